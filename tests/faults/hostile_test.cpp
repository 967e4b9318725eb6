// Hostile alert files through real collection cycles: nothing crashes, the
// cycle ends, and each file reaches the end the processing rules give it.
#include <gtest/gtest.h>

#include <chrono>

#ifndef _WIN32
#include <pthread.h>
#endif

#include "fault_support.h"
#include "hostile_files.h"

namespace asum::test {
namespace {

const char* ExpectName(Expect e) {
  switch (e) {
    case Expect::kStored: return "stored";
    case Expect::kMarked: return "marked";
    case Expect::kLeft: return "left";
  }
  return "?";
}

// Drops the hostile set into `install`, returning the paths in set order.
std::vector<std::u16string> DropAll(const Install& install, const std::vector<HostileFile>& files) {
  std::vector<std::u16string> paths;
  for (const HostileFile& f : files) {
    if (f.is_folder) {
      paths.push_back(install.SentFolder() + platform::kPathSeparator + f.name);
      MakeFolders(paths.back());
    } else {
      paths.push_back(install.Drop(f.name, f.bytes));
    }
  }
  return paths;
}

// What became of each file, compared with what it should have become.
void CheckEnds(const Install& install, const std::vector<HostileFile>& files,
               const std::vector<std::u16string>& paths) {
  const std::map<std::u16string, int> rows = install.RowsByPath();
  for (size_t i = 0; i < files.size(); ++i) {
    const std::u16string& path = paths[i];
    const bool renamed = Exists(ProcName(path)) && !Exists(path);
    const auto found = rows.find(path);
    const int row_count = found == rows.end() ? 0 : found->second;
    Expect got = Expect::kLeft;
    if (renamed) got = row_count > 0 ? Expect::kStored : Expect::kMarked;
    EXPECT_EQ(ExpectName(got), std::string(ExpectName(files[i].expect))) << Narrow(files[i].name);
    EXPECT_LE(row_count, 1) << Narrow(files[i].name) << " stored more than once";
    if (got == Expect::kLeft) {
      EXPECT_EQ(row_count, 0) << Narrow(files[i].name);
    }
  }
  EXPECT_EQ(install.IntegrityCheck(), "ok");
}

TEST(HostileFiles, EachReachesItsEndInACycleAndTheNextCycleChangesNothing) {
  CapturedLog log;
  Install install;
  const std::vector<HostileFile> files = HostileFiles(!QuickRun());
  const std::vector<std::u16string> paths = DropAll(install, files);

  ProcessTally tally;
  ASSERT_EQ(RunProcessingCycle(install.path(), &tally), CycleResult::kDone);
  CheckEnds(install, files, paths);
  const int rows = install.RowCount();

  // The folder named like an alert is never listed, so nothing was left in
  // the cycle: every listed file was stored or marked.
  EXPECT_EQ(tally.left, 0u);
  ASSERT_EQ(RunProcessingCycle(install.path(), &tally), CycleResult::kDone);
  EXPECT_EQ(install.RowCount(), rows);

  // Handed over by name anyway, the folder keeps its name and stops nothing.
  size_t folder = 0;
  while (!files[folder].is_folder) ++folder;
  StringList folder_only{paths[folder]};
  ProcessTally direct;
  ProcessAlertFiles(install.path(), folder_only, u"Delivered", kComponent, nullptr, &direct);
  EXPECT_EQ(direct.left, 1u);
  EXPECT_TRUE(Exists(paths[folder]));
}

#ifndef _WIN32
// The host may give the processing thread a small stack: a whole cycle over
// the hostile set must fit in 256 KiB.
struct StackRun {
  const Install* install;
  CycleResult result = CycleResult::kBusy;
};

void* RunCycleOnSmallStack(void* arg) {
  auto* run = static_cast<StackRun*>(arg);
  run->result = RunProcessingCycle(run->install->path());
  return nullptr;
}

TEST(HostileFiles, ACycleFitsInA256KiBStack) {
  CapturedLog log;
  Install install;
  const std::vector<HostileFile> files = HostileFiles(false);
  const std::vector<std::u16string> paths = DropAll(install, files);

  pthread_attr_t attr;
  ASSERT_EQ(pthread_attr_init(&attr), 0);
  ASSERT_EQ(pthread_attr_setstacksize(&attr, 256 * 1024), 0);
  StackRun run{&install};
  pthread_t thread;
  ASSERT_EQ(pthread_create(&thread, &attr, RunCycleOnSmallStack, &run), 0);
  pthread_join(thread, nullptr);
  pthread_attr_destroy(&attr);

  ASSERT_EQ(run.result, CycleResult::kDone);
  CheckEnds(install, files, paths);
}
#endif

}  // namespace
}  // namespace asum::test
