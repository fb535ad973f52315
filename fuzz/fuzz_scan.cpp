// The raw file walk: any bytes as a file item with two occupations over it, scanned into
// every store the scan fills.
#include <cstdint>

#include "fuzz_file.h"
#include "job/items.h"
#include "raw/ephemeris_store.h"
#include "raw/meteo_track.h"
#include "raw/precise_store.h"
#include "raw/scan.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static voxfuzz::InputFile input("scan.bin");
  if (!input.Write(data, size)) return 0;

  vox::TChainItem file(1, input.path(), false, false);
  vox::TOccupItem whole(1), part(2);
  whole.SetFile(&file);
  part.begin = TimeMs{13204u * 86400u + 3600u, 0};
  part.end = TimeMs{13204u * 86400u + 7200u, 500};
  part.SetFile(&file);

  vox::EphemerisStore ephemerides;
  vox::PreciseStore precise;
  vox::MeteoTrackList meteo;
  vox::ScanDetails details;
  vox::ScanSinks sinks;
  sinks.ephemerides = &ephemerides;
  sinks.precise = &precise;
  sinks.meteo = &meteo;
  sinks.log.write = [](void*, const char*) {};
  sinks.details = &details;
  vox::ScanFile(file, sinks);
  return 0;
}
