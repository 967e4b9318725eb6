#include "mail/message_split.h"

#include <initializer_list>

namespace asum::mail {
namespace {

constexpr std::string_view kBom = "\xEF\xBB\xBF";

// Every LF that no CR precedes becomes CR LF.
std::string LfToCrLf(std::string_view text) {
  std::string out;
  out.reserve(text.size() + text.size() / 16);
  for (size_t i = 0; i < text.size(); ++i) {
    if (text[i] == '\n' && (i == 0 || text[i - 1] != '\r')) out.push_back('\r');
    out.push_back(text[i]);
  }
  return out;
}

// CR CR CR LF and CR CR LF become CR LF.
std::string CollapseDoubledCr(std::string_view text) {
  std::string out;
  out.reserve(text.size());
  size_t i = 0;
  while (i < text.size()) {
    if (text.compare(i, 4, "\r\r\r\n") == 0) {
      out += "\r\n";
      i += 4;
    } else if (text.compare(i, 3, "\r\r\n") == 0) {
      out += "\r\n";
      i += 3;
    } else {
      out.push_back(text[i++]);
    }
  }
  return out;
}

// A CR that no LF follows ends a line, so CR CR is an empty line.
std::string BareCrToCrLf(std::string_view text) {
  std::string out;
  out.reserve(text.size() + text.size() / 16);
  for (size_t i = 0; i < text.size(); ++i) {
    out.push_back(text[i]);
    if (text[i] == '\r' && (i + 1 == text.size() || text[i + 1] != '\n')) out.push_back('\n');
  }
  return out;
}

// A text that begins with an empty line has no header fields; otherwise the
// header block ends at the earliest of `ends`. The earliest, not the first
// kind found: in a text with mixed line ends a later CR LF CR LF must not
// swallow the body lines before it. At one position the earlier listed (the
// longer) sequence wins, so CR LF CR never cuts a CR LF CR LF short.
bool SplitAt(std::string_view text, std::initializer_list<std::string_view> ends, SplitMessage* out) {
  if (text.substr(0, 2) == "\r\n") {
    out->header = {};
    out->body = text.substr(2);
    out->has_body = true;
    return true;
  }
  size_t best = std::string_view::npos;
  std::string_view best_end;
  for (std::string_view end : ends) {
    const size_t pos = text.find(end);
    if (pos < best) {
      best = pos;
      best_end = end;
    }
  }
  if (best == std::string_view::npos) return false;
  // The header block keeps the line end of its last line.
  out->header = text.substr(0, best + 2);
  out->body = text.substr(best + best_end.size());
  out->has_body = true;
  return true;
}

}  // namespace

std::string_view WithoutBom(std::string_view text) {
  if (text.size() > kBom.size() && text.substr(0, kBom.size()) == kBom) return text.substr(kBom.size());
  return text;
}

SplitMessage SplitHeaderAndBody(std::string_view text, std::string* storage) {
  SplitMessage split;
  // Each repair below may bring an empty first line to light (LF alone,
  // CR CR LF, a bare CR), so SplitAt tests for it after every one of them.
  if (SplitAt(text, {}, &split)) return split;
  const bool crlf_end = text.find("\r\n\r\n") != std::string_view::npos;
  // A leading LF is an empty first line written with LF line ends.
  const bool lf_end = text.find("\n\n") != std::string_view::npos || text.substr(0, 1) == "\n";
  if (lf_end) {
    *storage = LfToCrLf(text);
    if (SplitAt(*storage, {"\r\n\r\n", "\r\n\r\r\n", "\r\n\r", "\n\r\n"}, &split)) return split;
    split.header = *storage;
    return split;
  }
  if (crlf_end && SplitAt(text, {"\r\n\r\n"}, &split)) return split;
  *storage = CollapseDoubledCr(text);
  if (SplitAt(*storage, {"\r\n\r\n"}, &split)) return split;
  *storage = BareCrToCrLf(*storage);
  if (SplitAt(*storage, {"\r\n\r\n"}, &split)) return split;
  split.header = *storage;
  return split;
}

SplitMessage SplitPart(std::string_view text) {
  SplitMessage split;
  size_t line = 0;
  while (line < text.size()) {
    const size_t lf = text.find('\n', line);
    const size_t end = lf == std::string_view::npos ? text.size() : lf;
    const bool empty = end == line || (end == line + 1 && text[line] == '\r');
    if (empty && lf != std::string_view::npos) {
      split.header = text.substr(0, line);
      split.body = text.substr(lf + 1);
      split.has_body = true;
      return split;
    }
    if (lf == std::string_view::npos) break;
    line = lf + 1;
  }
  split.header = text;
  return split;
}

}  // namespace asum::mail
