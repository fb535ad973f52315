#include "sim_orbits.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "sim_random.h"

namespace voxsim {

namespace {

constexpr double kPi = std::numbers::pi;
constexpr double kTwoPi = 2.0 * kPi;

double Wrap(double angle) {
  return std::remainder(angle, kTwoPi);
}
// Values that live in 32-bit fields are drawn as floats, so the truth is what is broadcast.
double F32(double v) {
  return static_cast<float>(v);
}

double MeanMotion(const SimSatellite& s) {
  const double a = s.sqrt_a * s.sqrt_a;
  return std::sqrt(VOX_GPS_MU / (a * a * a)) + s.delta_n;
}

}  // namespace

std::vector<SimSatellite> MakeConstellation(uint64_t seed, double t_ref, int count) {
  Random rng(seed ^ 0x6f7262697473ull);
  count = std::clamp(count, 24, 31);
  // PRNs 1..32 shuffled; the constellation takes the first `count`.
  std::vector<unsigned> prns(32);
  for (unsigned k = 0; k < 32; ++k)
    prns[k] = k + 1;
  for (size_t k = prns.size() - 1; k > 0; --k)
    std::swap(prns[k], prns[static_cast<size_t>(rng.Integer(0, static_cast<int64_t>(k)))]);
  std::vector<SimSatellite> sats;
  const double plane_phase = rng.Uniform(0, kTwoPi);
  for (int k = 0; k < count; ++k) {
    const int plane = k % 6, slot = k / 6;
    const int in_plane = count / 6 + (plane < count % 6 ? 1 : 0);
    SimSatellite s;
    s.prn = prns[static_cast<size_t>(k)];
    s.t_ref = t_ref;
    s.sqrt_a = std::sqrt(26559.7e3 + rng.Uniform(-3e3, 3e3));
    s.e = rng.Uniform(0.001, 0.02);
    s.i0 = (55.0 + rng.Uniform(-1.5, 1.5)) * kPi / 180.0;
    s.omega = Wrap(rng.Uniform(0, kTwoPi));
    s.node_inertial = Wrap(plane_phase + plane * kPi / 3.0 + rng.Uniform(-0.02, 0.02));
    // Slots spread evenly around the plane, each plane shifted so planes do not align.
    s.m0 = Wrap(slot * kTwoPi / in_plane + plane * kPi / 9.0 + rng.Uniform(-0.1, 0.1) - s.omega);
    s.delta_n = F32(rng.Uniform(3.5e-9, 5.5e-9));
    s.node_rate = F32(rng.Uniform(-8.6e-9, -7.6e-9));
    s.idot = F32(rng.Uniform(-5e-10, 5e-10));
    s.cuc = F32(rng.Uniform(-4e-6, 4e-6));
    s.cus = F32(rng.Uniform(-4e-6, 8e-6));
    s.crc = F32(rng.Uniform(150.0, 350.0));
    s.crs = F32(rng.Uniform(-120.0, 120.0));
    s.cic = F32(rng.Uniform(-2e-7, 2e-7));
    s.cis = F32(rng.Uniform(-2e-7, 2e-7));
    s.clock_bias = rng.Uniform(-3e-4, 3e-4);
    s.clock_drift = F32(rng.Uniform(-5e-12, 5e-12));
    s.tgd = F32(rng.Uniform(-1.2e-8, 0.6e-8));
    sats.push_back(s);
  }
  std::sort(sats.begin(), sats.end(),
            [](const SimSatellite& a, const SimSatellite& b) { return a.prn < b.prn; });
  return sats;
}

SatTruth TrueState(const SimSatellite& s, double t) {
  // Written in the inertial frame and then turned with the Earth, rather than in the
  // broadcast model's rotating form: the two must agree, and the tests check that they do.
  const double tk = t - s.t_ref;
  const double a = s.sqrt_a * s.sqrt_a;
  const double m = s.m0 + MeanMotion(s) * tk;
  double ea = m;
  for (int k = 0; k < 50; ++k) {
    const double next = m + s.e * std::sin(ea);
    if (std::fabs(next - ea) < 1e-15) {
      ea = next;
      break;
    }
    ea = next;
  }
  const double nu = 2.0 * std::atan(std::sqrt((1 + s.e) / (1 - s.e)) * std::tan(ea / 2));
  const double phi = nu + s.omega;
  const double s2 = std::sin(2 * phi), c2 = std::cos(2 * phi);
  const double u = phi + s.cus * s2 + s.cuc * c2;
  const double r = a * (1 - s.e * std::cos(ea)) + s.crs * s2 + s.crc * c2;
  const double inc = s.i0 + s.idot * tk + s.cis * s2 + s.cic * c2;
  const double node = s.node_inertial + s.node_rate * tk;
  // Perifocal-in-node frame -> inertial.
  const double xo = r * std::cos(u), yo = r * std::sin(u);
  const Vec3 inertial{xo * std::cos(node) - yo * std::cos(inc) * std::sin(node),
                      xo * std::sin(node) + yo * std::cos(inc) * std::cos(node),
                      yo * std::sin(inc)};
  // The Earth's angle is counted from the time origin.
  const double theta = std::fmod(VOX_GPS_OMEGA_E * t, kTwoPi);
  SatTruth out;
  out.position = {std::cos(theta) * inertial[0] + std::sin(theta) * inertial[1],
                  -std::sin(theta) * inertial[0] + std::cos(theta) * inertial[1], inertial[2]};
  out.clock = s.clock_bias + s.clock_drift * tk + VOX_GPS_F_REL * s.e * s.sqrt_a * std::sin(ea);
  return out;
}

vox_GpsOrbitParams BroadcastFor(const SimSatellite& s, double toe_seconds, unsigned iode) {
  vox_GpsOrbitParams p{};
  const double tk = toe_seconds - s.t_ref;
  const double week = std::floor(toe_seconds / VOX_GPS_WEEK_SECONDS);
  p.week = static_cast<uint32_t>(week);
  p.toe = toe_seconds - week * VOX_GPS_WEEK_SECONDS;
  p.toc = p.toe;
  p.sqrt_a = s.sqrt_a;
  p.e = s.e;
  p.i0 = s.i0 + s.idot * tk;
  p.omega = s.omega;
  p.m0 = Wrap(s.m0 + MeanMotion(s) * tk);
  // The broadcast node is counted in the Earth-fixed frame of the week's start.
  p.omega0 = Wrap(s.node_inertial + s.node_rate * tk -
                  std::fmod(VOX_GPS_OMEGA_E * week * VOX_GPS_WEEK_SECONDS, kTwoPi));
  p.delta_n = s.delta_n;
  p.omega_dot = s.node_rate;
  p.idot = s.idot;
  p.cuc = s.cuc;
  p.cus = s.cus;
  p.crc = s.crc;
  p.crs = s.crs;
  p.cic = s.cic;
  p.cis = s.cis;
  p.af0 = s.clock_bias + s.clock_drift * tk;
  p.af1 = s.clock_drift;
  p.af2 = 0;
  p.tgd = s.tgd;
  p.iode = iode & 0xFFu;
  p.ura = 0;
  p.health = 0;
  p.fit_flag = 0;
  vox_GpsOrbitQuantize(&p);
  return p;
}

}  // namespace voxsim
