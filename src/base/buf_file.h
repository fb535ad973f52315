// TBufFile: the buffered file through which every file of the library but the engine log is
// read and written. Files opened for reading are mapped into memory whole when the platform
// allows it, else read through a buffer sized for the volume that holds them.
//
// Failures are not reported by exceptions or return codes: each one sets a status bit, and
// while any status bit is set every read and write does nothing (a read returns end of
// data). Callers test status() where it matters.
//
// Thread safety: a TBufFile belongs to one thread at a time; it takes no locks.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "platform/platform.h"

namespace vox {

// Open mode bits.
constexpr uint32_t kFileRead = 0x1;
constexpr uint32_t kFileWrite = 0x2;
constexpr uint32_t kFileAtEnd = 0x4;        // open an existing file and continue at its end
constexpr uint32_t kFileAppend = 0x8;       // every write goes to the current end of the file
constexpr uint32_t kFileTemporary = 0x200;  // hidden and temporary attributes where they exist
// Bits other than these are carried in mode() and have no effect.

// Status bits.
constexpr uint8_t kFileEof = 0x1;
constexpr uint8_t kFileOpenFailed = 0x2;
constexpr uint8_t kFileIoFailed = 0x4;  // read, seek or write failed

// Buffer sizes of the buffer-size rule.
constexpr uint32_t kDefaultBufferSize = 4096;
constexpr uint32_t kNetworkBufferSize = 1500;
constexpr uint32_t kLargestBufferSize = 65536;

// The buffer size for a file on a volume described by info.
uint32_t BufferSizeForVolume(const platform::VolumeInfo& info);
// The buffer size for a file at path: 4096 without a path, 1500 for a network path or a
// remote volume, else the volume's cluster size limited to 4096..65536.
uint32_t BufferSizeForPath(const std::string& path);

class TBufFile {
 public:
  TBufFile();
  ~TBufFile();
  TBufFile(const TBufFile&) = delete;
  TBufFile& operator=(const TBufFile&) = delete;

  // Close an open file first, then open with mode | kFileRead (or | kFileWrite). On failure
  // the status is kFileOpenFailed and false is returned.
  bool OpenRead(const std::string& path, uint32_t mode = kFileRead);
  bool OpenWrite(const std::string& path, uint32_t mode = kFileWrite);

  // Moves up to count bytes to destination (skips them when it is null); returns the number
  // moved. Fewer than count means the end of the data or a failure (see status()).
  uint32_t Read(void* destination, uint32_t count);
  // The next byte, or -1 at the end of the data or on failure.
  int ReadByte();
  // The count bytes at offset inside the mapped view, for reading them in place; null when the
  // file is not mapped, a status bit is set, or the range does not lie whole inside the file.
  // Callers then fall back to Seek and Read, which behave exactly as before. The pointer
  // stays valid until the file is closed; the read position does not move.
  const uint8_t* MappedBytes(uint32_t offset, uint32_t count) const {
    if (!mapped_ || status_ != 0 || offset > static_cast<uint32_t>(INT32_MAX) ||
        count > file_size_ || offset > file_size_ - count)
      return nullptr;
    return buffer_ + offset;
  }
  // Reads up to capacity - 1 bytes, stopping after the first terminator, which is consumed
  // but not stored; destination is always zero-terminated (capacity > 0). Returns the number
  // of bytes consumed from the file, so 0 means there was nothing left to read.
  uint32_t ReadLine(char* destination, uint32_t capacity, uint8_t terminator);

  // The next read or write happens at offset.
  void Seek(int32_t offset);

  // Writes count bytes at the target offset; returns the number accepted.
  uint32_t Write(const void* source, uint32_t count);
  uint32_t WriteByte(uint8_t byte);
  uint32_t WriteText(const char* text);  // a zero-terminated string, without the zero
  // Hands the waiting bytes to the OS.
  void Flush();
  // Flushes a file open for writing, releases everything and returns to the created state.
  // Returns false when opening, a read, a seek or a write (including this last flush)
  // failed since the file was opened.
  bool Close();

  bool is_open() const { return handle_ != nullptr; }
  uint8_t status() const { return status_; }
  uint32_t mode() const { return mode_; }
  bool mapped() const { return mapped_ != 0; }
  uint32_t buffer_size() const { return buffer_size_; }
  uint32_t file_size() const { return file_size_; }
  uint32_t last_count() const { return last_count_; }
  // The offset at which the next operation happens.
  int32_t tell() const { return target_; }

  // Reading through the buffer must give the same bytes as reading a mapped view; tests
  // switch mapping off to compare the two. Takes effect at the next OpenRead.
  void set_mapping_allowed(bool allowed) { mapping_allowed_ = allowed; }
  // The buffer size of the next OpenWrite instead of the buffer-size rule (0: the rule).
  // For private temporaries that are written once and read back whole, where a few write
  // calls per megabyte cost less than one per cluster.
  void set_write_buffer_size(uint32_t bytes) { write_buffer_size_ = bytes; }

 private:
  void Reset();
  bool Reposition();              // reading: bring the cursor to the target
  bool Refill();                  // reading: the next buffer block
  bool MoveTo(int32_t target);    // writing: flush and set the OS file offset
  bool WriteOut(uint32_t count);  // writing: one write call of the waiting bytes
  uint32_t WriteThrough(const uint8_t* source, uint32_t count);  // writing: past the buffer

  std::unique_ptr<platform::File> handle_;
  std::unique_ptr<uint8_t[]> storage_;  // the I/O buffer (null when mapped)
  const uint8_t* buffer_ = nullptr;     // storage_ or the mapped view
  uint32_t cursor_ = 0;                 // index of the current place in buffer_
  uint32_t buffer_size_ = kDefaultBufferSize;
  uint32_t buffered_ = 0;  // reading: bytes after the cursor; writing: bytes waiting
  uint32_t last_count_ = 0;
  uint32_t file_size_ = 0;
  uint32_t position_ = 0;  // file offset of the cursor
  int32_t target_ = 0;     // file offset of the next operation
  std::unique_ptr<platform::MappedFile> mapping_;
  uint32_t mapped_ = 0;
  uint32_t mode_ = 0;
  uint8_t status_ = 0;
  bool writing_ = false;
  bool mapping_allowed_ = true;
  uint32_t write_buffer_size_ = 0;
};

// The whole file as one byte string; empty if it cannot be read. The OS error of a failed
// open is left for platform::LastSystemError().
std::string ReadWholeFile(const std::string& path);

}  // namespace vox
