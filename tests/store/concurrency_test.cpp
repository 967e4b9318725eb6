// Several operations on one database at once: each has its own connection and
// waits for the others' locks instead of failing.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "store/alert_count.h"
#include "store/retention.h"
#include "store/setting_db_management.h"
#include "store_test_support.h"

namespace asum {
namespace {

using Clock = std::chrono::steady_clock;
constexpr char16_t kMarch[] = u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>";

int64_t MsSince(Clock::time_point start) {
  return std::chrono::duration_cast<std::chrono::milliseconds>(Clock::now() - start).count();
}

bool InsertOne(const test::StoreDir& dir, BusyBudget* budget, const std::u16string& when) {
  CSettingDBManagement store(budget);
  if (!store.OpenDB(dir.db_path())) return false;
  const bool ok = store.FillDatainDB(u"Email Alert", u"T", u"N", when, u"No", u"", u"", u"", u"Delivered",
                                     u"p", u"s");
  store.CloseDB();
  return ok;
}

TEST(StoreConcurrency, InsertCountAndPurgeAtOnceAllSucceed) {
  test::StoreDir dir;
  dir.Create();
  std::vector<std::vector<std::u16string>> seed(50, {u"Email Alert", u"T", u"2024/03/02 00:00:00"});
  dir.Insert(seed);

  constexpr int kInserts = 120;
  std::atomic<bool> done{false};
  std::atomic<int> failures{0};
  std::atomic<int> counts{0};
  std::atomic<int> purges{0};

  std::thread inserter([&] {
    for (int i = 0; i < kInserts; ++i) {
      BusyBudget budget(kProcessingBusyBudgetMs);
      if (!InsertOne(dir, &budget, i % 2 ? u"2024/03/10 10:00:00" : u"2000/01/01 00:00:00")) {
        ++failures;
        break;
      }
    }
    done = true;
  });
  auto counter = [&] {
    while (!done) {
      const int n = CountAlerts(dir.install(), u"Email Alert", kMarch);
      if (n < 50 || n > 50 + kInserts / 2) ++failures;
      ++counts;
    }
  };
  std::thread counter1(counter), counter2(counter);
  std::thread purger([&] {
    while (!done) {
      if (DeleteOldAlerts(dir.install(), u"2001/01/01 00:00:00") != 1) ++failures;
      ++purges;
    }
  });
  inserter.join();
  counter1.join();
  counter2.join();
  purger.join();

  EXPECT_EQ(failures.load(), 0);
  EXPECT_GT(counts.load(), 0);
  EXPECT_GT(purges.load(), 0);
  EXPECT_EQ(DeleteOldAlerts(dir.install(), u"2001/01/01 00:00:00"), 1);
  EXPECT_EQ(dir.RowCount(), 50 + kInserts / 2);
}

// Holds the database exclusively, as a writer in the middle of its work does.
class HeldDatabase {
 public:
  explicit HeldDatabase(const std::u16string& path) : raw_(path) {
    EXPECT_EQ(raw_.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
    EXPECT_EQ(raw_.Exec("INSERT INTO AlertDB VALUES('Email Alert','T','N','2024/03/03 00:00:00','','','','','','','')"),
              SQLITE_OK);
  }
  void CommitAfter(int ms) {
    releaser_ = std::thread([this, ms] {
      std::this_thread::sleep_for(std::chrono::milliseconds(ms));
      raw_.Exec("COMMIT");
    });
  }
  ~HeldDatabase() {
    if (releaser_.joinable()) releaser_.join();
    raw_.Exec("ROLLBACK");
  }

 private:
  test::RawConnection raw_;
  std::thread releaser_;
};

TEST(StoreConcurrency, QueriesWaitForAWriterInsteadOfFailing) {
  test::StoreDir dir;
  dir.Create();
  dir.Insert({{u"Email Alert", u"T", u"2024/03/02 00:00:00"}, {u"Email Alert", u"T", u"2000/01/01 00:00:00"}});
  {
    HeldDatabase writer(dir.db_path());
    writer.CommitAfter(300);
    const auto start = Clock::now();
    EXPECT_EQ(CountAlerts(dir.install(), u"", kMarch), 2) << "the writer's row is counted once it commits";
    EXPECT_GE(MsSince(start), 200);
  }
  {
    HeldDatabase writer(dir.db_path());
    writer.CommitAfter(300);
    EXPECT_EQ(DeleteOldAlerts(dir.install(), u"2001/01/01 00:00:00"), 1);
  }
  EXPECT_EQ(dir.RowCount(), 3);
}

// A database held for minutes must not cost a cycle a timeout per file.
TEST(StoreConcurrency, ProcessingBudgetBoundsTheWholeCycle) {
  test::StoreDir dir;
  dir.Create();
  HeldDatabase other_program(dir.db_path());
  BusyBudget cycle(300);
  const auto start = Clock::now();
  for (int file = 0; file < 20; ++file) EXPECT_FALSE(InsertOne(dir, &cycle, u"2024/03/10 10:00:00"));
  const int64_t ms = MsSince(start);
  EXPECT_GE(ms, 250);
  EXPECT_LT(ms, 2000);
  EXPECT_TRUE(cycle.Exhausted());
}

}  // namespace
}  // namespace asum
