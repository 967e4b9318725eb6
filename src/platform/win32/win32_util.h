// Helpers shared by the Windows backend files.
#pragma once

#ifndef WIN32_LEAN_AND_MEAN
#define WIN32_LEAN_AND_MEAN
#endif
#ifndef NOMINMAX
#define NOMINMAX
#endif
#include <windows.h>

#include <string>

#include "platform/platform.h"

namespace asum::platform::win32 {

// The wide-character API takes UTF-16 as it stands.
inline const wchar_t* W(const std::u16string& s) { return reinterpret_cast<const wchar_t*>(s.c_str()); }
inline std::u16string FromW(const wchar_t* s, size_t n) {
  return std::u16string(reinterpret_cast<const char16_t*>(s), n);
}

inline FileResult FromLastError(DWORD err) {
  FileResult r;
  r.os_error = err;
  switch (err) {
    case ERROR_SUCCESS: r.status = FileStatus::kOk; break;
    case ERROR_FILE_NOT_FOUND:
    case ERROR_PATH_NOT_FOUND:
    case ERROR_INVALID_NAME: r.status = FileStatus::kNotFound; break;
    case ERROR_ALREADY_EXISTS:
    case ERROR_FILE_EXISTS: r.status = FileStatus::kAlreadyExists; break;
    case ERROR_ACCESS_DENIED:
    case ERROR_WRITE_PROTECT: r.status = FileStatus::kAccessDenied; break;
    case ERROR_SHARING_VIOLATION:
    case ERROR_LOCK_VIOLATION: r.status = FileStatus::kSharingViolation; break;
    case ERROR_DISK_FULL:
    case ERROR_HANDLE_DISK_FULL: r.status = FileStatus::kDiskFull; break;
    case ERROR_NOT_ENOUGH_MEMORY:
    case ERROR_OUTOFMEMORY: r.status = FileStatus::kTooLarge; break;
    default: r.status = FileStatus::kOther; break;
  }
  return r;
}

inline SystemTime FromSystemTime(const SYSTEMTIME& s) {
  SystemTime st;
  st.year = s.wYear;
  st.month = s.wMonth;
  st.day_of_week = s.wDayOfWeek;
  st.day = s.wDay;
  st.hour = s.wHour;
  st.minute = s.wMinute;
  st.second = s.wSecond;
  st.milliseconds = s.wMilliseconds;
  return st;
}

inline SYSTEMTIME ToSystemTime(const SystemTime& st) {
  SYSTEMTIME s;
  s.wYear = st.year;
  s.wMonth = st.month;
  s.wDayOfWeek = st.day_of_week;
  s.wDay = st.day;
  s.wHour = st.hour;
  s.wMinute = st.minute;
  s.wSecond = st.second;
  s.wMilliseconds = st.milliseconds;
  return s;
}

}  // namespace asum::platform::win32
