// The record reader of raw observation files: reads one record ahead through a TBufFile.
//
// After the tag and length L of a record are known, the reader reads exactly L bytes: the
// record's body, its check field, and the tag and length of the following record. A record's
// position (for seeking back to it later) is the offset of the check field in front of its
// tag, so that five bytes read there give (check, tag, length) of that record.
//
// When the file is mapped whole, records are read in place from the mapped view instead of
// being copied into the buffer; body() then points into the mapping (valid until the next
// Next() or Seek(), like the buffer). Either way the same bytes are handed out.
//
// Every length is validated before it is used: a record shorter than its frame or longer
// than the 16384-byte buffer stops the walk, and nothing outside the buffer is ever read or
// written, whatever the file holds.
//
// A reader belongs to one thread; it takes no locks.
#pragma once

#include <array>
#include <cstdint>
#include <memory>

#include "raw/field_cursor.h"
#include "raw/raw_decoder.h"
#include "raw/raw_records.h"

namespace vox {

class TBufFile;

enum class ReadResult {
  kOk,
  kTruncated,  // the file ended inside the record
  kBadLength,  // the length is below the frame or above the buffer
};

// What the file header said, with the walk status it implies.
struct RawStart {
  int status = 0;                 // 0: go on; 2: too short; 3: not usable
  const char* message = nullptr;  // the engine-log text of a failure
  ByteOrder order = ByteOrder::kLittle;
  HeaderRecord header;
};

class RecordReader {
 public:
  explicit RecordReader(TBufFile& file);

  // Reads and checks the file header, chooses the byte order, and reads one record ahead.
  // On success (status 0) the reader stands before the first record after the header.
  RawStart Start();

  // Reads the pending record (next_tag(), next_length()).
  ReadResult Next();

  // Goes to a remembered record position and reads the five bytes there; the record itself
  // is then read by Next().
  bool Seek(uint32_t position);

  // The record last read by Next().
  uint8_t tag() const { return tag_; }
  uint16_t length() const { return length_; }
  ByteSpan body() const { return ByteSpan(data_, length_ - kRecordFrame); }
  uint16_t check() const { return check_; }
  uint32_t position() const { return position_; }

  // The record after it: tag 0 ends the data.
  uint8_t next_tag() const { return next_tag_; }
  uint16_t next_length() const { return next_length_; }
  uint32_t next_position() const { return offset_ - kRecordFrame; }

  const RawDecoder& decoder() const { return *decoder_; }
  ByteOrder order() const { return decoder_->order; }
  void set_order(ByteOrder order) { decoder_ = &DecoderFor(order); }

  static bool LengthOk(uint32_t length) {
    return length >= kRecordFrame && length <= kRecordBufferSize;
  }

 private:
  // Makes the count bytes at the current offset available at data_: in place when the file
  // is mapped, else copied into the buffer.
  bool Fill(uint32_t count);
  void TakeTrailer(uint32_t count);

  TBufFile& file_;
  std::unique_ptr<std::array<uint8_t, kRecordBufferSize>> buffer_;
  const uint8_t* data_;  // the bytes of the last Fill: the buffer or the mapped view
  const RawDecoder* decoder_;
  uint32_t offset_ = 0;  // file offset after the last byte read
  uint8_t tag_ = 0;
  uint16_t length_ = kRecordFrame;
  uint16_t check_ = 0;
  uint32_t position_ = 0;
  uint8_t next_tag_ = 0;
  uint16_t next_length_ = 0;
};

// True when the first seven bytes of a file say it is a raw observation file: tag 1 and the
// signature in either byte order at bytes 3 to 6.
bool LooksLikeRawFile(const uint8_t* first7, size_t size);

}  // namespace vox
