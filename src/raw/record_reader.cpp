#include "raw/record_reader.h"

#include "base/buf_file.h"

namespace vox {

RecordReader::RecordReader(TBufFile& file)
    : file_(file),
      buffer_(std::make_unique<std::array<uint8_t, kRecordBufferSize>>()),
      data_(buffer_->data()),
      decoder_(&DecoderFor(ByteOrder::kLittle)) {}

bool RecordReader::Fill(uint32_t count) {
  if (const uint8_t* in_place = file_.MappedBytes(offset_, count)) {
    data_ = in_place;
    offset_ += count;
    return true;
  }
  data_ = buffer_->data();
  file_.Seek(static_cast<int32_t>(offset_));
  const uint32_t got = file_.Read(buffer_->data(), count);
  offset_ += got;
  return got == count;
}

// The last five bytes of a read: check field of the current record, tag and length of the
// next one.
void RecordReader::TakeTrailer(uint32_t count) {
  const uint8_t* t = data_ + count - kRecordFrame;
  FieldCursor<LittleEndianOrder> le(ByteSpan(t, kRecordFrame));
  FieldCursor<BigEndianOrder> be(ByteSpan(t, kRecordFrame));
  if (decoder_->order == ByteOrder::kBig) {
    check_ = be.U16();
    next_tag_ = be.U8();
    next_length_ = be.U16();
  } else {
    check_ = le.U16();
    next_tag_ = le.U8();
    next_length_ = le.U16();
  }
}

namespace {
RawStart Fail(RawStart& s, int status, const char* message) {
  s.status = status;
  s.message = message;
  return s;
}
}  // namespace

RawStart RecordReader::Start() {
  RawStart s;
  offset_ = 0;
  if (!Fill(kHeaderReadSize)) return Fail(s, 2, " - Unexpected EOF\n");
  const uint8_t* b = data_;
  if (b[0] != kTagHeader) return Fail(s, 3, " - File Header expected\n");
  const auto order = OrderFromSignature(b + 3);
  if (!order) return Fail(s, 3, " - Unexpected signature\n");
  set_order(*order);
  s.order = *order;
  decoder_->header(ByteSpan(b + 3, kHeaderReadSize - 3), s.header);
  FieldCursor<LittleEndianOrder> le(ByteSpan(b + 1, 2));
  FieldCursor<BigEndianOrder> be(ByteSpan(b + 1, 2));
  const uint16_t length = *order == ByteOrder::kBig ? be.U16() : le.U16();
  if (s.header.type != 'N' && s.header.type != 'O') return Fail(s, 3, " - Unexpected type tag\n");
  if (s.header.version != 0) return Fail(s, 3, " - Unexpected version\n");
  if (!LengthOk(length)) return Fail(s, 3, " - Unexpected record length\n");
  // The header record is now the current one; read it again with its trailer.
  tag_ = kTagHeader;
  length_ = length;
  position_ = 0;
  offset_ = 3;
  if (!Fill(length)) return Fail(s, 2, " - Unexpected EOF\n");
  TakeTrailer(length);
  s.status = 0;
  return s;
}

ReadResult RecordReader::Next() {
  if (!LengthOk(next_length_)) return ReadResult::kBadLength;
  const uint32_t length = next_length_;
  position_ = offset_ - kRecordFrame;
  tag_ = next_tag_;
  length_ = static_cast<uint16_t>(length);
  if (!Fill(length)) {
    length_ = kRecordFrame;  // nothing of the damaged record is handed out
    return ReadResult::kTruncated;
  }
  TakeTrailer(length);
  return ReadResult::kOk;
}

bool RecordReader::Seek(uint32_t position) {
  offset_ = position;
  if (!Fill(kRecordFrame)) return false;
  TakeTrailer(kRecordFrame);
  return true;
}

bool LooksLikeRawFile(const uint8_t* first7, size_t size) {
  return size >= 7 && first7[0] == kTagHeader && OrderFromSignature(first7 + 3).has_value();
}

}  // namespace vox
