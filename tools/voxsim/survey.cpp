#include "survey.h"

#include <cmath>
#include <filesystem>
#include <fstream>
#include <numbers>

#include "raw_fields.h"
#include "sim_signals.h"

namespace voxsim {

namespace {

constexpr double kDeg = std::numbers::pi / 180.0;
constexpr double kToeSpacing = 7200;  // broadcast sets every two hours
constexpr double kFitHalf = 7200;     // a set is broadcast from two hours before its toe

int64_t DaysFromCivil(int y, int m, int d) {  // days since 1970-01-01
  y -= m <= 2;
  const int64_t era = (y >= 0 ? y : y - 399) / 400;
  const int64_t yoe = y - era * 400;
  const int64_t doy = (153 * (m + (m > 2 ? -3 : 9)) + 2) / 5 + d - 1;
  const int64_t doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
  return era * 146097 + doe - 719468;
}

Vec3 Offset(const Vec3& from, double east, double north, double up) {
  return from + voxeng::EnuToEcef({east, north, up}, voxeng::EcefToGeodetic(from));
}

}  // namespace

double GpsSecondsOf(int year, int month, int day, int hour, int minute, double second) {
  const int64_t days = DaysFromCivil(year, month, day) - DaysFromCivil(1980, 1, 6);
  return static_cast<double>(days) * 86400.0 + hour * 3600.0 + minute * 60.0 + second;
}

Vec3 Station::Antenna() const {
  return Offset(mark, 0, 0, height);
}

Vec3 Survey::KinematicAt(double t) const {
  // A circle driven at constant speed, with a gentle up-and-down over it.
  const double angle = track_speed * (t - options.start) / track_radius;
  return Offset(track_centre, track_radius * std::cos(angle), track_radius * std::sin(angle),
                1.5 * std::sin(2 * angle));
}

size_t Survey::EpochCount() const {
  return static_cast<size_t>(std::floor(options.duration / options.interval + 1e-9)) + 1;
}

double Survey::EpochTime(size_t k) const {
  const int64_t step_ms = std::llround(options.interval * 1000.0);
  return options.start + static_cast<double>(static_cast<int64_t>(k) * step_ms) / 1000.0;
}

vox_GpsOrbitParams Survey::BroadcastAt(const SimSatellite& s, double t) const {
  const double toe = std::round(t / kToeSpacing) * kToeSpacing;
  return BroadcastFor(s, toe, static_cast<unsigned>(std::llround(toe / kToeSpacing)) & 0xFFu);
}

Survey MakeSurvey(const SurveyOptions& options) {
  Survey s;
  s.options = options;
  Random rng(options.seed);
  // Orbits are referenced to the start of the survey's week, so the seed alone decides them.
  const double week_start = std::floor(options.start / VOX_GPS_WEEK_SECONDS) * VOX_GPS_WEEK_SECONDS;
  s.satellites = MakeConstellation(options.seed, week_start, options.satellites);
  const voxeng::Geodetic base_place{(46.5 + rng.Uniform(-1, 1)) * kDeg,
                                    (6.6 + rng.Uniform(-1, 1)) * kDeg, rng.Uniform(300, 700)};
  s.base = {"BASE", voxeng::GeodeticToEcef(base_place), 1.5};
  const double bearing = rng.Uniform(0, 2 * std::numbers::pi), distance = rng.Uniform(2e3, 5e3);
  s.rover = {"ROVER",
             Offset(s.base.mark, distance * std::sin(bearing), distance * std::cos(bearing),
                    rng.Uniform(-30, 30)),
             1.65};
  s.track_centre = Offset(s.base.mark, distance * 0.5 * std::sin(bearing + 0.5),
                          distance * 0.5 * std::cos(bearing + 0.5), 2.0);
  s.track_radius = 300;
  s.track_speed = 4;
  const double first = std::floor((options.start - kToeSpacing / 2) / kToeSpacing) * kToeSpacing;
  for (double toe = first; toe <= options.start + options.duration + kToeSpacing;
       toe += kToeSpacing)
    s.toes.push_back(toe);
  return s;
}

namespace {

using voxtools::RawWriter;

struct ReceiverFile {
  std::string file;
  std::string serial;
  double zenith_wet;
  uint64_t seed;
  bool moving;
  const Station* station;
};

void WriteEphemerides(RawWriter& w, const Survey& s, double toe) {
  for (const SimSatellite& sat : s.satellites) {
    const vox_GpsOrbitParams p =
        BroadcastFor(sat, toe, static_cast<unsigned>(std::llround(toe / kToeSpacing)) & 0xFFu);
    uint8_t tag = 13;
    const voxtools::RawGpsEphemeris r = voxtools::GpsEphemerisFromOrbit(p, sat.prn, &tag);
    w.GpsEphemeris(r, tag);
  }
}

void WriteReceiverFile(const Survey& s, const ReceiverFile& rf, RawWriter& w) {
  const SurveyOptions& o = s.options;
  ReceiverSim rx(rf.seed, o.start, rf.zenith_wet);
  w.Header('O');
  w.Receiver("voxsim", "simulated survey", rf.serial, "SIMRX", "1.0");
  size_t next_toe = 0;
  int64_t day = -1;
  for (size_t k = 0; k < s.EpochCount(); ++k) {
    const double t = s.EpochTime(k);
    const int64_t t_ms = std::llround(t * 1000.0);
    if (t_ms / 86400000 != day) {
      // Epochs carry the millisecond of the day only: a time reference gives their day.
      day = t_ms / 86400000;
      w.TimeRef("GPS", voxtools::StampOfSeconds(t), std::nullopt, o.leap_seconds);
    }
    while (next_toe < s.toes.size() && s.toes[next_toe] - kFitHalf <= t) {
      if (s.toes[next_toe] + kFitHalf > t)  // sets already out of date are not logged
        WriteEphemerides(w, s, s.toes[next_toe]);
      ++next_toe;
    }
    const Vec3 antenna = rf.moving ? s.KinematicAt(t) : rf.station->Antenna();
    std::vector<voxtools::RawSatellite> sats;
    for (const SimSatellite& sat : s.satellites) {
      Observables ob;
      if (!rx.Observe(sat, t, antenna, ob)) continue;
      voxtools::RawSatellite rs;
      rs.code = voxtools::SatCode51('G', sat.prn);
      rs.b2 = ob.cn0;
      rs.b3 = ob.new_arc ? (VOX_B3_L1_LOSS_OF_LOCK | VOX_B3_L2_LOSS_OF_LOCK) : 0;
      rs.signals.push_back(voxtools::RawSignal::Tag51(VOX_SIGNAL_GPS_L1CA, ob.p1, ob.l1));
      rs.signals.push_back(voxtools::RawSignal::Tag51(VOX_SIGNAL_GPS_L2P, ob.p2, ob.l2));
      sats.push_back(std::move(rs));
    }
    w.Epoch(51, static_cast<uint32_t>(t_ms % 86400000), sats);
  }
  w.EndOfData();
}

std::string JobTime(double t) {
  const int64_t ms = std::llround(t * 1000.0);
  return std::to_string(ms / 86400000) + ":" + std::to_string(ms % 86400000);
}

std::string Fixed(double v, int digits) {
  char buf[64];
  std::snprintf(buf, sizeof buf, "%.*f", digits, v);
  return buf;
}

void WriteJob(const Survey& s, std::ostream& out) {
  const double first = s.EpochTime(0), last = s.EpochTime(s.EpochCount() - 1);
  const std::string span = "Start=" + JobTime(first) + "\nEnd=" + JobTime(last) + "\n";
  out << "[JOB]\nName=voxsim survey, seed " << s.options.seed << "\nType=" << s.options.job_type
      << "\nResultPath=result.bin\nNumFiles=3\nNumPoints=2\nNumAntennas=2\nNumReceivers=3\n"
         "NumOccups=3\nNumVectors=1\nNumFans=1\n";
  out << "[FILE:1]\nName=base.raw\n[FILE:2]\nName=rover.raw\n[FILE:3]\nName=kinematic.raw\n";
  out << "[POINT:1]\nName=BASE\nPosX=" << Fixed(s.base.mark[0], 4)
      << "\nPosY=" << Fixed(s.base.mark[1], 4) << "\nPosZ=" << Fixed(s.base.mark[2], 4)
      << "\nPosRms=0.001\nType=0\n[POINT:2]\nName=ROVER\n";
  out << "[ANTENNA:1]\nName=SIM-GEODETIC\n[ANTENNA:2]\nName=SIM-ROVER\n";
  for (int k = 1; k <= 3; ++k)
    out << "[RECEIVER:" << k << "]\nVendor=voxsim\nName=SIMRX\nSN=" << 1000 + k << "\n";
  out << "[OCCUP:1]\nName=BASE\nFile=1\nPoint=1\nAntenna=1\nReceiver=1\nOffsetL1_U="
      << Fixed(s.base.height, 3) << "\n"
      << span;
  out << "[OCCUP:2]\nName=ROVER\nFile=2\nPoint=2\nAntenna=1\nReceiver=2\nOffsetL1_U="
      << Fixed(s.rover.height, 3) << "\n"
      << span;
  out << "[OCCUP:3]\nName=TRACK\nFile=3\nAntenna=2\nReceiver=3\n" << span;
  out << "[VECTOR:1]\nPoints=1,2\n";
  out << "[FAN:1]\nPoint=1\nRover=3\nGGAPath=fan.gga\n";
}

void WriteTruth(const Survey& s, std::ostream& out) {
  out << "# voxsim truth, seed " << s.options.seed << "\n"
      << "# Times: GPS seconds since 1980-01-06 00:00:00. Positions: Earth-centred X Y Z in\n"
      << "# metres. station: name, mark X Y Z, antenna height above the mark (m), antenna X Y Z.\n"
      << "# kinematic: epoch time and antenna X Y Z of the moving rover (file kinematic.raw).\n";
  for (const Station* st : {&s.base, &s.rover}) {
    const Vec3 a = st->Antenna();
    out << "station " << st->name << " " << Fixed(st->mark[0], 4) << " " << Fixed(st->mark[1], 4)
        << " " << Fixed(st->mark[2], 4) << " " << Fixed(st->height, 4) << " " << Fixed(a[0], 4)
        << " " << Fixed(a[1], 4) << " " << Fixed(a[2], 4) << "\n";
  }
  for (size_t k = 0; k < s.EpochCount(); ++k) {
    const double t = s.EpochTime(k);
    const Vec3 p = s.KinematicAt(t);
    out << "kinematic " << Fixed(t, 3) << " " << Fixed(p[0], 4) << " " << Fixed(p[1], 4) << " "
        << Fixed(p[2], 4) << "\n";
  }
}

}  // namespace

std::string WriteSurvey(const Survey& s) {
  namespace fs = std::filesystem;
  std::error_code ec;
  fs::create_directories(s.options.folder, ec);
  if (ec) return "cannot create folder " + s.options.folder + ": " + ec.message();
  const fs::path dir(s.options.folder);
  Random rng(s.options.seed ^ 0x7265636569766572ull);
  // The wet troposphere of nearby places differs by a centimetre or so, not by decimetres.
  const double wet = rng.Uniform(0.05, 0.2);
  const ReceiverFile files[] = {
      {"base.raw", "1001", wet, rng.Next(), false, &s.base},
      {"rover.raw", "1002", wet + rng.Uniform(-0.01, 0.01), rng.Next(), false, &s.rover},
      {"kinematic.raw", "1003", wet + rng.Uniform(-0.01, 0.01), rng.Next(), true, nullptr},
  };
  for (const ReceiverFile& rf : files) {
    RawWriter w(s.options.order);
    WriteReceiverFile(s, rf, w);
    if (!w.Save((dir / rf.file).string())) return "cannot write " + (dir / rf.file).string();
  }
  std::ofstream job(dir / "survey.job"), truth(dir / "truth.txt");
  WriteJob(s, job);
  WriteTruth(s, truth);
  if (!job.good() || !truth.good())
    return "cannot write survey.job or truth.txt in " + s.options.folder;
  return {};
}

}  // namespace voxsim
