// Settings on Linux: a folder tree that mirrors the registry below
// HKEY_LOCAL_MACHINE. Each key is a folder, each string value a file holding
// its UTF-8 text. Key names are matched as the file system matches them.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

#include "platform/posix/posix_util.h"

namespace asum::platform {
namespace {

// Any non-null pointer that no key folder can have.
int g_local_machine_tag;

struct KeyFolder {
  std::string path;
};

std::string FolderOf(SettingsKey key) {
  if (key == &g_local_machine_tag) return posix::ToNative(SettingsRoot());
  return static_cast<KeyFolder*>(key)->path;
}

bool IsFolder(const std::string& path) {
  struct stat st;
  return ::stat(path.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

// A key name is one path element; anything that would climb or nest is refused.
bool ValidName(const std::u16string& name) {
  return !name.empty() && name != u"." && name != u".." && name.find(u'/') == std::u16string::npos &&
         name.find(u'\0') == std::u16string::npos;
}

// Only the access check that RegOpenKeyExW with KEY_READ | KEY_WRITE makes.
bool ReadWritable(const std::string& path) { return ::access(path.c_str(), R_OK | W_OK | X_OK) == 0; }

}  // namespace

SettingsKey Env::LocalMachine() { return &g_local_machine_tag; }

SettingsKey Env::OpenKey(SettingsKey parent, const std::u16string& name) {
  if (parent == nullptr || !ValidName(name)) return nullptr;
  const std::string path = FolderOf(parent) + "/" + posix::ToNative(name);
  if (!IsFolder(path) || !ReadWritable(path)) return nullptr;
  return new KeyFolder{path};
}

SettingsKey Env::OpenKeyForReading(SettingsKey parent, const std::u16string& name) {
  if (parent == nullptr || !ValidName(name)) return nullptr;
  const std::string path = FolderOf(parent) + "/" + posix::ToNative(name);
  if (!IsFolder(path) || ::access(path.c_str(), R_OK | X_OK) != 0) return nullptr;
  return new KeyFolder{path};
}

SettingsKey Env::CreateKey(SettingsKey parent, const std::u16string& name) {
  if (parent == nullptr || !ValidName(name)) return nullptr;
  const std::string path = FolderOf(parent) + "/" + posix::ToNative(name);
  if (!IsFolder(path) && ::mkdir(path.c_str(), 0755) != 0 && errno != EEXIST) return nullptr;
  if (!IsFolder(path) || !ReadWritable(path)) return nullptr;
  return new KeyFolder{path};
}

std::optional<std::u16string> Env::QueryStringValue(SettingsKey key, const std::u16string& name) {
  if (key == nullptr || name.find(u'/') != std::u16string::npos || name == u"." || name == u"..") {
    return std::nullopt;
  }
  const std::string path = FolderOf(key) + "/" + posix::ToNative(name);
  std::string bytes;
  if (!ReadFile(posix::FromNative(path), &bytes, 1 << 20).ok()) return std::nullopt;
  std::u16string text = Utf8ToUtf16(bytes);
  // A registry string ends at its first zero character.
  const size_t nul = text.find(u'\0');
  if (nul != std::u16string::npos) text.resize(nul);
  return text;
}

void Env::CloseKey(SettingsKey key) {
  if (key != nullptr && key != &g_local_machine_tag) delete static_cast<KeyFolder*>(key);
}

}  // namespace asum::platform
