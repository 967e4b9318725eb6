#include "collect/process_alerts.h"

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <algorithm>

#include "collect/cycle.h"
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

class RefusingRename : public platform::Env {
 public:
  platform::FileResult RenameNoReplace(const std::u16string&, const std::u16string&) override {
    return {platform::FileStatus::kAccessDenied, 5};
  }
};

TEST_F(ProcessAlertFilesTest, AFailedRenameRemovesTheRowAndGoesOn) {
  const auto first = Place(u"Comp", u"a.eml", Message("Email Alert: T \"N\" (S(C)\\R\\X)", kActivityTable));
  const auto second = Place(u"Comp", u"b.eml", Message("Email Alert: T \"M\" (S(C)\\R\\X)", kActivityTable));
  {
    RefusingRename refusing;
    platform::ScopedEnv scope(&refusing);
    const ProcessTally tally = Process(u"Comp", {first, second});
    EXPECT_EQ(tally.left, 2u);
  }
  EXPECT_TRUE(ReadRows(dir_.path()).empty()) << "a row whose file keeps its name would be stored again";
  EXPECT_EQ(Names(u"Comp"), (std::vector<std::u16string>{u"a.eml", u"b.eml"}));
  const auto messages = log_.Messages();
  EXPECT_NE(std::find(messages.begin(), messages.end(),
                      first + u" could not be renamed to its PROC_ name: access denied (5)"),
            messages.end());

  // The next cycle, with renames working again, stores each alert once.
  const ProcessTally tally = Process(u"Comp", {first, second});
  EXPECT_EQ(tally.stored, 2u);
  EXPECT_EQ(ReadRows(dir_.path()).size(), 2u);
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

}  // namespace
}  // namespace asum
