#include "raw/scan.h"

#include <bit>
#include <cmath>
#include <string>

#include "base/buf_file.h"
#include "raw/ephemeris_store.h"
#include "raw/precise_store.h"
#include "raw/raw_codec.h"
#include "raw/record_reader.h"
#include "raw/scan_rules.h"
#include "raw/sp3_reader.h"

namespace vox {

namespace {

// The GPS signal codes whose phase feeds the L2C note: 1 for L2C, 2 for L2P.
inline unsigned L2Role(uint8_t code) {
  if (code == 32 || code == 34 || code == 35) return 1;
  if (code == 36 || code == 37) return 2;
  return 0;
}

// Tables built once so that the walk of a signal block that adds nothing new (the usual case
// after the first epochs) is a few look-ups and one test.
struct ScanTables {
  // What a signal block might give, by the low seven bits of its flags: the code and phase
  // mask bits of its slot, and kRoleBit for a GPS L2C or L2P signal. Rows 0-5: tag 51 code
  // groups; row 6: unknown tag 51 groups (nothing); row 7: tag 8 (slot by the kind bits).
  static constexpr uint32_t kCodeBits = 0x1F, kPhaseBits = 0x3E0, kRoleBit = 1u << 16;
  static constexpr uint32_t kMaskBits = kCodeBits | kPhaseBits;
  static constexpr uint8_t kUnknownRow = 6, kTag8Row = 7;
  uint32_t gives[8][128] = {};

  // Which of those a block's flags let through, by the flags' present and bad bits: code
  // bits when the code is present and not bad, phase bits and kRoleBit when the phase is.
  uint32_t usable51[16] = {};
  uint32_t usable8[4] = {};

  // Every satellite code decoded: tag 51 codes by their ten meaningful bits (number and
  // group), tag 8 codes by their byte; with the mask the satellite's bits go to (kSystemCount
  // for none) and its row of gives.
  struct Sat {
    DecodedSat decoded;
    uint8_t mask_index;
    uint8_t row;
    uint16_t unused;  // eight bytes make the look-up a plain scaled index
  };
  Sat two_byte[1024];
  Sat one_byte[256];

  ScanTables() {
    for (uint8_t code = 0; code < 128; ++code) {
      for (uint8_t group = 0; group < 6; ++group) {
        const SignalSlot slot = Slot51Fast(group, code);
        if (slot != kNoSlot) gives[group][code] = CodeBit(slot) | PhaseBit(slot);
        if (group == 0 && L2Role(code) != 0) gives[group][code] |= kRoleBit;
      }
      const SignalSlot slot8 = Slot8ForMask(Kind8(code));
      gives[kTag8Row][code] = CodeBit(slot8) | PhaseBit(slot8);
    }
    for (unsigned i = 0; i < 16; ++i) {
      const auto flags = static_cast<uint16_t>(((i & 3u) << 8) | ((i & 12u) << 10));
      const bool code = (flags & kSigCode) && !(flags & kSigCodeBad);
      const bool phase = (flags & kSigPhase) && !(flags & kSigPhaseBad);
      usable51[i] = (code ? kCodeBits : 0u) | (phase ? kPhaseBits | kRoleBit : 0u);
    }
    for (unsigned i = 0; i < 4; ++i)
      usable8[i] = ((i & 1u) ? kCodeBits : 0u) | ((i & 2u) ? kPhaseBits : 0u);
    for (uint16_t c = 0; c < 1024; ++c) {
      const DecodedSat d = DecodeSatCode(c, true);
      // A two-byte code of an unknown group names no system; its blocks are only consumed.
      const bool known = d.group < 6;
      two_byte[c] = {d, known ? static_cast<uint8_t>(SystemOf(d.sat)) : uint8_t{kSystemCount},
                     known ? d.group : kUnknownRow, 0};
    }
    for (uint16_t c = 0; c < 256; ++c) {
      const DecodedSat d = DecodeSatCode(c, false);
      one_byte[c] = {d, static_cast<uint8_t>(SystemOf(d.sat)), kTag8Row, 0};
    }
  }
  template <bool kTag51>
  const Sat& SatOf(uint16_t code) const {
    if constexpr (kTag51) return two_byte[code & 1023u];
    return one_byte[code & 255u];
  }
  template <bool kTag51>
  uint32_t Usable(uint16_t flags) const {
    static_assert(kSigCode == 1u << 8 && kSigPhase == 1u << 9 && kSigPhaseBad == 1u << 12 &&
                  kSigCodeBad == 1u << 13);
    if constexpr (kTag51) return usable51[((flags >> 8) & 3u) | ((flags >> 10) & 12u)];
    return usable8[(flags >> 8) & 3u];
  }
};

const ScanTables& GetScanTables() {
  static const ScanTables tables;
  return tables;
}

// The working state of one raw file walk.
struct ScanState {
  TChainItem& file;
  const ScanSinks& sinks;
  ScanDetails* details;
  RawTime time_ref;
  uint32_t time_ref_position = 0;
  IntervalTable intervals;
  C2Collector c2;
  const ScanTables& tables;
};

std::string ReceiverText(const ReceiverRecord& r) {
  std::string text = r.s4;
  if (r.s3[0] != '\0') text += std::string(" #") + r.s3;
  if (r.s5[0] != '\0') text += std::string(" (") + r.s5 + ")";
  return text;
}

void RegisterEpochTime(ScanState& st, const TimeMs& t, uint32_t position) {
  TChainItem& file = st.file;
  if (file.epoch_count == 0) file.first_epoch = t;
  file.last_epoch = t;
  ++file.epoch_count;
  for (const TROccupItem& ref : file.occupations) {
    TOccupItem* occ = ref.occupation;
    if (occ == nullptr || t < occ->begin || t > occ->end) continue;
    if (occ->epoch_count == 0) {
      occ->first_epoch = t;
      occ->first_epoch_position = position;
      occ->time_ref_position = st.time_ref_position;
    }
    occ->last_epoch = t;
    ++occ->epoch_count;
  }
  st.intervals.Add(t);
}

// The layout bits and size of the last signal block walked. Blocks of one file nearly always
// share their layout, so testing the flags against it (a branch the processor predicts) lets
// the walk step on without waiting for a table look-up after every flags word.
struct LayoutCache {
  uint32_t key = 0xFFFFFFFF;  // no flags word has these bits
  uint32_t size = 0;
};

// The bytes of one epoch record's satellite and signal blocks being walked.
struct BlockCursor {
  const uint8_t* p;
  const uint8_t* end;
  uintptr_t safe;  // up to this address a block of the largest size surely fits
};

// The L2C and L2P phases of one GPS satellite's epoch for the L2C note, as bit patterns; a
// zero of either sign means none.
struct L2Phases {
  uint64_t l2c = 0, l2p = 0;
  bool Both() const { return (l2c << 1) != 0 && (l2p << 1) != 0; }
};

// A block whose slot may add mask bits (may: the bits it could give that are still missing,
// and kRoleBit for a GPS L2C or L2P signal): its present, bad and window-checked values
// decide. A value outside its window counts as absent. Only here are values read.
template <typename Order, bool kTag51>
void LearnFromBlock(ScanState& st, const uint8_t* block, uint16_t flags, uint32_t may, SatId sat,
                    uint32_t& missing, L2Phases& l2) {
  may &= st.tables.Usable<kTag51>(flags);
  if (may == 0) return;
  const SignalLayout& layout = SignalLayoutOf<kTag51>(flags);
  uint32_t code_bit = may & ScanTables::kCodeBits, phase_bit = may & ScanTables::kPhaseBits;
  if (code_bit != 0 && !CodeBitsOk(Order::template Load<uint64_t>(block + layout.code_at)))
    code_bit = 0;
  uint64_t phase = 0;
  bool phase_ok = false;
  if (may & (ScanTables::kPhaseBits | ScanTables::kRoleBit)) {
    phase = Order::template Load<uint64_t>(block + layout.phase_at);
    phase_ok = PhaseBitsOk(phase);
  }
  if (!phase_ok) phase_bit = 0;
  missing &= ~(code_bit | phase_bit);
  if ((may & ScanTables::kRoleBit) && phase_ok) {
    if (L2Role(flags & 0x7F) == 1) {
      l2.l2c = phase;
      const unsigned number = NumberOf(sat);
      if (number >= 1 && number <= 32) st.c2.working_l2c_mask |= 1u << (number - 1);
    } else {
      l2.l2p = phase;
    }
  }
}

// Walks the signal blocks of one satellite, advancing the cursor past them, and adds their
// signal mask bits to mask. Returns true when the record ended inside a block. Only the flags
// are decoded as a rule: a value's window check can only withhold a mask bit, so once the
// bits a block could give are all in the mask its values need no look (the phase of a GPS L2C
// or L2P signal is always looked at, for the L2C note). A block that does not fit whole
// before the end is never read beyond the end and contributes nothing.
template <typename Order, bool kTag51>
bool WalkSignals(ScanState& st, BlockCursor& c, SatId sat, const uint32_t* gives, uint32_t& mask,
                 LayoutCache& cache, L2Phases& l2) {
  // The flag bits that decide a block's layout.
  constexpr uint16_t kLayoutBits = kSigCode | kSigPhase | kSigF32A | kSigCorrection |
                                   (kTag51 ? kSig51I16 | kSig51U16 : kSig8ByteA | kSig8ByteB);
  const uint8_t* p = c.p;
  uint32_t missing = ~mask | ScanTables::kRoleBit;
  bool truncated = false;
  for (;;) {
    uint16_t flags;
    uint32_t size;
    if (reinterpret_cast<uintptr_t>(p) <= c.safe) [[likely]] {
      flags = Order::template Load<uint16_t>(p);
      if ((flags & kLayoutBits) != cache.key) [[unlikely]]
        cache = {static_cast<uint32_t>(flags & kLayoutBits), SignalLayoutOf<kTag51>(flags).size};
      size = cache.size;
    } else {
      // Near the end of the record: the block must fit whole.
      if (c.end - p < 2) {
        truncated = true;
        break;
      }
      flags = Order::template Load<uint16_t>(p);
      size = SignalLayoutOf<kTag51>(flags).size;
      if (c.end - p < static_cast<ptrdiff_t>(size)) {
        truncated = true;
        break;
      }
    }
    const uint8_t* const block = p;
    p += size;
    if (const uint32_t may = gives[flags & 0x7F] & missing; may != 0) [[unlikely]]
      LearnFromBlock<Order, kTag51>(st, block, flags, may, sat, missing, l2);
    if (!(flags & kSigMore)) break;
  }
  c.p = p;
  mask |= ~missing & ScanTables::kMaskBits;
  return truncated;
}

// The signal masks and L2C notes of one epoch record. Kept out of line so that its walk gets
// the registers to itself.
template <typename Order, bool kTag51>
[[gnu::noinline]] void ScanEpoch(ScanState& st, ByteSpan body, uint32_t position) {
  EpochHeader h;
  const size_t n = RawCodec<Order>::Epoch(body, h);
  if (n == 0) return;  // too short to hold an epoch
  constexpr size_t kMaxSignal = RawCodec<Order>::kMaxSignal;
  const uintptr_t start = reinterpret_cast<uintptr_t>(body.data());
  BlockCursor c{body.data() + n, body.data() + body.size(),
                body.size() >= kMaxSignal ? start + body.size() - kMaxSignal : 0};

  RawTime raw{h.ms_of_day, st.time_ref.day};
  if (h.ms_of_day < st.time_ref.ms_of_day) ++raw.day;
  const TimeMs t = ToTimeMs(raw);

  // The file's masks only ever gain bits, so blocks add theirs to them directly; the extra
  // entry takes the (no) bits of satellites of no system.
  uint32_t masks[kSystemCount + 1];
  for (int k = 0; k < kSystemCount; ++k)
    masks[k] = st.file.signal_masks[k];
  masks[kSystemCount] = 0;
  ScanDetails* const details = st.details;
  const ScanTables& tables = st.tables;
  LayoutCache cache;
  for (unsigned left = h.sat_count; left != 0; --left) {
    // Both kinds of satellite block take four bytes: the code (two bytes for tag 51, one and
    // a byte not interpreted for tag 8), B2 and B3.
    static_assert(RawCodec<Order>::kMaxSatBlock == 4);
    if (c.end - c.p < 4) break;
    const uint16_t code = kTag51 ? Order::template Load<uint16_t>(c.p) : c.p[0];
    c.p += 4;
    const ScanTables::Sat& sat = tables.SatOf<kTag51>(code);
    if (details != nullptr && sat.decoded.valid)
      details->satellites_seen.set(SatIndexOf(sat.decoded.sat));

    L2Phases l2;
    const bool truncated = WalkSignals<Order, kTag51>(st, c, sat.decoded.sat, tables.gives[sat.row],
                                                      masks[sat.mask_index], cache, l2);
    // Only GPS satellites of group 0 have L2 phases.
    if (l2.Both())
      st.c2.Add(NumberOf(sat.decoded.sat), std::bit_cast<double>(l2.l2c),
                std::bit_cast<double>(l2.l2p));
    if (truncated) break;
  }
  for (int k = 0; k < kSystemCount; ++k)
    st.file.signal_masks[k] = masks[k];

  RegisterEpochTime(st, t, position);
  if (h.sat_count > st.file.max_satellites) st.file.max_satellites = h.sat_count;
}

template <typename Order, typename Record, typename Insert>
void StoreEphemeris(ScanState& st, ByteSpan body, size_t (*decode)(ByteSpan, Record&),
                    bool (*check)(const Record&), Insert insert) {
  Record r;
  bool stored = false;
  if (decode(body, r) != 0 && (check == nullptr || check(r)) && st.sinks.ephemerides != nullptr)
    stored = insert(*st.sinks.ephemerides, r);
  if (st.details) ++(stored ? st.details->ephemerides_stored : st.details->ephemerides_dropped);
}

template <typename Order>
void StorePosition(ScanState& st, ByteSpan body, bool two_byte) {
  SatPositionRecord r;
  bool stored = false;
  if (RawCodec<Order>::SatPosition(body, two_byte, r) != 0 && PassesCheck(r) &&
      st.sinks.precise != nullptr) {
    stored = st.sinks.precise->Insert(r.sat, ToTimeMs(r.time), r.position[0] * 1000.0,
                                      r.position[1] * 1000.0, r.position[2] * 1000.0,
                                      static_cast<float>(r.clock_us * 1e-6));
  }
  if (st.details) ++(stored ? st.details->positions_stored : st.details->positions_dropped);
}

template <typename Order>
void StoreMeteo(ScanState& st, ByteSpan body, uint8_t tag) {
  using C = RawCodec<Order>;
  if (st.sinks.meteo == nullptr) return;
  switch (tag) {
    case kTagMeteoSensor: {
      MeteoSensorRecord r;
      if (C::MeteoSensor(body, r) == 0) return;
      if (TMeteoTrack* t = TrackForFile(*st.sinks.meteo, st.file.id)) t->SetSensor(r);
      break;
    }
    case kTagMeteoPosition: {
      MeteoPositionRecord r;
      if (C::MeteoPosition(body, r) == 0) return;
      if (TMeteoTrack* t = TrackForFile(*st.sinks.meteo, st.file.id)) t->SetPosition(r);
      break;
    }
    default: {
      MeteoSampleRecord r;
      if (C::MeteoSample(body, r) == 0) return;
      if (TMeteoTrack* t = TrackForFile(*st.sinks.meteo, st.file.id)) t->Append(r);
      break;
    }
  }
}

// Routes one record to its store.
template <typename Order>
void Dispatch(ScanState& st, uint8_t tag, ByteSpan body, uint32_t position) {
  using C = RawCodec<Order>;
  switch (tag) {
    case kTagReceiver: {
      ReceiverRecord r;
      if (C::Receiver(body, r) != 0) st.file.receiver_text = ReceiverText(r);
      break;
    }
    case kTagTimeRef: {
      TimeRefRecord r;
      if (C::TimeRef(body, r) != 0) {
        st.time_ref = r.time;
        st.time_ref_position = position;
      }
      break;
    }
    case kTagEpoch8:
      ScanEpoch<Order, false>(st, body, position);
      break;
    case kTagEpoch51:
      ScanEpoch<Order, true>(st, body, position);
      break;
    case kTagGpsEphemeris:
    case kTagGpsHighEphemeris: {
      const bool high = tag == kTagGpsHighEphemeris;
      StoreEphemeris<Order, GpsEphemerisRecord>(
          st, body, &C::GpsEphemeris, &PassesCheck,
          [high](EphemerisStore& s, const GpsEphemerisRecord& r) { return s.InsertGps(r, high); });
      break;
    }
    case kTagGlonassEphemeris:
      StoreEphemeris<Order, GlonassEphemerisRecord>(
          st, body, &C::GlonassEphemeris, &PassesCheck,
          [](EphemerisStore& s, const GlonassEphemerisRecord& r) { return s.Insert(r); });
      break;
    case kTagSbasEphemeris:
      StoreEphemeris<Order, SbasEphemerisRecord>(
          st, body, &C::SbasEphemeris, &PassesCheck,
          [](EphemerisStore& s, const SbasEphemerisRecord& r) { return s.Insert(r); });
      break;
    case kTagGalileoEphemeris:
      StoreEphemeris<Order, GalileoEphemerisRecord>(
          st, body, &C::GalileoEphemeris, nullptr,
          [](EphemerisStore& s, const GalileoEphemerisRecord& r) { return s.Insert(r); });
      break;
    case kTagBdsEphemeris:
      StoreEphemeris<Order, BdsEphemerisRecord>(
          st, body, &C::BdsEphemeris, nullptr,
          [](EphemerisStore& s, const BdsEphemerisRecord& r) { return s.Insert(r); });
      break;
    case kTagSatPosition23:
      StorePosition<Order>(st, body, false);
      break;
    case kTagSatPosition56:
      StorePosition<Order>(st, body, true);
      break;
    case kTagMeteoSensor:
    case kTagMeteoPosition:
    case kTagMeteoSample:
      StoreMeteo<Order>(st, body, tag);
      break;
    default:
      break;
  }
}

template <typename Order>
int WalkRecords(ScanState& st, RecordReader& reader) {
  while (reader.next_tag() != kTagEnd) {
    const ReadResult result = reader.Next();
    if (result != ReadResult::kOk) {
      if (st.details) st.details->stop_offset = reader.position();
      if (result == ReadResult::kBadLength) {
        ScanLogf(st.sinks.log, " - Unexpected record length\n");
        return kScanNotUsable;
      }
      ScanLogf(st.sinks.log, " - Unexpected EOF\n");
      return kScanEndedEarly;
    }
    if (st.details) ++st.details->records_by_tag[reader.tag()];
    Dispatch<Order>(st, reader.tag(), reader.body(), reader.position());
  }
  if (st.details) st.details->stop_offset = reader.next_position();
  ScanLogf(st.sinks.log, " - Reached EOF\n");
  return kScanComplete;
}

int ScanRawFile(TChainItem& file, const ScanSinks& sinks, TBufFile& buf) {
  ScanLogf(sinks.log, "Scan file: %s\n", file.path.c_str());
  ScanState st{file, sinks, sinks.details, RawTime{}, 0, {}, {}, GetScanTables()};
  RecordReader reader(buf);
  const RawStart start = reader.Start();
  if (start.status != 0) {
    ScanLogf(sinks.log, "%s", start.message);
    return start.status;
  }
  if (st.details) st.details->order = start.order;
  const int status = start.order == ByteOrder::kBig ? WalkRecords<BigEndianOrder>(st, reader)
                                                    : WalkRecords<LittleEndianOrder>(st, reader);
  if (status != kScanComplete) return status;
  DecideC2(st.c2, file, sinks.log);
  ReportSignalsAndForceCopy(file, sinks.log);
  file.epoch_interval_ms = st.intervals.Interval();
  return kScanComplete;
}

}  // namespace

int ScanFile(TChainItem& file, const ScanSinks& sinks) {
  TBufFile buf;
  if (!buf.OpenRead(file.path)) {
    ScanLogf(sinks.log, "Can not open file: %s\n", file.path.c_str());
    return kScanCannotOpen;
  }
  uint8_t first[7] = {};
  const uint32_t got = buf.Read(first, sizeof first);
  int status = kScanNotUsable;
  if (LooksLikeRawFile(first, got)) {
    if (sinks.details) sinks.details->kind = ScanDetails::Kind::kRaw;
    status = ScanRawFile(file, sinks, buf);
  } else if (IsPreciseOrbitFile(buf)) {
    if (sinks.details) sinks.details->kind = ScanDetails::Kind::kPrecise;
    if (sinks.precise != nullptr) {
      status = ReadPreciseOrbitFile(buf, *sinks.precise);
    } else {
      PreciseStore scratch;
      status = ReadPreciseOrbitFile(buf, scratch);
    }
  }
  buf.Close();
  return status;
}

}  // namespace vox
