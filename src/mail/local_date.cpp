#include "mail/local_date.h"

namespace asum::mail {
namespace {

constexpr int kFirstYear = 1960;
constexpr int kLastYear = 2100;
constexpr int kMaxMilliseconds = 9999;

}  // namespace

int DaysInMonth(int year, int month) {
  static constexpr int kDays[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  if (month < 1 || month > 12) return 0;
  const bool leap = (year % 4 == 0 && year % 100 != 0) || year % 400 == 0;
  return kDays[month - 1] + (month == 2 && leap ? 1 : 0);
}

int DayOfWeek(int year, int month, int day) {
  // Sakamoto's method.
  static constexpr int kOffsets[] = {0, 3, 2, 5, 0, 3, 5, 1, 4, 6, 2, 4};
  if (month < 3) year -= 1;
  return (year + year / 4 - year / 100 + year / 400 + kOffsets[month - 1] + day) % 7;
}

platform::SystemTime RepairDate(platform::SystemTime date, const platform::SystemTime& utc_now) {
  if (date.year < kFirstYear || date.year > kLastYear) date.year = utc_now.year;
  if (date.month == 0 || date.month > 12) date.month = utc_now.month;
  if (date.day_of_week > 6) date.day_of_week = utc_now.day_of_week;
  if (date.hour > 23) date.hour = utc_now.hour;
  if (date.minute > 59) date.minute = utc_now.minute;
  if (date.second > 59) date.second = utc_now.second;
  if (date.milliseconds > kMaxMilliseconds) date.milliseconds = utc_now.milliseconds;
  if (date.day == 0 || date.day > DaysInMonth(date.year, date.month)) date.day = 1;
  return date;
}

platform::SystemTime LocalDate(const platform::SystemTime& utc_date, platform::Env& env) {
  platform::SystemTime repaired = RepairDate(utc_date, env.UtcNow());
  // The conversion refuses milliseconds above 999, which the repair allows.
  if (repaired.milliseconds > 999) repaired.milliseconds = 0;
  std::optional<platform::SystemTime> local = env.UtcToLocal(repaired);
  return local ? *local : repaired;
}

}  // namespace asum::mail
