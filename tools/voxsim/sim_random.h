// Random numbers that depend on the seed alone: the standard engines are fully specified,
// the standard distributions are not, so the distributions are written out here.
#pragma once

#include <cmath>
#include <cstdint>
#include <numbers>
#include <random>

namespace voxsim {

class Random {
 public:
  explicit Random(uint64_t seed) : engine_(seed) {}
  // Uniform in [0, 1).
  double Uniform() { return static_cast<double>(engine_() >> 11) * 0x1.0p-53; }
  double Uniform(double lo, double hi) { return lo + (hi - lo) * Uniform(); }
  // Standard normal (Box-Muller).
  double Gauss() {
    const double u = 1.0 - Uniform(), v = Uniform();
    return std::sqrt(-2.0 * std::log(u)) * std::cos(2.0 * std::numbers::pi * v);
  }
  int64_t Integer(int64_t lo, int64_t hi) {
    return lo + static_cast<int64_t>(Uniform() * static_cast<double>(hi - lo + 1));
  }
  uint64_t Next() { return engine_(); }

 private:
  std::mt19937_64 engine_;
};

}  // namespace voxsim
