// The job's list of satellites to leave out of processing ("G5,R7,J2").
#pragma once

#include <cstdint>
#include <string_view>

#include "base/sat.h"

namespace vox {

// Fills list (capacity kSatIndexCount) from the comma list value and returns the count.
// Items with an unknown letter, a number out of range or no room left are skipped with an
// "Invalid sv index" trace line naming the section.
uint32_t ParseOmitList(std::string_view value, std::string_view section_name,
                       SatId (&list)[kSatIndexCount]);

}  // namespace vox
