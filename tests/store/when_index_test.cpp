#include "store/when_index.h"

#include "store/alert_count.h"
#include "store_test_support.h"

namespace asum {
namespace {

constexpr char16_t kMarch[] = u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>";

// The index is an opt-in beside the library's table: the count and the purge
// use it through their statements as they stand and answer the same; it comes
// and goes without touching the rows.
TEST(WhenIndex, CountAndPurgeUseItAndAnswerTheSame) {
  test::StoreDir dir;
  dir.Create({{u"Email Alert", u"Disk", u"2024/02/29 23:59:59"},
              {u"Email Alert", u"Disk", u"2024/03/01 00:00:00"},
              {u"Script Alert", u"Disk", u"2024/03/31 23:59:59"},
              {u"Email Alert", u"Disk", u"-1/-1/-1 -1:-1:-1"}});
  const int before = CountAlerts(dir.install(), u"Email Alert", kMarch);
  const auto rows = dir.Column("\"Alert Action\" || \"When\"");
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
  EXPECT_EQ(CountAlerts(dir.install(), u"Email Alert", kMarch), before);
  EXPECT_EQ(dir.Column("\"Alert Action\" || \"When\""), rows);
  EXPECT_TRUE(DropWhenIndex(db));
  EXPECT_FALSE(HasWhenIndex(db));
}

}  // namespace
}  // namespace asum
