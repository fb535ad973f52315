#include "raw_writer.h"

#include <cstdio>
#include <cstring>
#include <type_traits>

namespace voxtools {

namespace {

constexpr uint16_t kMore = 1u << 7;
constexpr uint16_t kCode = 1u << 8;
constexpr uint16_t kPhase = 1u << 9;

}  // namespace

RawSignal RawSignal::Tag51(uint8_t signal_code, std::optional<double> code,
                           std::optional<double> phase) {
  RawSignal s;
  s.flags = signal_code & 0x7F;
  if (code) s.flags |= kCode, s.code = *code;
  if (phase) s.flags |= kPhase, s.phase = *phase;
  return s;
}

RawSignal RawSignal::Tag8(unsigned kind, std::optional<double> code, std::optional<double> phase) {
  RawSignal s;
  s.flags = static_cast<uint16_t>((kind & 3u) << 3);
  if (code) s.flags |= kCode, s.code = *code;
  if (phase) s.flags |= kPhase, s.phase = *phase;
  return s;
}

static unsigned GroupOf(char system, unsigned& number) {
  switch (system) {
    case 'S':
      return 1;
    case 'R':
      return 2;
    case 'E':
      return 4;
    case 'C':
      return 5;
    default:
      if (number > 32) {
        number -= 32;
        return 3;
      }
      return 0;
  }
}

uint16_t SatCode51(char system, unsigned number) {
  const unsigned g = GroupOf(system, number);
  return static_cast<uint16_t>((g << 6) | (number & 63));
}

uint8_t SatCode8(char system, unsigned number) {
  const unsigned g = GroupOf(system, number);
  return static_cast<uint8_t>(((g & 3) << 6) | (number & 63));
}

template <typename T>
void RawWriter::Put(T v) {
  uint8_t b[sizeof(T)];
  std::memcpy(b, &v, sizeof(T));
  // The host is little-endian (x86-64, as the library requires).
  if (order_ == RawOrder::kBig)
    for (size_t i = 0; i < sizeof(T) / 2; ++i)
      std::swap(b[i], b[sizeof(T) - 1 - i]);
  bytes_.insert(bytes_.end(), b, b + sizeof(T));
}

void RawWriter::Put16At(size_t at, uint16_t v) {
  const uint8_t lo = v & 0xFF, hi = v >> 8;
  bytes_[at] = order_ == RawOrder::kBig ? hi : lo;
  bytes_[at + 1] = order_ == RawOrder::kBig ? lo : hi;
}

RawWriter& RawWriter::Begin(uint8_t tag) {
  record_start_ = bytes_.size();
  bytes_.push_back(tag);
  Put<uint16_t>(0);
  return *this;
}
RawWriter& RawWriter::U8(uint8_t v) {
  return Put(v), *this;
}
RawWriter& RawWriter::U16(uint16_t v) {
  return Put(v), *this;
}
RawWriter& RawWriter::I16(int16_t v) {
  return Put(v), *this;
}
RawWriter& RawWriter::U32(uint32_t v) {
  return Put(v), *this;
}
RawWriter& RawWriter::F32(float v) {
  return Put(v), *this;
}
RawWriter& RawWriter::F64(double v) {
  return Put(v), *this;
}
RawWriter& RawWriter::Stamp(RawStamp t) {
  return U32(t.ms_of_day).U32(t.day);
}
RawWriter& RawWriter::Str(const std::string& s) {
  const size_t n = s.size() > 255 ? 255 : s.size();
  bytes_.push_back(static_cast<uint8_t>(n));
  bytes_.insert(bytes_.end(), s.begin(), s.begin() + static_cast<long>(n));
  return *this;
}
RawWriter& RawWriter::Zeros(size_t n) {
  bytes_.insert(bytes_.end(), n, 0);
  return *this;
}
RawWriter& RawWriter::Bytes(const std::vector<uint8_t>& b) {
  bytes_.insert(bytes_.end(), b.begin(), b.end());
  return *this;
}

RawWriter& RawWriter::End(std::optional<uint16_t> forced_length, uint16_t check) {
  Put<uint16_t>(check);
  const size_t length = bytes_.size() - record_start_;
  Put16At(record_start_ + 1, forced_length ? *forced_length : static_cast<uint16_t>(length));
  return *this;
}

RawWriter& RawWriter::Header(char type, uint16_t version, bool bad_signature) {
  Begin(1);
  const char* sig = bad_signature ? "XXXX" : (order_ == RawOrder::kBig ? "BRY$" : "$YRB");
  bytes_.insert(bytes_.end(), sig, sig + 4);
  U8(static_cast<uint8_t>(type)).U8(0).U16(0).U16(version);
  return End();
}

RawWriter& RawWriter::Receiver(const std::string& s1, const std::string& s2, const std::string& s3,
                               const std::string& s4, const std::string& s5) {
  Begin(2).Str(s1).Str(s2).Str(s3).Str(s4).Str(s5);
  return End();
}

RawWriter& RawWriter::TimeRef(const char* system, RawStamp time, std::optional<uint32_t> a,
                              std::optional<uint32_t> leap) {
  uint32_t word = 0;
  for (int i = 0; i < 3 && system[i] != '\0'; ++i)
    word |= static_cast<uint32_t>(static_cast<uint8_t>(system[i])) << (8 * i);
  if (a) word |= 1u << 26;
  if (leap) word |= 1u << 27;
  Begin(3).U32(word).Stamp(time);
  if (a) U32(*a);
  if (leap) U32(*leap);
  return End();
}

RawWriter& RawWriter::Epoch(uint8_t tag, uint32_t ms_of_day, const std::vector<RawSatellite>& sats,
                            std::optional<double> extra, std::optional<uint8_t> sat_count) {
  Begin(tag).U32(ms_of_day).U16(0);
  U8(extra ? 0x80 : 0).U8(sat_count ? *sat_count : static_cast<uint8_t>(sats.size()));
  if (extra) F64(*extra);
  for (const RawSatellite& sat : sats) {
    if (tag == 8)
      U8(static_cast<uint8_t>(sat.code)).U8(0);
    else
      U16(sat.code);
    U8(sat.b2).U8(sat.b3);
    for (size_t i = 0; i < sat.signals.size(); ++i) {
      const RawSignal& s = sat.signals[i];
      uint16_t flags = s.flags & static_cast<uint16_t>(~kMore);
      if (i + 1 < sat.signals.size()) flags |= kMore;
      U16(flags);
      if (tag == 8) {
        if (flags & (1u << 5)) U8(s.byte_a);
        if (flags & (1u << 6)) U8(s.byte_b);
      } else {
        if (flags & (1u << 15)) I16(s.i16);
        if (flags & (1u << 14)) U16(s.u16);
      }
      if (flags & kCode) F64(s.code);
      if (flags & kPhase) F64(s.phase);
      if (flags & (1u << 10)) F32(s.f32a);
      if (flags & (1u << 11)) F32(s.correction);
    }
  }
  return End();
}

RawWriter& RawWriter::GpsEphemeris(const RawGpsEphemeris& e, uint8_t tag) {
  Begin(tag).U8(e.number).Stamp(e.time).U32(e.g1).U32(e.g2);
  for (float f : e.g3_g7)
    F32(f);
  F64(e.g8).F64(e.g9).F64(e.g10);
  for (float f : e.g11_g16)
    F32(f);
  F64(e.g17).F64(e.g18).F32(e.g19).F64(e.g20).F32(e.g21);
  U8(e.g22).U16(0).U8(e.g23).U16(e.g24).U8(e.g25);
  return End();
}

RawWriter& RawWriter::BdsEphemeris(const RawBdsEphemeris& e) {
  Begin(49).U8(e.number).Stamp(e.time).U32(e.c1).U32(e.c2);
  for (float f : e.c3_c7)
    F32(f);
  F64(e.c8).F64(e.c9).F64(e.c10);
  for (float f : e.c11_c16)
    F32(f);
  F64(e.c17).F64(e.c18).F32(e.c19).F64(e.c20).F32(e.c21);
  U8(e.c22).U8(0).U8(e.c23).U8(e.c24).U8(e.c25);
  return End();
}

RawWriter& RawWriter::GlonassEphemeris(const RawGlonassEphemeris& e) {
  Begin(14).U8(e.slot).Stamp(e.time).F32(e.r1).F32(e.r2);
  for (double d : e.position)
    F64(d);
  for (float f : e.velocity)
    F32(f);
  for (float f : e.acceleration)
    F32(f);
  F64(0).U8(0).U8(0).U8(e.r3).U8(e.r4);
  return End();
}

RawWriter& RawWriter::SbasEphemeris(const RawSbasEphemeris& e) {
  Begin(21).U8(e.number).Stamp(e.time).U8(0).U8(e.s1).U8(e.s2).U32(e.reference_seconds);
  for (double d : e.s3_s5)
    F64(d);
  for (float f : e.s6_s13)
    F32(f);
  return End();
}

RawWriter& RawWriter::GalileoEphemeris(const RawGalileoEphemeris& e) {
  Begin(47).U8(e.number).Stamp(e.time).U32(e.e1).U32(e.e2);
  for (float f : e.e3_e6)
    F32(f);
  for (double d : e.e7_e10)
    F64(d);
  for (float f : e.e11_e17)
    F32(f);
  F64(e.e18).F64(e.e19).F32(e.e20).F64(e.e21).F32(e.e22);
  U16(e.e23).U16(0).U8(e.e24).U8(e.e25);
  return End();
}

RawWriter& RawWriter::SatPosition(const RawSatPosition& p, uint8_t tag) {
  Begin(tag);
  if (tag == 23)
    U8(static_cast<uint8_t>(p.code));
  else
    U16(p.code);
  Stamp(p.time).Zeros(22);
  for (double d : p.position)
    F64(d);
  Zeros(12).F64(p.clock_us).Zeros(5);
  return End();
}

RawWriter& RawWriter::MeteoSensor(uint16_t selector, float value, const std::string& name1,
                                  const std::string& name2) {
  Begin(15).U16(selector).F32(value).Str(name1).Str(name2);
  return End();
}

RawWriter& RawWriter::MeteoPosition(uint16_t selector, std::optional<std::vector<double>> xyz,
                                    std::optional<double> height) {
  uint16_t flags = selector & 7;
  if (xyz) flags |= 1u << 6;
  if (height) flags |= 1u << 7;
  Begin(16).U16(flags);
  if (xyz)
    for (size_t i = 0; i < 3; ++i)
      F64(i < xyz->size() ? (*xyz)[i] : 0.0);
  if (height) F64(*height);
  return End();
}

RawWriter& RawWriter::MeteoSample(const RawMeteoSample& s) {
  uint16_t flags = 0;
  if (s.pressure) flags |= 1;
  if (s.temperature) flags |= 2;
  if (s.humidity) flags |= 4;
  if (s.unused) flags |= 8;
  Begin(17).Stamp(s.time).U16(flags);
  if (s.pressure) F32(*s.pressure);
  if (s.temperature) F32(*s.temperature);
  if (s.humidity) F32(*s.humidity);
  if (s.unused) F32(*s.unused);
  return End();
}

RawWriter& RawWriter::EndOfData(bool cut) {
  bytes_.push_back(0);
  if (!cut) Put<uint16_t>(3);
  return *this;
}

bool RawWriter::Save(const std::string& path) const {
  std::FILE* f = std::fopen(path.c_str(), "wb");
  if (f == nullptr) return false;
  // An empty writer's buffer may be null, which fwrite must not be given even for no bytes.
  const bool ok =
      bytes_.empty() || std::fwrite(bytes_.data(), 1, bytes_.size(), f) == bytes_.size();
  return std::fclose(f) == 0 && ok;
}

}  // namespace voxtools
