/* vox: definitions shared by the host and the engine headers.
 *
 * Every record exchanged with an engine is packed (no padding) and little-endian; its
 * size and the offset of every field are checked at compile time with VOX_CHECK_SIZE and
 * VOX_CHECK_OFFSET, because engines built by others depend on every byte. */
#ifndef VOX_DEFS_H
#define VOX_DEFS_H

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
#define VOX_EXTERN_C extern "C"
#define VOX_BEGIN_DECLS extern "C" {
#define VOX_END_DECLS }
#else
#define VOX_EXTERN_C
#define VOX_BEGIN_DECLS
#define VOX_END_DECLS
#endif

/* VOX_API marks a function exported by the vox library. */
#if defined(_WIN32)
#if defined(VOX_BUILDING_LIBRARY)
#define VOX_API __declspec(dllexport)
#else
#define VOX_API __declspec(dllimport)
#endif
#define VOX_CALL __cdecl
#else
#define VOX_API __attribute__((visibility("default")))
#define VOX_CALL
#endif

/* VOX_ENGINE_EXPORT marks a function exported by an engine library. */
#if defined(_WIN32)
#define VOX_ENGINE_EXPORT VOX_EXTERN_C __declspec(dllexport)
#else
#define VOX_ENGINE_EXPORT VOX_EXTERN_C __attribute__((visibility("default")))
#endif

#if defined(__GNUC__) || defined(__clang__)
#define VOX_PACKED __attribute__((packed))
#else
#define VOX_PACKED
#endif

#ifdef __cplusplus
#define VOX_CHECK_SIZE(type, size) static_assert(sizeof(type) == (size), #type " size")
#define VOX_CHECK_OFFSET(type, field, off) \
  static_assert(offsetof(type, field) == (off), #type "." #field " offset")
#else
#define VOX_CHECK_SIZE(type, size) _Static_assert(sizeof(type) == (size), #type " size")
#define VOX_CHECK_OFFSET(type, field, off) \
  _Static_assert(offsetof(type, field) == (off), #type "." #field " offset")
#endif

#endif /* VOX_DEFS_H */
