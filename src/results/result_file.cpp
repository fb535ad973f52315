#include "results/result_file.h"

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <system_error>
#include <vector>

#include "base/le.h"
#include "platform/platform.h"
#include "results/plot_description.h"
#include "results/record_builder.h"

namespace vox {
namespace {

constexpr size_t kFrameBytes = 5;  // kind, leading length, trailing length
constexpr uint32_t kModeWrite = 2;
constexpr uint32_t kModeWriteKeep = kModeWrite | kFileAtEnd;  // no emptying; starts at the end
// A thread writer's buffer: the largest of the buffer-size rule. Larger buffers save few write
// calls but come from fresh memory pages for every thread, which costs more than the calls.
constexpr uint32_t kThreadFileBuffer = kLargestBufferSize;
// Records up to this size are framed on the stack and handed over in one write.
constexpr size_t kSmallRecord = 512;
// The largest run of records handed to one write call by the merge.
constexpr size_t kLargestRun = size_t{1} << 30;

// The on-disk payload of a plot line description handed over in memory form; empty when
// `count` is too short to hold the description's fixed part.
std::vector<uint8_t> EncodePlotLine(uint8_t kind, const uint8_t* bytes, size_t count) {
  RecordBuilder out;
  const size_t fixed =
      kind == kKindPlotLineV101 ? offsetof(PlotLineDescEx, name) : offsetof(PlotLineDescIm, name);
  if (bytes == nullptr || count < fixed) return {};
  const size_t room = count - fixed < kPlotNameMax ? count - fixed : kPlotNameMax;
  const char* name = reinterpret_cast<const char*>(bytes + fixed);
  const size_t n = strnlen(name, room);
  if (kind == kKindPlotLineV101) {
    PlotLineDescEx d;
    std::memcpy(&d, bytes, fixed);
    out.U16(d.stream_id).U16(d.flags).U16(d.sat_a).U16(d.sat_b).U16(d.index);
  } else {
    PlotLineDescIm d;
    std::memcpy(&d, bytes, fixed);
    out.U16(d.index).U8(d.value);
  }
  out.CountedString(std::string_view(name, n), kPlotNameMax);
  return {out.data(), out.data() + out.size()};
}

// The length of the leading run of whole records (framing intact) in bytes.
size_t WholeRecordsLength(const uint8_t* data, size_t size) {
  size_t at = 0;
  while (size - at >= kFrameBytes) {
    const uint16_t length = le::Load<uint16_t>(data + at + 1);
    if (length < kFrameBytes || length > size - at) break;
    if (le::Load<uint16_t>(data + at + length - 2) != length) break;
    at += length;
  }
  return at;
}

// A write that failed part-way (a full disk) leaves the file ending inside a record. Cutting
// it back to its last whole record gives readers a clean, if incomplete, file.
void TrimToWholeRecords(const std::string& path) {
  size_t keep = 0;
  {
    auto file = platform::OpenFile(path, platform::FileAccess::kRead,
                                   platform::FileCreation::kOpenExisting);
    if (!file) return;
    auto view = platform::MapWholeFile(*file);
    if (!view) return;  // empty, or not mappable: nothing to cut
    keep = WholeRecordsLength(view->data(), view->size());
    if (keep == view->size()) return;
  }
  std::error_code ignored;
  std::filesystem::resize_file(path, keep, ignored);
}

}  // namespace

uint32_t MessageType(uint32_t flags) {
  static constexpr uint8_t kTypes[16] = {0, 3, 4, 5, 0, 1, 2, 1, 7, 6, 0, 0, 0, 0, 0, 0};
  return kTypes[flags & 0xF];
}

bool TResultFile::Open() {
  if (!file_.OpenWrite(path_, kModeWrite)) return false;
  return WriteHeader();
}

bool TResultFile::OpenThreadFile() {
  file_.set_write_buffer_size(kThreadFileBuffer);
  if (!file_.OpenWrite(path_, kModeWriteKeep)) return false;
  if (file_.file_size() != 0 && !file_.OpenWrite(path_, kModeWrite)) return false;
  return WriteHeader();
}

bool TResultFile::WriteHeader() {
  RecordBuilder header;
  header.Bytes("$YRB", 4).U32(kResultFormatNumber).U16(0);
  WriteRecord(kKindHeader, header.data(), header.size());
  return true;
}

bool TResultFile::Close() {
  if (!file_.is_open()) return false;
  const bool end_written = WriteFramed(kKindEnd, nullptr, 0);
  // The end record alone is not enough: bytes still waiting in the buffer may fail to reach
  // the disk at the closing flush, and a result file that lost its tail must not be reported
  // as complete.
  const bool flushed = file_.Close();
  if (!end_written || !flushed) {
    TrimToWholeRecords(path_);
    return false;
  }
  // A file whose folder was removed while it was open takes every write and is gone
  // afterwards; such a result file was not written, whatever the writes said.
  return platform::FileExists(path_);
}

bool TResultFile::is_open() const {
  return file_.is_open();
}
bool TResultFile::good() const {
  return file_.is_open() && file_.status() == 0;
}

bool TResultFile::WriteRecord(uint8_t kind, const void* bytes, size_t count) {
  if (count > kMaxRecordPayload) return false;
  const auto* payload = static_cast<const uint8_t*>(bytes);
  if (kind == kKindPlotLineV100 || kind == kKindPlotLineV101) {
    const std::vector<uint8_t> encoded = EncodePlotLine(kind, payload, count);
    if (encoded.empty()) return false;
    return WriteFramed(kind, encoded.data(), encoded.size());
  }
  if (payload == nullptr && count != 0) return false;
  return WriteFramed(kind, payload, count);
}

bool TResultFile::WriteFramed(uint8_t kind, const uint8_t* payload, size_t count) {
  const uint16_t length = static_cast<uint16_t>(count + kFrameBytes);
  if (length <= kSmallRecord) {
    // Most records are small and many: one write call each.
    uint8_t frame[kSmallRecord];
    frame[0] = kind;
    le::Store<uint16_t>(&frame[1], length);
    if (count != 0) std::memcpy(&frame[3], payload, count);
    le::Store<uint16_t>(&frame[length - 2], length);
    file_.Write(frame, length);
    return good();
  }
  // Head, payload and tail go to the file one after the other, without a copy of the record
  // in between; after a failed write the later ones do nothing.
  uint8_t head[3] = {kind};
  le::Store<uint16_t>(&head[1], length);
  uint8_t tail[2];
  le::Store<uint16_t>(tail, length);
  file_.Write(head, sizeof head);
  file_.Write(payload, static_cast<uint32_t>(count));
  file_.Write(tail, sizeof tail);
  return good();
}

bool TResultFile::WriteMessage(const char* text, uint32_t flags) {
  if (flags & kMessageOpenLevel) ++nesting_depth;
  if (flags & kMessageCloseLevel) --nesting_depth;
  uint32_t type = MessageType(flags);
  if (flags & kMessageOpenLevel) type += 0x20;
  if (flags & kMessageCloseLevel) type += 0x40;
  if (flags & kMessageMark400) type += 0x80;
  RecordBuilder record;
  record.U32(type).U32(static_cast<uint32_t>(nesting_depth));
  record.CountedString(text != nullptr ? std::string_view(text) : std::string_view());
  return WriteRecord(kKindMessage, record.data(), record.size());
}

size_t TResultFile::Append(const std::string& thread_file_path) {
  auto file = platform::OpenFile(thread_file_path, platform::FileAccess::kRead,
                                 platform::FileCreation::kOpenExisting);
  if (!file) return 0;
  auto view = platform::MapWholeFile(*file);
  if (!view) return 0;
  const uint8_t* data = view->data();
  const size_t size = view->size();
  size_t copied = 0;
  size_t at = 0;
  size_t run = 0;  // start of the records checked but not yet written
  // Writes the checked records before `at` in as few calls as the write size allows.
  const auto write_run = [&] {
    while (run < at) {
      const size_t n = std::min(at - run, kLargestRun);
      file_.Write(data + run, static_cast<uint32_t>(n));
      run += n;
    }
  };
  // Every length is checked against the bytes that remain: a thread file cut short by a
  // crash or a full disk must end the copy, not carry the reader past the mapping. Only
  // records checked whole are written, so the copy is the same as one record at a time.
  while (size - at >= kFrameBytes) {
    const uint8_t kind = data[at];
    const uint16_t length = le::Load<uint16_t>(data + at + 1);
    if (length < kFrameBytes || length > size - at) break;
    if (le::Load<uint16_t>(data + at + length - 2) != length) break;
    if (kind == kKindEnd) break;
    if (kind == kKindHeader) {
      write_run();
      run = at + length;  // the header is left out
    } else {
      ++copied;
    }
    at += length;
  }
  write_run();
  return copied;
}

}  // namespace vox
