// The engine-log listing of the prepared data (broadcast and precise ephemerides,
// occupations with their epochs, vectors with their occupations), written once per job after
// every file was scanned.
//
// Runs on the job thread during data preparation, before any engine exists.
#pragma once

#include "job/items.h"
#include "raw/scan_log.h"

namespace vox {

class EphemerisStore;
class PreciseStore;

void WritePreparationListing(const EphemerisStore& ephemerides, const PreciseStore& precise,
                             const ItemList<TOccupItem>& occupations,
                             const ItemList<TVectorItem>& vectors, const ScanLogSink& log = {});

}  // namespace vox
