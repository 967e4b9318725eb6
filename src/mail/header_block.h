// Reads a header block (of the message or of a MIME part) into its fields.
//
// Thread-safe; code pages are converted through platform::Current(). Never
// fails: lines without a colon are skipped, and the whole block is read in
// time linear in its size however many folded lines or fields it has.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace asum::mail {

struct HeaderField {
  std::string name;
  std::string value;      // unfolded, UTF-8, encoded words decoded
  std::string raw_value;  // unfolded, UTF-8, encoded words as written
};

// Blocks larger than this are not read at all (no fields).
inline constexpr size_t kMaxHeaderBlockBytes = 20000000;

// The value begins after the colon and one blank or tab; every value except
// the Subject's is then trimmed of blanks, tabs, CR and LF. One code page
// serves the whole block: the charset of its first encoded word that names a
// known one, else the guess of text_convert.h.
std::vector<HeaderField> ParseHeaderBlock(std::string_view block);

// The first field of that name (ASCII case ignored), or null.
const HeaderField* FindField(const std::vector<HeaderField>& fields, std::string_view name);

}  // namespace asum::mail
