// The site data of a point: the best position the library knows for it, as an engine asks
// for it before starting a solution.
//
// Locking: the navigation mean and the solved position of a point change from engine threads
// (navigation coordinates, vector solutions) under the task's solution lock; GetSiteData
// holds that lock while it reads the point.
#pragma once

#include <cstdint>

#include "base/tlock.h"
#include "job/item_cursor.h"
#include "job/job_model.h"
#include "vox/vox_sdk_streams.h"

namespace vox {

using PointCursor = ItemCursor<TPointItem>;

// The site type of a point's stored job type when the job gave coordinates: stored 0 is known
// coordinates (1); stored 2 (what the job's type 1 becomes) and 1 are reported as type 2;
// anything else as 0.
uint32_t SiteTypeOfPointType(int32_t type);

// Fills the record for record.id: the job's coordinates, unless they are exactly the origin;
// then a solved position; then the navigation mean. True when a position was found. The
// record keeps its identifier and is cleared otherwise, also when the point is unknown.
bool GetSiteData(const JobModel& job, TLock& solution_lock, vox_SiteData& record);

}  // namespace vox
