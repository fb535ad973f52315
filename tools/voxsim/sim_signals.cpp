#include "sim_signals.h"

#include <algorithm>
#include <cmath>

namespace voxsim {

namespace {
constexpr double kC = VOX_SPEED_OF_LIGHT;
constexpr double kPi = std::numbers::pi;
constexpr double kLambda1 = kC / VOX_GPS_L1_HZ;
constexpr double kLambda2 = kC / VOX_GPS_L2_HZ;
constexpr double kGamma = (VOX_GPS_L1_HZ / VOX_GPS_L2_HZ) * (VOX_GPS_L1_HZ / VOX_GPS_L2_HZ);
}  // namespace

ReceiverClock::ReceiverClock(uint64_t seed, double t0) : rng_(seed), t_(t0) {
  offset_ = rng_.Uniform(-4e-4, 4e-4);
  drift_ = rng_.Uniform(-5e-8, 5e-8);
}

double ReceiverClock::At(double t) {
  // Random walk of the drift, one step per second of elapsed time.
  while (t_ + 1.0 <= t) {
    offset_ += drift_;
    drift_ += 2e-11 * rng_.Gauss();
    t_ += 1.0;
  }
  return offset_ + drift_ * (t - t_);
}

ReceiverSim::ReceiverSim(uint64_t seed, double t0, double zenith_wet)
    : rng_(seed), clock_(seed * 0x9E3779B97F4A7C15ull + 1, t0), zenith_wet_(zenith_wet) {}

double SimTroposphere(const voxeng::Geodetic& place, double elevation, double zenith_wet) {
  // Standard pressure at the height, Saastamoinen hydrostatic zenith delay, and a mapping
  // function of the 1/sqrt form (a different one from the engines', as in real life).
  const double h = std::clamp(place.height, -500.0, 9000.0);
  const double pressure = 1013.25 * std::pow(1.0 - 2.2557e-5 * h, 5.2568);
  const double zhd = 0.0022768 * pressure / (1.0 - 0.00266 * std::cos(2 * place.lat) - 0.28e-6 * h);
  const double ce = std::cos(elevation);
  const double map = 1.0 / std::sqrt(1.0 - (ce / 1.001) * (ce / 1.001));
  return (zhd + zenith_wet) * map;
}

double SimIonosphereL1(const voxeng::Geodetic& place, double elevation, double azimuth, double t) {
  // Thin shell at 350 km: pierce point, then a daytime cosine bump of vertical TEC over a
  // night-time floor, varying with local time and latitude.
  const double re = 6371e3, hs = 350e3;
  const double z = kPi / 2 - elevation;
  const double zp = std::asin(re / (re + hs) * std::sin(z));
  const double psi = z - zp;
  const double lat = std::asin(std::sin(place.lat) * std::cos(psi) +
                               std::cos(place.lat) * std::sin(psi) * std::cos(azimuth));
  const double lon = place.lon + psi * std::sin(azimuth) / std::cos(lat);
  const double local_hours = std::fmod(t / 3600.0 + lon * 12.0 / kPi + 240.0, 24.0);
  const double day = std::cos(2 * kPi * (local_hours - 14.0) / 24.0);
  const double vtec = 6.0 + 18.0 * std::max(day, 0.0) * std::cos(lat) * std::cos(lat);  // TECU
  const double slant = 1.0 / std::cos(zp);
  return 40.3e16 * vtec * slant / (VOX_GPS_L1_HZ * VOX_GPS_L1_HZ);
}

bool ReceiverSim::Observe(const SimSatellite& sat, double t_tag, const Vec3& antenna,
                          Observables& out) {
  if (t_tag != last_clock_t_) {
    clock_offset_ = clock_.At(t_tag);
    last_clock_t_ = t_tag;
  }
  const double t_receive = t_tag - clock_offset_;  // true GPS time of reception
  // Light time: the signal left the satellite `travel` seconds earlier, while the Earth (and
  // the receiver with it) turned by omega_e * travel.
  double travel = 0.075;
  SatTruth st;
  Vec3 sat_pos{};
  for (int k = 0; k < 4; ++k) {
    st = TrueState(sat, t_receive - travel);
    const double w = VOX_GPS_OMEGA_E * travel;
    sat_pos = {std::cos(w) * st.position[0] + std::sin(w) * st.position[1],
               -std::sin(w) * st.position[0] + std::cos(w) * st.position[1], st.position[2]};
    travel = voxeng::Norm(sat_pos - antenna) / kC;
  }
  const double rho = travel * kC;
  const voxeng::LookAngles look = voxeng::Look(antenna, sat_pos);
  out.elevation = look.elevation;
  if (look.elevation < kElevationMask) {
    arcs_.erase(sat.prn);
    return false;
  }
  auto [it, fresh] = arcs_.try_emplace(sat.prn);
  Arc& arc = it->second;
  if (fresh) {
    arc.n1 = rng_.Integer(-200000, 200000);
    arc.n2 = rng_.Integer(-200000, 200000);
    for (double& p : arc.mp_phase)
      p = rng_.Uniform(0, 2 * kPi);
    arc.mp_period[0] = rng_.Uniform(180, 600);
    arc.mp_period[1] = rng_.Uniform(40, 120);
  }
  out.new_arc = fresh;
  const voxeng::Geodetic place = voxeng::EcefToGeodetic(antenna);
  const double tropo = SimTroposphere(place, look.elevation, zenith_wet_);
  const double iono = SimIonosphereL1(place, look.elevation, look.azimuth, t_receive);
  const double s = std::sin(look.elevation);
  // Multipath: two slow sinusoids per arc, stronger near the horizon.
  const double mp_scale = std::min(1.0 / s, 4.0);
  const double mp =
      mp_scale * (0.25 * std::sin(2 * kPi * t_tag / arc.mp_period[0] + arc.mp_phase[0]) +
                  0.10 * std::sin(2 * kPi * t_tag / arc.mp_period[1] + arc.mp_phase[1]));
  const double mp_phase =
      mp_scale * 0.004 * std::sin(2 * kPi * t_tag / arc.mp_period[0] + arc.mp_phase[2]);
  const double common = rho + kC * (clock_offset_ - st.clock) + tropo;
  const double code_sigma = 0.25 * mp_scale, phase_sigma = 0.002 * mp_scale;
  out.p1 = common + kC * sat.tgd + iono + mp + code_sigma * rng_.Gauss();
  out.p2 =
      common + kGamma * kC * sat.tgd + kGamma * iono + 1.2 * mp + 1.3 * code_sigma * rng_.Gauss();
  out.l1 = (common - iono + mp_phase + phase_sigma * rng_.Gauss()) / kLambda1 + arc.n1;
  out.l2 = (common - kGamma * iono + mp_phase + phase_sigma * rng_.Gauss()) / kLambda2 + arc.n2;
  out.cn0 = static_cast<uint8_t>(std::lround(32.0 + 18.0 * s));
  return true;
}

}  // namespace voxsim
