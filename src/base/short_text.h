// Short texts: texts of at most 255 bytes built in the calling thread's scratch ring, laid
// out as a length byte, the text and a zero byte. A short text is used through a pointer to
// its first text byte, so it reads as an ordinary C string, and ShortTextLength reads the
// byte before it. Like everything in the ring, a short text is valid only until the ring
// wraps: use it at once, copy it to keep it.
//
// Also here: the system's error texts, made the same way. Any thread may call everything
// here; each works on its own ring.
#pragma once

#include <cstdarg>
#include <cstdint>
#include <string>

namespace vox {

constexpr size_t kShortTextMax = 255;

// The length stored before a short text.
inline size_t ShortTextLength(const char* short_text) {
  return static_cast<uint8_t>(short_text[-1]);
}

// The first 255 bytes at most of text (null reads as empty).
const char* ShortCopy(const char* text);

// printf-style; the result is cut to 255 bytes, and a formatting error gives the empty text.
const char* ShortFormat(const char* format, ...)
#if defined(__GNUC__)
    __attribute__((format(printf, 1, 2)))
#endif
    ;
const char* ShortFormatV(const char* format, va_list arguments);

// The system's text for an error code, as one line in a 256-byte area of the ring; null for
// code 0 or when the system has no text for the code.
const char* SystemErrorText(uint32_t code);
// The same for the calling thread's last error code.
const char* LastErrorText();
// The last error's text as an owned string; empty when there is none.
std::string LastErrorString();

}  // namespace vox
