// The win32 platform layer on the system's own services, under the cases where Windows
// behaves differently from POSIX: temporary names, sharing, mapping, volumes, error texts,
// code pages, the floating-point control word and the fault guard.
#include <gtest/gtest.h>
#include <windows.h>

#include <float.h>

#include <atomic>
#include <cstdio>
#include <stdexcept>
#include <string>

#include "platform/platform.h"

namespace vox::platform {
namespace {

std::string Name(const std::string& path) {
  return path.substr(path.find_last_of("\\/") + 1);
}

// ---------------------------------------------------------------- threads and slots

uint32_t ReturnArgument(void* argument) {
  return static_cast<uint32_t>(reinterpret_cast<uintptr_t>(argument));
}

TEST(Win32Threads, ExitStatusIsStillActiveUntilTheEndAndWaitAnyFindsTheEndedOne) {
  Semaphore gate(false);
  auto blocked = StartThread(
      [](void* g) -> uint32_t {
        static_cast<Semaphore*>(g)->Acquire();
        return 3;
      },
      &gate, 0x10000);
  auto quick = StartThread(ReturnArgument, reinterpret_cast<void*>(uintptr_t{42}), 0x10000);
  ASSERT_TRUE(blocked && quick);
  EXPECT_NE(blocked->id(), quick->id());
  Thread* both[] = {blocked.get(), nullptr, quick.get()};
  EXPECT_EQ(WaitAnyThread(both, 3, 5000), 2);
  EXPECT_EQ(quick->ExitStatus(), 42u);
  EXPECT_EQ(blocked->ExitStatus(), 259u);
  EXPECT_FALSE(blocked->Wait(20));
  gate.Release();
  EXPECT_TRUE(blocked->Wait(5000));
  EXPECT_EQ(blocked->ExitStatus(), 3u);
  gate.Release();
  gate.Release();  // absorbed: the semaphore is binary
  EXPECT_TRUE(gate.TryAcquire(0));
  EXPECT_FALSE(gate.TryAcquire(0));
}

std::atomic<int> g_released{0};

TEST(Win32Threads, SlotValuesAreReleasedWhenTheirThreadEnds) {
  ThreadLocalSlot slot([](void* value) {
    if (value != nullptr) g_released.fetch_add(1);
  });
  g_released = 0;
  auto thread = StartThread(
      [](void* s) -> uint32_t {
        auto* own = static_cast<ThreadLocalSlot*>(s);
        own->Set(own);
        return own->Get() == own ? 0 : 1;
      },
      &slot, 0x10000);
  ASSERT_TRUE(thread);
  ASSERT_TRUE(thread->Wait(5000));
  EXPECT_EQ(thread->ExitStatus(), 0u);
  EXPECT_EQ(g_released.load(), 1);
  EXPECT_EQ(slot.Get(), nullptr);  // this thread never set one
}

// ---------------------------------------------------------------- files

TEST(Win32Files, TemporaryNamesCarryThePrefixAndTheFilesExist) {
  const std::string folder = TempFolder();
  ASSERT_FALSE(folder.empty());
  EXPECT_EQ(folder.back(), '\\');
  const std::string a = CreateUniqueTempFile(folder, "VOX");
  const std::string b = CreateUniqueTempFile(folder, "OUT");
  ASSERT_FALSE(a.empty());
  ASSERT_FALSE(b.empty());
  EXPECT_EQ(Name(a).rfind("VOX", 0), 0u);
  EXPECT_EQ(Name(b).rfind("OUT", 0), 0u);
  EXPECT_EQ(Name(a).substr(Name(a).size() - 4), ".tmp");
  EXPECT_TRUE(FileExists(a));
  EXPECT_FALSE(DirectoryExists(a));
  EXPECT_TRUE(DirectoryExists(folder));
  EXPECT_TRUE(RemoveFile(a));
  EXPECT_TRUE(RemoveFile(b));
  EXPECT_FALSE(FileExists(a));
  EXPECT_STREQ(NullDevicePath(), "nul");
}

TEST(Win32Files, WriteReadMapAndReplace) {
  const std::string path = CreateUniqueTempFile(TempFolder(), "VOX");
  {
    auto file = OpenFile(path, FileAccess::kWrite, FileCreation::kCreateAlways, true);
    ASSERT_TRUE(file);
    EXPECT_EQ(file->Write("0123456789", 10), 10);
    // Unlike POSIX, a file being written cannot be opened for reading: readers share only
    // reading, and the writer holds write access.
    EXPECT_FALSE(OpenFile(path, FileAccess::kRead, FileCreation::kOpenExisting));
  }
  // Wine keeps no hidden or temporary attribute for files on a Unix file system.
  if (GetProcAddress(GetModuleHandleA("ntdll.dll"), "wine_get_version") == nullptr) {
    DWORD attributes = GetFileAttributesA(path.c_str());
    EXPECT_TRUE(attributes & FILE_ATTRIBUTE_HIDDEN);
    EXPECT_TRUE(attributes & FILE_ATTRIBUTE_TEMPORARY);
  }
  {
    auto file = OpenFile(path, FileAccess::kRead, FileCreation::kOpenExisting);
    ASSERT_TRUE(file);
    EXPECT_EQ(file->Size(), 10);
    auto view = MapWholeFile(*file);
    ASSERT_TRUE(view);
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(view->data()), view->size()), "0123456789");
    ASSERT_TRUE(file->Seek(6));
    char tail[8] = {};
    EXPECT_EQ(file->Read(tail, sizeof tail), 4);
    EXPECT_STREQ(tail, "6789");
    EXPECT_FALSE(file->Seek(-1));
  }
  {
    auto file = OpenFile(path, FileAccess::kWrite, FileCreation::kCreateAlways);
    ASSERT_TRUE(file);
  }
  auto emptied = OpenFile(path, FileAccess::kRead, FileCreation::kOpenExisting);
  ASSERT_TRUE(emptied);
  EXPECT_EQ(emptied->Size(), 0);
  EXPECT_FALSE(MapWholeFile(*emptied));  // nothing to map
  emptied.reset();
  EXPECT_TRUE(RemoveFile(path));
  EXPECT_FALSE(OpenFile(path, FileAccess::kRead, FileCreation::kOpenExisting));
  EXPECT_EQ(LastSystemError(), static_cast<uint32_t>(ERROR_FILE_NOT_FOUND));
}

TEST(Win32Files, VolumesReportTheirClusterSize) {
  VolumeInfo local = QueryVolume(TempFolder() + "x.res");
  ASSERT_TRUE(local.known);
  EXPECT_FALSE(local.remote);
  EXPECT_GE(local.cluster_bytes, 512u);
  EXPECT_TRUE(QueryVolume("relative.res").known);  // the current directory's drive
  EXPECT_FALSE(QueryVolume("").known);
  EXPECT_FALSE(QueryVolume("Q:\\no-such-drive\\x.res").known);
}

// The engine log lives in the user's temporary folder, whose name may hold characters
// outside the ANSI code page; it is written in text mode, so its lines end in CR LF.
TEST(Win32Files, TextFilesOpenUnderNonAsciiFoldersAndEndTheirLinesInCrLf) {
  const std::string folder = TempFolder() + "vox \xC3\xA9t\xC3\xA9 \xE6\xB8\xAC\xE9\x87\x8F";
  const int wide_length = MultiByteToWideChar(CP_UTF8, 0, folder.c_str(), -1, nullptr, 0);
  std::wstring wide(static_cast<size_t>(wide_length), L'\0');
  MultiByteToWideChar(CP_UTF8, 0, folder.c_str(), -1, wide.data(), wide_length);
  ASSERT_TRUE(CreateDirectoryW(wide.c_str(), nullptr) || GetLastError() == ERROR_ALREADY_EXISTS);
  const std::string path = folder + "\\log.txt";
  std::FILE* log = OpenTextFileForWriting(path);
  ASSERT_NE(log, nullptr);
  std::fputs("first\nsecond\n", log);
  std::fclose(log);
  auto file = OpenFile(path, FileAccess::kRead, FileCreation::kOpenExisting);
  ASSERT_TRUE(file);
  char bytes[32] = {};
  EXPECT_EQ(file->Read(bytes, sizeof bytes), 15);
  EXPECT_STREQ(bytes, "first\r\nsecond\r\n");
  file.reset();
  EXPECT_TRUE(RemoveFile(path));
  RemoveDirectoryW(wide.c_str());
}

// ---------------------------------------------------------------- texts

TEST(Win32Text, SystemErrorTextsAreOneLineAndEmptyForNoError) {
  EXPECT_EQ(SystemErrorText(0), "");
  const std::string text = SystemErrorText(ERROR_FILE_NOT_FOUND);
  EXPECT_FALSE(text.empty());
  EXPECT_EQ(text.find('\n'), std::string::npos);
  EXPECT_EQ(text.find('\r'), std::string::npos);
  EXPECT_NE(text.back(), ' ');
  SetLastSystemError(ERROR_ACCESS_DENIED);
  EXPECT_EQ(LastSystemError(), static_cast<uint32_t>(ERROR_ACCESS_DENIED));
}

TEST(Win32Text, AnsiAndWidePathsBecomeUtf8AndBack) {
  EXPECT_EQ(PathFromWide(L"C:\\jobs\\\u00e9t\u00e9.job"), "C:\\jobs\\\xc3\xa9t\xc3\xa9.job");
  EXPECT_EQ(PathFromWide(L"\U0001F600"), "\xf0\x9f\x98\x80");  // a surrogate pair
  EXPECT_EQ(PathFromWide(nullptr), "");
  if (GetACP() == 1252) {
    EXPECT_EQ(PathFromAnsi("caf\xe9"), "caf\xc3\xa9");
    EXPECT_EQ(AnsiFromPath("caf\xc3\xa9"), "caf\xe9");
    EXPECT_EQ(AnsiFromPath("\xe2\x82\xac\xe6\x97\xa5"), "\x80?");  // euro is in 1252, 日 is not
  }
  EXPECT_EQ(AnsiFromPath(PathFromAnsi("plain.job")), "plain.job");
}

// ---------------------------------------------------------------- floating point and faults

volatile double g_zero_double = 0.0;
volatile double g_sink = 0.0;
volatile int* volatile g_null = nullptr;
volatile int g_zero = 0;
volatile int g_int_sink = 0;

TEST(Win32FloatingPoint, EngineModeTrapsDivisionAndTheGuardTurnsItIntoAReport) {
  SetEngineFloatingPointMode();
  EXPECT_EQ(_controlfp(0, 0) & _MCW_EM, 0x80003u);
  GuardReport trap = RunGuarded([] { g_sink = 1.0 / g_zero_double; });
  EXPECT_EQ(trap.outcome, GuardOutcome::kFault);
  EXPECT_NE(trap.description.find("floating-point"), std::string::npos) << trap.description;
  // The mode survives the fault, and the next division traps again.
  EXPECT_EQ(_controlfp(0, 0) & _MCW_EM, 0x80003u);
  EXPECT_EQ(RunGuarded([] { g_sink = 1.0 / g_zero_double; }).outcome, GuardOutcome::kFault);
  // Underflow and inexact stay masked.
  EXPECT_EQ(RunGuarded([] { g_sink = 1e-300 * 1e-300 + 1.0 / 3.0; }).outcome,
            GuardOutcome::kReturned);
  RestoreDefaultFloatingPointMode();
  EXPECT_EQ(_controlfp(0, 0) & _MCW_EM, 0x8001Fu);
  g_sink = 1.0 / g_zero_double;  // masked again: no trap
}

TEST(Win32FaultGuard, AccessViolationsDivisionAndExceptionsAreDiscardedAgainAndAgain) {
  for (int round = 0; round < 3; ++round) {
    GuardReport access = RunGuarded([] { *g_null = 1; });
    EXPECT_EQ(access.outcome, GuardOutcome::kFault);
    EXPECT_EQ(static_cast<DWORD>(access.signal), EXCEPTION_ACCESS_VIOLATION);
    GuardReport division = RunGuarded([] { g_int_sink = 10 / g_zero; });
    EXPECT_EQ(static_cast<DWORD>(division.signal), EXCEPTION_INT_DIVIDE_BY_ZERO);
    GuardReport thrown = RunGuarded([] { throw std::runtime_error("engine gave up"); });
    EXPECT_EQ(thrown.outcome, GuardOutcome::kException);
    EXPECT_NE(thrown.description.find("engine gave up"), std::string::npos);
  }
  // Nested guards: the inner fault stays inside the inner guard.
  GuardOutcome inner = GuardOutcome::kReturned;
  GuardReport outer = RunGuarded([&] { inner = RunGuarded([] { *g_null = 2; }).outcome; });
  EXPECT_EQ(inner, GuardOutcome::kFault);
  EXPECT_EQ(outer.outcome, GuardOutcome::kReturned);
}

TEST(Win32FaultGuard, WorksOnAWorkerThreadWithASmallStack) {
  auto thread = StartThread(
      [](void*) -> uint32_t {
        return RunGuarded([] { *g_null = 3; }).outcome == GuardOutcome::kFault ? 0 : 1;
      },
      nullptr, 0x10000);
  ASSERT_TRUE(thread);
  ASSERT_TRUE(thread->Wait(5000));
  EXPECT_EQ(thread->ExitStatus(), 0u);
}

// ---------------------------------------------------------------- libraries

TEST(Win32Library, LoadsBySystemNameResolvesAndReportsMissingFiles) {
  Library* kernel = LoadLibrary("kernel32.dll");
  ASSERT_NE(kernel, nullptr);
  EXPECT_NE(ResolveSymbol(kernel, "GetTickCount"), nullptr);
  EXPECT_EQ(ResolveSymbol(kernel, "NoSuchFunctionAnywhere"), nullptr);
  UnloadLibrary(kernel);
  EXPECT_EQ(LoadLibrary("C:\\no\\such\\engine.eng"), nullptr);
  EXPECT_FALSE(LastLibraryError().empty());
  const std::string own = OwnModulePath();
  EXPECT_NE(own.find("windows_platform_test"), std::string::npos) << own;
}

}  // namespace
}  // namespace vox::platform
