// The two complete raw record decoders, one per byte order, as tables of functions built from
// the single description in raw_codec.h. Readers choose one table per file (DecoderFor) and
// then never test the byte order again.
#pragma once

#include <optional>

#include "raw/field_cursor.h"
#include "raw/raw_records.h"

namespace vox {

struct RawDecoder {
  ByteOrder order;
  size_t (*header)(ByteSpan, HeaderRecord&);
  size_t (*receiver)(ByteSpan, ReceiverRecord&);
  size_t (*time_ref)(ByteSpan, TimeRefRecord&);
  size_t (*epoch)(ByteSpan, EpochHeader&);
  size_t (*sat_block8)(ByteSpan, SatBlock&);
  size_t (*sat_block51)(ByteSpan, SatBlock&);
  size_t (*signal8)(ByteSpan, SignalBlock&);
  size_t (*signal51)(ByteSpan, SignalBlock&);
  size_t (*gps_ephemeris)(ByteSpan, GpsEphemerisRecord&);
  size_t (*bds_ephemeris)(ByteSpan, BdsEphemerisRecord&);
  size_t (*glonass_ephemeris)(ByteSpan, GlonassEphemerisRecord&);
  size_t (*sbas_ephemeris)(ByteSpan, SbasEphemerisRecord&);
  size_t (*galileo_ephemeris)(ByteSpan, GalileoEphemerisRecord&);
  size_t (*sat_position)(ByteSpan, bool two_byte, SatPositionRecord&);
  size_t (*meteo_sensor)(ByteSpan, MeteoSensorRecord&);
  size_t (*meteo_position)(ByteSpan, MeteoPositionRecord&);
  size_t (*meteo_sample)(ByteSpan, MeteoSampleRecord&);
};

const RawDecoder& DecoderFor(ByteOrder order);

// The byte order of a file from the four signature bytes as stored, or nothing when they
// spell neither "$YRB" nor "BRY$".
std::optional<ByteOrder> OrderFromSignature(const uint8_t* four_bytes);

// Value checks of the records that have one (ephemerides of GPS layout, GLONASS and SBAS,
// satellite positions); a record that fails is dropped.
bool PassesCheck(const GpsEphemerisRecord& r);
bool PassesCheck(const GlonassEphemerisRecord& r);
bool PassesCheck(const SbasEphemerisRecord& r);
bool PassesCheck(const SatPositionRecord& r);

}  // namespace vox
