#include "store/setting_db_management.h"

#include <gtest/gtest.h>

#include <algorithm>

#include "store/alert_table.h"
#include "store/retention.h"
#include "store_test_support.h"

namespace asum {
namespace {

using test::StoreDir;

TEST(AlertTable, CreateStatementIsExact) {
  const std::u16string tabs(8, u'\t');
  const std::u16string expected =
      u"CREATE TABLE AlertDB (" + tabs + u" \"Alert Action\"\tTEXT NOT NULL," + tabs +
      u" \"Alert Type\"\tTEXT NOT NULL," + tabs + u" \"Alert Name\"\tTEXT NOT NULL," + tabs +
      u" \"When\"\tTEXT NOT NULL," + tabs + u" \"Threshold\"\tTEXT NOT NULL," + tabs + u" \"Who\"\tTEXT NOT NULL," +
      tabs + u" \"Operation\"\tTEXT NOT NULL," + tabs + u" \"Component Name\"\tTEXT NOT NULL," + tabs +
      u" \"EmailStatus\"\tTEXT NOT NULL," + tabs + u" \"Server Name\"\tTEXT NOT NULL," + tabs +
      u" \"Alert Path\"\tTEXT NOT NULL)";
  EXPECT_EQ(CreateAlertTableSql().size(), 411u);
  EXPECT_EQ(CreateAlertTableSql(), expected);
}

TEST(AlertSummaryFolder, JoinsAndCreatesOneLevel) {
  test::TempDir dir;
  const std::u16string sep(1, platform::kPathSeparator);
  EXPECT_EQ(CSettingDBManagement::GetAlertSummaryFolder(dir.path()), dir.path() + sep + u"Alert_Summary");
  EXPECT_TRUE(platform::Current().PathExists(dir.path() + sep + u"Alert_Summary"));
  EXPECT_EQ(CSettingDBManagement::GetAlertSummaryFolder(dir.path() + sep), dir.path() + sep + u"Alert_Summary");
  // One level only: a missing parent is not created, and that is no error.
  EXPECT_EQ(CSettingDBManagement::GetAlertSummaryFolder(dir.Join(u"a\\b")), dir.Join(u"a\\b\\Alert_Summary"));
  EXPECT_FALSE(platform::Current().PathExists(dir.Join(u"a")));
  EXPECT_EQ(CSettingDBManagement::DatabasePath(u"F"), u"F" + sep + u"AlertSummaryDB.db");
}

TEST(OpenDB, FirstOpenCreatesFileAndTableSecondOnlyOpens) {
  test::CapturedLog log;
  StoreDir dir;
  const std::u16string path = CSettingDBManagement::DatabasePath(CSettingDBManagement::GetAlertSummaryFolder(dir.install()));
  {
    CSettingDBManagement store;
    EXPECT_TRUE(store.OpenDB(path));
  }
  EXPECT_EQ(dir.RowCount(), 0);
  {
    CSettingDBManagement store;
    EXPECT_TRUE(store.OpenDB(path)) << "the table exists: a second CREATE would fail";
    EXPECT_TRUE(store.CloseDB());
  }
  const auto messages = log.Messages();
  ASSERT_EQ(messages.size(), 2u);
  EXPECT_EQ(messages[0], u"Inside OpenDB function: " + path);
}

// The table is left alone in a file that already exists, even when empty.
TEST(OpenDB, ExistingDatabaseWithoutTheTableGetsIt) {
  StoreDir dir;
  test::WriteText(dir.db_path(), "");  // what a crash during the first creation leaves
  test::CapturedLog log;
  CSettingDBManagement store;
  EXPECT_TRUE(store.OpenDB(dir.db_path()));
  EXPECT_TRUE(store.FillDatainDB(u"", u"", u"", u"", u"", u"", u"", u"", u"", u"", u""));
  EXPECT_EQ(store.ExecuteScalar(u"SELECT count(*) FROM AlertDB"), u"1");
  EXPECT_EQ(store.ExecuteScalar(u"SELECT sql FROM sqlite_master WHERE name = 'AlertDB'"), CreateAlertTableSql());
  const auto messages = log.Messages();
  EXPECT_EQ(std::count(messages.begin(), messages.end(), u"AlertDB table missing in " + dir.db_path() + u"; created it"),
            1);
}

// Two first callers on a fresh install both find no file; the second one's
// CREATE TABLE then fails. Here the other caller makes file and table right
// after this caller's look.
class RacedFirstCall : public platform::Env {
 public:
  explicit RacedFirstCall(std::u16string db) : db_(std::move(db)) {}
  bool PathExists(const std::u16string& path) override {
    const bool exists = Env::PathExists(path);
    if (path == db_ && !raced_) {
      raced_ = true;
      test::RawConnection other(db_);
      EXPECT_EQ(other.Exec(test::Narrow(CreateAlertTableSql()).c_str()), SQLITE_OK);
    }
    return exists;
  }

 private:
  std::u16string db_;
  bool raced_ = false;
};

TEST(OpenDB, TwoFirstCallersBothSucceed) {
  struct Case {
    const char* caller;
    int (*call)(const StoreDir& dir);
  };
  const Case cases[] = {
      {"OpenDB", [](const StoreDir& dir) { return static_cast<int>(CSettingDBManagement().OpenDB(dir.db_path())); }},
      {"purge", [](const StoreDir& dir) { return DeleteOldAlerts(dir.install(), u"2001/01/01 00:00:00"); }},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.caller);
    StoreDir dir;
    CSettingDBManagement::GetAlertSummaryFolder(dir.install());
    RacedFirstCall raced(dir.db_path());
    platform::ScopedEnv scope(&raced);
    EXPECT_EQ(c.call(dir), 1);
    EXPECT_EQ(dir.RowCount(), 0) << "the table is there";
  }
}

TEST(OpenDB, UnusableFilesFailWithoutCrashing) {
  StoreDir dir;
  test::WriteText(dir.db_path(), std::string(4096, 'j'));  // not a database
  CSettingDBManagement store;
  EXPECT_TRUE(store.OpenDB(dir.db_path())) << "opening reads nothing yet";
  EXPECT_FALSE(store.ExecuteQuery(u"DELETE FROM AlertDB"));
  EXPECT_EQ(store.ExecuteScalar(u"SELECT 1 FROM AlertDB"), u"");
  EXPECT_FALSE(store.OpenDB(dir.folder() + platform::NativeSeparators(u"\\missing\\AlertSummaryDB.db")));
}

TEST(ExecuteQuery, LogsFirstOutcomeAndRetriesSevenTimesInAll) {
  StoreDir dir;
  dir.Create();
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(dir.db_path()));
  test::CapturedLog log;
  EXPECT_TRUE(store.ExecuteQuery(u"DELETE FROM AlertDB"));
  EXPECT_FALSE(store.ExecuteQuery(u"DELETE FROM nothing"));
  // The same text again, after another program changed the schema: the
  // statement kept from the first run is stale, and the run still succeeds.
  EXPECT_TRUE(store.ExecuteQuery(u"DELETE FROM AlertDB"));
  EXPECT_EQ(test::RawConnection(dir.db_path()).Exec("CREATE TABLE other (x)"), SQLITE_OK);
  EXPECT_TRUE(store.ExecuteQuery(u"DELETE FROM AlertDB"));
  EXPECT_EQ(log.Messages(), (std::vector<std::u16string>{ExecuteQueryStatusLine(true), ExecuteQueryStatusLine(false),
                                                         ExecuteQueryStatusLine(true), ExecuteQueryStatusLine(true)}));
  EXPECT_EQ(ExecuteQueryStatusLine(false), u"Inside ExecuteQuery function - Status: failure");
}

TEST(FillDatainDB, ValuesLandInTheirColumns) {
  StoreDir dir;
  dir.Create();
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(dir.db_path()));
  // Alert path is the tenth parameter, server name the eleventh.
  ASSERT_TRUE(store.FillDatainDB(u"Email Alert", u"Type", u"Name", u"2024/03/05 14:07:09", u"N\\A", u"Who",
                                 u"Op", u"Comp", u"Delivered", u"P", u"S"));
  // Quotes, a NUL and text beyond the BMP: stored, cut at the NUL.
  ASSERT_TRUE(store.FillDatainDB(u"Script Alert", u"O'Brien's \"type\"", u"'; DROP TABLE AlertDB; --",
                                 std::u16string(u"2024\0junk", 9), u"", u"", u"", u"", u"", u"\U0001F600", u""));
  ASSERT_TRUE(store.FillDatainDB(u"", u"", u"", u"", u"", u"", u"", u"", u"", u"", u""));
  const auto rows = dir.Rows();
  ASSERT_EQ(rows.size(), 3u);
  EXPECT_EQ(rows[0], (std::vector<std::u16string>{u"Email Alert", u"Type", u"Name", u"2024/03/05 14:07:09", u"N\\A",
                                                  u"Who", u"Op", u"Comp", u"Delivered", u"S", u"P"}));
  EXPECT_EQ(rows[1][1], u"O'Brien's \"type\"");
  EXPECT_EQ(rows[1][2], u"'; DROP TABLE AlertDB; --");
  EXPECT_EQ(rows[1][3], u"2024");
  EXPECT_EQ(rows[1][10], u"\U0001F600");
  EXPECT_EQ(rows[2], std::vector<std::u16string>(11, u""));
}

}  // namespace
}  // namespace asum
