#include "store/retention.h"

#include <cstdio>

#include "common/utf.h"
#include "store/retention_settings.h"
#include "store/setting_db_management.h"
#include "common/wide_number.h"

namespace asum {
namespace {

// Days since 1970-01-01 of a proleptic Gregorian date, and back.
int64_t DaysFromCivil(int64_t y, int64_t m, int64_t d) {
  y -= m <= 2;
  const int64_t era = (y >= 0 ? y : y - 399) / 400;
  const int64_t yoe = y - era * 400;
  const int64_t doy = (153 * (m + (m > 2 ? -3 : 9)) + 2) / 5 + d - 1;
  const int64_t doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
  return era * 146097 + doe - 719468;
}

void CivilFromDays(int64_t z, int64_t* y, int64_t* m, int64_t* d) {
  z += 719468;
  const int64_t era = (z >= 0 ? z : z - 146096) / 146097;
  const int64_t doe = z - era * 146097;
  const int64_t yoe = (doe - doe / 1460 + doe / 36524 - doe / 146096) / 365;
  const int64_t doy = doe - (365 * yoe + yoe / 4 - yoe / 100);
  const int64_t mp = (5 * doy + 2) / 153;
  *d = doy - (153 * mp + 2) / 5 + 1;
  *m = mp + (mp < 10 ? 3 : -9);
  *y = yoe + era * 400 + (*m <= 2);
}

}  // namespace

int32_t RetentionDays(const std::u16string& setting) {
  std::u16string text = setting;
  constexpr std::u16string_view kUnit = u" Days";
  for (size_t at = text.find(kUnit); at != std::u16string::npos; at = text.find(kUnit, at)) {
    text.erase(at, kUnit.size());
  }
  return WcstolBase10(text);
}

std::u16string CutoffText(const platform::SystemTime& now, int32_t days) {
  int64_t year = -1, month = -1, day = -1;
  if (now.month >= 1 && now.month <= 12 && now.day >= 1 && now.day <= 31) {
    CivilFromDays(DaysFromCivil(now.year, now.month, now.day) - days, &year, &month, &day);
  }
  // The date arithmetic of the host's date type only holds years 100 to 9999.
  if (year < 100 || year > 9999) year = month = day = -1;
  char text[64];
  std::snprintf(text, sizeof text, "%02d/%02d/%02d %02d:%02d:%02d", static_cast<int>(year),
                static_cast<int>(month), static_cast<int>(day), 0, 0, 0);
  return AsciiToUtf16(text);
}

int DeleteOldAlerts(const std::u16string& install_folder, const std::u16string& cutoff, uint32_t busy_timeout_ms) {
  BusyBudget budget(busy_timeout_ms);
  CSettingDBManagement store(&budget);
  const std::u16string path =
      DatabasePathOf(install_folder);
  if (!store.OpenDB(path)) return 0;
  const bool deleted = store.ExecuteQuery(u"DELETE FROM AlertDB WHERE \"When\" <= '" + cutoff + u"';");
  // Closed here: a connection left open would hold the file for the next caller.
  store.CloseDB();
  return deleted ? 1 : 0;
}

int RunRetentionProc(const std::u16string& install_folder, uint32_t busy_timeout_ms) {
  if (GetRetentionSetting(kRetentionEnabledSetting, kRetentionEnabledDefault) != u"TRUE") return 0;
  const int32_t days = RetentionDays(GetRetentionSetting(kRetentionDaysSetting, kRetentionDaysDefault));
  const std::u16string cutoff = CutoffText(platform::Current().LocalNow(), days);
  return DeleteOldAlerts(install_folder, cutoff, busy_timeout_ms);
}

}  // namespace asum
