#include "store/host_queries.h"

#include <gtest/gtest.h>

#include "store_test_support.h"

namespace asum {
namespace {

class HostQueriesTest : public ::testing::Test {
 protected:
  void SetUp() override {
    env_.executable = dir_.install() + platform::kPathSeparator + u"host.exe";
    env_.local_now.year = 2024;
    env_.local_now.month = 3;
    env_.local_now.day = 20;
    dir_.Create();
    dir_.Insert({{u"Email Alert", u"T\u00e9st \U0001F600", u"2024/03/10 00:00:00"},
                 {u"Script Alert", u"Disk", u"2000/01/01 00:00:00"}});
  }
  test::FakeEnv env_;
  platform::ScopedEnv scoped_{&env_};
  test::StoreDir dir_;
};

TEST_F(HostQueriesTest, CountUsesTheDatabaseBesideTheHost) {
  struct Case {
    const char16_t* filter;
    const char16_t* range;
    int expected;
  } cases[] = {
      {u"Email Alert", u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>", 1},
      {u"", u"</FROM>", 2},
      {u"\u00e9st \U0001F600", u"</FROM>", 1},
      {u"Email Alert", u"", 0},
      {u"", u"", 0},
      // Swapped arguments are not the same request.
      {u"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>", u"Email Alert", 0},
  };
  for (const Case& c : cases) EXPECT_EQ(CountForHost(c.filter, c.range), c.expected);
}

TEST_F(HostQueriesTest, RetentionUsesTheDatabaseBesideTheHost) {
  test::SeededSettings settings;
  EXPECT_EQ(RunRetentionForHost(), 0);
  settings.SetString(u"Sch_Retention", u"TRUE");
  EXPECT_EQ(RunRetentionForHost(), 1);
  EXPECT_EQ(dir_.RowCount(), 1);
}

}  // namespace
}  // namespace asum
