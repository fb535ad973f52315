// A complete simulated survey: three receivers (a base and a static rover on marks, and a
// rover driving a track) observing the simulated constellation, written as raw observation
// files with their broadcast ephemerides, a job file and a truth file.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "raw_writer.h"
#include "sim_orbits.h"

namespace voxsim {

struct SurveyOptions {
  double start = 0;        // GPS seconds since the time origin of the first epoch
  double duration = 3600;  // s
  double interval = 1;     // s between epochs (a whole number of milliseconds)
  uint64_t seed = 1;
  voxtools::RawOrder order = voxtools::RawOrder::kLittle;
  std::string folder = ".";
  int satellites = 31;
  int job_type = 2;  // the job's Type key: 1 static, 2 or 3 kinematic
  uint32_t leap_seconds = 18;
};

// A station on a mark; the antenna's phase centre is `height` above it along the vertical.
struct Station {
  std::string name;
  Vec3 mark{};
  double height = 0;
  Vec3 Antenna() const;
};

// Everything the simulation is made of, before anything is written.
struct Survey {
  SurveyOptions options;
  std::vector<SimSatellite> satellites;
  Station base, rover;
  Vec3 track_centre{};  // centre of the kinematic rover's circle
  double track_radius = 0, track_speed = 0;
  std::vector<double> toes;  // absolute toe of every broadcast set, ascending

  Vec3 KinematicAt(double t) const;  // antenna of the moving rover at epoch time t
  size_t EpochCount() const;
  double EpochTime(size_t k) const;
  // The broadcast set valid at t: the one whose toe is nearest.
  vox_GpsOrbitParams BroadcastAt(const SimSatellite& s, double t) const;
};

Survey MakeSurvey(const SurveyOptions& options);

// Writes base.raw, rover.raw, kinematic.raw, survey.job and truth.txt into the folder.
// Returns an empty string on success, else what failed.
std::string WriteSurvey(const Survey& survey);

// GPS seconds since the time origin of a calendar date and time of day on the GPS scale.
double GpsSecondsOf(int year, int month, int day, int hour, int minute, double second);

}  // namespace voxsim
