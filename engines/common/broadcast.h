// Satellite position and clock from a Keplerian broadcast ephemeris (the GPS user
// algorithm), with the helpers every pseudorange model needs around it: the relativistic
// clock term, the group delay and the Earth's rotation during the signal's travel.
#pragma once

#include "geodesy.h"
#include "vox/vox_sdk_fields.h"

namespace voxeng {

struct SatelliteState {
  Vec3 position{};        // m, Earth-fixed frame at the time of evaluation
  Vec3 velocity{};        // m/s, Earth-fixed
  double clock = 0;       // s, polynomial plus relativistic term (ionosphere-free clock)
  double relativity = 0;  // s, the relativistic part of clock
};

// Absolute GPS time (seconds since the time origin) of toe and toc.
double ToeSeconds(const vox_GpsOrbitParams& p);
double TocSeconds(const vox_GpsOrbitParams& p);

// Position, velocity and clock at GPS time t (seconds since the time origin, the
// satellite's transmit time). Valid for any t; accuracy degrades beyond the fit interval.
SatelliteState EvaluateBroadcast(const vox_GpsOrbitParams& p, double t);

// Clock offset for a single-frequency L1 user: clock minus TGD.
double L1Clock(const vox_GpsOrbitParams& p, const SatelliteState& s);

// The satellite position of the transmit time, expressed in the Earth-fixed frame of the
// receive time `travel` seconds later (the Earth turned under the signal).
Vec3 RotateForTravel(const Vec3& position, double travel);

// Transmit-time state for a pseudorange `range` (m) received at GPS time t_receive: the
// transmit time is found from the range and the satellite clock, and the position is rotated
// into the frame of the receive time. `receiver` gives the travel time for that rotation; pass
// an empty vector (all zero) before a position is known, and the range then stands in.
struct TransmitState {
  SatelliteState state;  // position already rotated into the receive frame
  double transmit_time = 0;
  double travel = 0;
};
TransmitState StateAtTransmit(const vox_GpsOrbitParams& p, double t_receive, double range,
                              const Vec3& receiver);

}  // namespace voxeng
