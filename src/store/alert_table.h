// The one table of the alert summary database: its row, its column names in
// table order and the exact statement that creates it. Other programs read
// this file, so the schema is fixed: no key, no index, nothing else.
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

// One alert row, in the table's column order.
struct AlertRow {
  std::u16string alert_action;
  std::u16string alert_type;
  std::u16string alert_name;
  std::u16string when;
  std::u16string threshold;
  std::u16string who;
  std::u16string operation;
  std::u16string component_name;
  std::u16string email_status;
  std::u16string server_name;
  std::u16string alert_path;
};

// "CREATE TABLE AlertDB (" and, per column, eight tabs, a blank, the quoted
// name, a tab, "TEXT NOT NULL" and "," (")" after the last): 411 characters,
// no trailing semicolon.
const std::u16string& CreateAlertTableSql();

}  // namespace asum
