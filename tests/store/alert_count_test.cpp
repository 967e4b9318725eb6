#include "store/alert_count.h"

#include <gtest/gtest.h>

#include <chrono>

#include "store_test_support.h"

namespace asum {
namespace {

using test::StoreDir;

constexpr char16_t kMarch[] = u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>";

TEST(SplitRange, CutsBoundsAroundTheMarker) {
  struct Case {
    std::u16string range;
    std::u16string lower;
    std::u16string upper;
    bool date;
  } cases[] = {
      {kMarch, u"2024/03/01 00:00:00", u"2024/03/31 23:59:59", true},
      {u"<TO>a</FROM><TO>b", u"a", u"", true},                        // no closing "<"
      {u"0123456789ABCDEF<x", u"", u"ABCDEF", true},                  // no marker: from the eleventh character
      {u"</FROM><TO>b</TO>", u"", u"b", false},                       // marker at 0
      {u"", u"", u"", true},
      {u"abc</FROM>", u"abc", u"", true},                             // nothing after the marker
      {u"2024</FROM><TO>x<", u"2024", u"x", true},                    // lower without a tag
      {u"<a><b>c</FROM><TO>b<c<d", u"c", u"b<c", true},                // last ">" and last "<"
      {u"x</FROM>y</FROM><TO>z</TO>", u"x", u"ROM><TO>z", true},        // the first marker counts
      {u"x</FROM><T>", u"x", u"", true},                               // count of 0
  };
  for (const Case& c : cases) {
    const RangeBounds b = SplitRange(c.range);
    EXPECT_EQ(b.lower, c.lower) << test::Narrow(c.range);
    EXPECT_EQ(b.upper, c.upper) << test::Narrow(c.range);
    EXPECT_EQ(b.has_date_condition, c.date) << test::Narrow(c.range);
  }
}

class CountAlertsTest : public ::testing::Test {
 protected:
  void SetUp() override {
    dir_.Create();
    dir_.Insert({
        {u"Email Alert", u"Threshold Breach", u"2024/03/01 00:00:00"},
        {u"Email Alert", u"threshold low", u"2024/03/31 23:59:59"},
        {u"Script Alert", u"Disk", u"2024/03/31 10:00:00"},
        {u"Email Alert", u"O'Brien", u"2024/03/15 12:00:00"},
        {u"Script Alert", u"50%_off", u"2024/04/01 00:00:00"},
        {u"Email Alert", u"Old", u"2024/02/29 23:59:59"},
    });
  }
  StoreDir dir_;
};

TEST_F(CountAlertsTest, FilterAndRangeSelectRows) {
  const std::u16string longText(100000, u'a');
  struct Case {
    std::u16string filter;
    std::u16string range;
    int expected;
  } cases[] = {
      {u"Email Alert", kMarch, 3},  // both bounds inclusive
      {u"Script Alert", kMarch, 1},
      {u"Alert", kMarch, 0},        // routed to "Alert Type"
      {u"email alert", kMarch, 0},  // lower case is no action: matched against "Alert Type"
      {u"Threshold", kMarch, 2},    // LIKE ignores ASCII case
      {u"", kMarch, 4},
      {u"%", kMarch, 4},
      {u"_i_k", kMarch, 1},
      {u"O'Brien", kMarch, 1},            // a quote no longer breaks the statement
      {u"Disk' OR '1'='1", kMarch, 0},    // nor opens it
      {u"Email Alert", u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31</TO>", 2},  // bare upper date
      {u"Email Alert", u"</FROM><TO>ignored</TO>", 4},                            // marker at 0: no date condition
      {u"", u"</FROM>", 6},
      {u"", u"2024/03/01 00:00:00", 0},                                          // no marker
      {u"", u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59", 0},       // no closing "<"
      {u"", u"<TO>2024/03/01' 00:00:00</FROM><TO>2024/03/31 23:59:59'</TO>", 3},  // quotes compare as text
      {longText, kMarch, 0},
      {u"", longText + u"</FROM><TO>" + longText + u"</TO>", 0},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(CountAlerts(dir_.install(), c.filter, c.range), c.expected)
        << test::Narrow(c.filter.substr(0, 40)) << " | " << test::Narrow(c.range.substr(0, 60));
  }
}

TEST_F(CountAlertsTest, LockedDatabaseGivesZeroAfterTheTimeout) {
  test::RawConnection other(dir_.db_path());
  ASSERT_EQ(other.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
  const auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(CountAlerts(dir_.install(), u"", kMarch, 200), 0);
  const auto ms = std::chrono::duration_cast<std::chrono::milliseconds>(std::chrono::steady_clock::now() - start);
  EXPECT_GE(ms.count(), 150);
  EXPECT_LT(ms.count(), 3000);
  other.Exec("ROLLBACK");
  EXPECT_EQ(CountAlerts(dir_.install(), u"", kMarch, 200), 4);
}

TEST(CountAlertsFaults, BadDatabasesAndFoldersGiveZero) {
  {
    StoreDir dir;  // before any alert: folder, file and table appear
    EXPECT_EQ(CountAlerts(dir.install(), u"", kMarch), 0);
    EXPECT_EQ(dir.RowCount(), 0);
  }
  struct Case {
    const char* name;
    const char* content;  // null: nothing written
  } cases[] = {{"empty file", ""}, {"not a database", "plain text, not SQLite at all"}};
  for (const Case& c : cases) {
    StoreDir dir;
    test::WriteText(dir.db_path(), c.content);
    EXPECT_EQ(CountAlerts(dir.install(), u"", kMarch), 0) << c.name;
  }
  StoreDir dir;
  test::WriteText(dir.install() + platform::NativeSeparators(u"\\file"), "x");
  EXPECT_EQ(CountAlerts(dir.install() + platform::NativeSeparators(u"\\file"), u"", kMarch), 0);
  EXPECT_EQ(CountAlerts(dir.install() + platform::NativeSeparators(u"\\no\\such"), u"", kMarch), 0);
}

}  // namespace
}  // namespace asum
