// Win32 implementation of platform.h: files, file mapping, volumes and temporary files.
#include <windows.h>

#include <cstdio>

#include "platform/platform.h"
#include "platform/win32/win32_text.h"

namespace vox::platform {
namespace {

class Win32File final : public File {
 public:
  explicit Win32File(HANDLE handle) : handle_(handle) {}
  ~Win32File() override { CloseHandle(handle_); }
  Win32File(const Win32File&) = delete;
  Win32File& operator=(const Win32File&) = delete;

  HANDLE handle() const { return handle_; }

  int64_t Size() const override {
    LARGE_INTEGER size;
    if (GetFileType(handle_) != FILE_TYPE_DISK || !GetFileSizeEx(handle_, &size)) return -1;
    return size.QuadPart;
  }

  // One call moves at most 4 GiB - 1; larger counts go in pieces.
  int64_t Read(void* destination, size_t count) override {
    auto* bytes = static_cast<char*>(destination);
    size_t done = 0;
    while (done < count) {
      DWORD piece = static_cast<DWORD>(count - done > 0x40000000 ? 0x40000000 : count - done);
      DWORD got = 0;
      if (!ReadFile(handle_, bytes + done, piece, &got, nullptr)) {
        return done > 0 ? static_cast<int64_t>(done) : -1;
      }
      done += got;
      if (got < piece) break;  // end of file
    }
    return static_cast<int64_t>(done);
  }

  int64_t Write(const void* source, size_t count) override {
    const auto* bytes = static_cast<const char*>(source);
    size_t done = 0;
    while (done < count) {
      DWORD piece = static_cast<DWORD>(count - done > 0x40000000 ? 0x40000000 : count - done);
      DWORD put = 0;
      if (!WriteFile(handle_, bytes + done, piece, &put, nullptr)) {
        return done > 0 ? static_cast<int64_t>(done) : -1;
      }
      if (put == 0) break;
      done += put;
    }
    return static_cast<int64_t>(done);
  }

  bool Seek(int64_t offset) override {
    if (offset < 0) {
      SetLastError(ERROR_NEGATIVE_SEEK);
      return false;
    }
    LARGE_INTEGER target;
    target.QuadPart = offset;
    return SetFilePointerEx(handle_, target, nullptr, FILE_BEGIN) != 0;
  }

 private:
  HANDLE handle_;
};

class Win32MappedFile final : public MappedFile {
 public:
  Win32MappedFile(HANDLE mapping, const void* view, size_t size)
      : mapping_(mapping), view_(view), size_(size) {}
  ~Win32MappedFile() override {
    UnmapViewOfFile(view_);
    CloseHandle(mapping_);
  }
  Win32MappedFile(const Win32MappedFile&) = delete;
  Win32MappedFile& operator=(const Win32MappedFile&) = delete;
  const uint8_t* data() const override { return static_cast<const uint8_t*>(view_); }
  size_t size() const override { return size_; }

 private:
  HANDLE mapping_;
  const void* view_;
  size_t size_;
};

// The root of the volume that holds path: "\\server\share\" for a network path, "X:\" for a
// path with a drive, else the current directory's drive.
std::wstring VolumeRoot(const std::wstring& path) {
  if (path.size() >= 2 && (path[0] == L'\\' || path[0] == L'/') &&
      (path[1] == L'\\' || path[1] == L'/')) {
    size_t server_end = path.find_first_of(L"\\/", 2);
    if (server_end == std::wstring::npos) return path + L"\\";
    size_t share_end = path.find_first_of(L"\\/", server_end + 1);
    return path.substr(0, share_end == std::wstring::npos ? path.size() : share_end) + L"\\";
  }
  if (path.size() >= 2 && path[1] == L':') return path.substr(0, 2) + L"\\";
  wchar_t current[MAX_PATH];
  DWORD length = GetCurrentDirectoryW(MAX_PATH, current);
  if (length >= 2 && length < MAX_PATH && current[1] == L':') {
    return std::wstring(current, 2) + L"\\";
  }
  return {};
}

DWORD Attributes(const std::string& path) {
  return GetFileAttributesW(win32::WideFromUtf8(path).c_str());
}

}  // namespace

std::unique_ptr<File> OpenFile(const std::string& path, FileAccess access, FileCreation creation,
                               bool hidden_temporary) {
  DWORD disposition = OPEN_EXISTING;
  if (creation == FileCreation::kOpenOrCreate) disposition = OPEN_ALWAYS;
  if (creation == FileCreation::kCreateAlways) disposition = CREATE_ALWAYS;
  const DWORD attributes =
      hidden_temporary ? FILE_ATTRIBUTE_HIDDEN | FILE_ATTRIBUTE_TEMPORARY : FILE_ATTRIBUTE_NORMAL;
  HANDLE handle = CreateFileW(win32::WideFromUtf8(path).c_str(),
                              access == FileAccess::kRead ? GENERIC_READ : GENERIC_WRITE,
                              FILE_SHARE_READ, nullptr, disposition, attributes, nullptr);
  if (handle == INVALID_HANDLE_VALUE) return nullptr;
  return std::make_unique<Win32File>(handle);
}

std::unique_ptr<MappedFile> MapWholeFile(File& file) {
  auto* win = dynamic_cast<Win32File*>(&file);
  if (win == nullptr) return nullptr;
  int64_t size = win->Size();
  if (size <= 0 || static_cast<uint64_t>(size) > SIZE_MAX) return nullptr;
  HANDLE mapping = CreateFileMappingW(win->handle(), nullptr, PAGE_READONLY, 0, 0, nullptr);
  if (mapping == nullptr) return nullptr;
  const void* view = MapViewOfFile(mapping, FILE_MAP_READ, 0, 0, 0);
  if (view == nullptr) {
    CloseHandle(mapping);
    return nullptr;
  }
  return std::make_unique<Win32MappedFile>(mapping, view, static_cast<size_t>(size));
}

bool FileExists(const std::string& path) {
  return Attributes(path) != INVALID_FILE_ATTRIBUTES;
}

bool DirectoryExists(const std::string& path) {
  DWORD attributes = Attributes(path);
  return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
}

bool RemoveFile(const std::string& path) {
  return DeleteFileW(win32::WideFromUtf8(path).c_str()) != 0;
}

VolumeInfo QueryVolume(const std::string& path) {
  VolumeInfo info;
  if (path.empty()) return info;
  const std::wstring root = VolumeRoot(win32::WideFromUtf8(path));
  if (root.empty()) return info;
  if (GetDriveTypeW(root.c_str()) == DRIVE_REMOTE) {
    info.known = true;
    info.remote = true;
    return info;
  }
  DWORD sectors_per_cluster = 0, bytes_per_sector = 0, free_clusters = 0, clusters = 0;
  if (!GetDiskFreeSpaceW(root.c_str(), &sectors_per_cluster, &bytes_per_sector, &free_clusters,
                         &clusters)) {
    return info;
  }
  info.known = true;
  info.cluster_bytes = static_cast<uint64_t>(sectors_per_cluster) * bytes_per_sector;
  return info;
}

std::string TempFolder() {
  wchar_t buffer[MAX_PATH + 2];
  DWORD length = GetTempPathW(MAX_PATH + 1, buffer);
  if (length == 0 || length > MAX_PATH + 1) return ".\\";
  std::string folder = win32::Utf8FromWide(std::wstring_view(buffer, length));
  if (folder.back() != '\\' && folder.back() != '/') folder += '\\';
  return folder;
}

// The system makes the name from the first three characters of the prefix, hexadecimal
// digits and ".tmp", and creates the file.
std::string CreateUniqueTempFile(const std::string& folder, const std::string& prefix) {
  wchar_t name[MAX_PATH];
  if (GetTempFileNameW(win32::WideFromUtf8(folder).c_str(), win32::WideFromUtf8(prefix).c_str(), 0,
                       name) == 0) {
    return std::string();
  }
  return win32::Utf8FromWide(name);
}

const char* NullDevicePath() {
  return "nul";
}

std::FILE* OpenTextFileForWriting(const std::string& path) {
  return _wfopen(win32::WideFromUtf8(path).c_str(), L"wt");
}

}  // namespace vox::platform
