#include "platform/win32/win32_util.h"

#include <oleauto.h>

namespace asum::platform {

using win32::FromSystemTime;
using win32::ToSystemTime;

SystemTime Env::LocalNow() {
  SYSTEMTIME s;
  ::GetLocalTime(&s);
  return FromSystemTime(s);
}

SystemTime Env::UtcNow() {
  SYSTEMTIME s;
  ::GetSystemTime(&s);
  return FromSystemTime(s);
}

int32_t Env::CurrentBiasMinutes() {
  TIME_ZONE_INFORMATION tz;
  const DWORD mode = ::GetTimeZoneInformation(&tz);
  if (mode == TIME_ZONE_ID_INVALID) return 0;
  LONG bias = tz.Bias;
  if (mode == TIME_ZONE_ID_DAYLIGHT) bias += tz.DaylightBias;
  return bias;
}

std::optional<SystemTime> Env::UtcToLocal(const SystemTime& utc) {
  const SYSTEMTIME s = ToSystemTime(utc);
  FILETIME ft, local_ft;
  SYSTEMTIME local;
  if (!::SystemTimeToFileTime(&s, &ft) || !::FileTimeToLocalFileTime(&ft, &local_ft) ||
      !::FileTimeToSystemTime(&local_ft, &local)) {
    return std::nullopt;
  }
  return FromSystemTime(local);
}

std::u16string Env::TimestampText(const SystemTime& local) {
  SYSTEMTIME s = ToSystemTime(local);
  s.wMilliseconds = 0;
  DATE date;
  if (!::SystemTimeToVariantTime(&s, &date)) return {};
  BSTR text = nullptr;
  if (FAILED(::VarBstrFromDate(date, LOCALE_USER_DEFAULT, 0, &text)) || text == nullptr) return {};
  std::u16string result = win32::FromW(text, ::SysStringLen(text));
  ::SysFreeString(text);
  return result;
}

std::optional<double> Env::SystemTimeToVariantTime(const SystemTime& st) {
  SYSTEMTIME s = ToSystemTime(st);
  DATE date;
  if (!::SystemTimeToVariantTime(&s, &date)) return std::nullopt;
  return date;
}

std::optional<SystemTime> Env::VariantTimeToSystemTime(double date) {
  SYSTEMTIME s;
  if (!::VariantTimeToSystemTime(date, &s)) return std::nullopt;
  return FromSystemTime(s);
}

}  // namespace asum::platform
