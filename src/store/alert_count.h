// The alert count query: how many stored alerts fall in a "When" range and
// match an action or type filter.
//
// The range text packs the two bounds around the marker "</FROM>", each inside
// a tag, e.g. "<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>"
// (an opening tag of four characters after the marker). Bounds and filter are
// bound as parameters; the filter keeps its LIKE meaning ("%" and "_" are
// wildcards, ASCII letter case is ignored).
//
// Callable from any thread at once: every count opens and closes its own
// connection. Every failure gives 0; nothing is thrown.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "store/busy_budget.h"

namespace asum {

struct RangeBounds {
  std::u16string lower;
  std::u16string upper;
  bool has_date_condition = true;  // false when the marker stands at position 0
};

RangeBounds SplitRange(const std::u16string& range);

struct CountStatement {
  std::u16string sql;                  // with ?1.. for the values
  std::vector<std::u16string> params;  // lower and upper bound (when present), then the filter
};

// "SELECT Count(*) FROM AlertDB WHERE" + the date condition (unless the
// marker stands at 0) + the filter condition on "Alert Action" (filter holds
// "Script Alert" or "Email Alert") or "Alert Type".
CountStatement BuildCountStatement(const std::u16string& filter, const std::u16string& range);

// Opens the database in `install_folder`'s "Alert_Summary" folder (creating
// folder, file and table when missing), counts, closes. A writer holding the
// database is waited for up to `busy_timeout_ms`.
int CountAlerts(const std::u16string& install_folder, const std::u16string& filter, const std::u16string& range,
                uint32_t busy_timeout_ms = kQueryBusyTimeoutMs);

}  // namespace asum
