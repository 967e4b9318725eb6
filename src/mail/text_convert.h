// Turns 8-bit text of a message (header values, text parts) into UTF-8.
//
// Thread-safe; uses platform::Current() for code pages other than UTF-8 and
// the charsets the reader decodes itself (charset_table.h). Never fails: text
// that its declared code page cannot read as a whole (a charset that lies, or
// one this machine lacks) is read by the header rule instead (UTF-8 when the
// bytes are valid UTF-8, else the system's ANSI code page), so a lying or
// unknown charset never yields an empty text or replacement characters.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace asum::mail {

// True when no byte has its high bit set and no ESC (ISO-2022 shift) occurs:
// such text is the same in every code page we convert from.
bool IsPlainAscii(std::string_view bytes);

// The code page a header block without a declared charset is read in.
uint32_t GuessCodePage(std::string_view bytes);

// `bytes` in `code_page` (none: guessed) as UTF-8.
std::string ToUtf8(std::string_view bytes, std::optional<uint32_t> code_page);

}  // namespace asum::mail
