// Exported occupation, antenna, receiver and raw-file functions: they find the current task,
// check their arguments and write their trace lines; the records are built in the job room.
#include <cstring>
#include <new>

#include "base/engine_log.h"
#include "job/navigation_mean.h"
#include "job/occupation_records.h"
#include "job/record_text.h"
#include "platform/platform.h"
#include "run/current_task.h"
#include "run/task.h"
#include "vox/vox_sdk_streams.h"

namespace {

vox::JobModel* Job() {
  vox::TTask* task = vox::CurrentTask();
  return task != nullptr ? &task->job : nullptr;
}

vox::NavCoord FromRecord(const vox_NavCoordData& r) {
  vox::NavCoord c;
  c.x = r.x;
  c.y = r.y;
  c.z = r.z;
  c.sx = r.sx;
  c.sy = r.sy;
  c.sz = r.sz;
  c.rxy = r.rxy;
  c.rxz = r.rxz;
  c.ryz = r.ryz;
  return c;
}

void ToRecord(const vox::NavCoord& c, vox_NavCoordData& r) {
  r.x = c.x;
  r.y = c.y;
  r.z = c.z;
  r.sx = c.sx;
  r.sy = c.sy;
  r.sz = c.sz;
  r.rxy = c.rxy;
  r.rxz = c.rxz;
  r.ryz = c.ryz;
}

// The step of both occupation streams; the fill's own result is not passed on.
template <typename Record>
int32_t NextOccupation(void* stream, Record* out) {
  const vox::JobModel* job = Job();
  if (stream == nullptr || out == nullptr || job == nullptr) return 0;
  vox::TOccupItem* occupation = static_cast<vox::OccupationCursor*>(stream)->Next();
  if (occupation == nullptr) return 0;
  if constexpr (std::is_same_v<Record, vox_OccupationData>) {
    vox::FillOccupationData(*job, *occupation, *out);
  } else {
    vox::FillOccupationDataEx(*job, *occupation, *out);
  }
  return 1;
}

template <typename Record>
int32_t OccupationData(Record* record) {
  if (record == nullptr) return 0;
  const uint32_t id = record->id;
  vox::Trace("get occupation data #%08X\n", id);
  const vox::JobModel* job = Job();
  if (job == nullptr) return 0;
  const vox::TOccupItem* occupation = job->FindOccup(id);
  if (occupation == nullptr) return 0;
  if constexpr (std::is_same_v<Record, vox_OccupationData>) {
    return vox::FillOccupationData(*job, *occupation, *record) ? 1 : 0;
  } else {
    return vox::FillOccupationDataEx(*job, *occupation, *record) ? 1 : 0;
  }
}

}  // namespace

extern "C" {

VOX_API void* VOX_CALL vox_OpenSolOccupStream(void) {
  vox::Trace("open occupation stream\n");
  const vox::JobModel* job = Job();
  if (job == nullptr || job->occupations.empty()) return nullptr;
  return new (std::nothrow) vox::OccupationCursor(job->occupations.head());
}

VOX_API int32_t VOX_CALL vox_GetNextSolOccup(void* stream, vox_OccupationData* out) {
  return NextOccupation(stream, out);
}

VOX_API int32_t VOX_CALL vox_GetNextSolOccupEx(void* stream, vox_OccupationDataEx* out) {
  return NextOccupation(stream, out);
}

VOX_API int32_t VOX_CALL vox_CloseSolOccupStream(void* stream) {
  vox::Trace("close occupation stream\n");
  delete static_cast<vox::OccupationCursor*>(stream);
  return 1;
}

VOX_API void* VOX_CALL vox_OpenROccupStream(uint32_t item_id, uint32_t selector) {
  const vox::JobModel* job = Job();
  if (job == nullptr) return nullptr;
  vox::TROccupItem* head = vox::LinkedOccupations(*job, item_id, selector);
  if (head == nullptr) return nullptr;
  return new (std::nothrow) vox::LinkedOccupationCursor(head);
}

VOX_API int32_t VOX_CALL vox_GetNextROccup(void* stream, vox_ROccupData* out) {
  if (stream == nullptr || out == nullptr) return 0;
  const vox::TROccupItem* link = static_cast<vox::LinkedOccupationCursor*>(stream)->Next();
  if (link == nullptr) return 0;
  if (link->occupation != nullptr) vox::FillLinkedOccupation(*link->occupation, *out);
  return 1;
}

VOX_API int32_t VOX_CALL vox_CloseROccupStream(void* stream) {
  delete static_cast<vox::LinkedOccupationCursor*>(stream);
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetOccupationData(vox_OccupationData* record) {
  return OccupationData(record);
}

VOX_API int32_t VOX_CALL vox_GetOccupationDataEx(vox_OccupationDataEx* record) {
  return OccupationData(record);
}

VOX_API int32_t VOX_CALL vox_GetAntennaType(uint32_t antenna_id, vox_AntennaData* out) {
  if (out == nullptr) return 0;
  std::memset(out, 0, sizeof(*out));
  const vox::JobModel* job = Job();
  const vox::TAntennItem* antenna = job != nullptr ? job->FindAntenna(antenna_id) : nullptr;
  if (antenna == nullptr) return 0;
  vox::FillAntennaData(*antenna, *out);
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetAntennaTypeEx(uint32_t antenna_id, vox_AntennaDataEx* out) {
  if (out == nullptr) return 0;
  std::memset(out, 0, sizeof(*out));
  const vox::JobModel* job = Job();
  const vox::TAntennItem* antenna = job != nullptr ? job->FindAntenna(antenna_id) : nullptr;
  if (antenna == nullptr) return 0;
  vox::FillAntennaDataEx(*antenna, *out);
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetReceiverData(uint32_t receiver_id, vox_ReceiverData* out) {
  if (out == nullptr) return 0;
  const vox::JobModel* job = Job();
  const vox::TReceiverItem* receiver = job != nullptr ? job->FindReceiver(receiver_id) : nullptr;
  if (receiver == nullptr) return 0;
  vox::FillReceiverData(receiver_id, *receiver, *out);
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetTrackData(vox_TrackData* record) {
  if (record == nullptr) return 0;
  const vox::JobModel* job = Job();
  const vox::TChainItem* file = job != nullptr ? job->FindFile(record->id) : nullptr;
  if (file == nullptr) return 0;
  vox::CopyRecordText(record->file_name, file->file_name);
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetNavCoord(uint32_t occupation_id, vox_NavCoordData* out) {
  const vox::platform::QuietFloatingPoint quiet;
  vox::Trace("get occupation coord #%08X\n", occupation_id);
  vox::TTask* task = vox::CurrentTask();
  if (out == nullptr || task == nullptr) return 0;
  const vox::TOccupItem* occupation = task->job.FindOccup(occupation_id);
  if (occupation == nullptr) return 0;
  const std::optional<vox::NavCoord> coord = vox::GetNavCoord(*occupation, task->solution_lock);
  if (!coord) return 0;
  ToRecord(*coord, *out);
  return 1;
}

VOX_API int32_t VOX_CALL vox_SetNavCoord(uint32_t occupation_id, const vox_NavCoordData* in) {
  const vox::platform::QuietFloatingPoint quiet;
  if (in == nullptr) return 0;
  vox::Trace("set occupation coord #%08X\n", occupation_id);
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return 0;
  vox::TOccupItem* occupation = task->job.FindOccup(occupation_id);
  if (occupation == nullptr) return 0;
  return vox::SetNavCoord(*occupation, FromRecord(*in), task->solution_lock) ? 1 : 0;
}

}  // extern "C"
