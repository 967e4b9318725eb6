// The processing thread on a short interval while alert files keep arriving
// and four host threads count and purge: every file that arrived ends stored
// once under its PROC_ name or still under its own name, and no count ever
// saw fewer rows than were known to be stored.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <filesystem>
#include <mutex>
#include <thread>

#include "alert_generator.h"
#include "entry/processing_thread.h"
#include "fault_support.h"
#include "store/alert_count.h"
#include "store/retention.h"

namespace asum::test {
namespace {

using Clock = std::chrono::steady_clock;
constexpr char16_t kEverything[] = u"<TO>2001/01/01 00:00:00</FROM><TO>9999/12/31 23:59:59</TO>";

// Retention settings the host threads read while the test switches them.
#ifndef _WIN32
class RetentionSwitch {
 public:
  RetentionSwitch() : previous_(platform::SettingsRoot()) {
    MakeFolders(root_.Join(u"software"));
    platform::SetSettingsRoot(root_.path());
    Write(u"Sch_Retention_Val", "3650 Days");
    Set(false);
  }
  ~RetentionSwitch() { platform::SetSettingsRoot(previous_); }
  // Replaced in one rename, so a reader sees the old or the new value.
  void Set(bool on) { Write(u"Sch_Retention", on ? "TRUE" : "FALSE"); }

 private:
  void Write(const std::u16string& name, const std::string& value) {
    const std::u16string key = root_.Join(u"software/Varnholt Suite/Varnholt Suite/" + name);
    MakeFolders(key);
    const std::u16string temp = key + u"/.next";
    WriteText(temp, value);
    std::filesystem::rename(std::filesystem::path(temp), std::filesystem::path(key + u"/" + name));
  }
  TempDir root_;
  std::u16string previous_;
};
#else
// The registry is the machine's own here; the values come from an Env that
// stands in for it.
class RetentionSwitch : public platform::Env {
 public:
  RetentionSwitch() : scoped_(this) {}
  void Set(bool on) { on_ = on; }
  std::optional<std::u16string> QueryStringValue(platform::SettingsKey key, const std::u16string& name) override {
    if (name == u"Sch_Retention") return on_.load() ? u"TRUE" : u"FALSE";
    if (name == u"Sch_Retention_Val") return u"3650 Days";
    return Env::QueryStringValue(key, name);
  }

 private:
  std::atomic<bool> on_{false};
  platform::ScopedEnv scoped_;
};
#endif

TEST(Stress, ArrivingFilesWithCountsAndPurgesEndStoredOnceOrUnderTheirNames) {
  CapturedLog log;
  Install install;
  RetentionSwitch retention;
  // Rows far older than the retention period: a purge that runs removes them,
  // and the counts' range leaves them out.
  for (int i = 0; i < 20; ++i) {
    ASSERT_EQ(ExecSql(install.DbPath(),
                      "INSERT INTO AlertDB VALUES('Email Alert','Old','n','1990/01/01 00:00:00','No','w','o','c',"
                      "'Delivered','old path','s')"),
              "");
  }

  const auto run_for = std::chrono::milliseconds(QuickRun() ? 1500 : 4000);
  const Clock::time_point deadline = Clock::now() + run_for;
  std::atomic<uint64_t> stored_known{0};
  ProcessingThread* processing = ProcessingThread::Start(5, [&](const platform::StopSignal& stop) {
    CycleContext cycle(&stop);
    ProcessTally tally;
    install.Cycle(&tally, &cycle);
    stored_known += tally.stored;
  });
  ASSERT_NE(processing, nullptr);

  std::vector<std::u16string> arrived;
  std::thread feeder([&] {
    for (uint32_t i = 0; Clock::now() < deadline; ++i) {
      const gen::GeneratedAlert alert = gen::GenerateAlert(7, i, 3, false);
      arrived.push_back(install.DropAtomically(U16(alert.file_name), alert.bytes));
      std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
  });

  std::atomic<int> counts{0}, short_counts{0}, purges_run{0};
  std::mutex first_failure_mutex;
  std::string first_failure;
  auto host = [&] {
    for (int i = 0; Clock::now() < deadline; ++i) {
      const uint64_t known = stored_known.load();
      const Clock::time_point began = Clock::now();
      const int n = CountAlerts(install.path(), u"%", kEverything);
      const auto took = std::chrono::duration_cast<std::chrono::milliseconds>(Clock::now() - began).count();
      ++counts;
      if (n < 0 || static_cast<uint64_t>(n) < known) {
        ++short_counts;
        std::lock_guard<std::mutex> lock(first_failure_mutex);
        if (first_failure.empty()) first_failure = std::to_string(n) + " < " + std::to_string(known) + " after " + std::to_string(took) + " ms";
      }
      if (i % 2 == 1 && RunRetentionProc(install.path()) == 1) ++purges_run;
    }
  };
  std::vector<std::thread> hosts;
  for (int i = 0; i < 4; ++i) hosts.emplace_back(host);
  for (bool on = false; Clock::now() < deadline; on = !on) {
    retention.Set(on);
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
  }
  feeder.join();
  for (std::thread& t : hosts) t.join();
  processing->RequestStop();
  ASSERT_TRUE(processing->WaitUntilFinished(30000));

  EXPECT_EQ(short_counts.load(), 0) << "first: " << first_failure;
  EXPECT_GT(counts.load(), 0);
  EXPECT_GT(purges_run.load(), 0);
  ASSERT_FALSE(arrived.empty());

  const auto rows = install.RowsByPath();
  size_t stored = 0, waiting = 0;
  for (const std::u16string& p : arrived) {
    const auto found = rows.find(p);
    const int n = found == rows.end() ? 0 : found->second;
    if (Exists(p)) {
      ++waiting;
      EXPECT_EQ(n, 0) << Narrow(p);
      EXPECT_FALSE(Exists(ProcName(p))) << Narrow(p);
    } else {
      ++stored;
      EXPECT_EQ(n, 1) << Narrow(p);
      EXPECT_TRUE(Exists(ProcName(p))) << Narrow(p);
    }
  }
  EXPECT_GT(stored, 0u);
  EXPECT_EQ(rows.count(u"old path"), 0u) << "retention ran but the old rows stayed";
  EXPECT_EQ(CountAlerts(install.path(), u"%", kEverything), static_cast<int>(stored));
  EXPECT_EQ(install.IntegrityCheck(), "ok");
  std::cout << arrived.size() << " files arrived, " << stored << " stored, " << waiting << " waiting; " << counts
            << " counts, " << purges_run << " purges ran, " << processing->CyclesCompleted() << " cycles\n";
}

}  // namespace
}  // namespace asum::test
