#include "store/alert_count.h"

#include "store/when_index.h"
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
      {u"<TO>a</FROM><TO>b", u"a", u"", true},                    // no closing "<"
      {u"0123456789ABCDEF<x", u"", u"ABCDEF", true},              // no marker: from the eleventh character
      {u"</FROM><TO>b</TO>", u"", u"b", false},                   // marker at 0
      {u"2024</FROM><TO>x<", u"2024", u"x", true},                // lower without a tag
      {u"<a><b>c</FROM><TO>b<c<d", u"c", u"b<c", true},           // last ">" and last "<"
      {u"x</FROM>y</FROM><TO>z</TO>", u"x", u"ROM><TO>z", true},  // the first marker counts
      {u"x</FROM><T>", u"x", u"", true},                          // nothing left after the skip
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

// Routing and the statement's text are pinned above; here the bounds and the
// filter reach SQLite as parameters.
TEST(CountAlerts, FilterAndRangeSelectRows) {
  test::StoreDir dir;
  dir.Create({{u"Email Alert", u"Threshold Breach", u"2024/03/01 00:00:00"},
              {u"Email Alert", u"threshold low", u"2024/03/31 23:59:59"},
              {u"Script Alert", u"Disk", u"2024/03/31 10:00:00"},
              {u"Email Alert", u"O'Brien", u"2024/03/15 12:00:00"},
              {u"Email Alert", u"Old", u"2024/02/29 23:59:59"}});
  const struct {
    std::u16string filter, range;
    int expected;
  } cases[] = {
      {u"Email Alert", kMarch, 3},  // both bounds inclusive
      {u"Threshold", kMarch, 2},    // LIKE ignores ASCII case
      {u"_i_k", kMarch, 1},
      {u"O'Brien", kMarch, 1},      // a quote breaks nothing
      {u"Email Alert", u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31</TO>", 2},  // a bare upper date
  };
  for (const auto& c : cases) {
    EXPECT_EQ(CountAlerts(dir.install(), c.filter, c.range), c.expected)
        << test::Narrow(c.filter) << " | " << test::Narrow(c.range);
  }
}

// Every failure is 0: no database yet (folder, file and table appear), a
// database locked past the allowance, a file that is no database, an install
// folder that cannot hold one.
TEST(CountAlerts, FailuresGiveZero) {
  test::StoreDir dir, junk;
  EXPECT_EQ(CountAlerts(dir.install(), u"", kMarch), 0);
  dir.Create({{u"Email Alert", u"T", u"2024/03/02 00:00:00"}});
  test::RawConnection other(dir.db_path());
  ASSERT_EQ(other.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
  EXPECT_EQ(CountAlerts(dir.install(), u"", kMarch, 20), 0);
  other.Exec("ROLLBACK");
  EXPECT_EQ(CountAlerts(dir.install(), u"", kMarch, 20), 1);
  test::WriteText(junk.db_path(), "plain text, not SQLite at all");
  EXPECT_EQ(CountAlerts(junk.install(), u"", kMarch), 0);
  const std::u16string file = dir.install() + platform::NativeSeparators(u"\\file");
  test::WriteText(file, "x");
  EXPECT_EQ(CountAlerts(file, u"", kMarch), 0);
}

// The index is an opt-in beside the library's table: the count and the purge
// use it through their statements as they stand.
TEST(WhenIndex, CountAndPurgeUseIt) {
  test::StoreDir dir;
  dir.Create();
  CDbSQLite db;
  ASSERT_TRUE(db.Open(dir.db_path()));
  EXPECT_FALSE(HasWhenIndex(db));
  EXPECT_TRUE(DropWhenIndex(db)) << "removing what is not there is no failure";
  for (int twice = 0; twice < 2; ++twice) EXPECT_TRUE(CreateWhenIndex(db));
  EXPECT_TRUE(HasWhenIndex(db));
  const CountStatement cases[] = {BuildCountStatement(u"Email Alert", kMarch),
                                  {u"DELETE FROM AlertDB WHERE \"When\" <= '2024/03/01 00:00:00';", {}}};
  for (const CountStatement& c : cases) {
    auto plan = db.Statement(u"EXPLAIN QUERY PLAN " + c.sql);
    for (size_t i = 0; i < c.params.size(); ++i) plan->BindText(static_cast<int>(i + 1), c.params[i]);
    std::u16string details;
    while (plan->NextRow()) details += plan->ValueString(3);
    EXPECT_NE(details.find(kWhenIndexName), std::u16string::npos) << test::Narrow(c.sql + u": " + details);
  }
  EXPECT_TRUE(DropWhenIndex(db));
  EXPECT_FALSE(HasWhenIndex(db));
}

}  // namespace
}  // namespace asum
