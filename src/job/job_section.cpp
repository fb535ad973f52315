#include "job/job_section.h"

#include <cfloat>
#include <charconv>
#include <cmath>
#include <limits>

namespace vox {

namespace {

constexpr size_t kNotFound = std::string_view::npos;

bool IsWhiteSpace(char c) {
  return c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r';
}

// Digits from `pos` on, wrapping in 32 bits.
uint32_t ReadDigits(std::string_view text, size_t pos) {
  uint32_t value = 0;
  for (; pos < text.size() && text[pos] >= '0' && text[pos] <= '9'; ++pos)
    value = value * 10u + static_cast<uint32_t>(text[pos] - '0');
  return value;
}

}  // namespace

bool JobSection::FindSection(std::string_view name) {
  section_.assign(name);
  std::string pattern;
  pattern.reserve(name.size() + 2);
  pattern.append("[").append(name).append("]");

  size_t match = text_.find(pattern);
  while (match != kNotFound && match != 0 && text_[match - 1] != '\n')
    match = text_.find(pattern, match + 1);
  if (match == kNotFound) {
    start_ = -1;
    end_ = -1;
    return false;
  }
  start_ = static_cast<int32_t>(match + pattern.size());
  const size_t next = text_.find("\n[", static_cast<size_t>(start_));
  end_ = next == kNotFound ? -1 : static_cast<int32_t>(next + 1);
  return true;
}

std::string JobSection::GetString(std::string_view key) const {
  if (start_ < 0 || static_cast<size_t>(start_) >= text_.size()) return {};
  const size_t limit = end_ < 0 ? text_.size() : static_cast<size_t>(end_);
  const std::string_view range = text_.substr(0, limit);

  std::string pattern;
  pattern.reserve(key.size() + 2);
  pattern.append("\n").append(key).append("=");
  const size_t match = range.find(pattern, static_cast<size_t>(start_));
  if (match == kNotFound) return {};

  const size_t begin = match + pattern.size();
  const size_t line_end = range.find('\n', begin);
  if (line_end == kNotFound) return std::string(range.substr(begin));

  std::string_view value = range.substr(begin, line_end - begin);
  const size_t semicolon = value.find(';');
  if (semicolon != kNotFound) {
    value = value.substr(0, semicolon);
    while (!value.empty() && value.back() == ' ')
      value.remove_suffix(1);
  }
  return std::string(value);
}

int32_t JobSection::GetInt(std::string_view key, int32_t default_value) const {
  const std::string value = GetString(key);
  return value.empty() ? default_value : ParseIntDigits(value);
}

double JobSection::GetDouble(std::string_view key, double default_value) const {
  const std::string value = GetString(key);
  return value.empty() ? default_value : ParseDouble(value);
}

float JobSection::GetFloat(std::string_view key, float default_value) const {
  return NarrowToFloat(GetDouble(key, default_value));
}

int32_t ParseIntDigits(std::string_view text) {
  const bool negative = !text.empty() && text[0] == '-';
  const uint32_t digits = ReadDigits(text, negative ? 1 : 0);
  return static_cast<int32_t>(negative ? 0u - digits : digits);
}

int32_t ParseIntBlankTolerant(std::string_view text) {
  size_t pos = 0;
  while (pos < text.size() && (text[pos] == ' ' || text[pos] == '\t'))
    ++pos;
  bool negative = false;
  if (pos < text.size() && (text[pos] == '-' || text[pos] == '+')) {
    negative = text[pos] == '-';
    ++pos;
  }
  const uint32_t digits = ReadDigits(text, pos);
  return static_cast<int32_t>(negative ? 0u - digits : digits);
}

double ParseDouble(std::string_view text, size_t* consumed) {
  if (consumed != nullptr) *consumed = 0;
  text = text.substr(0, 63);
  size_t pos = 0;
  while (pos < text.size() && IsWhiteSpace(text[pos]))
    ++pos;
  bool negative = false;
  if (pos < text.size() && (text[pos] == '-' || text[pos] == '+')) {
    negative = text[pos] == '-';
    ++pos;
  }
  // from_chars takes no sign of its own after ours ("--1" is no number, as in strtod).
  if (pos < text.size() && (text[pos] == '-' || text[pos] == '+')) return 0.0;
  const char* first = text.data() + pos;
  const char* last = text.data() + text.size();

  // Hexadecimal numbers ("0x1.8p1") as the C conversion reads them.
  if (last - first > 2 && first[0] == '0' && (first[1] == 'x' || first[1] == 'X')) {
    double hex = 0.0;
    const auto result = std::from_chars(first + 2, last, hex, std::chars_format::hex);
    if (result.ec == std::errc() && first[2] != '-' && first[2] != '+') {
      if (consumed != nullptr) *consumed = static_cast<size_t>(result.ptr - text.data());
      return negative ? -hex : hex;
    }
  }

  double value = 0.0;
  const auto result = std::from_chars(first, last, value, std::chars_format::general);
  if (result.ec == std::errc::result_out_of_range) {
    // Beyond the double range: overflow gives infinity and underflow 0, as strtod does.
    long double wide = 0.0L;
    const auto wide_result = std::from_chars(first, last, wide, std::chars_format::general);
    if (wide_result.ec == std::errc()) {
      value = static_cast<double>(wide);
    } else {
      const std::string_view number(first, static_cast<size_t>(result.ptr - first));
      const size_t exponent = number.find_first_of("eE");
      const bool tiny =
          exponent != kNotFound && exponent + 1 < number.size() && number[exponent + 1] == '-';
      value = tiny ? 0.0 : std::numeric_limits<double>::infinity();
    }
  } else if (result.ec != std::errc()) {
    return 0.0;
  }
  if (consumed != nullptr) *consumed = static_cast<size_t>(result.ptr - text.data());
  return negative ? -value : value;
}

float NarrowToFloat(double value) {
  const float narrowed = static_cast<float>(value);
  if (std::fabs(narrowed) < FLT_MIN) return 0.0f;
  return narrowed;
}

std::vector<std::string_view> SplitCommaList(std::string_view value) {
  std::vector<std::string_view> items;
  size_t begin = 0;
  for (;;) {
    const size_t comma = value.find(',', begin);
    if (comma == kNotFound) {
      items.push_back(value.substr(begin));
      return items;
    }
    items.push_back(value.substr(begin, comma - begin));
    begin = comma + 1;
  }
}

bool ParseTimeMs(std::string_view text, TimeMs& target) {
  const size_t colon = text.find(':');
  if (colon == kNotFound) return false;
  const uint32_t days = static_cast<uint32_t>(ParseIntBlankTolerant(text.substr(0, colon)));
  const uint32_t ms = static_cast<uint32_t>(ParseIntBlankTolerant(text.substr(colon + 1)));
  target.seconds = days * kSecondsPerDay + ms / 1000u;
  target.ms = static_cast<uint16_t>(ms % 1000u);
  return true;
}

}  // namespace vox
