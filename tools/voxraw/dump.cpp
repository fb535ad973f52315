// voxraw dump: walks a raw observation file record by record with the library's reader and
// decoders and prints each record decoded; a precise orbit file is printed as its samples.
#include <cstdio>
#include <iostream>
#include <nlohmann/json.hpp>
#include <string>

#include "base/buf_file.h"
#include "base/gps_time.h"
#include "raw/precise_store.h"
#include "raw/record_reader.h"
#include "raw/signal_rules.h"
#include "raw/sp3_reader.h"
#include "voxraw.h"

namespace voxraw {

using json = nlohmann::ordered_json;
using namespace vox;

namespace {

json Time(const RawTime& t) {
  const TimeMs m = ToTimeMs(t);
  return json{{"day", t.day}, {"ms_of_day", t.ms_of_day}, {"date", CalendarText(m)}};
}

std::string SatName(SatId sat, bool valid) {
  if (!valid) return "invalid";
  static const char kLetters[] = {'G', 'R', 'C', 'E', 'S'};
  char text[8];
  std::snprintf(text, sizeof text, "%c%02u", kLetters[static_cast<int>(SystemOf(sat))],
                NumberOf(sat));
  return text;
}

json Signal(const SignalBlock& s, const SatBlock& sat, bool tag51) {
  json j{{"flags", s.flags}};
  if (tag51) {
    j["signal_code"] = s.flags & 0x7F;
    const SignalSlot slot = Slot51(sat.group, s.flags & 0x7F);
    j["slot"] = slot == kNoSlot ? "none" : std::string(SignalMaskBitName(slot)).substr(4);
  } else {
    j["kind"] = Kind8(s.flags);
  }
  if (s.flags & kSigCode) j["code"] = s.code;
  if (s.flags & kSigPhase) j["phase"] = s.phase;
  if (s.flags & kSigF32A) j["f32"] = s.f32a;
  if (s.flags & kSigCorrection) j["correction"] = s.correction;
  return j;
}

json Epoch(const RawDecoder& d, ByteSpan b, bool tag51) {
  EpochHeader h;
  size_t n = d.epoch(b, h);
  if (n == 0) return json{{"error", "too short for an epoch header"}};
  b = b.subspan(n);
  json j{{"ms_of_day", h.ms_of_day}, {"flags", h.flags}, {"satellites", h.sat_count}};
  json sats = json::array();
  for (unsigned i = 0; i < h.sat_count; ++i) {
    SatBlock sat;
    n = tag51 ? d.sat_block51(b, sat) : d.sat_block8(b, sat);
    if (n == 0) {
      j["error"] = "satellite blocks run past the record";
      break;
    }
    b = b.subspan(n);
    json js{
        {"sat", SatName(sat.sat, sat.valid)}, {"code", sat.code}, {"b2", sat.b2}, {"b3", sat.b3}};
    json sigs = json::array();
    for (;;) {
      SignalBlock s;
      n = tag51 ? d.signal51(b, s) : d.signal8(b, s);
      if (n == 0) {
        j["error"] = "signal blocks run past the record";
        break;
      }
      b = b.subspan(n);
      sigs.push_back(Signal(s, sat, tag51));
      if (!(s.flags & kSigMore)) break;
    }
    js["signals"] = sigs;
    sats.push_back(js);
    if (j.contains("error")) break;
  }
  j["blocks"] = sats;
  return j;
}

json Record(const RawDecoder& d, uint8_t tag, ByteSpan b) {
  auto short_record = [] { return json{{"error", "record too short"}}; };
  switch (tag) {
    case kTagReceiver: {
      ReceiverRecord r;
      if (!d.receiver(b, r)) return short_record();
      return json{{"kind", "receiver"}, {"s1", r.s1}, {"s2", r.s2},
                  {"s3", r.s3},         {"s4", r.s4}, {"s5", r.s5}};
    }
    case kTagTimeRef: {
      TimeRefRecord r;
      if (!d.time_ref(b, r)) return short_record();
      json j{{"kind", "time reference"},
             {"system", r.IsGps() ? "GPS" : "UTC-based"},
             {"time", Time(r.time)}};
      if (r.has_leap) j["leap_seconds"] = r.leap_seconds;
      return j;
    }
    case kTagEpoch8:
    case kTagEpoch51: {
      json j = Epoch(d, b, tag == kTagEpoch51);
      j["kind"] = "epoch";
      return j;
    }
    case kTagGpsEphemeris:
    case kTagGpsHighEphemeris: {
      GpsEphemerisRecord r;
      if (!d.gps_ephemeris(b, r)) return short_record();
      const unsigned n = tag == kTagGpsHighEphemeris ? r.number + 32u : r.number;
      return json{{"kind", "GPS ephemeris"},
                  {"sat", n},
                  {"time", Time(r.time)},
                  {"passes_check", PassesCheck(r)}};
    }
    case kTagGlonassEphemeris: {
      GlonassEphemerisRecord r;
      if (!d.glonass_ephemeris(b, r)) return short_record();
      return json{{"kind", "GLONASS ephemeris"},
                  {"slot", r.slot},
                  {"time", Time(r.time)},
                  {"position_km", r.position},
                  {"passes_check", PassesCheck(r)}};
    }
    case kTagSbasEphemeris: {
      SbasEphemerisRecord r;
      if (!d.sbas_ephemeris(b, r)) return short_record();
      return json{{"kind", "SBAS ephemeris"},
                  {"sat", r.number},
                  {"time", Time(r.time)},
                  {"reference_seconds", r.reference_seconds},
                  {"passes_check", PassesCheck(r)}};
    }
    case kTagGalileoEphemeris: {
      GalileoEphemerisRecord r;
      if (!d.galileo_ephemeris(b, r)) return short_record();
      return json{{"kind", "GALILEO ephemeris"}, {"sat", r.number}, {"time", Time(r.time)}};
    }
    case kTagBdsEphemeris: {
      BdsEphemerisRecord r;
      if (!d.bds_ephemeris(b, r)) return short_record();
      return json{{"kind", "BDS ephemeris"}, {"sat", r.number}, {"time", Time(r.time)}};
    }
    case kTagSatPosition23:
    case kTagSatPosition56: {
      SatPositionRecord r;
      if (!d.sat_position(b, tag == kTagSatPosition56, r)) return short_record();
      return json{{"kind", "satellite position"}, {"sat", SatName(r.sat, r.valid)},
                  {"time", Time(r.time)},         {"position_km", r.position},
                  {"clock_us", r.clock_us},       {"passes_check", PassesCheck(r)}};
    }
    case kTagMeteoSensor: {
      MeteoSensorRecord r;
      if (!d.meteo_sensor(b, r)) return short_record();
      return json{{"kind", "meteo sensor"},
                  {"selector", r.selector},
                  {"value", r.value},
                  {"name1", r.name1},
                  {"name2", r.name2}};
    }
    case kTagMeteoPosition: {
      MeteoPositionRecord r;
      if (!d.meteo_position(b, r)) return short_record();
      json j{{"kind", "meteo position"}, {"flags", r.flags}};
      if (r.flags & MeteoPositionRecord::kXyzBit) j["xyz"] = {r.x, r.y, r.z};
      if (r.flags & MeteoPositionRecord::kHeightBit) j["height"] = r.height;
      return j;
    }
    case kTagMeteoSample: {
      MeteoSampleRecord r;
      if (!d.meteo_sample(b, r)) return short_record();
      return json{
          {"kind", "meteo sample"}, {"time", Time(r.time)},         {"flags", r.flags},
          {"pressure", r.pressure}, {"temperature", r.temperature}, {"humidity", r.humidity}};
    }
    default:
      return json{{"kind", "not interpreted"}};
  }
}

void Print(const json& record, bool as_json) {
  if (as_json) {
    std::cout << record.dump() << "\n";
    return;
  }
  std::string line;
  for (auto it = record.begin(); it != record.end(); ++it) {
    if (!line.empty()) line += ' ';
    line += it.key() + "=" + (it->is_string() ? it->get<std::string>() : it->dump());
  }
  std::cout << line << "\n";
}

int DumpPrecise(TBufFile& file, bool as_json) {
  PreciseStore store;
  const int status = ReadPreciseOrbitFile(file, store);
  for (unsigned i = 0; i < kSatIndexCount; ++i) {
    char name[4];
    SatIndexName(i, name);
    for (const PreciseSample* p = store.first(i); p != nullptr; p = p->next)
      Print(json{{"sat", name},
                 {"time", CalendarText(p->time)},
                 {"seconds", p->time.seconds},
                 {"xyz_m", {p->x, p->y, p->z}},
                 {"clock_s", p->clock}},
            as_json);
  }
  Print(json{{"end", status == kPreciseFileComplete ? "complete" : "damaged"}, {"status", status}},
        as_json);
  return status == kPreciseFileComplete ? 0 : 1;
}

}  // namespace

int Dump(const std::string& path, bool as_json) {
  TBufFile file;
  if (!file.OpenRead(path)) {
    std::cerr << "voxraw: can not open " << path << "\n";
    return 1;
  }
  uint8_t first[7] = {};
  const uint32_t got = file.Read(first, sizeof first);
  if (!LooksLikeRawFile(first, got)) {
    if (IsPreciseOrbitFile(file)) return DumpPrecise(file, as_json);
    std::cerr << "voxraw: " << path
              << " is neither a raw observation file nor a precise orbit file\n";
    return 2;
  }
  RecordReader reader(file);
  const RawStart start = reader.Start();
  if (start.status != 0) {
    Print(json{{"end", "damaged"}, {"offset", 0}, {"reason", start.message}}, as_json);
    return 1;
  }
  Print(json{{"offset", 0},
             {"tag", 1},
             {"length", reader.length()},
             {"kind", "header"},
             {"byte_order", start.order == ByteOrder::kBig ? "big-endian" : "little-endian"},
             {"type", std::string(1, start.header.type)}},
        as_json);
  const RawDecoder& d = reader.decoder();
  while (reader.next_tag() != kTagEnd) {
    const uint32_t at = reader.next_position() + 2;
    const uint16_t length = reader.next_length();
    const ReadResult r = reader.Next();
    if (r != ReadResult::kOk) {
      Print(json{{"end", "damaged"},
                 {"offset", at},
                 {"length", length},
                 {"reason", r == ReadResult::kBadLength ? "record length outside 5..16384"
                                                        : "file ends inside the record"}},
            as_json);
      return 1;
    }
    json j = json{{"offset", at}, {"tag", reader.tag()}, {"length", reader.length()}};
    j.update(Record(d, reader.tag(), reader.body()));
    Print(j, as_json);
  }
  Print(json{{"end", "complete"}, {"offset", reader.next_position() + 2}}, as_json);
  return 0;
}

}  // namespace voxraw
