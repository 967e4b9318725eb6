// Builds the MIME part tree of a message body: multipart bodies split at
// their boundaries, transfer encodings undone, text parts in UTF-8.
//
// Thread-safe; code pages through platform::Current(). Never fails and never
// recurses: parts are processed from an explicit work list. Multiparts deeper
// than kMaxPartDepth keep their content as an opaque body, and no more than
// kMaxParts parts are made (later parts are dropped), so hostile nesting or
// part counts cost bounded time and memory.
#pragma once

#include <string_view>
#include <vector>

#include "mail/email2.h"
#include "mail/header_block.h"

namespace asum::mail {

inline constexpr int kMaxPartDepth = 32;
inline constexpr size_t kMaxParts = 10000;
// Longer boundaries are not valid (RFC 2046 allows 70) and are not split at.
inline constexpr size_t kMaxBoundaryLength = 200;

// Fills `root` from the message's header fields and body.
void ParseMimeTree(const std::vector<HeaderField>& fields, std::string_view body, MimePart* root);

// The contents of the parts of a multipart body (between delimiter lines,
// without the line end before each delimiter). Empty when no delimiter line
// occurs. A body whose closing delimiter is missing ends its last part at the
// end of the text.
std::vector<std::string_view> SplitMultipart(std::string_view body, std::string_view boundary,
                                             size_t max_parts);

}  // namespace asum::mail
