/* vox host API: run a job, steer it, learn how it ended.
 *
 * A host runs one job at a time. A run function starts the job on a thread of its own and
 * returns a control handle; the host then steers and watches the job through
 * SendEngineControl and, optionally, a callback registered with command 8. The job ends with
 * an exit code (VOX_EXIT_*), which the host receives through the callback (code 7), through
 * command 7 while the handle is open, or by waiting (RunProcessAndWait*).
 *
 * Typical use:
 *
 *   vox_ControlHandle h = RunProcess("/data/job.ini");
 *   if (h == NULL) { ... another job runs ... }
 *   vox_HostCallbackPair cb = { my_callback, my_context };
 *   SendEngineControl(h, VOX_CMD_SET_CALLBACK, (uintptr_t)&cb);
 *   ... my_callback(my_context, VOX_CALLBACK_EXIT_CODE, code) tells the end ...
 *
 * Control handles. A handle names one run's control channel (on Windows its hidden control
 * window). It is a number, not a pointer, and stays safe to use for the life of the
 * process: once the job has ended the channel is closed, and every command sent on the
 * handle returns 0 without effect (except callback registration on the most recent handle,
 * see VOX_CMD_SET_CALLBACK). A job whose file cannot be read (exit code 5) leaves its
 * channel open until the next run starts. Never dereference a handle.
 *
 * Threads. The run functions, SendEngineControl and GetEngineControlTitle may be called
 * from any host thread. The callback is called on library threads: code 3 on whichever
 * thread reports the progress (the job thread or an engine thread), code 7 on the job thread
 * (or on the registering thread, see VOX_CMD_SET_CALLBACK). It must return quickly and must
 * not wait for the job to end. On POSIX no message pumping is needed anywhere.
 *
 * Paths are byte strings in the system's ANSI code page (UTF-8 on POSIX) for the plain
 * functions and wide strings for the W functions (converted to UTF-8 on POSIX). Relative
 * paths inside a job file are taken against the job file's folder.
 *
 * Engine log: when a folder named "engine" exists in the temporary folder (TMPDIR, else
 * /tmp), every run call leaves a new trace file "OUT<hex>.tmp" there; a call refused as busy
 * writes "Program is busy" to a file of its own and leaves the running job's log alone. */
#ifndef VOX_HOST_H
#define VOX_HOST_H

#include <stddef.h>
#include <stdint.h>
#include <wchar.h>

#include "vox_defs.h"

VOX_BEGIN_DECLS

/* Opaque control handle; NULL means "no run started". */
typedef struct vox_ControlWindow_* vox_ControlHandle;

/* ---------------------------------------------------------------- exit codes */

#define VOX_EXIT_DONE 0               /* job done and result file closed properly */
#define VOX_EXIT_JOB_FILE 5           /* job file unreadable/empty, or an unterminated "$(" */
#define VOX_EXIT_PARSE 6              /* job text not parsed (includes an engine that cannot load) */
#define VOX_EXIT_RESULT_FILE 7        /* result file cannot be opened */
#define VOX_EXIT_PREPARATION 8        /* data preparation failed (a raw file unusable) */
#define VOX_EXIT_THREAD 9             /* the job thread could not be started */
#define VOX_EXIT_BREAK 10             /* a break was requested (command 0) */
#define VOX_EXIT_CLOSE 11             /* the result file's closing record could not be written */
#define VOX_EXIT_STILL_ACTIVE 259     /* the job has not ended (also before the first job) */

/* ---------------------------------------------------------------- callback */

/* Called with (context, code, value); the result is ignored. */
typedef void(VOX_CALL* vox_HostCallback)(void* context, uint32_t code, uint32_t value);

#define VOX_CALLBACK_PROGRESS 3  /* value: the new progress in percent, each time it rises */
#define VOX_CALLBACK_EXIT_CODE 7 /* value: the exit code, once the job thread has stored it */

/* The argument of command 8. */
typedef struct vox_HostCallbackPair {
  vox_HostCallback callback;
  void* context;
} vox_HostCallbackPair;

/* ---------------------------------------------------------------- run functions */

/* Starts the job file at job_path and returns at once with the control handle; NULL when
 * another job is running ("busy"). If the job thread cannot be started the handle is still
 * returned and the exit code is 9. */
VOX_API vox_ControlHandle RunProcess(const char* job_path);
VOX_API vox_ControlHandle RunProcessW(const wchar_t* job_path);

/* Runs the job file and returns 1 once the job has ended, whatever its exit code (read it
 * through the callback); 0 when the job could not be started (busy, or no thread). */
VOX_API uint32_t RunProcessAndWait(const char* job_path);
VOX_API uint32_t RunProcessAndWaitW(const wchar_t* job_path);

/* Like RunProcess, with run variables: each entry "NAME=VALUE" (a text without '=' defines
 * NAME with an empty value) replaces "$(NAME)" in the job text; of two entries with one name
 * the later wins, and an unknown name is replaced by nothing. The standard entry points run
 * with no variables. variables may be NULL when count is 0. */
VOX_API vox_ControlHandle RunProcessWithVariables(const char* job_path,
                                                  const char* const* variables,
                                                  uint32_t count);

/* ---------------------------------------------------------------- control commands */

/* Command numbers for SendEngineControl, with what each returns. */
#define VOX_CMD_BREAK 0        /* request a break; the job ends with exit code 10. Returns 0 */
#define VOX_CMD_PAUSE 1        /* set the pause flag. Returns 1 at once (see below) */
#define VOX_CMD_RESUME 2       /* clear the pause flag. Returns 2 */
#define VOX_CMD_PROGRESS 3     /* progress in percent, 0 to 99; never decreases within a job */
#define VOX_CMD_PING 4         /* returns 4 */
#define VOX_CMD_ELAPSED 5      /* whole seconds since the job started (local clock); after the
                                  job, its length; 0 before any job */
#define VOX_CMD_THREAD_ID 6    /* the job thread's id */
#define VOX_CMD_EXIT_CODE 7    /* the exit code; VOX_EXIT_STILL_ACTIVE (259) while running */
#define VOX_CMD_SET_CALLBACK 8 /* argument: (uintptr_t) a vox_HostCallbackPair*. Registers the
                                  callback if none is registered yet (the first one stays in
                                  force for all later jobs); if the job has already ended,
                                  calls the pair's function at once with (context, 7, exit
                                  code) on the calling thread. Returns 8.
                                  This command is also taken on the handle of the most
                                  recent run after its job has ended, so a host that
                                  registers right after the run call never misses the end */

/* Carries out one command on the run's control channel and returns its result; any other
 * command number returns 0, and so does every command on a closed or unknown handle.
 *
 * Pause: on POSIX a pause only raises a flag. The sender gets 1 back at once and nothing
 * is held up, neither the job thread nor a host thread; VOX_CMD_RESUME clears the flag. A
 * pause still in force when the job ends is dropped with the channel, so nothing can be left
 * waiting for a resume that no longer has a channel to arrive on.
 *
 * On Windows the same function sends the registered window message "EngCtrlWndMsg" to the
 * control window. */
VOX_API uint32_t SendEngineControl(vox_ControlHandle handle, uint32_t command,
                                   uintptr_t argument);

/* The channel's title: "EngineControlWindow" at first, the job's Name once the job file has
 * been parsed and its data prepared. Copies at most capacity - 1 bytes and a terminating zero
 * into buffer (which may be NULL when capacity is 0) and returns the title's full length;
 * 0 (and an empty buffer) for a closed or unknown handle. */
VOX_API uint32_t GetEngineControlTitle(vox_ControlHandle handle, char* buffer, uint32_t capacity);

/* The Name and the completed result path of the most recent job, as its job file gave them;
 * kept after the job has ended, until the next run starts (empty before the job file has
 * been parsed). Copy like GetEngineControlTitle, without a handle. */
VOX_API uint32_t GetEngineJobName(char* buffer, uint32_t capacity);
VOX_API uint32_t GetEngineResultPath(char* buffer, uint32_t capacity);

VOX_END_DECLS

#ifdef __cplusplus
/* Starts a job from its text instead of a file (carriage returns are removed, no variables
 * are substituted, relative paths are taken against "./"); returns the control handle, NULL
 * when busy. Exported with C++ linkage: its exported name encodes its signature. */
VOX_API vox_ControlHandle RunMultiSiteTask(const char* job_text);
#endif

#endif /* VOX_HOST_H */
