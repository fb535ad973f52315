// POSIX implementation of platform.h: the fault guard.
//
// A guarded call records a jump point on its own thread; the handlers for SIGSEGV, SIGBUS,
// SIGFPE and SIGILL jump back to it when the fault happened on a thread inside a guarded
// call, and otherwise pass the fault on to whatever handled it before (by default the
// process dies, as it would without us). The handlers run on an alternate signal stack that
// every guarded thread gets, so that a stack overflow inside the guard is caught as well.
//
// The jump abandons the frames of the guarded function without running their destructors:
// whatever they held is lost. That is the price of turning a fault into a report; callers
// guard only code whose leftovers they can afford (an engine call on a worker thread).
#include <setjmp.h>
#include <signal.h>
#include <unistd.h>

#include <cfenv>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <mutex>

#include "platform/guard_exceptions.h"
#include "platform/platform.h"

namespace vox::platform {
namespace {

constexpr int kGuardedSignals[] = {SIGSEGV, SIGBUS, SIGFPE, SIGILL};
constexpr size_t kSignalCount = sizeof kGuardedSignals / sizeof kGuardedSignals[0];

struct GuardFrame {
  sigjmp_buf jump;
  GuardFrame* previous = nullptr;
  // Written by the handler, read after the jump back.
  volatile int signal = 0;
  volatile int code = 0;
  void* volatile address = nullptr;
};

// The innermost guarded call of this thread. Initial-exec TLS: the handler must reach it
// without the lazy allocation that the general TLS model may do on a thread's first access.
__attribute__((tls_model("initial-exec"))) thread_local GuardFrame* t_frame = nullptr;

struct sigaction g_previous[kSignalCount];

size_t SignalSlot(int signal) {
  for (size_t i = 0; i < kSignalCount; ++i) {
    if (kGuardedSignals[i] == signal) return i;
  }
  return 0;
}

void PassOn(int signal, siginfo_t* info, void* context) {
  const struct sigaction& previous = g_previous[SignalSlot(signal)];
  if (previous.sa_flags & SA_SIGINFO) {
    if (previous.sa_sigaction != nullptr) {
      previous.sa_sigaction(signal, info, context);
      return;
    }
  } else if (previous.sa_handler != SIG_DFL && previous.sa_handler != SIG_IGN &&
             previous.sa_handler != nullptr) {
    previous.sa_handler(signal);
    return;
  }
  // Default action: put it back and let the signal strike again. A fault repeats when the
  // faulting instruction is resumed; a sent signal is raised again here (it stays blocked
  // until this handler returns).
  struct sigaction fallback {};
  fallback.sa_handler = SIG_DFL;
  sigemptyset(&fallback.sa_mask);
  sigaction(signal, &fallback, nullptr);
  if (info == nullptr || info->si_code <= 0) raise(signal);
}

void OnFault(int signal, siginfo_t* info, void* context) {
  GuardFrame* frame = t_frame;
  if (frame == nullptr) {
    PassOn(signal, info, context);
    return;
  }
  t_frame = frame->previous;
  frame->signal = signal;
  frame->code = info != nullptr ? info->si_code : 0;
  frame->address = info != nullptr ? info->si_addr : nullptr;
  siglongjmp(frame->jump, 1);
}

void InstallHandlers() {
  struct sigaction action {};
  action.sa_sigaction = OnFault;
  action.sa_flags = SA_SIGINFO | SA_ONSTACK;
  sigemptyset(&action.sa_mask);
  for (size_t i = 0; i < kSignalCount; ++i) {
    sigaction(kGuardedSignals[i], &action, &g_previous[i]);
  }
}

// The alternate signal stack of a guarded thread, released when the thread ends.
class AltStack {
 public:
  AltStack() {
    stack_t current{};
    if (sigaltstack(nullptr, &current) == 0 && !(current.ss_flags & SS_DISABLE)) return;
    long minimum = sysconf(_SC_SIGSTKSZ);
    size_ = 65536 + (minimum > 0 ? static_cast<size_t>(minimum) : SIGSTKSZ);
    memory_ = malloc(size_);
    if (memory_ == nullptr) return;
    stack_t ours{};
    ours.ss_sp = memory_;
    ours.ss_size = size_;
    if (sigaltstack(&ours, nullptr) != 0) {
      free(memory_);
      memory_ = nullptr;
    }
  }
  ~AltStack() {
    if (memory_ == nullptr) return;
    stack_t off{};
    off.ss_flags = SS_DISABLE;
    sigaltstack(&off, nullptr);
    free(memory_);
  }
  AltStack(const AltStack&) = delete;
  AltStack& operator=(const AltStack&) = delete;

 private:
  void* memory_ = nullptr;
  size_t size_ = 0;
};

void EnsureAltStack() {
  static thread_local AltStack stack;
}

const char* SignalName(int signal) {
  switch (signal) {
    case SIGSEGV:
      return "SIGSEGV";
    case SIGBUS:
      return "SIGBUS";
    case SIGFPE:
      return "SIGFPE";
    case SIGILL:
      return "SIGILL";
    default:
      return "signal";
  }
}

const char* FaultKind(int signal, int code) {
  if (signal == SIGFPE) {
    switch (code) {
      case FPE_INTDIV:
        return "integer division by zero";
      case FPE_INTOVF:
        return "integer overflow";
      case FPE_FLTDIV:
        return "floating-point division by zero";
      case FPE_FLTOVF:
        return "floating-point overflow";
      case FPE_FLTUND:
        return "floating-point underflow";
      case FPE_FLTRES:
        return "floating-point inexact result";
      case FPE_FLTINV:
        return "invalid floating-point operation";
      default:
        return "arithmetic fault";
    }
  }
  if (signal == SIGSEGV) return "invalid memory access";
  if (signal == SIGBUS) return "bus error";
  if (signal == SIGILL) return "illegal instruction";
  return "processor fault";
}

// Runs fn inside frame; kept apart from the jump point so that nothing it changes needs to
// survive a jump.
__attribute__((noinline)) GuardReport CallInside(GuardFrame& frame,
                                                 const std::function<void()>& fn) {
  t_frame = &frame;
  GuardReport report = CallCatchingExceptions(fn);
  t_frame = frame.previous;
  return report;
}

}  // namespace

GuardReport RunGuarded(const std::function<void()>& fn) {
  static std::once_flag installed;
  std::call_once(installed, InstallHandlers);
  EnsureAltStack();

  GuardFrame frame;
  frame.previous = t_frame;
  fenv_t mode;
  fegetenv(&mode);
  if (sigsetjmp(frame.jump, 1) == 0) return CallInside(frame, fn);

  // Back from a fault: the handler has already unlinked the frame. The kernel handed the
  // handler a fresh floating-point state, which the jump kept; put the caller's back.
  fesetenv(&mode);
  feclearexcept(FE_ALL_EXCEPT);
  GuardReport report;
  report.outcome = GuardOutcome::kFault;
  report.signal = frame.signal;
  char text[160];
  snprintf(text, sizeof text, "%s (%s) at address %p", FaultKind(frame.signal, frame.code),
           SignalName(frame.signal), frame.address);
  report.description = text;
  return report;
}

}  // namespace vox::platform
