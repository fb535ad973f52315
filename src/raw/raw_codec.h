// The one description of every raw record, as decoders templated over the byte order.
//
// Each decoder reads its record or block from the front of a byte span and returns the number
// of bytes it consumed, or 0 when the span is too short (the record is then damaged and its
// values must not be used). Values that fail their window check lose their presence bit here,
// so every later stage sees them as absent. raw_decoder.h instantiates these for both orders;
// the scan uses them directly inside its per-order walk.
#pragma once

#include <array>

#include "raw/field_cursor.h"
#include "raw/raw_records.h"
#include "raw/signal_rules.h"

namespace vox {

// Where a signal block's code and phase values lie and how long the block is, from its flags
// alone. This mirrors Signal8 and Signal51 below (a test holds them together), so that a walk
// needing only a few values can step over the rest without decoding them.
struct SignalLayout {
  uint8_t size;
  uint8_t code_at;
  uint8_t phase_at;
};

namespace detail {
// Layout index: bits 0-3 the code, phase and two 32-bit value flags; bits 4-5 the two leading
// extras (16-bit words for tag 51, bytes for tag 8).
constexpr std::array<SignalLayout, 64> MakeSignalLayouts(bool tag51) {
  std::array<SignalLayout, 64> table{};
  for (unsigned i = 0; i < 64; ++i) {
    const unsigned extras = ((i >> 4) & 1u) + ((i >> 5) & 1u);
    const unsigned code_at = 2 + extras * (tag51 ? 2 : 1);
    const unsigned phase_at = code_at + ((i & 1u) ? 8 : 0);
    const unsigned size = phase_at + ((i & 2u) ? 8 : 0) + ((i & 4u) ? 4 : 0) + ((i & 8u) ? 4 : 0);
    table[i] = {static_cast<uint8_t>(size), static_cast<uint8_t>(code_at),
                static_cast<uint8_t>(phase_at)};
  }
  return table;
}
inline constexpr std::array<SignalLayout, 64> kSignalLayouts8 = MakeSignalLayouts(false);
inline constexpr std::array<SignalLayout, 64> kSignalLayouts51 = MakeSignalLayouts(true);
}  // namespace detail

template <bool kTag51>
constexpr const SignalLayout& SignalLayoutOf(uint16_t flags) {
  static_assert(kSigCode == 1u << 8 && kSigPhase == 1u << 9 && kSigF32A == 1u << 10 &&
                kSigCorrection == 1u << 11);
  if constexpr (kTag51) {
    static_assert(kSig51U16 == 1u << 14 && kSig51I16 == 1u << 15);
    return detail::kSignalLayouts51[((flags >> 8) & 0x0Fu) | ((flags >> 10) & 0x30u)];
  } else {
    static_assert(kSig8ByteA == 1u << 5 && kSig8ByteB == 1u << 6);
    return detail::kSignalLayouts8[((flags >> 8) & 0x0Fu) | ((flags >> 1) & 0x30u)];
  }
}

template <typename Order>
struct RawCodec {
  using Cursor = FieldCursor<Order>;

  static size_t Header(ByteSpan b, HeaderRecord& r) {
    Cursor c(b);
    for (uint8_t& s : r.signature)
      s = c.U8();
    r.type = static_cast<char>(c.U8());
    r.byte5 = c.U8();
    r.word6 = c.U16();
    r.version = c.U16();
    return c.Result();
  }

  static size_t Receiver(ByteSpan b, ReceiverRecord& r) {
    Cursor c(b);
    c.String(r.s1);
    c.String(r.s2);
    c.String(r.s3);
    c.String(r.s4);
    c.String(r.s5);
    return c.Result();
  }

  static size_t TimeRef(ByteSpan b, TimeRefRecord& r) {
    Cursor c(b);
    r.system_word = c.U32();
    r.time = c.Time();
    r.has_field_a = (r.system_word & TimeRefRecord::kFieldABit) != 0;
    r.has_leap = (r.system_word & TimeRefRecord::kLeapBit) != 0;
    r.field_a = r.has_field_a ? c.U32() : 0;
    r.leap_seconds = r.has_leap ? c.U32() : 0;
    return c.Result();
  }

  static size_t Epoch(ByteSpan b, EpochHeader& h) {
    Cursor c(b);
    h.ms_of_day = c.U32();
    h.word4 = c.U16();
    h.flags = c.U8();
    h.sat_count = c.U8();
    h.extra = (h.flags & 0x80) ? c.F64() : 0.0;
    return c.Result();
  }

  // The largest sizes of the blocks of epoch records.
  static constexpr size_t kMaxSatBlock = 4;
  static constexpr size_t kMaxSignal = 2 + 2 + 2 + 8 + 8 + 4 + 4;

  // Tag 8: one-byte code, one byte not interpreted, B2, B3.
  static size_t SatBlock8(ByteSpan b, SatBlock& s) {
    Cursor c(b);
    s.code = c.U8();
    c.Skip(1);
    s.b2 = c.U8();
    s.b3 = c.U8();
    const DecodedSat d = DecodeSatCode(s.code, false);
    s.sat = d.sat, s.group = d.group, s.valid = d.valid;
    return c.Result();
  }

  // Tag 51: two-byte code, B2, B3.
  static size_t SatBlock51(ByteSpan b, SatBlock& s) {
    Cursor c(b);
    s.code = c.U16();
    s.b2 = c.U8();
    s.b3 = c.U8();
    const DecodedSat d = DecodeSatCode(s.code, true);
    s.sat = d.sat, s.group = d.group, s.valid = d.valid;
    return c.Result();
  }

  static size_t Signal8(ByteSpan b, SignalBlock& s) {
    Cursor c(b);
    s.flags = c.U16();
    s.byte_a = (s.flags & kSig8ByteA) ? c.U8() : 0;
    s.byte_b = (s.flags & kSig8ByteB) ? c.U8() : 0;
    ReadValues(c, s);
    return c.Result();
  }

  static size_t Signal51(ByteSpan b, SignalBlock& s) {
    Cursor c(b);
    s.flags = c.U16();
    s.i16 = (s.flags & kSig51I16) ? c.I16() : 0;
    s.u16 = (s.flags & kSig51U16) ? c.U16() : 0;
    ReadValues(c, s);
    return c.Result();
  }

  static size_t GpsEphemeris(ByteSpan b, GpsEphemerisRecord& r) {
    Cursor c(b);
    r.number = c.U8();
    r.time = c.Time();
    r.g1 = c.U32();
    r.g2 = c.U32();
    c.Array(r.g3_g7);
    r.g8 = c.F64();
    r.g9 = c.F64();
    r.g10 = c.F64();
    c.Array(r.g11_g16);
    r.g17 = c.F64();
    r.g18 = c.F64();
    r.g19 = c.F32();
    r.g20 = c.F64();
    r.g21 = c.F32();
    r.g22 = c.U8();
    r.unused118 = c.U16();
    r.g23 = c.U8();
    r.g24 = c.U16();
    r.g25 = c.U8();
    return c.Result();
  }
  static bool Check(const GpsEphemerisRecord& r) {
    return InWindow<-33, 8>(r.g8) && InWindow<-33, 8>(r.g20);
  }

  static size_t BdsEphemeris(ByteSpan b, BdsEphemerisRecord& r) {
    Cursor c(b);
    r.number = c.U8();
    r.time = c.Time();
    r.c1 = c.U32();
    r.c2 = c.U32();
    c.Array(r.c3_c7);
    r.c8 = c.F64();
    r.c9 = c.F64();
    r.c10 = c.F64();
    c.Array(r.c11_c16);
    r.c17 = c.F64();
    r.c18 = c.F64();
    r.c19 = c.F32();
    r.c20 = c.F64();
    r.c21 = c.F32();
    r.c22 = c.U8();
    r.unused118 = c.U8();
    r.c23 = c.U8();
    r.c24 = c.U8();
    r.c25 = c.U8();
    return c.Result();
  }

  static size_t GlonassEphemeris(ByteSpan b, GlonassEphemerisRecord& r) {
    Cursor c(b);
    r.slot = c.U8();
    r.time = c.Time();
    r.r1 = c.F32();
    r.r2 = c.F32();
    c.Array(r.position);
    c.Array(r.velocity);
    c.Array(r.acceleration);
    r.unused65 = c.F64();
    c.Skip(2);  // two bytes not used
    r.r3 = c.U8();
    r.r4 = c.U8();
    return c.Result();
  }
  static bool Check(const GlonassEphemerisRecord& r) {
    return InWindow<-33, 18>(r.position[0]) && InWindow<-33, 18>(r.position[1]);
  }

  static size_t SbasEphemeris(ByteSpan b, SbasEphemerisRecord& r) {
    Cursor c(b);
    r.number = c.U8();
    r.time = c.Time();
    r.unused9 = c.U8();
    r.s1 = c.U8();
    r.s2 = c.U8();
    r.reference_seconds = c.U32();
    c.Array(r.s3_s5);
    c.Array(r.s6_s13);
    return c.Result();
  }
  static bool Check(const SbasEphemerisRecord& r) {
    return InWindow<-33, 28>(r.s3_s5[0]) && InWindow<-33, 28>(r.s3_s5[1]);
  }

  static size_t GalileoEphemeris(ByteSpan b, GalileoEphemerisRecord& r) {
    Cursor c(b);
    r.number = c.U8();
    r.time = c.Time();
    r.e1 = c.U32();
    r.e2 = c.U32();
    c.Array(r.e3_e6);
    c.Array(r.e7_e10);
    c.Array(r.e11_e17);
    r.e18 = c.F64();
    r.e19 = c.F64();
    r.e20 = c.F32();
    r.e21 = c.F64();
    r.e22 = c.F32();
    r.e23 = c.U16();
    r.unused127 = c.U16();
    r.e24 = c.U8();
    r.e25 = c.U8();
    return c.Result();
  }

  // Tag 23 (one-byte code) or 56 (two-byte code).
  static size_t SatPosition(ByteSpan b, bool two_byte, SatPositionRecord& r) {
    Cursor c(b);
    r.code = two_byte ? c.U16() : c.U8();
    const DecodedSat d = DecodeSatCode(r.code, two_byte);
    r.sat = d.sat;
    r.valid = d.valid;
    r.time = c.Time();
    c.Skip(21 + 1);
    c.Array(r.position);
    c.Skip(12);
    r.clock_us = c.F64();
    c.Skip(4 + 1);
    return c.Result();
  }
  static bool Check(const SatPositionRecord& r) {
    return r.valid && InWindow<-33, 28>(r.position[0]) && InWindow<-33, 28>(r.position[1]);
  }

  static size_t MeteoSensor(ByteSpan b, MeteoSensorRecord& r) {
    Cursor c(b);
    r.selector = c.U16();
    r.value = c.F32();
    c.String(r.name1);
    c.String(r.name2);
    return c.Result();
  }

  static size_t MeteoPosition(ByteSpan b, MeteoPositionRecord& r) {
    Cursor c(b);
    r.flags = c.U16();
    if (r.flags & MeteoPositionRecord::kXyzBit) {
      r.x = c.F64();
      r.y = c.F64();
      r.z = c.F64();
    }
    if (r.flags & MeteoPositionRecord::kHeightBit) r.height = c.F64();
    return c.Result();
  }

  static size_t MeteoSample(ByteSpan b, MeteoSampleRecord& r) {
    Cursor c(b);
    r.time = c.Time();
    r.flags = c.U16();
    r.pressure = (r.flags & 1) ? c.F32() : DefaultPressure();
    r.temperature = (r.flags & 2) ? c.F32() : kDefaultTemperature;
    r.humidity = (r.flags & 4) ? c.F32() : kDefaultHumidity;
    r.unused = (r.flags & 8) ? c.F32() : 0.0f;
    return c.Result();
  }

 private:
  // The optional values shared by both signal block kinds, each checked as it is read.
  static void ReadValues(Cursor& c, SignalBlock& s) {
    if (s.flags & kSigCode) {
      s.code = c.F64();
      if (!CodeValueOk(s.code)) s.flags &= ~kSigCode;
    }
    if (s.flags & kSigPhase) {
      s.phase = c.F64();
      if (!PhaseValueOk(s.phase)) s.flags &= ~kSigPhase;
    }
    if (s.flags & kSigF32A) {
      s.f32a = c.F32();
      if (!Float32ValueOk(s.f32a)) s.flags &= ~kSigF32A;
    }
    if (s.flags & kSigCorrection) {
      s.correction = c.F32();
      if (!Float32ValueOk(s.correction)) s.flags &= ~kSigCorrection;
    }
  }
};

}  // namespace vox
