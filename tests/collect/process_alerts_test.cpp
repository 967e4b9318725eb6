#include "collect/process_alerts.h"

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <algorithm>
#include <mutex>
#include <thread>

#include "mail/cls_email.h"
#include "store/setting_db_management.h"
#include "support/test_support.h"

namespace asum {
namespace {

using Row = std::vector<std::string>;  // the eleven columns, UTF-8
using Lines = std::vector<std::u16string>;

std::vector<Row> ReadRows(const std::u16string& install) {
  std::vector<Row> rows;
  sqlite3* db = nullptr;
  sqlite3_stmt* st = nullptr;
  if (sqlite3_open16(DatabasePathOf(install).c_str(), &db) == SQLITE_OK &&
      sqlite3_prepare_v2(db, "SELECT * FROM AlertDB ORDER BY rowid", -1, &st, nullptr) == SQLITE_OK) {
    while (sqlite3_step(st) == SQLITE_ROW) {
      rows.emplace_back();
      for (int c = 0; c < 11; ++c) rows.back().push_back(reinterpret_cast<const char*>(sqlite3_column_text(st, c)));
    }
  }
  sqlite3_finalize(st);
  sqlite3_close(db);
  return rows;
}

void Exec(const std::u16string& install, const char* sql) {
  sqlite3* db = nullptr;
  ASSERT_EQ(sqlite3_open16(DatabasePathOf(install).c_str(), &db), SQLITE_OK);
  EXPECT_EQ(sqlite3_exec(db, sql, nullptr, nullptr, nullptr), SQLITE_OK) << sqlite3_errmsg(db);
  sqlite3_close(db);
}

const std::string kDate = "Date: Mon, 11 Jun 2018 09:05:03 +0000\r\n";
const std::string kSubject = "Email Alert: T \"N\" (S(C)\\R\\X)";

std::string Message(const std::string& subject, const std::string& html, const std::string& date = kDate) {
  return "From: \"Alert Service\" <alerts@corp.example>\r\nSubject: " + subject + "\r\n" + date +
         "MIME-Version: 1.0\r\nContent-Type: text/html; charset=utf-8\r\n\r\n" + html;
}

const std::string kActivityTable =
    "<p>Changes were found on <b>File Server(s).</b></p><table><thead><tr><th>Who</th><th>Operation</th>"
    "<th>Server Name</th><th>Component Name</th><th>Server</th></tr></thead><tbody>"
    "<tr><td>CORP\\jsmith</td><td>Deleted</td><td>FS01</td><td>File Server</td><td>SRV9</td></tr>"
    "<tr><td>corp\\JSMITH</td><td>Moved</td><td>FS02</td><td>File Server</td><td>SRV9</td></tr></tbody></table>";

bool InOrder(const Lines& log, const Lines& wanted) {
  auto at = log.begin();
  for (const auto& line : wanted) {
    at = std::find(at, log.end(), line);
    if (at == log.end()) return false;
  }
  return true;
}

// A fixed clock (the 15th of a month, so a test run across midnight of a
// month's last day cannot see two months), the failures a test asks for, and
// a record of each file read: its thread and how many files the log had seen
// finished by then.
class TestEnv : public platform::Env {
 public:
  enum class Fault { kNone, kBadVariantTime, kHeld, kSize, kRenameRefused, kRenameVanishes };
  platform::SystemTime UtcNow() override { return {2031, 2, 6, 15, 12, 30, 45, 0}; }
  platform::SystemTime LocalNow() override { return UtcNow(); }
  std::optional<double> SystemTimeToVariantTime(const platform::SystemTime& st) override {
    return fault == Fault::kBadVariantTime ? std::nullopt : Env::SystemTimeToVariantTime(st);
  }
  platform::FileResult FileSize(const std::u16string& path, uint64_t* size) override {
    if (fault != Fault::kSize) return Env::FileSize(path, size);
    *size = file_size;
    return {};
  }
  platform::FileResult ReadFile(const std::u16string& path, std::string* bytes, uint64_t max_bytes) override {
    if (log != nullptr) {
      const Lines lines = log->Messages();
      const auto done = std::count_if(lines.begin(), lines.end(), [](const auto& m) {
        return m.ends_with(u"Successfully renamed");
      });
      std::lock_guard<std::mutex> lock(mutex);
      reads.push_back({std::this_thread::get_id(), static_cast<int>(done)});
    }
    if (fault == Fault::kHeld) return {platform::FileStatus::kSharingViolation, 32};
    if (fault == Fault::kSize && file_size > max_bytes) return {platform::FileStatus::kTooLarge, 0};
    return Env::ReadFile(path, bytes, max_bytes);
  }
  platform::FileResult RenameNoReplace(const std::u16string& from, const std::u16string& to) override {
    if (fault == Fault::kRenameRefused) return {platform::FileStatus::kAccessDenied, 5};
    if (fault != Fault::kRenameVanishes) return Env::RenameNoReplace(from, to);
    RemoveFile(from);
    return {platform::FileStatus::kNotFound, 2};
  }

  Fault fault = Fault::kNone;
  uint64_t file_size = 0;
  const test::CapturedLog* log = nullptr;
  std::mutex mutex;
  std::vector<std::pair<std::thread::id, int>> reads;
};

class ProcessAlertFilesTest : public ::testing::Test {
 protected:
  std::u16string Place(const std::u16string& component, const std::u16string& name, const std::string& bytes) {
    const std::u16string path = dir_.Join(component + u"\\AlertReports\\Sent items\\" + name);
    test::WriteText(path, bytes);
    return path;
  }
  // One processing call over `files`, the database made first so the call does real work.
  ProcessTally Process(const std::u16string& component, StringList files, const std::u16string& status = u"Delivered") {
    EnsureDatabase(dir_.path());
    ProcessTally tally;
    ProcessAlertFiles(dir_.path(), files, status, component, nullptr, &tally);
    return tally;
  }
  Lines Names(const std::u16string& component) {
    return test::ListNames(dir_.Join(component + u"\\AlertReports\\Sent items"));
  }

  test::CapturedLog log_;
  test::TempDir dir_;
  TestEnv env_;
  platform::ScopedEnv scope_{&env_};
};

TEST_F(ProcessAlertFilesTest, FirstCallOnlyCreatesTheDatabase) {
  StringList files{Place(u"Comp", u"a.eml", Message(kSubject, kActivityTable))};
  ProcessTally tally;
  ProcessAlertFiles(dir_.path(), files, u"Delivered", u"Comp", nullptr, &tally);
  EXPECT_TRUE(platform::Current().PathExists(DatabasePathOf(dir_.path())));
  EXPECT_EQ(Names(u"Comp"), Lines{u"a.eml"});
  EXPECT_EQ(tally.left, 1u);
  EXPECT_FALSE(InOrder(log_.Messages(), {u"AlertSummaryDB opened"}));
  ProcessAlertFiles(dir_.path(), files, u"Delivered", u"Comp");
  EXPECT_EQ(Names(u"Comp"), Lines{u"PROC_a.eml"});
  EXPECT_EQ(ReadRows(dir_.path()).size(), 1u);
}

TEST_F(ProcessAlertFilesTest, EachAlertGivesItsRowInColumnOrder) {
  const std::string script = "Script Execution Alert: Unlock \"Unlock accounts\" (DC01\\Account Lockout Report\\Daily)";
  const std::string leak_table =
      "<table><thead><tr><th>Recipient</th></tr></thead><tbody><tr><td>x@example.org</td></tr></tbody></table>";
  const std::string who_table = "<table><tr><th>Who</th></tr><tbody><tr><td>u</td></tr></tbody></table>";
  struct Case {
    const char16_t* component;
    std::string subject, html, date;
    TestEnv::Fault fault;
    Row row;               // all columns but the path; its status is the call's
    const char16_t* who;   // as the log line names Who and Operation, before the fallbacks
  };
  const TestEnv::Fault none = TestEnv::Fault::kNone;
  const Case cases[] = {
      {u"Comp", "Threshold Alert: File Change \"Mass deletion\" (FS01(File Server)\\File Server Changes\\Daily)",
       kActivityTable, kDate, none,
       {"Email Alert", "File Change", "Mass deletion", "2018/06/11 09:05:03", "Yes", "CORP\\jsmith", "Deleted, Moved",
        "File Server", "Delivered", "FS01"},
       u"CORP\\jsmith & Deleted, Moved"},
      // "Server Name" replaces the predefined alert's "Server" (SRV9).
      {u"Predefine Alerts", "Change Alert:  \"All Environment Changes\"", kActivityTable, kDate, none,
       {"Email Alert", "Change", "All Environment Changes", "2018/06/11 09:05:03", "No", "CORP\\jsmith",
        "Deleted, Moved", "File Server", "Failed", "FS01, FS02"},
       u"CORP\\jsmith & Deleted, Moved"},
      {u"Predefine Alerts", "Data Leakage Alert: Potential Data Leakage!", leak_table, kDate, none,
       {"Email Alert", "Data Leakage", "Potential Data Leakage", "2018/06/11 09:05:03", "N\\A", "alerts@corp.example",
        "Email Sent", "Exchange Server", "Delivered", ""},
       u"alerts@corp.example & "},
      {u"Comp", script, "<p><b>Who  :</b> &#74;&#83;</p>", kDate, none,
       {"Script Alert", "Unlock", "Unlock accounts", "2018/06/11 09:05:03", "N\\A", "JS", "Account Lockout Report",
        "Active Directory, Exchange Server & Group Policy", "Delivered", ""},
       u" & "},
      // No paragraph end: no name, and the lockout report's "N\A" stands in.
      {u"Comp", script, "<p><b>Who  :</b> JS", kDate, none,
       {"Script Alert", "Unlock", "Unlock accounts", "2018/06/11 09:05:03", "N\\A", "N\\A", "Account Lockout Report",
        "Active Directory, Exchange Server & Group Policy", "Delivered", ""},
       u" & "},
      // The tail goes on after ')': the category, Operation's fallback, is empty.
      {u"Comp", "Email Alert: T \"N\" (report) more", "<p>no table</p>", kDate, none,
       {"Email Alert", "T", "N", "2018/06/11 09:05:03", "No", "", "", "", "Delivered", ""}, u" & "},
      // No date: the 1st of the clock's month; a date the conversion refuses: -1 throughout.
      {u"Comp", kSubject, who_table, "", none,
       {"Email Alert", "T", "N", "2031/02/01 00:00:00", "No", "u", "R", "C", "Delivered", "S"}, u"u & "},
      {u"Comp", kSubject, who_table, kDate, TestEnv::Fault::kBadVariantTime,
       {"Email Alert", "T", "N", "-1/-1/-1 -1:-1:-1", "No", "u", "R", "C", "Delivered", "S"}, u"u & "},
  };
  for (const Case& c : cases) {
    const size_t index = &c - cases;
    SCOPED_TRACE(index);
    test::CapturedLog log;
    env_.fault = c.fault;
    const std::u16string path = Place(c.component, u"a" + test::U16(std::to_string(index)) + u".eml",
                                      Message(c.subject, c.html, c.date));
    EXPECT_EQ(Process(c.component, {path}, test::U16(c.row[8])).stored, 1u);
    Row expected = c.row;
    expected.push_back(test::Narrow(path));
    const auto rows = ReadRows(dir_.path());
    ASSERT_EQ(rows.size(), index + 1);
    EXPECT_EQ(rows.back(), expected);
    EXPECT_TRUE(InOrder(log.Messages(),
                        {u"After calling \"ParseHtmlBodyAndGetFieldData\" function Who & Operation Fields are " +
                             std::u16string(c.who),
                         u"Before calling \"FillDataDB\" function ", u"After calling \"FillDataDB\" function ",
                         path + u"Successfully renamed"}));
  }
}

// Renamed without a row: an empty subject or body, or no Alert Type. A taken
// PROC_ name deletes the file instead and keeps the earlier one.
TEST_F(ProcessAlertFilesTest, FilesAreMarkedWithOrWithoutARowAndATakenNameDeletesThem) {
  struct Case {
    std::string subject, html;
    bool taken;       // a PROC_ file of that name is there already
    size_t rows;      // rows the file gives
    int empty_lines;  // "Alert subject and body are empty."
  };
  const Case cases[] = {
      {kSubject, "", false, 0, 1},
      {"", kActivityTable, false, 0, 1},
      {"no colon and no quotes", kActivityTable, false, 0, 0},
      {kSubject, kActivityTable, true, 1, 0},
      {"no colon and no quotes", kActivityTable, true, 0, 0},
  };
  size_t rows = 0;
  for (const Case& c : cases) {
    SCOPED_TRACE(&c - cases);
    test::CapturedLog log;
    const std::u16string component = u"C" + test::U16(std::to_string(&c - cases));
    const std::u16string path = Place(component, u"a.eml", Message(c.subject, c.html));
    if (c.taken) Place(component, u"PROC_a.eml", "earlier");
    const ProcessTally tally = Process(component, {path});
    EXPECT_EQ(tally.stored + tally.marked, 1u);
    EXPECT_EQ(ReadRows(dir_.path()).size(), rows += c.rows);
    EXPECT_EQ(Names(component), Lines{u"PROC_a.eml"});
    const std::string kept = test::ReadText(dir_.Join(component + u"\\AlertReports\\Sent items\\PROC_a.eml"));
    EXPECT_EQ(kept == "earlier", c.taken);
    const Lines lines = log.Messages();
    EXPECT_EQ(std::count(lines.begin(), lines.end(), u"Alert subject and body are empty."), c.empty_lines);
    EXPECT_EQ(std::count(lines.begin(), lines.end(), path + u"Successfully renamed"), static_cast<int>(c.rows));
  }
}

// Left under its name, the file is offered again next cycle, and stored once
// in all when that cycle goes well; a file gone after it was read keeps its row.
TEST_F(ProcessAlertFilesTest, AFileThatCannotBeDoneNowIsStoredOnceLater) {
  using F = TestEnv::Fault;
  const uint64_t cap = mail::kMaxMessageFileBytes;
  struct Case {
    F fault;
    uint64_t size;
    bool refuse_insert;
    size_t left, rows;    // after the first call
    const char16_t* why;  // the line that says so, after the path but for the refused insert
  };
  const Case cases[] = {
      {F::kHeld, 0, false, 1, 0, u" is still being written (in use by another process (32)); it is offered again "
                                 u"next cycle"},
      {F::kSize, cap + 1, false, 1, 0, u" holds 134217729 bytes, more than the 134217728 an alert file may hold; it "
                                       u"keeps its name"},
      {F::kSize, cap, false, 0, 1, u"Successfully renamed"},
      {F::kNone, 0, true, 1, 0, u"Data is not inserted in DB"},
      {F::kRenameRefused, 0, false, 1, 0, u" could not be renamed to its PROC_ name: access denied (5)"},
      {F::kRenameVanishes, 0, false, 0, 1, u" could not be renamed to its PROC_ name: not found (2)"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(&c - cases);
    test::TempDir dir;
    test::CapturedLog log;
    const std::u16string path = dir.Join(u"Comp\\AlertReports\\Sent items\\a.eml");
    test::WriteText(path, Message(kSubject, kActivityTable));
    EnsureDatabase(dir.path());
    if (c.refuse_insert) Exec(dir.path(), "CREATE TRIGGER no BEFORE INSERT ON AlertDB BEGIN SELECT RAISE(ABORT, 'no'); END;");
    env_.fault = c.fault;
    env_.file_size = c.size;
    StringList files{path};
    ProcessTally tally;
    ProcessAlertFiles(dir.path(), files, u"Delivered", u"Comp", nullptr, &tally);
    EXPECT_EQ(tally.left, c.left);
    EXPECT_EQ(ReadRows(dir.path()).size(), c.rows);
    const std::u16string why = c.refuse_insert ? std::u16string(c.why) : path + c.why;
    EXPECT_TRUE(InOrder(log.Messages(), {why}));

    env_.fault = TestEnv::Fault::kNone;
    if (c.refuse_insert) Exec(dir.path(), "DROP TRIGGER no;");
    ProcessAlertFiles(dir.path(), files, u"Delivered", u"Comp");
    EXPECT_EQ(ReadRows(dir.path()).size(), 1u);
  }
}

// Should reading a file bring the process down, the log's last lines must
// name that file: with the log on, nothing is read ahead or written later by
// another thread. With it off, files may be read ahead; all are stored.
TEST_F(ProcessAlertFilesTest, WithTheLogOnEachFileIsReadOnTheProcessingThreadAfterThePreviousIsDone) {
  for (const bool log_on : {true, false}) {
    SCOPED_TRACE(log_on ? "log on" : "log off");
    const std::u16string component = log_on ? u"On" : u"Off";
    StringList files;
    for (const char16_t* name : {u"a.eml", u"b.eml", u"c.eml"}) {
      files.push_back(Place(component, name, Message(kSubject, kActivityTable)));
    }
    const std::u16string log_folder = platform::LogFolder();
    if (!log_on) platform::SetLogFolder(log_folder + u"-absent");
    env_.log = &log_;
    env_.reads.clear();
    EXPECT_EQ(Process(component, files).stored, 3u);
    env_.log = nullptr;
    platform::SetLogFolder(log_folder);
    if (!log_on) continue;
    ASSERT_EQ(env_.reads.size(), 3u);
    for (int k = 0; k < 3; ++k) {
      EXPECT_EQ(env_.reads[k].first, std::this_thread::get_id()) << k;
      EXPECT_EQ(env_.reads[k].second, k) << "file " << k << " was read before the one ahead of it was finished";
    }
  }
}

// The same cut gives the host's install folder from its executable's path.
TEST(ProcName, PrefixesTheFileNameAfterTheLastSeparator) {
  const std::u16string sep(1, platform::kPathSeparator);
  EXPECT_EQ(ProcName(sep + u"r" + sep + u"a.eml"), sep + u"r" + sep + u"PROC_a.eml");
  EXPECT_EQ(ProcName(u"a.eml"), sep + u"PROC_a.eml");
  EXPECT_EQ(platform::FolderOf(sep + u"opt" + sep + u"host.exe"), sep + u"opt");
}

}  // namespace
}  // namespace asum
