// Turns the stored UTC message date into the local date the reader answers.
// Never fails: unusable fields are replaced from the current UTC time, an
// impossible day becomes 1, and a time the platform cannot convert comes back
// repaired but unconverted.
//
// Thread-safe.
#pragma once

#include "platform/platform.h"

namespace asum::mail {

// Field by field: a year outside 1960..2100, a month 0 or above 12, a day of
// week above 6, an hour above 23, a minute or second above 59 or a
// millisecond above 9999 takes that field of `utc_now`; then a day of 0 or
// beyond the month's length becomes 1.
platform::SystemTime RepairDate(platform::SystemTime date, const platform::SystemTime& utc_now);

// RepairDate with env.UtcNow(), then env.UtcToLocal.
platform::SystemTime LocalDate(const platform::SystemTime& utc_date, platform::Env& env);

// Days in a month of the Gregorian calendar (0 for a month outside 1..12).
int DaysInMonth(int year, int month);
// 0 for Sunday; only meaningful for a valid date.
int DayOfWeek(int year, int month, int day);

}  // namespace asum::mail
