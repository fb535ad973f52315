#!/usr/bin/env bash
# The Windows stage: installs the MinGW-w64 cross compiler and Wine when they are missing,
# cross-builds vox.dll, the engines, the tools and the Windows tests into build-win, and runs
# the tests under Wine in a private prefix whose graphics driver is "null" (hidden windows
# and window messages work without an X server).
#
#   scripts/test-windows.sh [build folder]      (default: build-win)
#
# Prints the time each step took.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
build=${1:-$root/build-win}
mkdir -p "$build"
build=$(cd "$build" && pwd)  # Wine wants an absolute prefix path
jobs=${JOBS:-$(nproc)}
stage_start=$(date +%s)
step_start=$stage_start
step() {  # name of the step just finished
  local now
  now=$(date +%s)
  printf 'test-windows: %-28s %4d s\n' "$1" $((now - step_start))
  step_start=$now
}

if ! command -v x86_64-w64-mingw32-g++-posix > /dev/null || ! command -v wine > /dev/null ||
   [[ ! -f /usr/src/googletest/CMakeLists.txt ]]; then
  sudo=""
  [[ $(id -u) != 0 ]] && sudo=sudo
  $sudo apt-get update -qq
  DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq --no-install-recommends \
    g++-mingw-w64-x86-64-posix wine64 wine googletest > /dev/null
fi
step "install"

export WINEPREFIX=${WINEPREFIX:-$build/wineprefix}
export WINEDEBUG=${WINEDEBUG:--all}
# No Mono or Gecko installer prompts: the tests need neither.
export WINEDLLOVERRIDES=${WINEDLLOVERRIDES:-mscoree,mshtml=}
if [[ ! -f $WINEPREFIX/system.reg ]]; then
  mkdir -p "$WINEPREFIX"
  wineboot --init > /dev/null 2>&1
  wine reg add 'HKCU\Software\Wine\Drivers' /v Graphics /d null /f > /dev/null 2>&1
  wineserver --wait
fi
step "wine prefix"

# Unoptimised and without debug information: with the runtime linked statically into every
# program, debug information makes each link several times slower, and this build exists to
# run the tests.
cmake -S "$root" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=Debug -DCMAKE_CXX_FLAGS_DEBUG=-O0 \
  -DCMAKE_C_FLAGS_DEBUG=-O0 -DCMAKE_TOOLCHAIN_FILE="$root/cmake/toolchain-mingw64.cmake" > /dev/null
cmake --build "$build" -j "$jobs"
step "cross build"

status=0
ctest --test-dir "$build" --output-on-failure -j "$jobs" -L windows || status=$?
step "tests under wine"
wineserver -k 2> /dev/null || true
printf 'test-windows: %-28s %4d s\n' "whole stage" $(($(date +%s) - stage_start))
exit "$status"
