#include "mail/transfer_decoding.h"

#include <cstdint>

#include "mail/text_util.h"

namespace asum::mail {
namespace {

int Base64Value(unsigned char c) {
  if (c >= 'A' && c <= 'Z') return c - 'A';
  if (c >= 'a' && c <= 'z') return c - 'a' + 26;
  if (c >= '0' && c <= '9') return c - '0' + 52;
  if (c == '+') return 62;
  if (c == '/') return 63;
  return -1;
}

int HexValue(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  return -1;
}

// A cut group still yields its whole bytes (the padding case).
void FlushPartial(uint32_t bits, int count, char* out, size_t* n) {
  if (count == 2) {
    out[(*n)++] = static_cast<char>((bits >> 4) & 0xFF);
  } else if (count == 3) {
    out[(*n)++] = static_cast<char>((bits >> 10) & 0xFF);
    out[(*n)++] = static_cast<char>((bits >> 2) & 0xFF);
  }
}

}  // namespace

// Both decoders write into a buffer sized once for the most they can give
// and cut it to what they gave: alert bodies pass through here whole, and
// appending byte by byte cost more than the rest of reading a message.
std::string DecodeBase64(std::string_view text) {
  // Every four characters give three bytes; a cut group gives at most two
  // more, and so does every padding that ends a group early.
  std::string buffer(text.size() / 4 * 3 + 3, '\0');
  char* out = buffer.data();
  size_t n = 0;
  uint32_t bits = 0;
  int count = 0;
  for (char ch : text) {
    const int v = Base64Value(static_cast<unsigned char>(ch));
    // Padding ends a group; writers that join several encoded blocks put
    // more data after it, so decoding goes on with a fresh group.
    if (ch == '=') {
      FlushPartial(bits, count, out, &n);
      bits = 0;
      count = 0;
      continue;
    }
    if (v < 0) continue;
    bits = (bits << 6) | static_cast<uint32_t>(v);
    if (++count == 4) {
      out[n++] = static_cast<char>((bits >> 16) & 0xFF);
      out[n++] = static_cast<char>((bits >> 8) & 0xFF);
      out[n++] = static_cast<char>(bits & 0xFF);
      bits = 0;
      count = 0;
    }
  }
  FlushPartial(bits, count, out, &n);
  buffer.resize(n);
  return buffer;
}

std::string DecodeQuotedPrintable(std::string_view text) {
  // Never more bytes out than in.
  std::string buffer(text.size(), '\0');
  char* out = buffer.data();
  size_t n = 0;
  size_t i = 0;
  while (i < text.size()) {
    const char c = text[i];
    if (c != '=') {
      out[n++] = c;
      ++i;
      continue;
    }
    // Soft line break: '=', optional trailing blanks, then CR LF or LF.
    size_t j = i + 1;
    while (j < text.size() && (text[j] == ' ' || text[j] == '\t')) ++j;
    if (j < text.size() && text[j] == '\r' && j + 1 < text.size() && text[j + 1] == '\n') {
      i = j + 2;
      continue;
    }
    if (j < text.size() && text[j] == '\n') {
      i = j + 1;
      continue;
    }
    if (j == text.size()) break;  // a soft break at the very end
    if (i + 2 < text.size() && HexValue(text[i + 1]) >= 0 && HexValue(text[i + 2]) >= 0) {
      out[n++] = static_cast<char>(HexValue(text[i + 1]) * 16 + HexValue(text[i + 2]));
      i += 3;
      continue;
    }
    out[n++] = c;
    ++i;
  }
  buffer.resize(n);
  return buffer;
}

std::string DecodeTransfer(std::string_view text, std::string_view encoding) {
  const std::string_view trimmed = TrimBlanks(encoding);
  if (EqualsNoCase(trimmed, "base64")) return DecodeBase64(text);
  if (EqualsNoCase(trimmed, "quoted-printable")) return DecodeQuotedPrintable(text);
  return std::string(text);
}

}  // namespace asum::mail
