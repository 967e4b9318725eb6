#include "collect/cycle.h"

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <mutex>
#include <thread>

#include "mail/cls_email.h"
#include "store/setting_db_management.h"
#include "support/test_support.h"

namespace asum {
namespace {

using Row = std::vector<std::string>;  // UTF-8
using Lines = std::vector<std::u16string>;

// Runs one statement on the install folder's database; its rows.
std::vector<Row> Sql(const std::u16string& install, const char* sql = "SELECT * FROM AlertDB ORDER BY rowid") {
  std::vector<Row> rows;
  sqlite3* db = nullptr;
  sqlite3_open16(DatabasePathOf(install).c_str(), &db);
  const auto add = [](void* out, int n, char** values, char**) {
    static_cast<std::vector<Row>*>(out)->emplace_back(values, values + n);
    return 0;
  };
  EXPECT_EQ(sqlite3_exec(db, sql, add, &rows, nullptr), SQLITE_OK) << sql;
  sqlite3_close(db);
  return rows;
}

const std::string kDate = "Date: Mon, 11 Jun 2018 09:05:03 +0000\r\n";
const std::string kSubject = "Email Alert: T \"N\" (S(C)\\R\\X)";
const std::string kTable =
    "<p>Changes were found on <b>File Server(s).</b></p><table><thead><tr><th>Who</th><th>Operation</th>"
    "<th>Server Name</th><th>Component Name</th><th>Server</th></tr></thead><tbody>"
    "<tr><td>CORP\\jsmith</td><td>Deleted</td><td>FS01</td><td>File Server</td><td>SRV9</td></tr>"
    "<tr><td>corp\\JSMITH</td><td>Moved</td><td>FS02</td><td>File Server</td><td>SRV9</td></tr></tbody></table>";

std::string Message(const std::string& subject = kSubject, const std::string& html = kTable,
                    const std::string& date = kDate) {
  return "From: \"Alert Service\" <alerts@corp.example>\r\nSubject: " + subject + "\r\n" + date +
         "MIME-Version: 1.0\r\nContent-Type: text/html; charset=utf-8\r\n\r\n" + html;
}

// Whether the log holds the lines `patterns` in this order; a leading '%' stands for `path`.
bool Logged(const Lines& log, const Lines& patterns, const std::u16string& path) {
  auto line = log.begin();
  for (std::u16string pattern : patterns) {
    if (pattern.starts_with(u'%')) pattern = path + pattern.substr(1);
    line = std::find(line, log.end(), pattern);
    if (!pattern.empty() && line == log.end()) return false;
  }
  return true;
}

// A fixed clock (mid-month: a run across a month's end sees one month), the
// failures a test asks for, and each file read: its thread, and how many files
// the log had seen finished by then.
class TestEnv : public platform::Env {
 public:
  enum class Fault { kNone, kNoDate, kNoDatabase, kRefuseInsert, kBadVariantTime, kOverCap, kAtCap, kRenameRefused,
                     kRenameVanishes, kStopBefore, kStopRename, kBeingWritten };
  explicit TestEnv(const test::CapturedLog& captured) : log(captured) {}
  platform::SystemTime UtcNow() override { return {2031, 2, 6, 15, 12, 30, 45, 0}; }
  platform::SystemTime LocalNow() override { return UtcNow(); }
  std::optional<double> SystemTimeToVariantTime(const platform::SystemTime& st) override {
    return fault == Fault::kBadVariantTime ? std::nullopt : Env::SystemTimeToVariantTime(st);
  }
  platform::FileResult FileSize(const std::u16string& path, uint64_t* size) override {
    if (fault != Fault::kOverCap && fault != Fault::kAtCap) return Env::FileSize(path, size);
    *size = mail::kMaxMessageFileBytes + (fault == Fault::kOverCap);
    return {};
  }
  platform::FileResult ReadFile(const std::u16string& path, std::string* bytes, uint64_t max_bytes) override {
    const Lines lines = log.Messages();
    const auto done = std::count_if(lines.begin(), lines.end(), [](auto& m) { return m.ends_with(u"renamed"); });
    std::lock_guard<std::mutex> lock(mutex);
    reads.push_back({std::this_thread::get_id(), done});
    if (fault == Fault::kBeingWritten) return {platform::FileStatus::kSharingViolation, 32};
    return Env::ReadFile(path, bytes, max_bytes);
  }
  platform::ThreadHandle StartThread(void (*fn)(void*), void* arg) override {
    return ++threads, Env::StartThread(fn, arg);
  }
  platform::FileResult RenameNoReplace(const std::u16string& from, const std::u16string& to) override {
    if (fault == Fault::kStopRename) stop->Request();
    if (fault == Fault::kRenameRefused) return {platform::FileStatus::kAccessDenied, 5};
    if (fault != Fault::kRenameVanishes) return Env::RenameNoReplace(from, to);
    RemoveFile(from);
    return {platform::FileStatus::kNotFound, 2};
  }

  Fault fault = Fault::kNone;
  int threads = 0;  // started through the environment
  const test::CapturedLog& log;
  platform::StopSignal* stop = nullptr;
  std::mutex mutex;
  std::vector<std::pair<std::thread::id, std::ptrdiff_t>> reads;
};
using F = TestEnv::Fault;

class ProcessAlertFilesTest : public ::testing::Test {
 protected:
  // Writes the alert files into `component`'s Sent items and processes them in one call.
  StringList Process(const std::u16string& component, const std::vector<std::string>& messages,
                     const std::u16string& status = u"Delivered") {
    StringList files;
    for (const std::string& message : messages) {
      files.push_back(dir_.Join(component + u"\\AlertReports\\Sent items\\" + test::U16(std::to_string(++made_))));
      test::WriteText(files.back(), message);
    }
    EnsureDatabase(dir_.path());
    ProcessAlertFiles(dir_.path(), files, status, component);
    return files;
  }

  test::CapturedLog log_;
  test::TempDir dir_;
  TestEnv env_{log_};
  platform::ScopedEnv scope_{&env_};
  int made_ = 0;
};

TEST_F(ProcessAlertFilesTest, EachAlertGivesItsRowInColumnOrder) {
  const std::string script = "Script Execution Alert: Unlock \"Unlock accounts\" (DC01\\Account Lockout Report\\Daily)";
  const std::string who_table = "<table><tr><th>Who</th></tr><tbody><tr><td>u</td></tr></tbody></table>";
  struct Case {
    const char16_t* component;
    std::string subject, html;
    F fault;
    Row row;              // all columns but the path; its status is the call's
    const char16_t* who;  // Who and Operation as the log names them, before the fallbacks
  };
  const Case cases[] = {
      {u"Comp", "Threshold Alert: File Change \"Mass deletion\" (FS01(File Server)\\File Server Changes\\Daily)",
       kTable, F::kNone, {"Email Alert", "File Change", "Mass deletion", "2018/06/11 09:05:03", "Yes", "CORP\\jsmith",
       "Deleted, Moved", "File Server", "Delivered", "FS01"}, u"CORP\\jsmith & Deleted, Moved"},
      // "Server Name" replaces the predefined alert's "Server" (SRV9).
      {u"Predefine Alerts", "Change Alert:  \"All Environment Changes\"", kTable, F::kNone,
       {"Email Alert", "Change", "All Environment Changes", "2018/06/11 09:05:03", "No", "CORP\\jsmith",
        "Deleted, Moved", "File Server", "Failed", "FS01, FS02"}, u"CORP\\jsmith & Deleted, Moved"},
      {u"Predefine Alerts", "Data Leakage Alert: Potential Data Leakage!", "<p>nobody</p>", F::kNone,
       {"Email Alert", "Data Leakage", "Potential Data Leakage", "2018/06/11 09:05:03", "N\\A", "alerts@corp.example",
        "Email Sent", "Exchange Server", "Delivered", ""}, u"alerts@corp.example & "},
      {u"Comp", script, "<p><b>Who  :</b> &#74;&#83;</p>", F::kNone,
       {"Script Alert", "Unlock", "Unlock accounts", "2018/06/11 09:05:03", "N\\A", "JS", "Account Lockout Report",
        "Active Directory, Exchange Server & Group Policy", "Delivered", ""}, u" & "},
      // No paragraph end: no name, and the lockout report's "N\A" stands in.
      {u"Comp", script, "<p><b>Who  :</b> JS", F::kNone,
       {"Script Alert", "Unlock", "Unlock accounts", "2018/06/11 09:05:03", "N\\A", "N\\A", "Account Lockout Report",
        "Active Directory, Exchange Server & Group Policy", "Delivered", ""}, u" & "},
      // No date: the 1st of the clock's month; a date the conversion refuses: -1 throughout.
      {u"Comp", kSubject, who_table, F::kNoDate,
       {"Email Alert", "T", "N", "2031/02/01 00:00:00", "No", "u", "R", "C", "Delivered", "S"}, u"u & "},
      {u"Comp", kSubject, who_table, F::kBadVariantTime,
       {"Email Alert", "T", "N", "-1/-1/-1 -1:-1:-1", "No", "u", "R", "C", "Delivered", "S"}, u"u & "},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(&c - cases);
    test::CapturedLog log;
    env_.fault = c.fault;
    const std::string date = c.fault == F::kNoDate ? "" : kDate;
    const StringList files = Process(c.component, {Message(c.subject, c.html, date)}, test::U16(c.row[8]));
    Row expected = c.row;
    expected.push_back(test::Narrow(files[0]));
    const auto rows = Sql(dir_.path());
    ASSERT_EQ(rows.size(), static_cast<size_t>(&c - cases + 1));
    EXPECT_EQ(rows.back(), expected);
    const std::u16string fields = u"After calling \"ParseHtmlBodyAndGetFieldData\" function Who & Operation Fields are";
    EXPECT_TRUE(Logged(log.Messages(), {fields + u" " + c.who, u"Before calling \"FillDataDB\" function ",
                                        u"After calling \"FillDataDB\" function ", u"%Successfully renamed"},
                       files[0]));
  }
}

// What becomes of a file: renamed with its row, renamed without one (an
// empty subject or body, no Alert Type), deleted when its PROC_ name is taken,
// or left under its name and stored once in all by a later cycle that goes
// well. A file gone after it was read keeps its row.
TEST_F(ProcessAlertFilesTest, EachFileIsStoredOnceMarkedOrLeftForTheNextCycle) {
  const std::string no_type = "no colon and no quotes";
  struct Case {
    std::string subject, html;
    F fault;
    bool taken;              // a PROC_ file of that name is there already
    size_t rows, rows_next;  // after this call, and after the next call without the fault
    const char16_t* name;    // the file's name after this call (null: gone)
    const char16_t* line;    // a line of this call ('%' stands for the path)
  };
  const Case cases[] = {
      {kSubject, "", F::kNone, false, 0, 0, u"PROC_a.eml", u"Alert subject and body are empty."},
      {"", kTable, F::kNone, false, 0, 0, u"PROC_a.eml", u"Alert subject and body are empty."},
      {kSubject, kTable, F::kNone, true, 1, 1, u"PROC_a.eml", u"%Successfully renamed"},
      {no_type, kTable, F::kNone, true, 0, 0, u"PROC_a.eml", u""},
      {kSubject, kTable, F::kNoDatabase, false, 0, 1, u"a.eml", u""},
      {kSubject, kTable, F::kRefuseInsert, false, 0, 1, u"a.eml", u"Data is not inserted in DB"},
      {kSubject, kTable, F::kOverCap, false, 0, 1, u"a.eml",
       u"% holds 134217729 bytes, more than the 134217728 an alert file may hold; it keeps its name"},
      {kSubject, kTable, F::kAtCap, false, 1, 1, u"PROC_a.eml", u"%Successfully renamed"},
      {kSubject, kTable, F::kBeingWritten, false, 0, 1, u"a.eml",
       u"% is still being written (in use by another process (32)); it is offered again next cycle"},
      {kSubject, kTable, F::kRenameRefused, false, 0, 1, u"a.eml", u"% could not be renamed to its PROC_ name: access "
                                                                    u"denied (5)"},
      {kSubject, kTable, F::kRenameVanishes, false, 1, 1, nullptr, u"% could not be renamed to its PROC_ name: not "
                                                                    u"found (2)"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(&c - cases);
    test::TempDir dir;
    test::CapturedLog log;
    const std::u16string report = dir.Join(u"Comp\\AlertReports\\Sent items");
    StringList files{report + platform::kPathSeparator + u"a.eml"};
    test::WriteText(files[0], Message(c.subject, c.html));
    if (c.taken) test::WriteText(ProcName(files[0]), "earlier");
    if (c.fault != F::kNoDatabase) EnsureDatabase(dir.path());
    if (c.fault == F::kRefuseInsert) {
      Sql(dir.path(), "CREATE TRIGGER no BEFORE INSERT ON AlertDB BEGIN SELECT RAISE(ABORT, 'no'); END");
    }
    env_.fault = c.fault;
    ProcessAlertFiles(dir.path(), files, u"Delivered", u"Comp");
    EXPECT_EQ(Sql(dir.path()).size(), c.rows);
    EXPECT_EQ(test::ListNames(report), c.name ? Lines{c.name} : Lines{});
    EXPECT_EQ(test::ReadText(ProcName(files[0])) == "earlier", c.taken);
    const Lines lines = log.Messages();
    EXPECT_TRUE(Logged(lines, {c.line}, files[0]));
    EXPECT_EQ(std::count(lines.begin(), lines.end(), files[0] + u"Successfully renamed"), c.rows && c.name ? 1 : 0);
    env_.fault = F::kNone;
    if (c.fault == F::kRefuseInsert) Sql(dir.path(), "DROP TRIGGER no");
    ProcessAlertFiles(dir.path(), files, u"Delivered", u"Comp");
    EXPECT_EQ(Sql(dir.path()).size(), c.rows_next);
  }
}

// Should reading a file bring the process down, the log's last lines must
// name that file: with the log on, nothing is read ahead or written later by
// another thread. With it off, files may be read ahead; all are stored.
TEST_F(ProcessAlertFilesTest, WithTheLogOnEachFileIsReadOnTheProcessingThreadAfterThePreviousIsDone) {
  Process(u"On", {Message(), Message(), Message()});
  ASSERT_EQ(env_.reads.size(), 3u);
  for (std::ptrdiff_t k = 0; k < 3; ++k) EXPECT_EQ(env_.reads[k], std::make_pair(std::this_thread::get_id(), k));
  EXPECT_EQ(env_.threads, 0) << "no reader ahead while the log is on";
  const std::u16string log_folder = platform::LogFolder();
  platform::SetLogFolder(log_folder + u"-absent");
  Process(u"Off", {Message(), Message(), Message(), Message(), Message()});
  platform::SetLogFolder(log_folder);
  EXPECT_EQ(Sql(dir_.path()).size(), 8u);
}

// An install folder with one component: two alerts in Sent items, one in Outbox.
struct Install {
  Install() {
    test::WriteText(dir.Join(u"Comp\\info.dat"), "");
    for (const char16_t* name : {u"Sent items\\a.eml", u"Sent items\\b.eml", u"Outbox\\c.eml"}) {
      test::WriteText(dir.Join(u"Comp\\AlertReports\\" + std::u16string(name)), Message());
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
    test::WriteText(db, result == CycleResult::kNotADatabase ? junk : "");
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

// A stop is seen before the database is opened and before each report folder
// (the processing sees it before each file: here the first rename asks for it).
TEST(RunProcessingCycle, AStopIsSeenBeforeEachReportFolderAndTheDatabase) {
  for (const F fault : {F::kStopBefore, F::kStopRename}) {
    Install install;
    EnsureDatabase(install.dir.path());
    test::CapturedLog log;
    platform::StopSignal stop;
    TestEnv env(log);
    env.fault = fault, env.stop = &stop;
    if (fault == F::kStopBefore) stop.Request();
    CycleContext cycle(&stop);
    {
      platform::ScopedEnv scope(&env);
      EXPECT_EQ(RunProcessingCycle(install.dir.path(), nullptr, &cycle), CycleResult::kDone);
    }
    EXPECT_EQ(install.Stored(), fault == F::kStopBefore ? 0 : 1);
    const Lines lines = log.Messages();
    EXPECT_EQ(std::count(lines.begin(), lines.end(), u"Inside GetDomainFolders function"), fault == F::kStopRename);
    EXPECT_TRUE(fault == F::kStopRename || lines.empty()) << "stopped before anything was looked at";
  }
}

#ifndef _WIN32
// Linux names are bytes: one that is not UTF-8 is stored and renamed by its
// exact bytes; its row shows each bad byte as U+FFFD, the log as '?'.
TEST(RunProcessingCycle, ANameThatIsNotUtf8IsStoredAndMarkedByItsExactBytes) {
  test::TempDir dir;
  test::CapturedLog log;
  test::WriteText(dir.Join(u"Comp\\info.dat"), "");
  const std::u16string sent = dir.Join(u"Comp\\AlertReports\\Sent items") + platform::kPathSeparator;
  const std::filesystem::path folder(test::Narrow(sent));
  std::filesystem::create_directories(folder);
  std::ofstream(folder / "Alert_caf\xe9.eml", std::ios::binary) << Message();
  EnsureDatabase(dir.path());
  ASSERT_EQ(RunProcessingCycle(dir.path()), CycleResult::kDone);
  EXPECT_TRUE(std::filesystem::exists(folder / "PROC_Alert_caf\xe9.eml"));
  const std::vector<Row> path{{test::Narrow(sent) + "Alert_caf\uFFFD.eml"}};
  EXPECT_EQ(Sql(dir.path(), "SELECT \"Alert Path\" FROM AlertDB"), path);
  EXPECT_TRUE(Logged(log.Messages(), {sent + u"Alert_caf?.emlSuccessfully renamed"}, u""));
}
#endif

}  // namespace
}  // namespace asum
