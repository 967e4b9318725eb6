#include "store/retention.h"

#include "store/alert_count.h"
#include "store/host_queries.h"
#include "store_test_support.h"

namespace asum {
namespace {

using platform::SystemTime;

TEST(RetentionDays, ReadsTheNumberAsWcstolDoes) {
  const std::pair<std::u16string, int32_t> cases[] = {
      {u"15 Days", 15}, {u"30", 30}, {u"7Days", 7},         {u"1 Day", 1},   {u"0 Days", 0},
      {u"-5 Days", -5}, {u"Days", 0}, {u"", 0},             {u"  +12", 12},  {u"abc 3", 0},
      {u"3 Days4 Days", 34}, {u"99999999999 Days", INT32_MAX}, {u"-99999999999", INT32_MIN},
  };
  for (const auto& [text, days] : cases) EXPECT_EQ(RetentionDays(text), days) << test::Narrow(text);
}

TEST(CutoffText, MidnightOfTheDayCountedBack) {
  const struct {
    SystemTime now;
    int32_t days;
    std::u16string cutoff;
  } cases[] = {
      {{2024, 3, 3, 20, 13, 45}, 15, u"2024/03/05 00:00:00"},
      {{2024, 3, 3, 20, 0, 0}, 0, u"2024/03/20 00:00:00"},
      {{2024, 3, 3, 20}, -5, u"2024/03/25 00:00:00"},
      {{2024, 3, 5, 1}, 1, u"2024/02/29 00:00:00"},
      {{2023, 3, 3, 1}, 1, u"2023/02/28 00:00:00"},
      {{2024, 1, 5, 5}, 10, u"2023/12/26 00:00:00"},
      {{2024, 3, 3, 20}, INT32_MAX, u"-1/-1/-1 00:00:00"},
      {{2024, 3, 3, 20}, INT32_MIN, u"-1/-1/-1 00:00:00"},
      {{100, 1, 6, 2}, 1, u"100/01/01 00:00:00"},
      {{100, 1, 5, 1}, 1, u"-1/-1/-1 00:00:00"},
      {{9999, 12, 5, 31}, -1, u"-1/-1/-1 00:00:00"},
      {{2024, 0, 0, 0}, 1, u"-1/-1/-1 00:00:00"},  // a clock that gives no date
  };
  for (const auto& c : cases) EXPECT_EQ(CutoffText(c.now, c.days), c.cutoff) << c.now.year << " " << c.days;
}

// Today is 2024-03-20; the settings live in a registry of the test's own.
class RetentionTest : public ::testing::Test {
 protected:
  void SetUp() override {
    env_.executable = dir_.install() + platform::kPathSeparator + u"host.exe";
    dir_.Create();
    Reset();
  }
  void Reset() {
    test::RawConnection(dir_.db_path()).Exec("DELETE FROM AlertDB");
    for (const auto& when : kWhens) dir_.Insert({{u"a", u"t", when}});
  }
  std::vector<std::u16string> Remaining() const {
    std::vector<std::u16string> whens;
    for (const auto& row : dir_.Rows()) whens.push_back(row[3]);
    return whens;
  }
  const std::vector<std::u16string> kWhens = {u"2024/03/04 23:59:59", u"2024/03/05 00:00:00", u"2024/03/05 00:00:01",
                                              u"-1/-1/-1 -1:-1:-1", u"2024/03/20 00:00:00", u"2024/03/20 08:00:00"};
  test::StoreEnv env_;
  platform::ScopedEnv scoped_{&env_};
  test::StoreDir dir_;
};

TEST_F(RetentionTest, DaySettingDecidesWhatStays) {
  const auto& w = kWhens;
  const struct {
    const char16_t* value;  // null: no value, the default "15 Days"
    std::vector<std::u16string> left;
  } cases[] = {
      {nullptr, {w[2], w[4], w[5]}}, {u"15 Days", {w[2], w[4], w[5]}}, {u"0 Days", {w[5]}}, {u"no digits", {w[5]}},
      {u"-5 Days", {}},              {u"99999999 Days", {w[0], w[1], w[2], w[4], w[5]}},  // -1/-1/-1 00:00:00
  };
  env_.SetSetting(u"Sch_Retention", u"TRUE");
  for (const auto& c : cases) {
    Reset();
    env_.values.erase(u"software\\Varnholt Suite\\Varnholt Suite\\Sch_Retention_Val\\Sch_Retention_Val");
    if (c.value != nullptr) env_.SetSetting(u"Sch_Retention_Val", c.value);
    EXPECT_EQ(RunRetentionForHost(), 1);
    EXPECT_EQ(Remaining(), c.left) << (c.value ? test::Narrow(c.value) : "default");
  }
}

// Only "TRUE" switches the purge on; the keys on the way are created and
// every key opened is closed again.
TEST_F(RetentionTest, OnlyExactlyTrueSwitchesItOn) {
  env_.SetSetting(u"Sch_Retention_Val", u"-5 Days");
  for (const char16_t* value : {u"", u"true", u"True", u"TRUE ", u"FALSE", u"TRUE"}) {
    env_.SetSetting(u"Sch_Retention", value);
    const int purged = std::u16string(value) == u"TRUE";
    EXPECT_EQ(RunRetentionProc(dir_.install()), purged) << test::Narrow(value);
    EXPECT_EQ(Remaining().size(), purged ? 0u : kWhens.size()) << test::Narrow(value);
  }
  EXPECT_EQ(env_.keys, (std::set<std::u16string>{u"software", u"software\\Varnholt Suite",
                                                 u"software\\Varnholt Suite\\Varnholt Suite",
                                                 u"software\\Varnholt Suite\\Varnholt Suite\\Sch_Retention",
                                                 u"software\\Varnholt Suite\\Varnholt Suite\\Sch_Retention_Val"}));
  EXPECT_EQ(env_.open_keys, 0);
  Reset();
  env_.keys = {};  // no "software": nothing is created, the default leaves it off
  EXPECT_EQ(RunRetentionProc(dir_.install()), 0);
  EXPECT_TRUE(env_.keys.empty());
  EXPECT_EQ(Remaining().size(), kWhens.size());
}

TEST_F(RetentionTest, UnusableDatabasesGiveZero) {
  env_.SetSetting(u"Sch_Retention", u"TRUE");
  test::StoreDir fresh, empty, junk;  // none yet: created with its table; empty: given the table
  test::WriteText(empty.db_path(), "");
  test::WriteText(junk.db_path(), "not a database");
  EXPECT_EQ(RunRetentionProc(fresh.install()), 1);
  EXPECT_EQ(fresh.Rows().size(), 0u);
  EXPECT_EQ(RunRetentionProc(empty.install()), 1);
  EXPECT_EQ(RunRetentionProc(junk.install()), 0);
  EXPECT_EQ(test::ReadText(junk.db_path()), "not a database") << "never touched";
  EXPECT_EQ(RunRetentionProc(fresh.install() + platform::NativeSeparators(u"\\no\\such")), 0);
  test::RawConnection other(dir_.db_path());
  ASSERT_EQ(other.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
  EXPECT_EQ(RunRetentionProc(dir_.install(), 20), 0);
  other.Exec("ROLLBACK");
  EXPECT_EQ(Remaining().size(), kWhens.size()) << "the rows stay";
}

TEST_F(RetentionTest, ReadOnlyDatabaseIsCountedButNotPurged) {
  env_.SetSetting(u"Sch_Retention", u"TRUE");
  test::UnwritableFile file(dir_.db_path());
  if (!file.unwritable()) {
    GTEST_SKIP() << "this user writes read-only files, and this file system or user cannot set the immutable "
                    "attribute (chattr +i needs CAP_LINUX_IMMUTABLE and ext2/3/4, XFS or Btrfs)";
  }
  EXPECT_EQ(CountAlerts(dir_.install(), u"", u"</FROM>"), 6);
  EXPECT_EQ(RunRetentionProc(dir_.install(), 20), 0);
  EXPECT_EQ(Remaining().size(), kWhens.size());
}

TEST_F(RetentionTest, HostQueriesUseTheDatabaseBesideTheHost) {
  EXPECT_EQ(HostText(nullptr), u"");
  EXPECT_EQ(HostText(L"caf\u00e9 \U0001F600"), u"caf\u00e9 \U0001F600");
  EXPECT_EQ(GetAlertCountForHost(nullptr, L"</FROM>"), 6);
  EXPECT_EQ(GetAlertCountForHost(L"t", L"<TO>2024/03/05 00:00:00</FROM><TO>2024/03/20 00:00:00</TO>"), 3);
  EXPECT_EQ(GetAlertCountForHost(L"</FROM>", L"t"), 0) << "swapped arguments are another request";
  EXPECT_EQ(GetAlertCountForHost(L"t", nullptr), 0);
  EXPECT_EQ(RunRetentionForHost(), 0);
  env_.SetSetting(u"Sch_Retention", u"TRUE");
  EXPECT_EQ(RunRetentionForHost(), 1);
  EXPECT_EQ(Remaining().size(), 3u);
}

}  // namespace
}  // namespace asum
