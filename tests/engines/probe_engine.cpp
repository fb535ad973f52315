// The probe engine: a complete engine built on the public SDK alone that walks every stream
// over the job's occupations, points, vectors and fans, stores navigation coordinates, runs
// threads of its own, reports progress and messages, and writes everything it read to a text
// file that the tests compare against the job.
//
// Its parameters come from the job's [JOB] section (or a vector's or fan's section):
//   ProbeOut=<path>        the file it writes (nothing is written without it)
//   ProbeThreads=<n>       threads of its own, each registered with vox_InitNewThread
//   ProbeSlowMs=<ms>       sleep this long in each of 20 work steps
//   ProbeHonourBreak=1     stop the work steps once _eng_BreakProcess was called
//   ProbeFail=throw|fault  throw a C++ exception, or write through a null pointer
//   ProbeResults, ProbeEphemeris, ProbeEpochs: the optional modes of probe_modes.h
#include <atomic>
#include <chrono>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "probe_modes.h"
#include "probe_output.h"
#include "test_engine.h"

namespace {

enum Failure : int32_t { kNoFailure = 0, kThrow = 1, kFault = 2 };

#pragma pack(push, 1)
struct ProbeBlock {
  ParameterBlock header;
  char out[256];
  int32_t threads;
  int32_t slow_ms;
  int32_t honour_break;
  int32_t fail;
  int32_t results;
  int32_t epochs;
  char ephemeris[128];
};
#pragma pack(pop)

std::atomic<bool> g_break{false};

using probe::Output;

void WalkSolution(Output& out) {
  vox_SolutionData data;
  std::memset(&data, 0, sizeof(data));
  vox_GetSolutionData(&data);
  vox_SolutionDataEx ex;
  std::memset(&ex, 0, sizeof(ex));
  vox_GetSolutionDataEx(&ex);
  uint32_t solution = 0;
  vox_GetSolutionByVector(0, &solution);
  out.Line("solution kind=%u name=%s extra=%u type=%u one=%u", data.job_kind, data.job_name,
           ex.max_extra_bases, vox_GetSolutionType(), solution);
}

void WalkAntenna(Output& out, uint32_t id) {
  vox_AntennaDataEx antenna;
  if (vox_GetAntennaTypeEx(id, &antenna) == 0) return;
  out.Line("antenna id=%08X slots=%u mask=%08X", antenna.id, antenna.slot_count,
           antenna.pattern_mask);
}

void WalkOccupations(Output& out) {
  void* stream = vox_OpenSolOccupStream();
  if (stream == nullptr) {
    out.Line("occupations none");
    return;
  }
  vox_OccupationDataEx record;
  for (;;) {
    std::memset(&record, 0, sizeof(record));
    record.mask =
        VOX_OCC_NAME | VOX_OCC_ANTENNA | VOX_OCC_METEO | VOX_OCC_SIGNALS | VOX_OCC_SAT_STATES;
    if (vox_GetNextSolOccupEx(stream, &record) == 0) break;
    out.Line(
        "occupation id=%08X point=%08X file=%08X receiver=%08X epochs=%u interval=%u "
        "mask=%08X name=%s",
        record.occupation_id, record.point_id, record.file_id, record.receiver_id,
        record.epoch_count, record.epoch_interval_ms, record.mask, record.name);
    // GLONASS 6 and 7, and GALILEO 11, from the state tables (two bits per satellite).
    const uint32_t glonass = record.sat_states[1][0];
    const uint32_t galileo = record.sat_states[3][0];
    out.Line("states id=%08X R6=%u R7=%u E11=%u", record.occupation_id, (glonass >> 12) & 3,
             (glonass >> 14) & 3, (galileo >> 22) & 3);
    // The same occupation by identifier, plain form.
    vox_OccupationData plain;
    std::memset(&plain, 0, sizeof(plain));
    plain.id = record.occupation_id;
    plain.mask = VOX_OCC_NAME;
    const int32_t found = vox_GetOccupationData(&plain);
    out.Line("occupation_plain id=%08X result=%d name=%s", plain.id, found, plain.name);
    if (record.antenna.id != 0) WalkAntenna(out, record.antenna.id);
    if (record.receiver_id != 0) {
      vox_ReceiverData receiver;
      if (vox_GetReceiverData(record.receiver_id, &receiver) != 0)
        out.Line("receiver id=%08X vendor=%s name=%s serial=%s", receiver.id, receiver.vendor,
                 receiver.name, receiver.serial);
    }
    if (record.file_id != 0) {
      vox_TrackData track;
      track.id = record.file_id;
      if (vox_GetTrackData(&track) != 0)
        out.Line("track id=%08X name=%s", track.id, track.file_name);
    }
  }
  vox_CloseSolOccupStream(stream);
}

void WalkSites(Output& out, const char* label) {
  void* stream = vox_OpenPointStream();
  if (stream == nullptr) {
    out.Line("points none");
    return;
  }
  for (uint32_t id = vox_GetPointId(stream); id != 0; id = vox_GetPointId(stream)) {
    vox_SiteData site;
    std::memset(&site, 0, sizeof(site));
    site.id = id;
    const int32_t result = vox_GetSiteData(&site);
    out.Line("%s id=%08X result=%d type=%u count=%u x=%.4f y=%.4f z=%.4f rms=%.4f name=%s", label,
             site.id, result, site.site_type, site.occupation_count, site.x, site.y, site.z,
             site.rms, site.name);
  }
  vox_ClosePointStream(stream);
}

std::string LinkedOccupations(uint32_t id, uint32_t selector) {
  std::string list;
  void* stream = vox_OpenROccupStream(id, selector);
  if (stream == nullptr) return "-";
  vox_ROccupData record;
  while (vox_GetNextROccup(stream, &record) != 0) {
    char text[16];
    std::snprintf(text, sizeof(text), "%s%08X", list.empty() ? "" : ",", record.occupation_id);
    list += text;
  }
  vox_CloseROccupStream(stream);
  return list;
}

void WalkVectors(Output& out, const ProbeBlock& job_block) {
  void* stream = vox_OpenVectorStream();
  if (stream == nullptr) {
    out.Line("vectors none");
    return;
  }
  vox_VectorData record;
  while (vox_GetNextVector(stream, &record) != 0) {
    vox_VectorData again;
    std::memset(&again, 0, sizeof(again));
    again.id = record.id & 0xFFFFFF;  // the bare number finds it too
    const int32_t found = vox_GetVectorData(&again);
    ProbeBlock property;
    std::memset(&property, 0, sizeof(property));
    property.header.allocated = sizeof(property);
    vox_GetVectorProperty(record.id, &property.header);
    out.Line("vector id=%08X points=%08X,%08X names=%s,%s again=%d occups=%s size=%u same=%d",
             record.id, record.first_point_id, record.second_point_id, record.first_point_name,
             record.second_point_name, found, LinkedOccupations(record.id, 1).c_str(),
             property.header.size, vox_CompareVectorProperty(&property.header, &job_block.header));
  }
  vox_CloseVectorStream(stream);
}

void WalkFans(Output& out) {
  void* stream = vox_OpenFanStream();
  if (stream == nullptr) {
    out.Line("fans none");
    return;
  }
  vox_FanData record;
  while (vox_GetNextFan(stream, &record) != 0) {
    ProbeBlock property;
    std::memset(&property, 0, sizeof(property));
    property.header.allocated = sizeof(property);
    const int32_t has_property = vox_GetFanProperty(record.id, &property.header);
    TRayStream* rays = vox_OpenRayStream(record.id, 0);
    const bool refused = vox_OpenRayStream(record.id, 1) == nullptr;
    out.Line(
        "fan id=%08X base=%08X rover=%08X base_name=%s rover_name=%s occups=%s "
        "property=%d rays=%d read_refused=%d",
        record.id, record.base_point_id, record.rover_file_id, record.base_point_name,
        record.rover_file_name, LinkedOccupations(record.id, 0).c_str(), has_property,
        rays != nullptr, refused);
    vox_CloseRayStream(rays);
  }
  vox_CloseFanStream(stream);
}

// Every occupation gets navigation coordinates at x = its number, sigma 1 m.
void StoreNavCoords(Output& out) {
  void* stream = vox_OpenSolOccupStream();
  if (stream == nullptr) return;
  vox_OccupationData record;
  for (;;) {
    record.mask = 0;
    if (vox_GetNextSolOccup(stream, &record) == 0) break;
    vox_NavCoordData coord;
    std::memset(&coord, 0, sizeof(coord));
    coord.x = record.occupation_id & 0xFFFFFF;
    coord.sx = coord.sy = coord.sz = 1.0f;
    const int32_t set = vox_SetNavCoord(record.occupation_id, &coord);
    vox_NavCoordData back;
    const int32_t got = vox_GetNavCoord(record.occupation_id, &back);
    out.Line("navcoord id=%08X set=%d get=%d x=%.1f", record.occupation_id, set, got, back.x);
  }
  vox_CloseSolOccupStream(stream);
}

void RunThreads(Output& out, const vox_ThreadContext* context, int32_t count) {
  std::vector<std::thread> threads;
  std::vector<vox_ThreadContext> contexts(static_cast<size_t>(count));
  for (int32_t k = 0; k < count; ++k) {
    threads.emplace_back([&out, &contexts, context, k] {
      vox_ThreadContext& own = contexts[static_cast<size_t>(k)];
      own = *context;
      const uint32_t init = vox_InitNewThread(&own);
      const bool own_writer = own.writer != context->writer;
      own.progress(own.writer, 50);
      char text[32];
      std::snprintf(text, sizeof(text), "probe thread %d", k);
      own.message(own.writer, 1, text);
      void* points = vox_OpenPointStream();  // streams work from any thread
      const uint32_t first_point = vox_GetPointId(points);
      vox_ClosePointStream(points);
      const uint32_t released = vox_DeleteThread(&own);
      out.Line("thread init=%u own_writer=%d flags=%08X first_point=%08X delete=%u", init,
               own_writer, own.flags & 64u, first_point, released);
    });
  }
  for (std::thread& t : threads)
    t.join();
}

// The work steps: progress reports (which let vox run its break check) and optional sleeps.
void WorkSteps(Output& out, const vox_ThreadContext* context, const ProbeBlock& block) {
  for (int step = 1; step <= 20; ++step) {
    if (block.slow_ms > 0) std::this_thread::sleep_for(std::chrono::milliseconds(block.slow_ms));
    const uint32_t flags = context->progress(context->writer, step * 5);
    if (block.honour_break != 0 && g_break.load()) {
      out.Line("break honoured at step %d", step);
      return;
    }
    if (step == 20) out.Line("steps done flags=%08X", flags);
  }
}

template <size_t N>
void SetText(char (&field)[N], const char* value) {
  std::snprintf(field, sizeof(field), "%s", value);
}

}  // namespace

TEST_ENGINE_REQUIRED_FUNCTIONS(VOX_ENGINE_INTERFACE_VERSION)

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetParamBlockSize(void) {
  return sizeof(ProbeBlock);
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_InitParamBlock(ParameterBlock* block) {
  block->size = block->allocated;
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_EnumParamName(vox_EnumParamCallback callback,
                                                       void* context) {
  for (const char* name : {"ProbeOut", "ProbeThreads", "ProbeSlowMs", "ProbeHonourBreak",
                           "ProbeFail", "ProbeResults", "ProbeEphemeris", "ProbeEpochs"})
    callback(context, 0, name);
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_SetParam(ParameterBlock* header, const char* name,
                                                  const char* value) {
  if (header->allocated < sizeof(ProbeBlock)) return 0;
  ProbeBlock* block = reinterpret_cast<ProbeBlock*>(header);
  if (std::strcmp(name, "ProbeOut") == 0) SetText(block->out, value);
  if (std::strcmp(name, "ProbeThreads") == 0) block->threads = std::atoi(value);
  if (std::strcmp(name, "ProbeSlowMs") == 0) block->slow_ms = std::atoi(value);
  if (std::strcmp(name, "ProbeHonourBreak") == 0) block->honour_break = std::atoi(value);
  if (std::strcmp(name, "ProbeResults") == 0) block->results = std::atoi(value);
  if (std::strcmp(name, "ProbeEpochs") == 0) block->epochs = std::atoi(value);
  if (std::strcmp(name, "ProbeEphemeris") == 0) SetText(block->ephemeris, value);
  if (std::strcmp(name, "ProbeFail") == 0) {
    block->fail = std::strcmp(value, "throw") == 0   ? kThrow
                  : std::strcmp(value, "fault") == 0 ? kFault
                                                     : kNoFailure;
  }
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_BreakProcess(void) {
  g_break.store(true);
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroup(vox_ThreadContext* context) {
  g_break.store(false);
  ProbeBlock block;
  std::memset(&block, 0, sizeof(block));
  block.header.allocated = sizeof(block);
  vox_GetSolutionProperty(0, &block.header);

  if (block.fail == kThrow) throw std::runtime_error("probe engine: asked to throw");
  if (block.fail == kFault) {
    volatile int* nowhere = nullptr;
    *nowhere = 1;
  }

  Output out(block.out);
  out.Line("start id=%u flags=%08X", context->id, context->flags);
  context->message(context->writer, 1, "probe: start");
  WalkSolution(out);
  WalkOccupations(out);
  WalkSites(out, "site");
  WalkVectors(out, block);
  WalkFans(out);
  StoreNavCoords(out);
  WalkSites(out, "site_after");
  if (block.threads > 0) RunThreads(out, context, block.threads);
  if (block.results != 0) probe::StoreResults(out, context, block.results);
  if (block.ephemeris[0] != '\0') probe::ReadEphemerides(out, block.ephemeris);
  if (block.epochs != 0) probe::ReadEpochs(out);
  WorkSteps(out, context, block);
  context->message(context->writer, 1, "probe: end");
  out.Line("end");
  return 0;
}
