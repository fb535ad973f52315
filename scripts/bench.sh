#!/usr/bin/env bash
# Builds the benchmarks with optimisation in build-bench, runs them all and prints one table:
# every figure beside the reference it was measured against in the same run.
# Usage: scripts/bench.sh [--rounds N]   (passed to every benchmark)
set -euo pipefail
root="$(cd "$(dirname "$0")/.." && pwd)"
build="${VOX_BENCH_BUILD:-$root/build-bench}"
cmake -S "$root" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=Release -DVOX_BUILD_TESTS=OFF >/dev/null
cmake --build "$build" --target vox_bench_all -j"${VOX_BENCH_JOBS:-2}" >/dev/null

rows="$(mktemp)"
trap 'rm -f "$rows"' EXIT
for bench in vox_bench_scan vox_bench_results vox_bench_job; do
  echo "== $bench"
  # Detail lines go to the terminal, table rows to the table.
  out="$("$build/bin/$bench" "$@" || true)"
  grep -v '^row' <<<"$out" || true
  grep '^row' <<<"$out" >>"$rows" || true
done

echo
{
  printf 'benchmark\tfigure\treference (same run)\tratio\ttarget\tverdict\n'
  cut -f2- "$rows"
} | column -t -s $'\t'
