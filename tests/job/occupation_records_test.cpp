#include "job/occupation_records.h"

#include <gtest/gtest.h>

#include <cstring>

#include "stream_job.h"

namespace vox {
namespace {

class OccupationRecordsTest : public ::testing::Test {
 protected:
  void SetUp() override { testing::BuildStreamJob(job); }
  TOccupItem& Occupation(uint32_t n) { return *job.FindOccup(n); }

  JobModel job;
};

unsigned PlainState(const vox_OccupationData& r, int system, unsigned n) {
  uint16_t word;
  std::memcpy(&word, reinterpret_cast<const uint8_t*>(&r) + 474 + system * 10 + (n / 8) * 2, 2);
  return (word >> (2 * (n % 8))) & 3;
}

unsigned ExState(const vox_OccupationDataEx& r, int system, unsigned n) {
  uint32_t word;
  std::memcpy(&word, reinterpret_cast<const uint8_t*>(&r) + 1512 + system * 16 + (n / 16) * 4, 4);
  return (word >> (2 * (n % 16))) & 3;
}

TEST_F(OccupationRecordsTest, StreamYieldsEveryOccupationOnceThenStaysAtTheEnd) {
  OccupationCursor cursor(job.occupations.head());
  EXPECT_EQ(cursor.Next()->id, 0x02000001u);
  EXPECT_EQ(cursor.Next()->id, 0x02000002u);
  EXPECT_EQ(cursor.Next()->id, 0x02000003u);
  EXPECT_EQ(cursor.Next(), nullptr);
  EXPECT_EQ(cursor.Next(), nullptr);

  OccupationCursor empty(nullptr);
  EXPECT_EQ(empty.Next(), nullptr);
}

TEST_F(OccupationRecordsTest, RequestMaskZeroStillGivesIdentifiersTimesAndCounts) {
  Occupation(1).SetReceiver(job.FindReceiver(1));
  Occupation(1).epoch_gap = 5;
  vox_OccupationData r;
  std::memset(&r, 0xAB, sizeof(r));
  r.mask = 0;
  ASSERT_TRUE(FillOccupationData(job, Occupation(1), r));
  EXPECT_EQ(r.mask, VOX_OCC_EPOCHS);
  EXPECT_EQ(r.occupation_id, 0x02000001u);
  EXPECT_EQ(r.id, 0x02000001u);
  EXPECT_EQ(r.receiver_id, 0x80000001u);
  EXPECT_EQ(r.point_id, 0x01000001u);
  EXPECT_EQ(r.file_id, 0x04000001u);
  EXPECT_EQ(r.file_id2, 0x04000001u);
  EXPECT_EQ(r.first_epoch.seconds, 1001u);
  EXPECT_EQ(r.last_epoch.ms, 500u);
  EXPECT_EQ(r.epoch_interval_ms, 5000u);
  EXPECT_EQ(r.epoch_interval_ms2, 5000u);
  EXPECT_EQ(r.file_interval_ms, 1000u);
  EXPECT_EQ(r.epoch_count, 10u);
  EXPECT_EQ(r.max_satellites, 12u);
  // Everything not requested is cleared, the name included.
  EXPECT_EQ(r.name[0], 0);
  EXPECT_EQ(r.antenna.id, 0u);
  EXPECT_EQ(r.meteo_present, 0u);
}

TEST_F(OccupationRecordsTest, OccupationWithoutFileGivesOnlyIdentifiers) {
  auto* o = job.occupations.Append(new TOccupItem(9));
  o->SetPoint(job.FindPoint(3));
  vox_OccupationDataEx r{};
  r.mask = 0xFFFF;
  EXPECT_FALSE(FillOccupationDataEx(job, *o, r));
  EXPECT_EQ(r.mask, 0u);
  EXPECT_EQ(r.occupation_id, 0x02000009u);
  EXPECT_EQ(r.point_id, 0x01000003u);
  EXPECT_EQ(r.file_id, 0u);
}

TEST_F(OccupationRecordsTest, DefaultHumidityMeansNoMeteorologicalValues) {
  vox_OccupationData r{};
  r.mask = VOX_OCC_METEO;
  ASSERT_TRUE(FillOccupationData(job, Occupation(1), r));
  EXPECT_EQ(r.mask, VOX_OCC_EPOCHS);
  EXPECT_EQ(r.meteo_present, 0u);

  TOccupItem& o = Occupation(2);
  o.humidity = 0;  // zero humidity is a value
  o.temperature = 21.5f;
  o.pressure = 1013.0f;
  o.meteo_height = 1.5f;
  vox_OccupationDataEx ex{};
  ex.mask = VOX_OCC_METEO;
  ASSERT_TRUE(FillOccupationDataEx(job, o, ex));
  EXPECT_EQ(ex.mask, VOX_OCC_EPOCHS | VOX_OCC_METEO | VOX_OCC_METEO_FILLED);
  EXPECT_EQ(ex.meteo_present, 1u);
  EXPECT_EQ(ex.temperature, 21.5f);
  EXPECT_EQ(ex.pressure, 1013.0f);
  EXPECT_EQ(ex.meteo_height, 1.5f);
}

TEST_F(OccupationRecordsTest, FilledBitsFollowTheRequest) {
  TOccupItem& o = Occupation(1);
  o.SetAntenna(job.FindAntenna(1));
  o.l1_up = 1.25;
  o.l1_east = -0.5;
  o.l1_north = 0.75;
  vox_OccupationData r{};
  r.mask = VOX_OCC_ANTENNA | VOX_OCC_L1_OFFSETS | VOX_OCC_NAME | VOX_OCC_SIGNALS;
  ASSERT_TRUE(FillOccupationData(job, o, r));
  EXPECT_EQ(r.mask, VOX_OCC_EPOCHS | VOX_OCC_ANTENNA_ALT | VOX_OCC_L1_OFFSETS | VOX_OCC_NAME |
                        VOX_OCC_SIGNALS | VOX_OCC_SIGNALS_FILLED);
  EXPECT_EQ(r.antenna.id, 0x80000001u);
  float l1[3];
  std::memcpy(l1, reinterpret_cast<const uint8_t*>(&r) + 404, sizeof(l1));
  EXPECT_EQ(l1[0], 1.25f);
  EXPECT_EQ(l1[1], -0.5f);
  EXPECT_EQ(l1[2], 0.75f);
  EXPECT_STREQ(r.name, "O1");
}

TEST_F(OccupationRecordsTest, OmittedSatellitesAreExcludedInTheTablesThatHoldThem) {
  job.omit_list[0] = MakeSatId(SatSystem::kGlonass, 7);
  job.omit_list[1] = MakeSatId(SatSystem::kGalileo, 11);
  job.omit_count = 2;
  vox_OccupationData plain{};
  plain.mask = VOX_OCC_SAT_STATES;
  ASSERT_TRUE(FillOccupationData(job, Occupation(1), plain));
  EXPECT_EQ(plain.mask & VOX_OCC_SAT_STATES, VOX_OCC_SAT_STATES);
  EXPECT_EQ(PlainState(plain, 1, 7), VOX_SAT_EXCLUDED);
  EXPECT_EQ(PlainState(plain, 1, 6), VOX_SAT_USABLE);
  EXPECT_EQ(PlainState(plain, 1, 25), VOX_SAT_NONE);
  EXPECT_EQ(PlainState(plain, 0, 0), VOX_SAT_NONE);
  EXPECT_EQ(PlainState(plain, 0, 37), VOX_SAT_USABLE);
  EXPECT_EQ(PlainState(plain, 0, 38), VOX_SAT_NONE);

  vox_OccupationDataEx ex{};
  ex.mask = VOX_OCC_SAT_STATES;
  ASSERT_TRUE(FillOccupationDataEx(job, Occupation(1), ex));
  EXPECT_EQ(ExState(ex, 1, 7), VOX_SAT_EXCLUDED);
  EXPECT_EQ(ExState(ex, 3, 11), VOX_SAT_EXCLUDED);
  EXPECT_EQ(ExState(ex, 3, 30), VOX_SAT_USABLE);
  EXPECT_EQ(ExState(ex, 3, 31), VOX_SAT_NONE);
  EXPECT_EQ(ExState(ex, 4, 19), VOX_SAT_NONE);
  EXPECT_EQ(ExState(ex, 4, 20), VOX_SAT_USABLE);
  EXPECT_EQ(ExState(ex, 4, 40), VOX_SAT_USABLE);
  EXPECT_EQ(ExState(ex, 2, 37), VOX_SAT_USABLE);
}

TEST(SignalMasks, AreInvertedSoThatSetBitsMarkAbsentSignals) {
  // All ten signals present.
  EXPECT_EQ(AbsentSignalsPlain(0x3FF), 0xC0);
  EXPECT_EQ(AbsentSignalsExtended(0x3FF), 0u);
  // Code and phase of L1C only (file bits 0 and 5).
  EXPECT_EQ(AbsentSignalsPlain(0x21), static_cast<uint8_t>(~0x09u));
  EXPECT_EQ(AbsentSignalsExtended(0x21), 0x3FCu);
  // Phase of L5X only (file bit 9): no plain bit for it.
  EXPECT_EQ(AbsentSignalsPlain(0x200), 0xFF);
  EXPECT_EQ(AbsentSignalsExtended(0x200), 0x3FFu ^ 0x200u);
  EXPECT_EQ(AbsentSignalsExtended(0), 0x3FFu);
}

TEST_F(OccupationRecordsTest, PatternOnlyInSlotFourReachesOnlyTheExtendedRecord) {
  const TAntennItem& antenna = *job.FindAntenna(2);
  vox_AntennaData plain;
  std::memset(&plain, 0x5A, sizeof(plain));
  FillAntennaData(antenna, plain);
  const vox_AntennaData zero{};
  EXPECT_EQ(std::memcmp(reinterpret_cast<const uint8_t*>(&plain) + 40,
                        reinterpret_cast<const uint8_t*>(&zero) + 40, 304),
            0);

  vox_AntennaDataEx ex;
  FillAntennaDataEx(antenna, ex);
  EXPECT_EQ(ex.pattern_mask, 0x10u);
  EXPECT_EQ(ex.slot_count, 5u);
  float first;
  std::memcpy(&first, reinterpret_cast<const uint8_t*>(&ex) + 48 + 4 * 76, 4);
  EXPECT_EQ(first, 44.0f);
}

TEST_F(OccupationRecordsTest, AntennaRecordCarriesOffsetsUpEastNorthAndAcceptedPatterns) {
  vox_AntennaData r;
  FillAntennaData(*job.FindAntenna(1), r);
  EXPECT_EQ(r.id, 0x80000001u);
  float l2[3];
  std::memcpy(l2, reinterpret_cast<const uint8_t*>(&r) + 28, sizeof(l2));
  EXPECT_EQ(l2[0], 0.1f);
  EXPECT_EQ(l2[1], 0.2f);
  EXPECT_EQ(l2[2], 0.3f);
  float last_of_l2;
  std::memcpy(&last_of_l2, reinterpret_cast<const uint8_t*>(&r) + 40 + 76 + 18 * 4, 4);
  EXPECT_EQ(last_of_l2, 118.0f);

  vox_AntennaDataEx none;
  FillAntennaDataEx(TAntennItem(7), none);
  EXPECT_EQ(none.pattern_mask, 0u);
  EXPECT_EQ(none.slot_count, 0u);
}

TEST_F(OccupationRecordsTest, LinkedOccupationsOfVectorsAndFans) {
  auto* vector = job.vectors.Append(new TVectorItem(3, job.FindPoint(1), job.FindPoint(2)));
  vector->occupations.Append(new TROccupItem(&Occupation(3)));
  job.fans.Append(new TFanItem(1, job.FindPoint(1), job.FindFile(2)));

  EXPECT_EQ(LinkedOccupations(job, 3, 1)->occupation, &Occupation(3));
  EXPECT_EQ(LinkedOccupations(job, 0x08000003, 7)->occupation, &Occupation(3));
  EXPECT_EQ(LinkedOccupations(job, 3, 0), nullptr);  // no fan 3
  EXPECT_EQ(LinkedOccupations(job, 1, 0), nullptr);  // fan 1 has none

  vox_ROccupData r;
  std::memset(&r, 0xCD, sizeof(r));
  FillLinkedOccupation(Occupation(3), r);
  EXPECT_EQ(r.occupation_id3, 0x02000003u);
  EXPECT_EQ(r.point_id, 0x01000002u);
  EXPECT_EQ(r.file_id2, 0x04000001u);
  EXPECT_EQ(r.reserved, 0u);

  TOccupItem fileless(8);
  FillLinkedOccupation(fileless, r);
  EXPECT_EQ(r.file_id, 0u);
  EXPECT_EQ(r.file_id2, 0u);
}

}  // namespace
}  // namespace vox
