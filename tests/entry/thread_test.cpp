#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "entry/app.h"
#include "entry/processing_thread.h"
#include "log/log.h"
#include "support/test_support.h"

namespace asum {
namespace {

bool WaitUntil(const std::function<bool()>& done, int ms = 5000) {
  for (int waited = 0; waited < ms; waited += 5) {
    if (done()) return true;
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
  return done();
}

TEST(ProcessingThread, RunsCyclesUntilStoppedAndStopCutsTheSleepShort) {
  test::CapturedLog log;
  std::atomic<int> cycles{0};
  ProcessingThread* thread = ProcessingThread::Start(1, [&](const platform::StopSignal&) { ++cycles; });
  ASSERT_NE(thread, nullptr);
  EXPECT_TRUE(WaitUntil([&] { return cycles.load() >= 3; }));
  thread->RequestStop();
  EXPECT_TRUE(thread->WaitUntilFinished(5000));
  const int after = cycles.load();
  std::this_thread::sleep_for(std::chrono::milliseconds(20));
  EXPECT_EQ(cycles.load(), after) << "no cycle may start after the stop";
  EXPECT_EQ(log.Messages().front(), u"Inside EnableProcessAlertThread(LPVOID lp)");

  // A thread asleep for a whole interval still ends at once when asked.
  ProcessingThread* sleeper = ProcessingThread::Start(kCycleIntervalMs, [](const platform::StopSignal&) {});
  ASSERT_NE(sleeper, nullptr);
  const auto start = std::chrono::steady_clock::now();
  sleeper->RequestStop();
  EXPECT_TRUE(sleeper->WaitUntilFinished(5000));
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
}

TEST(ProcessingThread, ACycleThatThrowsDoesNotEndTheThread) {
  std::atomic<int> cycles{0};
  ProcessingThread* thread = ProcessingThread::Start(1, [&](const platform::StopSignal&) {
    ++cycles;
    throw std::bad_alloc();
  });
  ASSERT_NE(thread, nullptr);
  EXPECT_TRUE(WaitUntil([&] { return cycles.load() >= 2; }));
  thread->RequestStop();
  EXPECT_TRUE(thread->WaitUntilFinished(5000));
}

TEST(GetSuccAlertsInfo, SecondCallReturnsTheRunningThreadAndLogsInOrder) {
  test::CapturedLog log;
  BEProcessSuccessfulAlerts processor;
  void* first = processor.GetSuccAlertsInfo();
  void* second = processor.GetSuccAlertsInfo();
  ASSERT_NE(first, nullptr);
  EXPECT_EQ(first, second);
  EXPECT_TRUE(WaitUntil([&] { return log.Messages().size() >= 3; }));
  EXPECT_TRUE(processor.StopProcessing(5000));
  const auto messages = log.Messages();
  ASSERT_GE(messages.size(), 3u);
  EXPECT_EQ(messages[0], u"Inside HANDLE BEProcessSuccessfulAlerts::GetSuccAlertsInfo()");
  // The thread's first line may land before or after the second call's line.
  int thread_lines = 0;
  for (const auto& m : messages) thread_lines += m == u"Inside EnableProcessAlertThread(LPVOID lp)";
  EXPECT_EQ(thread_lines, 1) << "one thread only";

  // After a stop, a new call starts a new thread.
  void* third = processor.GetSuccAlertsInfo();
  EXPECT_NE(third, nullptr);
  EXPECT_NE(third, first);
  EXPECT_TRUE(processor.StopProcessing(5000));
}

}  // namespace
}  // namespace asum
