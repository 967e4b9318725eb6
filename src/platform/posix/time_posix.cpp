#include <locale.h>
#include <time.h>
#include <wchar.h>

#include <cmath>
#include <string>

#include "platform/posix/posix_util.h"

namespace asum::platform {
namespace {

SystemTime FromTm(const struct tm& tm, int ms) {
  SystemTime st;
  st.year = static_cast<uint16_t>(tm.tm_year + 1900);
  st.month = static_cast<uint16_t>(tm.tm_mon + 1);
  st.day_of_week = static_cast<uint16_t>(tm.tm_wday);
  st.day = static_cast<uint16_t>(tm.tm_mday);
  st.hour = static_cast<uint16_t>(tm.tm_hour);
  st.minute = static_cast<uint16_t>(tm.tm_min);
  st.second = static_cast<uint16_t>(tm.tm_sec);
  st.milliseconds = static_cast<uint16_t>(ms);
  return st;
}

// Days from 1970-01-01 to a proleptic Gregorian date (Howard Hinnant's algorithm).
int64_t DaysFromCivil(int64_t y, unsigned m, unsigned d) {
  y -= m <= 2;
  const int64_t era = (y >= 0 ? y : y - 399) / 400;
  const auto yoe = static_cast<unsigned>(y - era * 400);
  const unsigned doy = (153 * (m + (m > 2 ? -3 : 9)) + 2) / 5 + d - 1;
  const unsigned doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
  return era * 146097 + static_cast<int64_t>(doe) - 719468;
}

void CivilFromDays(int64_t z, int64_t* y, unsigned* m, unsigned* d) {
  z += 719468;
  const int64_t era = (z >= 0 ? z : z - 146096) / 146097;
  const auto doe = static_cast<unsigned>(z - era * 146097);
  const unsigned yoe = (doe - doe / 1460 + doe / 36524 - doe / 146096) / 365;
  const unsigned doy = doe - (365 * yoe + yoe / 4 - yoe / 100);
  const unsigned mp = (5 * doy + 2) / 153;
  *d = doy - (153 * mp + 2) / 5 + 1;
  *m = mp < 10 ? mp + 3 : mp - 9;
  *y = static_cast<int64_t>(yoe) + era * 400 + (*m <= 2);
}

bool ValidCalendar(const SystemTime& st) {
  static const int kDays[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  if (st.month < 1 || st.month > 12 || st.day < 1) return false;
  const bool leap = (st.year % 4 == 0 && st.year % 100 != 0) || st.year % 400 == 0;
  const int days = kDays[st.month - 1] + (st.month == 2 && leap ? 1 : 0);
  return st.day <= days && st.hour <= 23 && st.minute <= 59 && st.second <= 59 &&
         st.milliseconds <= 999;
}

constexpr int64_t kOleEpochDays = -25569;  // 1899-12-30 relative to 1970-01-01

}  // namespace

SystemTime Env::LocalNow() {
  struct timespec ts;
  clock_gettime(CLOCK_REALTIME, &ts);
  struct tm tm;
  localtime_r(&ts.tv_sec, &tm);
  return FromTm(tm, static_cast<int>(ts.tv_nsec / 1000000));
}

SystemTime Env::UtcNow() {
  struct timespec ts;
  clock_gettime(CLOCK_REALTIME, &ts);
  struct tm tm;
  gmtime_r(&ts.tv_sec, &tm);
  return FromTm(tm, static_cast<int>(ts.tv_nsec / 1000000));
}

int32_t Env::CurrentBiasMinutes() {
  const time_t now = time(nullptr);
  struct tm tm;
  localtime_r(&now, &tm);
  return static_cast<int32_t>(-tm.tm_gmtoff / 60);
}

std::optional<SystemTime> Env::UtcToLocal(const SystemTime& utc) {
  // SystemTimeToFileTime refuses years before 1601 and invalid fields.
  if (utc.year < 1601 || utc.year > 30827 || !ValidCalendar(utc)) return std::nullopt;
  const int64_t days = DaysFromCivil(utc.year, utc.month, utc.day);
  const time_t t = static_cast<time_t>(days * 86400 + utc.hour * 3600 + utc.minute * 60 + utc.second);
  struct tm tm;
  if (localtime_r(&t, &tm) == nullptr) return std::nullopt;
  return FromTm(tm, utc.milliseconds);
}

std::u16string Env::TimestampText(const SystemTime& local) {
  struct tm tm = {};
  tm.tm_year = local.year - 1900;
  tm.tm_mon = local.month - 1;
  tm.tm_mday = local.day;
  tm.tm_hour = local.hour;
  tm.tm_min = local.minute;
  tm.tm_sec = local.second;
  tm.tm_wday = local.day_of_week;
  // The user's locale is the environment's (LC_ALL, then LC_TIME, then
  // LANG), not the process's: a host never calls setlocale, which would leave
  // every log in the C form. Loaded per line, so a changed environment counts
  // from the next line on, as on Windows. A name this machine has no locale
  // for gives the C form. The wide form decodes whatever character set the
  // locale writes its month names and era in.
  locale_t locale = newlocale(LC_TIME_MASK, "", static_cast<locale_t>(0));
  if (locale == static_cast<locale_t>(0)) locale = newlocale(LC_TIME_MASK, "C", static_cast<locale_t>(0));
  if (locale == static_cast<locale_t>(0)) return {};
  wchar_t buffer[128];
  const size_t n = wcsftime_l(buffer, sizeof buffer / sizeof buffer[0], L"%x %X", &tm, locale);
  freelocale(locale);
  if (n == 0) return {};
  return Utf32ToUtf16(std::u32string(buffer, buffer + n));
}

// The OLE Automation date as VarUdate/SystemTimeToVariantTime define it:
// whole days since 1899-12-30; before that date the fraction still counts
// forward in time (so -1.25 is 1899-12-29 06:00). Valid for years 100..9999.
std::optional<double> Env::SystemTimeToVariantTime(const SystemTime& st) {
  if (st.year < 100 || st.year > 9999 || !ValidCalendar(st)) return std::nullopt;
  const int64_t days = DaysFromCivil(st.year, st.month, st.day) - kOleEpochDays;
  const double fraction = (st.hour * 3600.0 + st.minute * 60.0 + st.second) / 86400.0;
  return days >= 0 ? static_cast<double>(days) + fraction : static_cast<double>(days) - fraction;
}

std::optional<SystemTime> Env::VariantTimeToSystemTime(double date) {
  // Limits of VariantTimeToSystemTime: 0100-01-01 to 9999-12-31.
  if (!std::isfinite(date) || date < -657434.0 || date >= 2958466.0) return std::nullopt;
  double whole = std::trunc(date);
  double fraction = std::fabs(date - whole);
  int64_t seconds = static_cast<int64_t>(std::llround(fraction * 86400.0));
  if (seconds >= 86400) {
    seconds -= 86400;
    whole += date >= 0 ? 1 : -1;
  }
  int64_t y;
  unsigned m, d;
  CivilFromDays(static_cast<int64_t>(whole) + kOleEpochDays, &y, &m, &d);
  SystemTime st;
  st.year = static_cast<uint16_t>(y);
  st.month = static_cast<uint16_t>(m);
  st.day = static_cast<uint16_t>(d);
  const int64_t days_since_epoch = static_cast<int64_t>(whole) + kOleEpochDays;
  st.day_of_week = static_cast<uint16_t>(((days_since_epoch % 7) + 7 + 4) % 7);  // 1970-01-01 was a Thursday
  st.hour = static_cast<uint16_t>(seconds / 3600);
  st.minute = static_cast<uint16_t>(seconds / 60 % 60);
  st.second = static_cast<uint16_t>(seconds % 60);
  return st;
}

}  // namespace asum::platform
