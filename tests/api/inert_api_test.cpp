// The exports that do nothing: they answer 0 (or nothing), leave every record alone and
// never reach the engine log.
#include <gtest/gtest.h>

#include <barrier>
#include <cstring>
#include <thread>
#include <vector>

#include "trace_capture.h"
#include "vox/vox_engine.h"

namespace {

// A record of recognisable bytes, big enough for any of the argument records.
struct Canvas {
  Canvas() {
    for (size_t i = 0; i < sizeof bytes; ++i)
      bytes[i] = static_cast<uint8_t>(i * 7 + 3);
    std::memcpy(original, bytes, sizeof bytes);
  }
  bool Untouched() const { return std::memcmp(bytes, original, sizeof bytes) == 0; }
  template <typename T>
  T* As() {
    return reinterpret_cast<T*>(bytes);
  }
  alignas(8) uint8_t bytes[1024];
  uint8_t original[1024];
};

// Calls all 26 with records (or nulls) and returns the sum of the 22 results.
int32_t CallAll(Canvas* c) {
  void* p = c != nullptr ? c->bytes : nullptr;
  vox_EpochSatData* sat = c != nullptr ? c->As<vox_EpochSatData>() : nullptr;
  const vox_NavSolutionData* nav = c != nullptr ? c->As<vox_NavSolutionData>() : nullptr;
  vox_RayData* ray = c != nullptr ? c->As<vox_RayData>() : nullptr;
  vox_FanResult* fan = c != nullptr ? c->As<vox_FanResult>() : nullptr;
  vox_ThreadContext* ctx = c != nullptr ? c->As<vox_ThreadContext>() : nullptr;
  int32_t sum = 0;
  sum |= vox_GetEditOccupationData(p);
  sum |= vox_GetEditOccupationDataEx(p);
  sum |= vox_SetEditOccupationData(p);
  sum |= vox_SetEditOccupationDataEx(p);
  sum |= vox_GetEpochData(p, sat);
  sum |= vox_SetEpochNavSolution(p, nav);
  sum |= vox_GetNextRay(reinterpret_cast<TRayStream*>(p), ray);
  sum |= vox_GetFanResult(1, fan);
  sum |= vox_GetFanProcessed(1);
  sum |= vox_SetFanProcessed(1);
  sum |= vox_GetVectorProcessed(1);
  sum |= vox_SetVectorProcessed(1);
  sum |= vox_SetFanProperty(1, p);
  sum |= vox_SetVectorProperty(1, p);
  sum |= vox_SetSolutionProperty(1, p);
  sum |= vox_GetNextSolXOccup(p, p);
  sum |= vox_GetPrevSolXOccup(p, p);
  sum |= vox_SetOccupationMeasMask(1, 0xFFFFFFFF);
  sum |= vox_SetOccupationStatus(1, 3);
  sum |= vox_InitNewThreadTLS(ctx);
  sum |= vox_Lock();
  sum |= vox_Translate();
  vox_AntennaToOffset();
  vox_GetOccupationTiming();
  vox_GetOccupationTimingEx();
  vox_UnLock();
  return sum;
}

TEST(InertExports, ReturnZeroAndLeaveRecordsAlone) {
  EXPECT_EQ(CallAll(nullptr), 0);
  Canvas c;
  EXPECT_EQ(CallAll(&c), 0);
  EXPECT_TRUE(c.Untouched());
}

TEST(InertExports, WriteNothingToAnOpenEngineLog) {
  vox::testing::TraceCapture log;
  ASSERT_TRUE(vox::EngineLogIsOpen());
  vox::Trace("before\n");
  Canvas c;
  CallAll(&c);
  CallAll(nullptr);
  vox::Trace("after\n");
  EXPECT_EQ(log.Text(), "before\nafter\n");
}

TEST(InertExports, LockExcludesNobody) {
  // Both threads hold the "lock" at the same moment; a real lock would hang here.
  std::barrier both_inside(2);
  auto body = [&] {
    vox_Lock();
    both_inside.arrive_and_wait();
    vox_UnLock();
  };
  std::thread a(body), b(body);
  a.join();
  b.join();
}

}  // namespace
