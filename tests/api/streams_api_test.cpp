// The exported stream functions against a task set up by hand: argument checks, trace
// lines, and the cases where the adapters themselves decide (ray stream modes, null records).
#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "job/stream_job.h"
#include "job/trace_capture.h"
#include "run/run_state.h"
#include "run/task.h"
#include "support/scratch.h"
#include "vox/vox_engine.h"

namespace vox {
namespace {

class StreamsApiTest : public ::testing::Test {
 protected:
  void SetUp() override {
    testing::BuildStreamJob(task.job);
    TheRun().current_task.store(&task);
  }
  void TearDown() override { TheRun().current_task.store(nullptr); }

  TTask task;
};

TEST_F(StreamsApiTest, EmptyListsGiveNoStreams) {
  task.job.occupations.Clear();
  task.job.points.Clear();
  EXPECT_EQ(vox_OpenSolOccupStream(), nullptr);
  EXPECT_EQ(vox_OpenPointStream(), nullptr);
  EXPECT_EQ(vox_OpenVectorStream(), nullptr);
  EXPECT_EQ(vox_OpenFanStream(), nullptr);
  EXPECT_EQ(vox_OpenROccupStream(1, 1), nullptr);
  EXPECT_EQ(vox_GetPointId(nullptr), 0u);
  EXPECT_EQ(vox_CloseSolOccupStream(nullptr), 1);
}

TEST_F(StreamsApiTest, NoTaskMeansNothingFound) {
  TheRun().current_task.store(nullptr);
  vox_SiteData site{};
  site.id = 1;
  EXPECT_EQ(vox_GetSiteData(&site), 0);
  EXPECT_EQ(vox_OpenSolOccupStream(), nullptr);
  EXPECT_EQ(vox_GetSolutionType(), 0u);
}

TEST_F(StreamsApiTest, VectorStreamOverVectorsWithoutOccupationsEndsAtOnce) {
  task.job.vectors.Append(new TVectorItem(1, task.job.FindPoint(1), task.job.FindPoint(2)));
  auto* third =
      task.job.vectors.Append(new TVectorItem(3, task.job.FindPoint(2), task.job.FindPoint(3)));
  void* stream = vox_OpenVectorStream();
  ASSERT_NE(stream, nullptr);
  vox_VectorData record{};
  EXPECT_EQ(vox_GetNextVector(stream, &record), 0);
  EXPECT_EQ(vox_CloseVectorStream(stream), 1);

  // Lookup by bare number and by full identifier finds the same vector, stream or not.
  third->occupations.Append(new TROccupItem(task.job.FindOccup(3)));
  record.id = 3;
  ASSERT_EQ(vox_GetVectorData(&record), 1);
  EXPECT_EQ(record.id, 0x08000003u);
  EXPECT_STREQ(record.first_point_name, "P2");
  record.id = 0x08000003;
  EXPECT_EQ(vox_GetVectorData(&record), 1);
  record.id = 2;
  EXPECT_EQ(vox_GetVectorData(&record), 0);
  EXPECT_EQ(vox_GetVectorData(nullptr), 0);

  void* linked = vox_OpenROccupStream(0x08000003, 1);
  ASSERT_NE(linked, nullptr);
  vox_ROccupData occupation{};
  EXPECT_EQ(vox_GetNextROccup(linked, &occupation), 1);
  EXPECT_EQ(occupation.occupation_id, 0x02000003u);
  EXPECT_EQ(vox_GetNextROccup(linked, &occupation), 0);
  EXPECT_EQ(vox_CloseROccupStream(linked), 1);
}

TEST_F(StreamsApiTest, VectorFunctionsTraceEvenWhenTheyRefuse) {
  testing::TraceCapture capture;
  EXPECT_EQ(vox_OpenVectorStream(), nullptr);
  EXPECT_EQ(vox_GetNextVector(nullptr, nullptr), 0);
  EXPECT_EQ(vox_GetVectorData(nullptr), 0);
  EXPECT_EQ(vox_GetVectorProperty(1, nullptr), 0);
  EXPECT_EQ(vox_GetSolutionProperty(0, nullptr), 0);
  uint32_t result = 7;
  EXPECT_EQ(vox_GetVectorResult(0, &result), 0);
  EXPECT_EQ(result, 0u);
  EXPECT_EQ(vox_CloseVectorStream(nullptr), 1);
  vox_OccupationData occupation{};
  occupation.id = 0x2A;
  EXPECT_EQ(vox_GetOccupationData(&occupation), 0);
  EXPECT_EQ(vox_OpenFanStream(), nullptr);  // writes nothing
  EXPECT_EQ(capture.Text(),
            "open vector stream\nget next vector\nget vector data\nget vector property\n"
            "get solution property\nget vector result\nclose vector stream\n"
            "get occupation data #0000002A\n");
}

TEST_F(StreamsApiTest, OccupationStreamTracesAndFillsByRequest) {
  testing::TraceCapture capture;
  void* stream = vox_OpenSolOccupStream();
  ASSERT_NE(stream, nullptr);
  vox_OccupationDataEx record{};
  int count = 0;
  for (;;) {
    record.mask = VOX_OCC_NAME;
    if (vox_GetNextSolOccupEx(stream, &record) == 0) break;
    ++count;
  }
  EXPECT_EQ(count, 3);
  EXPECT_STREQ(record.name, "O3");
  EXPECT_EQ(vox_GetNextSolOccupEx(stream, &record), 0);
  EXPECT_EQ(vox_CloseSolOccupStream(stream), 1);
  EXPECT_EQ(capture.Text(), "open occupation stream\nclose occupation stream\n");
}

TEST_F(StreamsApiTest, NavCoordWithoutPointIsStoredButReportsZero) {
  task.job.occupations.Append(new TOccupItem(4));
  vox_NavCoordData in{};
  in.x = 1;
  in.y = 2;
  in.z = 3;
  in.sx = in.sy = in.sz = 0.5f;
  vox_NavCoordData out{};
  EXPECT_EQ(vox_GetNavCoord(4, &out), 0);
  testing::TraceCapture capture;
  EXPECT_EQ(vox_SetNavCoord(4, &in), 0);
  EXPECT_EQ(vox_SetNavCoord(4, nullptr), 0);
  EXPECT_EQ(vox_GetNavCoord(0x02000004, &out), 1);
  EXPECT_EQ(std::memcmp(&in, &out, sizeof(in)), 0);
  EXPECT_EQ(capture.Text(), "set occupation coord #00000004\nget occupation coord #02000004\n");
  EXPECT_EQ(vox_SetNavCoord(9, &in), 0);
}

TEST_F(StreamsApiTest, AntennaReceiverAndTrackLookups) {
  vox_AntennaData antenna;
  std::memset(&antenna, 0x33, sizeof(antenna));
  EXPECT_EQ(vox_GetAntennaType(9, &antenna), 0);
  EXPECT_EQ(antenna.id, 0u);  // cleared even when not found
  EXPECT_EQ(vox_GetAntennaType(1, &antenna), 1);
  EXPECT_EQ(vox_GetAntennaType(1, nullptr), 0);

  vox_ReceiverData receiver;
  std::memset(&receiver, 0x33, sizeof(receiver));
  EXPECT_EQ(vox_GetReceiverData(5, &receiver), 0);
  EXPECT_EQ(receiver.id, 0x33333333u);  // untouched when not found
  EXPECT_EQ(vox_GetReceiverData(1, &receiver), 1);
  EXPECT_EQ(receiver.id, 1u);  // as passed
  EXPECT_STREQ(receiver.vendor, "Acme");
  EXPECT_STREQ(receiver.serial, "SN1");

  vox_TrackData track{};
  track.id = 0x04000002;
  EXPECT_EQ(vox_GetTrackData(&track), 1);
  EXPECT_STREQ(track.file_name, "site2.raw");
  track.id = 3;
  EXPECT_EQ(vox_GetTrackData(&track), 0);
}

TEST_F(StreamsApiTest, SolutionPropertyIntoACallerBlockWithoutAllocatedSize) {
  task.job.engine_params = ParamBlock::Create(16);
  uint8_t* job_block = task.job.engine_params->data();
  job_block[0] = 16;  // meaningful size 16
  std::memset(job_block + 4, 0x5A, 12);
  uint8_t caller[16] = {12, 0, 0, 0};
  EXPECT_EQ(vox_GetSolutionProperty(0, reinterpret_cast<ParameterBlock*>(caller)), 1);
  EXPECT_EQ(caller[0], 0);
  EXPECT_EQ(caller[4], 0);
  uint8_t sized[20] = {0, 0, 20, 0};
  EXPECT_EQ(vox_GetSolutionProperty(0, reinterpret_cast<ParameterBlock*>(sized)), 1);
  EXPECT_EQ(sized[0], 16);
  EXPECT_EQ(sized[15], 0x5A);
  EXPECT_EQ(sized[16], 0);
  EXPECT_EQ(vox_CompareVectorProperty(reinterpret_cast<ParameterBlock*>(sized),
                                      reinterpret_cast<ParameterBlock*>(job_block)),
            1);
}

TEST_F(StreamsApiTest, FanStreamRaysAndSolutionQueries) {
  test::ScratchDir scratch;
  auto* fan = task.job.fans.Append(new TFanItem(1, task.job.FindPoint(1), task.job.FindFile(2)));
  fan->nmea_path = scratch.File("fan.gga");
  test::WriteFile(fan->nmea_path, "old contents");

  void* stream = vox_OpenFanStream();
  vox_FanData record{};
  EXPECT_EQ(vox_GetNextFan(stream, &record), 1);
  EXPECT_EQ(vox_GetNextFan(stream, &record), 0);
  EXPECT_EQ(vox_GetNextFan(stream, &record), 0);
  EXPECT_EQ(vox_CloseFanStream(stream), 1);

  EXPECT_EQ(vox_OpenRayStream(1, 1), nullptr);  // reading rays back is not offered
  EXPECT_EQ(vox_OpenRayStream(2, 0), nullptr);
  TRayStream* rays = vox_OpenRayStream(1, 0);
  ASSERT_NE(rays, nullptr);
  EXPECT_EQ(vox_CloseRayStream(rays), 1);
  EXPECT_EQ(test::ReadFile(fan->nmea_path), "");  // replaced
  EXPECT_EQ(vox_CloseRayStream(nullptr), 1);

  uint32_t solution = 0;
  EXPECT_EQ(vox_GetSolutionByVector(5, &solution), 1);
  EXPECT_EQ(solution, 1u);
  EXPECT_EQ(vox_GetSolutionBySolXOccup(5, nullptr), 0);
  task.job.job_kind = 3;
  EXPECT_EQ(vox_GetSolutionType(), 3u);
  EXPECT_EQ(vox_GetSolutionData(nullptr), 0);
  EXPECT_EQ(vox_SetSolutionProcessed(), 1);
}

}  // namespace
}  // namespace vox
