// Reads ISO-2022-JP (RFC 1468), the 7-bit form of Japanese mail, by turning it
// into Shift_JIS, which every platform converts (code page 932): the code pages
// Windows has for ISO-2022-JP itself are not installed on every machine.
//
// Pure and thread-safe. Returns nothing when the bytes are no ISO-2022-JP text
// (an 8-bit byte, an unknown escape sequence, a cut two-byte character), so the
// caller can read them another way.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace asum::mail {

// The escape sequences select ASCII (ESC ( B), JIS X 0201 Roman (ESC ( J),
// JIS X 0201 Katakana (ESC ( I) or JIS X 0208 (ESC $ @, ESC $ B, also after
// the revision announcer ESC & @). Roman text comes out as the single bytes it
// is in Shift_JIS too, so code page 932 reads its 0x5C and 0x7E as it reads
// them in Shift_JIS text. A line end returns to ASCII, as every line of
// ISO-2022-JP text must end in ASCII anyway.
std::optional<std::string> Iso2022JpToShiftJis(std::string_view bytes);

}  // namespace asum::mail
