// Several operations on one database at once: each has its own connection and
// waits for the others' locks, within its allowance, instead of failing.
#include <atomic>
#include <thread>

#include "store/alert_count.h"
#include "store/retention.h"
#include "store/setting_db_management.h"
#include "store_test_support.h"

namespace asum {
namespace {

bool InsertOne(const test::StoreDir& dir, BusyBudget* budget, const std::u16string& when) {
  CSettingDBManagement store(budget);
  return store.OpenDB(dir.db_path()) && store.FillDatainDB(u"Email Alert", u"T", u"N", when, u"No", u"", u"", u"",
                                                           u"Delivered", u"p", u"s");
}

TEST(StoreConcurrency, InsertCountAndPurgeAtOnceAllSucceed) {
  test::StoreDir dir;
  dir.Create(std::vector<std::array<std::u16string, 3>>(50, {u"Email Alert", u"T", u"2024/03/02 00:00:00"}));
  constexpr int kInserts = 120;
  std::atomic<bool> done{false};
  std::atomic<int> failures{0};
  std::thread inserter([&] {
    for (int i = 0; i < kInserts && failures == 0; ++i) {
      BusyBudget cycle(kProcessingBusyBudgetMs);
      if (!InsertOne(dir, &cycle, i % 2 ? u"2024/03/10 10:00:00" : u"2000/01/01 00:00:00")) ++failures;
    }
    done = true;
  });
  const auto counter = [&] {
    do {
      const int n = CountAlerts(dir.install(), u"Email Alert", u"<TO>2024/03/01</FROM><TO>2024/03/31</TO>");
      failures += n < 50 || n > 50 + kInserts / 2;
    } while (!done);
  };
  std::thread counter1(counter), counter2(counter), purger([&] {
    do failures += DeleteOldAlerts(dir.install(), u"2001/01/01 00:00:00") != 1;
    while (!done);
  });
  for (std::thread* t : {&inserter, &counter1, &counter2, &purger}) t->join();
  EXPECT_EQ(failures.load(), 0);
  EXPECT_EQ(DeleteOldAlerts(dir.install(), u"2001/01/01 00:00:00"), 1);
  EXPECT_EQ(dir.Column().size(), 50u + kInserts / 2);
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
