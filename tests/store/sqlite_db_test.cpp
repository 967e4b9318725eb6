#include "store/sqlite_db.h"

#include "store_test_support.h"

namespace asum {
namespace {

class SqliteDbTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(db_.Open(dir_.Join(u"t.db")));
    ASSERT_TRUE(db_.Statement(u"CREATE TABLE t (v TEXT)")->Execute());
  }
  std::u16string Count() {
    auto s = db_.Statement(u"SELECT count(*) FROM t");
    return s->NextRow() ? s->ValueString(0) : u"none";
  }
  test::TempDir dir_;
  CDbSQLite db_;
};

TEST_F(SqliteDbTest, ExecuteStepsTheFirstStatementOnce) {
  const struct {
    const char16_t* sql;
    bool execute;
    const char16_t* rows_after;
  } cases[] = {
      {u"INSERT INTO t VALUES('a'); INSERT INTO t VALUES('b')", true, u"1"},  // only the first statement
      {u"SELECT 1 UNION SELECT 2", true, u"1"},
      {u"", false, u"1"},                                                   // nothing to compile
      {u"-- only a comment", false, u"1"},
      {u"SELEC nonsense", false, u"1"},
      {u"INSERT INTO missing VALUES(1)", false, u"1"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(db_.Statement(c.sql)->Execute(), c.execute) << test::Narrow(c.sql);
    EXPECT_EQ(Count(), c.rows_after) << test::Narrow(c.sql);
  }
}

// A statement that Execute or NextRow ran to a row or to the end is reset:
// it holds no read lock, so another program can write while it still lives.
TEST_F(SqliteDbTest, SteppedStatementsAreResetAndLockNothing) {
  ASSERT_TRUE(db_.Statement(u"INSERT INTO t VALUES('x\u00e9\U0001F600')")->Execute());
  auto rows = db_.Statement(u"SELECT v, NULL, 42 FROM t");
  ASSERT_TRUE(rows->NextRow());
  EXPECT_EQ(rows->ValueString(0), u"x\u00e9\U0001F600");
  EXPECT_EQ(rows->ValueString(1), u"");
  EXPECT_EQ(rows->ValueString(2), u"42");
  EXPECT_EQ(rows->ValueString(7), u"");
  EXPECT_FALSE(rows->NextRow());
  auto select = db_.Statement(u"SELECT v FROM t UNION ALL SELECT v FROM t");
  ASSERT_TRUE(select->Execute());
  test::RawConnection other(dir_.Join(u"t.db"));
  EXPECT_EQ(other.Exec("BEGIN EXCLUSIVE"), SQLITE_OK) << "a statement left on a row would hold a read lock";
  EXPECT_EQ(other.Exec("COMMIT"), SQLITE_OK);
  EXPECT_TRUE(rows->NextRow()) << "the reset statement starts over";
  EXPECT_TRUE(select->Execute());
}

TEST_F(SqliteDbTest, CloseFinalizesLiveStatementsWhichThenFailSafely) {
  auto open_read = db_.Statement(u"SELECT 1 UNION SELECT 2");
  ASSERT_TRUE(open_read->NextRow());  // left on its row: the connection is busy
  auto never_stepped = db_.Statement(u"SELECT 1");
  EXPECT_TRUE(db_.Close());
  EXPECT_FALSE(db_.IsOpen());
  EXPECT_FALSE(open_read->NextRow());
  EXPECT_FALSE(never_stepped->Execute());
  EXPECT_EQ(open_read->ValueString(0), u"");
  EXPECT_TRUE(db_.Close()) << "closing nothing";
  open_read.reset();  // the statements outlive the connection; going must not touch it
  never_stepped.reset();
  EXPECT_FALSE(db_.Statement(u"SELECT 1")->Execute());
  ASSERT_TRUE(db_.Open(dir_.Join(u"t.db")));
  EXPECT_TRUE(db_.Statement(u"INSERT INTO t VALUES('b')")->Execute()) << "the file is free again";
  EXPECT_FALSE(db_.Open(dir_.Join(u"missing\\sub\\t.db")));
  EXPECT_FALSE(db_.IsOpen());
  EXPECT_FALSE(db_.Open(dir_.path())) << "a folder is not a database";
}

}  // namespace
}  // namespace asum
