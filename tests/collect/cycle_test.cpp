#include "collect/cycle.h"

#include <gtest/gtest.h>

#include <algorithm>

#include "collect/process_alerts.h"
#include "support/test_support.h"

namespace asum {
namespace {

using test::TempDir;
using test::WriteText;

const char kAlert[] =
    "From: a@b.example\r\nSubject: Threshold Alert: T \"N\" (S(C)\\R\\X)\r\nContent-Type: text/html\r\n\r\n"
    "<table><tr><th>Who</th></tr><tbody><tr><td>u</td></tr></tbody></table>";

class LockedCycleTest : public ::testing::Test {
 protected:
  LockedCycleTest() {
    WriteText(dir_.Join(u"Comp\\info.dat"), "");
    WriteText(dir_.Join(u"Comp\\AlertReports\\Sent items\\a.eml"), kAlert);
  }
  CycleResult Run() {
    return RunLockedCycle(dir_.path(), [&](StringList& files, const std::u16string& status,
                                           const std::u16string& component) {
      ++calls_;
      ProcessAlertFiles(dir_.path(), files, status, component);
    });
  }
  std::vector<std::u16string> Names() { return test::ListNames(dir_.Join(u"Comp\\AlertReports\\Sent items")); }

  test::CapturedLog log_;
  TempDir dir_;
  int calls_ = 0;
};

// Without the lock no cycle runs; the log says whether another collector has
// it or why the lock file cannot be had (a read-only install folder, access
// denied, here a folder in its place).
TEST_F(LockedCycleTest, WithoutTheLockNothingIsDoneAndTheLogSaysWhy) {
  const std::u16string lock_path = CollectorLockPathOf(dir_.path());
  platform::Env& env = platform::Current();
  platform::FileResult failure;
  platform::FileLock held = env.TryLockFile(lock_path, &failure);
  ASSERT_NE(held, nullptr);
  EXPECT_EQ(Run(), CycleResult::kBusy);
  env.UnlockFile(held);
  test::RemoveTree(lock_path);
  test::MakeFolders(lock_path);
  EXPECT_EQ(Run(), CycleResult::kNoLock);

  EXPECT_EQ(calls_, 0);
  const auto messages = log_.Messages();
  ASSERT_EQ(messages.size(), 2u);
  EXPECT_EQ(messages[0], u"Another collector is processing " + dir_.path() + u"; this cycle does nothing");
  const std::u16string cause = u"The collector lock " + lock_path + u" cannot be created or opened: ";
  EXPECT_EQ(messages[1].substr(0, cause.size()), cause);
  EXPECT_TRUE(messages[1].ends_with(u"; this cycle does nothing"));

  test::RemoveTree(lock_path);
  EnsureDatabase(dir_.path());
  EXPECT_EQ(Run(), CycleResult::kDone);
  EXPECT_EQ(Names(), std::vector<std::u16string>{u"PROC_a.eml"});
}

TEST_F(LockedCycleTest, AFileThatIsNotADatabaseIsNeverTouched) {
  const std::string junk(5000, 'j');
  WriteText(DatabasePathOf(dir_.path()), junk);
  EXPECT_EQ(Run(), CycleResult::kNotADatabase);
  EXPECT_EQ(Run(), CycleResult::kNotADatabase);
  EXPECT_EQ(calls_, 0);
  EXPECT_EQ(Names(), std::vector<std::u16string>{u"a.eml"});
  EXPECT_EQ(test::ReadText(DatabasePathOf(dir_.path())), junk);
  const auto messages = log_.Messages();
  EXPECT_EQ(std::count(messages.begin(), messages.end(),
                       DatabasePathOf(dir_.path()) + u" is not an alert database; no alert file is processed"),
            2);
}

TEST_F(LockedCycleTest, ADatabaseLeftWithoutItsTableStoresAgain) {
  WriteText(DatabasePathOf(dir_.path()), "");
  EXPECT_EQ(Run(), CycleResult::kDone);
  EXPECT_EQ(Names(), std::vector<std::u16string>{u"PROC_a.eml"});
}

// Asks for a stop when a report folder is listed or when a file is renamed.
class StopAt : public platform::Env {
 public:
  enum class Where { kBefore, kListing, kRename, kNever };
  StopAt(platform::StopSignal* stop, Where where) : stop_(stop), where_(where) {}
  bool ListFiles(const std::u16string& folder, const std::u16string& wildcard, std::string_view skip,
                 std::vector<std::u16string>* out) override {
    if (where_ == Where::kListing) stop_->Request();
    return Env::ListFiles(folder, wildcard, skip, out);
  }
  platform::FileResult RenameNoReplace(const std::u16string& from, const std::u16string& to) override {
    if (where_ == Where::kRename) stop_->Request();
    return Env::RenameNoReplace(from, to);
  }

 private:
  platform::StopSignal* stop_;
  Where where_;
};

// After a stop only the file in hand is finished: no further report folder
// is listed, the database is not opened, no further file is read.
TEST_F(LockedCycleTest, AStopIsSeenBeforeEachReportFolderTheDatabaseAndEachFile) {
  struct Case {
    StopAt::Where where;
    int stored;    // files of the cycle given their PROC_ name
    int listings;  // report folders listed
    int opens;     // "Inside OpenDB function" lines
  };
  const Case cases[] = {
      {StopAt::Where::kBefore, 0, 0, 0},
      {StopAt::Where::kListing, 0, 1, 0},
      {StopAt::Where::kRename, 1, 1, 1},
      {StopAt::Where::kNever, 3, 2, 2},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(static_cast<int>(&c - cases));
    TempDir dir;
    WriteText(dir.Join(u"Comp\\info.dat"), "");
    for (const char16_t* name : {u"Sent items\\a.eml", u"Sent items\\b.eml", u"Outbox\\c.eml"}) {
      WriteText(dir.Join(u"Comp\\AlertReports\\" + std::u16string(name)), kAlert);
    }
    EnsureDatabase(dir.path());
    test::CapturedLog log;
    platform::StopSignal stop;
    if (c.where == StopAt::Where::kBefore) stop.Request();
    StopAt env(&stop, c.where);
    CycleContext cycle(&stop);
    {
      platform::ScopedEnv scope(&env);
      EXPECT_EQ(RunProcessingCycle(dir.path(), cycle), CycleResult::kDone);
    }
    int stored = 0;
    for (const char16_t* folder : {u"Sent items", u"Outbox"}) {
      for (const auto& name : test::ListNames(dir.Join(u"Comp\\AlertReports\\" + std::u16string(folder)))) {
        stored += name.starts_with(u"PROC_");
      }
    }
    EXPECT_EQ(stored, c.stored);
    const auto messages = log.Messages();
    EXPECT_EQ(std::count(messages.begin(), messages.end(), u"Inside GetDomainFolders function"), c.listings);
    EXPECT_EQ(std::count_if(messages.begin(), messages.end(),
                            [](const std::u16string& m) { return m.starts_with(u"Inside OpenDB function"); }),
              c.opens);
  }
}

}  // namespace
}  // namespace asum
