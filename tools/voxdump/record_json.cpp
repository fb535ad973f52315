#include "record_json.h"

#include <cstdio>
#include <type_traits>

namespace vox::tools {
namespace {

std::string Hex(uint32_t v, int digits = 8) {
  char text[16];
  std::snprintf(text, sizeof text, "0x%0*X", digits, v);
  return text;
}

// Single-precision values shown with the digits they carry, not their widened double's.
Json F(float v) {
  char text[32];
  std::snprintf(text, sizeof text, "%.7g", static_cast<double>(v));
  Json parsed = Json::parse(text, nullptr, false);
  return parsed.is_discarded() ? Json(nullptr) : parsed;  // nan and inf have no JSON form
}

Json Time(const RecTime& t) {
  return Json{{"date", CalendarText(t)}, {"gps_seconds", t.gps_seconds()}};
}

template <typename T, size_t N>
Json Array(const T (&values)[N], size_t count = N) {
  Json a = Json::array();
  for (size_t i = 0; i < count; ++i)
    a.push_back(values[i]);
  return a;
}

template <size_t N>
Json HexArray(const uint32_t (&values)[N], size_t count = N) {
  Json a = Json::array();
  for (size_t i = 0; i < count; ++i)
    a.push_back(Hex(values[i]));
  return a;
}

void Join(std::string& out, const std::string& part) {
  if (!out.empty()) out += '|';
  out += part;
}

void Flags(Json& j, const char* key, uint32_t value, const std::string& names, int digits = 8) {
  j[key] = Hex(value, digits);
  j[std::string(key) + "_names"] = names;
}

std::string MessageTypeNames(uint32_t type) {
  std::string out = "type=" + std::to_string(type & 0x1F);
  if (type & 0x20) Join(out, "open-level");
  if (type & 0x40) Join(out, "close-level");
  if (type & 0x80) Join(out, "mark");
  return out;
}

std::string FanFlagNames(uint32_t flags) {
  return (flags & 0x80000000) ? "has-position" : "";
}

std::string RayFlagNames(uint32_t flags) {
  std::string out = "fix=" + std::to_string(flags & 3);
  if (flags & 0x80000000) Join(out, "bit3");
  for (int bit = 2; bit <= 30; ++bit) {
    if (flags & (1u << bit)) Join(out, "bit" + std::to_string(bit));
  }
  return out;
}

std::string SatelliteFlagNames(uint16_t flags) {
  static const char* kCombination[8] = {"", "L1", "L2", "plus", "minus", "iono-free", "L5", "7"};
  std::string out;
  if (flags & 7) Join(out, kCombination[flags & 7]);
  if (flags & 0x100) Join(out, "pair");
  if (flags & 0x400) Join(out, "code");
  if (flags & 0x10) Join(out, "bit8");
  if (flags & 0x20) Join(out, "bit9");
  if (flags & 0x200) Join(out, "bit14");
  if (flags & 0x8000) Join(out, "bit15");
  return out;
}

std::string Satellite16(uint16_t code) {
  static const char kGroups[] = "GSRJEC??????????";
  char text[8];
  std::snprintf(text, sizeof text, "%c%02u", kGroups[(code >> 6) & 0xF], code & 0x3F);
  return text;
}

void Span(Json& j, const SpanFields& s) {
  j["span_start"] = Time(s.start);
  j["span_end"] = Time(s.end);
  j["span_value1"] = s.value1;
  j["span_value2"] = s.value2;
  j["span_float"] = F(s.value);
  j["span_name"] = s.name;
}

}  // namespace

std::string VectorFlagNames(uint32_t flags) {
  std::string out;
  if (flags & 0x80000000) Join(out, "solved");
  if (flags & 0x40000000) Join(out, "rms-over-limit");
  for (int bit = 29; bit >= 25; --bit) {
    if (flags & (1u << bit)) Join(out, "fail-bit" + std::to_string(bit));
  }
  if (flags & 0x01000000) Join(out, "fail-bit24");
  if (flags & 0x40000) Join(out, "bit18");
  if (flags & 0x1000) Join(out, "extra-value");
  if (flags & 0x800) Join(out, "reversed");
  if (flags & 0x400) Join(out, "bit10");
  if (flags & 0x300) Join(out, "bits8-9=" + std::to_string((flags >> 8) & 3));
  if (flags & 0xF0) Join(out, "kind=" + Hex(flags & 0xF0, 2));
  if (flags & 0xC) Join(out, "bits2-3=" + std::to_string((flags >> 2) & 3));
  if (flags & 0x3) Join(out, "bits0-1=" + std::to_string(flags & 3));
  return out;
}

std::string PlotLineFlagNames(uint16_t flags) {
  if (flags & 0x4000) return "raw-line=" + std::to_string(flags & 0x3FF);
  static const char* kCombination[8] = {"",      "first-frequency", "second-frequency", "plus",
                                        "minus", "iono-free",       "third-frequency",  "7"};
  std::string out;
  if (flags & 7) Join(out, kCombination[flags & 7]);
  if ((flags & 0x210) == 0x210) Join(out, "option-m");
  if (flags & 0x20) Join(out, "option-c");
  if (flags & 0x100) Join(out, "pair");
  if (flags & 0x400) Join(out, "code-signal");
  return out;
}

std::string RecordDescriber::LineName(bool v101, uint16_t stream_id, uint16_t index) const {
  if (v101) {
    auto it = v101_names_.find({stream_id, index});
    return it != v101_names_.end() ? it->second : "";
  }
  auto it = v100_names_.find(index);
  return it != v100_names_.end() ? it->second : "";
}

Json RecordDescriber::Describe(const Record& record) {
  Json j;
  j["offset"] = record.offset;
  j["kind"] = record.kind;
  j["name"] = KindName(record.kind);
  std::visit(
      [&](const auto& r) {
        using T = std::decay_t<decltype(r)>;
        if constexpr (std::is_same_v<T, HeaderRec>) {
          j["magic"] = r.magic;
          j["format"] = r.format;
        } else if constexpr (std::is_same_v<T, MessageRec>) {
          Flags(j, "type", r.type, MessageTypeNames(r.type), 2);
          j["depth"] = r.depth;
          j["text"] = r.text;
        } else if constexpr (std::is_same_v<T, SolutionStartRec>) {
          j["solution_type"] = r.type;
          j["solution_flags"] = Hex(r.flags);
        } else if constexpr (std::is_same_v<T, VectorRec>) {
          j["vector"] = Hex(r.number);
          Flags(j, "flags", r.flags, VectorFlagNames(r.flags));
          j["base"] = Array(r.base);
          j["baseline"] = Array(r.baseline);
          j["values_32"] = HexArray(r.values_32);
          j["value_48"] = F(r.value_48);
          j["value_52"] = F(r.value_52);
          j["values_80"] = HexArray(r.values_80);
          j["value_96"] = F(r.value_96);
          j["value_100"] = F(r.value_100);
          if (r.has_span) {
            j["from_point"] = Hex(r.from_point);
            j["to_point"] = Hex(r.to_point);
            Span(j, r.span);
          }
          if (r.has_extra) {
            j["extra_marker"] = r.extra_marker;
            j["extra"] = F(r.extra);
          }
        } else if constexpr (std::is_same_v<T, OccupationRec>) {
          j["occupation"] = Hex(r.occupation);
          j["point"] = Hex(r.point);
          j["antenna"] = Hex(r.antenna);
          j["first_epoch"] = Time(r.first);
          j["last_epoch"] = Time(r.last);
          j["epochs"] = r.epochs;
          j["l1_offsets"] = Array(r.l1_offsets);
          j["l2_offsets"] = Array(r.l2_offsets);
          j["nav"] = Array(r.nav);
          j["nav_sigma"] = Array(r.nav_sigma);
          j["point_name"] = r.point_name;
          j["receiver"] = r.receiver;
          j["antenna_name"] = r.antenna_name;
        } else if constexpr (std::is_same_v<T, FanRec>) {
          j["fan"] = Hex(r.number);
          Flags(j, "flags", r.flags, FanFlagNames(r.flags));
          j["position"] = Array(r.position);
          if (r.has_span) {
            j["fan_id"] = Hex(r.fan_id);
            Span(j, r.span);
          }
        } else if constexpr (std::is_same_v<T, RayRec>) {
          j["fan"] = Hex(r.fan);
          Flags(j, "flags", r.flags, RayFlagNames(r.flags));
          j["time"] = Time(r.time);
          j["offset_xyz"] = Array(r.offset);
          j["values"] = HexArray(r.values);
          j["hdop"] = F(r.hdop);
          j["satellites"] = r.satellites;
        } else if constexpr (std::is_same_v<T, PlotLineRec>) {
          if (r.v101) {
            j["stream"] = r.stream_id;
            Flags(j, "line_flags", r.flags, PlotLineFlagNames(r.flags), 4);
            j["sat_a"] = Satellite16(r.sat_a);
            j["sat_b"] = Satellite16(r.sat_b);
            v101_names_[{r.stream_id, r.index}] = r.name;
          } else {
            j["value"] = r.value;
            v100_names_[r.index] = r.name;
          }
          j["line"] = r.index;
          j["line_name"] = r.name;
        } else if constexpr (std::is_same_v<T, PlotEpochRec>) {
          j["time"] = Time(r.time);
          j["stream"] = r.stream_id;
          j["count"] = r.values.size();
          Json values = Json::array();
          for (const PlotValue& v : r.values) {
            Json e;
            if (r.v101) {
              e["line"] = v.index;
              e["line_name"] = LineName(true, r.stream_id, v.index);
            } else {
              Flags(e, "line_flags", v.flags, PlotLineFlagNames(v.flags), 4);
              e["sat_a"] = v.sat_a;
              e["sat_b"] = v.sat_b;
            }
            e["value"] = F(v.value);
            values.push_back(std::move(e));
          }
          j["values"] = std::move(values);
        } else if constexpr (std::is_same_v<T, SatelliteRec>) {
          Flags(j, "flags", r.flags, SatelliteFlagNames(r.flags), 4);
          j["plot_counter"] = r.plot_counter;
          const bool wide = record.kind == 52 || record.kind == 55;
          j["code_a"] = wide ? Satellite16(r.code_a) : Hex(r.code_a, 2);
          j["code_b"] = wide ? Satellite16(r.code_b) : Hex(r.code_b, 2);
          if (r.timed) {
            j["time1"] = Time(r.time1);
            j["time2"] = Time(r.time2);
            j["value"] = r.value;
            j["value_f"] = F(r.value_f);
            j["values"] = HexArray(r.values);
          } else {
            j["values"] = HexArray(r.values, 3);
          }
        } else if constexpr (std::is_same_v<T, UnknownRec>) {
          j["payload_bytes"] = r.payload.size();
        }
      },
      record.body);
  return j;
}

namespace {

std::string Text(const std::string& key, const Json& v);

std::string TextValue(const Json& v) {
  if (v.is_object()) {
    if (v.contains("date")) {
      char seconds[32];
      std::snprintf(seconds, sizeof seconds, "%.3f", v["gps_seconds"].get<double>());
      return v["date"].get<std::string>() + " (GPS " + seconds + " s)";
    }
    std::string out = "{";
    for (auto it = v.begin(); it != v.end(); ++it) {
      if (out.size() > 1) out += ' ';
      out += Text(it.key(), it.value());
    }
    return out + "}";
  }
  if (v.is_array()) {
    std::string out = "(";
    for (size_t i = 0; i < v.size(); ++i)
      out += (i ? ", " : "") + TextValue(v[i]);
    return out + ")";
  }
  if (v.is_string()) {
    const std::string s = v.get<std::string>();
    if (s.rfind("0x", 0) == 0) return s;
    return v.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
  }
  return v.dump();
}

std::string Text(const std::string& key, const Json& v) {
  if (key.size() > 6 && key.compare(key.size() - 6, 6, "_names") == 0) {
    return "[" + v.get<std::string>() + "]";
  }
  return key + "=" + TextValue(v);
}

}  // namespace

std::string TextLine(const Json& d) {
  std::string out = "@" + std::to_string(d["offset"].get<uint64_t>()) + " " +
                    d["name"].get<std::string>() + "(" + std::to_string(d["kind"].get<int>()) + ")";
  for (auto it = d.begin(); it != d.end(); ++it) {
    if (it.key() == "offset" || it.key() == "kind" || it.key() == "name") continue;
    out += (it.key().size() > 6 && it.key().ends_with("_names")) ? "" : " ";
    out += Text(it.key(), it.value());
  }
  return out;
}

}  // namespace vox::tools
