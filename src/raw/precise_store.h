// The satellite position store: tabulated positions and clock offsets per satellite, from
// precise orbit files and from the satellite position records of raw files, and the cursor
// through which engines read them back.
//
// Thread safety: the scan fills the store on the job thread before any engine runs; after
// that it is only read, by any number of cursors on any threads, without locks.
#pragma once

#include <array>
#include <cstdint>
#include <optional>

#include "base/node_pool.h"
#include "base/sat.h"
#include "base/time_ms.h"
#include "vox/vox_sdk_ephemeris.h"

namespace vox {

// One sample, a node of its satellite's list.
struct PreciseSample {
  PreciseSample* next = nullptr;
  TimeMs time{};
  SatId sat = 0;
  double x = 0, y = 0, z = 0;  // metres
  float clock = 0;             // seconds
};

// An engine's position in one satellite's list. pending: the current sample has not been
// delivered yet.
struct PreciseCursor {
  SatId sat = 0;
  const PreciseSample* current = nullptr;
  bool pending = false;
};

class PreciseStore {
 public:
  // A sample serves from 900 s before to 900 s after its time when a stream picks its start.
  static constexpr int64_t kWindowSeconds = 900;

  PreciseStore() = default;
  PreciseStore(const PreciseStore&) = delete;
  PreciseStore& operator=(const PreciseStore&) = delete;

  // Stores a sample in time order. Dropped (false) for a satellite without a list, when the
  // list already holds a sample of the same whole second (the first one stored wins), or
  // when no memory is left.
  bool Insert(SatId sat, TimeMs time, double x, double y, double z, float clock);

  // A cursor on the first sample whose window overlaps [from, to] (whole seconds); none for
  // an unknown satellite or when no sample qualifies.
  std::optional<PreciseCursor> Open(SatId sat, uint32_t from, uint32_t to) const;
  std::optional<PreciseCursor> OpenIndex(unsigned index, uint32_t from, uint32_t to) const;
  // By the short satellite number of the plain stream functions: 1 to 127 name the index
  // number - 1; 128 + n names GLONASS slot n; 0 names nothing.
  std::optional<PreciseCursor> OpenShort(uint8_t short_number, uint32_t from, uint32_t to) const;

  // For the listing of prepared data; index is a SatIndex (0 to 148).
  uint32_t count(unsigned index) const;
  const PreciseSample* first(unsigned index) const;  // null when empty
  const PreciseSample* last(unsigned index) const;

  void Clear();

 private:
  struct List {
    PreciseSample* head = nullptr;
    PreciseSample* tail = nullptr;
    NodePool pool;
    uint32_t count = 0;
  };
  const List* ListAt(unsigned index) const {
    return index < lists_.size() ? &lists_[index] : nullptr;
  }

  std::array<List, kSatIndexCount> lists_;
};

// Fills out from the cursor's sample and moves on: true, or false at the end of the list.
// The stream runs to the end of the list; it does not stop at the span's end.
bool GetNextPrecise(PreciseCursor& cursor, vox_PreciseEphemerisData& out);

}  // namespace vox
