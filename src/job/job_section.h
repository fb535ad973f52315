// The job file reader: a cursor over the one prepared job text through which the parser and
// the leap-second table look up sections and keys.
//
// There is no table of the file: every lookup is a fresh search of the text, which keeps the
// grammar narrow and exact. A section header must start a line; a key must start a line and
// be followed directly by '='; the first match wins; a ';' cuts a value (with trailing blanks)
// except on a last line without a line feed. Numbers are read with the classic "C" rules
// whatever the process locale.
//
// A JobSection is used by one thread at a time; it only reads the text, which the caller
// keeps alive for as long as the cursor is used.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "base/time_ms.h"

namespace vox {

class JobSection {
 public:
  explicit JobSection(std::string_view text) : text_(text) {}

  // Positions the cursor on the first header "[name]" that starts a line. False (and every
  // later key lookup empty) when there is none.
  bool FindSection(std::string_view name);

  // The value of the first line "key=..." of the current section; empty when absent.
  std::string GetString(std::string_view key) const;
  // Default for an absent or empty value; otherwise the digit rule (ParseIntDigits).
  int32_t GetInt(std::string_view key, int32_t default_value) const;
  // Default for an absent or empty value; otherwise ParseDouble of the value.
  double GetDouble(std::string_view key, double default_value) const;
  // GetDouble narrowed to float; magnitudes below the smallest normal float become 0.
  float GetFloat(std::string_view key, float default_value) const;

  const std::string& section_name() const { return section_; }
  int32_t start() const { return start_; }
  int32_t end() const { return end_; }
  std::string_view text() const { return text_; }

 private:
  std::string_view text_;
  std::string section_;
  int32_t start_ = -1;
  int32_t end_ = -1;  // -1: up to the end of the text
};

// Digit rule of integer keys and integer list items: an optional leading '-', then decimal
// digits up to the first other byte, wrapping in 32 bits. No blanks, no '+': anything else
// first gives 0, and so does a lone '-'.
int32_t ParseIntDigits(std::string_view text);

// Blank-tolerant rule of satellite lists and times: leading blanks and tabs skipped, an
// optional '-' or '+', then digits; an empty or blank field gives 0.
int32_t ParseIntBlankTolerant(std::string_view text);

// Classic-locale conversion of at most the first 63 bytes: leading white space, a sign and an
// exponent are accepted; bytes after the number are ignored; no number gives 0.
// consumed, when given, receives the count of bytes up to the end of the number (0 when
// there is no number).
double ParseDouble(std::string_view text, size_t* consumed = nullptr);

// Narrowing to float with magnitudes below the smallest normal float flushed to 0.
float NarrowToFloat(double value);

// Splits a list value at every ','; an empty value is one empty item.
std::vector<std::string_view> SplitCommaList(std::string_view value);

// The job's time syntax "days:milliseconds" (days since the GPS time origin). Without a ':'
// the target keeps its value and the result is false.
bool ParseTimeMs(std::string_view text, TimeMs& target);

}  // namespace vox
