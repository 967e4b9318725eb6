#include "collect/process_alerts.h"

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <algorithm>
#include <mutex>
#include <thread>

#include "collect/cycle.h"
#include "mail/cls_email.h"
#include "support/test_support.h"

namespace asum {
namespace {

using test::TempDir;
using test::U16;
using test::WriteText;

using Row = std::vector<std::string>;  // the eleven columns, UTF-8

std::vector<Row> ReadRows(const std::u16string& install) {
  std::vector<Row> rows;
  sqlite3* db = nullptr;
  if (sqlite3_open16(DatabasePathOf(install).c_str(), &db) == SQLITE_OK) {
    sqlite3_stmt* st = nullptr;
    if (sqlite3_prepare_v2(db, "SELECT * FROM AlertDB ORDER BY rowid", -1, &st, nullptr) == SQLITE_OK) {
      while (sqlite3_step(st) == SQLITE_ROW) {
        Row row;
        for (int c = 0; c < 11; ++c) row.push_back(reinterpret_cast<const char*>(sqlite3_column_text(st, c)));
        rows.push_back(row);
      }
    }
    sqlite3_finalize(st);
  }
  sqlite3_close(db);
  return rows;
}

void Exec(const std::u16string& install, const char* sql) {
  sqlite3* db = nullptr;
  ASSERT_EQ(sqlite3_open16(DatabasePathOf(install).c_str(), &db), SQLITE_OK);
  EXPECT_EQ(sqlite3_exec(db, sql, nullptr, nullptr, nullptr), SQLITE_OK) << sqlite3_errmsg(db);
  sqlite3_close(db);
}

std::string Message(const std::string& subject, const std::string& html, const std::string& extra_headers = "") {
  return "From: \"Alert Service\" <alerts@corp.example>\r\nSubject: " + subject +
         "\r\nDate: Mon, 11 Jun 2018 09:05:03 +0000\r\n" + extra_headers +
         "MIME-Version: 1.0\r\nContent-Type: text/html; charset=utf-8\r\n\r\n" + html;
}

const std::string kActivityTable =
    "<p>Changes were found on <b>File Server(s).</b></p><table><thead><tr><th>Who</th><th>Operation</th>"
    "<th>Server Name</th><th>Component Name</th><th>Server</th></tr></thead><tbody>"
    "<tr><td>CORP\\jsmith</td><td>Deleted</td><td>FS01</td><td>File Server</td><td>SRV9</td></tr>"
    "<tr><td>corp\\JSMITH</td><td>Moved</td><td>FS02</td><td>File Server</td><td>SRV9</td></tr></tbody></table>";

class ProcessAlertFilesTest : public ::testing::Test {
 protected:
  std::u16string Place(const std::u16string& component, const std::u16string& name, const std::string& bytes) {
    const std::u16string path = dir_.Join(component + u"\\AlertReports\\Sent items\\" + name);
    WriteText(path, bytes);
    return path;
  }
  // Runs one processing call over the given files (creating the database
  // first, so the call does real work).
  ProcessTally Process(const std::u16string& component, StringList files) {
    EnsureDatabase(dir_.path());
    ProcessTally tally;
    ProcessAlertFiles(dir_.path(), files, u"Delivered", component, nullptr, &tally);
    return tally;
  }
  std::vector<std::u16string> Names(const std::u16string& component) {
    return test::ListNames(dir_.Join(component + u"\\AlertReports\\Sent items"));
  }

  test::CapturedLog log_;
  TempDir dir_;
};

TEST_F(ProcessAlertFilesTest, FirstCallOnlyCreatesTheDatabase) {
  StringList files{Place(u"Comp", u"a.eml", Message("Threshold Alert: Type \"Name\" (S(C)\\R\\X)", kActivityTable))};
  ProcessTally tally;
  ProcessAlertFiles(dir_.path(), files, u"Delivered", u"Comp", nullptr, &tally);
  EXPECT_TRUE(platform::Current().PathExists(DatabasePathOf(dir_.path())));
  EXPECT_EQ(Names(u"Comp"), std::vector<std::u16string>{u"a.eml"});
  EXPECT_EQ(tally.left, 1u);
  const auto messages = log_.Messages();
  EXPECT_EQ(std::count(messages.begin(), messages.end(), u"AlertSummaryDB opened"), 0);

  ProcessAlertFiles(dir_.path(), files, u"Delivered", u"Comp", nullptr, &tally);
  EXPECT_EQ(Names(u"Comp"), std::vector<std::u16string>{u"PROC_a.eml"});
  EXPECT_EQ(ReadRows(dir_.path()).size(), 1u);
}

TEST_F(ProcessAlertFilesTest, GeneralAlertBecomesOneRowInColumnOrder) {
  const auto path = Place(u"Comp", u"a.eml",
                          Message("Threshold Alert: File Change \"Mass deletion\" (FS01(File Server)\\File Server Changes\\Daily)",
                                  kActivityTable));
  const ProcessTally tally = Process(u"Comp", {path});
  EXPECT_EQ(tally.stored, 1u);
  const auto rows = ReadRows(dir_.path());
  ASSERT_EQ(rows.size(), 1u);
  EXPECT_EQ(rows[0], (Row{"Email Alert", "File Change", "Mass deletion", "2018/06/11 09:05:03", "Yes",
                          "CORP\\jsmith", "Deleted, Moved", "File Server", "Delivered", "FS01", test::Narrow(path)}));
  EXPECT_EQ(Names(u"Comp"), std::vector<std::u16string>{u"PROC_a.eml"});
  const auto messages = log_.Messages();
  const auto who = std::find(messages.begin(), messages.end(),
                             u"After calling \"ParseHtmlBodyAndGetFieldData\" function Who & Operation Fields are "
                             u"CORP\\jsmith & Deleted, Moved");
  ASSERT_NE(who, messages.end());
  const auto before = std::find(who, messages.end(), u"Before calling \"FillDataDB\" function ");
  const auto after = std::find(before, messages.end(), u"After calling \"FillDataDB\" function ");
  ASSERT_NE(after, messages.end());
  EXPECT_NE(std::find(after, messages.end(), path + u"Successfully renamed"), messages.end());
}

TEST_F(ProcessAlertFilesTest, EmptySubjectOrBodyIsMarkedWithoutARow) {
  const auto no_body = Place(u"Comp", u"a.eml", Message("Threshold Alert: T \"N\" (S(C)\\R\\X)", ""));
  const auto no_subject = Place(u"Comp", u"b.eml", Message("", kActivityTable));
  const ProcessTally tally = Process(u"Comp", {no_body, no_subject});
  EXPECT_EQ(tally.marked, 2u);
  EXPECT_TRUE(ReadRows(dir_.path()).empty());
  EXPECT_EQ(Names(u"Comp"), (std::vector<std::u16string>{u"PROC_a.eml", u"PROC_b.eml"}));
  const auto messages = log_.Messages();
  EXPECT_EQ(std::count(messages.begin(), messages.end(), u"Alert subject and body are empty."), 2);
}

TEST_F(ProcessAlertFilesTest, ATakenProcNameDeletesTheFileAndKeepsTheEarlierOne) {
  const auto stored = Place(u"Comp", u"a.eml", Message("Threshold Alert: T \"N\" (S(C)\\R\\X)", kActivityTable));
  const auto unstored = Place(u"Comp", u"b.eml", Message("no colon and no quotes", kActivityTable));
  Place(u"Comp", u"PROC_a.eml", "earlier a");
  Place(u"Comp", u"PROC_b.eml", "earlier b");
  const ProcessTally tally = Process(u"Comp", {stored, unstored});
  EXPECT_EQ(tally.stored, 1u);
  EXPECT_EQ(tally.marked, 1u);
  EXPECT_EQ(Names(u"Comp"), (std::vector<std::u16string>{u"PROC_a.eml", u"PROC_b.eml"}));
  EXPECT_EQ(test::ReadText(dir_.Join(u"Comp\\AlertReports\\Sent items\\PROC_a.eml")), "earlier a");
  const auto messages = log_.Messages();
  EXPECT_EQ(std::count(messages.begin(), messages.end(), stored + u"Successfully renamed"), 1);
  EXPECT_EQ(std::count(messages.begin(), messages.end(), unstored + u"Successfully renamed"), 0);
}

TEST_F(ProcessAlertFilesTest, PredefinedAlertsTakeServerNameOverServerForActivityCategories) {
  const auto path = Place(u"Predefine Alerts", u"a.eml", Message("Change Alert:  \"All Environment Changes\"", kActivityTable));
  Process(u"Predefine Alerts", {path});
  const auto rows = ReadRows(dir_.path());
  ASSERT_EQ(rows.size(), 1u);
  EXPECT_EQ(rows[0][0], "Email Alert");
  EXPECT_EQ(rows[0][1], "Change");
  EXPECT_EQ(rows[0][2], "All Environment Changes");
  EXPECT_EQ(rows[0][4], "No");
  EXPECT_EQ(rows[0][7], "File Server");  // the body's "Component Name" column
  EXPECT_EQ(rows[0][9], "FS01, FS02");   // "Server Name" replaced "Server" (SRV9)
}

TEST_F(ProcessAlertFilesTest, DataLeakageFallsBackToSenderAndExchangeServer) {
  const std::string table =
      "<table><thead><tr><th>Recipient</th></tr></thead><tbody><tr><td>x@example.org</td></tr></tbody></table>";
  const auto path = Place(u"Predefine Alerts", u"a.eml", Message("Data Leakage Alert: Potential Data Leakage!", table));
  Process(u"Predefine Alerts", {path});
  const auto rows = ReadRows(dir_.path());
  ASSERT_EQ(rows.size(), 1u);
  EXPECT_EQ(rows[0], (Row{"Email Alert", "Data Leakage", "Potential Data Leakage", "2018/06/11 09:05:03", "N\\A",
                          "alerts@corp.example", "Email Sent", "Exchange Server", "Delivered", "", test::Narrow(path)}));
}

TEST_F(ProcessAlertFilesTest, ScriptAlertWhoComesFromItsParagraph) {
  const std::string subject = "Script Execution Alert: Unlock \"Unlock accounts\" (DC01\\Account Lockout Report\\Daily)";
  const auto with_end = Place(u"Comp", u"a.eml", Message(subject, "<p><b>Who  :</b> &#74;&#83;</p>"));
  const auto without_end = Place(u"Comp", u"b.eml", Message(subject, "<p><b>Who  :</b> JS"));
  Process(u"Comp", {with_end, without_end});
  const auto rows = ReadRows(dir_.path());
  ASSERT_EQ(rows.size(), 2u);
  EXPECT_EQ(rows[0][0], "Script Alert");
  EXPECT_EQ(rows[0][5], "JS");
  EXPECT_EQ(rows[1][5], "N\\A");  // no paragraph end: no name, and the category is the lockout report
  EXPECT_EQ(rows[0][6], "Account Lockout Report");  // Operation falls back to the category
  EXPECT_EQ(rows[0][7], "Active Directory, Exchange Server & Group Policy");
}

TEST_F(ProcessAlertFilesTest, OperationFallsBackToAnEmptyCategory) {
  // The tail ends after ')' with more text: the category is written empty.
  const auto path = Place(u"Comp", u"a.eml", Message("Email Alert: T \"N\" (report) more", "<p>no table</p>"));
  Process(u"Comp", {path});
  const auto rows = ReadRows(dir_.path());
  ASSERT_EQ(rows.size(), 1u);
  EXPECT_EQ(rows[0][6], "");
}

class FailingVariantTime : public platform::Env {
 public:
  std::optional<double> SystemTimeToVariantTime(const platform::SystemTime&) override { return std::nullopt; }
};

TEST_F(ProcessAlertFilesTest, UnusableDatesGiveTheRepairedOrTheInvalidWhen) {
  const std::string html = "<table><tr><th>Who</th></tr><tbody><tr><td>u</td></tr></tbody></table>";
  std::string no_date = Message("Email Alert: T \"N\" (S(C)\\R\\X)", html);
  no_date.erase(no_date.find("Date:"), no_date.find("MIME") - no_date.find("Date:"));
  const auto path = Place(u"Comp", u"a.eml", no_date);
  Process(u"Comp", {path});
  auto rows = ReadRows(dir_.path());
  ASSERT_EQ(rows.size(), 1u);
  const platform::SystemTime now = platform::Current().UtcNow();
  char expected_month[16];
  std::snprintf(expected_month, sizeof expected_month, "%d/%02d/", now.year, now.month);
  // The 1st of the current month, 00:00:00 UTC, in local time (tests run in UTC).
  EXPECT_EQ(rows[0][3], std::string(expected_month) + "01 00:00:00");

  FailingVariantTime failing;
  platform::ScopedEnv scope(&failing);
  const auto second = Place(u"Comp", u"b.eml", Message("Email Alert: T \"N\" (S(C)\\R\\X)", html));
  Process(u"Comp", {second});
  rows = ReadRows(dir_.path());
  ASSERT_EQ(rows.size(), 2u);
  EXPECT_EQ(rows[1][3], "-1/-1/-1 -1:-1:-1");
}

TEST_F(ProcessAlertFilesTest, AFailedInsertLeavesTheFileForTheNextCycle) {
  const auto path = Place(u"Comp", u"a.eml", Message("Email Alert: T \"N\" (S(C)\\R\\X)", kActivityTable));
  EnsureDatabase(dir_.path());
  Exec(dir_.path(), "CREATE TRIGGER refuse BEFORE INSERT ON AlertDB BEGIN SELECT RAISE(ABORT, 'refused'); END;");
  ProcessTally tally = Process(u"Comp", {path});
  EXPECT_EQ(tally.left, 1u);
  EXPECT_EQ(Names(u"Comp"), std::vector<std::u16string>{u"a.eml"});
  const auto messages = log_.Messages();
  EXPECT_NE(std::find(messages.begin(), messages.end(), u"Data is not inserted in DB"), messages.end());

  Exec(dir_.path(), "DROP TRIGGER refuse;");
  tally = Process(u"Comp", {path});
  EXPECT_EQ(tally.stored, 1u);
  EXPECT_EQ(ReadRows(dir_.path()).size(), 1u);
}

// Renames fail: refused while the file stays, or because someone removed the
// file after it was read.
class FailingRename : public platform::Env {
 public:
  explicit FailingRename(bool vanish) : vanish_(vanish) {}
  platform::FileResult RenameNoReplace(const std::u16string& from, const std::u16string&) override {
    if (!vanish_) return {platform::FileStatus::kAccessDenied, 5};
    RemoveFile(from);
    return {platform::FileStatus::kNotFound, 2};
  }

 private:
  bool vanish_;
};

TEST_F(ProcessAlertFilesTest, AFailedRenameRemovesTheRowOnlyWhileTheFileIsThere) {
  struct Case {
    bool vanish;
    const char16_t* failure;  // as the log line names it
    size_t rows_after;        // rows once the cycle with the failing renames is over
  };
  const Case cases[] = {
      {false, u"access denied (5)", 0},  // the file comes back next cycle and is stored then
      {true, u"not found (2)", 2},       // the row is all that is left of the alert
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.vanish ? "vanished" : "refused");
    TempDir dir;
    const auto place = [&](const std::u16string& name, const std::string& subject) {
      const std::u16string path = dir.Join(u"Comp\\AlertReports\\Sent items\\" + name);
      WriteText(path, Message(subject, kActivityTable));
      return path;
    };
    const StringList files{place(u"a.eml", "Email Alert: T \"N\" (S(C)\\R\\X)"),
                           place(u"b.eml", "Email Alert: T \"M\" (S(C)\\R\\X)")};
    EnsureDatabase(dir.path());
    {
      FailingRename failing(c.vanish);
      platform::ScopedEnv scope(&failing);
      StringList listed = files;
      ProcessTally tally;
      ProcessAlertFiles(dir.path(), listed, u"Delivered", u"Comp", nullptr, &tally);
      EXPECT_EQ(tally.stored, c.rows_after);
    }
    EXPECT_EQ(ReadRows(dir.path()).size(), c.rows_after);
    const auto messages = log_.Messages();
    EXPECT_NE(std::find(messages.begin(), messages.end(),
                        files[0] + u" could not be renamed to its PROC_ name: " + c.failure),
              messages.end());

    // The next cycle, with renames working again, ends with each alert stored once.
    StringList listed = files;
    ProcessAlertFiles(dir.path(), listed, u"Delivered", u"Comp");
    EXPECT_EQ(ReadRows(dir.path()).size(), 2u);
  }
}

TEST(ProcName, PrefixesTheFileName) {
  const std::u16string sep(1, platform::kPathSeparator);
  EXPECT_EQ(ProcName(sep + u"r" + sep + u"a.eml"), sep + u"r" + sep + u"PROC_a.eml");
  EXPECT_EQ(ProcName(u"a.eml"), sep + u"PROC_a.eml");
}

}  // namespace
}  // namespace asum

namespace asum {
namespace {

class HeldByWriter : public platform::Env {
 public:
  platform::FileResult ReadFile(const std::u16string&, std::string*, uint64_t) override {
    return {platform::FileStatus::kSharingViolation, 32};
  }
};

TEST_F(ProcessAlertFilesTest, AFileStillBeingWrittenWaitsForTheNextCycle) {
  const auto path = Place(u"Comp", u"a.eml", Message("Email Alert: T \"N\" (S(C)\\R\\X)", kActivityTable));
  {
    HeldByWriter held;
    platform::ScopedEnv scope(&held);
    EXPECT_EQ(Process(u"Comp", {path}).left, 1u);
  }
  EXPECT_EQ(Names(u"Comp"), std::vector<std::u16string>{u"a.eml"});
  const auto messages = log_.Messages();
  EXPECT_NE(std::find(messages.begin(), messages.end(),
                      path + u" is still being written (in use by another process (32)); it is offered again next cycle"),
            messages.end());
  EXPECT_EQ(Process(u"Comp", {path}).stored, 1u);
}

// A file as large as the test says, as far as its size goes; beyond the cap
// the read refuses it as the real backend would.
class SizedFile : public platform::Env {
 public:
  explicit SizedFile(uint64_t size) : size_(size) {}
  platform::FileResult FileSize(const std::u16string&, uint64_t* size) override {
    *size = size_;
    return {};
  }
  platform::FileResult ReadFile(const std::u16string& path, std::string* bytes, uint64_t max_bytes) override {
    if (size_ > max_bytes) return {platform::FileStatus::kTooLarge, 0};
    return Env::ReadFile(path, bytes, max_bytes);
  }

 private:
  uint64_t size_;
};

TEST_F(ProcessAlertFilesTest, AFileOverTheReadersCapKeepsItsNameWithALineSayingWhy) {
  const uint64_t cap = mail::kMaxMessageFileBytes;
  const auto path = Place(u"Comp", u"a.eml", Message("Email Alert: T \"N\" (S(C)\\R\\X)", kActivityTable));
  const std::u16string line = path + u" holds 134217729 bytes, more than the 134217728 an alert file may hold; "
                                     u"it keeps its name";
  struct Case {
    uint64_t size;
    uint64_t left;
    int lines;  // of the line above, in all so far
  };
  for (const Case& c : {Case{cap + 1, 1, 1}, Case{cap + 1, 1, 2}, Case{cap, 0, 2}}) {
    SizedFile sized(c.size);
    platform::ScopedEnv scope(&sized);
    EXPECT_EQ(Process(u"Comp", {path}).left, c.left);
    const auto messages = log_.Messages();
    EXPECT_EQ(std::count(messages.begin(), messages.end(), line), c.lines);
  }
  EXPECT_EQ(Names(u"Comp"), std::vector<std::u16string>{u"PROC_a.eml"});
}

// For each file read: the thread that read it, and how many files the log had
// seen finished by then.
class ReadWatcher : public platform::Env {
 public:
  explicit ReadWatcher(const test::CapturedLog& log) : log_(log) {}
  platform::FileResult ReadFile(const std::u16string& path, std::string* bytes, uint64_t max_bytes) override {
    const auto messages = log_.Messages();
    const auto finished = std::count_if(messages.begin(), messages.end(), [](const std::u16string& m) {
      return m.ends_with(u"Successfully renamed");
    });
    {
      std::lock_guard<std::mutex> lock(mutex_);
      reads_.push_back({std::this_thread::get_id(), static_cast<int>(finished)});
    }
    return Env::ReadFile(path, bytes, max_bytes);
  }
  std::vector<std::pair<std::thread::id, int>> reads() {
    std::lock_guard<std::mutex> lock(mutex_);
    return reads_;
  }

 private:
  const test::CapturedLog& log_;
  std::mutex mutex_;
  std::vector<std::pair<std::thread::id, int>> reads_;
};

// Should reading a file bring the process down, the log's last lines must
// name that file: with the log on, nothing is read ahead or written later by
// another thread. With it off, files may be read ahead; all are stored.
TEST_F(ProcessAlertFilesTest, WithTheLogOnEachFileIsReadOnTheProcessingThreadAfterThePreviousIsDone) {
  for (const bool log_on : {true, false}) {
    SCOPED_TRACE(log_on ? "log on" : "log off");
    const std::u16string component = log_on ? u"On" : u"Off";
    StringList files;
    for (const char16_t* name : {u"a.eml", u"b.eml", u"c.eml"}) {
      files.push_back(Place(component, name, Message("Email Alert: T \"N\" (S(C)\\R\\X)", kActivityTable)));
    }
    const std::u16string log_folder = platform::LogFolder();
    if (!log_on) platform::SetLogFolder(log_folder + u"-absent");
    ReadWatcher watcher(log_);
    ProcessTally tally;
    {
      platform::ScopedEnv scope(&watcher);
      tally = Process(component, files);
    }
    platform::SetLogFolder(log_folder);
    EXPECT_EQ(tally.stored, 3u);
    if (!log_on) continue;
    const auto reads = watcher.reads();
    ASSERT_EQ(reads.size(), 3u);
    for (int k = 0; k < 3; ++k) {
      EXPECT_EQ(reads[k].first, std::this_thread::get_id()) << k;
      EXPECT_EQ(reads[k].second, k) << "file " << k << " was read before the one ahead of it was finished";
    }
  }
}

}  // namespace
}  // namespace asum
