#include "raw/precise_store.h"

#include <algorithm>
#include <cstring>
#include <new>

namespace vox {

bool PreciseStore::Insert(SatId sat, TimeMs time, double x, double y, double z, float clock) {
  // An invalid identifier can still map into the range (GLONASS 0 onto GPS 37): reject it.
  if (!IsValidSatId(sat)) return false;
  const unsigned index = SatIndexOf(sat);
  if (index >= lists_.size()) return false;
  List& list = lists_[index];

  // The last sample not after the new one; samples mostly arrive in time order.
  PreciseSample* before = nullptr;
  if (list.tail != nullptr && list.tail->time <= time) {
    before = list.tail;
  } else {
    for (PreciseSample* n = list.head; n != nullptr && n->time <= time; n = n->next)
      before = n;
  }
  PreciseSample* after = before != nullptr ? before->next : list.head;
  // One sample per whole second, whichever order the duplicates come in.
  if (before != nullptr && before->time.seconds == time.seconds) return false;
  if (after != nullptr && after->time.seconds == time.seconds) return false;

  void* memory = list.pool.Allocate(sizeof(PreciseSample));
  if (memory == nullptr) return false;
  auto* node = new (memory) PreciseSample{after, time, sat, x, y, z, clock};
  (before != nullptr ? before->next : list.head) = node;
  if (after == nullptr) list.tail = node;
  ++list.count;
  return true;
}

std::optional<PreciseCursor> PreciseStore::Open(SatId sat, uint32_t from, uint32_t to) const {
  if (!IsValidSatId(sat)) return std::nullopt;
  return OpenIndex(SatIndexOf(sat), from, to);
}

std::optional<PreciseCursor> PreciseStore::OpenIndex(unsigned index, uint32_t from,
                                                     uint32_t to) const {
  const List* list = ListAt(index);
  if (list == nullptr) return std::nullopt;
  for (const PreciseSample* n = list->head; n != nullptr; n = n->next) {
    const int64_t t = n->time.seconds;
    // Samples are in time order: once a window starts after the span, so do all later ones.
    if (t - kWindowSeconds > static_cast<int64_t>(to)) break;
    if (std::max<int64_t>(from, t - kWindowSeconds) <= std::min<int64_t>(t + kWindowSeconds, to))
      return PreciseCursor{n->sat, n, true};
  }
  return std::nullopt;
}

std::optional<PreciseCursor> PreciseStore::OpenShort(uint8_t short_number, uint32_t from,
                                                     uint32_t to) const {
  if (short_number == 0) return std::nullopt;
  if (short_number & 0x80) {
    // Only real GLONASS slots: slot 0 or slots past 24 would land in other systems' lists.
    return Open(MakeSatId(SatSystem::kGlonass, short_number - 128u), from, to);
  }
  return OpenIndex(short_number - 1u, from, to);
}

uint32_t PreciseStore::count(unsigned index) const {
  const List* list = ListAt(index);
  return list != nullptr ? list->count : 0;
}

const PreciseSample* PreciseStore::first(unsigned index) const {
  const List* list = ListAt(index);
  return list != nullptr ? list->head : nullptr;
}

const PreciseSample* PreciseStore::last(unsigned index) const {
  const List* list = ListAt(index);
  return list != nullptr ? list->tail : nullptr;
}

void PreciseStore::Clear() {
  for (List& list : lists_) {
    list.pool.Release();
    list.head = list.tail = nullptr;
    list.count = 0;
  }
}

bool GetNextPrecise(PreciseCursor& cursor, vox_PreciseEphemerisData& out) {
  if (cursor.current == nullptr) return false;
  if (!cursor.pending) {
    cursor.current = cursor.current->next;
    if (cursor.current == nullptr) return false;
  }
  const PreciseSample& s = *cursor.current;
  std::memset(&out, 0, sizeof out);
  out.seconds = s.time.seconds;
  out.ms = s.time.ms;
  out.x = s.x;
  out.y = s.y;
  out.z = s.z;
  out.clock = s.clock;
  cursor.pending = false;
  return true;
}

}  // namespace vox
