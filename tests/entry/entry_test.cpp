#include <gtest/gtest.h>

#include <atomic>

#include "entry/app.h"
#include "entry/host_text.h"
#include "store/setting_db_management.h"
#include "support/test_support.h"

namespace asum {
namespace {

using Lines = std::vector<std::u16string>;
constexpr uint32_t kDeadlineMs = 60000;  // a safety net only: every wait ends on its event

// The first cycle one interval after the start, then one per interval, also
// after a cycle that threw, until a stop, which cuts a sleep short.
TEST(ProcessingThread, RunsACycleAfterEachIntervalUntilAStop) {
  struct Case { uint32_t interval_ms; int least, most; };  // least and most cycles before the stop is seen
  for (const Case c : {Case{1, 3, 1 << 30}, Case{3600000, 0, 0}}) {
    test::CapturedLog log;
    std::atomic<int> cycles{0};
    platform::StopSignal reached;
    ProcessingThread* thread = ProcessingThread::Start(c.interval_ms, [&](const platform::StopSignal&) {
      if (++cycles >= c.least) reached.Request();
      throw std::bad_alloc();
    });
    ASSERT_NE(thread, nullptr);
    EXPECT_TRUE(c.least == 0 || reached.WaitFor(kDeadlineMs));
    thread->RequestStop();
    ASSERT_TRUE(thread->WaitUntilFinished(kDeadlineMs));
    EXPECT_EQ(thread->CyclesCompleted(), static_cast<uint64_t>(cycles.load()));
    EXPECT_TRUE(cycles >= c.least && cycles <= c.most) << cycles;
    EXPECT_EQ(log.Messages(), Lines{u"Inside EnableProcessAlertThread(LPVOID lp)"});
  }
}

// Counts the threads started; each waits at its start for `open` (one at a time).
class GatedThreads : public platform::Env {
 public:
  platform::ThreadHandle StartThread(void (*fn)(void*), void* arg) override {
    ++started, fn_ = fn, arg_ = arg;
    return Env::StartThread([](void* self) {
      auto* env = static_cast<GatedThreads*>(self);
      env->open.WaitFor(kDeadlineMs);
      env->fn_(env->arg_);
    }, this);
  }
  std::u16string ExecutablePath() override { return install.Join(u"host.exe"); }  // its cycles stay in here
  test::TempDir install;
  int started = 0;
  platform::StopSignal open;
  void (*fn_)(void*) = nullptr;
  void* arg_ = nullptr;
};

// Two threads over the same folders would store every alert twice: a second
// call returns the running thread. One that was stopped is replaced.
TEST(GetSuccAlertsInfo, StartsOneThreadOfTheTenSecondCycleAndLogsInOrder) {
  test::CapturedLog log;
  GatedThreads env;
  platform::ScopedEnv scope(&env);
  BEProcessSuccessfulAlerts processor;
  void* first = processor.GetSuccAlertsInfo();
  ASSERT_NE(first, nullptr);
  EXPECT_EQ(processor.GetSuccAlertsInfo(), first);
  EXPECT_EQ(env.started, 1);
  EXPECT_EQ(static_cast<ProcessingThread*>(first)->IntervalMs(), 10000u);
  env.open.Request();
  EXPECT_TRUE(processor.StopProcessing(kDeadlineMs));
  const std::u16string started = u"Inside HANDLE BEProcessSuccessfulAlerts::GetSuccAlertsInfo()";
  EXPECT_EQ(log.Messages(), (Lines{started, started, u"Inside EnableProcessAlertThread(LPVOID lp)"}));
  EXPECT_NE(processor.GetSuccAlertsInfo(), nullptr);
  EXPECT_EQ(env.started, 2);
  EXPECT_TRUE(processor.StopProcessing(kDeadlineMs));
}

struct HostIn : platform::Env {
  std::u16string exe;
  std::u16string ExecutablePath() override { return exe; }
};

// The count export's body reads the host's wide texts (null as empty) and
// hands the filter and the range on in that order.
TEST(GetAlertCountForHost, ReadsTheHostsTextsAndPassesTheFilterThenTheRange) {
  EXPECT_EQ(HostText(nullptr), u"");
  EXPECT_EQ(HostText(L"caf\u00e9 \U0001F600"), u"caf\u00e9 \U0001F600");
  test::TempDir dir;
  HostIn host;
  host.exe = dir.Join(u"host.exe");
  platform::ScopedEnv scope(&host);
  CSettingDBManagement store;
  ASSERT_TRUE(store.OpenDB(DatabasePathOf(dir.path())));
  ASSERT_TRUE(store.FillDatainDB({u"Email Alert", u"", u"", u"2024/03/05 10:00:00", u"", u"", u"", u"", u"", u"", {}}));
  store.CloseDB();
  const wchar_t* range = L"<FROM>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>";
  EXPECT_EQ(GetAlertCountForHost(L"Email Alert", range), 1);
  EXPECT_EQ(GetAlertCountForHost(range, L"Email Alert"), 0);
}

}  // namespace
}  // namespace asum
