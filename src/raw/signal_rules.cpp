#include "raw/signal_rules.h"

#include <array>
#include <cstring>

namespace vox {

namespace {

using SlotTable = std::array<std::array<uint8_t, 128>, 6>;

struct Entry {
  uint8_t group;
  SignalSlot slot;
  std::initializer_list<uint8_t> codes;
};

SlotTable BuildTable() {
  SlotTable t;
  for (auto& row : t)
    row.fill(kNoSlot);
  const Entry entries[] = {
      {0, kL1C, {16}},         {0, kL1P, {20, 21}},
      {0, kL2C, {32, 34, 35}}, {0, kL2P, {36, 37}},
      {0, kL5X, {82, 83}},     {3, kL1C, {16}},
      {3, kL1P, {17, 18, 19}}, {3, kL2C, {32, 34, 35}},
      {3, kL5X, {82, 83}},     {1, kL1C, {16}},
      {1, kL5X, {82}},         {2, kL1C, {16}},
      {2, kL1P, {17}},         {2, kL2C, {33}},
      {2, kL2P, {34}},         {4, kL1C, {18}},
      {4, kL1P, {81, 82, 83}}, {4, kL2C, {113, 114, 115}},
      {4, kL2P, {65, 66, 67}}, {4, kL5X, {97, 98, 100, 102, 103}},
      {5, kL1C, {33, 35}},     {5, kL1P, {34}},
      {5, kL2C, {113, 115}},   {5, kL2P, {114}},
      {5, kL5X, {97, 99}},
  };
  for (const Entry& e : entries)
    for (uint8_t c : e.codes)
      t[e.group][c] = e.slot;
  return t;
}

const SlotTable& Table() {
  static const SlotTable table = BuildTable();
  return table;
}

}  // namespace

DecodedSat DecodeSatCode(uint16_t code, bool two_byte) {
  const unsigned n = code & 63u;
  const unsigned g = two_byte ? (code >> 6) & 15u : (code >> 6) & 3u;
  DecodedSat d;
  d.group = static_cast<uint8_t>(g);
  switch (g) {
    case 0:
      d.sat = MakeSatId(SatSystem::kGps, n);
      break;
    case 1:
      d.sat = MakeSatId(SatSystem::kSbas, n);
      break;
    case 2:
      d.sat = MakeSatId(SatSystem::kGlonass, n);
      break;
    case 3:
      d.sat = MakeSatId(SatSystem::kGps, n + 32);
      break;
    case 4:
      d.sat = MakeSatId(SatSystem::kGalileo, n);
      break;
    case 5:
      d.sat = MakeSatId(SatSystem::kBds, n);
      break;
    default:
      return d;
  }
  d.valid = IsValidSatId(d.sat);
  return d;
}

SignalSlot Slot51(uint8_t group, uint8_t signal_code) {
  if (group >= 6 || signal_code >= 128) return kNoSlot;
  return static_cast<SignalSlot>(Table()[group][signal_code]);
}

SignalSlot Slot8ForMask(unsigned kind) {
  static constexpr SignalSlot kSlots[4] = {kL1P, kL2C, kL1C, kL2P};
  return kSlots[kind & 3];
}

SignalSlot Slot8ForValues(unsigned kind) {
  static constexpr SignalSlot kSlots[4] = {kL1P, kL2P, kL1C, kL2C};
  return kSlots[kind & 3];
}

const char* SignalMaskBitName(int bit) {
  static const char* const kNames[10] = {"CodeL1C",  "CodeL1P",  "CodeL2C",  "CodeL2P",
                                         "CodeL5X",  "PhaseL1C", "PhaseL1P", "PhaseL2C",
                                         "PhaseL2P", "PhaseL5X"};
  return bit >= 0 && bit < 10 ? kNames[bit] : "";
}

float DefaultPressure() {
  const uint32_t bits = 0x447D4FBEu;
  float f;
  std::memcpy(&f, &bits, sizeof f);
  return f;
}

}  // namespace vox
