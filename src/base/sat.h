// Satellite identifiers (SatId) and the dense satellite index (SatIndex) of the stores.
#pragma once

#include <cstdint>
#include <optional>

#include "vox/vox_sdk_core.h"

namespace vox {

enum class SatSystem : uint8_t { kGps = 0, kGlonass = 1, kBds = 2, kGalileo = 3, kSbas = 4 };
constexpr int kSystemCount = 5;
constexpr int kSatIndexCount = 149;

// "GPS", "GLONASS", "BDS", "GALILEO", "SBAS".
const char* SystemName(SatSystem system);

constexpr SatId MakeSatId(SatSystem system, unsigned number) {
  return static_cast<SatId>((static_cast<unsigned>(system) << 8) | (number & 0xFF));
}
constexpr SatSystem SystemOf(SatId id) { return static_cast<SatSystem>((id >> 8) & 7); }
constexpr unsigned NumberOf(SatId id) { return id & 0xFF; }

// Valid satellite numbers: GPS 1-37, GLONASS 1-24, BDS 1-37, GALILEO 1-30, SBAS 20-40.
constexpr bool IsValidSatellite(SatSystem system, unsigned number) {
  switch (system) {
    case SatSystem::kGps: return number >= 1 && number <= 37;
    case SatSystem::kGlonass: return number >= 1 && number <= 24;
    case SatSystem::kBds: return number >= 1 && number <= 37;
    case SatSystem::kGalileo: return number >= 1 && number <= 30;
    case SatSystem::kSbas: return number >= 20 && number <= 40;
  }
  return false;
}
constexpr bool IsValidSatId(SatId id) {
  return ((id >> 8) & 7) < kSystemCount && IsValidSatellite(SystemOf(id), NumberOf(id));
}

// GPS number - 1, GLONASS + 36, BDS + 60, GALILEO + 97, SBAS + 108. Returns kSatIndexCount or
// more for an identifier that names no store entry.
constexpr unsigned SatIndexOf(SatId id) {
  const unsigned n = NumberOf(id);
  switch ((id >> 8) & 7) {
    case 0: return n - 1;
    case 1: return n + 36;
    case 2: return n + 60;
    case 3: return n + 97;
    case 4: return n + 108;
  }
  return 0xFFFF;
}
std::optional<SatId> SatIdOfIndex(unsigned index);

// Three-character name of a satellite index as the engine-log listing shows it: G01-G32,
// J01-J05, R01-R24, C01-C37, E01-E30, S20-S40.
void SatIndexName(unsigned index, char out[4]);

}  // namespace vox
