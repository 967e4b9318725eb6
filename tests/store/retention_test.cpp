#include "store/retention.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "store/alert_count.h"
#include "store/retention_settings.h"
#include "store_test_support.h"

namespace asum {
namespace {

using test::StoreDir;

platform::SystemTime Day(uint16_t y, uint16_t m, uint16_t d, uint16_t hh = 13, uint16_t mm = 45) {
  platform::SystemTime t;
  t.year = y;
  t.month = m;
  t.day = d;
  t.hour = hh;
  t.minute = mm;
  return t;
}

TEST(RetentionDays, ReadsTheNumberAsWcstolDoes) {
  struct Case {
    std::u16string text;
    int32_t days;
  } cases[] = {
      {u"15 Days", 15}, {u"30", 30},      {u"7Days", 7},        {u"1 Day", 1},
      {u"0 Days", 0},   {u"-5 Days", -5}, {u"Days", 0},         {u"", 0},
      {u"  +12", 12},   {u"\t9 Days", 9}, {u"abc 3", 0},        {u"3 Days4 Days", 34},
      {u"99999999999 Days", 2147483647},  {u"-99999999999", -2147483647 - 1},
      {u"2147483647", 2147483647},        {u"-2147483648", -2147483647 - 1},
      {u"\uFF11\uFF12", 0},  // digits of other scripts are not read
  };
  for (const Case& c : cases) EXPECT_EQ(RetentionDays(c.text), c.days) << test::Narrow(c.text);
}

TEST(CutoffText, MidnightOfTheDayCountedBack) {
  struct Case {
    platform::SystemTime now;
    int32_t days;
    std::u16string cutoff;
  } cases[] = {
      {Day(2024, 3, 20), 15, u"2024/03/05 00:00:00"},
      {Day(2024, 3, 20), 0, u"2024/03/20 00:00:00"},
      {Day(2024, 3, 20), -5, u"2024/03/25 00:00:00"},
      {Day(2024, 3, 1), 1, u"2024/02/29 00:00:00"},  // leap day
      {Day(2023, 3, 1), 1, u"2023/02/28 00:00:00"},
      {Day(2024, 1, 5, 0, 0), 10, u"2023/12/26 00:00:00"},
      {Day(2024, 3, 20), 2147483647, u"-1/-1/-1 00:00:00"},
      {Day(2024, 3, 20), -2147483647 - 1, u"-1/-1/-1 00:00:00"},
      {Day(100, 1, 2), 1, u"100/01/01 00:00:00"},
      {Day(100, 1, 1), 1, u"-1/-1/-1 00:00:00"},
      {Day(9999, 12, 31), -1, u"-1/-1/-1 00:00:00"},
      {Day(2024, 0, 0), 1, u"-1/-1/-1 00:00:00"},  // a clock that gives no date
  };
  for (const Case& c : cases) {
    EXPECT_EQ(CutoffText(c.now, c.days), c.cutoff) << c.now.year << "-" << c.now.month << "-" << c.now.day << " "
                                                   << c.days;
  }
}

const std::vector<std::u16string> kWhens = {u"2024/03/04 23:59:59", u"2024/03/05 00:00:00", u"2024/03/05 00:00:01",
                                           u"-1/-1/-1 -1:-1:-1",  u"2024/03/20 00:00:00", u"2024/03/20 08:00:00"};

class RetentionTest : public ::testing::Test {
 protected:
  void SetUp() override {
    env_.local_now = Day(2024, 3, 20);
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
  test::FakeEnv env_;
  platform::ScopedEnv scoped_{&env_};
  test::SeededSettings settings_;
  StoreDir dir_;
};

TEST_F(RetentionTest, DaySettingDecidesWhatStays) {
  const auto& w = kWhens;
  struct Case {
    const char16_t* value;  // null: no value, the default "15 Days"
    std::vector<std::u16string> left;
  } cases[] = {
      {nullptr, {w[2], w[4], w[5]}},
      {u"15 Days", {w[2], w[4], w[5]}},
      {u"0 Days", {w[5]}},
      {u"no digits", {w[5]}},
      {u"-5 Days", {}},
      {u"99999999 Days", {w[0], w[1], w[2], w[4], w[5]}},  // cut-off -1/-1/-1 00:00:00
  };
  settings_.SetString(u"Sch_Retention", u"TRUE");
  for (const Case& c : cases) {
    Reset();
    if (c.value == nullptr) {
      settings_.Remove(u"Sch_Retention_Val");
    } else {
      settings_.SetString(u"Sch_Retention_Val", c.value);
    }
    EXPECT_EQ(RunRetentionProc(dir_.install()), 1);
    EXPECT_EQ(Remaining(), c.left) << (c.value ? test::Narrow(c.value) : "default");
  }
}

TEST_F(RetentionTest, OnlyExactlyTrueSwitchesItOn) {
  struct Case {
    const char16_t* value;
    bool string_value;
    int result;
  } cases[] = {
      {nullptr, true, 0}, {u"true", true, 0}, {u"True", true, 0}, {u"TRUE ", true, 0},
      {u"", true, 0},     {u"1", false, 0},   {u"TRUE", true, 1},
  };
  settings_.SetString(u"Sch_Retention_Val", u"-5 Days");
  for (const Case& c : cases) {
    if (c.value == nullptr) {
      settings_.Remove(u"Sch_Retention");
    } else if (c.string_value) {
      settings_.SetString(u"Sch_Retention", c.value);
    } else {
      settings_.SetNonString(u"Sch_Retention", 1);
    }
    const size_t before = Remaining().size();
    EXPECT_EQ(RunRetentionProc(dir_.install()), c.result) << (c.value ? test::Narrow(c.value) : "missing");
    EXPECT_EQ(Remaining().empty(), c.result == 1 || before == 0);
  }
}

TEST_F(RetentionTest, SettingValuesOfAnyShapeGiveANumberOrTheDefault) {
  settings_.SetString(u"Sch_Retention", u"TRUE");
  settings_.SetNonString(u"Sch_Retention_Val", 30);
  const std::u16string value = GetRetentionSetting(kRetentionDaysSetting, kRetentionDaysDefault);
#ifdef _WIN32
  EXPECT_EQ(value, std::u16string(1, u'\x1e')) << "a number value is read as the text of its bytes";
#else
  EXPECT_EQ(value, u"15 Days") << "an unreadable value gives the default";
#endif
  EXPECT_EQ(RunRetentionProc(dir_.install()), 1);
  settings_.SetString(u"Sch_Retention_Val", std::u16string(5000, u'9'));
  EXPECT_EQ(GetRetentionSetting(kRetentionDaysSetting, u"d").size(), 5000u);
  EXPECT_EQ(RunRetentionProc(dir_.install()), 1);
}

// The support tool's status reads the settings where a person may only read:
// it finds what the purge finds, and creates no key on the way.
TEST_F(RetentionTest, ReadingForStatusCreatesNoKey) {
  struct Case {
    const char16_t* value;  // null: no key at all
    std::u16string read;
  } cases[] = {{nullptr, u"15 Days"}, {u"30 Days", u"30 Days"}, {u"", u""}};
  for (const Case& c : cases) {
    if (c.value == nullptr) {
      settings_.Remove(kRetentionDaysSetting);
    } else {
      settings_.SetString(kRetentionDaysSetting, c.value);
    }
    EXPECT_EQ(ReadRetentionSetting(kRetentionDaysSetting, kRetentionDaysDefault), c.read);
    EXPECT_EQ(settings_.KeyExists(kRetentionDaysSetting), c.value != nullptr) << test::Narrow(c.read);
    EXPECT_EQ(GetRetentionSetting(kRetentionDaysSetting, kRetentionDaysDefault), c.read);
  }
}

TEST_F(RetentionTest, UnusableDatabasesGiveZero) {
  settings_.SetString(u"Sch_Retention", u"TRUE");
  {
    StoreDir fresh;  // no database yet: created with its table, the DELETE runs
    EXPECT_EQ(RunRetentionProc(fresh.install()), 1);
    EXPECT_EQ(fresh.RowCount(), 0);
  }
  {
    StoreDir empty;  // an empty file is a database without the table: it gets one
    test::WriteText(empty.db_path(), "");
    EXPECT_EQ(RunRetentionProc(empty.install()), 1);
    StoreDir junk;
    test::WriteText(junk.db_path(), "not a database");
    EXPECT_EQ(RunRetentionProc(junk.install()), 0);
    EXPECT_EQ(test::ReadText(junk.db_path()), "not a database") << "never touched";
  }
  StoreDir dir;
  EXPECT_EQ(RunRetentionProc(dir.install() + platform::NativeSeparators(u"\\no\\such")), 0);

  test::RawConnection other(dir_.db_path());
  ASSERT_EQ(other.Exec("BEGIN EXCLUSIVE"), SQLITE_OK);
  EXPECT_EQ(RunRetentionProc(dir_.install(), 100), 0);
  other.Exec("ROLLBACK");
  EXPECT_EQ(Remaining().size(), 6u) << "the rows stay";
}

TEST_F(RetentionTest, ReadOnlyDatabaseIsCountedButNotPurged) {
  namespace fs = std::filesystem;
  settings_.SetString(u"Sch_Retention", u"TRUE");
  const fs::path file(dir_.db_path());
  fs::permissions(file, fs::perms::owner_read | fs::perms::group_read | fs::perms::others_read);
  const bool still_writable = std::ofstream(file, std::ios::app).good();
  if (!still_writable) {
    EXPECT_EQ(CountAlerts(dir_.install(), u"", u"</FROM>"), 6);
    EXPECT_EQ(RunRetentionProc(dir_.install(), 100), 0);
  }
  fs::permissions(file, fs::perms::owner_all);
  if (still_writable) GTEST_SKIP() << "this user writes read-only files";
  EXPECT_EQ(Remaining().size(), 6u);
}

}  // namespace
}  // namespace asum
