#include "entry/host_text.h"

#include <string_view>

#include "common/utf.h"
#include "store/host_queries.h"

namespace asum {

std::u16string HostText(const wchar_t* text) {
  if (text == nullptr) return {};
  const std::wstring_view view(text);
  if constexpr (sizeof(wchar_t) == sizeof(char16_t)) {
    return std::u16string(reinterpret_cast<const char16_t*>(view.data()), view.size());
  } else {
    return Utf32ToUtf16(std::u32string_view(reinterpret_cast<const char32_t*>(view.data()), view.size()));
  }
}

int GetAlertCountForHost(const wchar_t* filter, const wchar_t* range) {
  try {
    return CountForHost(HostText(filter), HostText(range));
  } catch (...) {
    return 0;
  }
}

}  // namespace asum
