#include <dirent.h>
#include <fcntl.h>
#include <stdio.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "platform/posix/posix_util.h"

namespace asum::platform {

using posix::FromErrno;
using posix::FromNative;
using posix::ToNative;

namespace {

char16_t FoldAscii(char16_t c) { return (c >= u'A' && c <= u'Z') ? static_cast<char16_t>(c + 32) : c; }

// '*' and '?' over UTF-16 code units, ASCII case ignored, iterative with one
// back-tracking point so a hostile pattern cannot take exponential time.
bool WildcardMatch(std::u16string_view pattern, std::u16string_view name) {
  if (pattern == u"*.*" || pattern == u"*") return true;
  size_t p = 0, n = 0, star = std::u16string_view::npos, mark = 0;
  while (n < name.size()) {
    if (p < pattern.size() && (pattern[p] == u'?' || FoldAscii(pattern[p]) == FoldAscii(name[n]))) {
      ++p, ++n;
    } else if (p < pattern.size() && pattern[p] == u'*') {
      star = p++;
      mark = n;
    } else if (star != std::u16string_view::npos) {
      p = star + 1;
      n = ++mark;
    } else {
      return false;
    }
  }
  while (p < pattern.size() && pattern[p] == u'*') ++p;
  return p == pattern.size();
}

bool WriteAll(int fd, std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t n = ::write(fd, bytes.data(), bytes.size());
    if (n < 0) {
      if (errno == EINTR) continue;
      return false;
    }
    bytes.remove_prefix(static_cast<size_t>(n));
  }
  return true;
}

// Reads a folder's entries one by one, "." and ".." left out.
class FolderReader {
 public:
  explicit FolderReader(const std::u16string& folder)
      : native_(ToNative(folder)), dir_(::opendir(native_.empty() ? "." : native_.c_str())) {}
  ~FolderReader() {
    if (dir_ != nullptr) ::closedir(dir_);
  }
  FolderReader(const FolderReader&) = delete;
  FolderReader& operator=(const FolderReader&) = delete;

  bool opened() const { return dir_ != nullptr; }

  // The next entry, or null at the end.
  const struct dirent* Next() {
    while (const struct dirent* ent = ::readdir(dir_)) {
      if (std::strcmp(ent->d_name, ".") != 0 && std::strcmp(ent->d_name, "..") != 0) return ent;
    }
    return nullptr;
  }

  // The directory entry usually says what it is; only links and file systems
  // that do not say cost a stat.
  bool IsFolder(const struct dirent* ent) const {
    if (ent->d_type == DT_DIR || ent->d_type == DT_REG) return ent->d_type == DT_DIR;
    struct stat st;
    const std::string child = native_ + "/" + ent->d_name;
    return ::stat(child.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
  }

 private:
  std::string native_;
  DIR* dir_;
};

std::u16string PrefixOf(const std::u16string& folder) {
  std::u16string prefix = folder;
  if (!prefix.empty() && prefix.back() != kPathSeparator) prefix.push_back(kPathSeparator);
  return prefix;
}

}  // namespace

bool Env::PathExists(const std::u16string& path) {
  struct stat st;
  return !path.empty() && ::stat(ToNative(path).c_str(), &st) == 0;
}

bool Env::ListFolder(const std::u16string& folder, const std::u16string& wildcard,
                     std::vector<DirEntry>* out) {
  out->clear();
  FolderReader reader(folder);
  if (!reader.opened()) return false;
  const std::u16string prefix = PrefixOf(folder);
  while (const struct dirent* ent = reader.Next()) {
    DirEntry entry;
    entry.name = FromNative(ent->d_name);
    if (!WildcardMatch(wildcard, entry.name)) continue;
    entry.full_path = prefix + entry.name;
    entry.is_folder = reader.IsFolder(ent);
    out->push_back(std::move(entry));
  }
  return true;
}

bool Env::ListFiles(const std::u16string& folder, const std::u16string& wildcard, std::string_view skip,
                    std::vector<std::u16string>* out) {
  FolderReader reader(folder);
  if (!reader.opened()) return false;
  const std::u16string prefix = PrefixOf(folder);
  while (const struct dirent* ent = reader.Next()) {
    // An idle cycle meets nothing but skipped names: they are refused on
    // their bytes, before anything is converted or allocated. An ASCII text
    // is found in the bytes exactly where it stands in the UTF-16 name, since
    // neither a multibyte sequence nor an escaped byte holds an ASCII unit.
    const std::string_view bytes(ent->d_name);
    if (!skip.empty() && bytes.find(skip) != std::string_view::npos) continue;
    std::u16string path = prefix;
    path += FromNative(bytes);
    if (!WildcardMatch(wildcard, std::u16string_view(path).substr(prefix.size()))) continue;
    if (reader.IsFolder(ent)) continue;
    out->push_back(std::move(path));
  }
  return true;
}

FileResult Env::CreateFolder(const std::u16string& path) {
  if (::mkdir(ToNative(path).c_str(), 0755) == 0) return {};
  return FromErrno(errno);
}

FileResult Env::RenameNoReplace(const std::u16string& from, const std::u16string& to) {
  const std::string src = ToNative(from), dst = ToNative(to);
  // One atomic step that refuses an existing target, as MoveFileW does.
  if (::renameat2(AT_FDCWD, src.c_str(), AT_FDCWD, dst.c_str(), RENAME_NOREPLACE) == 0) return {};
  if (errno != EINVAL && errno != ENOSYS && errno != ENOTSUP) return FromErrno(errno);
  // File systems without it: link + unlink refuses an existing target too.
  if (::link(src.c_str(), dst.c_str()) == 0) {
    if (::unlink(src.c_str()) == 0) return {};
    const int err = errno;
    ::unlink(dst.c_str());
    return FromErrno(err);
  }
  const int err = errno;
  if (err == EEXIST) return FromErrno(err);
  // File systems without hard links: fall back to a checked rename.
  if (err == EPERM || err == EXDEV || err == EOPNOTSUPP || err == EMLINK) {
    struct stat st;
    if (::lstat(dst.c_str(), &st) == 0) return FromErrno(EEXIST);
    if (::rename(src.c_str(), dst.c_str()) == 0) return {};
    return FromErrno(errno);
  }
  return FromErrno(err);
}

FileResult Env::RemoveFile(const std::u16string& path) {
  if (::unlink(ToNative(path).c_str()) == 0) return {};
  return FromErrno(errno);
}

FileResult Env::ReadFile(const std::u16string& path, std::string* bytes, uint64_t max_bytes) {
  bytes->clear();
  const int fd = ::open(ToNative(path).c_str(), O_RDONLY | O_CLOEXEC);
  if (fd < 0) return FromErrno(errno);
  struct stat st;
  if (::fstat(fd, &st) != 0) {
    const int err = errno;
    ::close(fd);
    return FromErrno(err);
  }
  if (S_ISDIR(st.st_mode)) {
    ::close(fd);
    return {FileStatus::kIsFolder, EISDIR};
  }
  if (static_cast<uint64_t>(st.st_size) > max_bytes) {
    ::close(fd);
    return {FileStatus::kTooLarge, 0};
  }
  try {
    bytes->reserve(static_cast<size_t>(st.st_size));
  } catch (...) {
    ::close(fd);
    return {FileStatus::kTooLarge, ENOMEM};
  }
  char buffer[65536];
  for (;;) {
    const ssize_t n = ::read(fd, buffer, sizeof buffer);
    if (n < 0) {
      if (errno == EINTR) continue;
      const int err = errno;
      ::close(fd);
      bytes->clear();
      return FromErrno(err);
    }
    if (n == 0) break;
    if (bytes->size() + static_cast<size_t>(n) > max_bytes) {
      ::close(fd);
      bytes->clear();
      return {FileStatus::kTooLarge, 0};
    }
    bytes->append(buffer, static_cast<size_t>(n));
  }
  ::close(fd);
  return {};
}

FileResult Env::FileSize(const std::u16string& path, uint64_t* size) {
  *size = 0;
  struct stat st;
  if (::stat(ToNative(path).c_str(), &st) != 0) return FromErrno(errno);
  if (S_ISDIR(st.st_mode)) return {FileStatus::kIsFolder, EISDIR};
  *size = static_cast<uint64_t>(st.st_size);
  return {};
}

FileResult Env::WriteFile(const std::u16string& path, std::string_view bytes) {
  const int fd = ::open(ToNative(path).c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
  if (fd < 0) return FromErrno(errno);
  const bool ok = WriteAll(fd, bytes);
  const int err = errno;
  if (::close(fd) != 0 || !ok) return FromErrno(ok ? errno : err);
  return {};
}

bool Env::AppendExclusive(const std::u16string& path, std::string_view line, uint64_t size_limit) {
  const int fd = ::open(ToNative(path).c_str(), O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC, 0644);
  if (fd < 0) return false;
  // Windows opens the log with share mode 0; a writer that finds it held drops
  // its line instead of waiting, and so do we.
  if (::flock(fd, LOCK_EX | LOCK_NB) != 0) {
    ::close(fd);
    return false;
  }
  struct stat st;
  bool ok = ::fstat(fd, &st) == 0 && S_ISREG(st.st_mode);
  if (ok && static_cast<uint64_t>(st.st_size) >= size_limit) ok = ::ftruncate(fd, 0) == 0;
  if (ok) ok = ::lseek(fd, 0, SEEK_END) >= 0 && WriteAll(fd, line);
  ::close(fd);  // also releases the lock
  return ok;
}

FileLock Env::TryLockFile(const std::u16string& path, FileResult* failure) {
  *failure = {};
  const int fd = ::open(ToNative(path).c_str(), O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC, 0644);
  if (fd < 0) {
    *failure = FromErrno(errno);
    return nullptr;
  }
  if (::flock(fd, LOCK_EX | LOCK_NB) != 0) {
    const int err = errno;
    *failure = err == EWOULDBLOCK ? FileResult{FileStatus::kSharingViolation, static_cast<uint32_t>(err)} : FromErrno(err);
    ::close(fd);
    return nullptr;
  }
  return new int(fd);
}

void Env::UnlockFile(FileLock lock) {
  if (lock == nullptr) return;
  int* fd = static_cast<int*>(lock);
  ::close(*fd);  // releases the lock
  delete fd;
}

bool Env::FileLockHeld(const std::u16string& path) {
  const int fd = ::open(ToNative(path).c_str(), O_RDONLY | O_NOFOLLOW | O_CLOEXEC);
  if (fd < 0) return errno != ENOENT;
  // flock needs no write access; closing the descriptor releases it.
  const bool held = ::flock(fd, LOCK_EX | LOCK_NB) != 0;
  ::close(fd);
  return held;
}

}  // namespace asum::platform
