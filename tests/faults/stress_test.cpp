// Alert files keep arriving and cycles keep running while four host threads
// count and purge: no count sees fewer rows than were known to be stored,
// every purge runs, and every file ends stored once.
#include <atomic>

#include "fault_support.h"
#include "store/alert_count.h"
#include "store/retention.h"

namespace asum::test {
namespace {

constexpr char16_t kEverything[] = u"<FROM>2001/01/01 00:00:00</FROM><TO>9999/12/31 23:59:59</TO>";

struct Shared {
  Install install;
  std::atomic<bool> done{false};
  std::atomic<int> stored{0}, short_counts{0}, purges{0}, purges_run{0};

  static void Host(void* self) {
    Shared& s = *static_cast<Shared*>(self);
    for (int i = 0; i == 0 || !s.done; ++i) {
      const int known = s.stored;
      s.short_counts += CountAlerts(s.install.path(), u"%", kEverything) < known;
      if (i % 2 == 0) ++s.purges, s.purges_run += DeleteOldAlerts(s.install.path(), u"2000/01/01 00:00:00");
    }
  }
};

TEST(Stress, ArrivingFilesWithCountsAndPurgesEndStoredOnce) {
  CapturedLog log;
  Shared s;
  s.install.Sql(
      "INSERT INTO AlertDB VALUES('Email Alert','Old','n','1990/01/01 00:00:00','No','w','o','c',"
      "'Delivered','old path','s')");  // only a purge removes it
  platform::ThreadHandle hosts[4];
  for (platform::ThreadHandle& host : hosts) {
    ASSERT_NE(host = platform::Env::Default().StartThread(&Shared::Host, &s), nullptr);
  }
  std::vector<std::u16string> arrived;
  for (uint32_t i = 0; i < 120; i += 20) {  // files arrive while host threads count and purge
    const std::vector<std::u16string> batch = s.install.DropAlerts(i, i + 20);
    arrived.insert(arrived.end(), batch.begin(), batch.end());
    ProcessTally tally;
    EXPECT_EQ(RunProcessingCycle(s.install.path(), &tally), CycleResult::kDone);
    s.stored += static_cast<int>(tally.stored);
  }
  s.done = true;
  for (platform::ThreadHandle host : hosts) ASSERT_TRUE(platform::Env::Default().JoinThread(host, 120000));

  EXPECT_EQ(s.short_counts, 0);
  EXPECT_EQ(s.purges_run, s.purges);
  EXPECT_EQ(Count(EndsOf(s.install, arrived), kStored), 120);
  EXPECT_EQ(s.install.Sql("SELECT count(*) FROM AlertDB"), std::vector<std::u16string>{u"120"}) << "old rows stay";
}

}  // namespace
}  // namespace asum::test
