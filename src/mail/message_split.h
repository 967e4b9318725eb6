// Splits a message file's text into its header block and body, repairing the
// line ends that real mail programs write (LF only, bare CR, doubled CR).
//
// Pure and thread-safe; linear in the text's size. When a repair is needed
// the text is rewritten once into `storage`, and the views returned point
// into it (otherwise into the text given).
#pragma once

#include <string>
#include <string_view>

namespace asum::mail {

struct SplitMessage {
  std::string_view header;
  std::string_view body;
  bool has_body = false;
};

// The text without a leading UTF-8 byte order mark (only dropped from texts
// longer than the mark itself).
std::string_view WithoutBom(std::string_view text);

// `text` must stay alive as long as the views are used; so must `storage`.
SplitMessage SplitHeaderAndBody(std::string_view text, std::string* storage);

// Where a MIME part's header ends: the first empty line (CR LF or LF ends
// a line). Same result shape; no repair is made inside parts.
SplitMessage SplitPart(std::string_view text);

}  // namespace asum::mail
