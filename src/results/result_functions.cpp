#include "results/result_functions.h"

#include <cmath>
#include <cstddef>
#include <cstring>
#include <string>

#include "base/le.h"
#include "results/nmea_writer.h"
#include "results/record_builder.h"

namespace vox {
namespace {

// Engine records are read byte by byte at their documented offsets.
template <typename T>
T In(const void* record, size_t offset) {
  return le::Load<T>(static_cast<const uint8_t*>(record) + offset);
}

TimeMs InTime(const void* record, size_t offset) {
  return TimeMs{In<uint32_t>(record, offset), In<uint16_t>(record, offset + 4)};
}

struct Vec3 {
  double x, y, z;
};
Vec3 InVec(const void* record, size_t offset) {
  return {In<double>(record, offset), In<double>(record, offset + 8),
          In<double>(record, offset + 16)};
}
double Length(const Vec3& v) {
  return std::sqrt(v.x * v.x + v.y * v.y + v.z * v.z);
}

void SpanFields(RecordBuilder& r, const Span& span) {
  r.Time(span.start).Time(span.end).U32(span.value1).U32(span.value2).F32(span.value);
  r.CountedString(span.name, kSpanNameMax);
}

// Updates the solved positions of the vector's points; returns the outcome.
int StoreSolution(TPointItem* from, TPointItem* to, const Vec3& base, float base_rms,
                  const Vec3& baseline, float baseline_rms, double limit) {
  int outcome = kVectorStored;
  const Vec3 end{base.x + baseline.x, base.y + baseline.y, base.z + baseline.z};
  const float rms = std::sqrt(base_rms * base_rms + baseline_rms * baseline_rms);
  if (to != nullptr) {
    if (to->solved_set) {
      const Vec3 d{to->solved_x - end.x, to->solved_y - end.y, to->solved_z - end.z};
      if (Length(d) > limit) outcome = kVectorConflict;
      if (!(rms > to->solved_rms)) {
        to->solved_x = end.x, to->solved_y = end.y, to->solved_z = end.z;
        to->solved_rms = rms;
      }
    } else {
      to->solved_x = end.x, to->solved_y = end.y, to->solved_z = end.z;
      to->solved_rms = rms;
      to->solved_set = true;
    }
  }
  if (from != nullptr && !from->solved_set) {
    from->solved_x = base.x, from->solved_y = base.y, from->solved_z = base.z;
    from->solved_rms = 0;
    from->solved_set = true;
  }
  return outcome;
}

}  // namespace

uint32_t VectorResultFlags(bool solved, bool reversed, uint32_t f) {
  uint32_t flags = 0;
  if (solved) {
    flags = kResultSolved;
  } else {
    if (f & (1u << 29)) flags |= 0x20000000;
    if (f & (1u << 28)) flags |= 0x10000000;
    if (f & (1u << 27)) flags |= 0x08000000;
    if (f & (1u << 26)) flags |= 0x04000000;
    if (f & (1u << 25)) flags |= 0x02000000;
    if (f & ((1u << 17) | (1u << 24))) flags |= 0x01000000;
    if (f & (1u << 18)) flags |= 0x40000;
  }
  if (reversed) flags += kResultReversed;
  flags += f & 0x3;
  flags += f & 0xC;
  const uint32_t kind = f & 0xF0;
  if (kind >= 0x10 && kind <= 0x60) flags += kind;
  switch (f & 0x300) {
    case 0x100:
      flags += 0x100;
      break;
    case 0x200:
      flags += 0x300;
      break;
    case 0x300:
      flags += 0x200;
      break;
    default:
      break;
  }
  flags += f & 0x400;
  return flags;
}

int SetVectorResult(TResultFile& writer, TVectorItem* vector, uint32_t id,
                    const vox_VectorResult* result, TLock& solution_lock) {
  if (vector == nullptr || result == nullptr) return kVectorUnknown;
  const void* in = result;
  const bool solved = In<uint32_t>(in, offsetof(vox_VectorResult, solved)) != 0;
  const bool reversed = In<uint32_t>(in, offsetof(vox_VectorResult, reversed)) != 0;
  TPointItem* from = reversed ? vector->second_point : vector->first_point;
  TPointItem* to = reversed ? vector->first_point : vector->second_point;
  const uint32_t f = In<uint32_t>(in, offsetof(vox_VectorResult, solution_flags));

  TLockGuard guard(solution_lock);
  int outcome = kVectorStored;
  uint32_t flags = VectorResultFlags(solved, reversed, f);
  if (solved) {
    const Vec3 base = InVec(in, offsetof(vox_VectorResult, base));
    const Vec3 baseline = InVec(in, offsetof(vox_VectorResult, baseline));
    const float base_rms = In<float>(in, offsetof(vox_VectorResult, base_rms));
    const float baseline_rms = In<float>(in, offsetof(vox_VectorResult, baseline_rms));
    const double limit = Length(baseline) * 0.00001 + 1.0;
    if (static_cast<double>(baseline_rms) > limit) flags += kResultRmsOverLimit;
    outcome = StoreSolution(from, to, base, base_rms, baseline, baseline_rms, limit);
  }

  const auto* bytes = static_cast<const uint8_t*>(in);
  RecordBuilder r;
  r.U32(id & ~kVectorTag).U32(flags);
  r.Bytes(bytes + 8, 24).Bytes(bytes + 92, 16).Bytes(bytes + 108, 4).Bytes(bytes + 112, 4);
  r.Bytes(bytes + 36, 24).Bytes(bytes + 68, 16).Bytes(bytes + 84, 4).Bytes(bytes + 88, 4);
  if (vector->span.value < 0) {
    writer.WriteRecord(kKindVector, r.data(), r.size());
    return outcome;
  }
  r.U32(from != nullptr ? from->base_id & ~kPointTag : 0);
  r.U32(to != nullptr ? to->base_id & ~kPointTag : 0);
  SpanFields(r, vector->span);
  if (f & kResultExtraValue) {
    r.PatchU32(4, flags + kResultExtraValue);
    r.U32(1).Bytes(bytes + offsetof(vox_VectorResult, extra), 4);
  }
  writer.WriteRecord(kKindVectorSpan, r.data(), r.size());
  return outcome;
}

int SetFanResult(TResultFile& writer, TFanItem* fan, uint32_t id, const vox_FanResult* result) {
  if (fan == nullptr || result == nullptr) return 0;
  const bool has_position = In<uint32_t>(result, offsetof(vox_FanResult, has_position)) != 0;
  const Vec3 p = InVec(result, offsetof(vox_FanResult, position));
  fan->position[0] = p.x, fan->position[1] = p.y, fan->position[2] = p.z;
  RecordBuilder r;
  r.U32(id & ~kFanTag).U32(has_position ? kResultSolved : 0);
  if (has_position) {
    r.F64(p.x).F64(p.y).F64(p.z);
  } else {
    r.Zeros(24);
  }
  if (fan->span.value < 0) {
    r.Zeros(48);
    writer.WriteRecord(kKindFan, r.data(), r.size());
    return 1;
  }
  r.U32(fan->id);
  SpanFields(r, fan->span);
  writer.WriteRecord(kKindFanSpan, r.data(), r.size());
  return 1;
}

uint32_t RayRecordFlags(uint32_t ray_flags) {
  return ((ray_flags & 0x8) << 28) | (ray_flags & 0x7FFC0407);
}

uint32_t RayQuality(uint32_t ray_flags) {
  if (ray_flags & 0x3FFFE000) return 0;
  static constexpr uint32_t kByFix[4] = {4, 4, 5, 2};
  return kByFix[ray_flags & 0x3];
}

int SetNextRay(TResultFile& writer, TRayStream* stream, const vox_RayData* ray) {
  if (stream == nullptr || ray == nullptr) return 0;
  const TimeMs time = InTime(ray, offsetof(vox_RayData, time));
  const Vec3 p = InVec(ray, offsetof(vox_RayData, position));
  const uint32_t ray_flags = In<uint32_t>(ray, offsetof(vox_RayData, flags));
  const TFanItem& fan = *stream->fan;
  const auto* bytes = reinterpret_cast<const uint8_t*>(ray);
  RecordBuilder r;
  r.U32(fan.id & ~kFanTag).U32(RayRecordFlags(ray_flags)).Time(time);
  r.F64(p.x - fan.position[0]).F64(p.y - fan.position[1]).F64(p.z - fan.position[2]);
  r.Bytes(bytes + offsetof(vox_RayData, values), 12);
  r.Bytes(bytes + offsetof(vox_RayData, hdop), 4)
      .Bytes(bytes + offsetof(vox_RayData, satellites), 4);
  writer.WriteRecord(kKindRay, r.data(), r.size());
  if (NmeaOutputGood(stream->nmea)) {
    NmeaFix fix;
    fix.time = time;
    fix.x = p.x, fix.y = p.y, fix.z = p.z;
    fix.hdop = In<float>(ray, offsetof(vox_RayData, hdop));
    fix.satellites = In<uint32_t>(ray, offsetof(vox_RayData, satellites));
    fix.quality = RayQuality(ray_flags);
    WriteNmeaFix(stream->nmea, stream->sentences, fix);
  }
  return 1;
}

uint8_t SatelliteCode8(uint32_t v) {
  if (v > 37) return static_cast<uint8_t>((v - 37) | 0x80);
  if (v >= 33) return static_cast<uint8_t>((v - 32) | 0xC0);
  return static_cast<uint8_t>(v);
}

uint16_t SatelliteCode16(uint32_t v) {
  if (v < 33) return static_cast<uint16_t>(v);
  if (v <= 37) return static_cast<uint16_t>((v - 32) | 0xC0);
  if (v <= 61) return static_cast<uint16_t>((v - 37) | 0x80);
  if (v <= 98) return static_cast<uint16_t>((v - 61) | 0x140);
  if (v <= 128) return static_cast<uint16_t>((v - 98) | 0x100);
  if (v <= 149) return static_cast<uint16_t>((v - 128) | 0x40);
  return 0;
}

uint16_t SatelliteRecordFlags(uint16_t o, bool pair, bool timed) {
  uint16_t f = pair ? 0x100 : 0;
  if (o & 0x1) f |= 0x400;
  if (o & 0x2) f |= 1;
  if (o & 0x4) f |= 2;
  if (o & 0x40) f |= 6;
  if (o & 0x8) f |= 3;
  if (o & 0x10) f |= 4;
  if (o & 0x20) f |= 5;
  if (o & 0x100) f |= 0x10;
  if (o & 0x200) f |= 0x20;
  if (timed && (o & 0x8000)) f |= 0x8000;
  if (!timed && (o & 0x4000)) f |= 0x200;
  return f;
}

namespace {

// Kinds 39 (one-byte codes) and 52 (two-byte codes).
void WriteTimedSatellite(TResultFile& writer, const void* in, bool wide) {
  const auto* bytes = static_cast<const uint8_t*>(in);
  const uint8_t a = bytes[18], b = bytes[19];
  RecordBuilder r;
  r.U16(SatelliteRecordFlags(In<uint16_t>(in, 16), b != 0, true));
  r.U16(static_cast<uint16_t>(writer.plot_counter));
  if (wide) {
    r.U16(SatelliteCode16(a)).U16(SatelliteCode16(b));
  } else {
    r.U8(SatelliteCode8(a)).U8(SatelliteCode8(b));
  }
  r.Time(InTime(in, 20)).Time(InTime(in, 26)).Bytes(bytes + 32, 24);
  writer.WriteRecord(wide ? kKindSatelliteC : kKindSatelliteB, r.data(), r.size());
}

// Kinds 38 (one-byte codes) and 55 (two-byte codes).
void WriteShortSatellite(TResultFile& writer, const void* in, bool wide) {
  const auto* bytes = static_cast<const uint8_t*>(in);
  const uint8_t a = bytes[18], b = bytes[19];
  RecordBuilder r;
  r.U16(static_cast<uint16_t>(writer.plot_counter));
  r.U16(SatelliteRecordFlags(In<uint16_t>(in, 16), b != 0, false));
  if (wide) {
    r.U16(SatelliteCode16(a)).U16(SatelliteCode16(b));
  } else {
    r.U8(SatelliteCode8(a)).U8(SatelliteCode8(b));
  }
  r.Bytes(bytes + 20, 12);
  writer.WriteRecord(wide ? kKindSatelliteD : kKindSatelliteA, r.data(), r.size());
}

// The span fields of kinds 6 and 7 at `at` (start, end, two values, float, name); the name
// is read no further than the record's end, whatever its terminator.
Span ReadSpan(const void* in, size_t at, uint32_t size) {
  Span span;
  span.start = InTime(in, at);
  span.end = InTime(in, at + 6);
  span.value1 = In<uint32_t>(in, at + 12);
  span.value2 = In<uint32_t>(in, at + 16);
  span.value = In<float>(in, at + 20);
  const char* name = static_cast<const char*>(in) + at + 24;
  span.name.assign(name, strnlen(name, size - (at + 24)));
  return span;
}

}  // namespace

int CopyData(TResultFile& writer, uint32_t kind, const void* record, uint32_t size,
             const ItemList<TVectorItem>& vectors, const ItemList<TFanItem>& fans,
             uint32_t* done_units) {
  if (kind == 9) {
    ++writer.plot_counter;
    return 0;
  }
  if (record == nullptr) return 0;
  switch (kind) {
    case 1: {
      RecordBuilder r;
      r.U32(In<uint32_t>(record, 0)).U32(In<uint32_t>(record, 4) & 0xE5FFFFFF);
      writer.WriteRecord(kKindSolutionStart, r.data(), r.size());
      writer.plot_counter = 0;
      if (done_units != nullptr) ++*done_units;
      return 1;
    }
    case 5:
    case 10:
      if (size < 56) return 0;
      WriteTimedSatellite(writer, record, kind == 10);
      return 1;
    case 8:
    case 11:
      if (size < 32) return 0;
      WriteShortSatellite(writer, record, kind == 11);
      return 1;
    case 6: {
      if (size < 168) return 0;
      TVectorItem* v = vectors.FindById(In<uint32_t>(record, 124) | kVectorTag);
      if (v == nullptr) return 0;
      v->span = ReadSpan(record, 128, size);
      return 1;
    }
    case 7: {
      if (size < 76) return 0;
      TFanItem* fan = fans.FindById(In<uint32_t>(record, 32) | kFanTag);
      if (fan == nullptr) return 0;
      fan->span = ReadSpan(record, 36, size);
      return 1;
    }
    default:
      return 0;
  }
}

}  // namespace vox
