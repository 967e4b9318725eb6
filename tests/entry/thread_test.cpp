#include <gtest/gtest.h>

#include <atomic>
#include <memory>

#include "entry/app.h"
#include "entry/processing_thread.h"
#include "support/test_support.h"

namespace asum {
namespace {

using Lines = std::vector<std::u16string>;

// A safety net only: every wait below ends on the event it waits for.
constexpr uint32_t kDeadlineMs = 60000;

// The first cycle one interval after the start, then one per interval, also
// after a cycle that threw, until a stop, which cuts a sleep short.
TEST(ProcessingThread, RunsACycleAfterEachIntervalUntilAStop) {
  struct Case {
    uint32_t interval_ms;
    int least, most;  // cycles before the stop is seen
  };
  for (const Case c : {Case{1, 3, 1 << 30}, Case{3600000, 0, 0}}) {
    SCOPED_TRACE(c.interval_ms);
    test::CapturedLog log;
    std::atomic<int> cycles{0};
    platform::StopSignal reached;
    ProcessingThread* thread = ProcessingThread::Start(c.interval_ms, [&](const platform::StopSignal&) {
      if (++cycles >= c.least) reached.Request();
      throw std::bad_alloc();
    });
    ASSERT_NE(thread, nullptr);
    if (c.least > 0) EXPECT_TRUE(reached.WaitFor(kDeadlineMs));
    thread->RequestStop();
    ASSERT_TRUE(thread->WaitUntilFinished(kDeadlineMs));
    EXPECT_EQ(thread->CyclesCompleted(), static_cast<uint64_t>(cycles.load()));
    EXPECT_GE(cycles.load(), c.least);
    EXPECT_LE(cycles.load(), c.most);
    EXPECT_EQ(log.Messages(), Lines{u"Inside EnableProcessAlertThread(LPVOID lp)"});
  }
}

// Counts the threads started and holds each at its start until `open`.
class GatedThreads : public platform::Env {
 public:
  platform::ThreadHandle StartThread(void (*fn)(void*), void* arg) override {
    ++started;
    return Env::StartThread(&Gated, new Start{this, fn, arg});
  }
  int started = 0;
  platform::StopSignal open;

 private:
  struct Start {
    GatedThreads* env;
    void (*fn)(void*);
    void* arg;
  };
  static void Gated(void* start) {
    const std::unique_ptr<Start> s(static_cast<Start*>(start));
    s->env->open.WaitFor(kDeadlineMs);
    s->fn(s->arg);
  }
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

}  // namespace
}  // namespace asum
