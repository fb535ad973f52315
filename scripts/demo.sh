#!/usr/bin/env bash
# Runs the most complete end-to-end job vox can run today with the freshly built tools:
# writes a small job file into a scratch folder, runs it with voxrun, and shows what came out.
set -euo pipefail
build=${1:-build}
voxrun="$build/bin/voxrun"
if [[ ! -x "$voxrun" ]]; then
  echo "demo: $voxrun is missing; build first (make build)." >&2
  exit 1
fi

scratch=$(mktemp -d "${TMPDIR:-/tmp}/vox-demo-XXXXXX")
trap 'rm -rf "$scratch"' EXIT
mkdir -p "$scratch/tmp/engine"   # an "engine" folder switches the engine log on

# CR LF line ends and a run variable, as job files from other systems may carry them.
printf '[JOB]\r\nName=Demo survey $(SITE)\r\nResultPath=results/$(SITE).res\r\n' > "$scratch/demo.job"
mkdir -p "$scratch/results"

echo "demo: job file $scratch/demo.job:"
sed 's/\r$//; s/^/    /' "$scratch/demo.job"
echo "demo: running voxrun --var SITE=harbour demo.job"
status=0
TMPDIR="$scratch/tmp" "$voxrun" --var SITE=harbour "$scratch/demo.job" || status=$?

result="$scratch/results/harbour.res"
if [[ -f "$result" ]]; then
  echo "demo: result file $(basename "$result"), $(stat -c %s "$result") bytes:"
  od -A d -t x1 "$result" | sed 's/^/    /'
fi
for log in "$scratch"/tmp/engine/OUT*; do
  [[ -f "$log" ]] || continue
  echo "demo: engine log $(basename "$log"):"
  sed 's/^/    /' "$log"
done
echo "demo: the job was parsed, its result file opened with a header, the pipeline's"
echo "      messages written and the file closed with its end record; raw data scanning and"
echo "      engines join the demo when they arrive. voxrun exited with $status."
exit "$status"
