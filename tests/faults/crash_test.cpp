// A collector killed outright in the middle of a backlog, then started again:
// every file is stored, only the file in flight may be stored twice.
#ifndef _WIN32
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include "fault_support.h"

namespace asum::test {
namespace {

// At its 20th rename (that file's row is stored by then) the collector says so
// on a pipe and stays there until it is killed.
struct StopAtRename : platform::Env {
  explicit StopAtRename(int fd) : fd(fd) {}
  platform::FileResult RenameNoReplace(const std::u16string& from, const std::u16string& to) override {
    if (++renames == 20 && write(fd, "k", 1) == 1)
      for (;;) pause();
    return Env::RenameNoReplace(from, to);
  }
  int fd, renames = 0;
};

TEST(Crash, KilledMidBacklogLosesNothingAndStoresAtMostOneFileTwice) {
  CapturedLog log;
  Install install;
  const std::vector<std::u16string> paths = install.DropAlerts(0, 60);
  int fds[2];
  ASSERT_EQ(pipe(fds), 0);
  const pid_t child = fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    StopAtRename stopping(fds[1]);
    platform::ScopedEnv scoped(&stopping);
    _exit(static_cast<int>(RunProcessingCycle(install.path())));
  }
  close(fds[1]);
  char said = 0;
  EXPECT_EQ(read(fds[0], &said, 1), 1) << "the collector ended before its 20th rename";
  close(fds[0]);
  kill(child, SIGKILL);
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  ASSERT_TRUE(WIFSIGNALED(status));

  ASSERT_EQ(RunProcessingCycle(install.path()), CycleResult::kDone);  // its lock went with the killed process
  const std::vector<End> ends = EndsOf(install, paths);
  EXPECT_EQ(Count(ends, kStored) + Count(ends, kStoredTwice), 60);
  EXPECT_LE(Count(ends, kStoredTwice), 1);
}

}  // namespace
}  // namespace asum::test
#endif
