#include "broadcast.h"

#include <cmath>

namespace voxeng {

double ToeSeconds(const vox_GpsOrbitParams& p) {
  return p.week * VOX_GPS_WEEK_SECONDS + p.toe;
}

double TocSeconds(const vox_GpsOrbitParams& p) {
  // toc shares toe's week, except when the two straddle a week boundary.
  double toc = p.week * VOX_GPS_WEEK_SECONDS + p.toc;
  const double d = toc - ToeSeconds(p);
  if (d > VOX_GPS_WEEK_SECONDS / 2)
    toc -= VOX_GPS_WEEK_SECONDS;
  else if (d < -VOX_GPS_WEEK_SECONDS / 2)
    toc += VOX_GPS_WEEK_SECONDS;
  return toc;
}

namespace {

struct Orbit {
  Vec3 position;
  double eccentric_anomaly;
};

Orbit Position(const vox_GpsOrbitParams& p, double t) {
  const double a = p.sqrt_a * p.sqrt_a;
  const double tk = t - ToeSeconds(p);
  const double n = std::sqrt(VOX_GPS_MU / (a * a * a)) + p.delta_n;
  const double m = p.m0 + n * tk;
  double e_anom = m;
  for (int k = 0; k < 30; ++k) {  // Newton on Kepler's equation
    const double step = (e_anom - p.e * std::sin(e_anom) - m) / (1.0 - p.e * std::cos(e_anom));
    e_anom -= step;
    if (std::fabs(step) < 1e-15) break;
  }
  const double nu =
      std::atan2(std::sqrt(1.0 - p.e * p.e) * std::sin(e_anom), std::cos(e_anom) - p.e);
  const double phi = nu + p.omega;
  const double s2 = std::sin(2 * phi), c2 = std::cos(2 * phi);
  const double u = phi + p.cus * s2 + p.cuc * c2;
  const double r = a * (1.0 - p.e * std::cos(e_anom)) + p.crs * s2 + p.crc * c2;
  const double i = p.i0 + p.idot * tk + p.cis * s2 + p.cic * c2;
  const double node = p.omega0 + (p.omega_dot - VOX_GPS_OMEGA_E) * tk - VOX_GPS_OMEGA_E * p.toe;
  const double xp = r * std::cos(u), yp = r * std::sin(u);
  const double cn = std::cos(node), sn = std::sin(node), ci = std::cos(i);
  return {{xp * cn - yp * ci * sn, xp * sn + yp * ci * cn, yp * std::sin(i)}, e_anom};
}

}  // namespace

SatelliteState EvaluateBroadcast(const vox_GpsOrbitParams& p, double t) {
  SatelliteState s;
  const Orbit o = Position(p, t);
  s.position = o.position;
  // Central difference: the orbit is smooth enough that 0.5 s leaves errors far below a
  // millimetre per second.
  const Vec3 ahead = Position(p, t + 0.5).position, behind = Position(p, t - 0.5).position;
  s.velocity = ahead - behind;
  const double dt = t - TocSeconds(p);
  s.relativity = VOX_GPS_F_REL * p.e * p.sqrt_a * std::sin(o.eccentric_anomaly);
  s.clock = p.af0 + p.af1 * dt + p.af2 * dt * dt + s.relativity;
  return s;
}

double L1Clock(const vox_GpsOrbitParams& p, const SatelliteState& s) {
  return s.clock - p.tgd;
}

Vec3 RotateForTravel(const Vec3& position, double travel) {
  const double w = VOX_GPS_OMEGA_E * travel;
  const double c = std::cos(w), s = std::sin(w);
  return {c * position[0] + s * position[1], -s * position[0] + c * position[1], position[2]};
}

TransmitState StateAtTransmit(const vox_GpsOrbitParams& p, double t_receive, double range,
                              const Vec3& receiver) {
  TransmitState ts;
  // The pseudorange already holds the satellite clock offset, so t_receive - range/c is the
  // transmit time on the satellite's clock; one correction puts it on GPS time.
  double tx = t_receive - range / VOX_SPEED_OF_LIGHT;
  tx -= EvaluateBroadcast(p, tx).clock;
  ts.state = EvaluateBroadcast(p, tx);
  ts.transmit_time = tx;
  ts.travel = t_receive - tx;
  const bool known = receiver[0] != 0 || receiver[1] != 0 || receiver[2] != 0;
  if (known) {
    // Geometric travel time, iterated once: the rotation depends on it only weakly.
    for (int k = 0; k < 2; ++k)
      ts.travel =
          Norm(RotateForTravel(ts.state.position, ts.travel) - receiver) / VOX_SPEED_OF_LIGHT;
  }
  ts.state.position = RotateForTravel(ts.state.position, ts.travel);
  ts.state.velocity = RotateForTravel(ts.state.velocity, ts.travel);
  return ts;
}

}  // namespace voxeng
