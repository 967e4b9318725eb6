// Faults a deployment meets around the database and the report folders.
// While one lasts, each file is stored once or keeps its name without a row;
// once it is mended, the next cycles store every file exactly once.
#include <atomic>
#include <functional>
#include <optional>

#include "alert_generator.h"
#include "fault_support.h"

namespace asum::test {
namespace {

// Renames and deletes refused, as in a folder the service account may not
// change (a read-only folder does not stop root).
struct RefusingEnv : platform::Env {
  platform::FileResult RenameNoReplace(const std::u16string&, const std::u16string&) override { return Denied(); }
  platform::FileResult RemoveFile(const std::u16string&) override { return Denied(); }
  static platform::FileResult Denied() { return {platform::FileStatus::kAccessDenied, 5}; }
};

// While set, each new connection may grow its file to this many pages, so
// inserts fail as on a full disk.
std::atomic<int> g_page_limit{0};
int LimitPages(sqlite3* db, char**, const void*) {
  const std::string pragma = "PRAGMA max_page_count = " + std::to_string(g_page_limit.load());
  if (g_page_limit > 0) sqlite3_exec(db, pragma.c_str(), nullptr, nullptr, nullptr);
  return SQLITE_OK;
}
const auto kLimitPages = reinterpret_cast<void (*)()>(&LimitPages);

bool Shell(const std::string& command) { return std::system(command.c_str()) == 0; }

TEST(Faults, WhileAFaultLastsNoFileIsHalfDoneAndOnceMendedEachIsStoredOnce) {
  sqlite3* holder = nullptr;
  RefusingEnv refusing;
  std::optional<platform::ScopedEnv> scoped;
  const auto db = [](const Install& i) { return DatabasePathOf(i.path()); };
  const auto summary = [&](const Install& i) { return "'" + Narrow(platform::FolderOf(db(i))) + "'"; };
  struct Fault {
    const char* name;
    std::function<bool(const Install&)> make;  // false: this machine cannot make it
    std::function<void(const Install&)> mend;
    CycleResult result;  // of the cycle during the fault
    bool all_left;       // every file keeps its name (else only some)
    bool waits;          // the cycle spent its one lock-wait allowance, however many folders it had
  };
  const Fault faults[] = {
      {"locked by another program",
       [&](const Install& i) {
         return sqlite3_open16(db(i).c_str(), &holder) == SQLITE_OK &&
                sqlite3_exec(holder, "BEGIN EXCLUSIVE", nullptr, nullptr, nullptr) == SQLITE_OK;
       },
       [&](const Install&) { sqlite3_close(holder); }, CycleResult::kDone, true, true},
      {"replaced by another file, then put back",
       [&](const Install& i) {
         return platform::Env::Default().RenameNoReplace(db(i), db(i) + u".aside").ok() &&
                (WriteText(db(i), "a spreadsheet, not a database\r\n" + std::string(5000, 'x')), true);
       },
       [&](const Install& i) { RemoveTree(db(i)), platform::Env::Default().RenameNoReplace(db(i) + u".aside", db(i)); },
       CycleResult::kNotADatabase, true, false},
      {"deleted", [&](const Install& i) { return RemoveTree(db(i)), true; }, [](const Install&) {},
       CycleResult::kDone, false, false},  // the first folder's call makes it anew
      {"full",
       [&](const Install& i) {
         g_page_limit = std::stoi(Narrow(i.Sql("PRAGMA page_count").at(0))) + 2;
         return sqlite3_auto_extension(kLimitPages) == SQLITE_OK;
       },
       [](const Install&) { g_page_limit = 0, sqlite3_cancel_auto_extension(kLimitPages); }, CycleResult::kDone,
       false, false},
      {"renames and deletes refused", [&](const Install&) { return scoped.emplace(&refusing), true; },
       [&](const Install&) { scoped.reset(); }, CycleResult::kDone, true, false},
#ifndef _WIN32
      // A small disk mounted over the database folder, filled to a few pages;
      // the database goes back where it was before the disk is taken away.
      {"disk full",
       [&](const Install& i) {
         if (!Shell("mount -t tmpfs -o size=256k tmpfs " + summary(i) + " 2>/dev/null")) return false;
         EnsureDatabase(i.path());
         return Shell("cd " + summary(i) + " && (dd if=/dev/zero of=filler bs=4k 2>/dev/null; truncate -s -12K filler)");
       },
       [&](const Install& i) {
         EXPECT_TRUE(Shell("cd " + summary(i) + " && cp AlertSummaryDB.db ../db && cd .. && umount " + summary(i) +
                           " && mv db " + summary(i) + "/AlertSummaryDB.db"));
       },
       CycleResult::kDone, false, false},
#endif
  };
  const std::u16string folders[] = {kSent, u"Main Component\\AlertReports\\Outbox", u"Second\\AlertReports\\Sent items",
                                    u"Second\\AlertReports\\Outbox"};
  for (const Fault& f : faults) {
    SCOPED_TRACE(f.name);
    CapturedLog log;
    Install install;
    install.Drop(u"Second", u"info.dat", "");
    std::vector<std::u16string> paths;
    for (uint32_t i = 0; i < 40; ++i) {
      const gen::GeneratedAlert alert = gen::GenerateAlert(3, i, 3, false);
      paths.push_back(install.Drop(folders[i % 4], U16(alert.file_name), alert.bytes));
    }
    if (!f.make(install)) {
      std::cout << f.name << ": this machine cannot make the fault (mounting a disk needs root)\n";
      continue;
    }
    CycleContext cycle(nullptr, 100);
    EXPECT_EQ(RunProcessingCycle(install.path(), nullptr, &cycle), f.result);
    f.mend(install);
    EXPECT_EQ(cycle.busy.Exhausted(), f.waits);
    std::vector<End> ends = EndsOf(install, paths);
    EXPECT_EQ(Count(ends, kLeft) + Count(ends, kStored), 40);
    EXPECT_TRUE(f.all_left ? Count(ends, kLeft) == 40 : Count(ends, kLeft) > 0 && Count(ends, kStored) > 0);

    EXPECT_EQ(RunProcessingCycle(install.path()), CycleResult::kDone);
    EXPECT_EQ(RunProcessingCycle(install.path()), CycleResult::kDone);
    EXPECT_EQ(Count(EndsOf(install, paths), kStored), 40);
  }
}

}  // namespace
}  // namespace asum::test
