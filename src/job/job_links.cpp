// Occupations, vectors and fans: the items that refer to others.
#include <memory>

#include "base/engine_log.h"
#include "job/job_parser_steps.h"

namespace vox::job_parser {

namespace {

// A lookup number from the job: -1 and other negative values name nothing.
uint32_t Number(int32_t value) {
  return static_cast<uint32_t>(value);
}

void TraceIndex(const char* what, int32_t index, const std::string& section) {
  Trace("%s: %d in section: [%s]\n", what, index, section.c_str());
}

// The occupation's point: the named point, or a copy of it when re-occupations are off and
// the point is already occupied, so every occupation of such a job stands on a point of its
// own.
void LinkPoint(Context& c, TOccupItem& occupation, int32_t number) {
  if (number == -1) return;
  TPointItem* point = c.model.FindPoint(Number(number));
  if (point == nullptr) return;
  if (!c.model.enable_reoccupations && !point->occupations.empty()) {
    const uint32_t copy_number = static_cast<uint32_t>(c.model.points.Count()) + 1;
    point = c.model.points.Append(new TPointItem(copy_number, *point));
  }
  occupation.SetPoint(point);
}

void ReadOccupation(Context& c, TOccupItem& o, const std::string& section) {
  JobSection& r = c.reader;
  o.name = r.GetString("Name");
  o.epoch_gap = static_cast<uint32_t>(r.GetInt("EpochGap", 0));
  o.l1_east = r.GetFloat("OffsetL1_E", 0.0f);
  o.l1_north = r.GetFloat("OffsetL1_N", 0.0f);
  o.l1_up = r.GetFloat("OffsetL1_U", 0.0f);
  if (o.name.empty()) o.name = section;
  o.meteo_height = r.GetFloat("MeteoHeight", 0.0f);
  o.temperature = r.GetFloat("Temperature", 0.0f);
  o.humidity = r.GetFloat("Humidity", -1.0f);
  o.pressure = r.GetFloat("Pressure", 0.0f);
  o.nmea_path = JobPathValue(c, "GGAPath");
}

// The engine parameters of a vector or fan: a copy of the engine's job-level block with the
// values of the item's own section on top.
std::unique_ptr<ParamBlock> ItemParameters(Context& c, EngineRole role,
                                           const std::unique_ptr<ParamBlock>& job_block) {
  if (c.model.raw_filter_only || job_block == nullptr) return nullptr;
  std::unique_ptr<ParamBlock> block = job_block->Copy();
  c.binder.FillParameters(role, c.reader, *block);
  return block;
}

void LinkOccupation(ItemList<TROccupItem>& list, TOccupItem* occupation) {
  list.Append(new TROccupItem(occupation));
}

}  // namespace

void ParseOccupations(Context& c) {
  for (int32_t n = 1; n <= c.counts.occups; ++n) {
    const std::string section = SectionName("OCCUP:", n);
    if (!c.reader.FindSection(section)) {
      Trace("Not found section: [%s]\n", section.c_str());
      continue;
    }
    auto occupation = std::make_unique<TOccupItem>(static_cast<uint32_t>(n));
    TOccupItem& o = *occupation;
    ParseTimeMs(c.reader.GetString("Start"), o.begin);
    ParseTimeMs(c.reader.GetString("End"), o.end);
    if (o.end > c.model.window.end) o.end = c.model.window.end;
    if (o.begin < c.model.window.start) o.begin = c.model.window.start;
    if (o.end < o.begin) continue;  // outside the job window: dropped silently

    o.SetFile(c.model.FindFile(Number(c.reader.GetInt("File", -1))));
    o.SetAntenna(c.model.FindAntenna(Number(c.reader.GetInt("Antenna", -1))));
    o.SetReceiver(c.model.FindReceiver(Number(c.reader.GetInt("Receiver", -1))));
    LinkPoint(c, o, c.reader.GetInt("Point", -1));
    ReadOccupation(c, o, section);
    c.model.occupations.Append(occupation.release());
  }
}

namespace {

// The two point numbers of "Points=a,b" (both the whole value without a comma).
void ReadVectorPoints(const std::string& value, int32_t& first, int32_t& second) {
  const size_t comma = value.find(',');
  if (comma == std::string::npos) {
    first = second = ParseIntDigits(value);
  } else {
    first = ParseIntDigits(std::string_view(value).substr(0, comma));
    second = ParseIntDigits(std::string_view(value).substr(comma + 1));
  }
}

void LinkVectorOccupations(Context& c, TVectorItem& v, const std::string& section) {
  const std::string list = c.reader.GetString("Occup");
  if (list.empty()) {
    for (TOccupItem& o : c.model.occupations)
      if (o.point == v.first_point || o.point == v.second_point) LinkOccupation(v.occupations, &o);
    return;
  }
  for (std::string_view item : SplitCommaList(list)) {
    const int32_t number = ParseIntDigits(item);
    TOccupItem* o = c.model.FindOccup(Number(number));
    const bool on_vector = o != nullptr && o->point != nullptr &&
                           (o->point->base_id == v.first_point->base_id ||
                            o->point->base_id == v.second_point->base_id);
    if (on_vector) {
      LinkOccupation(v.occupations, o);
    } else {
      TraceIndex("Invalid occup index", number, section);
    }
  }
}

}  // namespace

void ParseVectors(Context& c) {
  for (int32_t n = 1; n <= c.counts.vectors; ++n) {
    const std::string section = SectionName("VECTOR:", n);
    if (!c.reader.FindSection(section)) {
      Trace("Not found section: [%s]\n", section.c_str());
      continue;
    }
    int32_t numbers[2];
    ReadVectorPoints(c.reader.GetString("Points"), numbers[0], numbers[1]);
    bool valid = true;
    for (int32_t number : numbers) {
      if (number < 1 || number > c.counts.points) {
        TraceIndex("Invalid point index", number, section);
        valid = false;
        break;
      }
    }
    if (!valid) continue;
    TPointItem* points[2] = {nullptr, nullptr};
    for (int i = 0; i < 2 && valid; ++i) {
      points[i] = c.model.FindPoint(Number(numbers[i]));
      if (points[i] == nullptr) {
        TraceIndex("Not found point", numbers[i], section);
        valid = false;
      }
    }
    if (!valid) continue;

    TVectorItem* vector =
        c.model.vectors.Append(new TVectorItem(static_cast<uint32_t>(n), points[0], points[1]));
    LinkVectorOccupations(c, *vector, section);
    const bool use_static = c.static_engine_loaded;
    vector->property = ItemParameters(c, use_static ? EngineRole::kStatic : EngineRole::kProcessing,
                                      use_static ? c.model.static_params : c.model.engine_params);
  }
}

namespace {

void LinkFanOccupations(Context& c, TFanItem& fan, const std::string& section) {
  const std::string list = c.reader.GetString("Occup");
  if (list.empty()) {
    for (TOccupItem& o : c.model.occupations)
      if (o.point == fan.base_point || o.file == fan.rover_file)
        LinkOccupation(fan.occupations, &o);
    return;
  }
  for (std::string_view item : SplitCommaList(list)) {
    const int32_t number = ParseIntDigits(item);
    TOccupItem* o = c.model.FindOccup(Number(number));
    // An occupation without a point can only belong to the fan through the rover file.
    const bool on_fan = o != nullptr && o->file != nullptr &&
                        ((o->point != nullptr && o->point->base_id == fan.base_point->base_id) ||
                         o->file == fan.rover_file);
    if (!on_fan) {
      TraceIndex("Invalid occup index", number, section);
      continue;
    }
    if (o->point != nullptr && o->point->id != fan.base_point->id) fan.base_point = o->point;
    LinkOccupation(fan.occupations, o);
  }
}

}  // namespace

void ParseFans(Context& c) {
  for (int32_t n = 1; n <= c.counts.fans; ++n) {
    const std::string section = SectionName("FAN:", n);
    if (!c.reader.FindSection(section)) {
      Trace("Not found section: [%s]\n", section.c_str());
      continue;
    }
    const int32_t point_number = c.reader.GetInt("Point", 0);
    if (point_number < 1 || point_number > c.counts.points) {
      TraceIndex("Invalid point index", point_number, section);
      continue;
    }
    const int32_t rover_number = c.reader.GetInt("Rover", 0);
    if (rover_number < 1 || rover_number > c.counts.files) {
      TraceIndex("Invalid rover index", rover_number, section);
      continue;
    }
    TPointItem* point = c.model.FindPoint(Number(point_number));
    TChainItem* rover = c.model.FindFile(Number(rover_number));
    if (point == nullptr) TraceIndex("Not found point", point_number, section);
    if (rover == nullptr) TraceIndex("Not found rover", rover_number, section);
    if (point == nullptr || rover == nullptr) continue;

    TFanItem* fan = c.model.fans.Append(new TFanItem(static_cast<uint32_t>(n), point, rover));
    LinkFanOccupations(c, *fan, section);
    fan->nmea_path = JobPathValue(c, "GGAPath");
    fan->property = ItemParameters(c, EngineRole::kProcessing, c.model.engine_params);
  }
}

}  // namespace vox::job_parser
