#include "raw/scan.h"

#include <gtest/gtest.h>

#include <array>
#include <cstring>

#include "raw/preparation_listing.h"
#include "scan_test_util.h"

namespace vox {
namespace {

using test::ScanRun;
using voxtools::RawOrder;
using voxtools::RawSatellite;
using voxtools::RawSignal;
using voxtools::RawWriter;
using voxtools::SatCode51;
using voxtools::SatCode8;

constexpr uint32_t kDay = 9000;  // a day number in 2004

RawSatellite Sat51(char sys, unsigned n, std::vector<RawSignal> signals) {
  return RawSatellite{SatCode51(sys, n), 0, 0, std::move(signals)};
}
RawSatellite Sat8(char sys, unsigned n, std::vector<RawSignal> signals) {
  return RawSatellite{SatCode8(sys, n), 0, 0, std::move(signals)};
}
TimeMs T(uint32_t ms_of_day, uint32_t day = kDay) {
  return ToTimeMs(RawTime{ms_of_day, day});
}

RawWriter& Start(RawWriter& w) {
  return w.Header().TimeRef("GPS", {0, kDay});
}

// Epochs 1000 ms apart with a single GPS satellite.
void Epochs(RawWriter& w, std::vector<uint32_t> ms) {
  for (uint32_t m : ms)
    w.Epoch(51, m, {Sat51('G', 1, {RawSignal::Tag51(16, 2e7, 1e8)})});
}

// ---- a file with every record kind, for the byte-order twins

void WriteEverything(RawWriter& w) {
  w.Header().Receiver("x", "y", "SN42", "Model", "1.2").TimeRef("GPS", {3600000, kDay}, {}, 13);
  voxtools::RawGpsEphemeris g;
  g.number = 7;
  g.time = {3600000, kDay};
  g.g8 = 0.005;
  g.g20 = 1e-5;
  g.g3_g7[0] = 1.5f;
  w.GpsEphemeris(g);
  g.number = 2;
  w.GpsEphemeris(g, 45);
  voxtools::RawGlonassEphemeris r;
  r.slot = 4;
  r.time = {3600000, kDay};
  r.position[0] = 1000.0;
  w.GlonassEphemeris(r);
  voxtools::RawSbasEphemeris s;
  s.number = 33;
  s.time = {3600000, kDay};
  s.reference_seconds = 3590;
  w.SbasEphemeris(s);
  voxtools::RawGalileoEphemeris e;
  e.number = 12;
  e.time = {3600000, kDay};
  e.e7_e10[2] = 3.25;
  w.GalileoEphemeris(e);
  voxtools::RawBdsEphemeris c;
  c.number = 30;
  c.time = {3600000, kDay};
  c.c25 = 9;
  w.BdsEphemeris(c);
  w.SatPosition({SatCode51('E', 3), {3600000, kDay}, {20000.0, 10000.0, 5000.0}, 12.5}, 56);
  w.SatPosition({SatCode8('R', 3), {3600000, kDay}, {20000.0, 10000.0, 5000.0}, 1.5}, 23);
  w.MeteoSensor(1, 2.0f, "baro", "B1").MeteoPosition(1, {}, 123.5);
  w.MeteoSample({{3600000, kDay}, 1001.0f, 15.0f, {}, {}});
  for (uint32_t i = 0; i < 5; ++i) {
    const uint32_t ms = 3600000 + i * 1000;
    w.Epoch(
        51, ms,
        {Sat51('G', 3, {RawSignal::Tag51(16, 2.1e7, 1.1e8), RawSignal::Tag51(36, 2.1e7, 8.6e7)}),
         Sat51('E', 12, {RawSignal::Tag51(18, 2.3e7, 1.2e8)}),
         Sat51('C', 7, {RawSignal::Tag51(33, 2.3e7, {})}),
         Sat51('S', 33, {RawSignal::Tag51(16, 3.8e7, {})})});
    w.Epoch(8, ms + 500, {Sat8('R', 4, {RawSignal::Tag8(2, 2.0e7, 1.0e8)})});
  }
  w.EndOfData();
}

TEST(ScanByteOrder, BigEndianTwinGivesIdenticalResults) {
  ScanRun runs[2];
  const RawOrder orders[2] = {RawOrder::kLittle, RawOrder::kBig};
  for (int i = 0; i < 2; ++i) {
    RawWriter w(orders[i]);
    WriteEverything(w);
    runs[i].Run(w, {{T(3600000), T(3602000)}});
    ASSERT_EQ(runs[i].status, kScanComplete) << runs[i].log;
  }
  const ScanRun& a = runs[0];
  const ScanRun& b = runs[1];
  EXPECT_EQ(a.log.substr(a.log.find('\n')), b.log.substr(b.log.find('\n')));
  EXPECT_EQ(a.file->receiver_text, "Model #SN42 (1.2)");
  EXPECT_EQ(b.file->receiver_text, a.file->receiver_text);
  EXPECT_EQ(a.file->epoch_count, 10u);
  EXPECT_EQ(b.file->epoch_count, 10u);
  EXPECT_EQ(a.file->epoch_interval_ms, 500u);
  EXPECT_EQ(b.file->epoch_interval_ms, 500u);
  EXPECT_EQ(a.file->max_satellites, 4u);
  EXPECT_TRUE(a.file->first_epoch == b.file->first_epoch);
  EXPECT_TRUE(a.file->last_epoch == b.file->last_epoch);
  EXPECT_EQ(std::memcmp(a.file->signal_masks, b.file->signal_masks, sizeof a.file->signal_masks),
            0);
  EXPECT_EQ(std::memcmp(a.file->force_copy, b.file->force_copy, sizeof a.file->force_copy), 0);
  EXPECT_EQ(a.occupations[0]->epoch_count, 5u);
  EXPECT_EQ(b.occupations[0]->epoch_count, 5u);
  EXPECT_EQ(a.occupations[0]->first_epoch_position, b.occupations[0]->first_epoch_position);
  EXPECT_EQ(a.occupations[0]->time_ref_position, b.occupations[0]->time_ref_position);
  EXPECT_EQ(a.ephemerides.Total(), 6u);
  for (unsigned i = 0; i < kSatIndexCount; ++i) {
    ASSERT_EQ(a.ephemerides.Count(i), b.ephemerides.Count(i)) << i;
    for (auto *p = a.ephemerides.head(i), *q = b.ephemerides.head(i); p; p = p->next, q = q->next)
      EXPECT_EQ(std::memcmp(&p->data, &q->data, sizeof p->data), 0) << i;
    ASSERT_EQ(a.precise.count(i), b.precise.count(i)) << i;
    if (const PreciseSample* p = a.precise.first(i)) {
      const PreciseSample* q = b.precise.first(i);
      EXPECT_EQ(p->x, q->x);
      EXPECT_EQ(p->clock, q->clock);
    }
  }
  EXPECT_EQ(a.precise.count(SatIndexOf(MakeSatId(SatSystem::kGalileo, 3))), 1u);
  EXPECT_DOUBLE_EQ(a.precise.first(SatIndexOf(MakeSatId(SatSystem::kGalileo, 3)))->x, 2e7);
  EXPECT_EQ(a.precise.count(SatIndexOf(MakeSatId(SatSystem::kGlonass, 3))), 1u);
  ASSERT_NE(a.meteo.head(), nullptr);
  ASSERT_NE(b.meteo.head(), nullptr);
  EXPECT_EQ(a.meteo.head()->sample_count, 1u);
  EXPECT_EQ(std::memcmp(&a.meteo.head()->first->data, &b.meteo.head()->first->data,
                        sizeof(vox_MeteoData)),
            0);
  EXPECT_FLOAT_EQ(a.meteo.head()->first->data.height, 123.5f);
  EXPECT_EQ(a.meteo.head()->first->data.humidity, 50.0f);
  EXPECT_EQ(a.details.satellites_seen.count(), 5u);

  std::string listings[2];
  for (int i = 0; i < 2; ++i) {
    ItemList<TOccupItem> occupations(false);
    occupations.Append(runs[i].occupations[0].get());
    ItemList<TVectorItem> vectors;
    WritePreparationListing(runs[i].ephemerides, runs[i].precise, occupations, vectors,
                            {&ScanRun::Collect, &listings[i]});
  }
  EXPECT_EQ(listings[0], listings[1]);
  EXPECT_NE(listings[0].find("007 - G07 - "), std::string::npos) << listings[0];
}

// ---- walk statuses

TEST(ScanStatus, MissingFileAndForeignFile) {
  ScanRun missing;
  missing.Run("/nonexistent/vox/file.bin");
  EXPECT_EQ(missing.status, kScanCannotOpen);
  EXPECT_EQ(missing.log, "Can not open file: /nonexistent/vox/file.bin\n");

  ScanRun foreign;
  foreign.Run(test::TempRawFile(std::vector<uint8_t>(64, 'z')).path());
  EXPECT_EQ(foreign.status, kScanNotUsable);
  EXPECT_EQ(foreign.log, "");
}

TEST(ScanStatus, EarlyEndKeepsEpochsButDecidesNothing) {
  RawWriter w;
  Start(w);
  Epochs(w, {1000, 2000, 3000});
  w.EndOfData(/*cut=*/true);
  ScanRun run;
  run.Run(w);
  EXPECT_EQ(run.status, kScanEndedEarly);
  // The last epoch cannot be read whole: its read includes the next record's length.
  EXPECT_EQ(run.file->epoch_count, 2u);
  EXPECT_EQ(run.file->epoch_interval_ms, 0u);
  EXPECT_NE(run.file->signal_masks[0], 0u);
  EXPECT_EQ(run.log.substr(run.log.find('\n') + 1), " - Unexpected EOF\n");
}

TEST(ScanStatus, HeaderThenEndRecord) {
  RawWriter w;
  w.Header().EndOfData();
  ScanRun run;
  run.Run(w);
  EXPECT_EQ(run.status, kScanComplete);
  EXPECT_EQ(run.file->epoch_count, 0u);
  EXPECT_NE(
      run.log.find(" - Reached EOF\nGPS C2 disabled\nGPS:\nGLONASS:\nBDS:\nGALILEO:\nSBAS:\n"),
      std::string::npos)
      << run.log;
}

TEST(ScanStatus, BadLengthEndsTheWalkAsUnusable) {
  RawWriter w;
  Start(w);
  Epochs(w, {1000});
  w.Begin(2).Str("abc").End(3);
  w.EndOfData();
  ScanRun run;
  run.Run(w);
  EXPECT_EQ(run.status, kScanNotUsable);
  EXPECT_EQ(run.file->epoch_count, 1u);
}

// ---- epochs, intervals and occupations

// The file's interval: the most frequent spacing, out-of-range spacings ignored, the one seen
// first on equal counts, none for a single epoch.
TEST(ScanEpochs, IntervalIsTheMostFrequentSpacingInRange) {
  const std::pair<std::vector<uint32_t>, uint32_t> cases[] = {
      // Spacings: 1000 x3, 5000, 1, 1, 1 (ignored), 3600000 (ignored).
      {{1000, 2000, 3000, 8000, 9000, 9001, 9002, 9003, 3609003}, 1000},
      {{1000, 3000, 5000, 6000, 7000}, 2000},  // 2000, 2000, 1000, 1000
      {{1000}, 0},
  };
  for (const auto& [epochs, interval] : cases) {
    RawWriter w;
    Start(w);
    Epochs(w, epochs);
    w.EndOfData();
    ScanRun run;
    run.Run(w);
    EXPECT_EQ(run.file->epoch_interval_ms, interval) << epochs.size() << " epochs";
  }
}

TEST(ScanEpochs, EpochBeforeTheReferenceTimeOfDayIsOnTheNextDay) {
  RawWriter w;
  w.Header().TimeRef("GPS", {86399000, kDay});
  Epochs(w, {86399500, 500});
  w.EndOfData();
  ScanRun run;
  run.Run(w);
  EXPECT_TRUE(run.file->first_epoch == T(86399500));
  EXPECT_TRUE(run.file->last_epoch == T(500, kDay + 1));
}

TEST(ScanEpochs, OccupationWindowsAreInclusiveAndRememberPositions) {
  RawWriter w;
  w.Header();
  const size_t ref_at = w.offset();
  w.TimeRef("GPS", {0, kDay});
  Epochs(w, {1000});
  const size_t second_at = w.offset();
  Epochs(w, {2000, 3000, 4000});
  w.EndOfData();
  ScanRun run;
  run.Run(w, {{T(1500), T(3000)}, {T(5000), T(6000)}});
  const TOccupItem& o = *run.occupations[0];
  EXPECT_EQ(o.epoch_count, 2u);
  EXPECT_TRUE(o.first_epoch == T(2000));
  EXPECT_TRUE(o.last_epoch == T(3000));
  EXPECT_EQ(o.first_epoch_position, second_at - 2);
  EXPECT_EQ(o.time_ref_position, ref_at - 2);
  EXPECT_EQ(run.occupations[1]->epoch_count, 0u);
  EXPECT_EQ(run.file->epoch_count, 4u);
}

// ---- signal masks

TEST(ScanSignals, Tag8KindsFillTheScanTableSlots) {
  RawWriter w;
  Start(w);
  w.Epoch(8, 1000,
          {Sat8('G', 1,
                {RawSignal::Tag8(2, 2e7, 1e8), RawSignal::Tag8(0, 2e7, {}),
                 RawSignal::Tag8(1, {}, 1e8)})});
  w.EndOfData();
  ScanRun run;
  run.Run(w);
  // The report shows the file's own mask: kind 2 L1C, kind 0 L1P, kind 1 L2C.
  EXPECT_NE(run.log.find("GPS: CodeL1C CodeL1P PhaseL1C PhaseL2C\n"), std::string::npos) << run.log;
}

TEST(ScanSignals, UnusableFlagsAndUnknownCodesLeaveNoBits) {
  RawWriter w;
  Start(w);
  RawSignal bad_code = RawSignal::Tag51(16, 2e7, 1e8);
  bad_code.flags |= 1u << 13;
  RawSignal bad_phase = RawSignal::Tag51(33, 2e7, 1e8);
  bad_phase.flags |= 1u << 12;
  w.Epoch(
      51, 1000,
      {Sat51('R', 1, {bad_code, bad_phase}), Sat51('E', 1, {RawSignal::Tag51(20, 2e7, 1e8)}),
       RawSatellite{static_cast<uint16_t>((9 << 6) | 1), 0, 0, {RawSignal::Tag51(16, 2e7, 1e8)}},
       Sat51('S', 20, {RawSignal::Tag51(16, 4e7, {})})});
  w.EndOfData();
  ScanRun run;
  run.Run(w);
  EXPECT_NE(run.log.find("GLONASS: CodeL2C PhaseL1C\n"), std::string::npos) << run.log;
  EXPECT_EQ(run.file->signal_masks[3], 0u);
  EXPECT_EQ(run.file->signal_masks[4], CodeBit(kL1C));
}

// ---- force copy

TEST(ScanForceCopy, EachRuleFiresOnItsCondition) {
  // Masks are made by signals: GPS code L1C + L2P fires rule 2.
  RawWriter w;
  Start(w);
  w.Epoch(51, 1000,
          {Sat51('G', 1, {RawSignal::Tag51(16, 2e7, {}), RawSignal::Tag51(36, 2e7, {})}),
           Sat51('R', 1, {RawSignal::Tag51(16, {}, 1e8), RawSignal::Tag51(33, {}, 1e8)}),
           Sat51('E', 1, {RawSignal::Tag51(81, 2e7, 1e8), RawSignal::Tag51(113, 2e7, {})}),
           Sat51('C', 1, {RawSignal::Tag51(34, 2e7, 1e8), RawSignal::Tag51(113, 2e7, 1e8)})});
  w.EndOfData();
  ScanRun run;
  run.Run(w);
  const TChainItem& f = *run.file;
  // GPS: CodeL1C CodeL2P -> rule 2 (CA to L1 code).
  EXPECT_EQ(f.signal_masks[0], CodeBit(kL1C) | CodeBit(kL2P) | CodeBit(kL1P));
  EXPECT_EQ(f.force_copy[2][0], 1);
  EXPECT_NE(run.log.find("GPS: CodeL1C CodeL2P\nGPS: force_copy_CA_to_L1_code\n"),
            std::string::npos);
  // GLONASS: PhaseL1C PhaseL2C -> rule 4 (CA to L1 phase), then rule 5 (L2C to L2P phase).
  EXPECT_EQ(f.force_copy[3][1], 1);
  EXPECT_EQ(f.force_copy[5][1], 1);
  EXPECT_NE(run.log.find("GLONASS: force_copy_CA_to_L1_phase\nGLONASS: "
                         "force_copy_L2C_to_L2P_phase\n"),
            std::string::npos);
  // GALILEO: CodeL1P PhaseL1P CodeL2C -> rule 1 (L1 to CA code), rule 6 (L2C to L2P code);
  // no L2 phase, so no phase rule.
  EXPECT_EQ(f.force_copy[0][3], 1);
  EXPECT_EQ(f.force_copy[4][3], 1);
  EXPECT_EQ(f.force_copy[1][3], 0);
  // BDS: L1P and L2C only, but never a rule.
  for (int g = 0; g < 6; ++g)
    EXPECT_EQ(f.force_copy[g][2], 0) << g;
  EXPECT_EQ(run.log.find("BDS: force"), std::string::npos);
}

TEST(ScanForceCopy, L1ToCaPhaseRule) {
  RawWriter w;
  Start(w);
  w.Epoch(51, 1000,
          {Sat51('G', 2, {RawSignal::Tag51(20, {}, 1e8), RawSignal::Tag51(36, {}, 1e8)})});
  w.EndOfData();
  ScanRun run;
  run.Run(w);
  EXPECT_EQ(run.file->force_copy[1][0], 1);
  EXPECT_NE(run.log.find("GPS: force_copy_L1_to_CA_phase\n"), std::string::npos);
}

// ---- C2-L2

// Adds epochs with L2C - L2P phases whose fractional parts fall in the given bins.
void C2Epochs(RawWriter& w, unsigned sat, int bin, int count, uint32_t& ms) {
  for (int i = 0; i < count; ++i) {
    const double l2p = 1000.0;
    const double l2c = l2p + bin / 12.0;  // + 1/24 puts it in the middle of the bin
    w.Epoch(51, ms,
            {Sat51('G', sat, {RawSignal::Tag51(32, {}, l2c), RawSignal::Tag51(36, {}, l2p)})});
    ms += 1000;
  }
}

// Scans a file of C2Epochs runs: (satellite, bin, count) each.
void ScanC2Runs(ScanRun& run, std::initializer_list<std::array<int, 3>> runs) {
  RawWriter w;
  Start(w);
  uint32_t ms = 1000;
  for (const auto& [sat, bin, count] : runs)
    C2Epochs(w, static_cast<unsigned>(sat), bin, count, ms);
  w.EndOfData();
  run.Run(w);
}

TEST(ScanC2, TenAgainstSevenDisablesTenAgainstSixDecides) {
  {
    ScanRun run;
    ScanC2Runs(run, {{4, 3, 10}, {5, 7, 7}});
    EXPECT_NE(run.log.find("GPS C2 disabled\n"), std::string::npos);
    EXPECT_EQ(run.file->c2_usable_mask, 0u);
  }
  {
    ScanRun run;
    ScanC2Runs(run, {{4, 3, 10}, {5, 7, 6}});
    EXPECT_DOUBLE_EQ(run.file->c2_l2_offset, 3 / 12.0);
    EXPECT_NE(run.log.find("GPS C2-L2: "), std::string::npos) << run.log;
    EXPECT_NE(run.log.find("G04 C2-L2: "), std::string::npos);
    EXPECT_NE(run.log.find("G05 C2-L2: "), std::string::npos);
    EXPECT_EQ(run.file->c2_agreeing_mask, 1u << 3);
    EXPECT_EQ(run.file->c2_usable_mask, 1u << 3);
  }
}

TEST(ScanC2, MeanAndOffsetAreLogged) {
  ScanRun run;
  ScanC2Runs(run, {{1, 0, 4}});
  EXPECT_NE(run.log.find("GPS C2-L2: 0.041667 0.000000\nG01 C2-L2: 0.041667 0.000000\n"),
            std::string::npos)
      << run.log;
}

TEST(ScanRecords, RecordsFailingTheirChecksAreDroppedSilently) {
  RawWriter w(RawOrder::kBig);
  Start(w);
  voxtools::RawGpsEphemeris g;
  g.number = 9;
  g.time = {0, kDay};
  g.g8 = 300.0;  // at least 2^8
  w.GpsEphemeris(g);
  g.g8 = 0.0;
  g.g20 = 1e-11;  // below 2^-33
  w.GpsEphemeris(g);
  voxtools::RawGlonassEphemeris r;
  r.slot = 2;
  r.position[1] = 300000.0;  // at least 2^18 km
  w.GlonassEphemeris(r);
  voxtools::RawSbasEphemeris s;
  s.number = 41;  // out of range
  w.SbasEphemeris(s);
  w.SatPosition({SatCode51('G', 9), {0, kDay}, {3.0e5, 0, 0}, 0}, 56);  // X at least 2^28
  w.SatPosition({static_cast<uint16_t>(7 << 6 | 1), {0, kDay}, {2e4, 0, 0}, 0}, 56);
  w.SatPosition({SatCode8('G', 9), {0, kDay}, {2e4, 1e4, 0}, 0}, 23);  // kept
  w.MeteoSample({{1000, kDay}, {}, 10.0f, {}, {}});
  w.EndOfData();
  ScanRun run;
  run.Run(w);
  EXPECT_EQ(run.status, kScanComplete);
  EXPECT_EQ(run.ephemerides.Total(), 0u);
  EXPECT_EQ(run.details.ephemerides_dropped, 4u);
  EXPECT_EQ(run.details.positions_stored, 1u);
  EXPECT_EQ(run.details.positions_dropped, 2u);
  ASSERT_NE(run.meteo.head(), nullptr);
  const vox_MeteoData& m = run.meteo.head()->first->data;
  uint32_t bits;
  std::memcpy(&bits, &m.pressure, 4);
  EXPECT_EQ(bits, 0x447D4FBEu);  // the default pressure
  EXPECT_EQ(m.temperature, 10.0f);
  EXPECT_EQ(m.humidity, 50.0f);
  EXPECT_EQ(run.meteo.head()->file_id, run.file->id);
}

}  // namespace
}  // namespace vox
