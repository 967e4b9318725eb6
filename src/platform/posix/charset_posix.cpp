#include <iconv.h>

#include <array>
#include <cerrno>

#include "platform/posix/posix_util.h"

namespace asum::platform {
namespace {

// A noncharacter: no code page decodes a byte to it.
constexpr char16_t kUndefined = 0xFFFF;

struct Converter {
  const char* name;  // as glibc's iconv knows it
  bool single_byte;
};

std::optional<Converter> ConverterFor(uint32_t code_page) {
  switch (code_page) {
    case 20127: return Converter{"US-ASCII", true};
    case 28591: return Converter{"ISO-8859-1", true};
    case 28592: return Converter{"ISO-8859-2", true};
    case 28593: return Converter{"ISO-8859-3", true};
    case 28594: return Converter{"ISO-8859-4", true};
    case 28595: return Converter{"ISO-8859-5", true};
    case 28596: return Converter{"ISO-8859-6", true};
    case 28597: return Converter{"ISO-8859-7", true};
    case 28598: return Converter{"ISO-8859-8", true};
    case 28599: return Converter{"ISO-8859-9", true};
    case 28600: return Converter{"ISO-8859-10", true};
    case 28601: return Converter{"ISO-8859-11", true};
    case 28603: return Converter{"ISO-8859-13", true};
    case 28604: return Converter{"ISO-8859-14", true};
    case 28605: return Converter{"ISO-8859-15", true};
    case 874: return Converter{"CP874", true};
    case 1250: return Converter{"CP1250", true};
    case 1251: return Converter{"CP1251", true};
    case 1252: return Converter{"CP1252", true};
    case 1253: return Converter{"CP1253", true};
    case 1254: return Converter{"CP1254", true};
    case 1255: return Converter{"CP1255", true};
    case 1256: return Converter{"CP1256", true};
    case 1257: return Converter{"CP1257", true};
    case 1258: return Converter{"CP1258", true};
    case 20866: return Converter{"KOI8-R", true};
    case 21866: return Converter{"KOI8-U", true};
    case 437: return Converter{"CP437", true};
    case 850: return Converter{"CP850", true};
    case 866: return Converter{"CP866", true};
    case 936: return Converter{"GBK", false};
    case 54936: return Converter{"GB18030", false};
    case 950: return Converter{"BIG5", false};
    case 932: return Converter{"CP932", false};
    case 20932: return Converter{"EUC-JP", false};
    case 51932: return Converter{"EUC-JP", false};
    case 50220: return Converter{"ISO-2022-JP", false};
    case 949: return Converter{"CP949", false};
    case 51949: return Converter{"EUC-KR", false};
    case 1200: return Converter{"UTF-16LE", false};
    case 1201: return Converter{"UTF-16BE", false};
    case 12000: return Converter{"UTF-32LE", false};
    default: return std::nullopt;
  }
}

// The bytes of single-byte code pages that Windows reads otherwise than
// glibc does (kUndefined: Windows leaves the byte undefined). Windows keeps the
// older readings of ISO 8859-7 and -8 and reads KOI8-U's two extra letters;
// its US-ASCII drops the high bit, but 0xBF then gives '?', its mark for an
// unreadable byte.
struct WindowsReading {
  uint32_t code_page;
  unsigned char byte;
  char16_t ch;
};
constexpr WindowsReading kWindowsReadings[] = {
    {1255, 0xCA, u'\u05BA'},   {28597, 0xA1, u'\u02BD'},  {28597, 0xA2, u'\u02BC'},
    {28597, 0xA4, kUndefined}, {28597, 0xA5, kUndefined}, {28597, 0xAA, kUndefined},
    {28598, 0xAF, u'\u203E'},  {28598, 0xFD, kUndefined}, {28598, 0xFE, kUndefined},
    {21866, 0xAE, u'\u045E'},  {21866, 0xBE, u'\u040E'},  {20127, 0xBF, kUndefined},
};

class Iconv {
 public:
  explicit Iconv(const char* from) : cd_(iconv_open("UTF-16LE", from)) {}
  ~Iconv() {
    if (ok()) iconv_close(cd_);
  }
  Iconv(const Iconv&) = delete;
  Iconv& operator=(const Iconv&) = delete;
  bool ok() const { return cd_ != reinterpret_cast<iconv_t>(-1); }
  iconv_t get() const { return cd_; }

 private:
  iconv_t cd_;
};

// A single-byte code page as a table of its 256 bytes, read as Windows reads them.
std::optional<std::array<char16_t, 256>> SingleByteTable(uint32_t code_page, const char* name) {
  Iconv cd(name);
  if (!cd.ok()) return std::nullopt;
  std::array<char16_t, 256> table;
  for (size_t b = 0; b < table.size(); ++b) {
    char byte = static_cast<char>(b);
    char16_t ch[2] = {};
    char* in = &byte;
    size_t in_left = 1;
    char* out = reinterpret_cast<char*>(ch);
    size_t out_left = sizeof ch;
    // The flush matters: glibc's 1255 and 1258 hold a letter back until they
    // know whether a combining mark follows.
    const bool read = iconv(cd.get(), &in, &in_left, &out, &out_left) != static_cast<size_t>(-1) &&
                      iconv(cd.get(), nullptr, nullptr, &out, &out_left) != static_cast<size_t>(-1) &&
                      out_left == sizeof ch - sizeof ch[0];
    table[b] = read ? ch[0] : kUndefined;
    iconv(cd.get(), nullptr, nullptr, nullptr, nullptr);
  }
  // Windows reads the bytes that its own 8-bit code pages leave undefined
  // below 0xA0 as the C1 controls.
  for (size_t b = 0x80; b < table.size(); ++b) {
    if (table[b] != kUndefined) continue;
    if (code_page == 20127) table[b] = static_cast<char16_t>(b & 0x7F);
    if ((code_page == 874 || (code_page >= 1250 && code_page <= 1258)) && b < 0xA0) {
      table[b] = static_cast<char16_t>(b);
    }
  }
  for (const WindowsReading& r : kWindowsReadings) {
    if (r.code_page == code_page) table[r.byte] = r.ch;
  }
  return table;
}

std::optional<std::u16string> DecodeSingleByte(uint32_t code_page, const char* name, std::string_view bytes,
                                               Env::InvalidBytes invalid) {
  const std::optional<std::array<char16_t, 256>> table = SingleByteTable(code_page, name);
  if (!table) return std::nullopt;
  std::u16string out(bytes.size(), u'\0');
  for (size_t i = 0; i < bytes.size(); ++i) {
    const char16_t ch = (*table)[static_cast<unsigned char>(bytes[i])];
    if (ch == kUndefined && invalid == Env::InvalidBytes::kFail) return std::nullopt;
    out[i] = ch == kUndefined ? u'\uFFFD' : ch;
  }
  return out;
}

std::optional<std::u16string> DecodeMultiByte(uint32_t code_page, const char* name, std::string_view bytes,
                                              Env::InvalidBytes invalid) {
  Iconv cd(name);
  if (!cd.ok()) return std::nullopt;
  std::u16string out;
  out.reserve(bytes.size());
  char* in = const_cast<char*>(bytes.data());
  size_t in_left = bytes.size();
  char16_t buffer[4096];
  while (in_left > 0) {
    char* dst = reinterpret_cast<char*>(buffer);
    size_t dst_left = sizeof buffer;
    const size_t rc = iconv(cd.get(), &in, &in_left, &dst, &dst_left);
    out.append(buffer, (sizeof buffer - dst_left) / sizeof(char16_t));
    if (rc != static_cast<size_t>(-1) || errno == E2BIG) continue;
    // An invalid or truncated sequence starts at `in`. Windows reads a lone
    // 0x80 of its Japanese and Korean code pages as U+0080.
    if (static_cast<unsigned char>(*in) == 0x80 && (code_page == 932 || code_page == 949)) {
      out.push_back(u'\u0080');
    } else if (invalid == Env::InvalidBytes::kFail) {
      return std::nullopt;
    } else {
      out.push_back(u'\uFFFD');
    }
    ++in;
    --in_left;
    iconv(cd.get(), nullptr, nullptr, nullptr, nullptr);
  }
  char* dst = reinterpret_cast<char*>(buffer);
  size_t dst_left = sizeof buffer;
  iconv(cd.get(), nullptr, nullptr, &dst, &dst_left);
  out.append(buffer, (sizeof buffer - dst_left) / sizeof(char16_t));
  return out;
}

}  // namespace

std::optional<std::u16string> Env::DecodeCodePage(uint32_t code_page, std::string_view bytes,
                                                  InvalidBytes invalid) {
  if (code_page == 65001) {
    if (invalid == InvalidBytes::kFail && !IsValidUtf8(bytes)) return std::nullopt;
    return Utf8ToUtf16(bytes);
  }
  const std::optional<Converter> converter = ConverterFor(code_page);
  if (!converter) return std::nullopt;
  if (converter->single_byte) return DecodeSingleByte(code_page, converter->name, bytes, invalid);
  return DecodeMultiByte(code_page, converter->name, bytes, invalid);
}

uint32_t Env::AnsiCodePage() { return 1252; }

}  // namespace asum::platform
