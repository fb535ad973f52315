#!/usr/bin/env bash
# Installs what a fresh Debian 12 machine may lack to build and test vox.
# Only missing packages are installed, so the script is cheap to call on every `make`.
set -euo pipefail

packages=(cmake ninja-build g++ make libgtest-dev libgmock-dev nlohmann-json3-dev libcli11-dev proj-bin
  clang-14 libclang-rt-14-dev)

missing=()
for p in "${packages[@]}"; do
  if ! dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed"; then
    missing+=("$p")
  fi
done

# node and npm run the independent NMEA parser of the tests (the npm package nmea-simple, which
# the tests install into the build folder). They count as present when the commands exist,
# whichever package brought them: a nodejs that bundles npm would conflict with Debian's npm.
if ! command -v node >/dev/null 2>&1 && ! command -v nodejs >/dev/null 2>&1; then
  missing+=(nodejs)
fi
if ! command -v npm >/dev/null 2>&1; then
  missing+=(npm)
fi

if [ ${#missing[@]} -eq 0 ]; then
  exit 0
fi

echo "install-deps: installing ${missing[*]}"
sudo_cmd=()
if [ "$(id -u)" -ne 0 ]; then sudo_cmd=(sudo); fi
export DEBIAN_FRONTEND=noninteractive
"${sudo_cmd[@]}" apt-get update -qq
"${sudo_cmd[@]}" apt-get install -y -qq --no-install-recommends "${missing[@]}"
