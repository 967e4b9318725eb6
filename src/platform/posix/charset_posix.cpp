#include <iconv.h>

#include <cerrno>

#include "platform/posix/posix_util.h"

namespace asum::platform {
namespace {

// Windows code page numbers to the names glibc's iconv knows.
const char* IconvName(uint32_t code_page) {
  switch (code_page) {
    case 65001: return "UTF-8";
    case 20127: return "US-ASCII";
    case 28591: return "ISO-8859-1";
    case 28592: return "ISO-8859-2";
    case 28593: return "ISO-8859-3";
    case 28594: return "ISO-8859-4";
    case 28595: return "ISO-8859-5";
    case 28596: return "ISO-8859-6";
    case 28597: return "ISO-8859-7";
    case 28598: return "ISO-8859-8";
    case 28599: return "ISO-8859-9";
    case 28600: return "ISO-8859-10";
    case 28601: return "ISO-8859-11";
    case 28603: return "ISO-8859-13";
    case 28604: return "ISO-8859-14";
    case 28605: return "ISO-8859-15";
    case 874: return "CP874";
    case 1250: return "CP1250";
    case 1251: return "CP1251";
    case 1252: return "CP1252";
    case 1253: return "CP1253";
    case 1254: return "CP1254";
    case 1255: return "CP1255";
    case 1256: return "CP1256";
    case 1257: return "CP1257";
    case 1258: return "CP1258";
    case 20866: return "KOI8-R";
    case 21866: return "KOI8-U";
    case 936: return "GBK";
    case 54936: return "GB18030";
    case 950: return "BIG5";
    case 932: return "CP932";
    case 20932: return "EUC-JP";
    case 51932: return "EUC-JP";
    case 50220: return "ISO-2022-JP";
    case 949: return "CP949";
    case 51949: return "EUC-KR";
    case 1200: return "UTF-16LE";
    case 1201: return "UTF-16BE";
    case 12000: return "UTF-32LE";
    case 437: return "CP437";
    case 850: return "CP850";
    case 866: return "CP866";
    default: return nullptr;
  }
}

}  // namespace

std::optional<std::u16string> Env::DecodeCodePage(uint32_t code_page, std::string_view bytes) {
  if (code_page == 65001) return Utf8ToUtf16(bytes);
  const char* name = IconvName(code_page);
  if (name == nullptr) return std::nullopt;
  iconv_t cd = iconv_open("UTF-16LE", name);
  if (cd == reinterpret_cast<iconv_t>(-1)) return std::nullopt;
  std::u16string out;
  out.reserve(bytes.size());
  char* in = const_cast<char*>(bytes.data());
  size_t in_left = bytes.size();
  char16_t buffer[4096];
  while (in_left > 0) {
    char* dst = reinterpret_cast<char*>(buffer);
    size_t dst_left = sizeof buffer;
    const size_t rc = iconv(cd, &in, &in_left, &dst, &dst_left);
    out.append(buffer, (sizeof buffer - dst_left) / sizeof(char16_t));
    if (rc == static_cast<size_t>(-1)) {
      if (errno == E2BIG) continue;
      // An invalid or truncated sequence: one replacement per bad byte, as
      // MultiByteToWideChar without MB_ERR_INVALID_CHARS does.
      out.push_back(u'\uFFFD');
      ++in;
      --in_left;
      iconv(cd, nullptr, nullptr, nullptr, nullptr);
    }
  }
  char* dst = reinterpret_cast<char*>(buffer);
  size_t dst_left = sizeof buffer;
  iconv(cd, nullptr, nullptr, &dst, &dst_left);
  out.append(buffer, (sizeof buffer - dst_left) / sizeof(char16_t));
  iconv_close(cd);
  return out;
}

uint32_t Env::AnsiCodePage() { return 1252; }

}  // namespace asum::platform
