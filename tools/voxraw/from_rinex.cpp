// voxraw from-rinex OBS NAV... -o OUT [--big-endian] [--interval S] [--position]
//
// Writes one raw observation file from a RINEX observation file (2.10, 2.11, 3.0x) and any
// number of RINEX navigation files:
//   tag 1   the file header (type "O");
//   tag 2   the receiver identification: marker name, agency, receiver number, type, version
//           (vox shows "<type> #<number> (<version>)");
//   tag 3   a GPS time reference at the start of every day that has epochs, carrying GPS - UTC
//           from the first navigation header that states it (else the observation header's);
//   13/45, 14, 21, 47, 49  the broadcast ephemerides of GPS, QZSS J01-J05 (as GPS 33-37),
//           GLONASS, SBAS, Galileo and BDS, in the field convention of vox/vox_sdk_fields.h;
//   tag 51  one epoch record per RINEX epoch (event epochs and cycle-slip records are left out).
//
// Epoch times are moved to GPS time (BDT + 14 s; GLONASS time + leap seconds; Galileo and QZSS
// time taken as GPS time). Code values are the RINEX pseudoranges in metres, phases the RINEX
// phases in cycles, both unchanged. B2 is the L1 signal strength (the S observable of the
// chosen L1 signal, in whole dB-Hz), B3 the loss-of-lock bits of the L1 and L2 phases (bit 0 of
// the RINEX loss-of-lock indicator); the L5 loss-of-lock indicator and the strength digits
// are dropped, because the satellite block has no room for them.
//
// The output is written under a temporary name in the output's folder and renamed at the end,
// so a failed conversion leaves nothing under the output name.
#include "from_rinex.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <optional>
#include <random>
#include <string>
#include <vector>

#include "raw_fields.h"
#include "raw_writer.h"
#include "rinex_reader.h"

namespace voxraw {

namespace {

namespace fs = std::filesystem;
using namespace voxtools;
using rinex::NavRecord;
using rinex::ObsReader;
using rinex::RinexError;

struct Options {
  std::string obs;
  std::vector<std::string> nav;
  std::string out;
  bool big_endian = false;
  double interval = 0;
  bool position = false;
};

// ---- observables -----------------------------------------------------------------------------

// One RINEX signal (band and attribute of its observation codes) and the signal code our
// records give it. A slot takes the first signal of its list that the satellite has.
struct SignalChoice {
  char band;
  char attr;
  uint8_t code;
};
using SlotList = std::array<std::vector<SignalChoice>, 5>;  // L1C, L1P, L2C, L2P, L5X

const SlotList& SlotsOf(char system) {
  static const SlotList kGps = {{{{'1', 'C', 16}},
                                 {{'1', 'P', 20}, {'1', 'W', 21}},
                                 {{'2', 'L', 35}, {'2', 'X', 35}, {'2', 'S', 34}, {'2', 'C', 32}},
                                 {{'2', 'P', 36}, {'2', 'W', 37}},
                                 {{'5', 'X', 83}, {'5', 'Q', 83}, {'5', 'I', 82}}}};
  // QZSS J01-J05, carried as GPS 33-37: L1C (D, P, X) fills slot L1P; no P code on L2.
  static const SlotList kQzss = {{{{'1', 'C', 16}},
                                  {{'1', 'X', 19}, {'1', 'L', 18}, {'1', 'S', 17}},
                                  {{'2', 'L', 35}, {'2', 'X', 35}, {'2', 'S', 34}},
                                  {},
                                  {{'5', 'X', 83}, {'5', 'Q', 83}, {'5', 'I', 82}}}};
  static const SlotList kGlonass = {
      {{{'1', 'C', 16}}, {{'1', 'P', 17}}, {{'2', 'C', 33}}, {{'2', 'P', 34}}, {}}};
  static const SlotList kSbas = {
      {{{'1', 'C', 16}}, {}, {}, {}, {{'5', 'X', 82}, {'5', 'Q', 82}, {'5', 'I', 82}}}};
  // Galileo: E1, E5a, E5b, E5 (AltBOC), E6.
  static const SlotList kGalileo = {
      {{{'1', 'X', 18}, {'1', 'C', 18}, {'1', 'B', 18}},
       {{'5', 'X', 83}, {'5', 'Q', 82}, {'5', 'I', 81}},
       {{'7', 'X', 115}, {'7', 'Q', 114}, {'7', 'I', 113}},
       {{'8', 'X', 67}, {'8', 'Q', 66}, {'8', 'I', 65}},
       {{'6', 'X', 102}, {'6', 'C', 100}, {'6', 'B', 98}, {'6', 'A', 97}, {'6', 'Z', 103}}}};
  // BDS: B1I (band 2 since RINEX 3.02), B2I (band 7), B3I (band 6).
  static const SlotList kBds = {{{{'2', 'I', 33}, {'2', 'X', 35}},
                                 {{'2', 'Q', 34}},
                                 {{'7', 'I', 113}, {'7', 'X', 115}},
                                 {{'7', 'Q', 114}},
                                 {{'6', 'I', 97}, {'6', 'X', 99}}}};
  static const SlotList kNone = {};
  switch (system) {
    case 'G':
      return kGps;
    case 'J':
      return kQzss;
    case 'R':
      return kGlonass;
    case 'S':
      return kSbas;
    case 'E':
      return kGalileo;
    case 'C':
      return kBds;
    default:
      return kNone;
  }
}

// The system letter and number of our records for a RINEX satellite; nullopt for satellites
// our records cannot carry.
std::optional<std::pair<char, unsigned>> RawSatelliteOf(char system, unsigned n) {
  switch (system) {
    case 'G':
      if (n >= 1 && n <= 32) return std::make_pair('G', n);
      break;
    case 'J':  // QZSS PRN 193-197 are J01-J05
      if (n >= 1 && n <= 5) return std::make_pair('G', n + 32);
      break;
    case 'R':
      if (n >= 1 && n <= 24) return std::make_pair('R', n);
      break;
    case 'E':
      if (n >= 1 && n <= 30) return std::make_pair('E', n);
      break;
    case 'C':
      if (n >= 1 && n <= 37) return std::make_pair('C', n);
      break;
    case 'S':  // RINEX numbers SBAS satellites by PRN - 100
      if (n >= 20 && n <= 40) return std::make_pair('S', n);
      break;
    default:
      break;
  }
  return std::nullopt;
}

class EpochConverter {
 public:
  explicit EpochConverter(ObsReader& reader) : reader_(reader) {}

  // The satellite block of one RINEX satellite; false when none of its signals has a slot.
  bool Convert(const rinex::SatObservations& sat, voxtools::RawSatellite& out) {
    const auto raw = RawSatelliteOf(sat.system, sat.number);
    if (!raw) return false;
    const std::vector<std::string>& types = Types(sat.system);
    const SlotList& slots = SlotsOf(sat.system);
    out = {};
    out.code = SatCode51(raw->first, raw->second);
    for (int slot = 0; slot < 5; ++slot) {
      for (const SignalChoice& s : slots[slot]) {
        const rinex::ObsValue* code = Find(sat, types, 'C', s);
        const rinex::ObsValue* phase = Find(sat, types, 'L', s);
        if (!code && !phase) continue;
        std::optional<double> c, p;
        if (code) c = code->value;
        if (phase) p = phase->value;
        out.signals.push_back(RawSignal::Tag51(s.code, c, p));
        if (phase && (phase->lli & 1)) {
          if (slot <= 1)
            out.b3 |= VOX_B3_L1_LOSS_OF_LOCK;
          else if (slot <= 3)
            out.b3 |= VOX_B3_L2_LOSS_OF_LOCK;
        }
        if (slot == 0) {
          const rinex::ObsValue* strength = Find(sat, types, 'S', s);
          if (strength)
            out.b2 = static_cast<uint8_t>(std::clamp(std::lround(strength->value), 0L, 255L));
        }
        break;
      }
    }
    return !out.signals.empty();
  }

 private:
  // Observation types of a system, with BDS B1I as RINEX 3.02 names it (band 2). Versions
  // 3.00 and 3.01, and some writers of later versions, put B1I on band 1; band 1 X is B1I
  // only before 3.02 (later it is the B1C signal, which our records have no slot for).
  const std::vector<std::string>& Types(char system) {
    const std::vector<std::string>& types = reader_.TypesOf(system);
    if (system != 'C') return types;
    if (bds_types_.empty()) {
      const bool old = reader_.header().version < 3.02;
      bds_types_ = types;
      for (std::string& t : bds_types_)
        if (t.size() == 3 && t[1] == '1' && (t[2] == 'I' || t[2] == 'Q' || (old && t[2] == 'X')))
          t[1] = '2';
    }
    return bds_types_;
  }

  static const rinex::ObsValue* Find(const rinex::SatObservations& sat,
                                     const std::vector<std::string>& types, char kind,
                                     const SignalChoice& s) {
    for (size_t i = 0; i < types.size() && i < sat.values.size(); ++i) {
      const std::string& t = types[i];
      if (t.size() == 3 && t[0] == kind && t[1] == s.band && t[2] == s.attr &&
          sat.values[i].present)
        return &sat.values[i];
    }
    return nullptr;
  }

  ObsReader& reader_;
  std::vector<std::string> bds_types_;
};

// ---- ephemerides ----------------------------------------------------------------------------

constexpr double kWeek = VOX_GPS_WEEK_SECONDS;

// The absolute time (same scale, seconds since the GPS origin) of a second of week that lies
// within half a week of `near`.
double NearestWeekTime(double near, double second_of_week) {
  const double week = std::floor((near - second_of_week) / kWeek + 0.5);
  return week * kWeek + second_of_week;
}

uint8_t UraIndex(double metres) {
  static const double kLimits[] = {2.4,  3.4,   4.85,  6.85,  9.65,   13.65,  24.0,  48.0,
                                   96.0, 192.0, 384.0, 768.0, 1536.0, 3072.0, 6144.0};
  if (metres < 0) return 15;
  for (uint8_t i = 0; i < 15; ++i)
    if (metres <= kLimits[i]) return i;
  return 15;
}

uint8_t SisaIndex(double m) {
  if (m < 0 || m > 6.0) return 255;  // no accuracy prediction available
  if (m < 0.5) return static_cast<uint8_t>(std::lround(m * 100));
  if (m < 1.0) return static_cast<uint8_t>(50 + std::lround((m - 0.5) * 50));
  if (m < 2.0) return static_cast<uint8_t>(75 + std::lround((m - 1.0) * 25));
  return static_cast<uint8_t>(100 + std::lround((m - 2.0) * 6.25));
}

// The Keplerian record values (GPS, QZSS, Galileo and BDS share the layout up to index 22).
vox_GpsOrbitParams KeplerParams(const NavRecord& r, double toc_scale_seconds) {
  const std::vector<double>& v = r.values;
  vox_GpsOrbitParams p{};
  p.af0 = v[0], p.af1 = v[1], p.af2 = v[2];
  p.iode = static_cast<uint32_t>(v[3]);
  p.crs = v[4], p.delta_n = v[5], p.m0 = v[6];
  p.cuc = v[7], p.e = v[8], p.cus = v[9], p.sqrt_a = v[10];
  p.toe = v[11], p.cic = v[12], p.omega0 = v[13], p.cis = v[14];
  p.i0 = v[15], p.crc = v[16], p.omega = v[17], p.omega_dot = v[18];
  p.idot = v[19];
  // The week comes from the time of clock rather than the week field, which older writers
  // fill modulo 1024.
  const double toe_abs = NearestWeekTime(toc_scale_seconds, p.toe);
  p.week = static_cast<uint32_t>(std::llround((toe_abs - p.toe) / kWeek));
  p.toc = std::fmod(toc_scale_seconds, kWeek);
  if (p.toc < 0) p.toc += kWeek;
  return p;
}

class NavConverter {
 public:
  NavConverter(RawWriter& w, std::optional<int> leap) : w_(w), leap_(leap) {}

  // Appends the record's ephemeris; false when our records cannot carry it.
  bool Convert(const NavRecord& r) {
    const double toc = rinex::SecondsSinceGpsOrigin(r.toc);
    switch (r.system) {
      case 'G':
      case 'J':
        return Gps(r, toc);
      case 'E':
        return Galileo(r, toc);
      case 'C':
        return Bds(r, toc);
      case 'R':
        return Glonass(r, toc);
      case 'S':
        return Sbas(r, toc);
      default:
        return false;
    }
  }

 private:
  static bool Enough(const NavRecord& r, size_t n) { return r.values.size() >= n; }

  bool Gps(const NavRecord& r, double toc) {
    const auto sat = RawSatelliteOf(r.system, r.number);
    if (!sat || !Enough(r, 29)) return false;
    vox_GpsOrbitParams p = KeplerParams(r, toc);
    p.ura = UraIndex(r.values[23]);
    p.health = static_cast<uint32_t>(r.values[24]);
    p.tgd = r.values[25];
    p.fit_flag = r.values[28] > 4.0 ? 1u : 0u;  // fit interval in hours; 0 means four
    uint8_t tag = 13;
    const RawGpsEphemeris e = GpsEphemerisFromOrbit(p, sat->second, &tag);
    w_.GpsEphemeris(e, tag);
    return true;
  }

  bool Galileo(const NavRecord& r, double toc) {
    const auto sat = RawSatelliteOf(r.system, r.number);
    if (!sat || !Enough(r, 27)) return false;
    const vox_GpsOrbitParams p = KeplerParams(r, toc);
    const std::vector<double>& v = r.values;
    RawGalileoEphemeris e;
    e.number = static_cast<uint8_t>(sat->second);
    e.time = StampOfSeconds(p.week * kWeek + p.toe);
    e.e1 = static_cast<uint32_t>(p.toe);
    e.e2 = static_cast<uint32_t>(p.toc);
    const double e3_e6[4] = {p.af2, p.af1, v[25], v[26]};
    for (int k = 0; k < 4; ++k)
      e.e3_e6[k] = static_cast<float>(e3_e6[k]);
    e.e7_e10[0] = p.af0, e.e7_e10[1] = p.e, e.e7_e10[2] = p.sqrt_a, e.e7_e10[3] = p.m0;
    const double e11_e17[7] = {p.delta_n, p.omega_dot, p.idot, p.cuc, p.cus, p.crc, p.crs};
    for (int k = 0; k < 7; ++k)
      e.e11_e17[k] = static_cast<float>(e11_e17[k]);
    e.e18 = p.omega0, e.e19 = p.omega;
    e.e20 = static_cast<float>(p.cic);
    e.e21 = p.i0;
    e.e22 = static_cast<float>(p.cis);
    e.e23 = static_cast<uint16_t>(v[3]);
    e.e24 = SisaIndex(v[23]);
    e.e25 = static_cast<uint8_t>(v[24]);
    w_.GalileoEphemeris(e);
    return true;
  }

  bool Bds(const NavRecord& r, double toc_bdt) {
    const auto sat = RawSatelliteOf(r.system, r.number);
    if (!sat || !Enough(r, 29)) return false;
    vox_GpsOrbitParams p = KeplerParams(r, toc_bdt);  // toe, toc in BDT seconds of week
    p.ura = UraIndex(r.values[23]);
    p.health = static_cast<uint32_t>(r.values[24]);
    p.tgd = r.values[25];
    double g[VOX_G_COUNT];
    vox_GpsOrbitToFields(&p, g);
    RawBdsEphemeris e;
    e.number = static_cast<uint8_t>(sat->second);
    // The record time is toe as GPS time: BDT runs 14 s behind GPS time.
    e.time = StampOfSeconds(p.week * kWeek + p.toe + 14.0);
    e.c1 = static_cast<uint32_t>(g[1]);
    e.c2 = static_cast<uint32_t>(g[2]);
    for (int k = 0; k < 5; ++k)
      e.c3_c7[k] = static_cast<float>(g[3 + k]);
    e.c8 = g[8], e.c9 = g[9], e.c10 = g[10];
    for (int k = 0; k < 6; ++k)
      e.c11_c16[k] = static_cast<float>(g[11 + k]);
    e.c17 = g[17], e.c18 = g[18];
    e.c19 = static_cast<float>(g[19]);
    e.c20 = g[20];
    e.c21 = static_cast<float>(g[21]);
    e.c22 = static_cast<uint8_t>(g[22]);
    e.c23 = static_cast<uint8_t>(g[23]);
    e.c24 = static_cast<uint8_t>(p.health);
    e.c25 = static_cast<uint8_t>(r.values[28]);  // AODC
    w_.BdsEphemeris(e);
    return true;
  }

  bool Glonass(const NavRecord& r, double toc_utc) {
    const auto sat = RawSatelliteOf(r.system, r.number);
    if (!sat || !Enough(r, 15)) return false;
    const std::vector<double>& v = r.values;
    const int leap = leap_ ? *leap_ : rinex::LeapSecondsAt(toc_utc);
    RawGlonassEphemeris e;
    e.slot = static_cast<uint8_t>(sat->second);
    e.time = StampOfSeconds(toc_utc + leap);
    e.r1 = static_cast<float>(-v[0]);  // RINEX gives -tau_n
    e.r2 = static_cast<float>(v[1]);
    for (int k = 0; k < 3; ++k) {
      e.position[k] = v[3 + 4 * k];
      e.velocity[k] = static_cast<float>(v[4 + 4 * k]);
      e.acceleration[k] = static_cast<float>(v[5 + 4 * k]);
    }
    e.r3 = static_cast<uint8_t>(static_cast<int8_t>(v[10]));
    e.r4 = static_cast<uint8_t>(v[6]);
    w_.GlonassEphemeris(e);
    return true;
  }

  bool Sbas(const NavRecord& r, double toc) {
    const auto sat = RawSatelliteOf(r.system, r.number);
    if (!sat || !Enough(r, 15)) return false;
    const std::vector<double>& v = r.values;
    RawSbasEphemeris e;
    e.number = static_cast<uint8_t>(sat->second);
    e.time = StampOfSeconds(toc);
    e.s1 = static_cast<uint8_t>(v[14]);
    e.s2 = UraIndex(v[10]);
    e.reference_seconds = e.time.ms_of_day / 1000;
    for (int k = 0; k < 3; ++k) {
      e.s3_s5[k] = v[3 + 4 * k] * 1000.0;
      e.s6_s13[k] = static_cast<float>(v[4 + 4 * k] * 1000.0);
      e.s6_s13[3 + k] = static_cast<float>(v[5 + 4 * k] * 1000.0);
    }
    e.s6_s13[6] = static_cast<float>(v[0]);
    e.s6_s13[7] = static_cast<float>(v[1]);
    w_.SbasEphemeris(e);
    return true;
  }

  RawWriter& w_;
  std::optional<int> leap_;
};

// ---- the conversion -------------------------------------------------------------------------

// Seconds to add to a time of the observation file's time scale to get GPS time.
double ToGpsTime(const rinex::ObsHeader& h, double seconds, std::optional<int> leap) {
  if (h.time_system == "BDT") return 14.0;
  if (h.time_system == "GLO" || h.time_system == "UTC")
    return leap ? *leap : rinex::LeapSecondsAt(seconds);
  return 0.0;  // GPS; Galileo and QZSS system time are kept within nanoseconds of it
}

class Output {
 public:
  Output(const std::string& path, RawOrder order) : path_(path), order_(order) {
    std::random_device rd;
    char suffix[32];
    std::snprintf(suffix, sizeof suffix, ".part%08x", rd());
    temp_ = path + suffix;
    file_.open(temp_, std::ios::binary | std::ios::trunc);
    if (!file_) throw RinexError(path, 0, "cannot create " + temp_);
  }
  ~Output() {
    if (!done_) {
      file_.close();
      std::error_code ec;
      fs::remove(temp_, ec);
    }
  }
  RawWriter Writer() const { return RawWriter(order_); }
  void Put(const RawWriter& w) {
    file_.write(reinterpret_cast<const char*>(w.bytes().data()),
                static_cast<std::streamsize>(w.size()));
  }
  void Commit() {
    file_.close();
    if (!file_) throw RinexError(path_, 0, "cannot write " + temp_);
    std::error_code ec;
    fs::rename(temp_, path_, ec);
    if (ec) throw RinexError(path_, 0, "cannot rename " + temp_ + ": " + ec.message());
    done_ = true;
  }

 private:
  std::string path_, temp_;
  RawOrder order_;
  std::ofstream file_;
  bool done_ = false;
};

// One conversion: the readers, the output and what was written.
class Conversion {
 public:
  explicit Conversion(const Options& o)
      : o_(o), obs_(o.obs), out_(o.out, o.big_endian ? RawOrder::kBig : RawOrder::kLittle) {
    for (const std::string& path : o.nav) {
      navs_.emplace_back(path);
      if (!leap_) leap_ = navs_.back().header().leap_seconds;
    }
    if (!leap_) leap_ = obs_.header().leap_seconds;
  }

  // Writes everything and gives the file its name; throws RinexError.
  void Run() {
    WriteHead();
    WriteEphemerides();
    WriteEpochs();
    RawWriter w = out_.Writer();
    w.EndOfData();
    out_.Put(w);
    out_.Commit();
  }

  void Report() {
    std::printf("%s: %u epochs, %u ephemerides", o_.out.c_str(), epochs_, ephemerides_);
    if (skipped_satellites_ || skipped_ephemerides_)
      std::printf(
          " (left out: %u satellite observations, %u ephemerides of satellites or "
          "systems without a place in the raw records)",
          skipped_satellites_, skipped_ephemerides_);
    std::printf("\n");
    if (!o_.position) return;
    const auto& xyz = obs_.header().approx_position;
    if (!xyz)
      std::fprintf(stderr, "%s: the header gives no approximate position\n", o_.obs.c_str());
    else
      std::printf("PosX=%.4f\nPosY=%.4f\nPosZ=%.4f\n", (*xyz)[0], (*xyz)[1], (*xyz)[2]);
  }

 private:
  void WriteHead() {
    RawWriter w = out_.Writer();
    const rinex::ObsHeader& h = obs_.header();
    w.Header('O').Receiver(h.marker_name, h.agency, h.receiver_number, h.receiver_type,
                           h.receiver_version);
    out_.Put(w);
  }

  void WriteEphemerides() {
    for (rinex::NavReader& nav : navs_) {
      const std::optional<int> leap = nav.header().leap_seconds ? nav.header().leap_seconds : leap_;
      NavRecord r;
      while (nav.Next(r)) {
        RawWriter w = out_.Writer();
        if (NavConverter(w, leap).Convert(r)) {
          out_.Put(w);
          ++ephemerides_;
        } else {
          ++skipped_ephemerides_;
        }
      }
    }
  }

  // Receivers that steer their clock date epochs a millisecond or so off the second; an
  // epoch belongs to the nearest grid point within 0.1 s, and each point takes the first
  // epoch that comes to it.
  bool OnGrid(int64_t ms) {
    const auto interval = static_cast<int64_t>(std::llround(o_.interval * 1000.0));
    if (interval <= 0) return true;
    const int64_t grid = (ms + interval / 2) / interval * interval;
    if (std::llabs(ms - grid) > std::min<int64_t>(100, interval / 2) || grid <= last_grid_)
      return false;
    last_grid_ = grid;
    return true;
  }

  void WriteEpochs() {
    EpochConverter converter(obs_);
    rinex::ObsEpoch epoch;
    while (obs_.Next(epoch)) {
      const double t = rinex::SecondsSinceGpsOrigin(epoch.time);
      const int64_t ms = std::llround((t + ToGpsTime(obs_.header(), t, leap_)) * 1000.0);
      if (ms < 0) throw RinexError(o_.obs, epoch.line, "epoch before 1980-01-06");
      if (!OnGrid(ms)) continue;
      std::vector<voxtools::RawSatellite> sats;
      for (const rinex::SatObservations& s : epoch.sats) {
        voxtools::RawSatellite raw;
        if (converter.Convert(s, raw))
          sats.push_back(std::move(raw));
        else
          ++skipped_satellites_;
      }
      if (!sats.empty()) WriteEpoch(ms, sats, epoch.line);
    }
  }

  void WriteEpoch(int64_t ms, const std::vector<voxtools::RawSatellite>& sats, int line) {
    if (sats.size() > 255) throw RinexError(o_.obs, line, "more than 255 satellites");
    RawWriter w = out_.Writer();
    const int64_t day = ms / 86400000;
    if (day != reference_day_) {
      // Epochs carry only the milliseconds of their day: a new day needs a new reference.
      std::optional<uint32_t> leap_field;
      if (leap_) leap_field = static_cast<uint32_t>(*leap_);
      w.TimeRef("GPS", {0, static_cast<uint32_t>(day)}, {}, leap_field);
      reference_day_ = day;
    }
    const size_t epoch_at = w.size();
    w.Epoch(51, static_cast<uint32_t>(ms % 86400000), sats);
    if (w.size() - epoch_at > 16384) throw RinexError(o_.obs, line, "epoch too large for a record");
    out_.Put(w);
    ++epochs_;
  }

  const Options& o_;
  ObsReader obs_;
  std::vector<rinex::NavReader> navs_;
  std::optional<int> leap_;
  Output out_;
  int64_t reference_day_ = -1;
  int64_t last_grid_ = -1;
  uint32_t epochs_ = 0, skipped_satellites_ = 0, ephemerides_ = 0, skipped_ephemerides_ = 0;
};

int Run(const Options& o) {
  try {
    Conversion c(o);
    c.Run();
    c.Report();
    return 0;
  } catch (const std::exception& e) {
    std::fprintf(stderr, "voxraw from-rinex: %s\n", e.what());
    return 1;
  }
}

}  // namespace

void AddFromRinex(CLI::App& app) {
  auto options = std::make_shared<Options>();
  CLI::App* cmd = app.add_subcommand(
      "from-rinex", "convert a RINEX observation file and its navigation files to a raw file");
  cmd->add_option("OBS", options->obs, "RINEX observation file (2.10, 2.11, 3.0x)")->required();
  cmd->add_option("NAV", options->nav, "RINEX navigation files");
  cmd->add_option("-o,--output", options->out, "raw observation file to write")->required();
  cmd->add_flag("--big-endian", options->big_endian, "write the big-endian byte order");
  cmd->add_option("--interval", options->interval,
                  "keep one epoch per grid point of this spacing (seconds from the GPS time "
                  "origin), the first within 0.1 s of it")
      ->check(CLI::NonNegativeNumber);
  cmd->add_flag("--position", options->position,
                "print the header's approximate position as PosX=, PosY=, PosZ= lines");
  cmd->callback([options]() {
    const int code = Run(*options);
    if (code == 0) throw CLI::Success();
    throw CLI::RuntimeError(code);
  });
}

}  // namespace voxraw
