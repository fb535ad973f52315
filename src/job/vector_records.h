// The records through which engines read the job's vectors and fans and the job's one
// solution, and the cursors of the vector and fan streams.
//
// Reads fields that do not change while engines run; no lock. A cursor belongs to the
// engine thread that opened it.
#pragma once

#include <cstdint>

#include "job/item_cursor.h"
#include "job/job_model.h"
#include "vox/vox_sdk_streams.h"

namespace vox {

// The vector stream's cursor: the next vector to look at.
struct VectorCursor {
  TVectorItem* next;
};

using FanCursor = ItemCursor<TFanItem>;

// The next vector that has occupations (vectors without are skipped), or null at the end.
TVectorItem* NextVector(VectorCursor& cursor);

void FillVectorData(const TVectorItem& vector, vox_VectorData& record);
void FillFanData(const TFanItem& fan, vox_FanData& record);

// The solution records: the job's kind and name (and MaxExtraBases); the leading words are
// the caller's and stay untouched.
void FillSolutionData(const JobModel& job, vox_SolutionData& record);
void FillSolutionDataEx(const JobModel& job, vox_SolutionDataEx& record);

}  // namespace vox
