#include "platform/win32/win32_util.h"

namespace asum::platform {

std::optional<std::u16string> Env::DecodeCodePage(uint32_t code_page, std::string_view bytes,
                                                  InvalidBytes invalid) {
  if (bytes.empty()) return std::u16string();
  if (!::IsValidCodePage(code_page) && code_page != 1200 && code_page != 1201) return std::nullopt;
  if (code_page == 1200) {  // UTF-16LE needs no conversion call
    std::u16string out(bytes.size() / 2, u'\0');
    for (size_t i = 0; i < out.size(); ++i) {
      out[i] = static_cast<char16_t>(static_cast<unsigned char>(bytes[2 * i]) |
                                     (static_cast<unsigned char>(bytes[2 * i + 1]) << 8));
    }
    return out;
  }
  // Without the flag Windows replaces what it cannot read and reports nothing.
  const DWORD flags = invalid == InvalidBytes::kFail ? MB_ERR_INVALID_CHARS : 0;
  std::u16string out;
  // Converted in slices so a length never passes what an int holds.
  size_t pos = 0;
  while (pos < bytes.size()) {
    int len = static_cast<int>(std::min<size_t>(bytes.size() - pos, 1u << 26));
    const int n = ::MultiByteToWideChar(code_page, flags, bytes.data() + pos, len, nullptr, 0);
    if (n <= 0) return std::nullopt;
    const size_t old = out.size();
    out.resize(old + static_cast<size_t>(n));
    ::MultiByteToWideChar(code_page, flags, bytes.data() + pos, len, reinterpret_cast<wchar_t*>(&out[old]), n);
    pos += static_cast<size_t>(len);
  }
  return out;
}

uint32_t Env::AnsiCodePage() { return ::GetACP(); }

}  // namespace asum::platform
