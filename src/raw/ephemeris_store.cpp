#include "raw/ephemeris_store.h"

#include <algorithm>
#include <new>
#include <optional>

namespace vox {

namespace {

bool InRange(SatSystem system, unsigned number) {
  return IsValidSatellite(system, number);
}

bool SameStaticSbas(const vox_EphemerisData& a, const vox_EphemerisData& b) {
  return IsStaticSbas(a) && IsStaticSbas(b) && a.sbas.s3_s5[0] == b.sbas.s3_s5[0] &&
         a.sbas.s3_s5[1] == b.sbas.s3_s5[1];
}

TimeMs TimeOf(const vox_EphemerisData& d) {
  return TimeMs{d.head.seconds, d.head.ms};
}

}  // namespace

bool EphemerisStore::Link(const vox_EphemerisData& d) {
  const unsigned index = SatIndexOf(d.head.sat);
  if (!IsValidSatId(d.head.sat) || index >= lists_.size()) return false;
  ItemList<TNavEphemItem>& list = lists_[index];
  // The last item not after the new one.
  TNavEphemItem* before = nullptr;
  for (TNavEphemItem* p = list.head(); p != nullptr && TimeOf(p->data) <= TimeOf(d); p = p->next)
    before = p;
  if (before != nullptr && before->data.head.seconds == d.head.seconds) return false;
  if (SystemOf(d.head.sat) == SatSystem::kSbas && before != nullptr &&
      SameStaticSbas(d, before->data))
    return false;
  auto* item = new (std::nothrow) TNavEphemItem(d);
  if (item == nullptr) return false;
  if (before == nullptr) {
    list.Prepend(item);
  } else {
    item->next = before->next;
    before->next = item;
  }
  return true;
}

bool EphemerisStore::InsertGps(const GpsEphemerisRecord& r, bool high_numbers) {
  const bool ok = high_numbers ? r.number >= 1 && r.number <= 5 : r.number >= 1 && r.number <= 32;
  return ok && Link(MakeGpsEphemeris(r, high_numbers));
}
bool EphemerisStore::Insert(const BdsEphemerisRecord& r) {
  return InRange(SatSystem::kBds, r.number) && Link(MakeBdsEphemeris(r));
}
bool EphemerisStore::Insert(const GlonassEphemerisRecord& r) {
  return InRange(SatSystem::kGlonass, r.slot) && Link(MakeGlonassEphemeris(r));
}
bool EphemerisStore::Insert(const SbasEphemerisRecord& r) {
  return InRange(SatSystem::kSbas, r.number) && Link(MakeSbasEphemeris(r));
}
bool EphemerisStore::Insert(const GalileoEphemerisRecord& r) {
  return InRange(SatSystem::kGalileo, r.number) && Link(MakeGalileoEphemeris(r));
}

size_t EphemerisStore::Total() const {
  size_t n = 0;
  for (const auto& list : lists_)
    n += list.Count();
  return n;
}

void EphemerisStore::Clear() {
  for (auto& list : lists_)
    list.Clear();
}

// ---- windows

bool IsStaticSbas(const vox_EphemerisData& d) {
  if (SystemOf(d.head.sat) != SatSystem::kSbas) return false;
  const vox_SbasEphemeris& s = d.sbas;
  if (s.s3_s5[2] != 0.0 || s.s12 != 0.0f || s.s13 != 0.0f) return false;
  // Indexed, not through std::begin/std::end: a packed member array cannot bind to a
  // reference, so each of those would get a temporary copy of its own, and the walk from
  // one copy to the end of the other reads the stack beyond them.
  for (size_t i = 0; i < sizeof s.s6_s11 / sizeof s.s6_s11[0]; ++i)
    if (s.s6_s11[i] != 0.0f) return false;
  return true;
}

EphemerisWindow ValidityWindow(const vox_EphemerisData& d) {
  int64_t half = 0;
  switch (SystemOf(d.head.sat)) {
    case SatSystem::kGps:
      half = 7200;
      break;
    case SatSystem::kGlonass:
      half = 900;
      break;
    case SatSystem::kBds:
    case SatSystem::kGalileo:
      half = 3600;
      break;
    case SatSystem::kSbas:
      half = 300;
      break;
  }
  const int64_t t = d.head.seconds;
  return {t - half, t + half};
}

bool ValidAt(const vox_EphemerisData& d, uint32_t seconds) {
  if (IsStaticSbas(d)) return true;
  const EphemerisWindow w = ValidityWindow(d);
  return w.start <= seconds && seconds <= w.end;
}

// ---- streams

namespace {

const TNavEphemItem* ListOf(const EphemerisStore& store, SatId sat) {
  if (!IsValidSatId(sat)) return nullptr;
  return store.head(SatIndexOf(sat));
}

}  // namespace

EphemerisCursor* OpenEphemerisStream(const EphemerisStore& store, SatId sat, const uint32_t* from,
                                     const uint32_t* to) {
  if (from == nullptr || to == nullptr) return nullptr;
  for (const TNavEphemItem* p = ListOf(store, sat); p != nullptr; p = p->next) {
    const EphemerisWindow w = ValidityWindow(p->data);
    const bool overlaps = std::max<int64_t>(*from, w.start) <= std::min<int64_t>(*to, w.end);
    if (IsStaticSbas(p->data) || overlaps) {
      auto* cursor = new (std::nothrow) EphemerisCursor{sat, p, true};
      return cursor;
    }
  }
  return nullptr;
}

EphemerisCursor* OpenEphemerisStreamShort(const EphemerisStore& store, uint8_t number,
                                          const uint32_t* from, const uint32_t* to) {
  std::optional<SatId> sat;
  if (number & 0x80)
    sat = MakeSatId(SatSystem::kGlonass, number - 128u);
  else if (number != 0)
    sat = SatIdOfIndex(number - 1u);
  if (!sat) return nullptr;
  return OpenEphemerisStream(store, *sat, from, to);
}

int FindEphemeris(const EphemerisStore& store, EphemerisCursor* cursor, const uint32_t* time,
                  vox_EphemerisData* out) {
  if (cursor == nullptr || time == nullptr || out == nullptr) return 0;
  cursor->pending = false;
  for (const TNavEphemItem* p = ListOf(store, cursor->sat); p != nullptr; p = p->next) {
    if (ValidAt(p->data, *time)) {
      cursor->current = p;
      *out = p->data;
      return 1;
    }
  }
  cursor->current = nullptr;
  return 0;
}

int FindEphemerisShort(const EphemerisStore& store, EphemerisCursor* cursor, const uint32_t* time,
                       vox_ShortEphemerisData* out) {
  vox_EphemerisData full;
  if (out != nullptr && FindEphemeris(store, cursor, time, &full)) ToShortRecord(full, out);
  return 0;
}

int GetNextEphemeris(EphemerisCursor* cursor, vox_EphemerisData* out) {
  if (cursor == nullptr || out == nullptr || cursor->current == nullptr) return 0;
  if (!cursor->pending) {
    if (cursor->current->next == nullptr) return 0;
    cursor->current = cursor->current->next;
  }
  *out = cursor->current->data;
  cursor->pending = false;
  return 1;
}

int GetNextEphemerisShort(EphemerisCursor* cursor, vox_ShortEphemerisData* out) {
  vox_EphemerisData full;
  if (out != nullptr && GetNextEphemeris(cursor, &full)) ToShortRecord(full, out);
  return 0;
}

int CloseEphemerisStream(EphemerisCursor* cursor) {
  delete cursor;
  return 1;
}

}  // namespace vox
