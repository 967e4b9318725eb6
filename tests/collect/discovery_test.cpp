#include "collect/discovery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>

#include "collect/cycle.h"
#include "support/test_support.h"

namespace asum {
namespace {

using Lines = std::vector<std::u16string>;

// "*.eml*" in any case, files only, no "PROC_" (with case) anywhere in the
// path, and nothing when the search pattern would not fit the search's buffer.
TEST(GetDomainFolders, ListsTheUnprocessedAlertFiles) {
  test::TempDir dir;
  const auto folder_of_length = [&](size_t length) {
    const std::u16string start = dir.Join(u"R");
    return start + std::u16string(length - start.size(), u'r');
  };
  struct Case { std::u16string folder; std::vector<const char16_t*> names, listed; };
  const Case cases[] = {
      {dir.Join(u"C\\AlertReports\\Sent items"),
       {u"a.eml", u"b.EML", u"c.emlx", u"PROC_d.eml", u"proc_e.eml", u"f.txt", u"xPROC_g.eml", u"h.em"},
       {u"a.eml", u"b.EML", u"c.emlx", u"proc_e.eml"}},
      {dir.Join(u"PROC_C\\AlertReports\\Outbox"), {u"a.eml"}, {}},
      {folder_of_length(kMaxSearchPattern - 8), {u"a.eml"}, {u"a.eml"}},
      {folder_of_length(kMaxSearchPattern - 7), {u"a.eml"}, {}},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(&c - cases);
    const std::u16string prefix = c.folder + platform::kPathSeparator;
    for (const char16_t* name : c.names) test::WriteText(prefix + name, "x");
    test::MakeFolders(prefix + u"folder.eml");
    StringList files, expected;
    GetDomainFolders(c.folder, files);
    for (const char16_t* name : c.listed) expected.push_back(prefix + name);
    std::sort(files.begin(), files.end());
    EXPECT_EQ(files, expected);
  }
}

// A subfolder holding a marker file (or a folder of its name) is a component
// folder. Marker folders come first, then the fixed names in their order; a
// fixed name that holds a marker is walked twice, and its second walk finds
// what the first left. Sent items before Outbox; empty lists are not handed on.
TEST(RunCollectionCycle, HandsEachReportFolderOnInOrderWithItsStatusAndComponent) {
  test::CapturedLog log;
  test::TempDir dir;
  for (const char16_t* file : {u"Comp\\info.dat", u"Empty\\info_SP.dat", u"B\\info_SS.dat", u"Web\\Web.dat",
                               u"E\\info_FSA.dat", u"Plain\\other.dat", u"Other\\Web.dat", u"info.dat",
                               u"Anomaly Alerts\\info.dat", u"Comp\\AlertReports\\Sent items\\s.eml",
                               u"Comp\\AlertReports\\Outbox\\o.eml", u"Anomaly Alerts\\AlertReports\\Sent items\\n.eml",
                               u"Predefine Alerts\\AlertReports\\Sent items\\p.eml",
                               u"All Environment Changes\\AlertReports\\Outbox\\e.eml"}) {
    test::WriteText(dir.Join(file), "");
  }
  test::MakeFolders(dir.Join(u"Empty\\AlertReports\\Outbox"));
  test::MakeFolders(dir.Join(u"F\\info.dat"));
  Lines calls, anomaly;
  RunCollectionCycle(dir.path(), [&](StringList& files, const std::u16string& status, const std::u16string& component) {
    std::u16string call = component + u" " + status;
    for (const auto& f : files) {
      call += u" " + platform::NameOf(f);
      std::filesystem::rename(test::Narrow(f), test::Narrow(ProcName(f)));  // as the processing does
    }
    (component == u"Anomaly Alerts" ? anomaly : calls).push_back(call);
  });
  EXPECT_EQ(calls, (Lines{u"Comp Delivered s.eml", u"Comp Failed o.eml", u"All Environment Changes Failed e.eml",
                          u"Predefine Alerts Delivered p.eml"}));
  EXPECT_EQ(anomaly, Lines{u"Anomaly Alerts Delivered n.eml"});
  const Lines lines = log.Messages();
  const std::u16string listed = u"After calling GetDomainFolders Function: ";
  const auto count = [&](const char16_t* folder, const char16_t* tail) {
    return std::count(lines.begin(), lines.end(), listed + dir.Join(folder) + u" path contains " + tail);
  };
  const auto at = std::find(lines.begin(), lines.end(), u"Anomaly Alerts");
  ASSERT_LT(at + 2, lines.end());
  EXPECT_EQ(Lines(at, at + 3), (Lines{u"Anomaly Alerts", dir.path(), listed + dir.path() + u" path contains 10 "
                                                                                          u"Component(s)."}));
  EXPECT_EQ(count(u"Empty\\AlertReports\\Outbox", u"0 file(s)."), 1);
  EXPECT_EQ(count(u"Anomaly Alerts\\AlertReports\\Sent items", u"1 file(s)."), 1);
  EXPECT_EQ(count(u"Anomaly Alerts\\AlertReports\\Sent items", u"0 file(s)."), 1);
}

}  // namespace
}  // namespace asum
