// Raw-file records built from the field conventions of vox_sdk_fields.h, so that the files
// our tools write decode to the same values the reference engines expect.
#pragma once

#include <cstdint>

#include "raw_writer.h"
#include "vox/vox_sdk_fields.h"

namespace voxtools {

// The ephemeris record of GPS satellite `gps_number` (1 to 37) with the orbit and clock of
// `p`. Satellites 1 to 32 give a tag-13 record; 33 to 37 a tag-45 record numbered 1 to 5,
// whose G24 is written so that the engine still reads "0 = healthy". The record time is toe
// on the week of p. `tag` receives the tag to write the record with.
RawGpsEphemeris GpsEphemerisFromOrbit(const vox_GpsOrbitParams& p, unsigned gps_number,
                                      uint8_t* tag = nullptr);

// The tag-47 record of GALILEO satellite `number` (1 to 30) with the orbit and clock of `p`
// (tgd and tgd2 are the two BGDs); the record time is toe on the week of p.
RawGalileoEphemeris GalileoEphemerisFromOrbit(const vox_GpsOrbitParams& p, unsigned number);

// The RawTime of a GPS time given in seconds since the time origin.
RawStamp StampOfSeconds(double seconds);

}  // namespace voxtools
