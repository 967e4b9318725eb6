#include "mail/ck_string.h"

#include <cstdint>

#include "common/utf.h"
#include "platform/platform.h"

namespace asum::mail {
namespace {

// Windows-1252's characters at 0x80..0x9F (0 where the code page has none).
constexpr char16_t kCp1252High[32] = {
    0x20AC, 0,      0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021, 0x02C6, 0x2030, 0x0160,
    0x2039, 0x0152, 0,      0x017D, 0,      0,      0x2018, 0x2019, 0x201C, 0x201D, 0x2022,
    0x2013, 0x2014, 0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, 0,      0x017E, 0x0178};

char EncodeCp1252(char16_t c) {
  if (c < 0x80 || (c >= 0xA0 && c <= 0xFF)) return static_cast<char>(c);
  for (int i = 0; i < 32; ++i) {
    if (kCp1252High[i] == c && c != 0) return static_cast<char>(0x80 + i);
  }
  return '?';
}

}  // namespace

void CkString::setStringU(const char16_t* text) {
  try {
    text_ = text == nullptr ? std::u16string() : std::u16string(text);
  } catch (...) {
  }
}

void CkString::SetText(std::u16string text) { text_ = std::move(text); }

const char* CkString::getString() const {
  try {
    if (utf8_) {
      narrow_ = Utf16ToUtf8(text_);
    } else {
      // The platform layer converts only towards UTF-16; Windows-1252 (the
      // POSIX ANSI code page and the common Windows one) is encoded here,
      // other ANSI code pages keep ASCII and show the rest as '?'.
      const uint32_t ansi = platform::Current().AnsiCodePage();
      narrow_.clear();
      narrow_.reserve(text_.size());
      for (size_t i = 0; i < text_.size(); ++i) {
        const char16_t c = text_[i];
        if (c >= 0xD800 && c <= 0xDBFF && i + 1 < text_.size()) ++i;  // one '?' per pair
        if (ansi == 1252) {
          narrow_.push_back(c >= 0xD800 && c <= 0xDFFF ? '?' : EncodeCp1252(c));
        } else {
          narrow_.push_back(c < 0x80 ? static_cast<char>(c) : '?');
        }
      }
    }
  } catch (...) {
    narrow_.clear();
  }
  return narrow_.c_str();
}

}  // namespace asum::mail
