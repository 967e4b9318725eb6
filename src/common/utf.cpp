#include "common/utf.h"

namespace asum {
namespace {

constexpr char32_t kReplacement = 0xFFFD;

void AppendUtf16(std::u16string& out, char32_t cp) {
  if (cp < 0x10000) {
    out.push_back(static_cast<char16_t>(cp));
  } else {
    cp -= 0x10000;
    out.push_back(static_cast<char16_t>(0xD800 + (cp >> 10)));
    out.push_back(static_cast<char16_t>(0xDC00 + (cp & 0x3FF)));
  }
}

void AppendUtf8(std::string& out, char32_t cp) {
  if (cp < 0x80) {
    out.push_back(static_cast<char>(cp));
  } else if (cp < 0x800) {
    out.push_back(static_cast<char>(0xC0 | (cp >> 6)));
    out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
  } else if (cp < 0x10000) {
    out.push_back(static_cast<char>(0xE0 | (cp >> 12)));
    out.push_back(static_cast<char>(0x80 | ((cp >> 6) & 0x3F)));
    out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
  } else {
    out.push_back(static_cast<char>(0xF0 | (cp >> 18)));
    out.push_back(static_cast<char>(0x80 | ((cp >> 12) & 0x3F)));
    out.push_back(static_cast<char>(0x80 | ((cp >> 6) & 0x3F)));
    out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
  }
}

// Decodes one UTF-8 sequence at `i`; advances `i` past it (or past the first
// byte of an ill-formed one) and returns the code point or kReplacement.
char32_t DecodeUtf8At(std::string_view s, size_t& i, bool* ok) {
  const auto b0 = static_cast<unsigned char>(s[i]);
  *ok = true;
  if (b0 < 0x80) {
    ++i;
    return b0;
  }
  int len = 0;
  char32_t cp = 0;
  char32_t min = 0;
  if (b0 >= 0xC2 && b0 <= 0xDF) {
    len = 2, cp = b0 & 0x1F, min = 0x80;
  } else if (b0 >= 0xE0 && b0 <= 0xEF) {
    len = 3, cp = b0 & 0x0F, min = 0x800;
  } else if (b0 >= 0xF0 && b0 <= 0xF4) {
    len = 4, cp = b0 & 0x07, min = 0x10000;
  } else {
    ++i;
    *ok = false;
    return kReplacement;
  }
  if (i + len > s.size()) {
    ++i;
    *ok = false;
    return kReplacement;
  }
  for (int k = 1; k < len; ++k) {
    const auto b = static_cast<unsigned char>(s[i + k]);
    if ((b & 0xC0) != 0x80) {
      ++i;
      *ok = false;
      return kReplacement;
    }
    cp = (cp << 6) | (b & 0x3F);
  }
  if (cp < min || cp > 0x10FFFF || (cp >= 0xD800 && cp <= 0xDFFF)) {
    ++i;
    *ok = false;
    return kReplacement;
  }
  i += len;
  return cp;
}

bool IsHighSurrogate(char32_t c) { return c >= 0xD800 && c <= 0xDBFF; }
bool IsLowSurrogate(char32_t c) { return c >= 0xDC00 && c <= 0xDFFF; }

// The lone surrogates that stand for the bytes 0x80..0xFF of a POSIX name.
constexpr char16_t kEscapedByteBase = 0xDC00;

}  // namespace

std::u16string Utf8ToUtf16(std::string_view utf8) {
  // Alert bodies pass through here whole: written into a buffer sized once
  // (a byte never gives more than one UTF-16 unit, four bytes two), with
  // ASCII copied straight, this is several times faster than appending.
  std::u16string out(utf8.size(), u'\0');
  size_t n = 0;
  size_t i = 0;
  bool ok = true;
  while (i < utf8.size()) {
    const auto byte = static_cast<unsigned char>(utf8[i]);
    if (byte < 0x80) {
      out[n++] = byte;
      ++i;
      continue;
    }
    char32_t cp = DecodeUtf8At(utf8, i, &ok);
    if (cp >= 0x10000) {
      cp -= 0x10000;
      out[n++] = static_cast<char16_t>(0xD800 + (cp >> 10));
      cp = 0xDC00 + (cp & 0x3FF);
    }
    out[n++] = static_cast<char16_t>(cp);
  }
  out.resize(n);
  return out;
}

bool IsValidUtf8(std::string_view bytes) {
  size_t i = 0;
  bool ok = true;
  while (i < bytes.size()) {
    DecodeUtf8At(bytes, i, &ok);
    if (!ok) return false;
  }
  return true;
}

std::string Utf16ToUtf8(std::u16string_view utf16) {
  // Every path handed to the system comes through here, mostly all ASCII:
  // that leading run is copied straight.
  size_t i = 0;
  while (i < utf16.size() && utf16[i] < 0x80) ++i;
  std::string out(i, '\0');
  for (size_t k = 0; k < i; ++k) out[k] = static_cast<char>(utf16[k]);
  out.reserve(i + (utf16.size() - i) * 3);
  for (; i < utf16.size(); ++i) {
    char32_t c = utf16[i];
    if (c >= 0xD800 && c <= 0xDBFF && i + 1 < utf16.size() && utf16[i + 1] >= 0xDC00 &&
        utf16[i + 1] <= 0xDFFF) {
      c = 0x10000 + ((c - 0xD800) << 10) + (utf16[i + 1] - 0xDC00);
      ++i;
    } else if (c >= 0xD800 && c <= 0xDFFF) {
      c = kReplacement;
    }
    AppendUtf8(out, c);
  }
  return out;
}

std::u16string BytesToNativeName(std::string_view bytes) {
  std::u16string out;
  out.reserve(bytes.size());
  size_t i = 0;
  bool ok = true;
  while (i < bytes.size()) {
    const size_t at = i;
    const char32_t cp = DecodeUtf8At(bytes, i, &ok);
    // An ill-formed sequence is always left one byte at a time, and that byte
    // is 0x80 or more: ASCII is never ill-formed.
    if (ok) {
      AppendUtf16(out, cp);
    } else {
      out.push_back(static_cast<char16_t>(kEscapedByteBase + static_cast<unsigned char>(bytes[at])));
    }
  }
  return out;
}

std::string NativeNameToBytes(std::u16string_view name) {
  std::string out;
  out.reserve(name.size());
  for (size_t i = 0; i < name.size(); ++i) {
    char32_t c = name[i];
    if (IsHighSurrogate(c) && i + 1 < name.size() && IsLowSurrogate(name[i + 1])) {
      c = 0x10000 + ((c - 0xD800) << 10) + (name[i + 1] - 0xDC00);
      ++i;
    } else if (c >= kEscapedByteBase + 0x80 && c <= kEscapedByteBase + 0xFF) {
      out.push_back(static_cast<char>(c - kEscapedByteBase));
      continue;
    } else if (IsHighSurrogate(c) || IsLowSurrogate(c)) {
      c = kReplacement;
    }
    AppendUtf8(out, c);
  }
  return out;
}

std::u16string DisplayText(std::u16string_view text) {
  std::u16string out(text);
  for (size_t i = 0; i < out.size(); ++i) {
    if (IsHighSurrogate(out[i]) && i + 1 < out.size() && IsLowSurrogate(out[i + 1])) {
      ++i;
    } else if (IsHighSurrogate(out[i]) || IsLowSurrogate(out[i])) {
      out[i] = static_cast<char16_t>(kReplacement);
    }
  }
  return out;
}

std::u16string Utf32ToUtf16(std::u32string_view utf32) {
  std::u16string out;
  out.reserve(utf32.size());
  for (char32_t c : utf32) {
    if (c > 0x10FFFF || (c >= 0xD800 && c <= 0xDFFF)) c = kReplacement;
    AppendUtf16(out, c);
  }
  return out;
}

std::string Utf16ToLatin1Lossy(std::u16string_view utf16) {
  std::string out;
  out.reserve(utf16.size());
  for (size_t i = 0; i < utf16.size(); ++i) {
    const char16_t c = utf16[i];
    if (c <= 0xFF) {
      out.push_back(static_cast<char>(c));
      continue;
    }
    if (c >= 0xD800 && c <= 0xDBFF && i + 1 < utf16.size() && utf16[i + 1] >= 0xDC00 &&
        utf16[i + 1] <= 0xDFFF) {
      ++i;
    }
    out.push_back('?');
  }
  return out;
}

std::u16string AsciiToUtf16(std::string_view ascii) {
  return std::u16string(ascii.begin(), ascii.end());
}

std::u16string DecimalText(int64_t value) { return AsciiToUtf16(std::to_string(value)); }

}  // namespace asum
