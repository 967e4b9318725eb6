#include "platform/win32/win32_util.h"

namespace asum::platform {

using win32::FromLastError;
using win32::W;

bool Env::PathExists(const std::u16string& path) {
  return !path.empty() && ::GetFileAttributesW(W(path)) != INVALID_FILE_ATTRIBUTES;
}

bool Env::ListFolder(const std::u16string& folder, const std::u16string& wildcard,
                     std::vector<DirEntry>* out) {
  out->clear();
  std::u16string prefix = folder;
  if (!prefix.empty() && prefix.back() != u'\\') prefix.push_back(u'\\');
  const std::u16string pattern = prefix + wildcard;
  WIN32_FIND_DATAW data;
  HANDLE find = ::FindFirstFileW(W(pattern), &data);
  if (find == INVALID_HANDLE_VALUE) return false;
  do {
    const std::u16string name = win32::FromW(data.cFileName, wcslen(data.cFileName));
    if (name == u"." || name == u"..") continue;
    DirEntry entry;
    entry.name = name;
    entry.full_path = prefix + name;
    entry.is_folder = (data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
    out->push_back(std::move(entry));
  } while (::FindNextFileW(find, &data));
  ::FindClose(find);
  return true;
}

bool Env::ListFiles(const std::u16string& folder, const std::u16string& wildcard, std::string_view skip,
                    std::vector<std::u16string>* out) {
  std::u16string prefix = folder;
  if (!prefix.empty() && prefix.back() != u'\\') prefix.push_back(u'\\');
  WIN32_FIND_DATAW data;
  HANDLE find = ::FindFirstFileW(W(prefix + wildcard), &data);
  if (find == INVALID_HANDLE_VALUE) return false;
  const std::u16string wide_skip(skip.begin(), skip.end());
  do {
    // Decided on the search's own buffer: a skipped name costs no copy.
    const std::u16string_view name(reinterpret_cast<const char16_t*>(data.cFileName), wcslen(data.cFileName));
    if (name == u"." || name == u"..") continue;
    if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) continue;
    if (!wide_skip.empty() && name.find(wide_skip) != std::u16string_view::npos) continue;
    std::u16string path = prefix;
    path += name;
    out->push_back(std::move(path));
  } while (::FindNextFileW(find, &data));
  ::FindClose(find);
  return true;
}

FileResult Env::CreateFolder(const std::u16string& path) {
  if (::CreateDirectoryW(W(path), nullptr)) return {};
  return FromLastError(::GetLastError());
}

FileResult Env::RenameNoReplace(const std::u16string& from, const std::u16string& to) {
  if (::MoveFileW(W(from), W(to))) return {};
  return FromLastError(::GetLastError());
}

FileResult Env::RemoveFile(const std::u16string& path) {
  if (::DeleteFileW(W(path))) return {};
  return FromLastError(::GetLastError());
}

FileResult Env::FileSize(const std::u16string& path, uint64_t* size) {
  *size = 0;
  WIN32_FILE_ATTRIBUTE_DATA data;
  if (!::GetFileAttributesExW(W(path), GetFileExInfoStandard, &data)) return FromLastError(::GetLastError());
  if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) return {FileStatus::kIsFolder, 0};
  *size = (static_cast<uint64_t>(data.nFileSizeHigh) << 32) | data.nFileSizeLow;
  return {};
}

FileResult Env::ReadFile(const std::u16string& path, std::string* bytes, uint64_t max_bytes) {
  bytes->clear();
  // FILE_SHARE_READ only: while the service still writes the message, the open
  // fails with a sharing violation and the file waits for the next cycle.
  HANDLE file = ::CreateFileW(W(path), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING,
                              FILE_ATTRIBUTE_NORMAL | FILE_FLAG_SEQUENTIAL_SCAN, nullptr);
  if (file == INVALID_HANDLE_VALUE) {
    const DWORD err = ::GetLastError();
    if (err == ERROR_ACCESS_DENIED) {
      const DWORD attrs = ::GetFileAttributesW(W(path));
      if (attrs != INVALID_FILE_ATTRIBUTES && (attrs & FILE_ATTRIBUTE_DIRECTORY)) {
        return {FileStatus::kIsFolder, err};
      }
    }
    return FromLastError(err);
  }
  LARGE_INTEGER size;
  if (!::GetFileSizeEx(file, &size)) {
    const DWORD err = ::GetLastError();
    ::CloseHandle(file);
    return FromLastError(err);
  }
  if (static_cast<uint64_t>(size.QuadPart) > max_bytes) {
    ::CloseHandle(file);
    return {FileStatus::kTooLarge, 0};
  }
  try {
    bytes->resize(static_cast<size_t>(size.QuadPart));
  } catch (...) {
    ::CloseHandle(file);
    return {FileStatus::kTooLarge, ERROR_NOT_ENOUGH_MEMORY};
  }
  size_t done = 0;
  while (done < bytes->size()) {
    DWORD chunk = static_cast<DWORD>(std::min<size_t>(bytes->size() - done, 1u << 24));
    DWORD got = 0;
    if (!::ReadFile(file, bytes->data() + done, chunk, &got, nullptr)) {
      const DWORD err = ::GetLastError();
      ::CloseHandle(file);
      bytes->clear();
      return FromLastError(err);
    }
    if (got == 0) break;
    done += got;
  }
  bytes->resize(done);
  ::CloseHandle(file);
  return {};
}

FileResult Env::WriteFile(const std::u16string& path, std::string_view bytes) {
  HANDLE file = ::CreateFileW(W(path), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr);
  if (file == INVALID_HANDLE_VALUE) return FromLastError(::GetLastError());
  while (!bytes.empty()) {
    DWORD chunk = static_cast<DWORD>(std::min<size_t>(bytes.size(), 1u << 24));
    DWORD written = 0;
    if (!::WriteFile(file, bytes.data(), chunk, &written, nullptr)) {
      const DWORD err = ::GetLastError();
      ::CloseHandle(file);
      return FromLastError(err);
    }
    bytes.remove_prefix(written);
  }
  ::CloseHandle(file);
  return {};
}

bool Env::AppendExclusive(const std::u16string& path, std::string_view line, uint64_t size_limit) {
  // Share mode 0: a second writer's open fails and its line is dropped, so lines
  // never interleave.
  HANDLE file = ::CreateFileW(W(path), GENERIC_READ | GENERIC_WRITE, 0, nullptr, OPEN_ALWAYS,
                              FILE_ATTRIBUTE_NORMAL, nullptr);
  if (file == INVALID_HANDLE_VALUE) return false;
  LARGE_INTEGER size;
  bool ok = ::GetFileSizeEx(file, &size) != 0;
  if (ok && static_cast<uint64_t>(size.QuadPart) >= size_limit) {
    LARGE_INTEGER zero = {};
    ok = ::SetFilePointerEx(file, zero, nullptr, FILE_BEGIN) && ::SetEndOfFile(file);
  }
  if (ok) {
    LARGE_INTEGER zero = {};
    ok = ::SetFilePointerEx(file, zero, nullptr, FILE_END) != 0;
  }
  if (ok) {
    DWORD written = 0;
    ok = ::WriteFile(file, line.data(), static_cast<DWORD>(line.size()), &written, nullptr) &&
         written == line.size();
  }
  ::CloseHandle(file);
  return ok;
}

FileLock Env::TryLockFile(const std::u16string& path, FileResult* failure) {
  *failure = {};
  HANDLE file = ::CreateFileW(W(path), GENERIC_READ | GENERIC_WRITE, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE,
                              nullptr, OPEN_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr);
  if (file == INVALID_HANDLE_VALUE) {
    *failure = FromLastError(::GetLastError());
    return nullptr;
  }
  OVERLAPPED at = {};
  if (!::LockFileEx(file, LOCKFILE_EXCLUSIVE_LOCK | LOCKFILE_FAIL_IMMEDIATELY, 0, 1, 0, &at)) {
    // ERROR_LOCK_VIOLATION: another holder has it.
    *failure = FromLastError(::GetLastError());
    ::CloseHandle(file);
    return nullptr;
  }
  return file;
}

void Env::UnlockFile(FileLock lock) {
  if (lock == nullptr) return;
  OVERLAPPED at = {};
  ::UnlockFileEx(static_cast<HANDLE>(lock), 0, 1, 0, &at);
  ::CloseHandle(static_cast<HANDLE>(lock));
}

bool Env::FileLockHeld(const std::u16string& path) {
  // Read access is enough for LockFileEx, and OPEN_EXISTING never creates.
  HANDLE file = ::CreateFileW(W(path), GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr,
                              OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
  if (file == INVALID_HANDLE_VALUE) {
    const DWORD error = ::GetLastError();
    return error != ERROR_FILE_NOT_FOUND && error != ERROR_PATH_NOT_FOUND;
  }
  OVERLAPPED at = {};
  const bool held = !::LockFileEx(file, LOCKFILE_EXCLUSIVE_LOCK | LOCKFILE_FAIL_IMMEDIATELY, 0, 1, 0, &at);
  if (!held) {
    OVERLAPPED again = {};
    ::UnlockFileEx(file, 0, 1, 0, &again);
  }
  ::CloseHandle(file);
  return held;
}

}  // namespace asum::platform
