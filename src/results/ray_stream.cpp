#include "results/ray_stream.h"

#include <new>

#include "results/nmea_writer.h"

namespace vox {

std::unique_ptr<TRayStream> OpenRayStream(TFanItem& fan) {
  std::unique_ptr<TRayStream> stream(new (std::nothrow) TRayStream(fan));
  if (!stream) return nullptr;
  if (!fan.nmea_path.empty()) stream->nmea.OpenWrite(fan.nmea_path, kNmeaOpenMode);
  return stream;
}

int CloseRayStream(TRayStream* stream) {
  if (stream == nullptr) return 1;
  stream->nmea.Close();
  delete stream;
  return 1;
}

}  // namespace vox
