#include "mail/rfc822_address.h"

#include "mail/encoded_words.h"
#include "mail/text_util.h"

namespace asum::mail {
namespace {

// Splits the text into what lies outside comments (kept) and the first
// comment's content. Quoted text is kept unquoted for a display name, and as
// written (quotes and escapes included) for an address, whose quoted local
// part ("john doe"@example.com) is part of the address itself.
struct Scanned {
  std::string plain;
  std::string first_comment;
  bool has_comment = false;
};

Scanned Scan(std::string_view text, bool keep_quotes) {
  Scanned out;
  int depth = 0;
  bool quoted = false;
  std::string comment;
  for (size_t i = 0; i < text.size(); ++i) {
    const char c = text[i];
    if (quoted) {
      if (c == '\\' && i + 1 < text.size()) {
        if (keep_quotes) out.plain.push_back(c);
        out.plain.push_back(text[++i]);
      } else {
        quoted = c != '"';
        if (quoted || keep_quotes) out.plain.push_back(c);
      }
      continue;
    }
    if (depth > 0) {
      if (c == '\\' && i + 1 < text.size()) {
        comment.push_back(text[++i]);
      } else if (c == '(') {
        ++depth;
        comment.push_back(c);
      } else if (c == ')') {
        if (--depth == 0 && !out.has_comment) {
          out.first_comment = comment;
          out.has_comment = true;
        }
        if (depth > 0) comment.push_back(c);
      } else {
        comment.push_back(c);
      }
      continue;
    }
    if (c == '"') {
      quoted = true;
      if (keep_quotes) out.plain.push_back(c);
    } else if (c == '(') {
      depth = 1;
      comment.clear();
    } else {
      out.plain.push_back(c);
    }
  }
  return out;
}

}  // namespace

std::optional<Rfc822Address> ParseMailbox(std::string_view value) {
  // Find where the first mailbox ends and where its '<' is, outside quotes
  // and comments; a group name before ':' is skipped.
  size_t begin = 0;
  size_t angle = std::string_view::npos;
  size_t end = value.size();
  bool quoted = false;
  int depth = 0;
  for (size_t i = 0; i < value.size(); ++i) {
    const char c = value[i];
    if (quoted) {
      if (c == '\\') {
        ++i;
      } else if (c == '"') {
        quoted = false;
      }
      continue;
    }
    if (depth > 0) {
      if (c == '\\') {
        ++i;
      } else if (c == '(') {
        ++depth;
      } else if (c == ')') {
        --depth;
      }
      continue;
    }
    if (c == '"') {
      quoted = true;
    } else if (c == '(') {
      depth = 1;
    } else if (c == '<' && angle == std::string_view::npos) {
      angle = i;
    } else if (c == ':' && angle == std::string_view::npos) {
      begin = i + 1;
    } else if ((c == ',' || c == ';') && angle == std::string_view::npos) {
      if (!TrimBlanks(value.substr(begin, i - begin)).empty()) {
        end = i;
        break;
      }
      begin = i + 1;
    } else if (c == '>' && angle != std::string_view::npos) {
      end = i + 1;
      break;
    }
  }
  Rfc822Address mailbox;
  if (angle != std::string_view::npos && angle >= begin) {
    const size_t close = value.find('>', angle);
    const size_t stop = close == std::string_view::npos || close > end ? end : close;
    mailbox.address = std::string(TrimBlanks(value.substr(angle + 1, stop - angle - 1)));
    const Scanned name = Scan(value.substr(begin, angle - begin), false);
    mailbox.name = std::string(TrimBlanks(name.plain));
    if (mailbox.name.empty() && name.has_comment) mailbox.name = std::string(TrimBlanks(name.first_comment));
  } else {
    const Scanned bare = Scan(value.substr(begin, end - begin), true);
    mailbox.address = std::string(TrimBlanks(bare.plain));
    if (bare.has_comment) mailbox.name = std::string(TrimBlanks(bare.first_comment));
  }
  if (mailbox.address.empty()) return std::nullopt;
  if (mailbox.name.find("=?") != std::string::npos) mailbox.name = DecodeEncodedWords(mailbox.name);
  return mailbox;
}

}  // namespace asum::mail
