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
  for (const char16_t* change : {u"INSERT INTO t VALUES('b')", u"CREATE TABLE u (v TEXT)"}) {
    EXPECT_FALSE(db.Statement(change)->Execute()) << test::Narrow(change);
  }
  auto read = db.Statement(u"SELECT group_concat(v) || count(*) FROM t");
  ASSERT_TRUE(read->NextRow());
  EXPECT_EQ(read->ValueString(0), u"a1");
}

// Lets another program commit as soon as a statement waits for it; once its lock
// is `held`, only when a spent allowance still waits (else that wait never ends).
class CommitWhenWaitedFor : public BusyBudget {
 public:
  CommitWhenWaitedFor(test::RawConnection* holder, uint32_t ms) : BusyBudget(ms), holder_(holder) {}
  void Charge(uint64_t ms) override {
    const bool late = Exhausted();
    BusyBudget::Charge(ms);
      if ((!held || late) && sqlite3_get_autocommit(holder_->get()) == 0) holder_->Exec("COMMIT");
  }
  bool held = false;

 private:
  test::RawConnection* holder_;
};

// A statement waits for another program's lock while its allowance lasts;
// once the allowance is spent, every later lock conflict fails at once, so a
// database held for minutes costs a cycle its allowance once, not per file.
TEST(BusyBudget, StatementsWaitForAWriterWithinTheAllowance) {
  test::StoreDir dir;
  dir.Create();
  test::RawConnection writer(dir.db_path());
  CommitWhenWaitedFor budget(&writer, kQueryBusyTimeoutMs);
  CSettingDBManagement store(&budget);
  ASSERT_TRUE(store.OpenDB(dir.db_path()));
  const auto hold = [&] {
    EXPECT_EQ(writer.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
    EXPECT_EQ(writer.Exec("INSERT INTO AlertDB VALUES('Email Alert','T','N','2024/03/03','','','','','','','')"), 0);
  };
  hold();
  EXPECT_EQ(store.ExecuteScalar(u"SELECT count(*) FROM AlertDB"), u"1") << "the writer's row, once it commits";
  hold();
  EXPECT_TRUE(store.FillDatainDB(u"", u"", u"", u"", u"", u"", u"", u"", u"", u"", u""));
  EXPECT_EQ(dir.Column().size(), 3u);

  ASSERT_EQ(writer.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
  CommitWhenWaitedFor cycle(&writer, 50);
  cycle.held = true;
  for (int file = 0; file < 3; ++file) {
    CSettingDBManagement per_file(&cycle);
    per_file.OpenDB(dir.db_path());
    EXPECT_FALSE(per_file.FillDatainDB(u"", u"", u"", u"", u"", u"", u"", u"", u"", u"", u""));
    EXPECT_TRUE(cycle.Exhausted());
  }
}

}  // namespace
}  // namespace asum
