// The simulated signal path from a satellite to a receiver: geometry with light time and the
// Earth's rotation, satellite and receiver clocks, troposphere, ionosphere, multipath and
// noise, and the integer ambiguities of the carrier phases.
#pragma once

#include <cstdint>
#include <map>

#include "geodesy.h"
#include "sim_orbits.h"
#include "sim_random.h"

namespace voxsim {

// The receiver clock: offset, drift and a random walk of the drift, stepped epoch by epoch.
class ReceiverClock {
 public:
  ReceiverClock(uint64_t seed, double t0);
  // Offset (s) at GPS time t; t must not go backwards between calls.
  double At(double t);

 private:
  Random rng_;
  double t_ = 0, offset_ = 0, drift_ = 0;
};

struct Observables {
  double elevation = 0;   // rad
  double p1 = 0, p2 = 0;  // m
  double l1 = 0, l2 = 0;  // cycles
  uint8_t cn0 = 0;        // dB-Hz
  bool new_arc = false;   // the ambiguities were (re)drawn at this epoch
};

// One receiver's view of the constellation: keeps the per-satellite ambiguities and the
// multipath phases, so that successive epochs are consistent.
class ReceiverSim {
 public:
  ReceiverSim(uint64_t seed, double t0, double zenith_wet);

  // Observables at receiver time tag t_tag for an antenna at `antenna`; false when the
  // satellite is below the elevation mask (its arc then ends).
  bool Observe(const SimSatellite& sat, double t_tag, const Vec3& antenna, Observables& out);
  double ClockAt(double t_tag) { return clock_.At(t_tag); }

  static constexpr double kElevationMask = 10.0 * std::numbers::pi / 180.0;

 private:
  struct Arc {
    int64_t n1 = 0, n2 = 0;
    double mp_phase[4] = {};
    double mp_period[2] = {};
  };
  Random rng_;
  ReceiverClock clock_;
  double zenith_wet_;
  double last_clock_t_ = -1, clock_offset_ = 0;
  std::map<unsigned, Arc> arcs_;
};

// Signal delays, shared by all receivers (they describe the atmosphere, not the receiver).
double SimTroposphere(const voxeng::Geodetic& place, double elevation, double zenith_wet);
double SimIonosphereL1(const voxeng::Geodetic& place, double elevation, double azimuth, double t);

}  // namespace voxsim
