// The one table of the alert summary database: its column names in table
// order and the exact statement that creates it. Other programs read this file,
// so the schema is fixed: no key, no index, nothing else.
#pragma once

#include <array>
#include <string>

namespace asum {

inline constexpr size_t kAlertColumnCount = 11;

// Column order of the alert row; FillDatainDB binds in this order.
inline constexpr std::array<const char16_t*, kAlertColumnCount> kAlertColumns = {
    u"Alert Action", u"Alert Type",     u"Alert Name",  u"When",        u"Threshold", u"Who",
    u"Operation",    u"Component Name", u"EmailStatus", u"Server Name", u"Alert Path",
};

// "CREATE TABLE AlertDB (" and, per column, eight tabs, a blank, the quoted
// name, a tab, "TEXT NOT NULL" and "," (")" after the last): 411 characters,
// no trailing semicolon.
const std::u16string& CreateAlertTableSql();

}  // namespace asum
