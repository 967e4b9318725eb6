// Small byte-text helpers shared by the message reader: ASCII case folding,
// blank trimming, prefix and suffix tests. Pure and thread-safe.
#pragma once

#include <string>
#include <string_view>

namespace asum::mail {

char LowerAscii(char c);
std::string LowerAsciiCopy(std::string_view text);
bool EqualsNoCase(std::string_view a, std::string_view b);
bool StartsWithNoCase(std::string_view text, std::string_view prefix);
bool EndsWithNoCase(std::string_view text, std::string_view suffix);
// Position of `needle` in `text` ignoring ASCII case, or npos.
size_t FindNoCase(std::string_view text, std::string_view needle, size_t from = 0);
// Strips blanks, tabs, CR and LF from both ends.
std::string_view TrimBlanks(std::string_view text);

}  // namespace asum::mail
