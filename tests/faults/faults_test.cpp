// Faults around the store and the report folders. After each one the system
// keeps working: the files it could not finish keep their names, and the
// next sound cycle stores each of them exactly once.
#include <gtest/gtest.h>
#include <sqlite3.h>

#include <atomic>
#include <functional>
#include <string>

#ifndef _WIN32
#include <fcntl.h>
#include <unistd.h>

#include <cstdlib>
#endif

#include "fault_support.h"
#include "hostile_files.h"
#include "platform/platform.h"

namespace asum::test {
namespace {

std::vector<std::u16string> DropAlerts(const Install& install, int count, const std::string& who_padding = "") {
  std::vector<std::u16string> paths;
  for (int i = 0; i < count; ++i) {
    paths.push_back(install.Drop(u"alert_" + U16(std::to_string(i)) + u".eml",
                                 PlainAlert("CORP\\user" + std::to_string(i) + who_padding)));
  }
  return paths;
}

// Every file keeps its own name and has no row.
void ExpectAllLeft(const Install& install, const std::vector<std::u16string>& paths) {
  const auto rows = install.RowsByPath();
  for (const std::u16string& p : paths) {
    EXPECT_TRUE(Exists(p)) << Narrow(p);
    EXPECT_FALSE(Exists(ProcName(p))) << Narrow(p);
    EXPECT_EQ(rows.count(p), 0u) << Narrow(p);
  }
}

// Every file has its PROC_ name and exactly one row.
void ExpectAllStoredOnce(const Install& install, const std::vector<std::u16string>& paths) {
  const auto rows = install.RowsByPath();
  for (const std::u16string& p : paths) {
    EXPECT_FALSE(Exists(p)) << Narrow(p);
    EXPECT_TRUE(Exists(ProcName(p))) << Narrow(p);
    const auto found = rows.find(p);
    EXPECT_EQ(found == rows.end() ? 0 : found->second, 1) << Narrow(p);
  }
  EXPECT_EQ(install.IntegrityCheck(), "ok");
}

// A database another program holds locked costs a cycle one lock-wait
// allowance in all, however many report folders have files (the allowance's
// own account says so, no clock); every file stays for the next cycle.
TEST(StoreFaults, DatabaseLockedLongerThanACycleCostsOneAllowanceAndLeavesTheFiles) {
  CapturedLog log;
  Install install;
  std::vector<std::u16string> paths = DropAlerts(install, 2);
  WriteText(install.path() + platform::kPathSeparator + u"Second" + platform::kPathSeparator + u"info.dat", "");
  for (const char16_t* folder : {u"Main Component\\AlertReports\\Outbox\\", u"Second\\AlertReports\\Sent items\\",
                                 u"Second\\AlertReports\\Outbox\\"}) {
    for (int i = 0; i < 2; ++i) {
      const std::u16string name = std::u16string(folder) + u"alert_" + U16(std::to_string(i)) + u".eml";
      paths.push_back(install.path() + platform::kPathSeparator + platform::NativeSeparators(name));
      WriteText(paths.back(), PlainAlert("CORP\\other" + std::to_string(paths.size())));
    }
  }

  sqlite3* holder = nullptr;
  ASSERT_EQ(sqlite3_open16(install.DbPath().c_str(), &holder), SQLITE_OK);
  ASSERT_EQ(sqlite3_exec(holder, "BEGIN EXCLUSIVE", nullptr, nullptr, nullptr), SQLITE_OK);
  CycleContext cycle(nullptr, 100);
  ProcessTally tally;
  EXPECT_EQ(install.Cycle(&tally, &cycle), CycleResult::kDone);
  EXPECT_EQ(tally.left, paths.size());
  EXPECT_TRUE(cycle.busy.Exhausted());
  EXPECT_LE(cycle.busy.SpentMs(), cycle.busy.TotalMs());
  sqlite3_exec(holder, "COMMIT", nullptr, nullptr, nullptr);
  sqlite3_close(holder);
  ExpectAllLeft(install, paths);

  EXPECT_EQ(install.Cycle(), CycleResult::kDone);
  ExpectAllStoredOnce(install, paths);
}

TEST(StoreFaults, DatabaseReplacedByAnotherFileIsNeverTouchedAndDeletedIsRebuilt) {
  CapturedLog log;
  Install install;
  const auto first = DropAlerts(install, 3);
  ASSERT_EQ(install.Cycle(), CycleResult::kDone);
  ExpectAllStoredOnce(install, first);

  const std::string junk = "this is a spreadsheet, not a database\r\n" + std::string(5000, 'x');
  WriteText(install.DbPath(), junk);
  const std::u16string late = install.Drop(u"late.eml", PlainAlert("CORP\\late"));
  EXPECT_EQ(install.Cycle(), CycleResult::kNotADatabase);
  EXPECT_EQ(install.Cycle(), CycleResult::kNotADatabase);
  EXPECT_EQ(ReadText(install.DbPath()), junk);
  EXPECT_TRUE(Exists(late));

  // Someone removes the file: the first cycle creates a new database and
  // leaves the files, the next stores them.
  RemoveTree(install.DbPath());
  EXPECT_EQ(install.Cycle(), CycleResult::kDone);
  EXPECT_TRUE(Exists(install.DbPath()));
  EXPECT_TRUE(Exists(late));
  EXPECT_EQ(install.Cycle(), CycleResult::kDone);
  ExpectAllStoredOnce(install, {late});
  EXPECT_EQ(install.RowCount(), 1);
}

// Renames and deletes refused, as a folder the service account may not
// change refuses them (a read-only folder does not stop root).
class RefusingEnv : public platform::Env {
 public:
  platform::FileResult RenameNoReplace(const std::u16string&, const std::u16string&) override { return Denied(); }
  platform::FileResult RemoveFile(const std::u16string&) override { return Denied(); }

 private:
  static platform::FileResult Denied() { return {platform::FileStatus::kAccessDenied, 5}; }
};

TEST(ReportFolderFaults, RenamesRefusedLeaveEveryFileWithoutARowUntilTheyWork) {
  CapturedLog log;
  Install install;
  auto paths = DropAlerts(install, 4);
  const std::u16string empty = install.Drop(u"empty.eml", "");
  {
    RefusingEnv refusing;
    platform::ScopedEnv scoped(&refusing);
    for (int cycle = 0; cycle < 2; ++cycle) {
      ProcessTally tally;
      EXPECT_EQ(install.Cycle(&tally), CycleResult::kDone);
      EXPECT_EQ(tally.left, 5u);
      EXPECT_EQ(tally.stored, 0u);
    }
  }
  ExpectAllLeft(install, paths);
  EXPECT_TRUE(Exists(empty));
  EXPECT_EQ(install.RowCount(), 0) << "a row whose file kept its name would be stored again every cycle";

  ProcessTally tally;
  EXPECT_EQ(install.Cycle(&tally), CycleResult::kDone);
  EXPECT_EQ(tally.stored, 4u);
  EXPECT_EQ(tally.marked, 1u);
  ExpectAllStoredOnce(install, paths);
  EXPECT_TRUE(Exists(ProcName(empty)));
}

// Every new connection of this process gets a page limit while it is set,
// so inserts fail with a full database as on a full disk.
std::atomic<int> g_page_limit{0};

int LimitPages(sqlite3* db, char**, const void*) {
  const int limit = g_page_limit.load();
  if (limit > 0) {
    const std::string pragma = "PRAGMA max_page_count = " + std::to_string(limit);
    sqlite3_exec(db, pragma.c_str(), nullptr, nullptr, nullptr);
  }
  return SQLITE_OK;
}

int PageCount(const std::u16string& db_path) {
  sqlite3* db = nullptr;
  int pages = -1;
  if (sqlite3_open16(db_path.c_str(), &db) == SQLITE_OK) {
    sqlite3_stmt* st = nullptr;
    if (sqlite3_prepare_v2(db, "PRAGMA page_count", -1, &st, nullptr) == SQLITE_OK && sqlite3_step(st) == SQLITE_ROW) {
      pages = sqlite3_column_int(st, 0);
    }
    sqlite3_finalize(st);
  }
  sqlite3_close(db);
  return pages;
}

// What a full store leaves: some files stored once, the rest under their
// names without a row; then the rest once there is room again.
void ExpectFullThenRecovered(const Install& install, const std::vector<std::u16string>& paths,
                             const ProcessTally& full, const std::function<void()>& make_room) {
  EXPECT_GT(full.left, 0u) << "the store never filled up";
  const auto rows = install.RowsByPath();
  for (const std::u16string& p : paths) {
    const auto found = rows.find(p);
    const int n = found == rows.end() ? 0 : found->second;
    if (Exists(p)) {
      EXPECT_EQ(n, 0) << Narrow(p);
    } else {
      EXPECT_EQ(n, 1) << Narrow(p);
    }
  }
  EXPECT_EQ(install.IntegrityCheck(), "ok");
  make_room();
  EXPECT_EQ(install.Cycle(), CycleResult::kDone);
  ExpectAllStoredOnce(install, paths);
}

TEST(StoreFaults, FullDatabaseKeepsTheFilesItCouldNotStore) {
  CapturedLog log;
  Install install;
  const auto paths = DropAlerts(install, 40, std::string(600, 'w'));
  const int pages = PageCount(install.DbPath());
  ASSERT_GT(pages, 0);
  g_page_limit = pages + 2;
  ASSERT_EQ(sqlite3_auto_extension(reinterpret_cast<void (*)(void)>(&LimitPages)), SQLITE_OK);
  ProcessTally tally;
  EXPECT_EQ(install.Cycle(&tally), CycleResult::kDone);
  g_page_limit = 0;
  sqlite3_cancel_auto_extension(reinterpret_cast<void (*)(void)>(&LimitPages));
  ExpectFullThenRecovered(install, paths, tally, [] {});
}

#ifndef _WIN32
// A small memory file system mounted over the database folder, unmounted
// before the install folder goes.
class SmallDisk {
 public:
  explicit SmallDisk(const std::u16string& folder) : folder_(Narrow(folder)) {
    if (geteuid() != 0) return;
    const std::string command = "mount -t tmpfs -o size=256k tmpfs '" + folder_ + "' 2>/dev/null";
    mounted_ = std::system(command.c_str()) == 0;
  }
  ~SmallDisk() {
    if (!mounted_) return;
    const std::string command = "umount '" + folder_ + "'";
    if (std::system(command.c_str()) != 0) ADD_FAILURE() << "cannot unmount " << folder_;
  }
  bool mounted() const { return mounted_; }

  // Fills the disk, then gives `slack` bytes back; the filler goes with Free().
  void Fill(off_t slack) {
    filler_ = folder_ + "/filler";
    const int fd = open(filler_.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
    ASSERT_GE(fd, 0);
    const std::string block(4096, 'f');
    off_t size = 0;
    while (write(fd, block.data(), block.size()) == static_cast<ssize_t>(block.size())) size += 4096;
    EXPECT_EQ(ftruncate(fd, size > slack ? size - slack : 0), 0);
    close(fd);
  }
  void Free() { unlink(filler_.c_str()); }

 private:
  std::string folder_;
  std::string filler_;
  bool mounted_ = false;
};

TEST(StoreFaults, DiskFullWhileInsertingKeepsTheFilesItCouldNotStore) {
  CapturedLog log;
  Install install;
  const std::u16string summary_folder = install.DbPath().substr(0, install.DbPath().rfind(u'/'));
  SmallDisk disk(summary_folder);
  if (!disk.mounted()) GTEST_SKIP() << "mounting a small tmpfs needs root and a machine that allows it";
  EnsureDatabase(install.path());  // the mount hides the database made before
  const auto paths = DropAlerts(install, 40, std::string(600, 'w'));
  disk.Fill(12 * 1024);
  ProcessTally tally;
  EXPECT_EQ(install.Cycle(&tally), CycleResult::kDone);
  ExpectFullThenRecovered(install, paths, tally, [&] { disk.Free(); });
}
#endif

}  // namespace
}  // namespace asum::test
