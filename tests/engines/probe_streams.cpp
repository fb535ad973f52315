// The probe's raw-data modes: the broadcast and precise ephemerides of chosen satellites, and
// every epoch and satellite of every occupation, written to the report exactly (records as
// hexadecimal bytes, numbers with 17 significant digits) so that the test can decode them
// with its own knowledge of what it wrote.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "probe_modes.h"

namespace probe {
namespace {

// Unused values of a satellite record keep what the buffer held: this marks them.
constexpr double kUnwritten = -7.0;

std::string Hex(const void* data, size_t size) {
  static const char kDigits[] = "0123456789ABCDEF";
  std::string text;
  const uint8_t* bytes = static_cast<const uint8_t*>(data);
  for (size_t i = 0; i < size; ++i) {
    text += kDigits[bytes[i] >> 4];
    text += kDigits[bytes[i] & 15];
  }
  return text;
}

// "G5" -> SatId; 0 for anything else.
SatId ParseSat(const std::string& item) {
  if (item.size() < 2) return 0;
  const char* systems = "GRCES";
  const char* at = std::strchr(systems, item[0]);
  if (at == nullptr) return 0;
  const unsigned long number = std::strtoul(item.c_str() + 1, nullptr, 10);
  return static_cast<SatId>((static_cast<unsigned>(at - systems) << 8) | (number & 0xFF));
}

std::vector<SatId> ParseSats(const char* list) {
  std::vector<SatId> sats;
  std::string item;
  for (const char* p = list;; ++p) {
    if (*p == ',' || *p == '\0') {
      if (SatId sat = ParseSat(item); sat != 0) sats.push_back(sat);
      item.clear();
      if (*p == '\0') break;
    } else if (*p != ' ') {
      item += *p;
    }
  }
  return sats;
}

// The short satellite number of GPS and GLONASS satellites; 0 for the other systems.
uint8_t ShortNumber(SatId sat) {
  const unsigned system = sat >> 8, number = sat & 0xFF;
  if (system == 0) return static_cast<uint8_t>(number);
  if (system == 1) return static_cast<uint8_t>(128 + number);
  return 0;
}

// Reads a short record through a function that returns 0 in every case: a record counts as
// delivered when the call changed the buffer.
template <typename Call>
bool ShortRecord(vox_ShortEphemerisData& out, Call call) {
  std::memset(&out, 0xA5, sizeof out);
  call(&out);
  vox_ShortEphemerisData untouched;
  std::memset(&untouched, 0xA5, sizeof untouched);
  return std::memcmp(&out, &untouched, sizeof out) != 0;
}

void Broadcast(Output& out, SatId sat) {
  const uint32_t from = 0, to = 0xFFFFFFFF;
  void* stream = vox_OpenEphemerisStreamEx(sat, &from, &to);
  std::vector<uint32_t> times;
  vox_EphemerisData rec;
  while (stream != nullptr && vox_GetNextEphemerisEx(stream, &rec) != 0) {
    out.Line("eph sat=%04X rec=%s", sat, Hex(&rec, sizeof rec).c_str());
    times.push_back(rec.head.seconds);
  }
  // Find around every ephemeris time, across the windows of every system.
  static const int32_t kOffsets[] = {-7201, -7200, -3601, -3600, -901, -900, -301, -300, 0,
                                     300,   301,   900,   901,   3600, 3601, 7200, 7201};
  for (uint32_t t : times) {
    for (int32_t d : kOffsets) {
      const uint32_t at = t + static_cast<uint32_t>(d);
      std::memset(&rec, 0, sizeof rec);
      const int32_t found = stream != nullptr ? vox_FindEphemerisEx(stream, &at, &rec) : 0;
      out.Line("eph_find sat=%04X t=%u d=%d found=%d seconds=%u", sat, t, d, found,
               found != 0 ? rec.head.seconds : 0u);
    }
  }
  vox_CloseEphemerisStream(stream);
  out.Line("eph_count sat=%04X open=%d count=%zu", sat, stream != nullptr, times.size());

  const uint8_t number = ShortNumber(sat);
  if (number == 0) return;
  void* short_stream = vox_OpenEphemerisStream(number, &from, &to);
  vox_ShortEphemerisData record;
  int32_t returned = 0;
  for (int guard = 0; short_stream != nullptr && guard < 64; ++guard) {
    if (!ShortRecord(record, [&](vox_ShortEphemerisData* r) {
          returned |= vox_GetNextEphemeris(short_stream, r);
        }))
      break;
    out.Line("eph_short sat=%04X rec=%s", sat, Hex(&record, sizeof record).c_str());
  }
  if (short_stream != nullptr && !times.empty()) {
    const uint32_t at = times.back();
    const bool found = ShortRecord(record, [&](vox_ShortEphemerisData* r) {
      returned |= vox_FindEphemeris(short_stream, &at, r);
    });
    out.Line("eph_short_find sat=%04X t=%u filled=%d rec=%s", sat, at, found,
             found ? Hex(&record, sizeof record).c_str() : "-");
  }
  vox_CloseEphemerisStream(short_stream);
  out.Line("eph_short_done sat=%04X open=%d returned=%d", sat, short_stream != nullptr, returned);
}

void Precise(Output& out, SatId sat) {
  const uint32_t from = 0, to = 0xFFFFFFFF;
  void* stream = vox_OpenPreciseEphemerisStreamEx(sat, &from, &to);
  vox_PreciseEphemerisData rec;
  size_t count = 0;
  while (stream != nullptr && vox_GetNextPreciseEphemeris(stream, &rec) != 0) {
    ++count;
    out.Line("sp3 sat=%04X t=%u.%03u x=%.17g y=%.17g z=%.17g clock=%.9g", sat, rec.seconds, rec.ms,
             rec.x, rec.y, rec.z, static_cast<double>(rec.clock));
  }
  vox_ClosePreciseEphemerisStream(stream);
  // The short form reaches the same samples.
  size_t short_count = 0;
  if (const uint8_t number = ShortNumber(sat); number != 0) {
    void* short_stream = vox_OpenPreciseEphemerisStream(number, &from, &to);
    while (short_stream != nullptr && vox_GetNextPreciseEphemeris(short_stream, &rec) != 0)
      ++short_count;
    vox_ClosePreciseEphemerisStream(short_stream);
  }
  out.Line("sp3_count sat=%04X count=%zu short=%zu", sat, count, short_count);
}

void WalkEpochs(Output& out, uint32_t occupation) {
  void* stream = vox_OpenEpochStream(occupation, 0, nullptr, nullptr);
  vox_EpochData epoch;
  const int32_t before_find = stream != nullptr ? vox_GetNextEpoch(stream, &epoch) : -1;
  out.Line("epochs occ=%08X open=%d before_find=%d", occupation, stream != nullptr, before_find);
  if (stream == nullptr) return;
  size_t count = 0;
  for (int32_t ok = vox_FindEpoch(stream, nullptr, &epoch); ok != 0;
       ok = vox_GetNextEpoch(stream, &epoch)) {
    ++count;
    out.Line("epoch occ=%08X t=%u.%03u count=%u one=%u flags=%08X x=%.1f", occupation,
             epoch.seconds, epoch.ms, epoch.sat_count, epoch.one, epoch.flags, epoch.x);
    for (;;) {
      vox_EpochSatData sat;
      sat.presence = 0xFFFFFFFF;
      for (int i = 0; i < 10; ++i)
        sat.values[i] = kUnwritten;
      if (vox_GetEpochDataEx(stream, &sat) == 0) break;
      std::string values;
      for (int i = 0; i < 10; ++i) {
        char text[32];
        const double v = sat.values[i];
        std::snprintf(text, sizeof text, "%s%.17g", values.empty() ? "" : ",", v);
        values += text;
      }
      out.Line("sat occ=%08X id=%04X b2=%u b3=%u mask=%03X v=%s", occupation, sat.sat, sat.b2,
               sat.b3, sat.presence, values.c_str());
    }
  }
  // In this order: as arguments of one call the two could run the other way round, and a
  // read after the close uses a freed stream.
  vox_EpochSatData after;
  const int read_after = vox_GetEpochDataEx(stream, &after);
  const int closed = vox_CloseEpochStream(stream);
  out.Line("epochs_done occ=%08X count=%zu after=%d close=%d", occupation, count, read_after,
           closed);
}

}  // namespace

void ReadEphemerides(Output& out, const char* satellites) {
  for (SatId sat : ParseSats(satellites)) {
    Broadcast(out, sat);
    Precise(out, sat);
  }
}

void ReadEpochs(Output& out) {
  void* stream = vox_OpenSolOccupStream();
  std::vector<uint32_t> occupations;
  vox_OccupationData record;
  for (;;) {
    record.mask = 0;
    if (stream == nullptr || vox_GetNextSolOccup(stream, &record) == 0) break;
    occupations.push_back(record.occupation_id);
  }
  vox_CloseSolOccupStream(stream);
  for (uint32_t id : occupations)
    WalkEpochs(out, id);
}

}  // namespace probe
