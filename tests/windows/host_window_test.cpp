// A Win32 host driving whole jobs through vox.dll's control window, as a Windows application
// does: the run call creates the window on this thread, the host talks to it with the
// registered message "EngCtrlWndMsg" and keeps handling its messages until the job ends.
#include <gtest/gtest.h>
#include <windows.h>

#include <atomic>
#include <string>
#include <thread>

#include "vox/vox_host.h"

namespace {

struct Ended {
  std::atomic<int> calls{0};
  std::atomic<uint32_t> exit_code{0xFFFFFFFFu};
  std::atomic<uint32_t> last_progress{0};
};

void VOX_CALL OnJob(void* context, uint32_t code, uint32_t value) {
  auto* ended = static_cast<Ended*>(context);
  if (code == VOX_CALLBACK_PROGRESS) ended->last_progress.store(value);
  if (code == VOX_CALLBACK_EXIT_CODE) {
    ended->exit_code.store(value);
    ended->calls.fetch_add(1);
  }
}

Ended g_ended;
vox_HostCallbackPair g_pair{OnJob, &g_ended};

void Pump() {
  MSG message;
  while (PeekMessageA(&message, nullptr, 0, 0, PM_REMOVE)) {
    TranslateMessage(&message);
    DispatchMessageA(&message);
  }
}

// Handles this thread's messages until done() holds or ms have passed.
template <typename Done>
bool PumpUntil(Done done, DWORD ms) {
  const ULONGLONG end = GetTickCount64() + ms;
  while (!done()) {
    if (GetTickCount64() > end) return false;
    MsgWaitForMultipleObjects(0, nullptr, FALSE, 20, QS_ALLINPUT);
    Pump();
  }
  return true;
}

std::string WriteJob(const std::string& name) {
  char temp[MAX_PATH];
  GetTempPathA(MAX_PATH, temp);
  const std::string folder = std::string(temp) + "vox_windows_host\\";
  CreateDirectoryA(folder.c_str(), nullptr);
  const std::string path = folder + name + ".job";
  const std::string text = "[JOB]\r\nName=" + name + "\r\nResultPath=" + name +
                           ".res\r\nType=1\r\nEnginePath=" SLOW_ENGINE
                           "\r\nNumPoints=2\r\nNumVectors=1\r\n[POINT:1]\r\nName=P1\r\n"
                           "[POINT:2]\r\nName=P2\r\n[VECTOR:1]\r\nPoints=1,2\r\n";
  HANDLE file = CreateFileA(path.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS,
                            FILE_ATTRIBUTE_NORMAL, nullptr);
  DWORD written = 0;
  WriteFile(file, text.data(), static_cast<DWORD>(text.size()), &written, nullptr);
  CloseHandle(file);
  return path;
}

UINT ControlMessage() {
  return RegisterWindowMessageA("EngCtrlWndMsg");
}

uint32_t Command(HWND window, uint32_t command, uintptr_t argument = 0) {
  return static_cast<uint32_t>(SendMessageA(window, ControlMessage(), command, argument));
}

// One job through the window: callback, progress, pause and resume from a second host
// thread, break, and the end reported with code 7 as the window goes.
TEST(ControlWindow, DrivesAJobFromCallbackToBreak) {
  auto* window = reinterpret_cast<HWND>(RunProcess(WriteJob("WinBreak").c_str()));
  ASSERT_NE(window, nullptr);
  ASSERT_TRUE(IsWindow(window));
  char class_name[64] = {};
  GetClassNameA(window, class_name, sizeof class_name);
  EXPECT_STREQ(class_name, "EngCtrlWndCls");
  EXPECT_FALSE(IsWindowVisible(window));
  EXPECT_EQ(GetWindowThreadProcessId(window, nullptr), GetCurrentThreadId());

  // A second run while this one is going is refused.
  EXPECT_EQ(RunProcess(WriteJob("WinBusy").c_str()), nullptr);

  EXPECT_EQ(Command(window, VOX_CMD_SET_CALLBACK, reinterpret_cast<uintptr_t>(&g_pair)), 8u);
  EXPECT_EQ(Command(window, VOX_CMD_EXIT_CODE), 259u);
  EXPECT_EQ(Command(window, VOX_CMD_PING), 4u);
  EXPECT_EQ(Command(window, 9), 0u);
  EXPECT_NE(Command(window, VOX_CMD_THREAD_ID), 0u);
  ASSERT_TRUE(PumpUntil([&] { return Command(window, VOX_CMD_PROGRESS) >= 5; }, 20000))
      << "progress " << Command(window, VOX_CMD_PROGRESS) << ", exit code "
      << Command(window, VOX_CMD_EXIT_CODE) << ", ended " << g_ended.calls.load();

  // Pause and resume come from another host thread: the pause loop holds this (the window's)
  // thread, which still answers commands, while the job goes on.
  std::atomic<bool> helper_done{false};
  uint32_t paused_reply = 0, resumed_reply = 0, progress_in_pause = 0, progress_later = 0;
  std::thread helper([&] {
    paused_reply = Command(window, VOX_CMD_PAUSE);
    progress_in_pause = Command(window, VOX_CMD_PROGRESS);
    Sleep(300);
    progress_later = Command(window, VOX_CMD_PROGRESS);
    resumed_reply = Command(window, VOX_CMD_RESUME);
    helper_done = true;
  });
  ASSERT_TRUE(PumpUntil([&] { return helper_done.load(); }, 20000));
  helper.join();
  EXPECT_EQ(paused_reply, 1u);
  EXPECT_EQ(resumed_reply, 2u);
  EXPECT_GT(progress_later, progress_in_pause);

  // The title follows the job's name once its data is prepared.
  char title[64] = {};
  EXPECT_EQ(GetEngineControlTitle(reinterpret_cast<vox_ControlHandle>(window), title, 64), 8u);
  EXPECT_STREQ(title, "WinBreak");
  Pump();
  GetWindowTextA(window, title, sizeof title);
  EXPECT_STREQ(title, "WinBreak");

  EXPECT_EQ(Command(window, VOX_CMD_BREAK), 0u);
  ASSERT_TRUE(PumpUntil([] { return g_ended.calls.load() > 0; }, 20000));
  EXPECT_EQ(g_ended.exit_code.load(), static_cast<uint32_t>(VOX_EXIT_BREAK));
  EXPECT_LE(g_ended.last_progress.load(), 98u);
  EXPECT_FALSE(IsWindow(window));

  // After the end the handle answers nothing but a registration, which is told at once.
  auto handle = reinterpret_cast<vox_ControlHandle>(window);
  EXPECT_EQ(SendEngineControl(handle, VOX_CMD_EXIT_CODE, 0), 0u);
  Ended late;
  vox_HostCallbackPair late_pair{OnJob, &late};
  EXPECT_EQ(
      SendEngineControl(handle, VOX_CMD_SET_CALLBACK, reinterpret_cast<uintptr_t>(&late_pair)), 8u);
  EXPECT_EQ(late.exit_code.load(), static_cast<uint32_t>(VOX_EXIT_BREAK));
}

// RunProcessAndWait keeps handling this thread's messages itself, so the job's last act
// (closing the window) cannot wait for a host that is itself waiting.
TEST(ControlWindow, RunProcessAndWaitHandlesTheWindowWhileWaiting) {
  const int before = g_ended.calls.load();
  EXPECT_EQ(RunProcessAndWait(WriteJob("WinWait").c_str()), 1u);
  EXPECT_EQ(g_ended.calls.load(), before + 1);
  EXPECT_EQ(g_ended.exit_code.load(), static_cast<uint32_t>(VOX_EXIT_DONE));
}

// A job whose file cannot be read ends at once with code 5; its window stays open until the
// next run, which closes it.
TEST(ControlWindow, UnreadableJobEndsWithFiveAndTheNextRunReplacesItsWindow) {
  const int before = g_ended.calls.load();
  auto* first = reinterpret_cast<HWND>(RunProcess("C:\\no\\such\\folder\\job.job"));
  ASSERT_NE(first, nullptr);
  ASSERT_TRUE(PumpUntil([&] { return g_ended.calls.load() > before; }, 20000));
  EXPECT_EQ(g_ended.exit_code.load(), static_cast<uint32_t>(VOX_EXIT_JOB_FILE));
  EXPECT_TRUE(IsWindow(first));
  EXPECT_EQ(RunProcessAndWait(WriteJob("WinAfter").c_str()), 1u);
  EXPECT_FALSE(IsWindow(first));
}

}  // namespace
