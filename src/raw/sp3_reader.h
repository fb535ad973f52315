// The reader of precise orbit files in the SP3 layout (versions a, b and c): recognising one
// by its first line, and reading its position samples into the satellite position store.
//
// Thread safety: called by the scan on the job thread; touches only the file and the store
// it is given.
#pragma once

#include <string_view>

#include "base/buf_file.h"
#include "raw/precise_store.h"

namespace vox {

// Line capacity of the reader: 95 characters and the terminating zero.
constexpr uint32_t kPreciseLineCapacity = 96;

// Statuses of ReadPreciseOrbitFile, as the scan reports them for a file.
constexpr int kPreciseFileEnded = 2;      // the file ended before all announced epochs
constexpr int kPreciseFileMalformed = 3;  // a header line or an epoch line is not as expected
constexpr int kPreciseFileComplete = 4;

// Whether line (the first line of a file, without its line feed; a final carriage return is
// ignored) is the header line of a precise orbit file: exactly 60 characters, "#", version
// "a" to "c", "P" or "V", and a plausible date (year 1970 to 2070).
bool IsPreciseOrbitHeader(std::string_view line);

// Reads the first line of file from its start and tests it.
bool IsPreciseOrbitFile(TBufFile& file);

// Reads the whole file from its start and inserts every usable position sample into store.
// Samples inserted before an error stay. Returns kPreciseFileEnded, kPreciseFileMalformed or
// kPreciseFileComplete.
int ReadPreciseOrbitFile(TBufFile& file, PreciseStore& store);

}  // namespace vox
