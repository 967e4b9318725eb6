// A collector killed outright in the middle of a backlog, then started again:
// every PROC_ file has its row (only the file in flight may have two), every
// other file is processed on restart, and the database is sound.
#ifndef _WIN32
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <thread>

#include "alert_generator.h"
#include "fault_support.h"

namespace asum::test {
namespace {

size_t CountProcNames(const std::u16string& folder) {
  size_t n = 0;
  for (const std::u16string& name : ListNames(folder)) n += name.rfind(u"PROC_", 0) == 0 ? 1 : 0;
  return n;
}

TEST(Crash, KilledMidBacklogLosesNothingAndStoresAtMostOneFileTwice) {
  CapturedLog log;
  Install install;
  const int backlog = QuickRun() ? 400 : 900;
  std::vector<std::u16string> paths;
  for (int i = 0; i < backlog; ++i) {
    const gen::GeneratedAlert alert = gen::GenerateAlert(11, static_cast<uint32_t>(i), 3, false);
    paths.push_back(install.Drop(U16(alert.file_name), alert.bytes));
  }

  const pid_t child = fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    for (int cycle = 0; cycle < 10; ++cycle) RunProcessingCycle(install.path());
    _exit(0);
  }
  const auto give_up = std::chrono::steady_clock::now() + std::chrono::seconds(30);
  while (CountProcNames(install.SentFolder()) < static_cast<size_t>(backlog / 3) &&
         std::chrono::steady_clock::now() < give_up) {
    std::this_thread::sleep_for(std::chrono::milliseconds(2));
  }
  kill(child, SIGKILL);
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  ASSERT_TRUE(WIFSIGNALED(status)) << "the collector finished before it was killed";
  const size_t done_before = CountProcNames(install.SentFolder());
  EXPECT_LT(done_before, static_cast<size_t>(backlog));
  EXPECT_EQ(install.IntegrityCheck(), "ok");

  // Restart: the killed process's collector lock went with it.
  ASSERT_EQ(RunProcessingCycle(install.path()), CycleResult::kDone);
  const auto rows = install.RowsByPath();
  int twice = 0;
  for (const std::u16string& p : paths) {
    EXPECT_FALSE(Exists(p)) << Narrow(p);
    EXPECT_TRUE(Exists(ProcName(p))) << Narrow(p);
    const auto found = rows.find(p);
    const int n = found == rows.end() ? 0 : found->second;
    EXPECT_GE(n, 1) << Narrow(p);
    EXPECT_LE(n, 2) << Narrow(p);
    twice += n == 2 ? 1 : 0;
  }
  EXPECT_LE(twice, 1);
  EXPECT_EQ(install.RowCount(), backlog + twice);
  EXPECT_EQ(install.IntegrityCheck(), "ok");
  std::cout << "killed after " << done_before << " of " << backlog << " files; " << twice
            << " file stored twice\n";
}

}  // namespace
}  // namespace asum::test
#endif
