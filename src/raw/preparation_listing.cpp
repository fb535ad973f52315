#include "raw/preparation_listing.h"

#include "base/gps_time.h"
#include "base/sat.h"
#include "raw/ephemeris_store.h"
#include "raw/precise_store.h"

namespace vox {

namespace {

const char* PointName(const TPointItem* p) {
  return p != nullptr ? p->name.c_str() : "";
}

void ListEphemerides(const EphemerisStore& store, const ScanLogSink& log) {
  ScanLogf(log, "Ephemeris:\n");
  for (unsigned i = 0; i < kSatIndexCount; ++i) {
    char name[4];
    SatIndexName(i, name);
    for (const TNavEphemItem* p = store.head(i); p != nullptr; p = p->next) {
      const TimeMs t{p->data.head.seconds, p->data.head.ms};
      ScanLogf(log, "%03u - %s - %u.%03u %s\n", i + 1, name, t.seconds, unsigned{t.ms},
               CalendarText(t).c_str());
    }
  }
  ScanLogf(log, "\n");
}

void ListPrecise(const PreciseStore& store, const ScanLogSink& log) {
  ScanLogf(log, "Precise Ephemeris:\n");
  for (unsigned i = 0; i < kSatIndexCount; ++i) {
    const PreciseSample* first = store.first(i);
    const PreciseSample* last = store.last(i);
    if (first == nullptr || last == nullptr) continue;
    char name[4];
    SatIndexName(i, name);
    ScanLogf(log, "%s - %s - %s - %u\n", name, CalendarText(first->time).c_str(),
             CalendarText(last->time).c_str(), store.count(i));
  }
}

void ListOccupations(const ItemList<TOccupItem>& occupations, const ScanLogSink& log) {
  ScanLogf(log, "Occupation:\n");
  for (const TOccupItem& o : occupations) {
    ScanLogf(log, "OCCUP#%08X %s, beg=%s end=%s, %6u epochs", o.id,
             o.point != nullptr ? o.point->name.c_str() : "Move",
             CalendarText(o.first_epoch).c_str(), CalendarText(o.last_epoch).c_str(),
             o.epoch_count);
    if (o.file != nullptr)
      ScanLogf(log, ", CHAIN#%08X GPS: dL2X=%.4f (%08X)\n", o.file->id, o.file->c2_l2_offset,
               o.file->c2_usable_mask);
    else
      ScanLogf(log, "\n");
  }
  ScanLogf(log, "\n");
}

void ListVectors(const ItemList<TVectorItem>& vectors, const ScanLogSink& log) {
  for (const TVectorItem& v : vectors) {
    ScanLogf(log, "VECTOR: %s - %s\n", PointName(v.first_point), PointName(v.second_point));
    for (const TROccupItem& r : v.occupations) {
      if (r.occupation == nullptr) continue;
      ScanLogf(log, "OCCUP: %s %s-%s\n", r.occupation->name.c_str(),
               CalendarText(r.occupation->first_epoch).c_str(),
               CalendarText(r.occupation->last_epoch).c_str());
    }
  }
  ScanLogf(log, "\n");
}

}  // namespace

void WritePreparationListing(const EphemerisStore& ephemerides, const PreciseStore& precise,
                             const ItemList<TOccupItem>& occupations,
                             const ItemList<TVectorItem>& vectors, const ScanLogSink& log) {
  ListEphemerides(ephemerides, log);
  ListPrecise(precise, log);
  ListOccupations(occupations, log);
  ListVectors(vectors, log);
}
}  // namespace vox
