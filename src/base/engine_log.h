// The engine log: the plain-text trace file that the whole library writes to, and the
// message operation that writes a line to it while keeping the host responsive.
//
// The log is one shared file; lines from several threads may interleave. The run room opens
// a fresh one for every run call and closes it at the end of the job. With no log open every
// operation here is a cheap no-op.
//
// Threads: Trace and Message may be called from any thread at any time. Writers hold a
// shared lock only while writing, and replacing or closing the log takes it exclusively, so
// a log is never closed under a thread that is still writing to it. A run call that is
// refused while a job runs must not replace the running job's log: it uses OpenSideLog.
#pragma once

#include <cstdarg>
#include <cstdio>
#include <string>

namespace vox {

// printf-style; writes the formatted text as it is (no line break, time stamp or prefix of
// its own, no flush). Nothing happens when no log is open or the format is null.
void Trace(const char* format, ...)
#if defined(__GNUC__)
    __attribute__((format(printf, 1, 2)))
#endif
    ;

// The message operation: pumps pending control messages (see SetMessagePump), then writes
// text and a line feed to the engine log. Returns 1.
int Message(int level, const char* text);

// Installs the routine that pumps pending control messages of the calling thread (the run
// room's control channel); null restores the no-op.
void SetMessagePump(void (*pump)());
void PumpMessages();

// Opens a fresh engine log as a run call does: a new "OUT"-prefixed unique file in the
// folder "engine" of the temporary folder when that folder exists, else the null device.
// Replaces (and closes) the log that was open. Returns the path of the log file.
std::string OpenEngineLog();
void CloseEngineLog();
bool EngineLogIsOpen();

// The va_list form of Trace.
void TraceV(const char* format, va_list arguments);

// Opens a log file chosen exactly as OpenEngineLog chooses it (so a refused run call also
// leaves its one "OUT" file when the "engine" folder exists) without touching the open log.
// The caller writes to it and closes it with std::fclose. Null if nothing could be opened;
// path (optional) receives the path of the file.
FILE* OpenSideLog(std::string* path = nullptr);

}  // namespace vox
