#include "base/sat.h"

#include <cstdio>

namespace vox {

const char* SystemName(SatSystem system) {
  static const char* const kNames[kSystemCount] = {"GPS", "GLONASS", "BDS", "GALILEO", "SBAS"};
  const auto i = static_cast<unsigned>(system);
  return i < kSystemCount ? kNames[i] : "";
}

std::optional<SatId> SatIdOfIndex(unsigned index) {
  if (index <= 36) return MakeSatId(SatSystem::kGps, index + 1);
  if (index <= 60) return MakeSatId(SatSystem::kGlonass, index - 36);
  if (index <= 97) return MakeSatId(SatSystem::kBds, index - 60);
  if (index <= 127) return MakeSatId(SatSystem::kGalileo, index - 97);
  if (index <= 148) return MakeSatId(SatSystem::kSbas, index - 108);
  return std::nullopt;
}

void SatIndexName(unsigned index, char out[4]) {
  char letter = '?';
  unsigned number = 0;
  if (index <= 31) {
    letter = 'G', number = index + 1;
  } else if (index <= 36) {
    letter = 'J', number = index - 31;
  } else if (index <= 60) {
    letter = 'R', number = index - 36;
  } else if (index <= 97) {
    letter = 'C', number = index - 60;
  } else if (index <= 127) {
    letter = 'E', number = index - 97;
  } else if (index <= 148) {
    letter = 'S', number = index - 108;
  }
  std::snprintf(out, 4, "%c%02u", letter, number % 100);
}

}  // namespace vox
