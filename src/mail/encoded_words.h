// Decodes the encoded words of header values ("=?charset?B?...?=" and
// "=?charset?Q?...?=").
//
// Pure apart from code page conversion through platform::Current(); thread-
// safe. Never fails: a malformed encoded word stays as written, and one whose
// charset is unknown is read by the header rule (UTF-8 when valid, else the
// ANSI code page). Runs in time linear in the value's length.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace asum::mail {

// The charset named by the first well-formed encoded word, if any.
std::optional<std::string_view> FirstEncodedWordCharset(std::string_view text);

// `text` (UTF-8) with every encoded word replaced by its UTF-8 text. Blanks
// between two adjacent encoded words are dropped; encoded words of the same
// charset next to each other are decoded as one run, so a character split
// across them survives.
std::string DecodeEncodedWords(std::string_view text);

}  // namespace asum::mail
