// The probe's results mode: known records through every result function, on the task's writer
// (plain forms, Ex forms with the call's writer and with null) and on a thread of its own.
// Each call's result goes to the report, so that the test can tell a refused call from a
// record that went missing on its way to the file.
#include <cmath>
#include <cstring>
#include <thread>

#include "probe_modes.h"
#include "probe_values.h"

namespace probe {
namespace {

using namespace probe_values;

int32_t Copy(void* writer, const CopyCase& c, uint32_t seed) {
  const vox_CopyDataRec rec = c.kind == 5 || c.kind == 10
                                  ? Satellite(c.obs_flags, c.a, c.b, seed)
                                  : SatelliteShort(c.obs_flags, c.a, c.b, seed);
  const uint32_t size = c.kind == 5 || c.kind == 10 ? 56 : 32;
  return vox_CopyDataEx(writer, c.kind, &rec, size);
}

void MainPlot(Output& out) {
  vox_PlotStream* plot = vox_OpenPlotStream();
  int32_t set = 0;
  for (const PlotLine& l : kMainLines)
    set += vox_SetLine(plot, l.index, l.mode, 0, l.name, l.options);
  // The time line and an index out of range change nothing.
  const int32_t time_line = vox_SetLine(plot, 1, 0, 0, "G01 L1", "m");
  const int32_t beyond = vox_SetLine(plot, 1024, 0, 0, "G01 L1", nullptr);
  for (const PlotLine& l : kMainLines)
    vox_CreatePlot(plot, 0, l.index, 0);
  int32_t sent = 0;
  sent += vox_SendData(plot, 1, 1, kPlotTime);
  sent += vox_SendData(plot, 0, 1, 1.5);
  sent += vox_SendData(plot, 2, 1, 2.5);
  sent += vox_SendData(plot, 1, 2, kPlotTime + 1.0);
  sent += vox_SendData(plot, 3, 2, 3.5);
  sent += vox_SendData(plot, 7, 2, 7.5);
  out.Line("plot set=%d time_line=%d beyond=%d sent=%d close=%d", set, time_line, beyond, sent,
           vox_ClosePlotStream(plot));
}

// A thread of its own: a solution start, two satellite records and a plot stream through its
// own writer, which reaches the result file as one block when the thread is released.
void OwnThread(Output& out, const vox_ThreadContext* context) {
  std::thread worker([&out, context] {
    vox_ThreadContext own = *context;
    const uint32_t init = vox_InitNewThread(&own);
    const vox_CopyDataRec start = Solution(3, 0x12345678);
    const int32_t started = vox_CopyDataEx(own.writer, 1, &start, 8);
    int32_t copied = 0;
    uint32_t seed = 50;
    for (const CopyCase& c : kThreadCases)
      copied += Copy(own.writer, c, seed++);
    vox_PlotStream* plot = vox_OpenPlotStreamEx(own.writer);
    vox_SetLine(plot, kThreadLine.index, kThreadLine.mode, 0, kThreadLine.name,
                kThreadLine.options);
    vox_CreatePlot(plot, 0, kThreadLine.index, 0);
    vox_SendData(plot, 1, 9, kPlotTime + 9.0);
    vox_SendData(plot, kThreadLine.index, 9, 5.5);
    vox_ClosePlotStream(plot);
    out.Line("results thread init=%u own_writer=%d start=%d copied=%d delete=%u", init,
             own.writer != context->writer, started, copied, vox_DeleteThread(&own));
  });
  worker.join();
}

}  // namespace

void StoreResults(Output& out, const vox_ThreadContext* context, int mode) {
  void* writer = context->writer;
  // A solution starts: the writer's plot counter goes to 0; kind 9 then raises it to 1.
  const vox_CopyDataRec start = Solution(2, 0xFFFFFFFF);
  const int32_t started = vox_CopyData(1, &start, 0);
  const int32_t counter = vox_CopyDataEx(writer, 9, &start, 0);
  int32_t copied = 0;
  uint32_t seed = 1;
  for (const CopyCase& c : kCopyCases)
    copied += Copy(seed % 2 == 0 ? nullptr : writer, c, seed), ++seed;
  out.Line("results start=%d counter=%d copied=%d", started, counter, copied);

  // Vector 1 without a span (kind 33), then its span, then two results with it (kind 40).
  const vox_VectorResult first = VectorFirst();
  const int32_t v1 = vox_SetVectorResult(1, &first);
  const vox_CopyDataRec vector_span = VectorSpan();
  const int32_t short_span = vox_CopyData(6, &vector_span, 167);
  const int32_t span = vox_CopyData(6, &vector_span, 168);
  const vox_VectorResult second = VectorSecond();
  const int32_t v2 = vox_SetVectorResultEx(writer, 0x08000001, &second);
  const vox_VectorResult conflict = VectorConflict();
  const int32_t v3 = vox_SetVectorResultEx(nullptr, 1, &conflict);
  const int32_t none = vox_SetVectorResult(9, &first);
  out.Line("results vector=%d,%d,%d none=%d short_span=%d span=%d", v1, v2, v3, none, short_span,
           span);

  // The fan: a position without a span (kind 35), its span, a second position (kind 41).
  const vox_FanResult fan1 = Fan(kFan1);
  const int32_t f1 = vox_SetFanResult(0x10000001, &fan1);
  const vox_CopyDataRec fan_span = FanSpan();
  const int32_t fspan = vox_CopyDataEx(writer, 7, &fan_span, kFanSpanSize);
  const vox_FanResult fan2 = Fan(kFan2);
  const int32_t f2 = vox_SetFanResultEx(writer, 1, &fan2);
  out.Line("results fan=%d,%d span=%d", f1, f2, fspan);

  // Rays relative to the fan's second position, on the three writer forms.
  TRayStream* rays = vox_OpenRayStream(0x10000001, 0);
  const vox_RayData r0 = Ray(0), r1 = Ray(1), r2 = Ray(2);
  const int32_t a = vox_SetNextRay(rays, &r0);
  const int32_t b = vox_SetNextRayEx(writer, rays, &r1);
  const int32_t c = vox_SetNextRayEx(nullptr, rays, &r2);
  const int32_t null_stream = vox_SetNextRay(nullptr, &r0);
  vox_CloseRayStream(rays);
  out.Line("results rays=%d,%d,%d null=%d", a, b, c, null_stream);

  MainPlot(out);
  OwnThread(out, context);

  // Mode 2: last of all, a ray whose position is not a number (a solution that failed).
  if (mode == 2) {
    TRayStream* more = vox_OpenRayStream(0x10000001, 0);
    vox_RayData ray = Ray(3);
    ray.position[0] = std::nan("");
    out.Line("results nan_ray=%d", vox_SetNextRay(more, &ray));
    vox_CloseRayStream(more);
  }
}

}  // namespace probe
