// The merge of an engine thread's file into the result file: any bytes as a thread file,
// appended to a freshly opened result file, which is then closed and checked: whatever the
// thread file held, the result file must stay a clean sequence of framed records from its
// header to its end record, holding exactly the records the merge reported.
#include <cstdint>
#include <fstream>
#include <iterator>
#include <vector>

#include "fuzz_file.h"
#include "results/result_file.h"

namespace {

uint16_t Load16(const uint8_t* p) {
  return static_cast<uint16_t>(p[0] | p[1] << 8);
}

// The number of records between the header and the end record; traps on any framing fault.
size_t CheckFraming(const std::vector<uint8_t>& bytes) {
  size_t at = 0, records = 0;
  bool header = false, end = false;
  while (at < bytes.size()) {
    if (end || bytes.size() - at < 5) __builtin_trap();
    const uint16_t length = Load16(&bytes[at + 1]);
    if (length < 5 || length > bytes.size() - at) __builtin_trap();
    if (Load16(&bytes[at + length - 2]) != length) __builtin_trap();
    const uint8_t kind = bytes[at];
    if (!header) {
      if (kind != vox::kKindHeader) __builtin_trap();
      header = true;
    } else if (kind == vox::kKindEnd) {
      end = true;
    } else {
      if (kind == vox::kKindHeader) __builtin_trap();
      ++records;
    }
    at += length;
  }
  if (!end) __builtin_trap();
  return records;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static voxfuzz::InputFile thread_file("thread.tmp");
  static voxfuzz::InputFile result_path("result.bin");
  if (!thread_file.Write(data, size)) return 0;

  vox::TResultFile result(result_path.path());
  if (!result.Open()) return 0;
  const size_t copied = result.Append(thread_file.path());
  if (!result.Close()) return 0;

  std::ifstream in(result_path.path(), std::ios::binary);
  const std::vector<uint8_t> bytes{std::istreambuf_iterator<char>(in),
                                   std::istreambuf_iterator<char>()};
  if (CheckFraming(bytes) != copied) __builtin_trap();
  return 0;
}
