// Win32 implementation of platform.h: the control window.
//
// The window is the hidden top-level window "EngineControlWindow" of class "EngCtrlWndCls",
// created on the thread of the run call (the window thread). Hosts send it the registered
// message "EngCtrlWndMsg" with the command in wParam and its argument in lParam; the window
// procedure carries the command out on the window thread through the run room's procedures.
// Commands 0 (break) and 1 (pause) release the sender at once with ReplyMessage; a pause then
// keeps the window thread in the pause loop, handling messages, until the pause flag is
// cleared or the window is closed (a pause cannot outlive its window: nothing could lift it).
// A pause sent by the window thread to itself only raises the flag.
//
// State: the open window, the latest window and the dialog window are atomics written on
// the window thread (and by CloseControlWindow); the title is guarded by a mutex.
#include <windows.h>

#include <atomic>
#include <cstring>
#include <mutex>

#include "platform/platform.h"

namespace vox::platform {

HINSTANCE OwnModuleInstance();

namespace {

constexpr const char* kClassName = "EngCtrlWndCls";
constexpr const char* kWindowTitle = "EngineControlWindow";
constexpr const char* kMessageName = "EngCtrlWndMsg";
// Posted to the window with a heap copy of a new title, so that setting the title never
// waits for the window thread.
constexpr UINT kSetTitleMessage = WM_APP + 0x56;
// The pause loop looks at the flag at least this often, even when no message comes.
constexpr DWORD kPauseWaitMs = 100;

struct WindowState {
  ControlWindowProcs procs;
  std::atomic<UINT> control_message{0};
  std::atomic<HWND> open{nullptr};
  std::atomic<HWND> latest{nullptr};
  std::atomic<DWORD> window_thread{0};
  std::atomic<HWND> dialog{nullptr};
  std::mutex title_mutex;
  std::string title;
};

WindowState& State() {
  static WindowState state;
  return state;
}

HWND ToWindow(uintptr_t handle) {
  return reinterpret_cast<HWND>(handle);
}

// Dispatches one message: on the window thread a message without a window goes to the
// control window, and a remembered dialog gets the first look at it.
void DispatchOne(MSG& message) {
  WindowState& s = State();
  if (GetCurrentThreadId() == s.window_thread.load()) {
    if (message.hwnd == nullptr) message.hwnd = s.open.load();
    HWND dialog = s.dialog.load();
    if (dialog != nullptr && IsDialogMessageA(dialog, &message)) return;
  }
  DispatchMessageA(&message);
}

void PauseLoop(HWND window) {
  WindowState& s = State();
  while (s.procs.paused != nullptr && s.procs.paused() && IsWindow(window)) {
    MsgWaitForMultipleObjects(0, nullptr, FALSE, kPauseWaitMs, QS_ALLINPUT);
    PumpPendingMessages();
  }
}

void TrackDialog(WPARAM w_param, LPARAM l_param) {
  WindowState& s = State();
  HWND child = reinterpret_cast<HWND>(l_param);
  if (LOWORD(w_param) == WM_CREATE) {
    HWND none = nullptr;
    if (GetWindowThreadProcessId(child, nullptr) == s.window_thread.load())
      s.dialog.compare_exchange_strong(none, child);
  } else if (LOWORD(w_param) == WM_DESTROY) {
    HWND remembered = child;
    s.dialog.compare_exchange_strong(remembered, nullptr);
  }
}

uint32_t Execute(uint32_t command, uintptr_t argument) {
  WindowState& s = State();
  return s.procs.execute != nullptr ? s.procs.execute(command, argument) : 0;
}

LRESULT CALLBACK WindowProc(HWND window, UINT message, WPARAM w_param, LPARAM l_param) {
  WindowState& s = State();
  if (message != 0 && message == s.control_message.load()) {
    const auto command = static_cast<uint32_t>(w_param);
    const auto argument = static_cast<uintptr_t>(l_param);
    if (command == 0) {
      ReplyMessage(0);
      Execute(command, argument);
      return 0;
    }
    if (command == 1) {
      // A pause sent from the window thread itself cannot be held there: nothing on that
      // thread could ever send the resume. It only raises the flag, as on POSIX.
      const bool from_another_thread = InSendMessage() != FALSE;
      ReplyMessage(1);
      Execute(command, argument);
      if (from_another_thread) PauseLoop(window);
      return 1;
    }
    return static_cast<LRESULT>(Execute(command, argument));
  }
  switch (message) {
    case WM_PARENTNOTIFY:
      TrackDialog(w_param, l_param);
      break;
    case kSetTitleMessage: {
      auto* title = reinterpret_cast<char*>(l_param);
      SetWindowTextA(window, title);
      delete[] title;
      return 0;
    }
    case WM_NCDESTROY: {
      HWND self = window;
      s.open.compare_exchange_strong(self, nullptr);
      s.dialog.store(nullptr);
      break;
    }
    default:
      break;
  }
  return DefWindowProcA(window, message, w_param, l_param);
}

// Registers the message and the class; a class that exists already (error 1410) is fine.
bool Register(ControlWindowOpened& opened) {
  WindowState& s = State();
  s.control_message.store(RegisterWindowMessageA(kMessageName));
  WNDCLASSA window_class{};
  window_class.style = CS_HREDRAW | CS_VREDRAW;
  window_class.lpfnWndProc = WindowProc;
  window_class.hInstance = OwnModuleInstance();
  window_class.hbrBackground = static_cast<HBRUSH>(GetStockObject(WHITE_BRUSH));
  window_class.lpszClassName = kClassName;
  if (RegisterClassA(&window_class) != 0) return true;
  const DWORD error = GetLastError();
  if (error == ERROR_CLASS_ALREADY_EXISTS) return true;
  opened.failure = ControlWindowFailure::kRegisterClass;
  opened.error = error;
  return false;
}

// Closes a window left open by an earlier run (a job whose file could not be read). Its
// thread may no longer handle messages, so the wait is bounded.
void CloseLeftover(HWND window) {
  if (window == nullptr || !IsWindow(window)) return;
  if (GetWindowThreadProcessId(window, nullptr) == GetCurrentThreadId()) {
    DestroyWindow(window);
  } else {
    DWORD_PTR ignored = 0;
    SendMessageTimeoutA(window, WM_CLOSE, 0, 0, SMTO_ABORTIFHUNG, 2000, &ignored);
  }
}

}  // namespace

void SetControlWindowProcs(const ControlWindowProcs& procs) {
  State().procs = procs;
}

ControlWindowOpened OpenControlWindow() {
  WindowState& s = State();
  ControlWindowOpened opened;
  if (!Register(opened)) return opened;
  CloseLeftover(s.open.exchange(nullptr));
  HWND window = CreateWindowExA(0, kClassName, kWindowTitle, WS_OVERLAPPEDWINDOW, 0, 0, 640, 320,
                                nullptr, nullptr, OwnModuleInstance(), nullptr);
  if (window == nullptr) {
    opened.failure = ControlWindowFailure::kCreateWindow;
    opened.error = GetLastError();
    return opened;
  }
  {
    std::lock_guard lock(s.title_mutex);
    s.title = kWindowTitle;
  }
  s.window_thread.store(GetCurrentThreadId());
  s.dialog.store(nullptr);
  s.latest.store(window);
  s.open.store(window);
  opened.handle = reinterpret_cast<uintptr_t>(window);
  return opened;
}

void CloseControlWindow(uintptr_t handle) {
  WindowState& s = State();
  HWND window = ToWindow(handle);
  if (window == nullptr || window != s.open.load()) return;
  if (GetWindowThreadProcessId(window, nullptr) == GetCurrentThreadId()) {
    DestroyWindow(window);
  } else {
    // Waits until the window thread has handled it: the window is destroyed afterwards.
    SendMessageA(window, WM_CLOSE, 0, 0);
  }
  s.open.compare_exchange_strong(window, nullptr);
}

bool ControlWindowIsOpen(uintptr_t handle) {
  HWND window = ToWindow(handle);
  return window != nullptr && window == State().open.load() && IsWindow(window);
}

uintptr_t CurrentControlWindow() {
  return reinterpret_cast<uintptr_t>(State().open.load());
}

bool IsLatestControlWindow(uintptr_t handle) {
  HWND window = ToWindow(handle);
  return window != nullptr && window == State().latest.load();
}

void SetControlWindowTitle(uintptr_t handle, const std::string& title) {
  if (!ControlWindowIsOpen(handle)) return;
  WindowState& s = State();
  {
    std::lock_guard lock(s.title_mutex);
    s.title = title;
  }
  auto* copy = new char[title.size() + 1];
  std::memcpy(copy, title.c_str(), title.size() + 1);
  if (!PostMessageA(ToWindow(handle), kSetTitleMessage, 0, reinterpret_cast<LPARAM>(copy)))
    delete[] copy;
}

size_t GetControlWindowTitle(uintptr_t handle, char* buffer, size_t capacity) {
  WindowState& s = State();
  if (!ControlWindowIsOpen(handle)) {
    if (buffer != nullptr && capacity > 0) buffer[0] = '\0';
    return 0;
  }
  std::lock_guard lock(s.title_mutex);
  if (buffer != nullptr && capacity > 0) {
    const size_t n = s.title.size() < capacity - 1 ? s.title.size() : capacity - 1;
    std::memcpy(buffer, s.title.data(), n);
    buffer[n] = '\0';
  }
  return s.title.size();
}

uint32_t SendControlMessage(uintptr_t handle, uint32_t command, uintptr_t argument) {
  if (!ControlWindowIsOpen(handle)) return 0;
  const LRESULT result = SendMessageA(ToWindow(handle), State().control_message.load(),
                                      static_cast<WPARAM>(command), static_cast<LPARAM>(argument));
  return static_cast<uint32_t>(result);
}

void PumpPendingMessages() {
  MSG message;
  while (PeekMessageA(&message, nullptr, 0, 0, PM_REMOVE))
    DispatchOne(message);
}

void* NativeThreadHandle(Thread& thread);

void WaitForThreadHandlingMessages(Thread& thread) {
  HANDLE handle = static_cast<HANDLE>(NativeThreadHandle(thread));
  for (;;) {
    const DWORD got = MsgWaitForMultipleObjects(1, &handle, FALSE, INFINITE, QS_ALLINPUT);
    if (got == WAIT_OBJECT_0) return;
    if (got == WAIT_OBJECT_0 + 1) PumpPendingMessages();
    if (thread.ExitStatus() != STILL_ACTIVE) return;
    if (got == WAIT_FAILED) {
      thread.Wait(UINT32_MAX);
      return;
    }
  }
}

}  // namespace vox::platform
