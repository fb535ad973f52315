#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "job/navigation_mean.h"
#include "job/parameter_assign.h"
#include "job/site_records.h"
#include "job/vector_records.h"
#include "stream_job.h"

namespace vox {
namespace {

class SiteRecordsTest : public ::testing::Test {
 protected:
  void SetUp() override { testing::BuildStreamJob(job); }
  bool Site(uint32_t id) {
    std::memset(&site, 0x77, sizeof(site));
    site.id = id;
    return GetSiteData(job, lock, site);
  }
  JobModel job;
  TLock lock{"solution"};
  vox_SiteData site;
};

TEST_F(SiteRecordsTest, KnownCoordinatesOfTypeZero) {
  TPointItem& p = *job.FindPoint(1);
  p.type = 0;
  p.x = 4000000;
  p.z = 5000000;
  p.rms = 0.01f;
  p.solved_set = true;  // a known position wins
  p.solved_x = 1;
  EXPECT_TRUE(Site(1));
  EXPECT_EQ(site.id, 1u);
  EXPECT_EQ(site.site_type, VOX_SITE_KNOWN);
  EXPECT_EQ(site.x, 4000000.0);
  EXPECT_EQ(site.y, 0.0);
  EXPECT_EQ(site.z, 5000000.0);
  EXPECT_EQ(site.rms, 0.01f);
  EXPECT_EQ(site.occupation_count, 2u);
  EXPECT_EQ(site.reserved, 0u);
  EXPECT_STREQ(site.name, "P1");
}

TEST_F(SiteRecordsTest, PointWithNothingKnownGivesTypeZeroAndItsName) {
  EXPECT_FALSE(Site(0x01000003));
  EXPECT_EQ(site.site_type, VOX_SITE_NONE);
  EXPECT_EQ(site.x, 0.0);
  EXPECT_EQ(site.occupation_count, 0u);
  EXPECT_STREQ(site.name, "P3");
}

TEST_F(SiteRecordsTest, UnknownPointLeavesTheRecordClearedButForItsIdentifier) {
  EXPECT_FALSE(Site(42));
  EXPECT_EQ(site.id, 42u);
  EXPECT_EQ(site.name[0], 0);
  EXPECT_EQ(site.occupation_count, 0u);
}

TEST_F(SiteRecordsTest, KnownCoordinatesAtTheOriginFallBackToSolvedThenMean) {
  TPointItem& p = *job.FindPoint(1);
  p.type = 0;
  NavCoord c;
  c.x = 10;
  c.sx = c.sy = c.sz = 2.0f;
  SetNavCoord(*job.FindOccup(1), c, lock);
  EXPECT_TRUE(Site(1));
  EXPECT_EQ(site.site_type, VOX_SITE_NAV_MEAN);
  EXPECT_NEAR(site.x, 10.0, 1e-9);
  EXPECT_NEAR(site.rms, std::sqrt(12.0f), 1e-5);

  p.solved_set = true;
  p.solved_x = 7;
  p.solved_rms = 0.5f;
  EXPECT_TRUE(Site(1));
  EXPECT_EQ(site.site_type, VOX_SITE_SOLVED);
  EXPECT_EQ(site.x, 7.0);
  EXPECT_EQ(site.rms, 0.5f);
}

TEST_F(SiteRecordsTest, PointOfJobTypeOneIsReportedAsTypeTwo) {
  TPointItem& p = *job.FindPoint(2);
  p.type = 2;  // how the parser stores the job's type 1
  p.x = 1;
  EXPECT_TRUE(Site(2));
  EXPECT_EQ(site.site_type, VOX_SITE_SOLVED);
  EXPECT_EQ(site.x, 1.0);

  p.type = 5;  // other types: coordinates copied, no site type
  EXPECT_FALSE(Site(2));
  EXPECT_EQ(site.x, 1.0);
  EXPECT_EQ(site.site_type, VOX_SITE_NONE);
}

class VectorRecordsTest : public ::testing::Test {
 protected:
  void SetUp() override { testing::BuildStreamJob(job); }
  TVectorItem* AddVector(uint32_t n, bool with_occupation) {
    auto* v = job.vectors.Append(new TVectorItem(n, job.FindPoint(1), job.FindPoint(2)));
    if (with_occupation) v->occupations.Append(new TROccupItem(job.FindOccup(1)));
    return v;
  }
  JobModel job;
};

TEST_F(VectorRecordsTest, VectorsWithoutOccupationsAreSkipped) {
  AddVector(1, false);
  AddVector(2, false);
  VectorCursor none{job.vectors.head()};
  EXPECT_EQ(NextVector(none), nullptr);
  EXPECT_EQ(NextVector(none), nullptr);

  AddVector(3, true);
  AddVector(4, false);
  VectorCursor cursor{job.vectors.head()};
  EXPECT_EQ(NextVector(cursor)->id, 0x08000003u);
  EXPECT_EQ(NextVector(cursor), nullptr);
}

TEST_F(VectorRecordsTest, NamesOf63BytesAreKeptAndLongerOnesCut) {
  const std::string name63(63, 'a');
  job.FindPoint(1)->name = name63;
  job.FindPoint(2)->name = std::string(64, 'b') + "tail";
  vox_VectorData r;
  std::memset(&r, 0xEE, sizeof(r));
  FillVectorData(*AddVector(3, true), r);
  EXPECT_EQ(r.id, 0x08000003u);
  EXPECT_EQ(r.first_point_id, 0x01000001u);
  EXPECT_EQ(r.second_point_id, 0x01000002u);
  EXPECT_EQ(std::string(r.first_point_name), name63);
  EXPECT_EQ(std::string(r.second_point_name), std::string(63, 'b'));
  for (uint8_t b : r.reserved)
    EXPECT_EQ(b, 0);
}

TEST_F(VectorRecordsTest, FanRecordNamesTheRoverFileWithoutFolder) {
  auto* fan = job.fans.Append(new TFanItem(1, job.FindPoint(3), job.FindFile(2)));
  vox_FanData r;
  std::memset(&r, 0xEE, sizeof(r));
  FillFanData(*fan, r);
  EXPECT_EQ(r.base_point_id, 0x01000003u);
  EXPECT_EQ(r.rover_file_id, 0x04000002u);
  EXPECT_STREQ(r.base_point_name, "P3");
  EXPECT_STREQ(r.rover_file_name, "site2.raw");
  EXPECT_EQ(r.reserved2, 0u);

  FanCursor cursor(job.fans.head());
  EXPECT_EQ(cursor.Next(), fan);  // a fan without occupations is streamed
  EXPECT_EQ(cursor.Next(), nullptr);
  EXPECT_EQ(cursor.Next(), nullptr);
}

TEST_F(VectorRecordsTest, SolutionRecordsLeaveTheLeadingWordsAlone) {
  job.job_name = "Survey";
  job.job_kind = 2;
  job.max_extra_bases = 3;
  vox_SolutionData r;
  std::memset(&r, 0xEE, sizeof(r));
  FillSolutionData(job, r);
  EXPECT_EQ(r.untouched, 0xEEEEEEEEu);
  EXPECT_EQ(r.reserved, 0u);
  EXPECT_EQ(r.job_kind, 2u);
  EXPECT_STREQ(r.job_name, "Survey");
  vox_SolutionDataEx ex;
  std::memset(&ex, 0xEE, sizeof(ex));
  FillSolutionDataEx(job, ex);
  EXPECT_EQ(ex.untouched[7], 0xEE);
  EXPECT_EQ(ex.max_extra_bases, 3u);
}

// A parameter block of 4 + payload bytes with the given header.
struct Block {
  Block(uint16_t size, uint16_t allocated, uint8_t fill) {
    std::memset(bytes, fill, sizeof(bytes));
    std::memcpy(bytes, &size, 2);
    std::memcpy(bytes + 2, &allocated, 2);
  }
  uint16_t size() const {
    uint16_t v;
    std::memcpy(&v, bytes, 2);
    return v;
  }
  uint16_t allocated() const {
    uint16_t v;
    std::memcpy(&v, bytes + 2, 2);
    return v;
  }
  uint8_t bytes[32];
};

// Each case: source and destination headers, then the destination's header after the copy
// and the end of the payload bytes taken from the source (the rest keep the destination's).
TEST(ParameterAssign, CopiesNoMoreThanBothHeadersAllow) {
  struct Case {
    const char* what;
    uint16_t src_size, src_allocated, dst_size, dst_allocated;
    uint16_t want_size, want_allocated, copied_to;
  };
  const Case cases[] = {
      {"caller block of allocated size zero receives nothing", 16, 16, 12, 0, 0, 0, 4},
      {"allocated source sets the destination's meaningful size", 10, 16, 0, 32, 10, 32, 10},
      {"... limited by what the destination holds", 10, 16, 0, 8, 8, 8, 8},
      {"unallocated source copies the smaller size, header kept", 20, 0, 8, 32, 8, 32, 8},
      {"meaningful size inside the header copies nothing", 2, 16, 0, 32, 2, 32, 4},
      {"a size beyond what the source holds", 30000, 12, 0, 32, 12, 32, 12},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    Block source(c.src_size, c.src_allocated, 0x11);
    Block destination(c.dst_size, c.dst_allocated, 0x22);
    AssignParameterBlock(destination.bytes, source.bytes);
    EXPECT_EQ(destination.size(), c.want_size);
    EXPECT_EQ(destination.allocated(), c.want_allocated);
    for (uint16_t i = 4; i < sizeof destination.bytes; ++i)
      ASSERT_EQ(destination.bytes[i], i < c.copied_to ? 0x11 : 0x22) << i;
  }
  Block block(4, 16, 0x11);
  AssignParameterBlock(nullptr, block.bytes);
  AssignParameterBlock(block.bytes, nullptr);
}

TEST(ParameterCompare, ComparesPayloadsOverTheSmallerMeaningfulSize) {
  Block a(10, 16, 0x11);
  Block b(12, 16, 0x11);
  b.bytes[11] = 0x99;  // beyond a's size
  EXPECT_TRUE(CompareParameterBlocks(a.bytes, b.bytes));
  b.bytes[9] = 0x99;
  EXPECT_FALSE(CompareParameterBlocks(a.bytes, b.bytes));
  Block empty(0, 16, 0x11);
  EXPECT_FALSE(CompareParameterBlocks(a.bytes, empty.bytes));
  EXPECT_TRUE(CompareParameterBlocks(empty.bytes, empty.bytes));
  EXPECT_FALSE(CompareParameterBlocks(a.bytes, nullptr));
  Block header_only(3, 16, 0x44);
  EXPECT_TRUE(CompareParameterBlocks(a.bytes, header_only.bytes));
}

}  // namespace
}  // namespace vox
