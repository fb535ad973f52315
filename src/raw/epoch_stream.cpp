#include "raw/epoch_stream.h"

#include <cmath>

#include "base/sat.h"
#include "job/leap_seconds.h"
#include "raw/raw_decoder.h"
#include "raw/signal_rules.h"

namespace vox {

namespace {

constexpr double kSpeedOfLight = 299792458.0;
// BDS time runs 14 s behind GPS time.
constexpr double kBdsOffset = 14.0;
// The interval grid is counted in ms from a base that stays within u32 milliseconds: the base
// starts on a multiple of 608400 s and moves on by 1216800 s whenever the grid passes that.
constexpr uint32_t kGridBase = 608400;
constexpr uint32_t kGridShift = 1216800;
constexpr int64_t kGridShiftMs = int64_t{kGridShift} * 1000;

// Groups of TChainItem::force_copy, in the order the scan fills them.
enum CopyGroup {
  kL1ToCaCode,
  kL1ToCaPhase,
  kCaToL1Code,
  kCaToL1Phase,
  kL2cToL2pCode,
  kL2cToL2pPhase
};

constexpr int CodeValue(int slot) {
  return 2 * slot;
}
constexpr int PhaseValue(int slot) {
  return 2 * slot + 1;
}

bool Has(const vox_EpochSatData& d, int value) {
  return (d.presence >> value) & 1u;
}
void Put(vox_EpochSatData& d, int value, double v) {
  d.values[value] = v;
  d.presence |= 1u << value;
}
void CopyIfMissing(vox_EpochSatData& d, int from, int to) {
  if (Has(d, from) && !Has(d, to)) Put(d, to, d.values[from]);
}

bool IsEpochTag(uint8_t tag) {
  return tag == kTagEpoch8 || tag == kTagEpoch51;
}

}  // namespace

std::unique_ptr<EpochStream> EpochStream::Open(TOccupItem& occupation, uint32_t interval_ms,
                                               const TimeMs* from, const TimeMs* to) {
  if (occupation.file == nullptr) return nullptr;
  const TimeMs first = occupation.first_epoch;
  const TimeMs last = occupation.last_epoch;
  TimeMs start = first, end = last;
  if (from != nullptr && *from >= first && *from <= last) start = *from;
  if (to != nullptr && *to >= first && *to < last) end = *to;
  if (start > end) return nullptr;
  std::unique_ptr<EpochStream> s(new EpochStream(occupation, start, end, interval_ms));
  if (!s->Position()) return nullptr;
  return s;
}

EpochStream::EpochStream(TOccupItem& occupation, const TimeMs& start, const TimeMs& end,
                         uint32_t interval_ms)
    : occupation_(occupation),
      file_(*occupation.file),
      start_(start),
      end_(end),
      interval_(interval_ms == occupation.file->epoch_interval_ms ? 0 : interval_ms),
      reader_(input_) {
  grid_base_ = start.seconds - start.seconds % kGridBase;
  next_wanted_ = int64_t{start.seconds - grid_base_} * 1000 + start.ms;
  if (interval_ != 0) next_wanted_ = (next_wanted_ + interval_ - 1) / interval_ * interval_;
}

EpochStream::~EpochStream() {
  if (nav_output_.is_open()) nav_output_.Close();
  input_.Close();
}

// Opens the file, chooses the byte order, takes the time reference of the first epoch and
// stands before that epoch.
bool EpochStream::Position() {
  if (occupation_.epoch_count == 0) return false;
  if (!input_.OpenRead(file_.path)) return false;
  uint8_t head[10] = {};
  input_.Seek(3);
  input_.Read(head, sizeof head);
  // Anything that is not the little-endian signature is read as big-endian.
  const auto order = OrderFromSignature(head);
  reader_.set_order(order == ByteOrder::kLittle ? ByteOrder::kLittle : ByteOrder::kBig);

  if (!reader_.Seek(occupation_.time_ref_position) || reader_.next_tag() != kTagTimeRef)
    return false;
  if (reader_.Next() != ReadResult::kOk) return false;
  TimeRefRecord r;
  if (reader_.decoder().time_ref(reader_.body(), r) == 0) return false;
  TakeTimeReference(r);
  opening_time_ref_ = time_ref_;
  return reader_.Seek(occupation_.first_epoch_position);
}

void EpochStream::TakeTimeReference(const TimeRefRecord& r) {
  time_ref_.time = r.time;
  time_ref_.gps = r.IsGps();
  const TimeMs t = ToTimeMs(r.time);
  if (r.has_leap) {
    SetLeapSeconds(t, r.leap_seconds);
    time_ref_.leap_seconds = r.leap_seconds;
  } else {
    const uint32_t leap = GetLeapSeconds(t);
    time_ref_.leap_seconds = leap == kLeapUnknown ? 0 : leap;
  }
}

uint8_t EpochStream::ReadRecord() {
  if (reader_.next_tag() == kTagEnd) return 0;
  if (reader_.Next() != ReadResult::kOk) return 0;
  if (reader_.tag() == kTagTimeRef) {
    TimeRefRecord r;
    if (reader_.decoder().time_ref(reader_.body(), r) != 0) TakeTimeReference(r);
  }
  return reader_.tag();
}

bool EpochStream::DecodeEpoch(TimeMs& time) {
  EpochHeader h;
  const ByteSpan body = reader_.body();
  const size_t n = reader_.decoder().epoch(body, h);
  if (n == 0) return false;
  RawTime raw{h.ms_of_day, time_ref_.time.day};
  if (h.ms_of_day < time_ref_.time.ms_of_day) ++raw.day;
  time = ToTimeMs(raw);
  tag51_ = reader_.tag() == kTagEpoch51;
  blocks_ = body.subspan(n);
  blocks_left_ = 0;  // nothing to read until the epoch is delivered
  sat_count_ = h.sat_count;
  return true;
}

void EpochStream::Deliver(const TimeMs& time, vox_EpochData& out) {
  out = vox_EpochData{};
  out.one = 1;
  out.flags = VOX_EPOCH_ALWAYS;
  out.seconds = time.seconds;
  out.ms = time.ms;
  out.sat_count = sat_count_;
  if (occupation_.nav_set) {
    out.x = occupation_.nav.x;
    out.y = occupation_.nav.y;
    out.z = occupation_.nav.z;
    out.flags |= VOX_EPOCH_HAS_POSITION;
  }
  blocks_left_ = sat_count_;
  state_ = State::kDelivered;
}

bool EpochStream::Find(const TimeMs* wanted, vox_EpochData& out) {
  state_ = State::kReady;
  blocks_left_ = 0;
  const TimeMs target = wanted != nullptr ? *wanted : start_;
  if (target < start_ || target > end_) return false;
  // The epochs after the first one were dated by whatever reference the stream read last;
  // going back to the first epoch means going back to its reference too, or a file that
  // crosses midnight would date the early epochs a day late.
  time_ref_ = opening_time_ref_;
  if (!reader_.Seek(occupation_.first_epoch_position)) return false;
  for (;;) {
    const uint8_t tag = ReadRecord();
    if (tag == 0) return false;
    TimeMs t;
    if (!IsEpochTag(tag) || !DecodeEpoch(t) || t < start_) continue;
    if (t > end_) return false;
    if (t < target) continue;
    Deliver(t, out);
    return true;
  }
}

bool EpochStream::OnGrid(const TimeMs& time) {
  if (next_wanted_ > kGridShiftMs) {
    grid_base_ += kGridShift;
    next_wanted_ -= kGridShiftMs;
  }
  const int64_t t = (int64_t{time.seconds} - grid_base_) * 1000 + time.ms;
  if (t < next_wanted_) return false;
  if (t > next_wanted_) next_wanted_ = t / interval_ * interval_;
  const bool hit = t == next_wanted_;
  next_wanted_ += interval_;
  return hit;
}

bool EpochStream::GetNext(vox_EpochData& out) {
  if (state_ != State::kDelivered) return false;
  blocks_left_ = 0;
  for (;;) {
    const uint8_t tag = ReadRecord();
    if (tag == 0) break;
    TimeMs t;
    if (!IsEpochTag(tag) || !DecodeEpoch(t) || t < start_) continue;
    if (t > end_) break;
    if (interval_ != 0 && !OnGrid(t)) continue;
    Deliver(t, out);
    return true;
  }
  state_ = State::kReady;
  return false;
}

double EpochStream::CodeSeconds(double pseudorange, SatSystem system) const {
  double v = pseudorange / kSpeedOfLight;
  const double leap = time_ref_.leap_seconds;
  const bool gps_time = time_ref_.gps;
  // Every code value leaves on one scale: GPS time for GPS, GALILEO and SBAS, UTC-based
  // time for GLONASS, BDS time moved onto GPS time. Older one-byte records carry SBAS on the
  // GLONASS side; engines read them that way.
  switch (system) {
    case SatSystem::kGps:
    case SatSystem::kGalileo:
      if (!gps_time) v -= leap;
      break;
    case SatSystem::kSbas:
      if (tag51_) {
        if (!gps_time) v -= leap;
      } else if (gps_time) {
        v += leap;
      }
      break;
    case SatSystem::kGlonass:
      if (gps_time) v += leap;
      break;
    case SatSystem::kBds:
      if (tag51_) v += gps_time ? kBdsOffset : kBdsOffset - leap;
      break;
  }
  return v;
}

bool EpochStream::ReadSatellite(vox_EpochSatData& out, bool& valid) {
  const RawDecoder& d = reader_.decoder();
  SatBlock sat;
  size_t n = tag51_ ? d.sat_block51(blocks_, sat) : d.sat_block8(blocks_, sat);
  if (n == 0) return false;
  blocks_ = blocks_.subspan(n);
  valid = sat.valid;
  const SatSystem system = SystemOf(sat.sat);
  // The values are assembled aside: the rules below may drop a value again, and a value
  // whose presence bit ends up clear must leave the engine's buffer as it was.
  vox_EpochSatData work{};
  for (;;) {
    SignalBlock s;
    n = tag51_ ? d.signal51(blocks_, s) : d.signal8(blocks_, s);
    if (n == 0) return false;
    blocks_ = blocks_.subspan(n);
    const SignalSlot slot =
        tag51_ ? Slot51(sat.group, s.flags & 0x7F) : Slot8ForValues(Kind8(s.flags));
    if (valid && slot != kNoSlot) {
      if ((s.flags & kSigCode) && !(s.flags & kSigCodeBad)) {
        double v = CodeSeconds(s.code, system);
        if ((s.flags & kSigCorrection) && file_.smooth) v -= static_cast<double>(s.correction);
        Put(work, CodeValue(slot), v);
      }
      const bool phase_bad = (s.flags & kSigPhaseBad) || (!tag51_ && (s.flags & kSig8PhaseBad));
      if ((s.flags & kSigPhase) && !phase_bad) Put(work, PhaseValue(slot), s.phase);
    }
    if (!(s.flags & kSigMore)) break;
  }
  if (!valid) return true;
  work.sat = sat.sat;
  if (tag51_) ApplyL2cRules(work);
  ApplyForceCopy(work, system);
  out.sat = sat.sat;
  out.b2 = sat.b2;
  out.b3 = sat.b3;
  out.presence = work.presence;
  for (int i = 0; i < 10; ++i)
    if (Has(work, i)) out.values[i] = work.values[i];
  return true;
}

bool EpochStream::GetSatellite(vox_EpochSatData& out) {
  while (blocks_left_ > 0) {
    --blocks_left_;
    bool valid = false;
    if (!ReadSatellite(out, valid)) {
      blocks_left_ = 0;  // a damaged record ends the epoch
      return false;
    }
    if (valid) return true;
  }
  return false;
}

// The scan found, per GPS satellite, whether its L2C phase is usable and agrees with the
// file's quarter-cycle offset; satellites without a usable L2C get their L2C values from L2P.
void EpochStream::ApplyL2cRules(vox_EpochSatData& out) const {
  const unsigned number = NumberOf(out.sat);
  if (SystemOf(out.sat) != SatSystem::kGps || number < 1 || number > 32) return;
  const uint32_t bit = 1u << (number - 1);
  const bool usable = (file_.c2_usable_mask & bit) != 0;
  const bool agreeing = (file_.c2_agreeing_mask & bit) != 0;
  if (usable && agreeing) {
    if (Has(out, PhaseValue(kL2C))) out.values[PhaseValue(kL2C)] -= file_.c2_l2_offset;
    return;
  }
  if (usable) {
    out.presence &= ~(1u << PhaseValue(kL2C));
  } else if (Has(out, CodeValue(kL2P))) {
    Put(out, CodeValue(kL2C), out.values[CodeValue(kL2P)]);
  }
  if (Has(out, PhaseValue(kL2P))) Put(out, PhaseValue(kL2C), out.values[PhaseValue(kL2P)]);
}

void EpochStream::ApplyForceCopy(vox_EpochSatData& out, SatSystem system) const {
  const int s = static_cast<int>(system);
  const auto on = [&](CopyGroup g) { return file_.force_copy[g][s] != 0; };
  if (on(kL1ToCaCode)) CopyIfMissing(out, CodeValue(kL1P), CodeValue(kL1C));
  if (on(kCaToL1Code)) CopyIfMissing(out, CodeValue(kL1C), CodeValue(kL1P));
  if (on(kL1ToCaPhase)) CopyIfMissing(out, PhaseValue(kL1P), PhaseValue(kL1C));
  if (on(kCaToL1Phase)) CopyIfMissing(out, PhaseValue(kL1C), PhaseValue(kL1P));
  if (on(kL2cToL2pPhase) && Has(out, PhaseValue(kL2C)))
    Put(out, PhaseValue(kL2P), out.values[PhaseValue(kL2C)]);
  if (on(kL2cToL2pCode) && Has(out, CodeValue(kL2C)))
    Put(out, CodeValue(kL2P), out.values[CodeValue(kL2C)]);
}

TBufFile* EpochStream::NavOutput(uint32_t open_mode) {
  if (occupation_.nmea_path.empty()) return nullptr;
  if (nav_state_ == NavState::kNotOpened) {
    nav_counter_ = 0;
    nav_state_ = nav_output_.OpenWrite(occupation_.nmea_path, open_mode) ? NavState::kOpened
                                                                         : NavState::kFailed;
  }
  return nav_state_ == NavState::kOpened ? &nav_output_ : nullptr;
}

}  // namespace vox
