// An install folder for the whole-system fault tests: one component, alert files
// dropped into its report folders, and what became of them, read on connections of its own.
#pragma once

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <algorithm>
#include <map>
#include <string>
#include <vector>

#include "alert_generator.h"
#include "collect/cycle.h"
#include "store/setting_db_management.h"
#include "support/test_support.h"

namespace asum::test {

inline constexpr char16_t kSent[] = u"Main Component\\AlertReports\\Sent items";

class Install : public TempDir {
 public:
  Install() {  // the component and the database, so the first cycle does work
    WriteText(Join(u"Main Component\\info.dat"), "marker");
    EnsureDatabase(path());
  }
  std::u16string Drop(const std::u16string& folder, const std::u16string& name, const std::string& bytes) const {
    WriteText(Join(folder + u"\\" + name), bytes);
    return Join(folder + u"\\" + name);
  }
  // Generated alerts `from` to `to` - 1, spread over `folders` in turn; their paths.
  std::vector<std::u16string> DropAlerts(uint32_t from, uint32_t to,
                                         const std::vector<std::u16string>& folders = {kSent}) const {
    std::vector<std::u16string> paths;
    for (uint32_t i = from; i < to; ++i) {
      const gen::GeneratedAlert alert = gen::GenerateAlert(7, i, 3, false);
      paths.push_back(Drop(folders[i % folders.size()], U16(alert.file_name), alert.bytes));
    }
    return paths;
  }
  // Runs one SQL text on a connection of its own: the first column of each row.
  std::vector<std::u16string> Sql(const std::string& sql) const {
    std::vector<std::u16string> column;
    sqlite3* db = nullptr;
    sqlite3_stmt* st = nullptr;
    sqlite3_open16(DatabasePathOf(path()).c_str(), &db);
    if (sqlite3_prepare_v2(db, sql.c_str(), -1, &st, nullptr) != SQLITE_OK) ADD_FAILURE() << sql << sqlite3_errmsg(db);
    while (st != nullptr && sqlite3_step(st) == SQLITE_ROW) {
      column.emplace_back(static_cast<const char16_t*>(sqlite3_column_text16(st, 0)));
    }
    sqlite3_finalize(st);
    sqlite3_close(db);
    return column;
  }
};

// Where each file ended; the integrity check is part of the reading.
// kMarked, kStored, kStoredTwice: PROC_ name and 0, 1, 2 rows; kLeft: own name, no row.
enum End { kMarked, kStored, kStoredTwice, kLeft, kHalfDone };
inline std::vector<End> EndsOf(const Install& install, const std::vector<std::u16string>& paths) {
  std::map<std::u16string, int> rows;
  for (const std::u16string& path : install.Sql("SELECT \"Alert Path\" FROM AlertDB")) ++rows[path];
  EXPECT_EQ(install.Sql("PRAGMA integrity_check"), std::vector<std::u16string>{u"ok"});
  std::vector<End> ends;
  for (const std::u16string& p : paths) {
    platform::Env& env = platform::Env::Default();
    const bool named = env.PathExists(p), marked = env.PathExists(ProcName(p));
    const int n = rows[p];
    ends.push_back(named ? (marked || n > 0 ? kHalfDone : kLeft) : !marked || n > 2 ? kHalfDone : End(n));
    if (ends.back() == kHalfDone) ADD_FAILURE() << Narrow(p) << ": " << marked << " marked, " << n << " row(s)";
  }
  return ends;
}
inline int Count(const std::vector<End>& ends, End end) { return std::count(ends.begin(), ends.end(), end); }

}  // namespace asum::test
