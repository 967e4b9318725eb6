// White space and decimal numbers as every part of the library reads them:
// one white-space table (the Unicode White_Space characters) for the trims of
// the extraction and for every wcstol-style read, ASCII digits only. Pure and
// thread-safe; header-only, so any subsystem can use it.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace asum {

inline bool IsWhiteSpace(char16_t c) {
  return (c >= 0x0009 && c <= 0x000D) || c == 0x0020 || c == 0x0085 ||
         c == 0x00A0 || c == 0x1680 || (c >= 0x2000 && c <= 0x200A) ||
         c == 0x2028 || c == 0x2029 || c == 0x202F || c == 0x205F ||
         c == 0x3000;
}

inline bool IsAsciiDigit(char16_t c) { return c >= u'0' && c <= u'9'; }

// Reads a decimal number the way the C library's wcstol does with base 10 and
// a 32-bit long: leading white space (the table above) is skipped, then an
// optional '+' or '-', then ASCII digits. Anything after the digits is
// ignored. No digit gives 0; a value beyond the 32-bit signed range is clamped
// to INT32_MIN / INT32_MAX. The retention day count, count results and numeric
// character references are all read with this, so numbers mean the same
// everywhere.
inline int32_t WcstolBase10(std::u16string_view text) {
  std::size_t i = 0;
  while (i < text.size() && IsWhiteSpace(text[i])) ++i;
  bool negative = false;
  if (i < text.size() && (text[i] == u'+' || text[i] == u'-')) {
    negative = text[i] == u'-';
    ++i;
  }
  // Accumulated as a magnitude that stops growing once past the range, so a
  // thousand-digit run neither overflows nor changes the clamped answer.
  constexpr int64_t kLimit = int64_t{INT32_MAX} + 1;
  int64_t magnitude = 0;
  for (; i < text.size() && IsAsciiDigit(text[i]); ++i) {
    if (magnitude <= kLimit) magnitude = magnitude * 10 + (text[i] - u'0');
  }
  if (negative) return magnitude >= kLimit ? INT32_MIN : static_cast<int32_t>(-magnitude);
  return magnitude > INT32_MAX ? INT32_MAX : static_cast<int32_t>(magnitude);
}

}  // namespace asum
