// The retention purge: when the setting "Sch_Retention" is exactly "TRUE",
// delete every alert row whose "When" text sorts at or before midnight at the
// start of the day that lies "Sch_Retention_Val" days before today.
//
// Callable from any thread at once: each purge opens and closes its own
// connection, and waits for a writer up to the busy timeout. Failures give 0;
// nothing is thrown except std::bad_alloc.
#pragma once

#include <cstdint>
#include <string>

#include "platform/platform.h"
#include "store/busy_budget.h"

namespace asum {

// The day count of a "Sch_Retention_Val" text: every " Days" removed, the
// rest read as wcstol reads it ("7Days" gives 7, "1 Day" gives 1).
int32_t RetentionDays(const std::u16string& setting);

// "%02d/%02d/%02d 00:00:00" of the date `days` whole days before `now`
// (after it for a negative count). A date outside the years 100 to 9999 gives
// "-1/-1/-1 00:00:00".
std::u16string CutoffText(const platform::SystemTime& now, int32_t days);

// Deletes the rows at or before `cutoff` from the database in
// `install_folder`'s "Alert_Summary" folder (created with its table when
// missing). 1 when the DELETE ran, else 0.
int DeleteOldAlerts(const std::u16string& install_folder, const std::u16string& cutoff,
                    uint32_t busy_timeout_ms = kQueryBusyTimeoutMs);

// The whole purge with today's local date: 0 when retention is off, else the
// result of DeleteOldAlerts.
int RunRetentionProc(const std::u16string& install_folder, uint32_t busy_timeout_ms = kQueryBusyTimeoutMs);

}  // namespace asum
