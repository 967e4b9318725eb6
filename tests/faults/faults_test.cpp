// Faults a deployment meets around the database (a file that is no database and
// refused renames are the collector's tests). While one lasts, each file is
// stored once or keeps its name without a row; once mended, each is stored once.
#include <atomic>
#include <functional>
#include <iostream>

#include "fault_support.h"

namespace asum::test {
namespace {

// While set, each new connection may grow its file to this many pages: inserts
// fail as on a full disk.
std::atomic<int> g_page_limit{0};
int LimitPages(sqlite3* db, char**, const void*) {
  const std::string pragma = "PRAGMA max_page_count = " + std::to_string(g_page_limit.load());
  return g_page_limit > 0 ? sqlite3_exec(db, pragma.c_str(), nullptr, nullptr, nullptr) : SQLITE_OK;
}
const auto kLimitPages = reinterpret_cast<void (*)()>(&LimitPages);

#ifndef _WIN32
bool InDatabaseFolder(const Install& i, const std::string& command) {
  return std::system(("cd '" + Narrow(platform::FolderOf(DatabasePathOf(i.path()))) + "' && " + command).c_str()) == 0;
}
#endif

TEST(Faults, WhileAFaultLastsNoFileIsHalfDoneAndOnceMendedEachIsStoredOnce) {
  sqlite3* holder = nullptr;
  const auto db = [](const Install& i) { return DatabasePathOf(i.path()); };
  struct Fault {
    const char* name;
    std::function<bool(const Install&)> make;  // false: this machine cannot make it
    std::function<void(const Install&)> mend;
    bool locked;  // every file waits (else only some), and the cycle spent its one lock-wait allowance
  };
  const Fault faults[] = {
      {"locked by another program",
       [&](const Install& i) {
         return !sqlite3_open16(db(i).c_str(), &holder) && !sqlite3_exec(holder, "BEGIN EXCLUSIVE", 0, 0, 0);
       },
       [&](const Install&) { sqlite3_close(holder); }, true},
      {"deleted (made anew)", [&](const Install& i) { return RemoveTree(db(i)), true; }, [](const Install&) {}, false},
      {"full",
       [&](const Install& i) {
         g_page_limit = std::stoi(Narrow(i.Sql("PRAGMA page_count").at(0))) + 2;
         return sqlite3_auto_extension(kLimitPages) == SQLITE_OK;
       },
       [](const Install&) { g_page_limit = 0, sqlite3_cancel_auto_extension(kLimitPages); }, false},
#ifndef _WIN32
      // A small disk over the database folder, filled to a few pages; the database goes back after.
      {"disk full",
       [&](const Install& i) {
         return InDatabaseFolder(i, "mount -t tmpfs -o size=256k tmpfs . 2>/dev/null") &&
                (EnsureDatabase(i.path()),
                 InDatabaseFolder(i, "(dd if=/dev/zero of=fill; truncate -s -12K fill) 2>/dev/null"));
       },
       [&](const Install& i) {
         EXPECT_TRUE(InDatabaseFolder(
             i, "cp AlertSummaryDB.db ../db && cd .. && umount \"$OLDPWD\" && mv db \"$OLDPWD\"/AlertSummaryDB.db"));
       },
       false},
#endif
  };
  const std::vector<std::u16string> folders = {kSent, u"Main Component\\AlertReports\\Outbox",
                                               u"Second\\AlertReports\\Sent items", u"Second\\AlertReports\\Outbox"};
  for (const Fault& f : faults) {
    SCOPED_TRACE(f.name);
    CapturedLog log;
    Install install;
    install.Drop(u"Second", u"info.dat", "");
    const std::vector<std::u16string> paths = install.DropAlerts(0, 40, folders);
    if (!f.make(install)) {  // only root may mount a disk
      std::cout << "skipped \"" << f.name << "\": this machine cannot make that fault\n";
      continue;
    }
    CycleContext cycle(nullptr, 100);
    EXPECT_EQ(RunProcessingCycle(install.path(), nullptr, &cycle), CycleResult::kDone);
    f.mend(install);
    EXPECT_EQ(cycle.busy.Exhausted(), f.locked);
    std::vector<End> ends = EndsOf(install, paths);
    EXPECT_EQ(Count(ends, kLeft) + Count(ends, kStored), 40);
    EXPECT_TRUE(f.locked ? Count(ends, kLeft) == 40 : Count(ends, kLeft) > 0 && Count(ends, kStored) > 0);

    EXPECT_EQ(RunProcessingCycle(install.path()), CycleResult::kDone);
    EXPECT_EQ(Count(EndsOf(install, paths), kStored), 40);
  }
}

}  // namespace
}  // namespace asum::test
