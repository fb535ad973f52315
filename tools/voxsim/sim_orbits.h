// The simulated GPS constellation: each satellite flies one smooth orbit over the whole
// survey (Keplerian with secular node and inclination drift and the usual harmonic
// perturbations), and its broadcast ephemerides are that orbit re-referenced to each toe.
// An engine evaluating a broadcast set with the standard user algorithm therefore finds the
// satellite where the simulator put it.
#pragma once

#include <cstdint>
#include <vector>

#include "geodesy.h"
#include "vox/vox_sdk_fields.h"

namespace voxsim {

using voxeng::Vec3;
using voxeng::operator+;
using voxeng::operator-;
using voxeng::operator*;

struct SimSatellite {
  unsigned prn = 0;
  double t_ref = 0;  // GPS seconds since the time origin at which the elements below hold
  double sqrt_a = 0, e = 0, i0 = 0, omega = 0, m0 = 0;
  double node_inertial = 0;  // right ascension of the node at t_ref, rad
  double delta_n = 0, node_rate = 0, idot = 0;
  double cuc = 0, cus = 0, crc = 0, crs = 0, cic = 0, cis = 0;
  double clock_bias = 0, clock_drift = 0;  // at t_ref, s and s/s
  double tgd = 0;
};

// A constellation of `count` satellites (24 to 31) in six planes at 55 degrees.
std::vector<SimSatellite> MakeConstellation(uint64_t seed, double t_ref, int count);

struct SatTruth {
  Vec3 position{};   // Earth-fixed frame of time t, m
  double clock = 0;  // satellite clock offset (polynomial + relativistic), s
};
// Truth at GPS time t (seconds since the time origin).
SatTruth TrueState(const SimSatellite& s, double t);

// The broadcast ephemeris with the given absolute toe (a multiple of 16 s), every value
// already rounded to the width of its raw field.
vox_GpsOrbitParams BroadcastFor(const SimSatellite& s, double toe_seconds, unsigned iode);

}  // namespace voxsim
