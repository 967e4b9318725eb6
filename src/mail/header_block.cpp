#include "mail/header_block.h"

#include <optional>

#include "mail/charset_table.h"
#include "mail/encoded_words.h"
#include "mail/text_convert.h"
#include "mail/text_util.h"

namespace asum::mail {
namespace {

struct RawField {
  std::string_view name;
  std::string value;  // still in the block's code page
};

std::vector<RawField> Unfold(std::string_view block) {
  std::vector<RawField> fields;
  bool open = false;  // a continuation line may extend the last field
  size_t line = 0;
  while (line < block.size()) {
    size_t lf = block.find('\n', line);
    if (lf == std::string_view::npos) lf = block.size();
    const std::string_view text = block.substr(line, lf - line);
    line = lf + 1;
    if (text.empty() || text == "\r") {
      open = false;
      continue;
    }
    if (text[0] == ' ' || text[0] == '\t') {
      if (!open) continue;
      std::string& value = fields.back().value;
      for (char c : text) {
        if (c != '\r' && c != '\n') value.push_back(c);
      }
      continue;
    }
    const size_t colon = text.find(':');
    if (colon == std::string_view::npos) {
      open = false;
      continue;
    }
    RawField field;
    field.name = TrimBlanks(text.substr(0, colon));
    size_t begin = colon + 1;
    if (begin < text.size() && (text[begin] == ' ' || text[begin] == '\t')) ++begin;
    for (char c : text.substr(begin)) {
      if (c != '\r' && c != '\n') field.value.push_back(c);
    }
    fields.push_back(std::move(field));
    open = true;
  }
  return fields;
}

std::optional<uint32_t> BlockCodePage(std::string_view block) {
  // Only the first few encoded words are tried; a block full of words with
  // unknown charsets must not be scanned again and again.
  size_t pos = 0;
  for (int tries = 0; tries < 8 && pos < block.size(); ++tries) {
    std::optional<std::string_view> charset = FirstEncodedWordCharset(block.substr(pos));
    if (!charset) break;
    if (std::optional<uint32_t> code_page = CodePageForCharset(*charset)) return code_page;
    pos = static_cast<size_t>(charset->data() - block.data()) + charset->size();
  }
  if (IsPlainAscii(block)) return kCodePageAscii;
  return GuessCodePage(block);
}

}  // namespace

std::vector<HeaderField> ParseHeaderBlock(std::string_view block) {
  std::vector<HeaderField> fields;
  if (block.size() > kMaxHeaderBlockBytes) return fields;
  std::vector<RawField> raw = Unfold(block);
  const std::optional<uint32_t> code_page = BlockCodePage(block);
  fields.reserve(raw.size());
  for (RawField& r : raw) {
    HeaderField field;
    field.name = std::string(r.name);
    std::string_view value = r.value;
    if (!EqualsNoCase(field.name, "Subject")) value = TrimBlanks(value);
    field.raw_value = ToUtf8(value, code_page);
    // Matched without regard to case: writers use "?q?" as well as "?Q?".
    if (field.raw_value.find("=?") != std::string::npos &&
        (FindNoCase(field.raw_value, "?q?") != std::string::npos ||
         FindNoCase(field.raw_value, "?b?") != std::string::npos)) {
      field.value = DecodeEncodedWords(field.raw_value);
    } else {
      field.value = field.raw_value;
    }
    fields.push_back(std::move(field));
  }
  return fields;
}

const HeaderField* FindField(const std::vector<HeaderField>& fields, std::string_view name) {
  for (const HeaderField& field : fields) {
    if (EqualsNoCase(field.name, name)) return &field;
  }
  return nullptr;
}

}  // namespace asum::mail
