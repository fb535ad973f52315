// What the reference engines read from vox and how they talk back: the observations of an
// occupation gathered epoch by epoch, the broadcast ephemerides of a span, positions of
// points and occupations, and the context's callbacks with the engine's stop request.
//
// Unlike the rest of this library these functions call vox_* exports, so an engine that uses
// them links the vox library (it binds to the copy that loaded it). Everything here works on
// one thread's own objects; the stop request is the only shared state and is atomic.
#pragma once

#include <atomic>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "geodesy.h"
#include "vox/vox_engine.h"

namespace voxeng::io {

// Message kinds as the engines pass them to the context's message callback.
inline constexpr uint32_t kInfo = 1;
inline constexpr uint32_t kWarning = 2;
inline constexpr uint32_t kError = 3;

// The engine's stop request: set by _eng_BreakProcess (from any callback's thread), read by
// the loops of every processing call.
class StopRequest {
 public:
  void Request() { flag_.store(true); }
  bool Requested() const { return flag_.load(); }
  void Clear() { flag_.store(false); }

 private:
  std::atomic<bool> flag_{false};
};

// The callbacks of one processing call (or of one engine thread, with its own context).
class Reporter {
 public:
  explicit Reporter(const vox_ThreadContext* context) : context_(context) {}
  void Message(uint32_t kind, const std::string& text) const;
  // Reports percent (0 to 100) when it changed; vox checks for a stop request inside.
  void Progress(int percent);
  const vox_ThreadContext* context() const { return context_; }
  void* writer() const { return context_ ? context_->writer : nullptr; }

 private:
  const vox_ThreadContext* context_;
  int last_percent_ = -1;
};

// One GPS satellite of one epoch, in metres and cycles.
struct SatObs {
  int prn = 0;
  double p1 = 0, p2 = 0;  // code, m; 0 when absent
  double l1 = 0, l2 = 0;  // phase, cycles; 0 when absent
  bool slip = false;      // loss of lock on either phase at this epoch
};

struct EpochObs {
  TimeMs time{};
  double t = 0;  // GPS seconds since the time origin
  std::vector<SatObs> sats;
};

// The GPS observations of an occupation, optionally limited to [from, to] and thinned to
// interval_ms (0: every epoch). The thinning keeps the epoch nearest each multiple of the
// interval when it lies within a tenth of the interval (at most 0.1 s) of it: receivers tag
// epochs a few milliseconds off the whole second, and exact multiples would lose them.
// Stops early, returning what it has, when `stop` is requested.
// Empty when the occupation has no epochs or its file cannot be read.
std::vector<EpochObs> ReadEpochs(uint32_t occupation_id, uint32_t interval_ms, const TimeMs* from,
                                 const TimeMs* to, const StopRequest& stop);

// The broadcast GPS orbits of a span, loaded once and picked by time.
class Ephemerides {
 public:
  // Loads satellites 1 to 32 over [from, to] (whole GPS seconds).
  void Load(uint32_t from, uint32_t to);
  // The healthy orbit whose toe lies nearest t within its four-hour fit; null when none.
  const vox_GpsOrbitParams* Find(int prn, double t) const;
  bool Empty() const;

 private:
  std::vector<vox_GpsOrbitParams> by_prn_[33];
};

// Occupation facts the engines need; nullopt when vox knows no such occupation.
struct Occupation {
  uint32_t id = 0;
  uint32_t point_id = 0;
  uint32_t file_id = 0;
  TimeMs first{}, last{};
  uint32_t epochs = 0;
  Vec3 offset_enu{};  // antenna reference above the mark: east, north, up (m)
  std::string name;
};
std::optional<Occupation> GetOccupation(uint32_t occupation_id);

// The antenna of an occupation standing on `mark`, and back.
Vec3 AntennaOf(const Vec3& mark, const Occupation& o);
Vec3 MarkOf(const Vec3& antenna, const Occupation& o);

// The best position vox knows of a point (known, solved or navigation mean), with its rms.
struct KnownPosition {
  Vec3 xyz{};
  double rms = 0;
  uint32_t site_type = VOX_SITE_NONE;
};
std::optional<KnownPosition> PointPosition(uint32_t point_id);
// The navigation coordinates stored for an occupation (by a raw filter), if any.
std::optional<Vec3> NavCoord(uint32_t occupation_id);

// Seconds of a TimeMs, and the TimeMs of GPS seconds (rounded to the millisecond).
double Seconds(const TimeMs& t);
TimeMs ToTimeMs(double seconds);
// "G05" for prn 5.
std::string SatName(int prn);

}  // namespace voxeng::io
