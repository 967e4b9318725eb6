// A collector killed outright in the middle of a backlog, then started again:
// every file is stored, only the file in flight may be stored twice, and the
// database is sound.
#ifndef _WIN32
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include "alert_generator.h"
#include "fault_support.h"

namespace asum::test {
namespace {

// At its n-th rename (its row is stored by then) the collector says so on a
// pipe and stops there until it is killed.
struct StopAtRename : platform::Env {
  StopAtRename(int fd, int n) : fd(fd), left(n) {}
  platform::FileResult RenameNoReplace(const std::u16string& from, const std::u16string& to) override {
    if (--left == 0) {
      if (write(fd, "k", 1) != 1) _exit(1);
      for (;;) pause();
    }
    return Env::RenameNoReplace(from, to);
  }
  int fd, left;
};

TEST(Crash, KilledMidBacklogLosesNothingAndStoresAtMostOneFileTwice) {
  CapturedLog log;
  Install install;
  std::vector<std::u16string> paths;
  for (uint32_t i = 0; i < 60; ++i) {
    const gen::GeneratedAlert alert = gen::GenerateAlert(11, i, 3, false);
    paths.push_back(install.Drop(kSent, U16(alert.file_name), alert.bytes));
  }
  int pipe_fds[2];
  ASSERT_EQ(pipe(pipe_fds), 0);
  const pid_t child = fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    StopAtRename stopping(pipe_fds[1], 20);
    platform::ScopedEnv scoped(&stopping);
    RunProcessingCycle(install.path());
    _exit(0);
  }
  close(pipe_fds[1]);
  char said = 0;
  EXPECT_EQ(read(pipe_fds[0], &said, 1), 1) << "the collector ended before its 20th rename";
  close(pipe_fds[0]);
  kill(child, SIGKILL);
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  ASSERT_TRUE(WIFSIGNALED(status));

  // Restart: the killed process's collector lock went with it.
  ASSERT_EQ(RunProcessingCycle(install.path()), CycleResult::kDone);
  const std::vector<End> ends = EndsOf(install, paths);
  EXPECT_EQ(Count(ends, kStored) + Count(ends, kStoredTwice), 60);
  EXPECT_LE(Count(ends, kStoredTwice), 1);
}

}  // namespace
}  // namespace asum::test
#endif
