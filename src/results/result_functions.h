// The logic behind the exported result functions: vector and fan results, rays and the
// per-satellite and span records of vox_CopyData. Each takes what it works on explicitly (the
// writer, the item, the lock, the counters), so that the exported adapters only resolve the
// current task and the writer.
//
// Concurrency: SetVectorResult holds `solution_lock` (the task's "solution" lock) while it
// reads and updates the points' solved positions and writes its record, because engine
// threads store solutions concurrently. The other functions take no lock: the fan and vector
// items they change belong to the engine thread working on them, and each thread writes
// through its own writer.
#pragma once

#include <cstdint>

#include "base/list.h"
#include "base/tlock.h"
#include "job/items.h"
#include "results/ray_stream.h"
#include "results/result_file.h"
#include "vox/vox_sdk_results.h"

namespace vox {

// Result flags of vector and fan records.
constexpr uint32_t kResultSolved = 0x80000000;
constexpr uint32_t kResultRmsOverLimit = 0x40000000;
constexpr uint32_t kResultReversed = 0x800;
constexpr uint32_t kResultExtraValue = 0x1000;

// Outcomes of SetVectorResult.
constexpr int kVectorUnknown = 0;
constexpr int kVectorStored = 1;
constexpr int kVectorConflict = 2;

// Span names are stored with at most this many characters.
constexpr size_t kSpanNameMax = 15;

// The record flags for a vector result (sections "solved" and the common bits).
uint32_t VectorResultFlags(bool solved, bool reversed, uint32_t solution_flags);

// Stores a vector result: updates the solved positions of the vector's end points and writes
// record kind 33 (span not set) or 40. `id` is the identifier as the engine passed it. Null
// vector or result: 0. Otherwise 1, or 2 when the new end point disagrees with its stored
// solution by more than 1 m + 10 ppm of the baseline; the record is written either way.
int SetVectorResult(TResultFile& writer, TVectorItem* vector, uint32_t id,
                    const vox_VectorResult* result, TLock& solution_lock);

// Stores the fan's position and writes record kind 35 (span not set) or 41. 0 for a null fan
// or result, else 1.
int SetFanResult(TResultFile& writer, TFanItem* fan, uint32_t id, const vox_FanResult* result);

// The ray record's flags and the NMEA quality indicator of ray flags.
uint32_t RayRecordFlags(uint32_t ray_flags);
uint32_t RayQuality(uint32_t ray_flags);

// Writes a ray record (kind 36) and, when the stream's NMEA output is good, its GGA sentence.
// 0 for a null stream or ray, else 1.
int SetNextRay(TResultFile& writer, TRayStream* stream, const vox_RayData* ray);

// Satellite codes of the satellite records from a satellite index.
uint8_t SatelliteCode8(uint32_t index);
uint16_t SatelliteCode16(uint32_t index);
// Record flags of a satellite record from the observation flags.
// `timed`: the records with two times (kinds 39 and 52), else kinds 38 and 55.
uint16_t SatelliteRecordFlags(uint16_t obs_flags, bool pair, bool timed);

// The data kinds of vox_CopyData. `done_units` is the task's counter when `writer` is the
// task's own writer, null for a thread writer. Returns 1 when the kind was handled.
int CopyData(TResultFile& writer, uint32_t kind, const void* record, uint32_t size,
             const ItemList<TVectorItem>& vectors, const ItemList<TFanItem>& fans,
             uint32_t* done_units);

}  // namespace vox
