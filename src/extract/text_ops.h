// The text operations every cut of an alert's subject, body and file name is
// made with. Their clamping rules decide what a missing marker does, so callers
// may pass the -1 of a failed search straight into Left, Right or Mid:
//   Find / ReverseFind  -> position, or -1 when absent (exact, case-sensitive)
//   Left(n), Right(n)   -> n <= 0 gives "", n >= length gives the whole text
//   Mid(i)              -> i <= 0 gives the whole text, i >= length gives ""
// Positions and lengths count UTF-16 code units. A character of code 0 is an
// ordinary character here: texts are counted, never cut at a NUL.
//
// White space (trims and WcstolBase10) is one fixed table, the same in every
// build and locale: U+0009..U+000D, U+0020, U+0085, U+00A0, U+1680,
// U+2000..U+200A, U+2028, U+2029, U+202F, U+205F, U+3000.
//
// All functions are pure, thread-safe and never throw anything but
// std::bad_alloc from building their result.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "common/wide_number.h"

namespace asum {

// Position of the first occurrence of `marker` in `text`, or -1. An empty
// marker is found at 0 (so "contains an empty name" is always true).
std::ptrdiff_t Find(std::u16string_view text, std::u16string_view marker);
// Position of the last occurrence of `c`, or -1.
std::ptrdiff_t ReverseFind(std::u16string_view text, char16_t c);

std::u16string Left(std::u16string_view text, std::ptrdiff_t n);
std::u16string Right(std::u16string_view text, std::ptrdiff_t n);
std::u16string Mid(std::u16string_view text, std::ptrdiff_t i);

// The same cuts without a copy, for scanners that walk a text by position.
// The result points into `text`'s storage and lives no longer than it.
std::u16string_view LeftView(std::u16string_view text, std::ptrdiff_t n);
std::u16string_view RightView(std::u16string_view text, std::ptrdiff_t n);
std::u16string_view MidView(std::u16string_view text, std::ptrdiff_t i);

// Every non-overlapping occurrence of `old_text`, scanning from the left, is
// replaced by `new_text`; replaced text is not scanned again. An empty
// `old_text` leaves the text unchanged.
std::u16string Replace(std::u16string_view text, std::u16string_view old_text,
                       std::u16string_view new_text);

std::u16string TrimLeft(std::u16string_view text);
std::u16string TrimRight(std::u16string_view text);

}  // namespace asum
