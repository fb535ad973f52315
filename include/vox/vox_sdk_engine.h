/* vox engine SDK: the _eng_* functions an engine exports, the interface version and the
 * parameter block.
 *
 * An engine is a shared library. vox loads it, looks up the functions below by name and
 * calls them with machine words only (pointers, 32-bit and pointer-sized integers). Each
 * name may be exported with or without its leading underscore ("_eng_ProcessGroup" or
 * "eng_ProcessGroup"); vox tries the name without the underscore first.
 *
 * Required (loading fails without them): _eng_GetEngineVOXVersion, _eng_GetEngineDLLVersion,
 * _eng_GetEngineInternalName, _eng_GetEngineCapability. Everything else is optional; vox
 * simply does not call what is missing.
 *
 * Loading order as seen by the engine:
 *   1. _eng_InitEngine(module), or, only when that is absent, _eng_InitEngineDLL(path);
 *   2. _eng_GetEngineVOXVersion(), which must return VOX_ENGINE_INTERFACE_VERSION;
 *   3. for the job and for every vector and fan: _eng_GetParamBlockSize(), then
 *      _eng_InitParamBlock(block), then _eng_EnumParamName(callback, context), from which
 *      vox calls _eng_SetParam(block, name, value) for every name the job file sets;
 *   4. the processing calls (_eng_ProcessGroup, _eng_ProcessGroupMT for jobs on several
 *      threads, _eng_ProcessOccupation for a raw filter), during which _eng_BreakProcess may
 *      be called from the callbacks of the vox_ThreadContext when the user stops the job.
 *
 * Example of an exported function:
 *   VOX_ENGINE_EXPORT int32_t VOX_CALL _eng_GetEngineVOXVersion(void) {
 *     return VOX_ENGINE_INTERFACE_VERSION;
 *   }
 *
 * An engine must not let a C++ exception leave any of these functions. */
#ifndef VOX_SDK_ENGINE_H
#define VOX_SDK_ENGINE_H

#include "vox_sdk_core.h"

/* The only interface version vox accepts from _eng_GetEngineVOXVersion. A lower value is
 * refused as obsolete, a higher one as unexpected. */
#define VOX_ENGINE_INTERFACE_VERSION 22

#pragma pack(push, 1)

/* Header of an engine's parameter block. vox allocates the block with the size the engine
 * asked for (_eng_GetParamBlockSize), zero-fills it and sets `size` to 0 and `allocated` to
 * the block's total size in bytes (header included); the engine's own bytes follow the
 * header. vox copies a block (for every vector and fan) by `allocated` bytes, so a block
 * must not hold pointers to itself. An engine usually declares its block as a packed
 * structure that begins with this header. */
typedef struct VOX_PACKED ParameterBlock {
  uint16_t size;      /* meaningful size; vox sets 0 and leaves it to the engine */
  uint16_t allocated; /* total size of the block in bytes, header included */
} ParameterBlock;
#pragma pack(pop)

VOX_CHECK_SIZE(ParameterBlock, 4);
VOX_CHECK_OFFSET(ParameterBlock, size, 0);
VOX_CHECK_OFFSET(ParameterBlock, allocated, 2);

/* The callback vox passes to _eng_EnumParamName. The engine calls it once per parameter
 * name with the context it received, a second argument vox ignores (pass 0) and the name.
 * Returns 0. */
typedef uint32_t(VOX_CALL* vox_EnumParamCallback)(void* context, uintptr_t unused,
                                                  const char* name);

/* ---- Called once at load ---------------------------------------------------------------- */

/* Receives an opaque handle of the vox library. On Windows it is the module instance of
 * vox; elsewhere it is the address of vox's own file path as a zero-terminated string, valid
 * for the life of the process. Optional; the result is ignored. */
typedef uint32_t(VOX_CALL* vox_eng_InitEngine)(void* vox_module);
/* Called only when _eng_InitEngine is absent: receives the full path of the vox library
 * (bytes, valid during the call). Optional; the result is ignored. */
typedef uint32_t(VOX_CALL* vox_eng_InitEngineDLL)(const char* vox_path);
/* Required: returns the interface version the engine was written for. */
typedef int32_t(VOX_CALL* vox_eng_GetEngineVOXVersion)(void);

/* ---- Required but never called by vox (for hosts and tools) ------------------------------ */

typedef uint32_t(VOX_CALL* vox_eng_GetEngineDLLVersion)(void);
typedef const char*(VOX_CALL* vox_eng_GetEngineInternalName)(void);
typedef uint32_t(VOX_CALL* vox_eng_GetEngineCapability)(void);

/* ---- Parameters -------------------------------------------------------------------------- */

/* Size of the parameter block in bytes, header included; 0 means the engine has none.
 * vox cannot describe a block above 65535 bytes and treats such a size as no block. */
typedef uint32_t(VOX_CALL* vox_eng_GetParamBlockSize)(void);
/* Sets the engine's defaults in a freshly allocated, zero-filled block. */
typedef uint32_t(VOX_CALL* vox_eng_InitParamBlock)(ParameterBlock* block);
/* Calls `callback(context, 0, name)` for every parameter name the engine understands. */
typedef uint32_t(VOX_CALL* vox_eng_EnumParamName)(vox_EnumParamCallback callback,
                                                  void* context);
/* Stores one parameter given as text (the job file's value) into the block. */
typedef uint32_t(VOX_CALL* vox_eng_SetParam)(ParameterBlock* block, const char* name,
                                             const char* value);

/* ---- Processing -------------------------------------------------------------------------- */

/* Processes the whole job. The result 0 or 3 means failure; anything else success. */
typedef uint32_t(VOX_CALL* vox_eng_ProcessGroup)(vox_ThreadContext* context);
/* As _eng_ProcessGroup, for single-site jobs that may use several threads. */
typedef uint32_t(VOX_CALL* vox_eng_ProcessGroupMT)(vox_ThreadContext* context);
/* Raw filters: processes the occupation whose identifier is context->id. May run on
 * several threads at once, each with its own context. The result is ignored. */
typedef uint32_t(VOX_CALL* vox_eng_ProcessOccupation)(vox_ThreadContext* context);
/* Asks a running process call to stop soon. May be called repeatedly, from the thread that
 * calls the context's callbacks. The result is ignored. */
typedef uint32_t(VOX_CALL* vox_eng_BreakProcess)(void);

/* ---- Resolved but never called by vox; their meaning is the engine's -------------------- */

typedef const char*(VOX_CALL* vox_eng_GetEngineDescription)(void);
typedef uint32_t(VOX_CALL* vox_eng_EditParamBlock)(ParameterBlock* block, void* parent_window);
typedef uint32_t(VOX_CALL* vox_eng_ProcessVector)(vox_ThreadContext* context);
typedef uint32_t(VOX_CALL* vox_eng_EditOccupation)(void* parent_window, uint32_t occupation_id);
typedef uint32_t(VOX_CALL* vox_eng_ViewVectorResult)(void* parent_window, uint32_t vector_id);
typedef uint32_t(VOX_CALL* vox_eng_GetParam)(const ParameterBlock* block, const char* name,
                                             char* value, uint32_t value_size);
typedef uintptr_t(VOX_CALL* vox_eng_EphemerisCalculator)(uintptr_t request, void* data);

#endif /* VOX_SDK_ENGINE_H */
