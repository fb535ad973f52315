#include "raw/signal_rules.h"

#include <array>
#include <cstring>

namespace vox {

namespace {

struct SlotTable {
  uint8_t slots[6][128];
};

struct Entry {
  uint8_t group;
  SignalSlot slot;
  uint8_t codes[5];  // zero-terminated
};

// Signal codes of tag-51 blocks by satellite code group and the slot each one fills.
constexpr Entry kEntries[] = {
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

constexpr SlotTable BuildTable() {
  SlotTable t{};
  for (auto& row : t.slots)
    for (uint8_t& v : row)
      v = kNoSlot;
  for (const Entry& e : kEntries)
    for (uint8_t c : e.codes)
      if (c != 0) t.slots[e.group][c] = e.slot;
  return t;
}

constexpr SlotTable kTable = BuildTable();

}  // namespace

namespace detail {
const uint8_t (&kSlot51Table)[6][128] = kTable.slots;
}

SignalSlot Slot51(uint8_t group, uint8_t signal_code) {
  return Slot51Fast(group, signal_code);
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
