// voxdump's reader: any bytes decoded as a result file and every record described as voxdump
// prints it (JSON and text line). The records the reader returns must lie inside the input,
// in order, and a fault must point inside it too.
#include <cstdint>
#include <span>

#include "record_json.h"
#include "result_reader.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const vox::tools::ReadResult result = vox::tools::ReadResultBytes(std::span(data, size));
  vox::tools::RecordDescriber describer;
  uint64_t next = 0;
  for (const vox::tools::Record& r : result.records) {
    if (r.offset != next || r.offset + r.length > size) __builtin_trap();
    next = r.offset + r.length;
    const vox::tools::Json described = describer.Describe(r);
    (void)described.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
    (void)vox::tools::TextLine(described);
  }
  if (result.fault && result.fault->offset > size) __builtin_trap();
  return 0;
}
