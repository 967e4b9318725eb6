#include "collect/process_alerts.h"

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <mutex>
#include <thread>

#include "collect/cycle.h"
#include "mail/cls_email.h"
#include "store/setting_db_management.h"
#include "support/test_support.h"

namespace asum {
namespace {

using Row = std::vector<std::string>;  // UTF-8
using Lines = std::vector<std::u16string>;

// Runs one statement on the install folder's database; the rows it gives.
std::vector<Row> Sql(const std::u16string& install, const char* sql = "SELECT * FROM AlertDB ORDER BY rowid") {
  std::vector<Row> rows;
  sqlite3* db = nullptr;
  sqlite3_stmt* st = nullptr;
  EXPECT_EQ(sqlite3_open16(DatabasePathOf(install).c_str(), &db), SQLITE_OK);
  EXPECT_EQ(sqlite3_prepare_v2(db, sql, -1, &st, nullptr), SQLITE_OK) << sqlite3_errmsg(db);
  for (rows.emplace_back(); st != nullptr && sqlite3_step(st) == SQLITE_ROW; rows.emplace_back()) {
    for (int c = 0; c < sqlite3_column_count(st); ++c) {
      rows.back().push_back(reinterpret_cast<const char*>(sqlite3_column_text(st, c)));
    }
  }
  rows.pop_back();
  sqlite3_finalize(st);
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

// Whether `text` reads `pattern`, in which '*' stands for any text.
bool Glob(std::u16string_view pattern, std::u16string_view text) {
  if (pattern.empty()) return text.empty();
  if (pattern[0] == u'*') return Glob(pattern.substr(1), text) || (!text.empty() && Glob(pattern, text.substr(1)));
  return !text.empty() && pattern[0] == text[0] && Glob(pattern.substr(1), text.substr(1));
}

// Whether the log holds lines reading `patterns` in this order; '%' in a pattern stands for `path`.
bool Logged(const Lines& log, const Lines& patterns, const std::u16string& path = u"") {
  auto at = log.begin();
  for (std::u16string pattern : patterns) {
    if (pattern.empty()) continue;
    for (size_t at = pattern.find(u'%'); at != pattern.npos; at = pattern.find(u'%', at + path.size())) {
      pattern.replace(at, 1, path);
    }
    at = std::find_if(at, log.end(), [&](const std::u16string& line) { return Glob(pattern, line); });
    if (at == log.end()) return false;
  }
  return true;
}

// A fixed clock (mid-month: a run across a month's end sees one month), the
// failures a test asks for, and each file read: its thread, and how many files
// the log had seen finished by then.
class TestEnv : public platform::Env {
 public:
  enum class Fault {
    kNone, kNoDatabase, kRefuseInsert, kBadVariantTime, kHeld, kOverCap, kAtCap, kRenameRefused, kRenameVanishes,
    kLockHeld, kFolderForLock, kStopBefore, kStopRename
  };
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
    if (fault == Fault::kHeld) return {platform::FileStatus::kSharingViolation, 32};
    return Env::ReadFile(path, bytes, max_bytes);
  }
  platform::FileResult RenameNoReplace(const std::u16string& from, const std::u16string& to) override {
    if (fault == Fault::kStopRename) stop->Request();
    if (fault == Fault::kRenameRefused) return {platform::FileStatus::kAccessDenied, 5};
    if (fault != Fault::kRenameVanishes) return Env::RenameNoReplace(from, to);
    RemoveFile(from);
    return {platform::FileStatus::kNotFound, 2};
  }

  Fault fault = Fault::kNone;
  const test::CapturedLog& log;
  platform::StopSignal* stop = nullptr;
  std::mutex mutex;
  std::vector<std::pair<std::thread::id, std::ptrdiff_t>> reads;
};

class ProcessAlertFilesTest : public ::testing::Test {
 protected:
  // Writes each alert file into `component`'s Sent items and processes them in one call.
  StringList Process(const std::u16string& component, const std::vector<std::string>& messages,
                     const std::u16string& status = u"Delivered") {
    StringList files;
    for (const std::string& message : messages) {
      files.push_back(dir_.Join(component + u"\\AlertReports\\Sent items\\" + test::U16(std::to_string(++made_)) + u".eml"));
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
    std::string subject, html, date;
    TestEnv::Fault fault;
    Row row;              // all columns but the path; its status is the call's
    const char16_t* who;  // Who and Operation as the log names them, before the fallbacks
  };
  const TestEnv::Fault none = TestEnv::Fault::kNone;
  const Case cases[] = {
      {u"Comp", "Threshold Alert: File Change \"Mass deletion\" (FS01(File Server)\\File Server Changes\\Daily)",
       kTable, kDate, none, {"Email Alert", "File Change", "Mass deletion", "2018/06/11 09:05:03", "Yes",
       "CORP\\jsmith", "Deleted, Moved", "File Server", "Delivered", "FS01"}, u"CORP\\jsmith & Deleted, Moved"},
      // "Server Name" replaces the predefined alert's "Server" (SRV9).
      {u"Predefine Alerts", "Change Alert:  \"All Environment Changes\"", kTable, kDate, none,
       {"Email Alert", "Change", "All Environment Changes", "2018/06/11 09:05:03", "No", "CORP\\jsmith",
        "Deleted, Moved", "File Server", "Failed", "FS01, FS02"}, u"CORP\\jsmith & Deleted, Moved"},
      {u"Predefine Alerts", "Data Leakage Alert: Potential Data Leakage!", "<p>nobody</p>", kDate, none,
       {"Email Alert", "Data Leakage", "Potential Data Leakage", "2018/06/11 09:05:03", "N\\A", "alerts@corp.example",
        "Email Sent", "Exchange Server", "Delivered", ""}, u"alerts@corp.example & "},
      {u"Comp", script, "<p><b>Who  :</b> &#74;&#83;</p>", kDate, none,
       {"Script Alert", "Unlock", "Unlock accounts", "2018/06/11 09:05:03", "N\\A", "JS", "Account Lockout Report",
        "Active Directory, Exchange Server & Group Policy", "Delivered", ""}, u" & "},
      // No paragraph end: no name, and the lockout report's "N\A" stands in.
      {u"Comp", script, "<p><b>Who  :</b> JS", kDate, none,
       {"Script Alert", "Unlock", "Unlock accounts", "2018/06/11 09:05:03", "N\\A", "N\\A", "Account Lockout Report",
        "Active Directory, Exchange Server & Group Policy", "Delivered", ""}, u" & "},
      // No date: the 1st of the clock's month; a date the conversion refuses: -1 throughout.
      {u"Comp", kSubject, who_table, "", none,
       {"Email Alert", "T", "N", "2031/02/01 00:00:00", "No", "u", "R", "C", "Delivered", "S"}, u"u & "},
      {u"Comp", kSubject, who_table, kDate, TestEnv::Fault::kBadVariantTime,
       {"Email Alert", "T", "N", "-1/-1/-1 -1:-1:-1", "No", "u", "R", "C", "Delivered", "S"}, u"u & "},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(&c - cases);
    test::CapturedLog log;
    env_.fault = c.fault;
    const StringList files = Process(c.component, {Message(c.subject, c.html, c.date)}, test::U16(c.row[8]));
    Row expected = c.row;
    expected.push_back(test::Narrow(files[0]));
    const auto rows = Sql(dir_.path());
    ASSERT_EQ(rows.size(), static_cast<size_t>(&c - cases + 1));
    EXPECT_EQ(rows.back(), expected);
    EXPECT_TRUE(Logged(log.Messages(),
                       {u"After calling \"ParseHtmlBodyAndGetFieldData\" function Who & Operation Fields are " +
                            std::u16string(c.who),
                        u"Before calling \"FillDataDB\" function ", u"After calling \"FillDataDB\" function ",
                        u"%Successfully renamed"},
                       files[0]));
  }
}

// What becomes of a file: renamed with its row, renamed without one (an
// empty subject or body, no Alert Type), deleted when its PROC_ name is taken,
// or left under its name and stored once in all by a later cycle that goes
// well. A file gone after it was read keeps its row.
TEST_F(ProcessAlertFilesTest, EachFileIsStoredOnceMarkedOrLeftForTheNextCycle) {
  using F = TestEnv::Fault;
  const std::string no_type = "no colon and no quotes";
  struct Case {
    std::string subject, html;
    F fault;
    bool taken;              // a PROC_ file of that name is there already
    size_t rows, rows_next;  // after this call, and after the next call without the fault
    const char16_t* name;    // the file's name after this call (null: gone)
    const char16_t* line;    // a line of this call ('%' stands for the path)
  };
  const char16_t* kEmpty = u"Alert subject and body are empty.";
  const Case cases[] = {
      {kSubject, "", F::kNone, false, 0, 0, u"PROC_a.eml", kEmpty},
      {"", kTable, F::kNone, false, 0, 0, u"PROC_a.eml", kEmpty},
      {no_type, kTable, F::kNone, false, 0, 0, u"PROC_a.eml", u""},
      {kSubject, kTable, F::kNone, true, 1, 1, u"PROC_a.eml", u"%Successfully renamed"},
      {no_type, kTable, F::kNone, true, 0, 0, u"PROC_a.eml", u""},
      {kSubject, kTable, F::kNoDatabase, false, 0, 1, u"a.eml", u""},
      {kSubject, kTable, F::kRefuseInsert, false, 0, 1, u"a.eml", u"Data is not inserted in DB"},
      {kSubject, kTable, F::kHeld, false, 0, 1, u"a.eml",
       u"% is still being written (in use by another process (32)); it is offered again next cycle"},
      {kSubject, kTable, F::kOverCap, false, 0, 1, u"a.eml",
       u"% holds 134217729 bytes, more than the 134217728 an alert file may hold; it keeps its name"},
      {kSubject, kTable, F::kAtCap, false, 1, 1, u"PROC_a.eml", u"%Successfully renamed"},
      {kSubject, kTable, F::kRenameRefused, false, 0, 1, u"a.eml",
       u"% could not be renamed to its PROC_ name: access denied (5)"},
      {kSubject, kTable, F::kRenameVanishes, false, 1, 1, nullptr, u"% could not be renamed to its PROC_ name: not found (2)"},
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
    if (c.fault == F::kRefuseInsert) Sql(dir.path(), "CREATE TRIGGER no BEFORE INSERT ON AlertDB BEGIN SELECT RAISE(ABORT, 'no'); END");
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
  const std::u16string log_folder = platform::LogFolder();
  platform::SetLogFolder(log_folder + u"-absent");
  Process(u"Off", {Message(), Message(), Message(), Message(), Message()});
  platform::SetLogFolder(log_folder);
  EXPECT_EQ(Sql(dir_.path()).size(), 8u);
}

// Nothing is touched without the collector lock, and the log says why. After
// a stop only the file in hand is finished: no further report folder is
// listed, the database is not opened, no further file is read.
TEST_F(ProcessAlertFilesTest, ACycleRunsUnderTheLockOverADatabaseUntilAStop) {
  using F = TestEnv::Fault;
  struct Case {
    F fault;
    CycleResult result;
    int stored, listings, opens;  // files given their PROC_ name, report folders listed, "Inside OpenDB" lines
    const char16_t* line;         // '%' stands for the install folder
  };
  const Case cases[] = {
      {F::kLockHeld, CycleResult::kBusy, 0, 0, 0, u"Another collector is processing %; this cycle does nothing"},
      {F::kFolderForLock, CycleResult::kNoLock, 0, 0, 0,
       u"The collector lock %*AlertSummaryDB.collector.lock cannot be created or opened: *; this cycle does nothing"},
      {F::kStopBefore, CycleResult::kDone, 0, 0, 0, u""},
      {F::kStopRename, CycleResult::kDone, 1, 1, 1, u""},
      {F::kNone, CycleResult::kDone, 3, 2, 2, u""},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(&c - cases);
    test::TempDir dir;
    test::WriteText(dir.Join(u"Comp\\info.dat"), "");
    for (const char16_t* name : {u"Sent items\\a.eml", u"Sent items\\b.eml", u"Outbox\\c.eml"}) {
      test::WriteText(dir.Join(u"Comp\\AlertReports\\" + std::u16string(name)), Message());
    }
    EnsureDatabase(dir.path());
    test::CapturedLog log;
    const std::u16string lock = CollectorLockPathOf(dir.path());
    platform::FileResult failure;
    platform::FileLock held = c.fault == F::kLockHeld ? env_.TryLockFile(lock, &failure) : nullptr;
    if (c.fault == F::kFolderForLock) test::MakeFolders(lock);
    platform::StopSignal stop;
    if (c.fault == F::kStopBefore) stop.Request();
    env_.fault = c.fault;
    env_.stop = &stop;
    CycleContext cycle(&stop);
    EXPECT_EQ(RunProcessingCycle(dir.path(), nullptr, &cycle), c.result);
    if (held != nullptr) env_.UnlockFile(held);
    int stored = 0;
    for (const char16_t* folder : {u"Comp\\AlertReports\\Sent items", u"Comp\\AlertReports\\Outbox"}) {
      for (const auto& name : test::ListNames(dir.Join(folder))) stored += name.starts_with(u"PROC_");
    }
    EXPECT_EQ(stored, c.stored);
    const Lines lines = log.Messages();
    EXPECT_EQ(std::count(lines.begin(), lines.end(), u"Inside GetDomainFolders function"), c.listings);
    EXPECT_EQ(std::count_if(lines.begin(), lines.end(), [](auto& m) { return m.starts_with(u"Inside OpenDB"); }),
              c.opens);
    EXPECT_TRUE(Logged(lines, {c.line}, dir.path()));
  }
}

#ifndef _WIN32
// Linux names are bytes: one that is not UTF-8 is stored and renamed by its
// exact bytes, and its row shows each bad byte as U+FFFD.
TEST_F(ProcessAlertFilesTest, ANameThatIsNotUtf8IsStoredAndMarkedByItsExactBytes) {
  const std::string folder = test::Narrow(dir_.Join(u"Comp\\AlertReports\\Sent items")) + "/";
  test::WriteText(dir_.Join(u"Comp\\info.dat"), "");
  std::filesystem::create_directories(folder);
  std::ofstream(folder + "caf\xe9.eml", std::ios::binary) << Message();
  EnsureDatabase(dir_.path());
  EXPECT_EQ(RunProcessingCycle(dir_.path()), CycleResult::kDone);
  EXPECT_TRUE(std::filesystem::exists(folder + "PROC_caf\xe9.eml"));
  EXPECT_EQ(Sql(dir_.path(), "SELECT \"Alert Path\" FROM AlertDB"), std::vector<Row>{{folder + "caf\uFFFD.eml"}});
}
#endif

}  // namespace
}  // namespace asum
