#include "result_reader.h"

#include <bit>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iterator>

namespace vox::tools {
namespace {

constexpr size_t kFrame = 5;

// A decoding error inside one record's payload, at a position relative to the payload.
struct PayloadError {
  size_t at;
  std::string what;
};

// Reads little-endian fields from one record's payload, refusing to pass its end.
class Cursor {
 public:
  Cursor(std::span<const uint8_t> payload, const std::string& kind) : p_(payload), kind_(kind) {}

  template <typename T>
  T Get(const char* field) {
    Need(sizeof(T), field);
    T v;
    uint8_t b[sizeof(T)];
    for (size_t i = 0; i < sizeof(T); ++i)
      b[i] = p_[at_ + i];  // stored little-endian
    std::memcpy(&v, b, sizeof(T));
    at_ += sizeof(T);
    return v;
  }
  RecTime Time(const char* field) {
    RecTime t;
    t.ms_of_day = Get<uint32_t>(field);
    t.day = Get<uint32_t>(field);
    return t;
  }
  std::string Counted(const char* field) {
    const uint8_t n = Get<uint8_t>(field);
    Need(n, field);
    std::string s(reinterpret_cast<const char*>(p_.data() + at_), n);
    at_ += n;
    return s;
  }
  void Skip(size_t n, const char* field) {
    Need(n, field);
    at_ += n;
  }
  size_t left() const { return p_.size() - at_; }
  size_t at() const { return at_; }
  // The payload must end here.
  void End() {
    if (left() != 0) {
      throw PayloadError{at_, kind_ + " payload ends after " + std::to_string(at_) +
                                  " bytes, found " + std::to_string(p_.size())};
    }
  }
  void Exact(size_t size) {
    if (p_.size() != size) {
      throw PayloadError{0, kind_ + " payload of " + std::to_string(size) + " bytes, found " +
                                std::to_string(p_.size())};
    }
  }

 private:
  void Need(size_t n, const char* field) {
    if (left() < n) {
      throw PayloadError{at_, std::string(field) + " of " + kind_ + " (" + std::to_string(n) +
                                  " bytes), only " + std::to_string(left()) +
                                  " bytes left in the record"};
    }
  }
  std::span<const uint8_t> p_;
  size_t at_ = 0;
  std::string kind_;
};

SpanFields ReadSpan(Cursor& c) {
  SpanFields s;
  s.start = c.Time("span start");
  s.end = c.Time("span end");
  s.value1 = c.Get<uint32_t>("span value 1");
  s.value2 = c.Get<uint32_t>("span value 2");
  s.value = c.Get<float>("span float");
  s.name = c.Counted("span name");
  return s;
}

VectorRec ReadVector(Cursor& c, bool with_span) {
  if (!with_span) c.Exact(104);
  VectorRec v;
  v.number = c.Get<uint32_t>("vector number");
  v.flags = c.Get<uint32_t>("flags");
  for (double& d : v.base)
    d = c.Get<double>("base position");
  for (uint32_t& u : v.values_32)
    u = c.Get<uint32_t>("values");
  v.value_48 = c.Get<float>("value");
  v.value_52 = c.Get<float>("value");
  for (double& d : v.baseline)
    d = c.Get<double>("baseline");
  for (uint32_t& u : v.values_80)
    u = c.Get<uint32_t>("values");
  v.value_96 = c.Get<float>("value");
  v.value_100 = c.Get<float>("value");
  if (with_span) {
    v.has_span = true;
    v.from_point = c.Get<uint32_t>("from-point");
    v.to_point = c.Get<uint32_t>("to-point");
    v.span = ReadSpan(c);
    if (v.flags & 0x1000) {
      v.has_extra = true;
      v.extra_marker = c.Get<uint32_t>("extra marker");
      v.extra = c.Get<float>("extra value");
    }
  }
  c.End();
  return v;
}

OccupationRec ReadOccupation(Cursor& c) {
  OccupationRec o;
  o.occupation = c.Get<uint32_t>("occupation number");
  o.point = c.Get<uint32_t>("point number");
  o.antenna = c.Get<uint32_t>("antenna number");
  o.first = c.Time("first epoch");
  o.last = c.Time("last epoch");
  o.epochs = c.Get<uint32_t>("epoch count");
  for (float& f : o.l1_offsets)
    f = c.Get<float>("L1 offsets");
  for (float& f : o.l2_offsets)
    f = c.Get<float>("L2 offsets");
  for (double& d : o.nav)
    d = c.Get<double>("navigation coordinates");
  for (float& f : o.nav_sigma)
    f = c.Get<float>("navigation deviations");
  o.point_name = c.Counted("point name");
  o.receiver = c.Counted("receiver text");
  o.antenna_name = c.Counted("antenna name");
  c.End();
  return o;
}

FanRec ReadFan(Cursor& c, bool with_span) {
  if (!with_span) c.Exact(80);
  FanRec f;
  f.number = c.Get<uint32_t>("fan number");
  f.flags = c.Get<uint32_t>("flags");
  for (double& d : f.position)
    d = c.Get<double>("position");
  if (with_span) {
    f.has_span = true;
    f.fan_id = c.Get<uint32_t>("fan identifier");
    f.span = ReadSpan(c);
    c.End();
  }
  return f;
}

RayRec ReadRay(Cursor& c) {
  c.Exact(60);
  RayRec r;
  r.fan = c.Get<uint32_t>("fan number");
  r.flags = c.Get<uint32_t>("flags");
  r.time = c.Time("time");
  for (double& d : r.offset)
    d = c.Get<double>("position");
  for (uint32_t& u : r.values)
    u = c.Get<uint32_t>("values");
  r.hdop = c.Get<float>("hdop");
  r.satellites = c.Get<uint32_t>("satellite count");
  return r;
}

PlotLineRec ReadPlotLine(Cursor& c, bool v101) {
  PlotLineRec l;
  l.v101 = v101;
  if (v101) {
    l.stream_id = c.Get<uint16_t>("stream id");
    l.flags = c.Get<uint16_t>("line flags");
    l.sat_a = c.Get<uint16_t>("satellite A");
    l.sat_b = c.Get<uint16_t>("satellite B");
    l.index = c.Get<uint16_t>("line index");
  } else {
    l.index = c.Get<uint16_t>("line index");
    l.value = c.Get<uint8_t>("line value");
  }
  l.name = c.Counted("line name");
  c.End();
  return l;
}

PlotEpochRec ReadPlotEpoch(Cursor& c, bool v101) {
  PlotEpochRec e;
  e.v101 = v101;
  e.time = c.Time("epoch time");
  e.stream_id = c.Get<uint16_t>("stream id");
  const uint16_t count = c.Get<uint16_t>("value count");
  const size_t entry = v101 ? 6 : 8;
  if (c.left() != count * entry) {
    throw PayloadError{c.at(), std::to_string(count) + " plot values (" +
                                   std::to_string(count * entry) + " bytes), found " +
                                   std::to_string(c.left()) + " bytes"};
  }
  for (uint16_t i = 0; i < count; ++i) {
    PlotValue v;
    if (v101) {
      v.index = c.Get<uint16_t>("line index");
    } else {
      v.flags = c.Get<uint16_t>("line flags");
      v.sat_a = c.Get<uint8_t>("satellite A");
      v.sat_b = c.Get<uint8_t>("satellite B");
    }
    v.value = c.Get<float>("value");
    e.values.push_back(v);
  }
  return e;
}

SatelliteRec ReadSatellite(Cursor& c, uint8_t kind) {
  const bool timed = kind == 39 || kind == 52;
  const bool wide = kind == 52 || kind == 55;
  c.Exact(kind == 38 ? 18 : kind == 39 ? 46 : kind == 52 ? 48 : 20);
  SatelliteRec s;
  s.timed = timed;
  if (timed) {
    s.flags = c.Get<uint16_t>("flags");
    s.plot_counter = c.Get<uint16_t>("plot counter");
  } else {
    s.plot_counter = c.Get<uint16_t>("plot counter");
    s.flags = c.Get<uint16_t>("flags");
  }
  if (wide) {
    s.code_a = c.Get<uint16_t>("satellite A");
    s.code_b = c.Get<uint16_t>("satellite B");
  } else {
    s.code_a = c.Get<uint8_t>("satellite A");
    s.code_b = c.Get<uint8_t>("satellite B");
  }
  if (timed) {
    s.time1 = c.Time("time 1");
    s.time2 = c.Time("time 2");
    s.value = c.Get<uint32_t>("value");
    s.value_f = c.Get<float>("value");
    for (uint32_t& u : s.values)
      u = c.Get<uint32_t>("values");
  } else {
    for (int i = 0; i < 3; ++i)
      s.values[i] = c.Get<uint32_t>("values");
  }
  return s;
}

RecordBody Decode(uint8_t kind, std::span<const uint8_t> payload) {
  Cursor c(payload, KindName(kind));
  switch (kind) {
    case 0:
      c.Exact(0);
      return EndRec{};
    case 1: {
      c.Exact(10);
      HeaderRec h;
      h.magic.assign(reinterpret_cast<const char*>(payload.data()), 4);
      c.Skip(4, "magic");
      h.format = c.Get<uint32_t>("format number");
      h.reserved = c.Get<uint16_t>("reserved");
      return h;
    }
    case 29: {
      MessageRec m;
      m.type = c.Get<uint32_t>("message type");
      m.depth = c.Get<uint32_t>("nesting depth");
      m.text = c.Counted("message text");
      c.End();
      return m;
    }
    case 30: {
      c.Exact(8);
      SolutionStartRec s;
      s.type = c.Get<uint32_t>("solution type");
      s.flags = c.Get<uint32_t>("solution flags");
      return s;
    }
    case 33:
      return ReadVector(c, false);
    case 40:
      return ReadVector(c, true);
    case 34:
      return ReadOccupation(c);
    case 35:
      return ReadFan(c, false);
    case 41:
      return ReadFan(c, true);
    case 36:
      return ReadRay(c);
    case 4:
      return ReadPlotLine(c, false);
    case 53:
      return ReadPlotLine(c, true);
    case 37:
      return ReadPlotEpoch(c, false);
    case 54:
      return ReadPlotEpoch(c, true);
    case 38:
    case 39:
    case 52:
    case 55:
      return ReadSatellite(c, kind);
    default:
      return UnknownRec{{payload.begin(), payload.end()}};
  }
}

uint16_t Load16(const uint8_t* p) {
  return static_cast<uint16_t>(p[0] | (p[1] << 8));
}

// Days since 1980-01-06 to a civil date.
void CivilFromGpsDay(uint32_t gps_day, int& y, unsigned& m, unsigned& d) {
  const long z = static_cast<long>(gps_day) + 3657 + 719468;  // days since 0000-03-01
  const long era = z / 146097;
  const auto doe = static_cast<unsigned>(z - era * 146097);
  const unsigned yoe = (doe - doe / 1460 + doe / 36524 - doe / 146096) / 365;
  const unsigned doy = doe - (365 * yoe + yoe / 4 - yoe / 100);
  const unsigned mp = (5 * doy + 2) / 153;
  d = doy - (153 * mp + 2) / 5 + 1;
  m = mp < 10 ? mp + 3 : mp - 9;
  y = static_cast<int>(yoe + era * 400 + (m <= 2));
}

}  // namespace

std::string CalendarText(const RecTime& t) {
  int y;
  unsigned m, d;
  const uint32_t extra_days = t.ms_of_day / 86400000;  // tolerate an unnormalised time
  CivilFromGpsDay(t.day + extra_days, y, m, d);
  const uint32_t ms = t.ms_of_day % 86400000;
  char text[40];
  std::snprintf(text, sizeof text, "%04d-%02u-%02u %02u:%02u:%02u.%03u", y, m, d, ms / 3600000,
                ms / 60000 % 60, ms / 1000 % 60, ms % 1000);
  return text;
}

std::string KindName(uint8_t kind) {
  switch (kind) {
    case 0:
      return "end";
    case 1:
      return "header";
    case 4:
      return "plot-line-v100";
    case 29:
      return "message";
    case 30:
      return "solution-start";
    case 33:
      return "vector";
    case 34:
      return "occupation";
    case 35:
      return "fan";
    case 36:
      return "ray";
    case 37:
      return "plot-epoch-v100";
    case 38:
      return "satellite-a";
    case 39:
      return "satellite-b";
    case 40:
      return "vector-span";
    case 41:
      return "fan-span";
    case 52:
      return "satellite-c";
    case 53:
      return "plot-line";
    case 54:
      return "plot-epoch";
    case 55:
      return "satellite-d";
    default:
      return "kind-" + std::to_string(kind);
  }
}

ReadResult ReadResultBytes(std::span<const uint8_t> bytes) {
  ReadResult out;
  size_t at = 0;
  while (at < bytes.size()) {
    const size_t left = bytes.size() - at;
    if (left < kFrame) {
      out.fault = ReadFault{at, "a record of at least 5 bytes, found " + std::to_string(left) +
                                    " bytes at the end of the file"};
      break;
    }
    const uint8_t kind = bytes[at];
    const uint16_t length = Load16(&bytes[at + 1]);
    if (length < kFrame) {
      out.fault = ReadFault{at + 1, "a record length of at least 5, found " +
                                        std::to_string(length) + " (" + KindName(kind) + ")"};
      break;
    }
    if (length > left) {
      out.fault = ReadFault{at, "a " + KindName(kind) + " record of " + std::to_string(length) +
                                    " bytes, only " + std::to_string(left) +
                                    " bytes left: the file is cut short"};
      break;
    }
    const uint16_t trailer = Load16(&bytes[at + length - 2]);
    if (trailer != length) {
      out.fault = ReadFault{at + length - 2, "the trailing length " + std::to_string(length) +
                                                 " of the " + KindName(kind) + " record, found " +
                                                 std::to_string(trailer)};
      break;
    }
    try {
      out.records.push_back(
          Record{at, kind, length, Decode(kind, bytes.subspan(at + 3, length - kFrame))});
    } catch (const PayloadError& e) {
      out.fault = ReadFault{at + 3 + e.at, e.what};
      break;
    }
    at += length;
  }
  return out;
}

ReadResult ReadResultFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  if (!in) {
    ReadResult out;
    out.fault = ReadFault{0, "a readable file at " + path};
    return out;
  }
  const std::vector<uint8_t> bytes{std::istreambuf_iterator<char>(in),
                                   std::istreambuf_iterator<char>()};
  return ReadResultBytes(bytes);
}

}  // namespace vox::tools
