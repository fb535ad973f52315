// The two commands of voxraw. Each returns the process exit code: 0 for a file read to its
// end, 1 when the file is damaged or cannot be read, 2 when it is neither a raw observation
// file nor a precise orbit file.
#pragma once

#include <string>

namespace voxraw {

int Dump(const std::string& path, bool json);
int Info(const std::string& path, bool json);

}  // namespace voxraw
