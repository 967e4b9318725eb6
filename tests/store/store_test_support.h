// Helpers of the store tests: a connection of another program, and an install
// folder whose database the test owns.
#pragma once

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <array>

#include "store/setting_db_management.h"
#include "support/test_support.h"

namespace asum::test {

// A connection of another program: no busy handler, so it fails at once.
class RawConnection {
 public:
  explicit RawConnection(const std::u16string& path) { EXPECT_EQ(sqlite3_open16(path.c_str(), &db_), SQLITE_OK); }
  ~RawConnection() { sqlite3_close_v2(db_); }  // a test that fails half-way leaves nothing locked
  int Exec(const char* sql) { return sqlite3_exec(db_, sql, nullptr, nullptr, nullptr); }
  sqlite3* get() const { return db_; }

 private:
  sqlite3* db_ = nullptr;
};

class StoreDir {
 public:
  const std::u16string& install() const { return dir_.path(); }
  std::u16string db_path() const { return dir_.Join(u"Alert_Summary\\AlertSummaryDB.db"); }
  // Creates folder, file and table through OpenDB when missing, and inserts
  // rows of (action, type, when) with "x" in every other column.
  void Create(const std::vector<std::array<std::u16string, 3>>& rows = {}) const {
    CSettingDBManagement store;
    ASSERT_TRUE(store.OpenDB(DatabasePathOf(install())));
    store.ExecuteQuery(u"BEGIN");
    for (const auto& [action, type, when] : rows) {
      EXPECT_TRUE(store.FillDatainDB(action, type, u"x", when, u"x", u"x", u"x", u"x", u"x", u"x", u"x"));
    }
    store.ExecuteQuery(u"COMMIT");
  }
  // An SQL expression over every row, in table order.
  std::vector<std::u16string> Column(const char* expression = "\"When\"") const {
    std::vector<std::u16string> column;
    RawConnection raw(db_path());
    sqlite3_stmt* stmt = nullptr;
    sqlite3_prepare_v2(raw.get(), (std::string("SELECT ") + expression + " FROM AlertDB").c_str(), -1, &stmt, nullptr);
    while (stmt != nullptr && sqlite3_step(stmt) == SQLITE_ROW) {
      column.emplace_back(static_cast<const char16_t*>(sqlite3_column_text16(stmt, 0)));
    }
    sqlite3_finalize(stmt);
    return column;
  }

 private:
  TempDir dir_;
};

}  // namespace asum::test
