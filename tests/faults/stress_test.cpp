// Alert files keep arriving while the processing thread runs short cycles and
// four host threads count and purge: no count sees fewer rows than were known
// to be stored, every purge runs, and every file ends stored once.
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <optional>

#include "alert_generator.h"
#include "entry/processing_thread.h"
#include "fault_support.h"
#include "store/alert_count.h"
#include "store/retention.h"

namespace asum::test {
namespace {

constexpr char16_t kEverything[] = u"<FROM>2001/01/01 00:00:00</FROM><TO>9999/12/31 23:59:59</TO>";
constexpr int kRounds = 40;

// Retention on, keeping ten years; no test writes the machine's own settings.
struct RetentionOn : platform::Env {
  platform::SettingsKey OpenKey(platform::SettingsKey, const std::u16string&) override { return this; }
  platform::SettingsKey CreateKey(platform::SettingsKey, const std::u16string&) override { return this; }
  void CloseKey(platform::SettingsKey) override {}
  std::optional<std::u16string> QueryStringValue(platform::SettingsKey, const std::u16string& name) override {
    return name == u"Sch_Retention" ? u"TRUE" : u"3650 Days";
  }
};

TEST(Stress, ArrivingFilesWithCountsAndPurgesEndStoredOnce) {
  CapturedLog log;
  Install install;
  RetentionOn retention;
  platform::ScopedEnv scoped(&retention);
  for (int i = 0; i < 20; ++i) {  // far older than ten years: only a purge removes them
    install.Sql("INSERT INTO AlertDB VALUES('Email Alert','Old','n','1990/01/01 00:00:00','No','w','o','c',"
                "'Delivered','old path','s')");
  }
  std::mutex mutex;
  std::condition_variable changed;
  std::atomic<uint64_t> stored{0}, cycles{0};  // changed under `mutex`
  const auto wait_until = [&](const std::function<bool()>& done) {
    std::unique_lock<std::mutex> lock(mutex);
    ASSERT_TRUE(changed.wait_for(lock, std::chrono::minutes(2), done));  // a safety net only
  };
  ProcessingThread* processing = ProcessingThread::Start(1, [&](const platform::StopSignal& stop) {
    CycleContext cycle(&stop);
    ProcessTally tally;
    RunProcessingCycle(install.path(), &tally, &cycle);
    std::lock_guard<std::mutex> lock(mutex);
    stored += tally.stored, ++cycles;
    changed.notify_all();
  });
  ASSERT_NE(processing, nullptr);

  struct Host {
    const Install* install;
    const std::atomic<uint64_t>* known;
    int short_counts = 0, purges_run = 0;
  };
  Host hosts[4];
  platform::ThreadHandle threads[4];
  for (int h = 0; h < 4; ++h) {
    hosts[h] = {&install, &stored};
    threads[h] = platform::Env::Default().StartThread(
        [](void* arg) {
          Host& host = *static_cast<Host*>(arg);
          for (int i = 0; i < kRounds; ++i) {
            const uint64_t known = host.known->load();
            host.short_counts += CountAlerts(host.install->path(), u"%", kEverything) < static_cast<int>(known);
            if (i % 2 == 1) host.purges_run += RunRetentionProc(host.install->path());
          }
        },
        &hosts[h]);
    ASSERT_NE(threads[h], nullptr);
  }
  const int files = QuickRun() ? 60 : 300;
  std::vector<std::u16string> arrived;
  for (uint32_t i = 0; i < static_cast<uint32_t>(files); ++i) {
    const gen::GeneratedAlert alert = gen::GenerateAlert(7, i, 3, false);
    arrived.push_back(install.DropAtomically(U16(alert.file_name), alert.bytes));
    if (i % 20 == 19) {  // files arrive while cycles run
      const uint64_t next = cycles + 1;
      wait_until([&] { return cycles >= next; });
    }
  }
  for (int h = 0; h < 4; ++h) ASSERT_TRUE(platform::Env::Default().JoinThread(threads[h], 120000));
  wait_until([&] { return stored == static_cast<uint64_t>(files); });
  processing->RequestStop();
  ASSERT_TRUE(processing->WaitUntilFinished(120000));

  for (const Host& host : hosts) {
    EXPECT_EQ(host.short_counts, 0);
    EXPECT_EQ(host.purges_run, kRounds / 2);
  }
  EXPECT_EQ(Count(EndsOf(install, arrived), kStored), files);
  EXPECT_EQ(install.Sql("SELECT count(*) FROM AlertDB WHERE \"Alert Path\" = 'old path'"),
            std::vector<std::u16string>{u"0"});
  EXPECT_EQ(CountAlerts(install.path(), u"%", kEverything), files);
}

}  // namespace
}  // namespace asum::test
