// Double differences between two receivers (base and rover) and two satellites: receiver and
// satellite clocks cancel, and on short baselines so do most of the atmosphere. Code double
// differences give a baseline to decimetres in one epoch; carrier phase double differences
// with their ambiguities give it to millimetres once the ambiguities are known.
#pragma once

#include <span>
#include <vector>

#include "geodesy.h"
#include "least_squares.h"
#include "vox/vox_sdk_fields.h"

namespace voxeng {

// One satellite seen by both receivers in one epoch.
struct DdSatellite {
  int sat = 0;                                // caller's identifier, stable across epochs
  const vox_GpsOrbitParams* orbit = nullptr;  // broadcast ephemeris valid at the epoch
  double base_code = 0, rover_code = 0;       // m
  double base_phase = 0, rover_phase = 0;     // cycles (L1), 0 when absent
  bool slip = false;  // either receiver lost the phase count here: a new ambiguity starts
};

struct DdEpoch {
  double t_base = 0;  // receive time tags (GPS seconds since the time origin)
  double t_rover = 0;
  std::vector<DdSatellite> sats;
};

struct DdOptions {
  double elevation_mask = 15.0 * kDeg;
  double code_sigma = 0.5;     // m, one receiver, zenith
  double phase_sigma = 0.003;  // m, one receiver, zenith
  double wavelength = VOX_SPEED_OF_LIGHT / VOX_GPS_L1_HZ;
  bool troposphere = true;  // model the (small) difference of the two delays
  int iterations = 4;       // relinearisations of the rover position
};

struct BaselineSolution {
  bool ok = false;
  Vec3 rover{};             // ECEF, m
  SymMatrix covariance{3};  // m^2, scaled by the variance factor
  double sigma0 = 0;
  size_t observations = 0;  // double differences used
  // Carrier-phase solutions only:
  std::vector<int> ambiguity_sats;  // the satellite of each ambiguity (reference excluded)
  std::vector<double> ambiguities;  // float values, or the integers when fixed (cycles)
  int reference_sat = 0;
  bool fixed = false;
  double ratio = 0;  // second-best over best integer candidate
};

// Rover position from code double differences over all epochs (static: one position for
// all; pass a single epoch for a kinematic position).
BaselineSolution SolveCodeBaseline(std::span<const DdEpoch> epochs, const Vec3& base,
                                   const Vec3& rover_approx, const DdOptions& options = {});

// Static rover position from L1 carrier-phase double differences (with code double
// differences holding the ambiguities until the geometry has changed enough), float
// ambiguities, then an integer fix accepted when the ratio reaches `min_ratio`.
BaselineSolution SolvePhaseBaseline(std::span<const DdEpoch> epochs, const Vec3& base,
                                    const Vec3& rover_approx, const DdOptions& options = {},
                                    double min_ratio = 3.0);

// A moving rover from L1 carrier-phase double differences: one position per epoch, one
// ambiguity per satellite arc, solved together (the positions are eliminated epoch by epoch,
// so the cost grows linearly with the epochs), then fixed to integers when the ratio
// reaches `min_ratio`. Epochs without the reference satellite get no position.
struct KinematicSolution {
  bool ok = false;
  bool fixed = false;
  double ratio = 0;
  int reference_sat = 0;
  std::vector<int> ambiguity_sats;
  std::vector<double> ambiguities;
  std::vector<bool> epoch_ok;         // per input epoch
  std::vector<Vec3> rover;            // per input epoch
  std::vector<SymMatrix> covariance;  // per input epoch, 3 x 3, m^2 (a-priori weights)
};
KinematicSolution SolveKinematicPhase(std::span<const DdEpoch> epochs, const Vec3& base,
                                      std::span<const Vec3> rover_approx,
                                      const DdOptions& options = {}, double min_ratio = 3.0);

}  // namespace voxeng
