// POSIX implementation of platform.h: files, file mapping, volumes and temporary files.
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/statfs.h>
#include <sys/statvfs.h>
#include <sys/types.h>
#include <time.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdio>
#include <cstdlib>

#include "platform/platform.h"

namespace vox::platform {
namespace {

class PosixFile final : public File {
 public:
  explicit PosixFile(int fd) : fd_(fd) {}
  ~PosixFile() override { ::close(fd_); }
  PosixFile(const PosixFile&) = delete;
  PosixFile& operator=(const PosixFile&) = delete;

  int fd() const { return fd_; }

  int64_t Size() const override {
    struct stat st;
    if (::fstat(fd_, &st) != 0 || !S_ISREG(st.st_mode)) return -1;
    return static_cast<int64_t>(st.st_size);
  }

  int64_t Read(void* destination, size_t count) override {
    for (;;) {
      ssize_t got = ::read(fd_, destination, count);
      if (got >= 0) return got;
      if (errno != EINTR) return -1;
    }
  }

  // Keeps writing until everything is out or the OS refuses; a partial write followed by a
  // refusal reports the part that was written so the caller sees a short count.
  int64_t Write(const void* source, size_t count) override {
    const char* bytes = static_cast<const char*>(source);
    size_t done = 0;
    while (done < count) {
      ssize_t put = ::write(fd_, bytes + done, count - done);
      if (put < 0) {
        if (errno == EINTR) continue;
        return done > 0 ? static_cast<int64_t>(done) : -1;
      }
      if (put == 0) break;
      done += static_cast<size_t>(put);
    }
    return static_cast<int64_t>(done);
  }

  bool Seek(int64_t offset) override {
    if (offset < 0) {
      errno = EINVAL;
      return false;
    }
    return ::lseek(fd_, static_cast<off_t>(offset), SEEK_SET) != static_cast<off_t>(-1);
  }

 private:
  int fd_;
};

class PosixMappedFile final : public MappedFile {
 public:
  PosixMappedFile(void* view, size_t size) : view_(view), size_(size) {}
  ~PosixMappedFile() override { ::munmap(view_, size_); }
  PosixMappedFile(const PosixMappedFile&) = delete;
  PosixMappedFile& operator=(const PosixMappedFile&) = delete;
  const uint8_t* data() const override { return static_cast<const uint8_t*>(view_); }
  size_t size() const override { return size_; }

 private:
  void* view_;
  size_t size_;
};

// Magic numbers (statfs f_type) of file systems whose data lives on another machine.
bool IsRemoteFileSystem(unsigned long type) {
  switch (type) {
    case 0x6969UL:      // NFS
    case 0x517BUL:      // SMB
    case 0xFF534D42UL:  // CIFS
    case 0xFE534D42UL:  // SMB2
    case 0x01021997UL:  // 9p
    case 0x564CUL:      // NCP
    case 0x73757245UL:  // Coda
    case 0x5346414FUL:  // OpenAFS
    case 0x6B414653UL:  // kAFS
    case 0x00C36400UL:  // Ceph
    case 0x0BD00BD0UL:  // Lustre
    case 0x47504653UL:  // GPFS
      return true;
    default:
      return false;
  }
}

bool QueryOne(const std::string& path, VolumeInfo& info) {
  struct statfs fs;
  struct statvfs vfs;
  if (::statfs(path.c_str(), &fs) != 0 || ::statvfs(path.c_str(), &vfs) != 0) return false;
  info.known = true;
  info.remote = IsRemoteFileSystem(static_cast<unsigned long>(fs.f_type));
  uint64_t cluster = vfs.f_frsize != 0 ? vfs.f_frsize : vfs.f_bsize;
  if (cluster == 0) cluster = static_cast<uint64_t>(fs.f_bsize);
  info.cluster_bytes = cluster;
  return true;
}

std::string ParentFolder(const std::string& path) {
  size_t slash = path.find_last_of('/');
  if (slash == std::string::npos) return ".";
  if (slash == 0) return "/";
  return path.substr(0, slash);
}

}  // namespace

std::unique_ptr<File> OpenFile(const std::string& path, FileAccess access, FileCreation creation,
                               bool /*hidden_temporary: POSIX has no such attributes*/) {
  int flags = O_CLOEXEC | (access == FileAccess::kRead ? O_RDONLY : O_WRONLY);
  switch (creation) {
    case FileCreation::kOpenExisting:
      break;
    case FileCreation::kOpenOrCreate:
      flags |= O_CREAT;
      break;
    case FileCreation::kCreateAlways:
      flags |= O_CREAT | O_TRUNC;
      break;
  }
  int fd;
  do {
    fd = ::open(path.c_str(), flags, 0666);
  } while (fd < 0 && errno == EINTR);
  if (fd < 0) return nullptr;
  // A folder opens for reading on POSIX but is no file for us.
  struct stat st;
  int error = 0;
  if (::fstat(fd, &st) != 0)
    error = errno;
  else if (S_ISDIR(st.st_mode))
    error = EISDIR;
  if (error != 0) {
    ::close(fd);
    errno = error;
    return nullptr;
  }
  return std::make_unique<PosixFile>(fd);
}

std::unique_ptr<MappedFile> MapWholeFile(File& file) {
  auto* posix = dynamic_cast<PosixFile*>(&file);
  if (posix == nullptr) return nullptr;
  int64_t size = posix->Size();
  if (size <= 0 || static_cast<uint64_t>(size) > SIZE_MAX) return nullptr;
  void* view = ::mmap(nullptr, static_cast<size_t>(size), PROT_READ, MAP_PRIVATE, posix->fd(), 0);
  if (view == MAP_FAILED) return nullptr;
  return std::make_unique<PosixMappedFile>(view, static_cast<size_t>(size));
}

bool FileExists(const std::string& path) {
  struct stat st;
  return ::stat(path.c_str(), &st) == 0;
}

bool DirectoryExists(const std::string& path) {
  struct stat st;
  return ::stat(path.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

bool RemoveFile(const std::string& path) {
  return ::unlink(path.c_str()) == 0;
}

// A file about to be created does not exist yet, so its folder answers for it.
VolumeInfo QueryVolume(const std::string& path) {
  VolumeInfo info;
  if (path.empty()) return info;
  if (!QueryOne(path, info)) QueryOne(ParentFolder(path), info);
  return info;
}

std::string TempFolder() {
  const char* tmpdir = std::getenv("TMPDIR");
  std::string folder = (tmpdir != nullptr && tmpdir[0] != '\0') ? tmpdir : "/tmp";
  if (folder.back() != '/') folder += '/';
  return folder;
}

std::string CreateUniqueTempFile(const std::string& folder, const std::string& prefix) {
  static std::atomic<uint32_t> counter{0};
  std::string base = folder;
  if (!base.empty() && base.back() != '/') base += '/';
  struct timespec now;
  ::clock_gettime(CLOCK_REALTIME, &now);
  uint32_t seed = static_cast<uint32_t>(::getpid()) * 2654435761u ^
                  static_cast<uint32_t>(now.tv_nsec) ^ static_cast<uint32_t>(now.tv_sec);
  for (int attempt = 0; attempt < 100000; ++attempt) {
    uint32_t number = seed + counter.fetch_add(1, std::memory_order_relaxed) * 0x9E3779B9u;
    char digits[9];
    std::snprintf(digits, sizeof digits, "%X", number);
    std::string path = base + prefix + digits + ".tmp";
    int fd = ::open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
    if (fd >= 0) {
      ::close(fd);
      return path;
    }
    if (errno != EEXIST && errno != EINTR) return std::string();
  }
  return std::string();
}

const char* NullDevicePath() {
  return "/dev/null";
}

std::FILE* OpenTextFileForWriting(const std::string& path) {
  return std::fopen(path.c_str(), "w");  // no line-end translation on POSIX
}

}  // namespace vox::platform
