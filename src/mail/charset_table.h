// Maps the charset names that messages declare to Windows code page numbers,
// the form in which the platform layer converts 8-bit text.
//
// Pure and thread-safe. An unknown, garbled or empty name gives no code page;
// the caller then falls back to its own rule and never to an empty text.
#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

namespace asum::mail {

inline constexpr uint32_t kCodePageUtf8 = 65001;
inline constexpr uint32_t kCodePageAscii = 20127;
// These three only name charsets that the reader decodes itself
// (iso2022jp.h, iso8859_tables.h) and never reach the platform: Windows has no
// code page for ISO 8859-10 and -14 and installs those for ISO-2022-JP unevenly.
inline constexpr uint32_t kCodePageIso2022Jp = 50220;
inline constexpr uint32_t kCodePageIso8859_10 = 28600;
inline constexpr uint32_t kCodePageIso8859_14 = 28604;

// Letter case, blanks, '-', '_' and surrounding quotes are ignored, so
// "ISO_8859-1", "iso8859-1" and "Latin1" all name code page 28591.
std::optional<uint32_t> CodePageForCharset(std::string_view name);

}  // namespace asum::mail
