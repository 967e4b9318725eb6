// Another program's lock on the database: statements wait for it within
// their allowance instead of failing (the faults tests run callers at once).
#include "store/setting_db_management.h"
#include "store_test_support.h"

namespace asum {
namespace {

bool InsertOne(const test::StoreDir& dir, BusyBudget* budget, const std::u16string& when) {
  CSettingDBManagement store(budget);
  return store.OpenDB(dir.db_path()) && store.FillDatainDB(u"Email Alert", u"T", u"N", when, u"No", u"", u"", u"",
                                                           u"Delivered", u"p", u"s");
}

// Lets the other program commit as soon as a statement has to wait for it.
class CommitWhenWaitedFor : public BusyBudget {
 public:
  explicit CommitWhenWaitedFor(test::RawConnection* holder) : BusyBudget(kQueryBusyTimeoutMs), holder_(holder) {}
  void Charge(uint64_t ms) override {
    BusyBudget::Charge(ms);
    ++waits;
    if (sqlite3_get_autocommit(holder_->get()) == 0) holder_->Exec("COMMIT");
  }
  int waits = 0;

 private:
  test::RawConnection* holder_;
};

// A statement waits for another program's lock while its allowance lasts;
// once the allowance is spent, every later lock conflict fails at once, so a
// database held for minutes costs a cycle its allowance once, not per file.
TEST(StoreConcurrency, StatementsWaitForAWriterWithinTheAllowance) {
  test::StoreDir dir;
  dir.Create();
  test::RawConnection writer(dir.db_path());
  CommitWhenWaitedFor budget(&writer);
  CSettingDBManagement store(&budget);
  ASSERT_TRUE(store.OpenDB(dir.db_path()));
  const auto hold = [&] {
    EXPECT_EQ(writer.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
    EXPECT_EQ(writer.Exec("INSERT INTO AlertDB VALUES('Email Alert','T','N','2024/03/03','','','','','','','')"), 0);
  };
  hold();
  EXPECT_EQ(store.ExecuteScalar(u"SELECT count(*) FROM AlertDB"), u"1") << "the writer's row, once it commits";
  hold();
  EXPECT_TRUE(store.ExecuteQuery(u"DELETE FROM AlertDB"));
  hold();
  EXPECT_TRUE(store.FillDatainDB(u"", u"", u"", u"", u"", u"", u"", u"", u"", u"", u""));
  EXPECT_EQ(budget.waits, 3);
  EXPECT_EQ(dir.Column().size(), 2u);

  ASSERT_EQ(writer.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);  // held for good now
  BusyBudget cycle(50);
  EXPECT_FALSE(InsertOne(dir, &cycle, u"2024/03/10 10:00:00"));
  EXPECT_TRUE(cycle.Exhausted());
  const uint64_t spent = cycle.SpentMs();
  for (int file = 0; file < 20; ++file) EXPECT_FALSE(InsertOne(dir, &cycle, u"2024/03/10 10:00:00"));
  EXPECT_EQ(cycle.SpentMs(), spent);
}

}  // namespace
}  // namespace asum
