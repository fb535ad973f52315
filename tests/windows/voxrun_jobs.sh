#!/usr/bin/env bash
# Whole jobs through the Windows tools under Wine, as a Windows user runs them: voxsim.exe
# simulates a short survey, voxrun.exe runs a static and a kinematic job with the reference
# engines found beside vox.dll by their default names, and voxdemo-report.exe checks the
# results against the simulated truth. A job naming a missing engine ends with exit code 6.
#
#   voxrun_jobs.sh <build folder> <wine>
set -euo pipefail
build=$(cd "$1" && pwd)
wine=${2:-wine}
bin="$build/bin"
scratch="$build/tests/windows/jobs"
rm -rf "$scratch"
mkdir -p "$scratch"

# Wine sees the Unix root as drive Z:.
windows_path() { printf 'Z:%s' "${1//\//\\}"; }
run() { "$wine" "$bin/$1.exe" "${@:2}"; }

run voxsim -o "$(windows_path "$scratch")" -d 900 -i 1 -s 2024 > /dev/null
make_job() {  # type name
  sed -e "s/^Type=.*/Type=$1/" -e "s/^ResultPath=.*/ResultPath=$2.res\nNumCPUs=2/" \
      -e "s/^\[OCCUP:1\]$/[OCCUP:1]\nGGAPath=base-$2.gga/" \
      "$scratch/survey.job" > "$scratch/$2.job"
}
make_job 1 static
make_job 2 kinematic
sed -e "s/^ResultPath=.*/ResultPath=absent.res\nEnginePath=absent.eng/" "$scratch/survey.job" \
  > "$scratch/absent.job"

status=0
for job in static kinematic; do
  if ! run voxrun -q "$(windows_path "$scratch/$job.job")"; then
    echo "voxrun_jobs: the $job job did not end with exit code 0" >&2
    status=1
  fi
  nmea=("$(windows_path "$scratch/base-$job.gga")")
  [[ $job == kinematic ]] && nmea+=("$(windows_path "$scratch/fan.gga")")
  if ! run voxdemo-report "$(windows_path "$scratch/$job.res")" \
       "$(windows_path "$scratch/truth.txt")" "${nmea[@]}"; then
    echo "voxrun_jobs: the $job job's results are off the truth" >&2
    status=1
  fi
done

code=0
run voxrun -q "$(windows_path "$scratch/absent.job")" > /dev/null || code=$?
if [[ $code != 6 ]]; then
  echo "voxrun_jobs: a job with a missing engine ended with $code, not 6" >&2
  status=1
fi
exit "$status"
