#include "mail/text_convert.h"

#include <cstring>

#include "common/utf.h"
#include "mail/charset_table.h"
#include "platform/platform.h"

namespace asum::mail {
namespace {

constexpr char kEscape = '\x1b';
// Big texts are converted in slices, so the UTF-16 intermediate never holds
// more than one slice; slices end after a line feed, which no multibyte code
// page uses as a trailing byte and after which ISO-2022 text is back in ASCII.
constexpr size_t kSliceBytes = 1 << 20;

std::optional<std::string> ConvertCodePage(std::string_view bytes, uint32_t code_page) {
  platform::Env& env = platform::Current();
  std::string out;
  out.reserve(bytes.size() + bytes.size() / 8);
  size_t pos = 0;
  while (pos < bytes.size()) {
    size_t end = bytes.size();
    if (end - pos > kSliceBytes) {
      const size_t lf = bytes.find('\n', pos + kSliceBytes);
      end = lf == std::string_view::npos ? bytes.size() : lf + 1;
    }
    std::optional<std::u16string> wide = env.DecodeCodePage(code_page, bytes.substr(pos, end - pos));
    if (!wide) return std::nullopt;
    out += Utf16ToUtf8(*wide);
    pos = end;
  }
  return out;
}

std::string Utf8Repaired(std::string_view bytes) {
  if (IsValidUtf8(bytes)) return std::string(bytes);
  return Utf16ToUtf8(Utf8ToUtf16(bytes));
}

}  // namespace

bool IsPlainAscii(std::string_view bytes) {
  for (char c : bytes) {
    if ((static_cast<unsigned char>(c) & 0x80) != 0 || c == kEscape) return false;
  }
  return true;
}

uint32_t GuessCodePage(std::string_view bytes) {
  bool high = false;
  bool escape = false;
  for (char c : bytes) {
    if ((static_cast<unsigned char>(c) & 0x80) != 0) high = true;
    if (c == kEscape) escape = true;
  }
  if (high) return IsValidUtf8(bytes) ? kCodePageUtf8 : platform::Current().AnsiCodePage();
  return escape ? kCodePageIso2022Jp : kCodePageAscii;
}

std::string ToUtf8(std::string_view bytes, std::optional<uint32_t> code_page) {
  if (IsPlainAscii(bytes)) return std::string(bytes);
  // US-ASCII cannot describe 8-bit bytes and UTF-8 that is not valid UTF-8
  // lies about itself: both get the guess.
  if (code_page == kCodePageAscii || (code_page == kCodePageUtf8 && !IsValidUtf8(bytes))) {
    code_page.reset();
  }
  const uint32_t chosen = code_page ? *code_page : GuessCodePage(bytes);
  if (chosen == kCodePageUtf8) return Utf8Repaired(bytes);
  if (chosen != kCodePageAscii) {
    if (std::optional<std::string> converted = ConvertCodePage(bytes, chosen)) return *converted;
  }
  // The machine cannot convert this code page (or 8-bit text was guessed as
  // ASCII, which cannot happen): the ANSI code page, then UTF-8 repair.
  const uint32_t ansi = platform::Current().AnsiCodePage();
  if (ansi != chosen) {
    if (std::optional<std::string> converted = ConvertCodePage(bytes, ansi)) return *converted;
  }
  return Utf8Repaired(bytes);
}

}  // namespace asum::mail
