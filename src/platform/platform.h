// The operating-system layer of vox: the only place in the tree that includes an OS header.
// One implementation per OS (posix/, win32/). Paths are UTF-8 byte strings here; the win32
// implementation converts them to UTF-16 at the call.
//
// Thread safety: every function may be called from any thread; objects (Thread, Semaphore,
// File, MappedFile) are used by one owner at a time unless said otherwise.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <functional>
#include <memory>
#include <string>
#include <string_view>

namespace vox::platform {

// ---------------------------------------------------------------- threads

using ThreadProc = uint32_t (*)(void* argument);

// A started thread. Destroying a Thread that is still running detaches it.
class Thread {
 public:
  virtual ~Thread() = default;
  virtual uint32_t id() const = 0;
  // Waits up to timeout_ms (UINT32_MAX: no limit); true once the thread has ended.
  virtual bool Wait(uint32_t timeout_ms) = 0;
  virtual bool HasEnded() const = 0;
  // The thread's exit status; 259 ("still active") while it runs.
  virtual uint32_t ExitStatus() const = 0;
};

// Starts proc(argument) on a new thread with the given stack size in bytes (rounded up to
// what the OS accepts). Null when the thread cannot be created.
std::unique_ptr<Thread> StartThread(ThreadProc proc, void* argument, size_t stack_bytes);

uint32_t CurrentThreadId();

// Waits up to timeout_ms for any of the threads to end (null entries are ignored);
// returns the index of an ended thread, or -1 on timeout.
int WaitAnyThread(Thread* const* threads, size_t count, uint32_t timeout_ms);

// ---------------------------------------------------------------- synchronisation

// A binary semaphore (count 0 or 1).
class Semaphore {
 public:
  explicit Semaphore(bool initially_available);
  ~Semaphore();
  Semaphore(const Semaphore&) = delete;
  Semaphore& operator=(const Semaphore&) = delete;
  void Acquire();
  bool TryAcquire(uint32_t timeout_ms);
  void Release();

 private:
  struct State;
  std::unique_ptr<State> state_;
};

// ---------------------------------------------------------------- thread-local storage

// A thread-local slot whose value is handed to `release` when a thread that set it ends.
class ThreadLocalSlot {
 public:
  explicit ThreadLocalSlot(void (*release)(void* value));
  ~ThreadLocalSlot();
  ThreadLocalSlot(const ThreadLocalSlot&) = delete;
  ThreadLocalSlot& operator=(const ThreadLocalSlot&) = delete;
  void* Get() const;
  void Set(void* value);

 private:
  uintptr_t key_;
};

// ---------------------------------------------------------------- dynamic libraries

// The system's headers on Windows make LoadLibrary a macro; this interface's function keeps
// its own name wherever both are included.
#ifdef LoadLibrary
#undef LoadLibrary
#endif

struct Library;  // opaque
// Loads the library at path; null on failure (LastLibraryError() then says why).
Library* LoadLibrary(const std::string& path);
void* ResolveSymbol(Library* library, const char* name);
void UnloadLibrary(Library* library);
// The loader's text for the last failure of LoadLibrary on this thread; empty if none.
std::string LastLibraryError();

// Path of the module (shared library or executable) this code was loaded from.
std::string OwnModulePath();

// ---------------------------------------------------------------- temporary files

// The temporary folder, with a trailing separator: TMPDIR, else /tmp/ (on Windows the
// system's temporary path).
std::string TempFolder();
// Creates a new, uniquely named empty file in folder (which ends with a separator) whose
// name starts with prefix; returns its path, or empty on failure. On POSIX the name is the
// prefix, hexadecimal digits and ".tmp", created exclusively.
std::string CreateUniqueTempFile(const std::string& folder, const std::string& prefix);
// The device that discards everything written to it.
const char* NullDevicePath();

// ---------------------------------------------------------------- files

enum class FileAccess { kRead, kWrite };
enum class FileCreation {
  kOpenExisting,  // fail when the file does not exist
  kOpenOrCreate,  // keep an existing file's content
  kCreateAlways,  // create, replacing (emptying) an existing file
};

// An open OS file. Sizes and offsets are 64-bit here; TBufFile narrows them.
class File {
 public:
  virtual ~File() = default;
  virtual int64_t Size() const = 0;  // -1 if unknown
  // Reads up to count bytes at the current offset; returns the number read, -1 on error.
  virtual int64_t Read(void* destination, size_t count) = 0;
  // Writes count bytes at the current offset; returns the number written, -1 on error.
  virtual int64_t Write(const void* source, size_t count) = 0;
  virtual bool Seek(int64_t offset) = 0;
};

// Opens a file; null on failure (LastSystemError() is set). hidden_temporary asks for the
// hidden and temporary attributes where the OS has them.
std::unique_ptr<File> OpenFile(const std::string& path, FileAccess access, FileCreation creation,
                               bool hidden_temporary = false);

// A read-only view of a whole file.
class MappedFile {
 public:
  virtual ~MappedFile() = default;
  virtual const uint8_t* data() const = 0;
  virtual size_t size() const = 0;
};
// Maps the whole open file read-only; null when mapping is not possible (also for an empty
// file).
std::unique_ptr<MappedFile> MapWholeFile(File& file);

// Opens (creating or emptying) a text file for writing through the C runtime, for the
// engine log: text mode where the C runtime translates line ends (CR LF on Windows). The
// path is UTF-8 like every path here, so on Windows it goes through the wide-character open
// (the narrow one would read it in the ANSI code page). Null on failure.
std::FILE* OpenTextFileForWriting(const std::string& path);

bool FileExists(const std::string& path);       // anything at the path
bool DirectoryExists(const std::string& path);  // a folder at the path
bool RemoveFile(const std::string& path);

// What the buffer-size rule needs to know about the file system holding path.
struct VolumeInfo {
  bool known = false;   // false when the volume cannot be queried
  bool remote = false;  // a network file system
  uint64_t cluster_bytes = 0;
};
VolumeInfo QueryVolume(const std::string& path);

// ---------------------------------------------------------------- clock and errors

struct LocalDateTime {
  int year, month, day, hour, minute, second;  // month 1 to 12
};
LocalDateTime LocalClock();
struct UtcDateTime {
  int year, month, day, hour, minute, second;
};
UtcDateTime UtcClock();
// The C runtime's time-zone value in seconds (UTC minus local time, positive west).
long TimeZoneSeconds();

// The calling thread's last system error code, and its text as one line (line breaks
// replaced by blanks, trailing blanks removed); empty text for code 0 or an unknown code.
uint32_t LastSystemError();
void SetLastSystemError(uint32_t code);
std::string SystemErrorText(uint32_t code);

// ---------------------------------------------------------------- text conversion

// Paths and names read from a job file are bytes in the system's ANSI code page; these turn
// them into the paths used here (identity on POSIX, where they are taken as UTF-8).
std::string PathFromAnsi(std::string_view ansi);
std::string AnsiFromPath(std::string_view path);  // unconvertible characters become '?'
// Wide strings from the host (wchar_t: UTF-32 on POSIX, UTF-16 on Windows) to paths.
std::string PathFromWide(const wchar_t* wide);

// ---------------------------------------------------------------- floating point

// Masks denormal, underflow and inexact exceptions and unmasks invalid operation, division
// by zero and overflow on the calling thread, as every thread that runs engine code needs.
void SetEngineFloatingPointMode();
// Restores the default mode (all exceptions masked) on the calling thread.
void RestoreDefaultFloatingPointMode();

// Masks every floating-point exception on the calling thread for the life of the object and
// then restores the mode and flags as they were. Library code that an engine calls runs under
// it: an engine thread traps on invalid operations, and a value that is not a number (read
// from a file or handed over by the engine) must be handled as data by the library, not end
// the engine's call in the middle of a library function.
class QuietFloatingPoint {
 public:
  QuietFloatingPoint();
  ~QuietFloatingPoint();
  QuietFloatingPoint(const QuietFloatingPoint&) = delete;
  QuietFloatingPoint& operator=(const QuietFloatingPoint&) = delete;

 private:
  alignas(16) unsigned char saved_[64];  // the platform's saved floating-point state
};

// ---------------------------------------------------------------- fault guard

enum class GuardOutcome {
  kReturned,   // the function returned normally
  kException,  // it threw a C++ exception (caught and discarded)
  kFault,      // a processor fault (invalid access, bus error, FP trap, illegal instruction)
};
struct GuardReport {
  GuardOutcome outcome = GuardOutcome::kReturned;
  int signal = 0;           // the fault's signal number (POSIX) or exception code (Windows)
  std::string description;  // readable text of the failure
};
// Runs fn on the calling thread; a C++ exception or a processor fault raised inside it on the
// same thread becomes a report instead of a dead process. Faults outside guarded regions go
// on to the handler that was installed before. The thread's floating-point mode is as
// before the call when a fault was caught.
GuardReport RunGuarded(const std::function<void()>& fn);

// ---------------------------------------------------------------- control window

// The OS side of a run's control window: only the mechanics of creating and closing it,
// delivering commands to it, releasing a sender early, the pause loop and message pumping.
// What the commands do belongs to the run room, which supplies it as ControlWindowProcs.
//
// On Windows the window is the hidden window "EngineControlWindow" of class "EngCtrlWndCls",
// created on the thread of the run call, and a command is the registered message
// "EngCtrlWndMsg" (command in wParam, argument in lParam), carried out on that thread. On
// POSIX a handle is a generation number and a command runs on the sender's thread. Handles
// are never 0; every function may be called from any thread.
struct ControlWindowProcs {
  // Carries out one command and returns its result.
  uint32_t (*execute)(uint32_t command, uintptr_t argument) = nullptr;
  // True while a pause is in force; the window's pause loop runs until it turns false.
  bool (*paused)() = nullptr;
};
// Installs the procedures; called before the first window is opened.
void SetControlWindowProcs(const ControlWindowProcs& procs);

enum class ControlWindowFailure { kNone, kRegisterClass, kCreateWindow };
struct ControlWindowOpened {
  uintptr_t handle = 0;  // 0 on failure
  ControlWindowFailure failure = ControlWindowFailure::kNone;
  uint32_t error = 0;  // the system's error code of the failure
};
// Opens a new window on the calling thread (which then owns it and must keep handling its
// messages while a job runs); closes the previous one first if it is still open.
ControlWindowOpened OpenControlWindow();
// Closes the window if it is the open one, and returns once it is closed: on Windows by
// sending WM_CLOSE, which waits until the window's thread has handled it.
void CloseControlWindow(uintptr_t handle);
bool ControlWindowIsOpen(uintptr_t handle);
// The handle of the open window (0 if none), and whether handle is the latest one opened.
uintptr_t CurrentControlWindow();
bool IsLatestControlWindow(uintptr_t handle);
// The title starts as "EngineControlWindow". Setting it never waits for the window's thread.
void SetControlWindowTitle(uintptr_t handle, const std::string& title);
// Copies the title (cut to fit, terminated when capacity > 0) and returns its full length;
// 0 and an empty buffer for a window that is not open.
size_t GetControlWindowTitle(uintptr_t handle, char* buffer, size_t capacity);
// Delivers one command to the open window and returns its result; 0 when handle is not the
// open window.
uint32_t SendControlMessage(uintptr_t handle, uint32_t command, uintptr_t argument);
// Dispatches every message waiting for the calling thread, without waiting (nothing to do on
// POSIX, which has no thread message queues).
void PumpPendingMessages();
// Waits until thread has ended, handling the calling thread's messages meanwhile (the
// control window may live on this thread).
void WaitForThreadHandlingMessages(Thread& thread);

}  // namespace vox::platform
