#!/usr/bin/env bash
# The demo: simulates a GPS survey (a base and a rover on marks, a receiver driving a circle)
# into a scratch folder, runs it through voxrun twice with the reference engines found beside
# the library under their default names (a static job for the baseline, a kinematic job for
# the track; the raw filter first in both), and prints what came out, read back from the
# result files with the result reader, against the simulator's truth.
#   scripts/demo.sh [BUILD]      (VOX_DEMO_DURATION=<seconds> for a longer or shorter survey)
set -euo pipefail
build=${1:-build}
for file in bin/voxrun bin/voxsim bin/voxdemo-report lib/kra_rawfilter.dll lib/kra_static.eng \
            lib/kra_kinematic.eng; do
  if [[ ! -e "$build/$file" ]]; then
    echo "demo: $build/$file is missing; build first (make build)." >&2
    exit 1
  fi
done

# The scratch folder stays after the demo, so that its NMEA and result files can be looked
# at; the next demo replaces it.
scratch="$(cd "$build" && pwd)/demo"
rm -rf "$scratch"
mkdir -p "$scratch"
duration=${VOX_DEMO_DURATION:-1800}
echo "demo: simulating ${duration} s of a survey at 1 s into $scratch"
"$build/bin/voxsim" -o "$scratch" -d "$duration" -i 1 -s 2024 > /dev/null

# One survey, two jobs: the job's Type chooses the engine (1: kra_static.eng, 2:
# kra_kinematic.eng) and kra_rawfilter.dll runs before it. The base's occupation asks for an
# NMEA file of its single-point fixes; the fan writes its rays to fan.gga.
make_job() {  # type name
  sed -e "s/^Type=.*/Type=$1/" -e "s/^ResultPath=.*/ResultPath=$2.res\nNumCPUs=2/" \
      -e "s/^\[OCCUP:1\]$/[OCCUP:1]\nGGAPath=base-$2.gga/" \
      "$scratch/survey.job" > "$scratch/$2.job"
}
make_job 1 static
make_job 2 kinematic

status=0
for job in static kinematic; do
  echo "demo: voxrun $job.job"
  "$build/bin/voxrun" -q "$scratch/$job.job" | sed 's/^/    /' || status=$?
done
for job in static kinematic; do
  echo
  echo "demo: $job job, read back from $scratch/$job.res"
  nmea=("$scratch/base-$job.gga")
  if [[ $job == kinematic ]]; then nmea+=("$scratch/fan.gga"); fi
  "$build/bin/voxdemo-report" "$scratch/$job.res" "$scratch/truth.txt" "${nmea[@]}" \
    | sed 's/^/    /' || status=$?
done
exit "$status"
