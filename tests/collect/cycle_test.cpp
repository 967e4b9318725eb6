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

TEST_F(LockedCycleTest, ASecondCollectorDoesNothingWhileTheFirstHoldsTheFolder) {
  platform::Env& env = platform::Current();
  platform::FileLock held = env.TryLockFile(CollectorLockPathOf(dir_.path()));
  ASSERT_NE(held, nullptr);
  EXPECT_EQ(Run(), CycleResult::kBusy);
  EXPECT_EQ(calls_, 0);
  const auto messages = log_.Messages();
  EXPECT_EQ(std::count(messages.begin(), messages.end(),
                       u"Another collector is processing " + dir_.path() + u"; this cycle does nothing"),
            1);
  env.UnlockFile(held);

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

}  // namespace
}  // namespace asum
