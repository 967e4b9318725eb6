#include "collect/discovery.h"

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <algorithm>
#include <filesystem>
#include <fstream>

#include "collect/cycle.h"
#include "collect/process_alerts.h"

#include "store/setting_db_management.h"
#include "support/test_support.h"

namespace asum {
namespace {

using test::TempDir;
using test::WriteText;

struct Call {
  StringList files;
  std::u16string status;
  std::u16string component;
};

std::vector<Call> RunCycle(const std::u16string& install) {
  std::vector<Call> calls;
  RunCollectionCycle(install, [&](StringList& files, const std::u16string& status, const std::u16string& component) {
    calls.push_back({files, status, component});
  });
  return calls;
}

StringList Sorted(StringList list) {
  std::sort(list.begin(), list.end());
  return list;
}

TEST(GetComponentFolders, EachMarkerMakesAComponentFolder) {
  TempDir dir;
  WriteText(dir.Join(u"A\\info.dat"), "");
  WriteText(dir.Join(u"B\\info_SP.dat"), "");
  WriteText(dir.Join(u"C\\info_SS.dat"), "");
  WriteText(dir.Join(u"Web\\Web.dat"), "");
  WriteText(dir.Join(u"E\\info_FSA.dat"), "");
  test::MakeFolders(dir.Join(u"F\\info.dat"));  // a folder of a marker's name counts too
  WriteText(dir.Join(u"Plain\\other.dat"), "");
  WriteText(dir.Join(u"info.dat"), "");  // a marker at the top makes nothing
  StringList components;
  GetComponentFolders(dir.path(), components);
  EXPECT_EQ(Sorted(components), (StringList{u"A", u"B", u"C", u"E", u"F", u"Web"}));

  StringList none;
  GetComponentFolders(u"", none);
  GetComponentFolders(dir.Join(u"missing"), none);
  EXPECT_TRUE(none.empty());
}

TEST(GetDomainFolders, ListsEmlFilesAndSkipsProcessedOnes) {
  TempDir dir;
  const std::u16string report = dir.Join(u"C\\AlertReports\\Sent items");
  for (const char16_t* name : {u"a.eml", u"b.EML", u"c.emlx", u"PROC_d.eml", u"proc_e.eml", u"f.txt", u"xPROC_g.eml"}) {
    WriteText(report + platform::kPathSeparator + name, "x");
  }
  test::MakeFolders(report + platform::kPathSeparator + u"folder.eml");
  StringList files;
  GetDomainFolders(report, files);
  StringList expected;
  for (const char16_t* name : {u"a.eml", u"b.EML", u"c.emlx", u"proc_e.eml"}) {
    expected.push_back(report + platform::kPathSeparator + name);
  }
  EXPECT_EQ(Sorted(files), Sorted(expected));

  // "PROC_" anywhere in the path hides every file below it.
  const std::u16string hidden = dir.Join(u"PROC_C\\AlertReports\\Outbox");
  WriteText(hidden + platform::kPathSeparator + u"a.eml", "x");
  StringList none;
  GetDomainFolders(hidden, none);
  EXPECT_TRUE(none.empty());
}

TEST(GetDomainFolders, TooLongASearchPatternListsNothing) {
  TempDir dir;
  std::u16string report = dir.path();
  while (report.size() + 7 < kMaxSearchPattern) report += platform::kPathSeparator + std::u16string(20, u'r');
  WriteText(report + platform::kPathSeparator + u"a.eml", "x");
  StringList files;
  GetDomainFolders(report, files);
  EXPECT_TRUE(files.empty());
}

TEST(RunCollectionCycle, HandsSentItemsBeforeOutboxWithStatusAndComponent) {
  test::CapturedLog log;
  TempDir dir;
  WriteText(dir.Join(u"Comp\\info.dat"), "");
  WriteText(dir.Join(u"Comp\\AlertReports\\Sent items\\s.eml"), "x");
  WriteText(dir.Join(u"Comp\\AlertReports\\Outbox\\o.eml"), "x");
  WriteText(dir.Join(u"Empty\\info.dat"), "");
  test::MakeFolders(dir.Join(u"Empty\\AlertReports\\Outbox"));
  WriteText(dir.Join(u"NoReports\\info.dat"), "");
  const auto calls = RunCycle(dir.path());
  ASSERT_EQ(calls.size(), 2u);
  EXPECT_EQ(calls[0].status, u"Delivered");
  EXPECT_EQ(calls[0].files, StringList{dir.Join(u"Comp\\AlertReports\\Sent items\\s.eml")});
  EXPECT_EQ(calls[1].status, u"Failed");
  EXPECT_EQ(calls[1].files, StringList{dir.Join(u"Comp\\AlertReports\\Outbox\\o.eml")});
  EXPECT_EQ(calls[0].component, u"Comp");
  EXPECT_EQ(calls[1].component, u"Comp");

  const auto messages = log.Messages();
  EXPECT_EQ(messages.front(), u"After calling GetDomainFolders Function: " + dir.path() + u" path contains 3 Component(s).");
  EXPECT_NE(std::find(messages.begin(), messages.end(),
                      u"After calling GetDomainFolders Function: " + dir.Join(u"Empty\\AlertReports\\Outbox") +
                          u" path contains 0 file(s)."),
            messages.end());
}

TEST(RunCollectionCycle, FixedNamesFollowMarkerFoldersAndMayStandTwice) {
  test::CapturedLog log;
  TempDir dir;
  WriteText(dir.Join(u"Predefine Alerts\\info.dat"), "");
  WriteText(dir.Join(u"Predefine Alerts\\AlertReports\\Sent items\\a.eml"), "x");
  test::MakeFolders(dir.Join(u"Anomaly Alerts"));
  WriteText(dir.Join(u"All Environment Changes"), "");  // a file of that name counts
  std::vector<std::u16string> seen;
  int walks = 0;
  RunCollectionCycle(dir.path(), [&](StringList& files, const std::u16string&, const std::u16string& component) {
    ++walks;
    seen.push_back(component);
    // Mark the file processed, as the processor does: the second walk of the
    // same folder then finds nothing new.
    for (const auto& f : files) {
      std::filesystem::rename(std::filesystem::path(f),
                              std::filesystem::path(f).parent_path() / "PROC_a.eml");
    }
  });
  EXPECT_EQ(walks, 1);
  EXPECT_EQ(seen, std::vector<std::u16string>{u"Predefine Alerts"});
  const auto messages = log.Messages();
  const auto count_line = u"After calling GetDomainFolders Function: " + dir.path() + u" path contains 4 Component(s).";
  const auto anomaly = std::find(messages.begin(), messages.end(), u"Anomaly Alerts");
  ASSERT_NE(anomaly, messages.end());
  EXPECT_EQ(*(anomaly + 1), dir.path());
  EXPECT_EQ(*(anomaly + 2), count_line);
}

#ifndef _WIN32
// Linux names are bytes: one that is not UTF-8 is stored and renamed by its
// exact bytes, and its row and log lines show each bad byte as U+FFFD.
TEST(RunCollectionCycle, ANameThatIsNotUtf8IsStoredAndMarkedByItsExactBytes) {
  test::CapturedLog log;
  TempDir dir;
  WriteText(dir.Join(u"Comp\\info.dat"), "");
  const std::u16string sent = dir.Join(u"Comp\\AlertReports\\Sent items");
  const std::filesystem::path folder(test::Narrow(sent));
  std::filesystem::create_directories(folder);
  std::ofstream(folder / "Alert_caf\xe9.eml", std::ios::binary)
      << "From: alerts@corp.example\r\nSubject: Threshold Alert: File Change \"Mass deletion\" (FS01(File Server)"
         "\\File Server Changes\\Daily)\r\nContent-Type: text/html\r\n\r\n<p>body</p>";
  EnsureDatabase(dir.path());
  ASSERT_EQ(RunProcessingCycle(dir.path()), CycleResult::kDone);
  EXPECT_FALSE(std::filesystem::exists(folder / "Alert_caf\xe9.eml"));
  EXPECT_TRUE(std::filesystem::exists(folder / "PROC_Alert_caf\xe9.eml"));

  const std::u16string shown = sent + platform::kPathSeparator + u"Alert_caf\uFFFD.eml";
  sqlite3* db = nullptr;
  sqlite3_stmt* st = nullptr;
  ASSERT_EQ(sqlite3_open16(DatabasePathOf(dir.path()).c_str(), &db), SQLITE_OK);
  ASSERT_EQ(sqlite3_prepare_v2(db, "SELECT \"Alert Path\" FROM AlertDB", -1, &st, nullptr), SQLITE_OK);
  ASSERT_EQ(sqlite3_step(st), SQLITE_ROW);
  EXPECT_EQ(reinterpret_cast<const char*>(sqlite3_column_text(st, 0)), test::Narrow(shown));
  sqlite3_finalize(st);
  sqlite3_close(db);

  std::u16string logged = shown + u"Successfully renamed";
  std::replace(logged.begin(), logged.end(), u'\uFFFD', u'?');  // the log holds one byte per character
  const auto messages = log.Messages();
  EXPECT_NE(std::find(messages.begin(), messages.end(), logged), messages.end());
}
#endif

}  // namespace
}  // namespace asum
