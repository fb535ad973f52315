// voxraw info: runs the library's scan over one file and prints what it learned.
#include <iostream>
#include <nlohmann/json.hpp>
#include <string>

#include "base/gps_time.h"
#include "base/sat.h"
#include "job/items.h"
#include "raw/ephemeris_store.h"
#include "raw/meteo_track.h"
#include "raw/precise_store.h"
#include "raw/raw_records.h"
#include "raw/scan.h"
#include "voxraw.h"

namespace voxraw {

using json = nlohmann::ordered_json;
using namespace vox;

namespace {

void CollectLog(void* context, const char* text) {
  *static_cast<std::string*>(context) += text;
}

json MaskNames(uint32_t mask) {
  json names = json::array();
  for (int bit = 0; bit < 10; ++bit)
    if (mask & (1u << bit)) names.push_back(SignalMaskBitName(bit));
  return names;
}

const char* const kCopyRules[6] = {"L1_to_CA_code",  "L1_to_CA_phase",  "CA_to_L1_code",
                                   "CA_to_L1_phase", "L2C_to_L2P_code", "L2C_to_L2P_phase"};

json Describe(const TChainItem& f, const ScanDetails& d, const EphemerisStore& eph,
              const PreciseStore& precise, const MeteoTrackList& meteo, int status,
              const std::string& log) {
  json j;
  j["file"] = f.path;
  j["kind"] = d.kind == ScanDetails::Kind::kRaw       ? "raw observation file"
              : d.kind == ScanDetails::Kind::kPrecise ? "precise orbit file"
                                                      : "unknown";
  j["status"] = status;
  j["status_text"] = status == kScanComplete     ? "read to its end"
                     : status == kScanEndedEarly ? "ended early"
                     : status == kScanNotUsable  ? "not usable"
                                                 : "can not be opened";
  if (d.kind == ScanDetails::Kind::kRaw) {
    j["byte_order"] = d.order == ByteOrder::kBig ? "big-endian" : "little-endian";
    j["receiver"] = f.receiver_text;
    j["epochs"] = f.epoch_count;
    j["first_epoch"] = CalendarText(f.first_epoch);
    j["last_epoch"] = CalendarText(f.last_epoch);
    j["interval_ms"] = f.epoch_interval_ms;
    j["max_satellites"] = f.max_satellites;
    json seen = json::array();
    for (unsigned i = 0; i < kSatIndexCount; ++i) {
      if (!d.satellites_seen.test(i)) continue;
      char name[4];
      SatIndexName(i, name);
      seen.push_back(name);
    }
    j["satellites"] = seen;
    json masks, copies;
    for (int s = 0; s < kSystemCount; ++s) {
      const char* system = SystemName(static_cast<SatSystem>(s));
      masks[system] = MaskNames(f.signal_masks[s]);
      json rules = json::array();
      for (int g = 0; g < 6; ++g)
        if (f.force_copy[g][s]) rules.push_back(kCopyRules[g]);
      copies[system] = rules;
    }
    j["signal_masks"] = masks;
    j["force_copy"] = copies;
    char mask_text[16];
    std::snprintf(mask_text, sizeof mask_text, "%08X", f.c2_usable_mask);
    j["c2"] = {
        {"offset", f.c2_l2_offset}, {"usable_mask", mask_text}, {"enabled", f.c2_usable_mask != 0}};
    j["stop_offset"] = d.stop_offset;
    uint32_t samples = 0;
    for (const TMeteoTrack& t : meteo)
      samples += t.sample_count;
    j["meteo_samples"] = samples;
  }
  json ephemerides, positions;
  for (unsigned i = 0; i < kSatIndexCount; ++i) {
    char name[4];
    SatIndexName(i, name);
    if (eph.Count(i)) ephemerides[name] = eph.Count(i);
    if (precise.count(i)) positions[name] = precise.count(i);
  }
  j["ephemerides"] = ephemerides.is_null() ? json::object() : ephemerides;
  j["precise_samples"] = positions.is_null() ? json::object() : positions;
  j["log"] = log;
  return j;
}

void PrintText(const json& j) {
  for (auto it = j.begin(); it != j.end(); ++it) {
    if (it.key() == "log") continue;
    if (it->is_object()) {
      std::cout << it.key() << ":\n";
      for (auto sub = it->begin(); sub != it->end(); ++sub)
        std::cout << "  " << sub.key() << ": "
                  << (sub->is_string() ? sub->get<std::string>() : sub->dump()) << "\n";
    } else {
      std::cout << it.key() << ": " << (it->is_string() ? it->get<std::string>() : it->dump())
                << "\n";
    }
  }
  std::cout << "scan log:\n" << j["log"].get<std::string>();
}

}  // namespace

int Info(const std::string& path, bool as_json) {
  TChainItem file(1, path, false, false);
  EphemerisStore eph;
  PreciseStore precise;
  MeteoTrackList meteo;
  ScanDetails details;
  std::string log;
  ScanSinks sinks;
  sinks.ephemerides = &eph;
  sinks.precise = &precise;
  sinks.meteo = &meteo;
  sinks.log = {&CollectLog, &log};
  sinks.details = &details;
  const int status = ScanFile(file, sinks);
  const json j = Describe(file, details, eph, precise, meteo, status, log);
  if (as_json)
    std::cout << j.dump(2) << "\n";
  else
    PrintText(j);
  if (details.kind == ScanDetails::Kind::kNone && status == kScanNotUsable) return 2;
  return status == kScanComplete ? 0 : 1;
}

}  // namespace voxraw
