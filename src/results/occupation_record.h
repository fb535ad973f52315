// The occupation record (result kind 34) that follows each occupation's raw-filter call.
#pragma once

#include <cstdint>
#include <vector>

#include "job/items.h"
#include "results/result_file.h"

namespace vox {

// Names in the record are cut to this many bytes.
constexpr size_t kOccupationNameMax = 60;

// The record's payload: a 104-byte fixed part, then the point name, the receiver text of the
// occupation's file and the antenna name as counted strings.
std::vector<uint8_t> BuildOccupationRecord(const TOccupItem& occupation);

// Builds and writes the record. The caller holds the task's "solution" lock, because thread
// writers and the task's writer may both be in use. True when the writer accepted it.
bool WriteOccupationRecord(TResultFile& writer, const TOccupItem& occupation);

}  // namespace vox
