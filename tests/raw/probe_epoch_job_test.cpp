// A whole job through voxrun whose four raw files carry epochs of GPS, GLONASS, GALILEO, BDS
// and SBAS satellites (records of tag 51 and of tag 8, little- and big-endian, GPS time and a
// UTC-based time scale): the probe engine walks every epoch and satellite of every occupation,
// and each value it sees is the value written after the documented conversions (code in
// seconds on one time scale, phase unchanged, the GPS L2C rules of tag-51 records).
#include <gtest/gtest.h>

#include <cmath>
#include <map>
#include <string>
#include <vector>

#include "epoch_test_files.h"
#include "probe_job_util.h"
#include "support/scratch.h"

namespace vox::test {
namespace {

constexpr double kLeap = 17.0;                         // in force in March 2016
constexpr double kFailsCheck = 268435456.0;            // 2^28: beyond the code window
constexpr double kPhaseFailsCheck = 17592186044416.0;  // 2^44: beyond the phase window

struct FileCase {
  uint8_t tag;
  RawOrder order;
  bool utc;
  const char* name;
};
const FileCase kFiles[4] = {{51, RawOrder::kLittle, false, "a.raw"},
                            {51, RawOrder::kBig, true, "b.raw"},
                            {8, RawOrder::kLittle, false, "c.raw"},
                            {8, RawOrder::kBig, true, "d.raw"}};

// One satellite as written: system letter, number, the values of its slots, B2 and B3.
struct Written {
  char system;
  unsigned number;
  std::vector<SignalValue> values;
  uint8_t b2, b3;
};

// Code pr + base + k and phase ph + base + k in slot k - 1, for k = 1 to count.
std::vector<SignalValue> Slots(int count, double pr, double ph, double base) {
  std::vector<SignalValue> values;
  for (int k = 1; k <= count; ++k)
    values.push_back({k - 1, pr + base + k, ph + base + k});
  return values;
}

// The satellites of epoch e. Every system that has L2 signals carries all its slots on one
// satellite, so that the file's signal masks are complete and no force-copy rule applies.
std::vector<Written> Satellites(uint8_t tag, uint32_t e) {
  const double pr = 2.0e7 + 1000.0 * e, ph = 1.1e8 + 0.25 + e;
  // G1: every slot, L2C phase an integer away from L2P phase (agreeing, offset 0).
  std::vector<SignalValue> g1 = Slots(tag == 51 ? 5 : 4, pr, ph, 0);
  g1[2].phase = ph + 8, g1[3].phase = ph + 3;
  std::vector<Written> sats = {{'G', 1, g1, 1, 2}};
  if (tag == 51) {
    // G2: no L2C phase, so L2P code and phase stand in for L2C.
    sats.push_back({'G', 2, {{0, pr + 21, {}}, {3, pr + 24, ph + 24}}, 3, 4});
    // G3: an L2C phase without L2P: kept as it is.
    sats.push_back({'G', 3, {{0, pr + 31, ph + 31}, {2, {}, ph + 33}}, 5, 6});
    sats.push_back({'G', 35, {{0, pr + 351, {}}, {4, pr + 355, ph + 355}}, 7, 8});
    sats.push_back({'R', 7, Slots(4, pr, ph, 70), 9, 10});
    // R8: a zero code counts as present; a code and a phase beyond their windows do not.
    sats.push_back({'R', 8, {{0, 0.0, {}}, {1, kFailsCheck, kPhaseFailsCheck}}, 11, 12});
    sats.push_back({'E', 11, Slots(5, pr, ph, 110), 13, 14});
    sats.push_back({'C', 3, Slots(5, pr, ph, 30), 15, 16});
    sats.push_back({'S', 20, {{0, pr + 201, ph + 201}, {4, pr + 205, {}}}, 17, 18});
  } else {
    sats.push_back({'G', 2, {{0, pr + 21, {}}, {3, pr + 24, ph + 24}}, 3, 4});
    sats.push_back({'G', 35, {{0, pr + 351, ph + 351}}, 7, 8});
    sats.push_back({'R', 7, Slots(4, pr, ph, 70), 9, 10});
    sats.push_back({'R', 8, {{0, 0.0, {}}, {1, kFailsCheck, kPhaseFailsCheck}}, 11, 12});
    sats.push_back({'S', 20, {{0, pr + 201, ph + 201}}, 17, 18});
  }
  return sats;
}

// Epoch times: three in the morning, then (after a second time reference at 23:59:59) one
// before midnight and one whose milliseconds of day put it on the next day.
constexpr uint32_t kEpochMs[5] = {36000000, 36001000, 36002500, 86399500, 200};

std::vector<RawSatellite> RawSatellites(uint8_t tag, uint32_t e) {
  std::vector<RawSatellite> raw;
  for (const Written& w : Satellites(tag, e))
    raw.push_back(Sat(tag, w.system, w.number, w.values, w.b2, w.b3));
  // A satellite that is not valid (tag 51: group 7; tag 8: SBAS 5) is counted and skipped.
  RawSatellite invalid = Sat(tag, 'S', 5, {{0, 2.0e7, {}}});
  if (tag == 51) invalid.code = 7 << 6 | 1;
  raw.insert(raw.begin() + 2, invalid);
  return raw;
}

bool WriteFileCase(const FileCase& f, const std::string& path) {
  RawWriter w(f.order);
  w.Header().TimeRef(f.utc ? "UTC" : "GPS", {0, kDay}, {},
                     f.utc ? std::optional<uint32_t>(17) : std::nullopt);
  for (uint32_t e = 0; e < 5; ++e) {
    if (e == 3)
      w.TimeRef(f.utc ? "UTC" : "GPS", {86399000, kDay}, {},
                f.utc ? std::optional<uint32_t>(17) : std::nullopt);
    w.Epoch(f.tag, kEpochMs[e], RawSatellites(f.tag, e));
  }
  w.EndOfData();
  return w.Save(path);
}

SatId IdOf(char system, unsigned number) {
  const std::map<char, unsigned> systems = {{'G', 0}, {'R', 1}, {'C', 2}, {'E', 3}, {'S', 4}};
  return static_cast<SatId>(systems.at(system) << 8 | number);
}

// The time-scale adjustment of a code value, in seconds.
double Adjustment(const FileCase& f, char system) {
  if (f.tag == 51) {
    if (system == 'R') return f.utc ? 0.0 : kLeap;
    if (system == 'C') return f.utc ? 14.0 - kLeap : 14.0;
    return f.utc ? -kLeap : 0.0;
  }
  if (system == 'G') return f.utc ? -kLeap : 0.0;
  return f.utc ? 0.0 : kLeap;  // GLONASS and SBAS
}

bool Passes(double v, bool phase) {
  if (v == 0.0) return true;
  const double a = std::fabs(v);
  return std::isnormal(v) && a >= std::ldexp(1.0, -50) && a < std::ldexp(1.0, phase ? 44 : 28);
}

struct Expected {
  SatId id;
  uint8_t b2, b3;
  uint32_t mask = 0;
  double values[10];
};

Expected Expect(const FileCase& f, const Written& w) {
  Expected x{IdOf(w.system, w.number), w.b2, w.b3, 0, {}};
  for (double& v : x.values)
    v = -7.0;  // the probe's mark for values not written
  for (const SignalValue& s : w.values) {
    if (s.code && Passes(*s.code, false)) {
      x.values[2 * s.slot] = *s.code / kC + Adjustment(f, w.system);
      x.mask |= 1u << (2 * s.slot);
    }
    if (s.phase && Passes(*s.phase, true)) {
      x.values[2 * s.slot + 1] = *s.phase;
      x.mask |= 1u << (2 * s.slot + 1);
    }
  }
  // Tag-51 GPS satellites 1 to 32 without both L2 phases take L2C from L2P.
  // (Presence bits: L2C code 0x10, L2C phase 0x20, L2P code 0x40, L2P phase 0x80.)
  const bool agreeing = (x.mask & 0x20) != 0 && (x.mask & 0x80) != 0;
  if (f.tag == 51 && w.system == 'G' && w.number <= 32 && !agreeing) {
    if (x.mask & 0x40) x.values[4] = x.values[6], x.mask |= 0x10;
    if (x.mask & 0x80) x.values[5] = x.values[7], x.mask |= 0x20;
  }
  return x;
}

std::vector<double> Values(const std::string& text) {
  std::vector<double> values;
  size_t at = 0;
  while (at <= text.size()) {
    const size_t comma = text.find(',', at);
    values.push_back(std::stod(text.substr(at, comma - at)));
    if (comma == std::string::npos) break;
    at = comma + 1;
  }
  return values;
}

class ProbeEpochJobTest : public ::testing::Test {
 protected:
  void SetUp() override {
    std::string sections;
    for (int i = 0; i < 4; ++i) {
      ASSERT_TRUE(WriteFileCase(kFiles[i], scratch_.File(kFiles[i].name)));
      const std::string n = std::to_string(i + 1);
      sections += "[FILE:" + n + "]\nName=" + kFiles[i].name + "\n[OCCUP:" + n + "]\nFile=" + n +
                  "\nPoint=1\n";
    }
    const ProbeRun run = RunProbeJob(
        scratch_, "Epochs",
        "ProbeEpochs=1\nNumFiles=4\nNumPoints=1\nNumOccups=4\n[POINT:1]\nName=Here\n" + sections);
    ASSERT_EQ(run.exit_code, 0);
    probe_ = run.report;
    for (const std::string& text : temp_.EngineLogTexts())
      log_ += text;
  }

  std::string Joined() const {
    std::string all;
    for (const std::string& l : probe_)
      if (l.rfind("epoch", 0) == 0 || l.rfind("sat ", 0) == 0) all += l + "\n";
    return all + log_;
  }

  ScratchDir scratch_;
  TempDirEnv temp_{scratch_, true};
  std::vector<std::string> probe_;
  std::string log_;
};

TEST_F(ProbeEpochJobTest, EveryEpochAndSatelliteArrivesConverted) {
  // The premise of the expectations: complete signal masks, so no force copies.
  EXPECT_EQ(log_.find("force_copy"), std::string::npos) << log_;
  for (int i = 0; i < 4; ++i) {
    const FileCase& f = kFiles[i];
    SCOPED_TRACE(std::string(f.name) + " tag " + std::to_string(f.tag) + (f.utc ? " UTC" : " GPS"));
    char id[16];
    std::snprintf(id, sizeof id, "%08X", 0x02000001 + i);
    const std::string occ = std::string("occ=") + id;
    ASSERT_EQ(WithPrefix(probe_, "epochs " + occ + " open=1 before_find=0").size(), 1u);
    const auto epochs = WithPrefix(probe_, "epoch " + occ + " ");
    ASSERT_EQ(epochs.size(), 5u) << Joined();
    const auto sats = WithPrefix(probe_, "sat " + occ + " ");
    size_t next = 0;
    for (uint32_t e = 0; e < 5; ++e) {
      SCOPED_TRACE("epoch " + std::to_string(e));
      const uint32_t day = kDay + (e == 4 ? 1 : 0);
      EXPECT_EQ(Field(epochs[e], "t"), std::to_string(day * 86400 + kEpochMs[e] / 1000) + "." +
                                           std::string(kEpochMs[e] % 1000 < 100 ? "0" : "") +
                                           std::string(kEpochMs[e] % 1000 < 10 ? "0" : "") +
                                           std::to_string(kEpochMs[e] % 1000));
      const std::vector<Written> written = Satellites(f.tag, e);
      EXPECT_EQ(Field(epochs[e], "count"), std::to_string(written.size() + 1));
      EXPECT_EQ(Field(epochs[e], "one"), "1");
      // Bit 3 always; bit 0 with the navigation coordinates the probe stored (x = number).
      EXPECT_EQ(Field(epochs[e], "flags"), "00000009");
      EXPECT_EQ(Field(epochs[e], "x"), std::to_string(i + 1) + ".0");
      for (const Written& w : written) {
        ASSERT_LT(next, sats.size());
        const std::string& line = sats[next++];
        SCOPED_TRACE(line);
        const Expected x = Expect(f, w);
        char sat_id[8];
        std::snprintf(sat_id, sizeof sat_id, "%04X", x.id);
        EXPECT_EQ(Field(line, "id"), sat_id);
        EXPECT_EQ(Field(line, "b2"), std::to_string(x.b2));
        EXPECT_EQ(Field(line, "b3"), std::to_string(x.b3));
        EXPECT_EQ(std::stoul(Field(line, "mask"), nullptr, 16), x.mask);
        const std::vector<double> got = Values(Field(line, "v"));
        ASSERT_EQ(got.size(), 10u);
        for (int k = 0; k < 10; ++k)
          EXPECT_EQ(got[k], x.values[k]) << "value " << k;
      }
    }
    EXPECT_EQ(next, sats.size());
    EXPECT_EQ(WithPrefix(probe_, "epochs_done " + occ + " count=5 after=0 close=1").size(), 1u);
  }
}

// A phase that is not a number fails its check like any value outside its window: the satellite
// arrives without it and the epoch goes on.
TEST(ProbeEpochJob, APhaseThatIsNotANumberIsDroppedAndTheEpochGoesOn) {
  ScratchDir scratch;
  TempDirEnv temp(scratch, true);
  RawWriter w(RawOrder::kLittle);
  w.Header().TimeRef("GPS", {0, kDay});
  for (uint32_t e = 0; e < 2; ++e)
    w.Epoch(51, 36000000 + 1000 * e,
            {Sat(51, 'G', 1, {{0, 2.0e7, 1.0e8}}), Sat(51, 'R', 8, {{0, 2.1e7, std::nan("")}}),
             Sat(51, 'G', 2, {{0, 2.2e7, 1.2e8}})});
  w.EndOfData();
  ASSERT_TRUE(w.Save(scratch.File("a.raw")));
  const ProbeRun run =
      RunProbeJob(scratch, "NaN",
                  "ProbeEpochs=1\nNumFiles=1\nNumPoints=1\nNumOccups=1\n[POINT:1]\nName=P\n"
                  "[FILE:1]\nName=a.raw\n[OCCUP:1]\nFile=1\nPoint=1\n");
  ASSERT_EQ(run.exit_code, 0);
  const std::vector<std::string>& probe = run.report;
  const auto sats = WithPrefix(probe, "sat occ=02000001 ");
  ASSERT_EQ(sats.size(), 6u);
  EXPECT_EQ(Field(sats[1], "id"), "0108");
  EXPECT_EQ(Field(sats[1], "mask"), "001");
  EXPECT_EQ(Field(sats[2], "id"), "0002");
  EXPECT_EQ(WithPrefix(probe, "epochs_done occ=02000001 count=2 after=0 close=1").size(), 1u);
}

}  // namespace
}  // namespace vox::test
