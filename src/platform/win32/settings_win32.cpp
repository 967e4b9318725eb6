#include <vector>

#include "platform/win32/win32_util.h"

namespace asum::platform {

using win32::W;

// No KEY_WOW64_* flag: a 32-bit service and its library see the same view.
constexpr REGSAM kAccess = KEY_READ | KEY_WRITE;

SettingsKey Env::LocalMachine() { return reinterpret_cast<SettingsKey>(HKEY_LOCAL_MACHINE); }

SettingsKey Env::OpenKey(SettingsKey parent, const std::u16string& name) {
  if (parent == nullptr) return nullptr;
  HKEY key = nullptr;
  if (::RegOpenKeyExW(static_cast<HKEY>(parent), W(name), 0, kAccess, &key) != ERROR_SUCCESS) return nullptr;
  return key;
}

SettingsKey Env::OpenKeyForReading(SettingsKey parent, const std::u16string& name) {
  if (parent == nullptr) return nullptr;
  HKEY key = nullptr;
  if (::RegOpenKeyExW(static_cast<HKEY>(parent), W(name), 0, KEY_READ, &key) != ERROR_SUCCESS) return nullptr;
  return key;
}

SettingsKey Env::CreateKey(SettingsKey parent, const std::u16string& name) {
  if (parent == nullptr) return nullptr;
  HKEY key = nullptr;
  if (::RegCreateKeyExW(static_cast<HKEY>(parent), W(name), 0, nullptr, REG_OPTION_NON_VOLATILE, kAccess,
                        nullptr, &key, nullptr) != ERROR_SUCCESS) {
    return nullptr;
  }
  return key;
}

std::optional<std::u16string> Env::QueryStringValue(SettingsKey key, const std::u16string& name) {
  if (key == nullptr) return std::nullopt;
  DWORD size = 0;
  if (::RegQueryValueExW(static_cast<HKEY>(key), W(name), nullptr, nullptr, nullptr, &size) != ERROR_SUCCESS) {
    return std::nullopt;
  }
  // The size is in bytes; the text is read as UTF-16 whatever the value's type.
  std::vector<wchar_t> buffer((size + 1) / 2 + 1, L'\0');
  DWORD got = static_cast<DWORD>((buffer.size() - 1) * sizeof(wchar_t));
  if (::RegQueryValueExW(static_cast<HKEY>(key), W(name), nullptr, nullptr,
                         reinterpret_cast<BYTE*>(buffer.data()), &got) != ERROR_SUCCESS) {
    return std::nullopt;
  }
  const size_t chars = std::min<size_t>((got + 1) / 2, buffer.size() - 1);
  size_t end = 0;
  while (end < chars && buffer[end] != L'\0') ++end;
  return win32::FromW(buffer.data(), end);
}

void Env::CloseKey(SettingsKey key) {
  if (key != nullptr && key != LocalMachine()) ::RegCloseKey(static_cast<HKEY>(key));
}

}  // namespace asum::platform
