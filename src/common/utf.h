// Conversions between the text forms the library meets: UTF-16 (every text of
// the core), UTF-8 (file names on POSIX, decoded message parts), UTF-32 (wchar_t
// on Linux) and the one-byte-per-character form of the diagnostic log.
//
// All functions are pure and thread-safe. None fails: ill-formed input is
// replaced by U+FFFD (or '?' for the one-byte form) so a hostile byte never
// stops the caller.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace asum {

// UTF-8 to UTF-16. Ill-formed sequences (overlong forms, surrogates, bytes
// beyond U+10FFFF, truncated sequences) each become one U+FFFD.
std::u16string Utf8ToUtf16(std::string_view utf8);

// UTF-16 to UTF-8. An unpaired surrogate becomes U+FFFD.
std::string Utf16ToUtf8(std::u16string_view utf16);

// POSIX file names are bytes and need not be UTF-8. A name read from the
// system keeps each byte that is not part of a well-formed sequence as the
// lone surrogate U+DC00 + byte (U+DC80..U+DCFF), and NativeNameToBytes turns
// such a surrogate back into its byte, so a name goes to the system exactly as
// it came: the file can be opened and renamed. Well-formed names convert as
// Utf8ToUtf16 and Utf16ToUtf8 do.
std::u16string BytesToNativeName(std::string_view bytes);
std::string NativeNameToBytes(std::u16string_view name);

// The one form in which a text that may hold a name is shown or stored (the
// row's "Alert Path", the diagnostic log, the tool): every unpaired surrogate,
// so every undecodable byte of a POSIX name, becomes U+FFFD. For a name read
// from the system this is Utf8ToUtf16 of its bytes.
std::u16string DisplayText(std::u16string_view text);

// True when the bytes are well-formed UTF-8.
bool IsValidUtf8(std::string_view bytes);

// UTF-32 (as wchar_t holds it on Linux) to UTF-16; code points beyond U+10FFFF
// and lone surrogates become U+FFFD.
std::u16string Utf32ToUtf16(std::u32string_view utf32);

// One byte per character: U+0000..U+00FF as the byte of that value, anything
// else as '?'. A surrogate pair counts as one character and gives one '?'.
std::string Utf16ToLatin1Lossy(std::u16string_view utf16);

// ASCII text to UTF-16, byte for byte (for literals and numbers).
std::u16string AsciiToUtf16(std::string_view ascii);

// A number in decimal, as "%d" writes it.
std::u16string DecimalText(int64_t value);

}  // namespace asum
