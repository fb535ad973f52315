// The in-memory form of a plot line description, as a plot stream hands it to the result
// writer. The writer turns it into the on-disk record (kinds 4 and 53), whose name is a
// counted string instead of this fixed zero-terminated field.
#pragma once

#include <cstddef>
#include <cstdint>

namespace vox {

// Longest line name stored; the field holds it and a terminating zero.
constexpr size_t kPlotNameMax = 80;

#pragma pack(push, 1)
// Result version 101 and above.
struct PlotLineDescEx {
  uint16_t stream_id;
  uint16_t flags;
  uint16_t sat_a;
  uint16_t sat_b;
  uint16_t index;
  char name[kPlotNameMax + 1];
};
// Result version 100 and below.
struct PlotLineDescIm {
  uint16_t index;
  uint8_t value;  // always 3
  char name[kPlotNameMax + 1];
};
#pragma pack(pop)
static_assert(sizeof(PlotLineDescEx) == 91);
static_assert(sizeof(PlotLineDescIm) == 84);

}  // namespace vox
