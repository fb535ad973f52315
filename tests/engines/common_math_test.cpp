// The engines' shared GNSS arithmetic against the simulator's truth: broadcast orbits through
// the raw record and back, single-point and double-difference solutions from simulated
// observations, and the conversions they rest on.
#include <gtest/gtest.h>

#include <unistd.h>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <iterator>

#include "base/buf_file.h"
#include "broadcast.h"
#include "combinations.h"
#include "double_difference.h"
#include "geodesy.h"
#include "point_solution.h"
#include "raw/ephemeris_store.h"
#include "raw/raw_decoder.h"
#include "raw/record_reader.h"
#include "raw_fields.h"
#include "sim_signals.h"
#include "survey.h"
#include "troposphere.h"

namespace {

using voxeng::Vec3;
using voxeng::operator-;
using voxeng::operator+;
using voxeng::operator*;

voxsim::Survey TestSurvey(double duration = 1200, double interval = 10, uint64_t seed = 7) {
  voxsim::SurveyOptions o;
  o.start = voxsim::GpsSecondsOf(2024, 3, 15, 9, 0, 0);
  o.duration = duration;
  o.interval = interval;
  o.seed = seed;
  return voxsim::MakeSurvey(o);
}

// A tag-13/45 record written by the raw writer, decoded by vox and unpacked with the field
// conventions: exactly what an engine sees.
vox_GpsOrbitParams ThroughRawRecord(const vox_GpsOrbitParams& p, unsigned prn,
                                    voxtools::RawOrder order, bool* passes = nullptr) {
  uint8_t tag = 0;
  voxtools::RawWriter w(order);
  w.GpsEphemeris(voxtools::GpsEphemerisFromOrbit(p, prn, &tag), tag);
  const auto& bytes = w.bytes();
  vox::GpsEphemerisRecord rec;
  const auto& decoder = vox::DecoderFor(
      order == voxtools::RawOrder::kBig ? vox::ByteOrder::kBig : vox::ByteOrder::kLittle);
  decoder.gps_ephemeris(vox::ByteSpan(bytes.data() + 3, bytes.size() - 5), rec);
  if (passes) *passes = vox::PassesCheck(rec);
  const vox_EphemerisData full = vox::MakeGpsEphemeris(rec, tag == 45);
  vox_GpsOrbitParams out{};
  EXPECT_EQ(vox_GpsOrbitFromEphemeris(&full, &out), 1);
  return out;
}

// Every orbit and clock value of two parameter sets, compared exactly.
void ExpectSameOrbit(const vox_GpsOrbitParams& q, const vox_GpsOrbitParams& p) {
  EXPECT_EQ(q.week, p.week);
  EXPECT_EQ(q.toe, p.toe);
  EXPECT_EQ(q.toc, p.toc);
  const double expected[] = {p.sqrt_a, p.e,   p.i0,   p.omega0,  p.omega,     p.m0,   p.af0,
                             p.af1,    p.tgd, p.tgd2, p.delta_n, p.omega_dot, p.idot, p.cuc,
                             p.cus,    p.crc, p.crs,  p.cic,     p.cis};
  const double got[] = {q.sqrt_a, q.e,   q.i0,   q.omega0,  q.omega,     q.m0,   q.af0,
                        q.af1,    q.tgd, q.tgd2, q.delta_n, q.omega_dot, q.idot, q.cuc,
                        q.cus,    q.crc, q.crs,  q.cic,     q.cis};
  for (size_t k = 0; k < std::size(expected); ++k)
    EXPECT_EQ(got[k], expected[k]) << k;
}

TEST(FieldConventions, RawRecordRoundTripKeepsEveryValue) {
  const voxsim::Survey s = TestSurvey();
  for (auto order : {voxtools::RawOrder::kLittle, voxtools::RawOrder::kBig}) {
    const vox_GpsOrbitParams p = s.BroadcastAt(s.satellites[3], s.options.start);
    bool passes = false;
    const vox_GpsOrbitParams q = ThroughRawRecord(p, s.satellites[3].prn, order, &passes);
    EXPECT_TRUE(passes);
    // The simulator quantises to the field widths, so nothing may change on the way.
    ExpectSameOrbit(q, p);
    EXPECT_EQ(q.iode, p.iode);
  }
}

TEST(FieldConventions, CheckedFieldsAndHealthSurviveTheReader) {
  vox_GpsOrbitParams p{};
  p.week = 2305;
  p.toe = p.toc = 7200;
  p.sqrt_a = 5153.7;
  p.e = 1e-12;  // below the reader's window: must be written as zero, not dropped
  p.i0 = 0.96;
  p.health = 0;
  bool passes = false;
  const vox_GpsOrbitParams q = ThroughRawRecord(p, 5, voxtools::RawOrder::kLittle, &passes);
  EXPECT_TRUE(passes);
  EXPECT_EQ(q.e, 0.0);
  EXPECT_EQ(q.health, 0u);
  // GPS 35 travels as tag 45, where vox inverts the health byte; "0 = healthy" must hold.
  uint8_t tag = 0;
  const auto r = voxtools::GpsEphemerisFromOrbit(p, 35, &tag);
  EXPECT_EQ(tag, 45);
  EXPECT_EQ(r.number, 3);
  EXPECT_EQ(ThroughRawRecord(p, 35, voxtools::RawOrder::kLittle).health, 0u);
  p.health = 0x21;
  EXPECT_EQ(ThroughRawRecord(p, 5, voxtools::RawOrder::kLittle).health, 0x21u);
  EXPECT_NE(ThroughRawRecord(p, 35, voxtools::RawOrder::kLittle).health, 0u);
}

TEST(FieldConventions, GalileoRecordRoundTrip) {
  vox_GpsOrbitParams p{};
  p.week = 2305;
  p.toe = 600;
  p.toc = 1200;
  p.sqrt_a = 5440.6;
  p.e = 0.0003;
  p.i0 = 0.97;
  p.omega0 = -2.5;
  p.omega = 0.4;
  p.m0 = 1.25;
  p.af0 = -5.123456789e-4;  // 64-bit for GALILEO: kept exactly
  p.af1 = 0.5f;
  p.tgd = -2.0f;
  p.tgd2 = 3.0f;
  p.delta_n = 1.0f;
  p.omega_dot = 2.0f;
  p.idot = 3.0f;
  p.cuc = 4.0f;
  p.cus = 5.0f;
  p.crc = 6.0f;
  p.crs = 7.0f;
  p.cic = 8.0f;
  p.cis = 9.0f;
  p.iode = 77;
  p.ura = 107;
  p.health = 0;
  voxtools::RawWriter w(voxtools::RawOrder::kBig);
  w.GalileoEphemeris(voxtools::GalileoEphemerisFromOrbit(p, 11));
  vox::GalileoEphemerisRecord rec;
  vox::DecoderFor(vox::ByteOrder::kBig)
      .galileo_ephemeris(vox::ByteSpan(w.bytes().data() + 3, w.bytes().size() - 5), rec);
  const vox_EphemerisData full = vox::MakeGalileoEphemeris(rec);
  vox_GpsOrbitParams q{};
  EXPECT_EQ(vox_GpsOrbitFromEphemeris(&full, &q), 0);  // not a GPS-layout record
  ASSERT_EQ(vox_GalileoOrbitFromEphemeris(&full, &q), 1);
  ExpectSameOrbit(q, p);
  EXPECT_EQ(q.iode, 77u);
  EXPECT_EQ(q.ura, 107u);
}

TEST(FieldConventions, WeekComesFromTheRecordTime) {
  // A record stamped a little before toe's week boundary still decodes to toe's week.
  EXPECT_EQ(vox_GpsWeekOf(2305u * 604800u - 100u, 0.0), 2305u);
  EXPECT_EQ(vox_GpsWeekOf(2305u * 604800u + 604000u, 604784.0), 2305u);
  EXPECT_EQ(vox_GpsWeekOf(2306u * 604800u + 10u, 604784.0), 2305u);
}

// Broadcast sets against the simulated orbits over four hours from a start time: mid-week, and
// across the end of a GPS week, where toe, toc and the node angle all change their week.
class BroadcastOrbitSpan : public ::testing::TestWithParam<double> {};

TEST_P(BroadcastOrbitSpan, ReproducesSimulatedSatellitesToTheCentimetre) {
  voxsim::SurveyOptions o;
  o.start = GetParam();
  o.duration = 4 * 3600.0;
  o.seed = 3;
  const voxsim::Survey s = voxsim::MakeSurvey(o);
  double worst_position = 0, worst_clock = 0;
  for (const auto& sat : s.satellites) {
    for (double dt = 0; dt <= o.duration; dt += 450.0) {
      const double t = s.options.start + dt;
      const vox_GpsOrbitParams p =
          ThroughRawRecord(s.BroadcastAt(sat, t), sat.prn, voxtools::RawOrder::kBig);
      const voxeng::SatelliteState est = voxeng::EvaluateBroadcast(p, t);
      const voxsim::SatTruth truth = voxsim::TrueState(sat, t);
      worst_position = std::max(worst_position, voxeng::Norm(est.position - truth.position));
      worst_clock = std::max(worst_clock, std::fabs(est.clock - truth.clock) * VOX_SPEED_OF_LIGHT);
    }
  }
  EXPECT_LT(worst_position, 0.01);
  EXPECT_LT(worst_clock, 0.01);
}

INSTANTIATE_TEST_SUITE_P(Starts, BroadcastOrbitSpan,
                         ::testing::Values(voxsim::GpsSecondsOf(2024, 3, 13, 9, 0, 0),
                                           voxsim::GpsSecondsOf(2024, 3, 16, 22, 0, 0)));

TEST(BroadcastOrbit, OrbitIsPlausibleAndVelocityMatchesMotion) {
  const voxsim::Survey s = TestSurvey();
  const double t = s.options.start + 100;
  const vox_GpsOrbitParams p = s.BroadcastAt(s.satellites[0], t);
  const voxeng::SatelliteState a = voxeng::EvaluateBroadcast(p, t);
  const voxeng::SatelliteState mid = voxeng::EvaluateBroadcast(p, t + 0.5);
  const voxeng::SatelliteState b = voxeng::EvaluateBroadcast(p, t + 1);
  EXPECT_NEAR(voxeng::Norm(a.position), 26560e3, 600e3);
  // Earth-fixed speed of a GPS satellite: about 3.9 km/s minus the Earth's turn.
  EXPECT_GT(voxeng::Norm(a.velocity), 2500);
  EXPECT_LT(voxeng::Norm(a.velocity), 4200);
  EXPECT_LT(voxeng::Norm((b.position - a.position) - mid.velocity), 0.01);
  EXPECT_LT(std::fabs(a.relativity), 50e-9);  // tens of nanoseconds at most for e < 0.02
}

TEST(BroadcastOrbit, EarthRotationTurnsAboutTheAxis) {
  const Vec3 p{26000e3, 0, 1000e3};
  const Vec3 q = voxeng::RotateForTravel(p, 0.07);
  EXPECT_NEAR(voxeng::Norm(q), voxeng::Norm(p), 1e-6);
  EXPECT_EQ(q[2], p[2]);
  EXPECT_NEAR(q[1], -26000e3 * VOX_GPS_OMEGA_E * 0.07, 0.01);  // ~ -133 m
}

TEST(LeastSquares, CorrelatedBlockEqualsItsDecorrelatedRows) {
  // Two observations with a full weight matrix must give what the same information gives
  // when added as independent rows after decorrelation (W = L L', rows L' A, L' l).
  voxeng::NormalEquations a(2), b(2);
  voxeng::SymMatrix w(2);
  w(0, 0) = 4;
  w(0, 1) = w(1, 0) = 1;
  w(1, 1) = 2;
  a.AddCorrelated({{1, 2}, {3, -1}}, {0.5, -0.25}, w);
  voxeng::SymMatrix l = w;
  ASSERT_TRUE(voxeng::Cholesky(l));
  // L' rows: row k = sum_i L(i,k) * original row i.
  b.Add({l(0, 0) * 1 + l(1, 0) * 3, l(0, 0) * 2 + l(1, 0) * -1}, l(0, 0) * 0.5 + l(1, 0) * -0.25,
        1);
  b.Add({l(1, 1) * 3, l(1, 1) * -1}, l(1, 1) * -0.25, 1);
  std::vector<double> xa, xb;
  ASSERT_TRUE(a.Solve(xa));
  ASSERT_TRUE(b.Solve(xb));
  EXPECT_NEAR(xa[0], xb[0], 1e-12);
  EXPECT_NEAR(xa[1], xb[1], 1e-12);
  EXPECT_NEAR(a.weighted_ll(), b.weighted_ll(), 1e-12);
}

TEST(LeastSquares, DegenerateGeometryIsRefused) {
  voxeng::NormalEquations ne(3);
  ne.Add({1, 1, 0}, 1, 1);
  ne.Add({2, 2, 0}, 2, 1);  // the same direction again: nothing new about x - y or z
  ne.Add({0, 0, 0}, 0, 1);
  std::vector<double> x;
  EXPECT_FALSE(ne.Solve(x));
  voxeng::SymMatrix inv;
  EXPECT_FALSE(voxeng::InvertSpd(ne.matrix(), inv));
}

TEST(Geodesy, ConversionsRoundTripAndHandleTheAxis) {
  for (double lat : {-89.9, -45.0, 0.0, 30.0, 89.99}) {
    for (double h : {-100.0, 0.0, 2000.0, 20200e3}) {
      const voxeng::Geodetic g{lat * voxeng::kDeg, 1.2, h};
      const voxeng::Geodetic back = voxeng::EcefToGeodetic(voxeng::GeodeticToEcef(g));
      EXPECT_NEAR(back.lat, g.lat, 1e-11) << lat << " " << h;
      EXPECT_NEAR(back.height, h, 1e-4) << lat << " " << h;
    }
  }
  const voxeng::Geodetic pole = voxeng::EcefToGeodetic({0, 0, -6356752.3142});
  EXPECT_NEAR(pole.lat, -voxeng::kPi / 2, 1e-12);
  EXPECT_NEAR(pole.height, 0, 1e-3);
  const voxeng::Geodetic equator = voxeng::EcefToGeodetic({6378137.0, 0, 0});
  EXPECT_NEAR(equator.lat, 0, 1e-15);
  EXPECT_NEAR(equator.height, 0, 1e-6);
  // A satellite straight above is at 90 degrees; one on the far side is below the horizon.
  const Vec3 site = voxeng::GeodeticToEcef({0.8, 0.1, 300});
  const Vec3 up = voxeng::EnuToEcef({0, 0, 20000e3}, voxeng::EcefToGeodetic(site));
  EXPECT_NEAR(voxeng::Look(site, site + up).elevation, voxeng::kPi / 2, 1e-9);
  EXPECT_LT(voxeng::Look(site, -1.0 * site).elevation, 0);
}

TEST(Atmosphere, TroposphereAndIonosphereFreeCombination) {
  const double zenith = voxeng::TroposphereDelay(0.8, 0, voxeng::kPi / 2);
  EXPECT_NEAR(zenith, 2.4, 0.15);
  EXPECT_LT(voxeng::TroposphereDelay(0.8, 2000, voxeng::kPi / 2), zenith);
  EXPECT_NEAR(voxeng::TroposphereDelay(0.8, 0, 30 * voxeng::kDeg), 2 * zenith, 0.1);
  // Held at 2 degrees below that, and finite at or below the horizon.
  EXPECT_EQ(voxeng::TroposphereDelay(0.8, 0, 0.0),
            voxeng::TroposphereDelay(0.8, 0, 2 * voxeng::kDeg));
  EXPECT_TRUE(std::isfinite(voxeng::TroposphereDelay(0.8, 0, -0.3)));

  const double range = 21e6, iono = 7.5;
  const double p1 = range + iono, p2 = range + voxeng::kGamma * iono;
  EXPECT_NEAR(voxeng::IonoFree(p1, p2), range, 1e-6);
  EXPECT_NEAR(voxeng::IonoL1FromCodes(p1, p2), iono, 1e-6);
}

// Observations of one simulated epoch, with the broadcast sets valid then.
struct EpochData {
  std::vector<vox_GpsOrbitParams> orbits;
  std::vector<voxsim::Observables> base, rover;
  std::vector<bool> seen_base, seen_rover;
};

EpochData Observe(const voxsim::Survey& s, voxsim::ReceiverSim& base, voxsim::ReceiverSim& rover,
                  const Vec3& base_antenna, const Vec3& rover_antenna, double t) {
  EpochData e;
  for (const auto& sat : s.satellites) {
    e.orbits.push_back(s.BroadcastAt(sat, t));
    voxsim::Observables ob, orv;
    e.seen_base.push_back(base.Observe(sat, t, base_antenna, ob));
    e.seen_rover.push_back(rover.Observe(sat, t, rover_antenna, orv));
    e.base.push_back(ob);
    e.rover.push_back(orv);
  }
  return e;
}

TEST(PointSolution, SimulatedCodeGivesThePositionWithinMetres) {
  const voxsim::Survey s = TestSurvey();
  voxsim::ReceiverSim base(11, s.options.start, 0.1), rover(12, s.options.start, 0.1);
  const Vec3 truth = s.base.Antenna();
  for (size_t k = 0; k < s.EpochCount(); k += 20) {
    const double t = s.EpochTime(k);
    const EpochData e = Observe(s, base, rover, truth, s.rover.Antenna(), t);
    std::vector<voxeng::RangeObservation> l1, iono_free;
    for (size_t i = 0; i < e.orbits.size(); ++i) {
      if (!e.seen_base[i]) continue;
      l1.push_back({static_cast<int>(i), &e.orbits[i], e.base[i].p1, false});
      iono_free.push_back(
          {static_cast<int>(i), &e.orbits[i], voxeng::IonoFree(e.base[i].p1, e.base[i].p2), true});
    }
    const voxeng::PointSolution a = voxeng::SolvePoint(t, iono_free);
    ASSERT_TRUE(a.ok) << t;
    EXPECT_LT(voxeng::Norm(a.position - truth), 3.0) << t;
    EXPECT_GT(a.used, 5);
    // The clock estimate is the receiver's offset, as the simulator applied it.
    EXPECT_NEAR(a.clock / VOX_SPEED_OF_LIGHT, base.ClockAt(t), 1e-8);
    EXPECT_GT(a.covariance(0, 0), 0);
    // L1 alone keeps the ionosphere: worse, but still a position.
    const voxeng::PointSolution b = voxeng::SolvePoint(t, l1);
    ASSERT_TRUE(b.ok);
    EXPECT_LT(voxeng::Norm(b.position - truth), 20.0);
  }
}

TEST(PointSolution, TooFewSatellitesIsAFailureNotAPosition) {
  const voxsim::Survey s = TestSurvey();
  voxsim::ReceiverSim base(11, s.options.start, 0.1), rover(12, s.options.start, 0.1);
  const double t = s.options.start;
  const EpochData e = Observe(s, base, rover, s.base.Antenna(), s.rover.Antenna(), t);
  std::vector<voxeng::RangeObservation> obs;
  for (size_t i = 0; i < e.orbits.size() && obs.size() < 3; ++i)
    if (e.seen_base[i]) obs.push_back({static_cast<int>(i), &e.orbits[i], e.base[i].p1, false});
  EXPECT_FALSE(voxeng::SolvePoint(t, obs).ok);
  EXPECT_FALSE(voxeng::SolvePoint(t, {}).ok);
}

// With base_tag or rover_tag (seconds, static rover only) a receiver tags its epochs that far
// off the nominal epoch, as a receiver with a drifting clock does, and observes at its tag.
std::vector<voxeng::DdEpoch> DdSession(const voxsim::Survey& s, std::vector<EpochData>& store,
                                       const Vec3& rover_antenna, bool moving, double base_tag = 0,
                                       double rover_tag = 0) {
  voxsim::ReceiverSim base(21, s.options.start, 0.12), rover(22, s.options.start, 0.125);
  // Observe() takes both receivers; these stand in for the one whose output is not used.
  voxsim::ReceiverSim spare_b(23, s.options.start, 0.12), spare_r(24, s.options.start, 0.125);
  const bool apart = base_tag != 0 || rover_tag != 0;
  std::vector<voxeng::DdEpoch> epochs;
  store.reserve(s.EpochCount());
  for (size_t k = 0; k < s.EpochCount(); ++k) {
    const double t = s.EpochTime(k);
    if (!apart) {
      store.push_back(
          Observe(s, base, rover, s.base.Antenna(), moving ? s.KinematicAt(t) : rover_antenna, t));
    } else {
      EpochData b = Observe(s, base, spare_r, s.base.Antenna(), rover_antenna, t + base_tag);
      const EpochData r =
          Observe(s, spare_b, rover, s.base.Antenna(), rover_antenna, t + rover_tag);
      b.rover = r.rover;
      b.seen_rover = r.seen_rover;
      store.push_back(std::move(b));
    }
    const EpochData& e = store.back();
    voxeng::DdEpoch dd;
    dd.t_base = t + base_tag;
    dd.t_rover = t + rover_tag;
    for (size_t i = 0; i < e.orbits.size(); ++i)
      if (e.seen_base[i] && e.seen_rover[i])
        dd.sats.push_back({static_cast<int>(s.satellites[i].prn), &e.orbits[i], e.base[i].p1,
                           e.rover[i].p1, e.base[i].l1, e.rover[i].l1,
                           e.base[i].new_arc || e.rover[i].new_arc});
    epochs.push_back(std::move(dd));
  }
  return epochs;
}

TEST(DoubleDifference, StaticCodeBaselineWithinHalfAMetre) {
  const voxsim::Survey s = TestSurvey(1200, 10);
  std::vector<EpochData> store;
  const Vec3 truth = s.rover.Antenna();
  const auto epochs = DdSession(s, store, truth, false);
  // Start from a point-solution-sized error.
  const Vec3 start = truth + Vec3{4.0, -3.0, 5.0};
  const voxeng::BaselineSolution sol = voxeng::SolveCodeBaseline(epochs, s.base.Antenna(), start);
  ASSERT_TRUE(sol.ok);
  EXPECT_LT(voxeng::Norm(sol.rover - truth), 0.5);
  EXPECT_GT(sol.observations, 500u);
  EXPECT_LT(std::sqrt(sol.covariance(0, 0)), 0.5);
}

TEST(DoubleDifference, KinematicCodeEpochsFollowTheTrack) {
  const voxsim::Survey s = TestSurvey(300, 30);
  std::vector<EpochData> store;
  const auto epochs = DdSession(s, store, {}, true);
  double sum2 = 0;
  for (size_t k = 0; k < epochs.size(); ++k) {
    const Vec3 truth = s.KinematicAt(epochs[k].t_rover);
    const voxeng::BaselineSolution sol = voxeng::SolveCodeBaseline(
        std::span(&epochs[k], 1), s.base.Antenna(), truth + Vec3{10, 10, -10});
    ASSERT_TRUE(sol.ok) << k;
    // One epoch of code: metres, within what the solution's own covariance claims.
    const double error = voxeng::Norm(sol.rover - truth);
    const double sigma =
        std::sqrt(sol.covariance(0, 0) + sol.covariance(1, 1) + sol.covariance(2, 2));
    EXPECT_LT(error, 5.0) << k;
    EXPECT_LT(error, 4.0 * sigma) << k;
    sum2 += error * error;
  }
  EXPECT_LT(std::sqrt(sum2 / epochs.size()), 2.5);
}

TEST(DoubleDifference, StaticPhaseBaselineFixesToCentimetres) {
  const voxsim::Survey s = TestSurvey(1800, 15);
  std::vector<EpochData> store;
  const Vec3 truth = s.rover.Antenna();
  const auto epochs = DdSession(s, store, truth, false);
  const voxeng::BaselineSolution sol =
      voxeng::SolvePhaseBaseline(epochs, s.base.Antenna(), truth + Vec3{1, 1, 1});
  ASSERT_TRUE(sol.ok);
  EXPECT_FALSE(sol.ambiguities.empty());
  // Half an hour on a few kilometres: the integers must be found, and then the baseline is
  // good to the centimetre.
  EXPECT_TRUE(sol.fixed) << "ratio " << sol.ratio;
  EXPECT_LT(voxeng::Norm(sol.rover - truth), sol.fixed ? 0.03 : 0.3)
      << "fixed " << sol.fixed << " ratio " << sol.ratio;
}

TEST(DoubleDifference, KinematicPhaseFixesEveryEpochToCentimetres) {
  const voxsim::Survey s = TestSurvey(900, 5);
  std::vector<EpochData> store;
  const auto epochs = DdSession(s, store, {}, true);
  // A rough start (a point solution would do): every epoch begins from its code solution.
  const Vec3 start = s.KinematicAt(s.options.start) + Vec3{5, -5, 5};
  const voxeng::KinematicSolution sol =
      voxeng::SolveKinematicPhase(epochs, s.base.Antenna(), std::span(&start, 1));
  ASSERT_TRUE(sol.ok);
  EXPECT_TRUE(sol.fixed) << "ratio " << sol.ratio;
  // Single-epoch phase positions: the simulated receivers' wet troposphere differs by 5 mm at
  // the zenith, which the model cannot know, so a couple of centimetres, not millimetres.
  double worst = 0, sum2 = 0;
  for (size_t k = 0; k < epochs.size(); ++k) {
    ASSERT_TRUE(sol.epoch_ok[k]) << k;
    const double error = voxeng::Norm(sol.rover[k] - s.KinematicAt(epochs[k].t_rover));
    worst = std::max(worst, error);
    sum2 += error * error;
  }
  EXPECT_LT(std::sqrt(sum2 / epochs.size()), 0.03);
  EXPECT_LT(worst, 0.08);
}

// Receivers tagging their epochs milliseconds apart (base 4 ms early, rover 7 ms late): each
// receiver's ranges come from its own tag and its own transmit times, so the clocks still
// cancel and the baseline fixes as with equal tags. Pretending both observed at the base's
// tag must go wrong by far more: the offsets are really in the data.
TEST(DoubleDifference, EpochsTaggedMillisecondsApartGiveTheSameBaseline) {
  const voxsim::Survey s = TestSurvey(1800, 15);
  std::vector<EpochData> store;
  const Vec3 truth = s.rover.Antenna();
  auto epochs = DdSession(s, store, truth, false, -0.004, 0.007);
  const voxeng::BaselineSolution code =
      voxeng::SolveCodeBaseline(epochs, s.base.Antenna(), truth + Vec3{4, -3, 5});
  ASSERT_TRUE(code.ok);
  EXPECT_LT(voxeng::Norm(code.rover - truth), 0.5);
  const voxeng::BaselineSolution sol =
      voxeng::SolvePhaseBaseline(epochs, s.base.Antenna(), truth + Vec3{1, 1, 1});
  ASSERT_TRUE(sol.fixed) << "ratio " << sol.ratio;
  EXPECT_LT(voxeng::Norm(sol.rover - truth), 0.03);

  for (auto& e : epochs)
    e.t_rover = e.t_base;
  const voxeng::BaselineSolution wrong =
      voxeng::SolvePhaseBaseline(epochs, s.base.Antenna(), truth + Vec3{1, 1, 1});
  EXPECT_TRUE(!wrong.ok || voxeng::Norm(wrong.rover - truth) > 0.1);
}

TEST(DoubleDifference, AmbiguityArcsRestartAfterALossOfLock) {
  const voxsim::Survey s = TestSurvey(600, 10);
  std::vector<EpochData> store;
  auto epochs = DdSession(s, store, s.rover.Antenna(), false);
  // Knock one non-reference satellite's rover phase by 7 cycles from the middle on, flagged
  // as a loss of lock: the solution must take a second ambiguity and stay right.
  const voxeng::BaselineSolution clean =
      voxeng::SolvePhaseBaseline(epochs, s.base.Antenna(), s.rover.Antenna());
  ASSERT_TRUE(clean.fixed);
  const int victim = clean.ambiguity_sats.front();
  for (size_t k = epochs.size() / 2; k < epochs.size(); ++k)
    for (auto& sat : epochs[k].sats)
      if (sat.sat == victim) {
        sat.rover_phase += 7;
        sat.slip = k == epochs.size() / 2;
      }
  const voxeng::BaselineSolution sol =
      voxeng::SolvePhaseBaseline(epochs, s.base.Antenna(), s.rover.Antenna());
  ASSERT_TRUE(sol.fixed) << sol.ratio;
  EXPECT_EQ(sol.ambiguities.size(), clean.ambiguities.size() + 1);
  EXPECT_LT(voxeng::Norm(sol.rover - s.rover.Antenna()), 0.03);
}

TEST(Simulator, SameSeedSameFilesOtherSeedOtherFiles) {
  namespace fs = std::filesystem;
  const fs::path root = fs::temp_directory_path() / ("voxsim_test_" + std::to_string(::getpid()));
  auto write = [&](const std::string& name, uint64_t seed) {
    voxsim::SurveyOptions o;
    o.start = voxsim::GpsSecondsOf(2024, 3, 15, 23, 58, 0);  // crosses midnight
    o.duration = 240;
    o.interval = 5;
    o.seed = seed;
    o.folder = (root / name).string();
    EXPECT_EQ(voxsim::WriteSurvey(voxsim::MakeSurvey(o)), "");
    std::ifstream in(root / name / "rover.raw", std::ios::binary);
    return std::vector<char>(std::istreambuf_iterator<char>(in), {});
  };
  const auto a = write("a", 5), b = write("b", 5), c = write("c", 6);
  EXPECT_FALSE(a.empty());
  EXPECT_EQ(a, b);
  EXPECT_NE(a, c);
  for (const char* f : {"base.raw", "kinematic.raw", "survey.job", "truth.txt"})
    EXPECT_TRUE(fs::exists(root / "a" / f)) << f;
  fs::remove_all(root);
}

// What vox's own reader finds in a file voxsim wrote.
struct FileContents {
  int start_status = -1;
  bool reached_end = false;
  int time_refs = 0, leap_seconds = -1, ephemerides = 0, epochs = 0, bad_ephemerides = 0;
  int signals = 0, dropped_values = 0, unexpected_signals = 0;
  double first_epoch_day = -1;
  std::vector<vox_EphemerisData> ephemeris_records;
};

FileContents ReadBack(const std::string& path) {
  FileContents c;
  vox::TBufFile file;
  EXPECT_TRUE(file.OpenRead(path));
  vox::RecordReader reader(file);
  c.start_status = reader.Start().status;
  if (c.start_status != 0) return c;
  const vox::RawDecoder& d = reader.decoder();
  while (reader.next_tag() != vox::kTagEnd) {
    if (reader.Next() != vox::ReadResult::kOk) return c;
    const vox::ByteSpan body = reader.body();
    if (reader.tag() == vox::kTagTimeRef) {
      vox::TimeRefRecord r;
      d.time_ref(body, r);
      ++c.time_refs;
      EXPECT_TRUE(r.IsGps());
      c.leap_seconds = r.has_leap ? static_cast<int>(r.leap_seconds) : -1;
      if (c.first_epoch_day < 0) c.first_epoch_day = r.time.day;
    } else if (reader.tag() == vox::kTagGpsEphemeris || reader.tag() == vox::kTagGpsHighEphemeris) {
      vox::GpsEphemerisRecord r;
      d.gps_ephemeris(body, r);
      ++c.ephemerides;
      if (!vox::PassesCheck(r)) ++c.bad_ephemerides;
      c.ephemeris_records.push_back(
          vox::MakeGpsEphemeris(r, reader.tag() == vox::kTagGpsHighEphemeris));
    } else if (reader.tag() == vox::kTagEpoch51) {
      ++c.epochs;
      vox::EpochHeader h;
      size_t at = d.epoch(body, h);
      for (unsigned k = 0; k < h.sat_count; ++k) {
        vox::SatBlock sb;
        at += d.sat_block51(body.subspan(at), sb);
        EXPECT_TRUE(sb.valid);
        EXPECT_GT(sb.b2, 30);  // C/N0 in dB-Hz
        for (bool more = true; more;) {
          vox::SignalBlock sig;
          at += d.signal51(body.subspan(at), sig);
          more = (sig.flags & 0x80) != 0;
          ++c.signals;
          const unsigned code = sig.flags & 0x7F;
          if (code != VOX_SIGNAL_GPS_L1CA && code != VOX_SIGNAL_GPS_L2P) ++c.unexpected_signals;
          if ((sig.flags & 0x300) != 0x300)  // a value failed its check and was dropped
            ++c.dropped_values;
        }
      }
      EXPECT_EQ(at, body.size());
    }
  }
  c.reached_end = true;
  return c;
}

TEST(Simulator, FilesReadBackThroughVoxInBothByteOrders) {
  namespace fs = std::filesystem;
  const fs::path root = fs::temp_directory_path() / ("voxsim_read_" + std::to_string(::getpid()));
  for (auto order : {voxtools::RawOrder::kLittle, voxtools::RawOrder::kBig}) {
    voxsim::SurveyOptions o;
    // Crosses midnight and a toe: a second time reference and a new ephemeris set are due.
    o.start = voxsim::GpsSecondsOf(2024, 3, 15, 22, 30, 0);
    o.duration = 5400;
    o.interval = 30;
    o.order = order;
    o.folder = root.string();
    const voxsim::Survey s = voxsim::MakeSurvey(o);
    ASSERT_EQ(voxsim::WriteSurvey(s), "");
    const FileContents c = ReadBack((root / "kinematic.raw").string());
    EXPECT_EQ(c.start_status, 0);
    EXPECT_TRUE(c.reached_end);
    EXPECT_EQ(c.time_refs, 2);
    EXPECT_EQ(c.leap_seconds, 18);
    EXPECT_EQ(c.epochs, static_cast<int>(s.EpochCount()));
    EXPECT_EQ(c.bad_ephemerides, 0);
    EXPECT_EQ(c.unexpected_signals, 0);
    EXPECT_EQ(c.dropped_values, 0);
    EXPECT_GT(c.signals, 2 * 6 * c.epochs);  // at least six satellites, two signals each
    // Sets of toe 22:00, 00:00 at the start, 02:00 written once 00:00 has passed.
    EXPECT_EQ(c.ephemerides, 3 * static_cast<int>(s.satellites.size()));
    // The record time is toe, and the engine's unpacking gives back the simulator's set.
    for (const vox_EphemerisData& rec : c.ephemeris_records) {
      vox_GpsOrbitParams p{};
      ASSERT_EQ(vox_GpsOrbitFromEphemeris(&rec, &p), 1);
      EXPECT_EQ(rec.head.seconds, p.week * 604800u + static_cast<uint32_t>(p.toe));
      const auto sat = std::find_if(s.satellites.begin(), s.satellites.end(),
                                    [&](const auto& x) { return x.prn == rec.head.sat; });
      ASSERT_NE(sat, s.satellites.end());
      const vox_GpsOrbitParams q = s.BroadcastAt(*sat, rec.head.seconds);
      EXPECT_EQ(p.m0, q.m0);
      EXPECT_EQ(p.omega0, q.omega0);
      EXPECT_EQ(p.af0, q.af0);
    }
    fs::remove_all(root);
  }
}

}  // namespace
