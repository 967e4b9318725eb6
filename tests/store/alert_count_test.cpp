#include "store/alert_count.h"

#include "store_test_support.h"

namespace asum {
namespace {

constexpr char16_t kMarch[] = u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>";

TEST(SplitRange, CutsBoundsAroundTheMarker) {
  const struct {
    std::u16string range, lower, upper;
    bool date;
  } cases[] = {
      {kMarch, u"2024/03/01 00:00:00", u"2024/03/31 23:59:59", true},
      {u"<TO>a</FROM><TO>b", u"a", u"", true},                  // no closing "<"
      {u"0123456789ABCDEF<x", u"", u"ABCDEF", true},            // no marker: from the eleventh character
      {u"</FROM><TO>b</TO>", u"", u"b", false},                 // marker at 0
      {u"", u"", u"", true},
      {u"abc</FROM>", u"abc", u"", true},                       // nothing after the marker
      {u"2024</FROM><TO>x<", u"2024", u"x", true},              // lower without a tag
      {u"<a><b>c</FROM><TO>b<c<d", u"c", u"b<c", true},          // last ">" and last "<"
      {u"x</FROM>y</FROM><TO>z</TO>", u"x", u"ROM><TO>z", true},  // the first marker counts
      {u"x</FROM><T>", u"x", u"", true},                         // a count of 0
  };
  for (const auto& c : cases) {
    const RangeBounds b = SplitRange(c.range);
    EXPECT_EQ(std::tie(b.lower, b.upper, b.has_date_condition), std::tie(c.lower, c.upper, c.date))
        << test::Narrow(c.range);
  }
}

TEST(BuildCountStatement, NamesTheColumnsAsTheTableDoes) {
  const std::u16string date = u"SELECT Count(*) FROM AlertDB WHERE(\"When\" BETWEEN ?1 AND ?2)AND ";
  const std::pair<std::u16string, std::u16string> cases[] = {
      {u"Email Alert", date + u"(\"Alert Action\" LIKE '%'||?3||'%')"},
      {u"x Script Alert", date + u"(\"Alert Action\" LIKE '%'||?3||'%')"},
      {u"email alert", date + u"(\"Alert Type\" LIKE '%'||?3||'%')"},
      {u"Script", date + u"(\"Alert Type\" LIKE '%'||?3||'%')"},
  };
  for (const auto& [filter, sql] : cases) EXPECT_EQ(BuildCountStatement(filter, kMarch).sql, sql);
  EXPECT_EQ(BuildCountStatement(u"", u"</FROM>").sql,
            u"SELECT Count(*) FROM AlertDB WHERE (\"Alert Type\" LIKE '%'||?1||'%')");
}

TEST(CountAlerts, FilterAndRangeSelectRows) {
  test::StoreDir dir;
  dir.Create({{u"Email Alert", u"Threshold Breach", u"2024/03/01 00:00:00"},
              {u"Email Alert", u"threshold low", u"2024/03/31 23:59:59"},
              {u"Script Alert", u"Disk", u"2024/03/31 10:00:00"},
              {u"Email Alert", u"O'Brien", u"2024/03/15 12:00:00"},
              {u"Script Alert", u"50%_off", u"2024/04/01 00:00:00"},
              {u"Email Alert", u"Old", u"2024/02/29 23:59:59"}});
  const struct {
    std::u16string filter, range;
    int expected;
  } cases[] = {
      {u"Email Alert", kMarch, 3},  // both bounds inclusive
      {u"Script Alert", kMarch, 1},
      {u"Alert", kMarch, 0},        // routed to "Alert Type"
      {u"email alert", kMarch, 0},  // lower case is no action: matched against "Alert Type"
      {u"Threshold", kMarch, 2},    // LIKE ignores ASCII case
      {u"", kMarch, 4},
      {u"_i_k", kMarch, 1},
      {u"O'Brien", kMarch, 1},          // a quote breaks nothing
      {u"Disk' OR '1'='1", kMarch, 0},  // nor opens the statement
      {u"Email Alert", u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31</TO>", 2},  // a bare upper date
      {u"Email Alert", u"</FROM><TO>ignored</TO>", 4},                            // marker at 0: no date condition
      {u"", u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59", 0},       // no closing "<"
  };
  for (const auto& c : cases) {
    EXPECT_EQ(CountAlerts(dir.install(), c.filter, c.range), c.expected)
        << test::Narrow(c.filter) << " | " << test::Narrow(c.range);
  }
}

// Every failure is 0: no database yet (folder, file and table appear), a
// database locked past the allowance, an empty file, a file that is no
// database, an install folder that cannot hold one.
TEST(CountAlerts, FailuresGiveZero) {
  test::StoreDir dir;
  EXPECT_EQ(CountAlerts(dir.install(), u"", kMarch), 0);
  dir.Create({{u"Email Alert", u"T", u"2024/03/02 00:00:00"}});
  test::RawConnection other(dir.db_path());
  ASSERT_EQ(other.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
  EXPECT_EQ(CountAlerts(dir.install(), u"", kMarch, 20), 0);
  other.Exec("ROLLBACK");
  EXPECT_EQ(CountAlerts(dir.install(), u"", kMarch, 20), 1);
  for (const char* content : {"", "plain text, not SQLite at all"}) {
    test::StoreDir bad;
    test::WriteText(bad.db_path(), content);
    EXPECT_EQ(CountAlerts(bad.install(), u"", kMarch), 0) << content;
  }
  test::WriteText(dir.install() + platform::NativeSeparators(u"\\file"), "x");
  EXPECT_EQ(CountAlerts(dir.install() + platform::NativeSeparators(u"\\file"), u"", kMarch), 0);
}

}  // namespace
}  // namespace asum
