#include "store/sqlite_db.h"

#include "store_test_support.h"

namespace asum {
namespace {

TEST(CSqlStatement, StepsTheFirstStatementAndResetsIt) {
  test::TempDir dir;
  CDbSQLite db;
  ASSERT_TRUE(db.Open(dir.Join(u"t.db")));
  ASSERT_TRUE(db.Statement(u"CREATE TABLE t (v TEXT)")->Execute());
  const struct {
    const char16_t* sql;
    bool execute;
  } cases[] = {
      {u"INSERT INTO t VALUES('x\u00e9\U0001F600'); INSERT INTO t VALUES('b')", true},  // the first one only
      {u"", false}, {u"-- only a comment", false}, {u"SELEC nonsense", false},
      {u"INSERT INTO missing VALUES(1)", false},
  };
  for (const auto& c : cases) EXPECT_EQ(db.Statement(c.sql)->Execute(), c.execute) << test::Narrow(c.sql);
  auto rows = db.Statement(u"SELECT v, NULL, 42 FROM t");
  ASSERT_TRUE(rows->NextRow());
  EXPECT_EQ(rows->ValueString(0) + u"|" + rows->ValueString(1) + u"|" + rows->ValueString(2) + u"|" +
                rows->ValueString(7), u"x\u00e9\U0001F600||42|");
  EXPECT_FALSE(rows->NextRow()) << "one row only";
  // Run to a row and reset, a statement holds no read lock: another program
  // can take the database for itself while the statement still lives.
  auto select = db.Statement(u"SELECT v FROM t UNION ALL SELECT v FROM t");
  ASSERT_TRUE(select->Execute());
  test::RawConnection other(dir.Join(u"t.db"));
  EXPECT_EQ(other.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
  EXPECT_EQ(other.Exec("COMMIT"), SQLITE_OK);
  EXPECT_TRUE(rows->NextRow()) << "the reset statement starts over";
}

TEST(CDbSQLite, CloseFinalizesLiveStatementsWhichThenFailSafely) {
  test::TempDir dir;
  CDbSQLite db;
  EXPECT_TRUE(db.Close()) << "closing nothing";
  EXPECT_FALSE(db.Open(dir.Join(u"missing\\sub\\t.db")));
  EXPECT_FALSE(db.Open(dir.path())) << "a folder is not a database";
  EXPECT_FALSE(db.IsOpen());
  ASSERT_TRUE(db.Open(dir.Join(u"t.db")));
  auto open_read = db.Statement(u"SELECT 1 UNION SELECT 2");
  ASSERT_TRUE(open_read->NextRow());  // left on its row: the connection is busy
  auto never_stepped = db.Statement(u"SELECT 1");
  EXPECT_TRUE(db.Close());
  EXPECT_FALSE(db.IsOpen());
  EXPECT_FALSE(open_read->NextRow());
  EXPECT_FALSE(never_stepped->Execute());
  EXPECT_EQ(open_read->ValueString(0), u"");
  open_read.reset();  // statements that outlive their connection go without touching it
  EXPECT_FALSE(db.Statement(u"SELECT 1")->Execute());
  ASSERT_TRUE(db.Open(dir.Join(u"t.db")));
  EXPECT_TRUE(db.Statement(u"CREATE TABLE t (v TEXT)")->Execute()) << "the file is free again";
  EXPECT_TRUE(db.Statement(u"INSERT INTO t VALUES('a')")->Execute());
  // The support tool's readers: nothing comes into being, nothing changes.
  EXPECT_FALSE(db.OpenReadOnly(dir.Join(u"new.db")));
  EXPECT_FALSE(platform::Current().PathExists(dir.Join(u"new.db")));
  ASSERT_TRUE(db.OpenReadOnly(dir.Join(u"t.db")));
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
