#include "raw/scan.h"

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

// The working state of one raw file walk.
struct ScanState {
  TChainItem& file;
  const ScanSinks& sinks;
  ScanDetails* details;
  RawTime time_ref;
  uint32_t time_ref_position = 0;
  IntervalTable intervals;
  C2Collector c2;
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

// Decodes a satellite or signal block, without per-field bounds tests when the body surely
// holds the largest block.
template <typename Order>
size_t NextSatBlock(ByteSpan body, bool tag51, SatBlock& sat) {
  using C = RawCodec<Order>;
  if (body.size() >= C::kMaxSatBlock)
    return tag51 ? C::template SatBlock51<false>(body, sat)
                 : C::template SatBlock8<false>(body, sat);
  return tag51 ? C::template SatBlock51<true>(body, sat) : C::template SatBlock8<true>(body, sat);
}

template <typename Order>
size_t NextSignal(ByteSpan body, bool tag51, SignalBlock& s) {
  using C = RawCodec<Order>;
  if (body.size() >= C::kMaxSignal)
    return tag51 ? C::template Signal51<false>(body, s) : C::template Signal8<false>(body, s);
  return tag51 ? C::template Signal51<true>(body, s) : C::template Signal8<true>(body, s);
}

// The signal mask bits of one signal block (the scan's reading of the kind bits for tag 8).
inline uint32_t MaskBits(const SignalBlock& s, const SatBlock& sat, bool tag51) {
  if (!tag51) {
    const SignalSlot slot = Slot8ForMask(Kind8(s.flags));
    return ((s.flags & kSigCode) ? CodeBit(slot) : 0u) |
           ((s.flags & kSigPhase) ? PhaseBit(slot) : 0u);
  }
  const SignalSlot slot = Slot51Fast(sat.group, s.flags & 0x7F);
  if (slot == kNoSlot) return 0;
  const bool code_ok = (s.flags & kSigCode) && !(s.flags & kSigCodeBad);
  const bool phase_ok = (s.flags & kSigPhase) && !(s.flags & kSigPhaseBad);
  return (code_ok ? CodeBit(slot) : 0u) | (phase_ok ? PhaseBit(slot) : 0u);
}

// The signal masks and L2C notes of one epoch record.
template <typename Order>
void ScanEpoch(ScanState& st, ByteSpan body, bool tag51, uint32_t position) {
  EpochHeader h;
  size_t n = RawCodec<Order>::Epoch(body, h);
  if (n == 0) return;  // too short to hold an epoch
  body = body.subspan(n);

  RawTime raw{h.ms_of_day, st.time_ref.day};
  if (h.ms_of_day < st.time_ref.ms_of_day) ++raw.day;
  const TimeMs t = ToTimeMs(raw);

  uint32_t masks[kSystemCount] = {};
  for (unsigned i = 0; i < h.sat_count; ++i) {
    SatBlock sat;
    n = NextSatBlock<Order>(body, tag51, sat);
    if (n == 0) break;
    body = body.subspan(n);
    // A two-byte code of an unknown group names no system; its blocks are only consumed.
    const bool known = !tag51 || sat.group <= 5;
    const unsigned system = static_cast<unsigned>(SystemOf(sat.sat));
    if (sat.valid && st.details) st.details->satellites_seen.set(SatIndexOf(sat.sat));
    const bool gps0 = tag51 && sat.group == 0;
    uint32_t sat_mask = 0;
    double l2c = 0.0, l2p = 0.0;
    bool truncated = false;
    for (;;) {
      SignalBlock s;
      n = NextSignal<Order>(body, tag51, s);
      if (n == 0) {
        truncated = true;
        break;
      }
      body = body.subspan(n);
      sat_mask |= MaskBits(s, sat, tag51);
      if (gps0 && (s.flags & kSigPhase) && !(s.flags & kSigPhaseBad)) {
        const uint8_t code = s.flags & 0x7F;
        const unsigned number = NumberOf(sat.sat);
        if (code == 32 || code == 34 || code == 35) {
          l2c = s.phase;
          if (number >= 1 && number <= 32) st.c2.working_l2c_mask |= 1u << (number - 1);
        } else if (code == 36 || code == 37) {
          l2p = s.phase;
        }
      }
      if (!(s.flags & kSigMore)) break;
    }
    if (known) masks[system] |= sat_mask;
    if (gps0 && l2c != 0.0 && l2p != 0.0) st.c2.Add(NumberOf(sat.sat), l2c, l2p);
    if (truncated) break;
  }
  for (int k = 0; k < kSystemCount; ++k)
    st.file.signal_masks[k] |= masks[k];

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
      ScanEpoch<Order>(st, body, false, position);
      break;
    case kTagEpoch51:
      ScanEpoch<Order>(st, body, true, position);
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
  ScanState st{file, sinks, sinks.details, RawTime{}, 0, {}, {}};
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
