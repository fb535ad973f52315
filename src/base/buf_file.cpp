#include "base/buf_file.h"

#include <algorithm>
#include <cstring>
#include <new>

namespace vox {

uint32_t BufferSizeForVolume(const platform::VolumeInfo& info) {
  if (!info.known) return kDefaultBufferSize;
  if (info.remote) return kNetworkBufferSize;
  return static_cast<uint32_t>(
      std::clamp<uint64_t>(info.cluster_bytes, kDefaultBufferSize, kLargestBufferSize));
}

uint32_t BufferSizeForPath(const std::string& path) {
  if (path.empty()) return kDefaultBufferSize;
  // Packets on a network share are small; larger buffers only add latency.
  if (path.size() >= 2 && path[0] == '\\' && path[1] == '\\') return kNetworkBufferSize;
  return BufferSizeForVolume(platform::QueryVolume(path));
}

TBufFile::TBufFile() = default;

TBufFile::~TBufFile() {
  Close();
}

void TBufFile::Reset() {
  mapping_.reset();
  handle_.reset();
  storage_.reset();
  buffer_ = nullptr;
  cursor_ = 0;
  buffer_size_ = kDefaultBufferSize;
  buffered_ = 0;
  last_count_ = 0;
  file_size_ = 0;
  position_ = 0;
  target_ = 0;
  mapped_ = 0;
  mode_ = 0;
  status_ = 0;
  writing_ = false;
}

bool TBufFile::Close() {
  if (writing_ && handle_ != nullptr) Flush();
  const bool ok = (status_ & (kFileOpenFailed | kFileIoFailed)) == 0;
  Reset();
  return ok;
}

bool TBufFile::OpenRead(const std::string& path, uint32_t mode) {
  Close();
  mode_ = mode | kFileRead;
  handle_ = platform::OpenFile(path, platform::FileAccess::kRead,
                               platform::FileCreation::kOpenExisting, (mode & kFileTemporary) != 0);
  if (handle_ != nullptr) {
    const int64_t size = handle_->Size();
    if (size >= 0) file_size_ = static_cast<uint32_t>(std::min<int64_t>(size, UINT32_MAX));
    if (size >= 0 && size <= UINT32_MAX && mapping_allowed_) {
      mapping_ = platform::MapWholeFile(*handle_);
      if (mapping_ != nullptr) {
        buffer_ = mapping_->data();
        buffer_size_ = file_size_;
        buffered_ = file_size_;
        mapped_ = 1;
        return true;
      }
    }
    buffer_size_ = BufferSizeForPath(path);
    storage_.reset(new (std::nothrow) uint8_t[buffer_size_]);
    buffer_ = storage_.get();
    if (buffer_ != nullptr) return true;
  }
  const uint32_t kept_mode = mode_;
  Reset();
  mode_ = kept_mode;
  status_ = kFileOpenFailed;
  return false;
}

bool TBufFile::OpenWrite(const std::string& path, uint32_t mode) {
  Close();
  mode_ = mode | kFileWrite;
  writing_ = true;
  // Without a reason to keep the content, a file opened for writing starts empty.
  const auto creation = (mode & (kFileRead | kFileAtEnd | kFileAppend)) != 0
                            ? platform::FileCreation::kOpenOrCreate
                            : platform::FileCreation::kCreateAlways;
  handle_ = platform::OpenFile(path, platform::FileAccess::kWrite, creation,
                               (mode & kFileTemporary) != 0);
  if (handle_ != nullptr) {
    buffer_size_ = write_buffer_size_ != 0 ? write_buffer_size_ : BufferSizeForPath(path);
    storage_.reset(new (std::nothrow) uint8_t[buffer_size_]);
    buffer_ = storage_.get();
    if (buffer_ != nullptr) {
      const int64_t size = handle_->Size();
      file_size_ = static_cast<uint32_t>(std::clamp<int64_t>(size, 0, UINT32_MAX));
      if (mode & kFileAtEnd) target_ = static_cast<int32_t>(file_size_);
      return true;
    }
  }
  const uint32_t kept_mode = mode_;
  Reset();
  mode_ = kept_mode;
  status_ = kFileOpenFailed;
  return false;
}

// ---------------------------------------------------------------- reading

bool TBufFile::Reposition() {
  if (target_ == static_cast<int32_t>(position_)) return true;
  if (target_ < 0) {
    status_ |= kFileIoFailed;
    return false;
  }
  const auto target = static_cast<uint32_t>(target_);
  if (mapped_) {
    cursor_ = std::min(target, file_size_);
    buffered_ = file_size_ - cursor_;
    position_ = target;
    return true;
  }
  const uint32_t block_start = position_ - cursor_;
  const uint32_t data_end = position_ + buffered_;
  if (target >= block_start && target <= data_end) {
    cursor_ = target - block_start;
    buffered_ = data_end - target;
    position_ = target;
    return true;
  }
  // Re-read the whole block that holds the target, so that later refills stay aligned.
  const uint32_t block = target - target % buffer_size_;
  if (!handle_->Seek(block)) {
    status_ |= kFileIoFailed;
    return false;
  }
  const int64_t got = handle_->Read(storage_.get(), buffer_size_);
  if (got < 0) {
    status_ |= kFileIoFailed;
    return false;
  }
  cursor_ = std::min(target - block, static_cast<uint32_t>(got));
  buffered_ = static_cast<uint32_t>(got) - cursor_;
  position_ = target;
  return true;
}

bool TBufFile::Refill() {
  if (mapped_) {
    status_ |= kFileEof;
    return false;
  }
  const int64_t got = handle_->Read(storage_.get(), buffer_size_);
  if (got < 0) {
    status_ |= kFileIoFailed;
    return false;
  }
  if (got == 0) {
    status_ |= kFileEof;
    return false;
  }
  cursor_ = 0;
  buffered_ = static_cast<uint32_t>(got);
  return true;
}

uint32_t TBufFile::Read(void* destination, uint32_t count) {
  last_count_ = 0;
  if (status_ != 0 || handle_ == nullptr || writing_) return 0;
  if (!Reposition()) return 0;
  auto* out = static_cast<uint8_t*>(destination);
  uint32_t moved = 0;
  while (moved < count) {
    if (buffered_ == 0 && !Refill()) break;
    const uint32_t n = std::min(count - moved, buffered_);
    if (out != nullptr) std::memcpy(out + moved, buffer_ + cursor_, n);
    cursor_ += n;
    buffered_ -= n;
    position_ += n;
    moved += n;
  }
  target_ = static_cast<int32_t>(position_);
  last_count_ = moved;
  return moved;
}

int TBufFile::ReadByte() {
  last_count_ = 0;
  if (status_ != 0 || handle_ == nullptr || writing_) return -1;
  if (!Reposition()) return -1;
  if (buffered_ == 0 && !Refill()) return -1;
  const uint8_t byte = buffer_[cursor_];
  ++cursor_;
  --buffered_;
  ++position_;
  target_ = static_cast<int32_t>(position_);
  last_count_ = 1;
  return byte;
}

uint32_t TBufFile::ReadLine(char* destination, uint32_t capacity, uint8_t terminator) {
  last_count_ = 0;
  if (capacity == 0) return 0;
  destination[0] = '\0';
  if (status_ != 0 || handle_ == nullptr || writing_) return 0;
  if (!Reposition()) return 0;
  uint32_t consumed = 0;
  uint32_t stored = 0;
  while (stored < capacity - 1) {
    if (buffered_ == 0 && !Refill()) break;
    const uint8_t byte = buffer_[cursor_];
    ++cursor_;
    --buffered_;
    ++position_;
    ++consumed;
    if (byte == terminator) break;
    destination[stored++] = static_cast<char>(byte);
  }
  destination[stored] = '\0';
  target_ = static_cast<int32_t>(position_);
  last_count_ = consumed;
  return consumed;
}

void TBufFile::Seek(int32_t offset) {
  target_ = offset;
}

// ---------------------------------------------------------------- writing

bool TBufFile::WriteOut(uint32_t count) {
  buffered_ = 0;
  cursor_ = 0;
  if (count == 0) return true;
  if (handle_->Write(storage_.get(), count) != static_cast<int64_t>(count)) {
    status_ |= kFileIoFailed;
    return false;
  }
  return true;
}

bool TBufFile::MoveTo(int32_t target) {
  if (!WriteOut(buffered_)) return false;
  if (target < 0 || !handle_->Seek(target)) {
    status_ |= kFileIoFailed;
    return false;
  }
  position_ = static_cast<uint32_t>(target);
  return true;
}

uint32_t TBufFile::Write(const void* source, uint32_t count) {
  if (count == 0) {
    last_count_ = 0;
    return 0;
  }
  if (count == 1) return WriteByte(*static_cast<const uint8_t*>(source));
  last_count_ = 0;
  if (status_ != 0 || handle_ == nullptr || !writing_) return 0;
  if (mode_ & kFileAppend) target_ = static_cast<int32_t>(file_size_);
  if (target_ != static_cast<int32_t>(position_) && !MoveTo(target_)) return 0;
  const auto* in = static_cast<const uint8_t*>(source);
  // What does not fit the buffer's free room and would fill at least a whole buffer goes to
  // the OS in one call after the waiting bytes: copying it through the buffer only splits
  // it into buffer-sized calls.
  if (count > buffer_size_ - buffered_ && count >= buffer_size_) return WriteThrough(in, count);
  uint32_t accepted = 0;
  while (accepted < count) {
    const uint32_t n = std::min(count - accepted, buffer_size_ - buffered_);
    std::memcpy(storage_.get() + buffered_, in + accepted, n);
    buffered_ += n;
    cursor_ = buffered_;
    position_ += n;
    accepted += n;
    if (buffered_ == buffer_size_ && !WriteOut(buffered_)) break;
  }
  file_size_ = std::max(file_size_, position_);
  target_ = static_cast<int32_t>(position_);
  last_count_ = accepted;
  return accepted;
}

uint32_t TBufFile::WriteThrough(const uint8_t* source, uint32_t count) {
  uint32_t accepted = 0;
  if (WriteOut(buffered_)) {
    const int64_t put = handle_->Write(source, count);
    accepted = put > 0 ? static_cast<uint32_t>(put) : 0;
    if (accepted != count) status_ |= kFileIoFailed;
  }
  position_ += accepted;
  file_size_ = std::max(file_size_, position_);
  target_ = static_cast<int32_t>(position_);
  last_count_ = accepted;
  return accepted;
}

uint32_t TBufFile::WriteByte(uint8_t byte) {
  last_count_ = 0;
  if (status_ != 0 || handle_ == nullptr || !writing_) return 0;
  if (mode_ & kFileAppend) target_ = static_cast<int32_t>(file_size_);
  if (target_ != static_cast<int32_t>(position_) && !MoveTo(target_)) return 0;
  storage_[buffered_++] = byte;
  cursor_ = buffered_;
  ++position_;
  file_size_ = std::max(file_size_, position_);
  target_ = static_cast<int32_t>(position_);
  last_count_ = 1;
  if (buffered_ == buffer_size_) WriteOut(buffered_);
  return 1;
}

uint32_t TBufFile::WriteText(const char* text) {
  if (text == nullptr) return 0;
  return Write(text, static_cast<uint32_t>(std::strlen(text)));
}

void TBufFile::Flush() {
  if (status_ != 0 || handle_ == nullptr || !writing_) return;
  WriteOut(buffered_);
}

// ---------------------------------------------------------------- whole files

std::string ReadWholeFile(const std::string& path) {
  TBufFile file;
  std::string bytes;
  if (!file.OpenRead(path)) return bytes;
  bytes.reserve(file.file_size());
  char chunk[16384];
  while (const uint32_t n = file.Read(chunk, sizeof chunk))
    bytes.append(chunk, n);
  if (file.status() & kFileIoFailed) bytes.clear();  // half a job file is worse than none
  return bytes;
}

}  // namespace vox
