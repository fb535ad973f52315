#!/usr/bin/env bash
# Builds the benchmarks with optimisation in build-bench and runs them.
# Usage: scripts/bench.sh [arguments for vox_bench_scan, e.g. --rounds 3]
set -euo pipefail
root="$(cd "$(dirname "$0")/.." && pwd)"
build="${VOX_BENCH_BUILD:-$root/build-bench}"
cmake -S "$root" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=Release -DVOX_BUILD_TESTS=OFF >/dev/null
cmake --build "$build" --target vox_bench_scan -j"${VOX_BENCH_JOBS:-2}" >/dev/null
"$build/bin/vox_bench_scan" "$@"
