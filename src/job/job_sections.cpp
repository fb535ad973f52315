// Files, points, antennas and receivers: the items that refer to nothing.
#include <algorithm>
#include <cstdlib>
#include <iterator>

#include "base/engine_log.h"
#include "job/job_parser_steps.h"

namespace vox::job_parser {

void ParseFiles(Context& c) {
  for (int32_t n = 1; n <= c.counts.files; ++n) {
    if (!c.reader.FindSection(SectionName("FILE:", n))) continue;
    std::string path = JobPathValue(c, "Name");
    if (path.empty()) continue;
    const bool temporary = c.reader.GetInt("Temp", 0) != 0;
    const bool smooth = c.reader.GetInt("Smooth", 0) != 0;
    c.model.files.Append(
        new TChainItem(static_cast<uint32_t>(n), std::move(path), temporary, smooth));
  }
}

void ParsePoints(Context& c) {
  for (int32_t n = 1; n <= c.counts.points; ++n) {
    TPointItem* point = c.model.points.Append(new TPointItem(static_cast<uint32_t>(n)));
    const std::string section = SectionName("POINT:", n);
    if (c.reader.FindSection(section)) {
      JobSection& r = c.reader;
      point->name = r.GetString("Name");
      point->x = r.GetDouble("PosX", 0.0);
      point->y = r.GetDouble("PosY", 0.0);
      point->z = r.GetDouble("PosZ", 0.0);
      point->rms = r.GetFloat("PosRms", 0.0f);
      const int32_t type = r.GetInt("Type", -1);
      point->type = type == 1 ? 2 : type;
    }
    if (point->name.empty()) point->name = section;
  }
}

namespace {

constexpr const char* kPatternKeys[] = {
    "DirPat_GPS_L1", "DirPat_GPS_L2", "DirPat_GPS_L5", "DirPat_GPS_L6", "DirPat_GLN_G1",
    "DirPat_GLN_G2", "DirPat_GLN_G3", "DirPat_BDS_B1", "DirPat_BDS_B2", "DirPat_BDS_B3",
};
static_assert(std::size(kPatternKeys) <= kPatternSlots);

// Pattern values are read under the process locale, unlike every other number of the job:
// stored job files were written that way and rely on it.
void ReadPatterns(const JobSection& r, TAntennItem& antenna) {
  for (size_t slot = 0; slot < std::size(kPatternKeys); ++slot) {
    const std::string value = r.GetString(kPatternKeys[slot]);
    if (value.empty()) continue;
    float values[kPatternValues];
    int read = 0;
    for (std::string_view item : SplitCommaList(value)) {
      if (read == kPatternValues) break;
      values[read++] = NarrowToFloat(std::atof(std::string(item).c_str()));
    }
    if (read < kPatternValues) continue;
    std::copy(values, values + kPatternValues, antenna.patterns[slot]);
    antenna.pattern_mask |= 1u << slot;
    Trace("PCV correction is accepted: %s\n", kPatternKeys[slot]);
  }
}

}  // namespace

void ParseAntennas(Context& c) {
  for (int32_t n = 1; n <= c.counts.antennas; ++n) {
    TAntennItem* antenna = c.model.antennas.Append(new TAntennItem(static_cast<uint32_t>(n)));
    const std::string section = SectionName("ANTENNA:", n);
    if (c.reader.FindSection(section)) {
      JobSection& r = c.reader;
      antenna->name = r.GetString("Name");
      antenna->l2_east = r.GetFloat("OffsetL2_E", 0.0f);
      antenna->l2_north = r.GetFloat("OffsetL2_N", 0.0f);
      antenna->l2_up = r.GetFloat("OffsetL2_U", 0.0f);
      ReadPatterns(r, *antenna);
    }
    if (antenna->name.empty()) antenna->name = section;
  }
}

void ParseReceivers(Context& c) {
  for (int32_t n = 1; n <= c.counts.receivers; ++n) {
    TReceiverItem* receiver = c.model.receivers.Append(new TReceiverItem(static_cast<uint32_t>(n)));
    const std::string section = SectionName("RECEIVER:", n);
    if (c.reader.FindSection(section)) {
      receiver->vendor = c.reader.GetString("Vendor");
      receiver->name = c.reader.GetString("Name");
      receiver->serial = c.reader.GetString("SN");
    }
    if (receiver->name.empty()) receiver->name = section;
  }
}

}  // namespace vox::job_parser
