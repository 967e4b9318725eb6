#include "mail/encoded_words.h"

#include "mail/charset_table.h"
#include "mail/text_convert.h"
#include "mail/text_util.h"
#include "mail/transfer_decoding.h"

namespace asum::mail {
namespace {

struct EncodedWord {
  size_t end = 0;  // one past "?="
  std::string_view charset;
  char encoding = 0;  // 'b' or 'q'
  std::string_view payload;
};

// Reads an encoded word starting at `pos` ("=?"). Each step looks only as far
// as the next '?', so a value full of "=?" is still scanned in linear time.
std::optional<EncodedWord> ReadEncodedWord(std::string_view text, size_t pos) {
  if (text.compare(pos, 2, "=?") != 0) return std::nullopt;
  const size_t charset_end = text.find('?', pos + 2);
  if (charset_end == std::string_view::npos || charset_end == pos + 2) return std::nullopt;
  if (charset_end + 2 >= text.size() || text[charset_end + 2] != '?') return std::nullopt;
  const char encoding = LowerAscii(text[charset_end + 1]);
  if (encoding != 'b' && encoding != 'q') return std::nullopt;
  const size_t payload_begin = charset_end + 3;
  const size_t payload_end = text.find('?', payload_begin);
  if (payload_end == std::string_view::npos || payload_end + 1 >= text.size() ||
      text[payload_end + 1] != '=') {
    return std::nullopt;
  }
  EncodedWord word;
  word.charset = text.substr(pos + 2, charset_end - pos - 2);
  // RFC 2231 language suffix: "utf-8*en".
  if (const size_t star = word.charset.find('*'); star != std::string_view::npos) {
    word.charset = word.charset.substr(0, star);
  }
  for (char c : word.charset) {
    if (c == ' ' || c == '\t') return std::nullopt;
  }
  word.encoding = encoding;
  word.payload = text.substr(payload_begin, payload_end - payload_begin);
  word.end = payload_end + 2;
  return word;
}

std::string DecodeQ(std::string_view payload) {
  std::string spaced(payload);
  for (char& c : spaced) {
    if (c == '_') c = ' ';
  }
  return DecodeQuotedPrintable(spaced);
}

bool IsFoldingBlank(char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; }

}  // namespace

std::optional<std::string_view> FirstEncodedWordCharset(std::string_view text) {
  for (size_t pos = text.find("=?"); pos != std::string_view::npos; pos = text.find("=?", pos + 2)) {
    if (std::optional<EncodedWord> word = ReadEncodedWord(text, pos)) return word->charset;
  }
  return std::nullopt;
}

std::string DecodeEncodedWords(std::string_view text) {
  std::string out;
  out.reserve(text.size());
  std::string run;  // undecoded bytes of adjacent words of one charset
  std::string_view run_charset;
  bool after_word = false;
  auto flush = [&] {
    if (run.empty()) return;
    out += ToUtf8(run, CodePageForCharset(run_charset));
    run.clear();
  };
  size_t pos = 0;
  while (pos < text.size()) {
    const size_t start = text.find("=?", pos);
    // Blanks between this word and the previous one vanish.
    const size_t gap_end = start == std::string_view::npos ? text.size() : start;
    std::optional<EncodedWord> word;
    if (start != std::string_view::npos) word = ReadEncodedWord(text, start);
    if (!word) {
      const size_t literal_end = start == std::string_view::npos ? text.size() : start + 2;
      flush();
      out.append(text.substr(pos, literal_end - pos));
      after_word = false;
      pos = literal_end;
      continue;
    }
    bool only_blanks = true;
    for (size_t i = pos; i < gap_end; ++i) {
      if (!IsFoldingBlank(text[i])) {
        only_blanks = false;
        break;
      }
    }
    if (!(after_word && only_blanks)) {
      flush();
      out.append(text.substr(pos, gap_end - pos));
    }
    if (!run.empty() && !EqualsNoCase(run_charset, word->charset)) flush();
    run_charset = word->charset;
    run += word->encoding == 'b' ? DecodeBase64(word->payload) : DecodeQ(word->payload);
    after_word = true;
    pos = word->end;
  }
  flush();
  return out;
}

}  // namespace asum::mail
