#include "mail/text_convert.h"

#include "common/utf.h"
#include "mail/charset_table.h"
#include "mail/iso2022jp.h"
#include "mail/iso8859_tables.h"
#include "platform/platform.h"

namespace asum::mail {
namespace {

using InvalidBytes = platform::Env::InvalidBytes;

constexpr char kEscape = '\x1b';
constexpr uint32_t kCodePageShiftJis = 932;
constexpr uint32_t kCodePageGbk = 936;
constexpr uint32_t kCodePageGb18030 = 54936;
// Big texts are converted in slices, so the UTF-16 intermediate never holds
// more than one slice; slices end after a line feed, which no multibyte code
// page uses as a trailing byte.
constexpr size_t kSliceBytes = 1 << 20;

std::optional<std::string> ConvertCodePage(std::string_view bytes, uint32_t code_page, InvalidBytes invalid) {
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
    std::optional<std::u16string> wide = env.DecodeCodePage(code_page, bytes.substr(pos, end - pos), invalid);
    if (!wide) return std::nullopt;
    out += Utf16ToUtf8(*wide);
    pos = end;
  }
  return out;
}

// The whole of `bytes` read in `code_page`; nothing when they are no text of
// it or this machine cannot read it.
std::optional<std::string> Decode(std::string_view bytes, uint32_t code_page) {
  switch (code_page) {
    case kCodePageUtf8:
      if (IsValidUtf8(bytes)) return std::string(bytes);
      return std::nullopt;
    case kCodePageAscii:
      if (IsPlainAscii(bytes)) return std::string(bytes);
      return std::nullopt;
    case kCodePageIso2022Jp:
      if (std::optional<std::string> shift_jis = Iso2022JpToShiftJis(bytes)) {
        return ConvertCodePage(*shift_jis, kCodePageShiftJis, InvalidBytes::kFail);
      }
      return std::nullopt;
    case kCodePageIso8859_10:
    case kCodePageIso8859_14:
      return Iso8859TableToUtf8(code_page, bytes);
    default:
      break;
  }
  std::optional<std::string> text = ConvertCodePage(bytes, code_page, InvalidBytes::kFail);
  // Some machines (Wine among them) lack GB18030; its two-byte part, which
  // is most Chinese text, is GBK.
  if (!text && code_page == kCodePageGb18030) text = ConvertCodePage(bytes, kCodePageGbk, InvalidBytes::kFail);
  return text;
}

std::string Utf8Repaired(std::string_view bytes) {
  if (IsValidUtf8(bytes)) return std::string(bytes);
  return Utf16ToUtf8(Utf8ToUtf16(bytes));
}

std::string ByHeaderRule(std::string_view bytes) {
  const uint32_t guess = GuessCodePage(bytes);
  if (std::optional<std::string> text = Decode(bytes, guess)) return *text;
  // 7-bit text that is no ISO-2022-JP stays as it is, ESC and all.
  if (guess == kCodePageIso2022Jp) return std::string(bytes);
  // The ANSI code page is the last resort: what it cannot read is replaced.
  if (std::optional<std::string> text = ConvertCodePage(bytes, guess, InvalidBytes::kReplace)) return *text;
  return Utf8Repaired(bytes);
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
  // A declared charset must read the whole text: one that lies about it
  // would otherwise turn the part into replacement characters.
  if (code_page) {
    if (std::optional<std::string> text = Decode(bytes, *code_page)) return *text;
  }
  return ByHeaderRule(bytes);
}

}  // namespace asum::mail
