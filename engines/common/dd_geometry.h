// Building blocks of the double-difference estimators (internal to this library): the
// geometry of one epoch, the weights of correlated double differences, the ambiguity columns
// of a session and the integer fix.
#pragma once

#include <map>
#include <span>
#include <utility>
#include <vector>

#include "double_difference.h"

namespace voxeng::dd {

// What one satellite contributes to one epoch after the geometry is computed.
struct SatGeometry {
  const DdSatellite* obs = nullptr;
  Vec3 unit_rover{};     // from the rover towards the satellite
  double computed = 0;   // (rho + tropo) rover minus base, m
  double elevation = 0;  // at the base
  bool HasPhase() const { return obs->base_phase != 0 && obs->rover_phase != 0; }
};

// The satellites of an epoch above the mask, with ranges from both receivers.
std::vector<SatGeometry> Geometry(const DdEpoch& e, const Vec3& base, const Vec3& rover,
                                  const DdOptions& o);
size_t HighestElevation(const std::vector<SatGeometry>& g);

// Weight matrix of the double differences of `rows` against reference `ref`.
SymMatrix DdWeights(const std::vector<SatGeometry>& g, size_t ref, const std::vector<size_t>& rows,
                    double sigma);
// Design row of the rover position for satellite j against the reference.
std::vector<double> PositionRow(const SatGeometry& j, const SatGeometry& ref, size_t unknowns);
// Code double differences of one epoch; position unknowns are the first three.
void AddCodeBlock(NormalEquations& ne, const std::vector<SatGeometry>& g, size_t ref,
                  size_t unknowns, const DdOptions& o);
// Phase double differences of one epoch; column[k] is the ambiguity column of g[k] (or -1).
void AddPhaseBlock(NormalEquations& ne, const std::vector<SatGeometry>& g, size_t ref,
                   const std::vector<int>& column, size_t unknowns, const DdOptions& o,
                   const std::vector<double>* known_ambiguities = nullptr);
double VarianceFactor(const NormalEquations& ne, const std::vector<double>& x);

// The reference satellite of a session: the one with phase in most epochs above the mask.
int PickReference(std::span<const DdEpoch> epochs, const Vec3& base, std::span<const Vec3> rovers,
                  const DdOptions& o);

// Ambiguity bookkeeping of a session: one column per satellite arc (a new arc starts when the
// satellite was missing from the previous epoch or lost lock).
class AmbiguityColumns {
 public:
  // Call for every epoch in order with its geometry; returns the column of each satellite
  // (-1 for the reference and for satellites without phase). Columns count from `first`.
  std::vector<int> Assign(const std::vector<SatGeometry>& g, int reference_sat, size_t first);
  size_t count() const { return sat_of_column_.size(); }
  const std::vector<int>& sats() const { return sat_of_column_; }

 private:
  std::map<int, int> open_;  // sat -> column of its current arc
  std::vector<int> sat_of_column_;
};

struct IntegerFix {
  std::vector<double> integers;
  double ratio = 0;
};
// Bootstrapped integers for float ambiguities a with covariance q, and the ratio of the
// nearest single-ambiguity alternative's distance to theirs.
bool FixIntegers(const std::vector<double>& a, const SymMatrix& q, IntegerFix& fix);

}  // namespace voxeng::dd
