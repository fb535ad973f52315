// The demo's report: what the engines computed, read back from the result file, against the
// simulator's truth. Per vector the baseline, its rms and its difference from the truth; per
// fan the number of rays and their error statistics; per occupation the navigation position.
#pragma once

#include <map>
#include <ostream>
#include <string>
#include <vector>

#include "result_reader.h"

namespace voxdemo {

struct Xyz {
  double v[3] = {};
};

// What a truth file of voxsim says: station marks and the moving antenna per epoch.
struct Truth {
  std::map<std::string, Xyz> marks;
  std::map<long long, Xyz> track;  // by epoch time in milliseconds
};
// Reads a truth file; false when it cannot be read.
bool ReadTruth(const std::string& path, Truth& truth);

// Writes the report; returns false when the result file had a fault.
bool Report(const vox::tools::ReadResult& result, const Truth& truth,
            const std::vector<std::string>& nmea_files, std::ostream& out);

}  // namespace voxdemo
