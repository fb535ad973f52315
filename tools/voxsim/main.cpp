// voxsim: writes a complete simulated GPS survey into a folder (raw observation files of a
// base, a static rover and a moving rover, a job file and the truth), the same for the same
// seed.
#include <CLI/CLI.hpp>
#include <cmath>
#include <cstdio>
#include <string>

#include "survey.h"

int main(int argc, char** argv) {
  CLI::App app{"voxsim: simulate a GPS survey (raw files, job file and truth)"};
  voxsim::SurveyOptions o;
  std::string start = "2024-03-15T09:00:00";
  std::string order = "little";
  app.add_option("-o,--output", o.folder, "output folder (created if missing)")->required();
  app.add_option("-d,--duration", o.duration, "survey length in seconds")
      ->check(CLI::Range(1.0, 7.0 * 86400.0))
      ->capture_default_str();
  app.add_option("-i,--interval", o.interval, "seconds between epochs")
      ->check(CLI::Range(0.05, 3600.0))
      ->capture_default_str();
  app.add_option("-s,--seed", o.seed, "random seed")->capture_default_str();
  app.add_option("-b,--byte-order", order, "byte order of the raw files")
      ->check(CLI::IsMember({"little", "big"}))
      ->capture_default_str();
  app.add_option("--start", start, "first epoch, GPS time, YYYY-MM-DDTHH:MM:SS")
      ->capture_default_str();
  app.add_option("--satellites", o.satellites, "constellation size")
      ->check(CLI::Range(24, 31))
      ->capture_default_str();
  app.add_option("--job-type", o.job_type, "Type key of the job (1 static, 2 or 3 kinematic)")
      ->check(CLI::Range(1, 3))
      ->capture_default_str();
  CLI11_PARSE(app, argc, argv);

  int y = 0, mo = 0, d = 0, h = 0, mi = 0, s = 0;
  if (std::sscanf(start.c_str(), "%d-%d-%dT%d:%d:%d", &y, &mo, &d, &h, &mi, &s) != 6 || y < 1980 ||
      mo < 1 || mo > 12 || d < 1 || d > 31 || h > 23 || mi > 59 || s > 59) {
    std::fprintf(stderr, "voxsim: --start must look like 2024-03-15T09:00:00\n");
    return 2;
  }
  o.start = voxsim::GpsSecondsOf(y, mo, d, h, mi, s);
  if (o.start < 86400) {
    std::fprintf(stderr, "voxsim: --start lies before the GPS time origin\n");
    return 2;
  }
  // Epoch times are whole milliseconds of the day in the raw files.
  const double interval_ms = o.interval * 1000.0;
  if (std::fabs(interval_ms - std::round(interval_ms)) > 1e-6) {
    std::fprintf(stderr, "voxsim: --interval must be a whole number of milliseconds\n");
    return 2;
  }
  o.order = order == "big" ? voxtools::RawOrder::kBig : voxtools::RawOrder::kLittle;

  const voxsim::Survey survey = voxsim::MakeSurvey(o);
  const std::string error = voxsim::WriteSurvey(survey);
  if (!error.empty()) {
    std::fprintf(stderr, "voxsim: %s\n", error.c_str());
    return 1;
  }
  std::printf("voxsim: %zu epochs of %zu satellites written to %s\n", survey.EpochCount(),
              survey.satellites.size(), o.folder.c_str());
  return 0;
}
