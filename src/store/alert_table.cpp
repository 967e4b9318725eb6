#include "store/alert_table.h"

namespace asum {

const std::u16string& CreateAlertTableSql() {
  static const std::u16string* const sql = [] {
    auto* text = new std::u16string(u"CREATE TABLE AlertDB (");
    for (size_t i = 0; i < kAlertColumnCount; ++i) {
      *text += std::u16string(8, u'\t');
      *text += u" \"";
      *text += kAlertColumns[i];
      *text += u"\"\tTEXT NOT NULL";
      *text += (i + 1 < kAlertColumnCount) ? u"," : u")";
    }
    return text;
  }();
  return *sql;
}

}  // namespace asum
