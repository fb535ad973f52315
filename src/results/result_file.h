// TResultFile: the result writer. It frames records into the job's result file or into an
// engine thread's temporary file, writes the run's messages, and merges a thread's file
// into the job's file.
//
// File layout: a sequence of records [u8 kind][u16 length L][payload][u16 L], where L counts
// the whole record (payload + 5). The first record is the header (kind 1), the last the end
// record (kind 0).
//
// Concurrency: a writer is used by one thread at a time and has no lock of its own. The job
// thread uses the task's writer; each engine thread writes through its own thread writer.
// Records that several threads may write to the task's writer (occupation and solution
// records) are written under the task's "solution" lock, held by the caller.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "base/buf_file.h"

namespace vox {

// Record kinds of the result file.
enum ResultKind : uint8_t {
  kKindEnd = 0,
  kKindHeader = 1,
  kKindPlotLineV100 = 4,
  kKindMessage = 29,
  kKindSolutionStart = 30,
  kKindVector = 33,
  kKindOccupation = 34,
  kKindFan = 35,
  kKindRay = 36,
  kKindPlotEpochV100 = 37,
  kKindSatelliteA = 38,
  kKindSatelliteB = 39,
  kKindVectorSpan = 40,
  kKindFanSpan = 41,
  kKindSatelliteC = 52,
  kKindPlotLineV101 = 53,
  kKindPlotEpochV101 = 54,
  kKindSatelliteD = 55,
};

// Largest payload a record may carry (its length field then reads 16382).
constexpr size_t kMaxRecordPayload = 16377;
constexpr uint32_t kDefaultResultVersion = 100;
// The header's format number; fixed, it does not follow the job's result version.
constexpr uint32_t kResultFormatNumber = 4178;

// Message flags of WriteMessage.
constexpr uint32_t kMessageOpenLevel = 0x10;   // nest one level deeper (before writing)
constexpr uint32_t kMessageCloseLevel = 0x20;  // one level back
constexpr uint32_t kMessageMark400 = 0x400;

class TResultFile {
 public:
  TResultFile() = default;
  explicit TResultFile(std::string path) : path_(std::move(path)) {}
  ~TResultFile() = default;
  TResultFile(const TResultFile&) = delete;
  TResultFile& operator=(const TResultFile&) = delete;

  const std::string& path() const { return path_; }
  void set_path(std::string path) { path_ = std::move(path); }

  // Creates (replacing) the file and writes the header record. False when the file cannot
  // be created.
  bool Open();
  // Open for an engine thread's file, which CreateUniqueTempFile made new and empty. The
  // file is kept as it is rather than emptied again (some file systems, ext4 among them,
  // write a file that was emptied out to disk when it is closed, and a thread file is
  // deleted right after the merge), and it is written through the largest buffer the
  // buffer-size rule knows, whatever its volume, as it is private and read back whole. A
  // file that is not empty is replaced as by Open.
  bool OpenThreadFile();
  // Writes the end record, then flushes and closes the file. True when the end record and
  // everything before it reached the file.
  bool Close();
  bool is_open() const;
  // False once any write failed (or the file is not open).
  bool good() const;

  // Frames and writes one record. Kinds 4 and 53 take a plot line description in its
  // in-memory form (PlotLineDescIm / PlotLineDescEx) and store it encoded. False for a
  // payload above kMaxRecordPayload (nothing is written) or when the file is not good.
  bool WriteRecord(uint8_t kind, const void* bytes, size_t count);

  // A message record (kind 29). flags: low four bits choose the message type; 0x10 nests
  // one level deeper, 0x20 one level back; 0x400 marks the type. Text is cut to 255 bytes;
  // null is stored as empty.
  bool WriteMessage(const char* text, uint32_t flags);

  // Copies the records of a closed thread file into this writer, leaving out its header and
  // stopping at its end record. A record whose framing does not fit the file ends the copy.
  // Returns the number of records copied.
  size_t Append(const std::string& thread_file_path);

  // The writer's bookkeeping (see the class comment).
  int32_t nesting_depth = 0;
  uint32_t plot_counter = 0;  // raised by each plot stream opened on this writer
  uint32_t progress = 0;      // last progress percentage reported through this writer
  uint32_t result_version = kDefaultResultVersion;
  void* lock_slot = nullptr;  // reserved; no locking goes through it

 private:
  bool WriteFramed(uint8_t kind, const uint8_t* payload, size_t count);
  bool WriteHeader();

  std::string path_;
  TBufFile file_;
};

// The message type stored for the low four bits of the message flags.
uint32_t MessageType(uint32_t flags);

}  // namespace vox
