#include "collect/cycle.h"

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <algorithm>
#include <filesystem>
#include <fstream>

#include "store/setting_db_management.h"
#include "support/test_support.h"

namespace asum {
namespace {

using Lines = std::vector<std::u16string>;

const char kAlert[] =
    "From: a@b.example\r\nSubject: Threshold Alert: T \"N\" (S(C)\\R\\X)\r\nContent-Type: text/html\r\n\r\n"
    "<table><tr><th>Who</th></tr><tbody><tr><td>u</td></tr></tbody></table>";

// An install folder with one component: two alerts in Sent items, one in Outbox.
struct Install {
  Install() {
    test::WriteText(dir.Join(u"Comp\\info.dat"), "");
    for (const char16_t* name : {u"Sent items\\a.eml", u"Sent items\\b.eml", u"Outbox\\c.eml"}) {
      test::WriteText(dir.Join(u"Comp\\AlertReports\\" + std::u16string(name)), kAlert);
    }
  }
  int Stored() const {
    int stored = 0;
    for (const char16_t* folder : {u"Comp\\AlertReports\\Sent items", u"Comp\\AlertReports\\Outbox"}) {
      for (const auto& name : test::ListNames(dir.Join(folder))) stored += name.starts_with(u"PROC_");
    }
    return stored;
  }
  test::TempDir dir;
};

// Without the collector lock, or with a database file that is no alert
// database, no file is touched and the log says why; a database left without
// its table (a crash during its creation) is given one and used.
TEST(RunProcessingCycle, RunsOnlyWithTheLockAndAnAlertDatabase) {
  platform::Env& env = platform::Current();
  const std::string junk(5000, 'j');
  const CycleResult results[] = {CycleResult::kBusy, CycleResult::kNoLock, CycleResult::kNotADatabase,
                                 CycleResult::kDone};
  for (const CycleResult result : results) {
    Install install;
    test::CapturedLog log;
    const std::u16string lock = CollectorLockPathOf(install.dir.path()), db = DatabasePathOf(install.dir.path());
    platform::FileResult failure;
    platform::FileLock held = result == CycleResult::kBusy ? env.TryLockFile(lock, &failure) : nullptr;
    if (result == CycleResult::kNoLock) test::MakeFolders(lock);  // a lock file that cannot be opened
    if (result == CycleResult::kNotADatabase) test::WriteText(db, junk);
    if (result == CycleResult::kDone) test::WriteText(db, "");
    EXPECT_EQ(RunProcessingCycle(install.dir.path()), result);
    if (held != nullptr) env.UnlockFile(held);
    EXPECT_EQ(install.Stored(), result == CycleResult::kDone ? 3 : 0);
    const Lines lines = log.Messages();
    const std::u16string why[] = {
        u"Another collector is processing " + install.dir.path() + u"; this cycle does nothing",
        u"The collector lock " + lock + u" cannot be created or opened: ",
        db + u" is not an alert database; no alert file is processed"};
    if (result == CycleResult::kDone) continue;
    EXPECT_TRUE(std::any_of(lines.begin(), lines.end(), [&](auto& l) { return l.starts_with(why[int(result) - 1]); }));
    if (result == CycleResult::kNotADatabase) {
      EXPECT_EQ(test::ReadText(db), junk);
    } else {  // the only line: nothing else was done
      ASSERT_EQ(lines.size(), 1u);
      EXPECT_TRUE(lines[0].ends_with(u"; this cycle does nothing"));
    }
  }
}

// Asks for a stop when a report folder is listed.
class StopAtListing : public platform::Env {
 public:
  explicit StopAtListing(platform::StopSignal* stop) : stop_(stop) {}
  bool ListFiles(const std::u16string& folder, const std::u16string& wildcard, std::string_view skip,
                 std::vector<std::u16string>* out) override {
    stop_->Request();
    return Env::ListFiles(folder, wildcard, skip, out);
  }

 private:
  platform::StopSignal* stop_;
};

// A stop is seen before each report folder and before the database is opened
// (the processing sees it before each file).
TEST(RunProcessingCycle, AStopIsSeenBeforeEachReportFolderAndTheDatabase) {
  for (const bool before : {true, false}) {
    Install install;
    EnsureDatabase(install.dir.path());
    test::CapturedLog log;
    platform::StopSignal stop;
    if (before) stop.Request();
    StopAtListing env(&stop);
    CycleContext cycle(&stop);
    {
      platform::ScopedEnv scope(&env);
      EXPECT_EQ(RunProcessingCycle(install.dir.path(), nullptr, &cycle), CycleResult::kDone);
    }
    EXPECT_EQ(install.Stored(), 0);
    const Lines lines = log.Messages();
    EXPECT_EQ(std::count(lines.begin(), lines.end(), u"Inside GetDomainFolders function"), before ? 0 : 1);
    EXPECT_TRUE(!before || lines.empty()) << "stopped before anything was looked at";
    EXPECT_FALSE(std::any_of(lines.begin(), lines.end(), [](auto& l) { return l.starts_with(u"Inside OpenDB"); }));
  }
}

#ifndef _WIN32
// Linux names are bytes: one that is not UTF-8 is stored and renamed by its
// exact bytes; its row shows each bad byte as U+FFFD, the log as '?'.
TEST(RunProcessingCycle, ANameThatIsNotUtf8IsStoredAndMarkedByItsExactBytes) {
  test::TempDir dir;
  test::CapturedLog log;
  test::WriteText(dir.Join(u"Comp\\info.dat"), "");
  const std::u16string sent = dir.Join(u"Comp\\AlertReports\\Sent items");
  const std::filesystem::path folder(test::Narrow(sent));
  std::filesystem::create_directories(folder);
  std::ofstream(folder / "Alert_caf\xe9.eml", std::ios::binary) << kAlert;
  EnsureDatabase(dir.path());
  ASSERT_EQ(RunProcessingCycle(dir.path()), CycleResult::kDone);
  EXPECT_FALSE(std::filesystem::exists(folder / "Alert_caf\xe9.eml"));
  EXPECT_TRUE(std::filesystem::exists(folder / "PROC_Alert_caf\xe9.eml"));
  const std::u16string shown = sent + platform::kPathSeparator + u"Alert_caf\uFFFD.eml";
  sqlite3* db = nullptr;
  ASSERT_EQ(sqlite3_open16(DatabasePathOf(dir.path()).c_str(), &db), SQLITE_OK);
  std::string path;
  sqlite3_exec(db, "SELECT \"Alert Path\" FROM AlertDB", [](void* out, int, char** v, char**) {
    return *static_cast<std::string*>(out) = v[0], 0;
  }, &path, nullptr);
  sqlite3_close(db);
  EXPECT_EQ(path, test::Narrow(shown));
  std::u16string logged = shown + u"Successfully renamed";
  std::replace(logged.begin(), logged.end(), u'\uFFFD', u'?');  // the log holds one byte per character
  const Lines lines = log.Messages();
  EXPECT_NE(std::find(lines.begin(), lines.end(), logged), lines.end());
}
#endif

}  // namespace
}  // namespace asum
