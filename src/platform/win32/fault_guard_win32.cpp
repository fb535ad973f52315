// Win32 implementation of platform.h: the fault guard.
//
// The compiler offers no structured exception blocks, so the guard is built from a vectored
// exception handler and a jump point. A guarded call records its frame in a thread-local
// slot; when a processor fault (access violation, floating-point trap, integer division by
// zero, illegal instruction, stack overflow, ...) strikes a thread inside a guarded call, the
// handler points the faulting thread at a small recovery routine, which jumps back to the
// frame's jump point. Faults outside guarded regions, and every other exception (C++ throws
// travel as exceptions too), go on to the next handler untouched.
//
// As on POSIX, the jump abandons the frames of the guarded function without running their
// destructors; callers guard only code whose leftovers they can afford.
#include <windows.h>

#include <float.h>

#include <cstdio>
#include <mutex>

#include "platform/guard_exceptions.h"
#include "platform/platform.h"

namespace vox::platform {
namespace {

struct GuardFrame {
  // __builtin_setjmp's buffer: five words, restored without unwinding the stack.
  void* jump[5];
  GuardFrame* previous = nullptr;
  // Written by the handler, read after the jump back.
  volatile DWORD code = 0;
  void* volatile address = nullptr;
};

// The innermost guarded call of each thread. A plain TLS index: the handler must reach it
// without allocating.
DWORD g_frame_slot = TLS_OUT_OF_INDEXES;

GuardFrame* CurrentFrame() {
  return static_cast<GuardFrame*>(TlsGetValue(g_frame_slot));
}
void SetCurrentFrame(GuardFrame* frame) {
  TlsSetValue(g_frame_slot, frame);
}

bool IsProcessorFault(DWORD code) {
  switch (code) {
    case EXCEPTION_ACCESS_VIOLATION:
    case EXCEPTION_ARRAY_BOUNDS_EXCEEDED:
    case EXCEPTION_DATATYPE_MISALIGNMENT:
    case EXCEPTION_FLT_DENORMAL_OPERAND:
    case EXCEPTION_FLT_DIVIDE_BY_ZERO:
    case EXCEPTION_FLT_INEXACT_RESULT:
    case EXCEPTION_FLT_INVALID_OPERATION:
    case EXCEPTION_FLT_OVERFLOW:
    case EXCEPTION_FLT_STACK_CHECK:
    case EXCEPTION_FLT_UNDERFLOW:
    case EXCEPTION_ILLEGAL_INSTRUCTION:
    case EXCEPTION_IN_PAGE_ERROR:
    case EXCEPTION_INT_DIVIDE_BY_ZERO:
    case EXCEPTION_INT_OVERFLOW:
    case EXCEPTION_PRIV_INSTRUCTION:
    case EXCEPTION_STACK_OVERFLOW:
    case 0xC00002B4:  // STATUS_FLOAT_MULTIPLE_FAULTS (SSE)
    case 0xC00002B5:  // STATUS_FLOAT_MULTIPLE_TRAPS (SSE)
      return true;
    default:
      return false;
  }
}

const char* FaultKind(DWORD code) {
  switch (code) {
    case EXCEPTION_ACCESS_VIOLATION:
    case EXCEPTION_IN_PAGE_ERROR:
      return "invalid memory access";
    case EXCEPTION_INT_DIVIDE_BY_ZERO:
      return "integer division by zero";
    case EXCEPTION_INT_OVERFLOW:
      return "integer overflow";
    case EXCEPTION_FLT_DIVIDE_BY_ZERO:
      return "floating-point division by zero";
    case EXCEPTION_FLT_OVERFLOW:
      return "floating-point overflow";
    case EXCEPTION_FLT_INVALID_OPERATION:
      return "invalid floating-point operation";
    case 0xC00002B4:
    case 0xC00002B5:
      return "floating-point trap";
    case EXCEPTION_ILLEGAL_INSTRUCTION:
    case EXCEPTION_PRIV_INSTRUCTION:
      return "illegal instruction";
    case EXCEPTION_STACK_OVERFLOW:
      return "stack overflow";
    default:
      return "processor fault";
  }
}

// Runs on the faulting thread in place of the faulting instruction.
[[noreturn]] void Recover() {
  GuardFrame* frame = CurrentFrame();
  SetCurrentFrame(frame->previous);
  __builtin_longjmp(frame->jump, 1);
}

LONG CALLBACK OnException(EXCEPTION_POINTERS* pointers) {
  const DWORD code = pointers->ExceptionRecord->ExceptionCode;
  if (!IsProcessorFault(code)) return EXCEPTION_CONTINUE_SEARCH;
  GuardFrame* frame = CurrentFrame();
  if (frame == nullptr) return EXCEPTION_CONTINUE_SEARCH;
  frame->code = code;
  frame->address = pointers->ExceptionRecord->ExceptionAddress;
  if (code == EXCEPTION_ACCESS_VIOLATION && pointers->ExceptionRecord->NumberParameters >= 2) {
    frame->address = reinterpret_cast<void*>(pointers->ExceptionRecord->ExceptionInformation[1]);
  }
  // Resume in Recover as if it had been called: a 16-byte aligned stack less the return
  // address slot, below the faulting frame (and below the red zone the handler may use).
  CONTEXT* context = pointers->ContextRecord;
  DWORD64 stack = (context->Rsp - 256) & ~static_cast<DWORD64>(15);
  context->Rsp = stack - 8;
  context->Rip = reinterpret_cast<DWORD64>(&Recover);
  return EXCEPTION_CONTINUE_EXECUTION;
}

void Install() {
  g_frame_slot = TlsAlloc();
  AddVectoredExceptionHandler(1, OnException);
}

// Runs fn inside frame; kept apart from the jump point so that nothing it changes needs to
// survive a jump.
__attribute__((noinline)) GuardReport CallInside(GuardFrame& frame,
                                                 const std::function<void()>& fn) {
  SetCurrentFrame(&frame);
  GuardReport report = CallCatchingExceptions(fn);
  SetCurrentFrame(frame.previous);
  return report;
}

}  // namespace

GuardReport RunGuarded(const std::function<void()>& fn) {
  static std::once_flag installed;
  std::call_once(installed, Install);

  GuardFrame frame;
  frame.previous = CurrentFrame();
  volatile unsigned mode = _controlfp(0, 0);
  if (__builtin_setjmp(frame.jump) == 0) return CallInside(frame, fn);

  // Back from a fault: Recover has already unlinked the frame. A floating-point trap leaves
  // its flags raised; clear them and put the caller's mode back.
  _clearfp();
  _controlfp(mode, _MCW_EM | _MCW_RC | _MCW_DN);
  if (frame.code == EXCEPTION_STACK_OVERFLOW) _resetstkoflw();
  GuardReport report;
  report.outcome = GuardOutcome::kFault;
  report.signal = static_cast<int>(frame.code);
  char text[160];
  std::snprintf(text, sizeof text, "%s (exception 0x%08lX) at address %p", FaultKind(frame.code),
                static_cast<unsigned long>(frame.code), frame.address);
  report.description = text;
  return report;
}

}  // namespace vox::platform
