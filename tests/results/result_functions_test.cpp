#include "results/result_functions.h"

#include <cstring>
#include <string>

#include <gtest/gtest.h>

#include "base/ellipsoid.h"
#include "base/gps_time.h"
#include "job/leap_seconds.h"
#include "result_test_util.h"

namespace vox {
namespace {

using test::At;

TEST(VectorResultFlags, MappingOfSolutionFlags) {
  EXPECT_EQ(VectorResultFlags(true, false, 0x200), kResultSolved | 0x300);
  EXPECT_EQ(VectorResultFlags(true, false, 0x300), kResultSolved | 0x200);
  EXPECT_EQ(VectorResultFlags(true, false, 0x100), kResultSolved | 0x100);
  EXPECT_EQ(VectorResultFlags(true, true, 0x3 | 0xC | 0x60 | 0x400), kResultSolved | 0x800 | 0x46F);
  EXPECT_EQ(VectorResultFlags(true, false, 0x70), kResultSolved);  // not a known kind
  EXPECT_EQ(VectorResultFlags(false, false, (1u << 29) | (1u << 17) | (1u << 18)),
            0x20000000u | 0x01000000 | 0x40000);
  EXPECT_EQ(VectorResultFlags(false, false, 1u << 24), 0x01000000u);
  EXPECT_EQ(VectorResultFlags(false, false, 0x1000), 0u);
}

class ResultFunctionsTest : public testing::Test {
 protected:
  void SetUp() override {
    path_ = test::TempPath("out.res");
    writer_.set_path(path_);
    ASSERT_TRUE(writer_.Open());
    p1_ = points_.Append(new TPointItem(1));
    p2_ = points_.Append(new TPointItem(2));
    vector_ = vectors_.Append(new TVectorItem(3, p1_, p2_));
    fan_ = fans_.Append(new TFanItem(4, p1_, nullptr));
  }
  void TearDown() override { ResetLeapTableForTesting(); }
  std::vector<test::RawRecord> CloseAndRead() {
    EXPECT_TRUE(writer_.Close());
    return test::SplitRecords(test::ReadBytes(path_));
  }
  static vox_VectorResult Solution(double dx, float baseline_rms = 0.01f) {
    vox_VectorResult r{};
    r.solved = 1;
    r.base[0] = 4000000;
    r.base[1] = 100;
    r.base[2] = 5000000;
    r.base_rms = 0.3f;
    r.baseline[0] = dx;
    r.baseline_rms = baseline_rms;
    r.stored_a[0] = 0xA1;
    r.stored_b = 84.0f;
    r.stored_d[3] = 0xD4;
    r.stored_f = 112.0f;
    r.extra = 120.0f;
    return r;
  }
  int Copy(uint32_t kind, const vox_CopyDataRec& rec, uint32_t size) {
    return CopyData(writer_, kind, &rec, size, vectors_, fans_, &done_units_);
  }

  std::string path_;
  TResultFile writer_;
  ItemList<TPointItem> points_;
  ItemList<TVectorItem> vectors_;
  ItemList<TFanItem> fans_;
  TPointItem* p1_;
  TPointItem* p2_;
  TVectorItem* vector_;
  TFanItem* fan_;
  TLock lock_{"solution"};
  uint32_t done_units_ = 0;
};

TEST_F(ResultFunctionsTest, ConflictingSecondSolutionReturns2AndIsStillWritten) {
  vox_VectorResult first = Solution(1000.0);
  EXPECT_EQ(SetVectorResult(writer_, vector_, 3, &first, lock_), kVectorStored);
  EXPECT_TRUE(p1_->solved_set);
  EXPECT_EQ(p1_->solved_rms, 0.0f);
  ASSERT_TRUE(p2_->solved_set);
  EXPECT_DOUBLE_EQ(p2_->solved_x, 4001000.0);
  // Within 1 m + 10 ppm of 1000 m (1.01 m): agrees. A worse rms keeps the stored position.
  vox_VectorResult near = Solution(1001.005);
  near.baseline_rms = 0.5f;
  EXPECT_EQ(SetVectorResult(writer_, vector_, 3, &near, lock_), kVectorStored);
  EXPECT_DOUBLE_EQ(p2_->solved_x, 4001000.0);
  // 1.02 m away: conflict; its better rms replaces the stored position all the same.
  vox_VectorResult far = Solution(1001.02, 0.001f);
  far.base_rms = 0.0f;
  EXPECT_EQ(SetVectorResult(writer_, vector_, 0x08000003, &far, lock_), kVectorConflict);
  EXPECT_DOUBLE_EQ(p2_->solved_x, 4001001.02);
  EXPECT_EQ(SetVectorResult(writer_, nullptr, 9, &far, lock_), kVectorUnknown);

  const auto records = CloseAndRead();
  ASSERT_EQ(records.size(), 5u);
  const auto& r = records[3].payload;
  EXPECT_EQ(records[3].kind, kKindVector);
  ASSERT_EQ(r.size(), 104u);
  EXPECT_EQ(At<uint32_t>(r, 0), 3u);
  EXPECT_EQ(At<uint32_t>(r, 4), kResultSolved);
  EXPECT_EQ(At<double>(r, 8), 4000000.0);
  EXPECT_EQ(At<uint32_t>(r, 44), 0xD4u);
  EXPECT_EQ(At<float>(r, 52), 112.0f);
  EXPECT_EQ(At<double>(r, 56), 1001.02);
  EXPECT_EQ(At<uint32_t>(r, 80), 0xA1u);
  EXPECT_EQ(At<float>(r, 96), 84.0f);
}

TEST_F(ResultFunctionsTest, RmsOverTheLimitAndReversedVectors) {
  vox_VectorResult r = Solution(1000.0, 2.0f);
  r.reversed = 1;
  EXPECT_EQ(SetVectorResult(writer_, vector_, 3, &r, lock_), kVectorStored);
  EXPECT_TRUE(p1_->solved_set);  // the to-point of a reversed vector
  const auto records = CloseAndRead();
  ASSERT_EQ(records.size(), 3u);
  EXPECT_EQ(At<uint32_t>(records[1].payload, 4), kResultSolved | kResultRmsOverLimit | 0x800);
}

TEST_F(ResultFunctionsTest, VectorSpanGivesKind40) {
  vox_CopyDataRec rec{};
  rec.vector_span.vector_id = 3;
  rec.vector_span.start = TimeMs{86400 + 1, 5};
  rec.vector_span.end = TimeMs{86400 + 2, 0};
  rec.vector_span.value1 = 11;
  rec.vector_span.value2 = 22;
  rec.vector_span.value = 0.5f;
  std::memcpy(rec.vector_span.name, "ABCDEFGHIJKLMNO", 16);

  // One byte short: refused, nothing changes.
  EXPECT_EQ(Copy(6, rec, 167), 0);
  EXPECT_LT(vector_->span.value, 0.0f);
  EXPECT_EQ(Copy(6, rec, 168), 1);
  EXPECT_EQ(vector_->span.name, "ABCDEFGHIJKLMNO");
  rec.vector_span.vector_id = 99;
  EXPECT_EQ(Copy(6, rec, 168), 0);

  vox_VectorResult r = Solution(10.0);
  r.reversed = 1;
  r.solution_flags = 0x1000;
  EXPECT_EQ(SetVectorResult(writer_, vector_, 3, &r, lock_), kVectorStored);
  const auto records = CloseAndRead();
  ASSERT_EQ(records.size(), 3u);
  EXPECT_EQ(records[1].kind, kKindVectorSpan);
  const auto& p = records[1].payload;
  ASSERT_EQ(p.size(), 140u + 1 + 15 + 8);
  EXPECT_EQ(At<uint32_t>(p, 4), kResultSolved | 0x800 | 0x1000);
  EXPECT_EQ(At<uint32_t>(p, 104), 2u);  // from-point of a reversed vector
  EXPECT_EQ(At<uint32_t>(p, 108), 1u);
  EXPECT_EQ(At<uint32_t>(p, 112), 1005u);
  EXPECT_EQ(At<uint32_t>(p, 116), 1u);
  EXPECT_EQ(At<uint32_t>(p, 128), 11u);
  EXPECT_EQ(At<float>(p, 136), 0.5f);
  EXPECT_EQ(p[140], 15);
  EXPECT_EQ(At<uint32_t>(p, 156), 1u);
  EXPECT_EQ(At<float>(p, 160), 120.0f);
}

TEST_F(ResultFunctionsTest, FanResultsWithAndWithoutSpan) {
  vox_FanResult fr{};
  fr.position[0] = 7.0;
  EXPECT_EQ(SetFanResult(writer_, fan_, 4, &fr), 1);
  EXPECT_EQ(fan_->position[0], 7.0);  // stored even without has_position
  EXPECT_EQ(SetFanResult(writer_, nullptr, 4, &fr), 0);
  vox_CopyDataRec rec{};
  rec.fan_span.fan_id = 0x10000004;
  rec.fan_span.value = 1.0f;
  std::strcpy(rec.fan_span.name, "span");
  EXPECT_EQ(Copy(7, rec, 75), 0);
  EXPECT_EQ(Copy(7, rec, 76), 1);
  fr.has_position = 1;
  EXPECT_EQ(SetFanResult(writer_, fan_, 0x10000004, &fr), 1);
  const auto records = CloseAndRead();
  ASSERT_EQ(records.size(), 4u);
  EXPECT_EQ(records[1].kind, kKindFan);
  EXPECT_EQ(records[1].payload.size(), 80u);
  EXPECT_EQ(At<uint32_t>(records[1].payload, 4), 0u);
  EXPECT_EQ(At<double>(records[1].payload, 8), 0.0);
  EXPECT_EQ(records[2].kind, kKindFanSpan);
  const auto& p = records[2].payload;
  ASSERT_EQ(p.size(), 64u + 1 + 4);
  EXPECT_EQ(At<uint32_t>(p, 0), 4u);
  EXPECT_EQ(At<uint32_t>(p, 4), kResultSolved);
  EXPECT_EQ(At<double>(p, 8), 7.0);
  EXPECT_EQ(At<uint32_t>(p, 32), 0x10000004u);
}

TEST(RayFlags, RecordFlagsAndQuality) {
  EXPECT_EQ(RayRecordFlags(0x8), 0x80000000u);
  EXPECT_EQ(RayRecordFlags(0xFFFFFFFF), 0x80000000u | 0x7FFC0407);
  EXPECT_EQ(RayQuality(0), 4u);
  EXPECT_EQ(RayQuality(1), 4u);
  EXPECT_EQ(RayQuality(2), 5u);
  EXPECT_EQ(RayQuality(3), 2u);
  EXPECT_EQ(RayQuality(3 | (1u << 13)), 0u);
  EXPECT_EQ(RayQuality(3 | (1u << 29)), 0u);
  EXPECT_EQ(RayQuality(3 | (1u << 30)), 2u);
}

TEST_F(ResultFunctionsTest, RayWithBit13GoesToBothOutputsWithQuality0) {
  fan_->nmea_path = test::TempPath("fan.nmea");
  fan_->position[0] = 1.0;
  auto stream = OpenRayStream(*fan_);
  ASSERT_TRUE(stream);
  const Cartesian c = GeodeticToCartesian(GpsEllipsoid(), Geodetic{0.8, 0.2, 50.0});
  vox_RayData ray{};
  ray.time = TimeMsFromDate(2017, 3, 1, 12, 0, 0);
  ray.position[0] = c.x;
  ray.position[1] = c.y;
  ray.position[2] = c.z;
  ray.flags = (1u << 13) | 0x8 | 2;
  ray.hdop = 0.9f;
  ray.satellites = 9;
  EXPECT_EQ(SetNextRay(writer_, stream.get(), &ray), 1);
  EXPECT_EQ(SetNextRay(writer_, nullptr, &ray), 0);
  EXPECT_EQ(CloseRayStream(stream.release()), 1);
  EXPECT_EQ(CloseRayStream(nullptr), 1);

  const auto records = CloseAndRead();
  ASSERT_EQ(records.size(), 3u);
  const auto& p = records[1].payload;
  EXPECT_EQ(records[1].kind, kKindRay);
  ASSERT_EQ(p.size(), 60u);
  EXPECT_EQ(At<uint32_t>(p, 0), 4u);
  EXPECT_EQ(At<uint32_t>(p, 4), 0x80000000u | 2);
  EXPECT_DOUBLE_EQ(At<double>(p, 16), c.x - 1.0);
  EXPECT_EQ(At<float>(p, 52), 0.9f);
  EXPECT_EQ(At<uint32_t>(p, 56), 9u);
  const auto nmea = test::ReadBytes(fan_->nmea_path);
  const std::string text(nmea.begin(), nmea.end());
  EXPECT_EQ(text.rfind("$GPZDA", 0), 0u);
  EXPECT_NE(text.find(",E,0,09,0.9,"), std::string::npos) << text;
}

TEST_F(ResultFunctionsTest, RayStreamWithoutOutputStillWritesTheRecord) {
  fan_->nmea_path = "/nonexistent-folder/x.nmea";
  auto stream = OpenRayStream(*fan_);
  ASSERT_TRUE(stream);
  vox_RayData ray{};
  EXPECT_EQ(SetNextRay(writer_, stream.get(), &ray), 1);
  CloseRayStream(stream.release());
  EXPECT_EQ(CloseAndRead().size(), 3u);
}

TEST(SatelliteCodes, OneAndTwoByteForms) {
  EXPECT_EQ(SatelliteCode8(4), 4);
  EXPECT_EQ(SatelliteCode8(33), 0xC1);
  EXPECT_EQ(SatelliteCode8(38), 0x81);
  EXPECT_EQ(SatelliteCode16(32), 32);
  EXPECT_EQ(SatelliteCode16(37), 0xC5);
  EXPECT_EQ(SatelliteCode16(61), 0x80 | 24);
  EXPECT_EQ(SatelliteCode16(62), 0x141);
  EXPECT_EQ(SatelliteCode16(99), 0x101);
  EXPECT_EQ(SatelliteCode16(149), 0x40 | 21);
  EXPECT_EQ(SatelliteCode16(150), 0);
  EXPECT_EQ(SatelliteRecordFlags(0x1 | 0x2 | 0x4 | 0x100 | 0x8000 | 0x4000, true, true),
            0x100 | 0x400 | 3 | 0x10 | 0x8000);
  EXPECT_EQ(SatelliteRecordFlags(0x4000 | 0x8000 | 0x40, false, false), 6 | 0x200);
}

TEST_F(ResultFunctionsTest, CopyDataKinds) {
  vox_CopyDataRec rec{};
  rec.solution.type = 2;
  rec.solution.flags = 0xFFFFFFFF;
  writer_.plot_counter = 5;
  EXPECT_EQ(Copy(1, rec, 0), 1);  // size is not consulted
  EXPECT_EQ(writer_.plot_counter, 0u);
  EXPECT_EQ(done_units_, 1u);
  EXPECT_EQ(CopyData(writer_, 1, &rec, 8, vectors_, fans_, nullptr), 1);  // thread writer
  EXPECT_EQ(done_units_, 1u);
  EXPECT_EQ(Copy(9, rec, 0), 0);
  EXPECT_EQ(writer_.plot_counter, 1u);

  rec = vox_CopyDataRec{};
  rec.satellite.obs_flags = 0x2;
  rec.satellite.sat_a = 100;
  rec.satellite.sat_b = 4;
  rec.satellite.time1 = TimeMs{86400 * 7 + 1, 2};
  rec.satellite.value = 77;
  rec.satellite.values[3] = 0xEE;
  EXPECT_EQ(Copy(5, rec, 55), 0);
  EXPECT_EQ(Copy(5, rec, 56), 1);
  EXPECT_EQ(Copy(10, rec, 56), 1);
  rec.satellite_short.values[2] = 0xCC;
  EXPECT_EQ(Copy(8, rec, 31), 0);
  EXPECT_EQ(Copy(8, rec, 32), 1);
  EXPECT_EQ(Copy(11, rec, 32), 1);
  EXPECT_EQ(Copy(2, rec, 200), 0);
  EXPECT_EQ(CopyData(writer_, 5, nullptr, 56, vectors_, fans_, nullptr), 0);

  const auto records = CloseAndRead();
  ASSERT_EQ(records.size(), 8u);
  EXPECT_EQ(records[1].kind, kKindSolutionStart);
  EXPECT_EQ(At<uint32_t>(records[1].payload, 4), 0xE5FFFFFFu);
  const auto& b = records[3].payload;  // kind 39
  EXPECT_EQ(records[3].kind, kKindSatelliteB);
  ASSERT_EQ(b.size(), 46u);
  EXPECT_EQ(At<uint16_t>(b, 0), 0x101);
  EXPECT_EQ(At<uint16_t>(b, 2), 1);
  EXPECT_EQ(b[4], (100 - 37) | 0x80);
  EXPECT_EQ(b[5], 4);
  EXPECT_EQ(At<uint32_t>(b, 6), 1002u);
  EXPECT_EQ(At<uint32_t>(b, 10), 7u);
  EXPECT_EQ(At<uint32_t>(b, 22), 77u);
  EXPECT_EQ(At<uint32_t>(b, 42), 0xEEu);
  const auto& c = records[4].payload;  // kind 52
  EXPECT_EQ(records[4].kind, kKindSatelliteC);
  ASSERT_EQ(c.size(), 48u);
  EXPECT_EQ(At<uint16_t>(c, 4), 0x102);
  const auto& a = records[5].payload;  // kind 38
  EXPECT_EQ(records[5].kind, kKindSatelliteA);
  ASSERT_EQ(a.size(), 18u);
  EXPECT_EQ(At<uint16_t>(a, 0), 1);
  EXPECT_EQ(At<uint16_t>(a, 2), 0x101);
  EXPECT_EQ(At<uint32_t>(a, 14), 0xCCu);
  EXPECT_EQ(records[6].kind, kKindSatelliteD);
  EXPECT_EQ(records[6].payload.size(), 20u);
}

}  // namespace
}  // namespace vox
