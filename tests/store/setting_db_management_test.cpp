#include "store/setting_db_management.h"

#include "store/alert_table.h"
#include "store_test_support.h"

namespace asum {
namespace {

using Texts = std::vector<std::u16string>;

TEST(AlertTable, CreateStatementIsExact) {
  std::u16string expected = u"CREATE TABLE AlertDB (";
  for (const char16_t* column : {u"Alert Action", u"Alert Type", u"Alert Name", u"When", u"Threshold", u"Who",
                                 u"Operation", u"Component Name", u"EmailStatus", u"Server Name", u"Alert Path"}) {
    expected += std::u16string(8, u'\t') + u" \"" + column + u"\"\tTEXT NOT NULL,";
  }
  expected.back() = u')';
  EXPECT_EQ(CreateAlertTableSql(), expected);
}

TEST(AlertSummaryFolder, JoinsAndCreatesOneLevel) {
  test::TempDir dir;
  const std::u16string summary = dir.Join(u"Alert_Summary");
  EXPECT_EQ(CSettingDBManagement::GetAlertSummaryFolder(dir.path() + platform::kPathSeparator), summary);
  EXPECT_TRUE(platform::Current().PathExists(summary));
  EXPECT_EQ(CSettingDBManagement::GetAlertSummaryFolder(dir.Join(u"a\\b")), dir.Join(u"a\\b\\Alert_Summary"));
  EXPECT_FALSE(platform::Current().PathExists(dir.Join(u"a"))) << "one level only, and that is no error";
  EXPECT_EQ(CSettingDBManagement::DatabasePath(u"F"), u"F" + platform::NativeSeparators(u"\\AlertSummaryDB.db"));
}

// A new file gets the table; an existing database gets only a missing table
// (what a crash during the first creation leaves); a file that is no database
// is opened and never touched.
TEST(OpenDB, CreatesTheTableOnlyWhereItIsMissing) {
  test::StoreDir dir;
  const std::u16string path = dir.db_path();
  const std::string junk = "not a database, not SQLite at all";
  CSettingDBManagement::GetAlertSummaryFolder(dir.install());
  test::CapturedLog log;
  for (const char* content : {"(new)", "", "(kept)", junk.c_str()}) {
    if (*content != '(') test::WriteText(path, content);
    CSettingDBManagement store;
    EXPECT_TRUE(store.OpenDB(path)) << content;
    EXPECT_EQ(store.FillDatainDB(u"", u"", u"", u"", u"", u"", u"", u"", u"", u"", u""), content != junk) << content;
  }
  EXPECT_EQ(test::ReadText(path), junk);
  const std::u16string open = u"Inside OpenDB function: " + path, fill = u"Inside FillDatainDB function";
  const std::u16string ok = u"Inside ExecuteQuery function - Status: success";
  EXPECT_EQ(log.Messages(), (Texts{open, fill, ok, open, u"AlertDB table missing in " + path + u"; created it", fill,
                                   ok, open, fill, ok, open, fill, u"Inside ExecuteQuery function - Status: failure"}));
  EXPECT_FALSE(CSettingDBManagement().OpenDB(dir.install() + platform::NativeSeparators(u"\\no\\such.db")));
}

// Two first callers on a fresh install both find no file; the second one's
// CREATE TABLE then fails. Here the other caller makes file and table right
// after this caller's look.
class RacedFirstCall : public platform::Env {
 public:
  explicit RacedFirstCall(std::u16string db) : db_(std::move(db)) {}
  bool PathExists(const std::u16string& path) override {
    const bool exists = Env::PathExists(path);
    if (path == db_ && !std::exchange(raced_, true)) {
      EXPECT_EQ(test::RawConnection(db_).Exec(test::Narrow(CreateAlertTableSql()).c_str()), SQLITE_OK);
    }
    return exists;
  }

 private:
  std::u16string db_;
  bool raced_ = false;
};

TEST(OpenDB, TwoFirstCallersBothSucceed) {
  test::StoreDir dir;
  CSettingDBManagement::GetAlertSummaryFolder(dir.install());
  RacedFirstCall raced(dir.db_path());
  platform::ScopedEnv scope(&raced);
  EXPECT_TRUE(CSettingDBManagement().OpenDB(dir.db_path()));
}

// Seven attempts, each compiling the text afresh; ExecuteScalar makes one. A
// statement that ran is kept for the same text, and compiled anew when a
// schema change made it stale.
TEST(ExecuteQuery, MakesSevenAttemptsAndLogsOnlyTheFirst) {
  test::StoreDir dir;
  dir.Create();
  test::RawConnection other(dir.db_path());
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(dir.db_path()));
  test::CapturedLog log;
  const auto attempts = [&](const auto& run) {
    const uint64_t before = store.Connection().StatementsPrepared();
    run();
    return store.Connection().StatementsPrepared() - before;
  };
  EXPECT_EQ(attempts([&] { EXPECT_TRUE(store.ExecuteQuery(u"DELETE FROM AlertDB")); }), 1u);
  EXPECT_EQ(attempts([&] { EXPECT_FALSE(store.ExecuteQuery(u"DELETE FROM nothing")); }), 7u);
  ASSERT_EQ(other.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);  // busy, and no allowance to wait
  EXPECT_EQ(attempts([&] { EXPECT_FALSE(store.FillDatainDB(u"", u"", u"", u"", u"", u"", u"", u"", u"", u"", u"")); }),
            7u);
  EXPECT_EQ(attempts([&] { EXPECT_EQ(store.ExecuteScalar(u"SELECT count(*) FROM AlertDB"), u""); }), 1u);
  other.Exec("ROLLBACK");
  EXPECT_EQ(attempts([&] { EXPECT_TRUE(store.ExecuteQuery(u"DELETE FROM AlertDB")); }), 0u);
  ASSERT_EQ(other.Exec("CREATE TABLE other (x)"), SQLITE_OK);
  EXPECT_EQ(attempts([&] { EXPECT_TRUE(store.ExecuteQuery(u"DELETE FROM AlertDB")); }), 1u);
  const std::u16string ok = u"Inside ExecuteQuery function - Status: success",
                       failed = u"Inside ExecuteQuery function - Status: failure";
  EXPECT_EQ(log.Messages(), (Texts{ok, failed, u"Inside FillDatainDB function", failed, ok, ok}));
}

TEST(FillDatainDB, ValuesLandInTheirColumns) {
  test::StoreDir dir;
  dir.Create();
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(dir.db_path()));
  // Alert path is the tenth parameter, server name the eleventh; quotes are
  // stored as they are, and a value ends at its NUL.
  ASSERT_TRUE(store.FillDatainDB(u"Email Alert", u"Type", u"Name", u"2024/03/05 14:07:09", u"N\\A", u"Who", u"Op",
                                 u"Comp", u"Delivered", u"P", u"S"));
  ASSERT_TRUE(store.FillDatainDB(u"A", u"O'Brien's \"type\"", u"'; DROP TABLE AlertDB; --",
                                 std::u16string(u"2024\0junk", 9), u"", u"", u"", u"", u"", u"\U0001F600", u""));
  EXPECT_EQ(dir.Column("\"Alert Action\"||'|'||\"Alert Type\"||'|'||\"Alert Name\"||'|'||\"When\"||'|'||\"Threshold\""
                       "||'|'||\"Who\"||'|'||\"Operation\"||'|'||\"Component Name\"||'|'||\"EmailStatus\"||'|'||"
                       "\"Server Name\"||'|'||\"Alert Path\""),
            (Texts{u"Email Alert|Type|Name|2024/03/05 14:07:09|N\\A|Who|Op|Comp|Delivered|S|P",
                   u"A|O'Brien's \"type\"|'; DROP TABLE AlertDB; --|2024|||||||\U0001F600"}));
}

}  // namespace
}  // namespace asum
