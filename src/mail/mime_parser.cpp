#include "mail/mime_parser.h"

#include <cstring>
#include <optional>

#include "mail/charset_table.h"
#include "mail/message_split.h"
#include "mail/mime_params.h"
#include "mail/text_convert.h"
#include "mail/text_util.h"
#include "mail/transfer_decoding.h"

namespace asum::mail {
namespace {

struct Pending {
  MimePart* part;
  std::string_view content;
  std::optional<std::string> boundary;
  std::optional<std::string> charset;
  int depth;
};

Pending Describe(const std::vector<HeaderField>& fields, std::string_view content, MimePart* part, int depth) {
  Pending pending{part, content, std::nullopt, std::nullopt, depth};
  if (const HeaderField* type = FindField(fields, "Content-Type")) {
    part->content_type = std::string(MainValue(type->raw_value));
    pending.boundary = Parameter(type->raw_value, "boundary");
    pending.charset = Parameter(type->raw_value, "charset");
    if (std::optional<std::string> name = Parameter(type->value, "name")) part->file_name = *name;
  }
  if (const HeaderField* disposition = FindField(fields, "Content-Disposition")) {
    part->disposition = std::string(MainValue(disposition->raw_value));
    if (std::optional<std::string> name = Parameter(disposition->value, "filename")) part->file_name = *name;
  }
  if (const HeaderField* encoding = FindField(fields, "Content-Transfer-Encoding")) {
    part->transfer_encoding = encoding->raw_value;
  }
  return pending;
}

// Where the delimiter line that starts at `line` ends (past its line end),
// or npos when the line is no delimiter of this boundary. `*closing` tells a
// closing delimiter ("--boundary--").
size_t DelimiterEnd(std::string_view body, size_t line, std::string_view boundary, bool* closing) {
  if (body.size() - line < boundary.size() + 2 || body[line] != '-' || body[line + 1] != '-' ||
      body.compare(line + 2, boundary.size(), boundary) != 0) {
    return std::string_view::npos;
  }
  size_t i = line + 2 + boundary.size();
  *closing = body.compare(i, 2, "--") == 0;
  if (*closing) i += 2;
  // Only transport padding may follow, so an outer boundary that is a prefix
  // of an inner one never matches the inner delimiters.
  while (i < body.size() && (body[i] == ' ' || body[i] == '\t')) ++i;
  if (i < body.size() && body[i] == '\r') ++i;
  if (i == body.size()) return i;
  if (body[i] == '\n') return i + 1;
  if (*closing) {
    // Text after a closing delimiter is epilogue anyway.
    const size_t lf = body.find('\n', i);
    return lf == std::string_view::npos ? body.size() : lf + 1;
  }
  return std::string_view::npos;
}

// The part content ends before the line end that precedes the delimiter.
size_t ContentEnd(std::string_view body, size_t delimiter_line, size_t content_begin) {
  size_t end = delimiter_line;
  if (end > content_begin && body[end - 1] == '\n') --end;
  if (end > content_begin && body[end - 1] == '\r') --end;
  return end;
}

void FillLeaf(const Pending& pending) {
  MimePart& part = *pending.part;
  part.body = DecodeTransfer(pending.content, part.transfer_encoding);
  const std::string_view type = part.content_type;
  if (type.empty() || StartsWithNoCase(type, "text/")) {
    std::optional<uint32_t> code_page;
    if (pending.charset) code_page = CodePageForCharset(*pending.charset);
    if (!IsPlainAscii(part.body)) part.body = ToUtf8(part.body, code_page);
  }
}

}  // namespace

std::vector<std::string_view> SplitMultipart(std::string_view body, std::string_view boundary,
                                             size_t max_parts) {
  std::vector<std::string_view> parts;
  if (boundary.empty() || boundary.size() > kMaxBoundaryLength) return parts;
  size_t content_begin = std::string_view::npos;  // npos: still in the preamble
  size_t line = 0;
  while (line < body.size()) {
    bool closing = false;
    const size_t end = DelimiterEnd(body, line, boundary, &closing);
    if (end != std::string_view::npos) {
      if (content_begin != std::string_view::npos) {
        if (parts.size() >= max_parts) return parts;
        parts.push_back(body.substr(content_begin, ContentEnd(body, line, content_begin) - content_begin));
      }
      if (closing) return parts;
      content_begin = end;
      line = end;
      continue;
    }
    const void* lf = std::memchr(body.data() + line, '\n', body.size() - line);
    if (lf == nullptr) break;
    line = static_cast<size_t>(static_cast<const char*>(lf) - body.data()) + 1;
  }
  if (content_begin != std::string_view::npos && parts.size() < max_parts) {
    parts.push_back(body.substr(content_begin));
  }
  return parts;
}

void ParseMimeTree(const std::vector<HeaderField>& fields, std::string_view body, MimePart* root) {
  *root = MimePart();
  std::vector<Pending> work;
  work.push_back(Describe(fields, body, root, 0));
  size_t made = 1;
  while (!work.empty()) {
    Pending pending = std::move(work.back());
    work.pop_back();
    MimePart& part = *pending.part;
    const bool multipart = StartsWithNoCase(part.content_type, "multipart/");
    if (!multipart || !pending.boundary || pending.depth >= kMaxPartDepth || made >= kMaxParts) {
      if (multipart) {
        part.body = std::string(pending.content);  // opaque: never split further
      } else {
        FillLeaf(pending);
      }
      continue;
    }
    std::vector<std::string_view> contents = SplitMultipart(pending.content, *pending.boundary, kMaxParts - made);
    if (contents.empty()) {
      part.body = std::string(pending.content);
      continue;
    }
    made += contents.size();
    // Sized once, so the pointers on the work list stay valid.
    part.parts.resize(contents.size());
    for (size_t i = contents.size(); i-- > 0;) {
      const SplitMessage split = SplitPart(contents[i]);
      const std::vector<HeaderField> part_fields = ParseHeaderBlock(split.header);
      // A part without an empty line and without fields is all content.
      const std::string_view content = split.has_body || !part_fields.empty() ? split.body : contents[i];
      work.push_back(Describe(part_fields, content, &part.parts[i], pending.depth + 1));
    }
  }
}

}  // namespace asum::mail
