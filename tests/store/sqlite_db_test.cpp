#include "store/sqlite_db.h"

#include <gtest/gtest.h>

#include "store_test_support.h"

namespace asum {
namespace {

class SqliteDbTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(db_.Open(dir_.Join(u"t.db")));
    ASSERT_TRUE(db_.Statement(u"CREATE TABLE t (v TEXT)")->Execute());
  }
  int64_t Count() {
    auto s = db_.Statement(u"SELECT count(*) FROM t");
    return s->NextRow() ? std::stoll(test::Narrow(s->ValueString(0))) : -1;
  }
  test::TempDir dir_;
  CDbSQLite db_;
};

TEST_F(SqliteDbTest, StepResultsFollowTheRowDoneAndErrorRules) {
  struct Case {
    const char16_t* sql;
    bool execute;
    int64_t rows_after;
  } cases[] = {
      {u"INSERT INTO t VALUES('a'); INSERT INTO t VALUES('b')", true, 1},  // only the first statement
      {u"SELECT 1", true, 1},                                            // a SELECT is stepped once and reset
      {u"", false, 1},                                                   // nothing to compile
      {u"-- only a comment", false, 1},
      {u"SELEC nonsense", false, 1},
      {u"INSERT INTO missing VALUES(1)", false, 1},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(db_.Statement(c.sql)->Execute(), c.execute) << test::Narrow(c.sql);
    EXPECT_EQ(Count(), c.rows_after) << test::Narrow(c.sql);
  }
}

TEST_F(SqliteDbTest, NextRowWalksRowsThenResets) {
  ASSERT_TRUE(db_.Statement(u"INSERT INTO t VALUES('x\u00e9\U0001F600')")->Execute());
  auto none = db_.Statement(u"SELECT v FROM t WHERE 0");
  EXPECT_FALSE(none->NextRow());
  EXPECT_FALSE(none->NextRow()) << "reset after the end: stepping again gives the end again";
  EXPECT_EQ(none->ValueString(0), u"");

  auto one = db_.Statement(u"SELECT v, NULL, 42 FROM t");
  ASSERT_TRUE(one->NextRow());
  EXPECT_EQ(one->ValueString(0), u"x\u00e9\U0001F600");
  EXPECT_EQ(one->ValueString(1), u"");
  EXPECT_EQ(one->ValueString(2), u"42");
  EXPECT_EQ(one->ValueString(7), u"");
  EXPECT_FALSE(one->NextRow());
  EXPECT_TRUE(one->NextRow()) << "the reset statement starts over";
}

TEST_F(SqliteDbTest, CloseFinalizesLiveStatementsWhichThenFailSafely) {
  EXPECT_TRUE(db_.Statement(u"INSERT INTO t VALUES('a')")->Execute());
  auto open_read = db_.Statement(u"SELECT v FROM t");
  ASSERT_TRUE(open_read->NextRow());  // left on its row: the connection is busy
  auto never_stepped = db_.Statement(u"SELECT 1");
  EXPECT_TRUE(db_.Close());
  EXPECT_FALSE(db_.IsOpen());
  EXPECT_FALSE(open_read->NextRow());
  EXPECT_FALSE(never_stepped->Execute());
  EXPECT_EQ(open_read->ValueString(0), u"");
  EXPECT_TRUE(db_.Close()) << "closing nothing";
  // The statements outlive the connection; their destruction must not touch it.
  open_read.reset();
  never_stepped.reset();
  EXPECT_FALSE(db_.Statement(u"SELECT 1")->Execute());
  // The file is free again: a new connection writes to it.
  ASSERT_TRUE(db_.Open(dir_.Join(u"t.db")));
  EXPECT_TRUE(db_.Statement(u"INSERT INTO t VALUES('b')")->Execute());
  EXPECT_EQ(Count(), 2);
}

TEST(SqliteDbOpen, FailingOpenLeavesNothingOpen) {
  test::TempDir dir;
  CDbSQLite db;
  EXPECT_FALSE(db.Open(dir.Join(u"missing\\sub\\t.db")));
  EXPECT_FALSE(db.IsOpen());
  EXPECT_FALSE(db.Open(dir.path())) << "a folder is not a database";
  EXPECT_FALSE(db.Statement(u"SELECT 1")->NextRow());
}

// The support tool's readers open the store this way: nothing may come into
// being and nothing may change, whatever statement runs.
TEST(SqliteDbOpen, ReadOnlyOpenCreatesAndChangesNothing) {
  test::TempDir dir;
  const std::u16string path = dir.Join(u"t.db");
  CDbSQLite db;
  EXPECT_FALSE(db.OpenReadOnly(path));
  EXPECT_FALSE(platform::Current().PathExists(path));
  ASSERT_TRUE(db.Open(path));
  ASSERT_TRUE(db.Statement(u"CREATE TABLE t (v TEXT)")->Execute());
  ASSERT_TRUE(db.Statement(u"INSERT INTO t VALUES('a')")->Execute());
  ASSERT_TRUE(db.OpenReadOnly(path));
  for (const char16_t* change : {u"INSERT INTO t VALUES('b')", u"DELETE FROM t", u"CREATE INDEX i ON t (v)",
                                 u"CREATE TABLE u (v TEXT)", u"PRAGMA user_version = 5"}) {
    EXPECT_FALSE(db.Statement(change)->Execute()) << test::Narrow(change);
  }
  auto read = db.Statement(u"SELECT group_concat(v) || count(*) FROM t");
  ASSERT_TRUE(read->NextRow());
  EXPECT_EQ(read->ValueString(0), u"a1");
}

}  // namespace
}  // namespace asum
