// Turns decoded result records into ordered JSON objects (the --json output) and into the
// one-line text form of voxdump. Plot epochs are shown with the names of their lines, which
// the describer remembers from the line records read before them.
#pragma once

#include <map>
#include <string>
#include <utility>

#include <nlohmann/json.hpp>

#include "result_reader.h"

namespace vox::tools {

using Json = nlohmann::ordered_json;

class RecordDescriber {
 public:
  // The record as a JSON object: offset, kind, name, then its fields. Times are objects with
  // "date" and "gps_seconds"; identifiers and flag words are hexadecimal strings, flag words
  // come with their bits spelled out in "<field>_names".
  Json Describe(const Record& record);

 private:
  std::string LineName(bool v101, uint16_t stream_id, uint16_t index) const;

  std::map<std::pair<uint16_t, uint16_t>, std::string> v101_names_;  // (stream, line)
  std::map<uint16_t, std::string> v100_names_;                       // line
};

// One line of text: "@offset name(kind) key=value ...".
std::string TextLine(const Json& described);

// Bits spelled out (exposed for the tests of the tool).
std::string VectorFlagNames(uint32_t flags);
std::string PlotLineFlagNames(uint16_t flags);

}  // namespace vox::tools
