#!/usr/bin/env bash
# Builds the fuzz targets with clang (build-fuzz), writes their seed corpora and runs each
# target for SECONDS seconds. Inputs the fuzzers find interesting are
# kept in build-fuzz/corpus/<target> from one run to the next; a crash, a sanitizer report
# or a hang leaves its input in build-fuzz/artifacts/ and makes the script fail. Targets run
# side by side, one per core.
#
# Usage: scripts/fuzz.sh SECONDS [TARGET...]   (targets: scan epochs sp3 job append result_reader)
set -euo pipefail
root="$(cd "$(dirname "$0")/.." && pwd)"
seconds="${1:?usage: scripts/fuzz.sh SECONDS [TARGET...]}"
shift
targets=("$@")
if [ ${#targets[@]} -eq 0 ]; then targets=(scan epochs sp3 job append result_reader); fi
build="${VOX_FUZZ_BUILD:-$root/build-fuzz}"
jobs="${VOX_FUZZ_JOBS:-$(nproc)}"

CC=clang-14 CXX=clang++-14 cmake -S "$root" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=Debug \
  -DVOX_FUZZ=ON -DVOX_BUILD_TESTS=OFF >/dev/null
cmake --build "$build" --target vox_fuzz_all -j "$jobs" >/dev/null

seeds="$build/seeds"
rm -rf "$seeds"
"$build/bin/vox_fuzz_seeds" "$seeds"
mkdir -p "$build/artifacts"

# Leaks are findings too; undefined behaviour stops the target (it is built without recovery).
export ASAN_OPTIONS="${ASAN_OPTIONS:-detect_leaks=1:abort_on_error=0}"
export UBSAN_OPTIONS="${UBSAN_OPTIONS:-print_stacktrace=1:halt_on_error=1}"

# One target: its verdict line goes to <build>/<target>.verdict, its output to <target>.log.
run_target() {
  local t="$1" corpus="$build/corpus/$1" start verdict runs
  mkdir -p "$corpus"
  local options=(-max_total_time="$seconds" -timeout=10 -rss_limit_mb=2048 -max_len=65536
    -print_final_stats=1 -artifact_prefix="$build/artifacts/$t-")
  if [ -f "$root/fuzz/$t.dict" ]; then options+=(-dict="$root/fuzz/$t.dict"); fi
  start=$(date +%s)
  if "$build/bin/vox_fuzz_$t" "${options[@]}" "$corpus" "$seeds/$t" >"$build/$t.log" 2>&1; then
    verdict=ok
  else
    verdict=FAILED
  fi
  runs=$(grep -o 'stat::number_of_executed_units: *[0-9]*' "$build/$t.log" | grep -o '[0-9]*$' || echo '?')
  echo "$verdict fuzz: $t: $verdict after $(( $(date +%s) - start )) s, $runs inputs, corpus $(ls "$corpus" | wc -l) files" >"$build/$t.verdict"
}

# Each fuzzer uses one core: run as many side by side as there are cores (VOX_FUZZ_PARALLEL).
parallel="${VOX_FUZZ_PARALLEL:-$(nproc)}"
running=0
for t in "${targets[@]}"; do
  rm -f "$build/$t.verdict"
  if [ "$running" -ge "$parallel" ]; then
    wait -n || true
    running=$((running - 1))
  fi
  run_target "$t" &
  running=$((running + 1))
done
wait

failed=()
for t in "${targets[@]}"; do
  line="$(cat "$build/$t.verdict" 2>/dev/null || echo "FAILED fuzz: $t: no verdict")"
  echo "${line#* }"
  if [ "${line%% *}" != ok ]; then
    failed+=("$t")
    grep -E 'ERROR|SUMMARY|runtime error|Test unit written' "$build/$t.log" | head -20 || true
  fi
done

if [ ${#failed[@]} -ne 0 ]; then
  echo "fuzz: findings in ${failed[*]} (logs in $build/<target>.log, inputs in $build/artifacts/)"
  exit 1
fi
