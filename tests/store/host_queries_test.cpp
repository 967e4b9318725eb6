#include "store/host_queries.h"

#include <gtest/gtest.h>

#include "store_test_support.h"

namespace asum {
namespace {

TEST(HostText, ReadsWideTextsOfThisPlatform) {
  EXPECT_EQ(HostText(nullptr), u"");
  EXPECT_EQ(HostText(L""), u"");
  EXPECT_EQ(HostText(L"Email Alert"), u"Email Alert");
  EXPECT_EQ(HostText(L"caf\u00e9 \U0001F600"), u"caf\u00e9 \U0001F600");
}

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
    const wchar_t* filter;
    const wchar_t* range;
    int expected;
  } cases[] = {
      {L"Email Alert", L"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>", 1},
      {nullptr, L"</FROM>", 2},
      {L"\u00e9st \U0001F600", L"</FROM>", 1},
      {L"Email Alert", nullptr, 0},
      {nullptr, nullptr, 0},
      // Swapped arguments are not the same request.
      {L"<TO>2024/03/01 00:00:00</FROM><TO>2024/03/31 23:59:59</TO>", L"Email Alert", 0},
  };
  for (const Case& c : cases) EXPECT_EQ(GetAlertCountForHost(c.filter, c.range), c.expected);
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
