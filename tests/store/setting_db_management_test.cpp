#include "store/setting_db_management.h"

#include "store/alert_table.h"
#include "store_test_support.h"

namespace asum {
namespace {

using Texts = std::vector<std::u16string>;

TEST(AlertTable, CreateStatementIsExact) {
  const std::u16string tabs(8, u'\t');
  std::u16string expected = u"CREATE TABLE AlertDB (";
  for (const char16_t* column : {u"Alert Action", u"Alert Type", u"Alert Name", u"When", u"Threshold", u"Who",
                                 u"Operation", u"Component Name", u"EmailStatus", u"Server Name", u"Alert Path"}) {
    expected += tabs + u" \"" + column + u"\"\tTEXT NOT NULL,";
  }
  expected.back() = u')';
  EXPECT_EQ(CreateAlertTableSql(), expected);
  EXPECT_EQ(expected.size(), 411u);
}

TEST(AlertSummaryFolder, JoinsAndCreatesOneLevel) {
  test::TempDir dir;
  const std::u16string summary = dir.Join(u"Alert_Summary");
  EXPECT_EQ(CSettingDBManagement::GetAlertSummaryFolder(dir.path()), summary);
  EXPECT_TRUE(platform::Current().PathExists(summary));
  EXPECT_EQ(CSettingDBManagement::GetAlertSummaryFolder(dir.path() + platform::kPathSeparator), summary);
  EXPECT_EQ(CSettingDBManagement::GetAlertSummaryFolder(dir.Join(u"a\\b")), dir.Join(u"a\\b\\Alert_Summary"));
  EXPECT_FALSE(platform::Current().PathExists(dir.Join(u"a"))) << "one level only, and that is no error";
  EXPECT_EQ(CSettingDBManagement::DatabasePath(u"F"), u"F" + platform::NativeSeparators(u"\\AlertSummaryDB.db"));
}

// A new file gets the table; an existing database only a missing table (what
// a crash during the first creation leaves); a file that is no database is
// opened and never touched.
TEST(OpenDB, CreatesTheTableOnlyWhereItIsMissing) {
  test::StoreDir dir;
  const std::u16string path = dir.db_path();
  CSettingDBManagement::GetAlertSummaryFolder(dir.install());
  test::CapturedLog log;
  for (const char* content : {"(none)", "", "(kept)", "not a database, not SQLite at all"}) {
    if (std::string(content) != "(none)" && std::string(content) != "(kept)") test::WriteText(path, content);
    CSettingDBManagement store;
    EXPECT_TRUE(store.OpenDB(path)) << content;
    const bool database = std::string(content).find("not") == std::string::npos;
    EXPECT_EQ(store.FillDatainDB(u"", u"", u"", u"", u"", u"", u"", u"", u"", u"", u""), database) << content;
  }
  EXPECT_EQ(test::ReadText(path), "not a database, not SQLite at all");
  const std::u16string opened = u"Inside OpenDB function: " + path;
  const Texts want = {opened, u"Inside FillDatainDB function", ExecuteQueryStatusLine(true),
                      opened, u"AlertDB table missing in " + path + u"; created it", u"Inside FillDatainDB function",
                      ExecuteQueryStatusLine(true), opened, u"Inside FillDatainDB function",
                      ExecuteQueryStatusLine(true), opened, u"Inside FillDatainDB function",
                      ExecuteQueryStatusLine(false)};
  EXPECT_EQ(log.Messages(), want);
  EXPECT_FALSE(CSettingDBManagement().OpenDB(dir.install() + platform::NativeSeparators(u"\\no\\such.db")));
}

// Seven attempts, each compiling the text afresh, back to back; one log line
// after the first.
TEST(ExecuteQuery, MakesSevenAttemptsAndLogsTheFirst) {
  test::StoreDir dir;
  dir.Create();
  test::RawConnection other(dir.db_path());
  test::CapturedLog log;
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(dir.db_path()));
  const auto attempts = [&](const std::u16string& sql, bool want) {
    const uint64_t before = store.Connection().StatementsPrepared();
    EXPECT_EQ(store.ExecuteQuery(sql), want) << test::Narrow(sql);
    return store.Connection().StatementsPrepared() - before;
  };
  EXPECT_EQ(attempts(u"DELETE FROM AlertDB", true), 1u);
  EXPECT_EQ(attempts(u"DELETE FROM nothing", false), 7u);
  ASSERT_EQ(other.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
  EXPECT_EQ(attempts(u"DELETE FROM AlertDB", false), 7u) << "a busy database, no allowance to wait";
  EXPECT_EQ(store.ExecuteScalar(u"SELECT count(*) FROM AlertDB"), u"");
  EXPECT_EQ(store.Connection().StatementsPrepared(), 17u) << "ExecuteScalar: one attempt";
  EXPECT_EQ(log.Messages(), (Texts{u"Inside OpenDB function: " + dir.db_path(),
                                   u"Inside ExecuteQuery function - Status: success",
                                   u"Inside ExecuteQuery function - Status: failure",
                                   u"Inside ExecuteQuery function - Status: failure"}));
}

TEST(FillDatainDB, ValuesLandInTheirColumns) {
  test::StoreDir dir;
  dir.Create();
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(dir.db_path()));
  // Alert path is the tenth parameter, server name the eleventh.
  ASSERT_TRUE(store.FillDatainDB(u"Email Alert", u"Type", u"Name", u"2024/03/05 14:07:09", u"N\\A", u"Who", u"Op",
                                 u"Comp", u"Delivered", u"P", u"S"));
  // Quotes and text beyond the BMP are stored as they are; a value ends at its NUL.
  ASSERT_TRUE(store.FillDatainDB(u"Script Alert", u"O'Brien's \"type\"", u"'; DROP TABLE AlertDB; --",
                                 std::u16string(u"2024\0junk", 9), u"", u"", u"", u"", u"", u"\U0001F600", u""));
  EXPECT_EQ(dir.Rows(), (std::vector<test::Row>{
                            {u"Email Alert", u"Type", u"Name", u"2024/03/05 14:07:09", u"N\\A", u"Who", u"Op", u"Comp",
                             u"Delivered", u"S", u"P"},
                            {u"Script Alert", u"O'Brien's \"type\"", u"'; DROP TABLE AlertDB; --", u"2024", u"", u"",
                             u"", u"", u"", u"", u"\U0001F600"}}));
}

}  // namespace
}  // namespace asum
