// TRayStream: a fan's output channel for rays. Every ray goes to the result file; when the
// fan names an NMEA output (GGAPath), each ray also becomes a GGA sentence there.
//
// A ray stream belongs to the engine thread that opened it; it takes no lock.
#pragma once

#include <cstdint>
#include <memory>

#include "base/buf_file.h"
#include "job/items.h"

namespace vox {

struct TRayStream {
  explicit TRayStream(TFanItem& f) : fan(&f) {}
  TFanItem* fan;
  TBufFile nmea;           // the fan's NMEA output; stays closed without a GGA path
  uint32_t sentences = 0;  // sentences written to it (the first one brings the ZDA line)
};

// A stream for the fan, with its NMEA output opened (replacing an existing file) when the fan
// has a GGA path. A failed open leaves the stream usable, without NMEA output. Null when
// memory is short.
std::unique_ptr<TRayStream> OpenRayStream(TFanItem& fan);
// Flushes and closes the NMEA output and frees the stream (null: nothing). Returns 1.
int CloseRayStream(TRayStream* stream);

}  // namespace vox
