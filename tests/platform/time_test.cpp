#include <gtest/gtest.h>

#include <cstdlib>
#include <ctime>
#include <locale>
#include <optional>
#include <stdexcept>
#include <string>

#include "platform/platform.h"
#include "support/test_support.h"

namespace asum {
namespace {

using platform::SystemTime;

#ifndef _WIN32
// Sets (null: unsets) an environment variable until the object goes.
class ScopedVariable {
 public:
  ScopedVariable(const char* name, const char* value) : name_(name), had_(std::getenv(name) != nullptr) {
    if (had_) old_ = std::getenv(name);
    Set(name_, value);
  }
  ~ScopedVariable() { Set(name_, had_ ? old_.c_str() : nullptr); }

 private:
  static void Set(const char* name, const char* value) {
    value ? setenv(name, value, 1) : unsetenv(name);
    tzset();
  }
  const char* name_;
  bool had_;
  std::string old_;
};

// The log's timestamp follows the locale the environment names, as the user's
// default locale does on Windows, and falls back to the C form.
TEST(TimestampText, FollowsTheEnvironmentsLocale) {
  bool german = true;
  try {
    std::locale{"de_DE.UTF-8"};
  } catch (const std::runtime_error&) {
    german = false;  // scripts/setup-locale.sh makes it; the C cases still run
  }
  const char* kGerman = "07.12.2026 01:02:03";
  const struct {
    const char *lc_all, *lc_time, *lang, *expected;
  } cases[] = {
      {nullptr, nullptr, nullptr, "12/07/26 01:02:03"},    {nullptr, "xx_XX.UTF-8", nullptr, "12/07/26 01:02:03"},
      {"C", "de_DE.UTF-8", "de_DE.UTF-8", "12/07/26 01:02:03"}, {"de_DE.UTF-8", nullptr, nullptr, kGerman},
      {nullptr, "de_DE.UTF-8", "C", kGerman},               {nullptr, nullptr, "de_DE.UTF-8", kGerman},
  };
  for (const auto& c : cases) {
    if (!german && c.expected == kGerman) continue;
    ScopedVariable all("LC_ALL", c.lc_all), time("LC_TIME", c.lc_time), lang("LANG", c.lang);
    EXPECT_EQ(test::Narrow(platform::Env::Default().TimestampText(SystemTime{2026, 12, 1, 7, 1, 2, 3, 0})), c.expected)
        << (c.lc_all ? c.lc_all : "-") << " " << (c.lc_time ? c.lc_time : "-") << " " << (c.lang ? c.lang : "-");
  }
}
#endif

// The bias is what turns local time into UTC: UTC = local + bias. (Linux
// sets a zone five and a half hours east; Windows keeps the machine's.)
TEST(UtcToLocal, AgreesWithTheBiasAndRefusesImpossibleTimes) {
#ifndef _WIN32
  ScopedVariable zone("TZ", "XST-05:30");
  EXPECT_EQ(platform::Env::Default().CurrentBiasMinutes(), -330);
  EXPECT_EQ(platform::Env::Default().UtcToLocal(SystemTime{2024, 12, 2, 31, 20, 0, 5, 7}),
            (SystemTime{2025, 1, 3, 1, 1, 30, 5, 7}));
#endif
  platform::Env& env = platform::Env::Default();
  const SystemTime utc = env.UtcNow();
  const std::optional<SystemTime> local = env.UtcToLocal(utc);
  ASSERT_TRUE(local.has_value());
  const auto minutes = [](const SystemTime& t) {
    return ((t.year * 400 + t.month * 32 + t.day) * 24 + t.hour) * 60 + t.minute;  // order kept, not a calendar
  };
  const int shift = minutes(*local) - minutes(utc);
  EXPECT_TRUE(shift == -env.CurrentBiasMinutes() || std::abs(shift) > 24 * 60) << shift;  // across a month end
  for (const SystemTime& bad : {SystemTime{1600, 12, 0, 31, 0, 0, 0, 0}, SystemTime{2024, 13, 0, 1, 0, 0, 0, 0},
                                SystemTime{2024, 1, 0, 1, 24, 0, 0, 0}}) {
    EXPECT_FALSE(env.UtcToLocal(bad).has_value()) << bad.year << "-" << bad.month << "-" << bad.day;
  }
}

// OLE Automation dates count days from 1899-12-30; before it the fraction
// still runs forward in time. Years 100 to 9999.
TEST(VariantTime, CountsDaysFrom30December1899BothWays) {
  const struct {
    SystemTime time;
    double date;
  } cases[] = {
      {SystemTime{1899, 12, 6, 30, 0, 0, 0, 0}, 0.0},
      {SystemTime{1899, 12, 5, 29, 6, 0, 0, 0}, -1.25},
      {SystemTime{1900, 1, 1, 1, 12, 0, 0, 0}, 2.5},
      {SystemTime{2024, 3, 2, 5, 14, 7, 9, 0}, 45356 + (14 * 3600 + 7 * 60 + 9) / 86400.0},
      {SystemTime{100, 1, 5, 1, 0, 0, 0, 0}, -657434.0},
      {SystemTime{9999, 12, 5, 31, 0, 0, 0, 0}, 2958465.0},
  };
  platform::Env& env = platform::Env::Default();
  for (const auto& c : cases) {
    EXPECT_NEAR(env.SystemTimeToVariantTime(c.time).value_or(-1e9), c.date, 1e-9) << c.date;
    EXPECT_EQ(env.VariantTimeToSystemTime(c.date), c.time) << c.date;
  }
  EXPECT_FALSE(env.VariantTimeToSystemTime(2958466.0).has_value());
  EXPECT_FALSE(env.VariantTimeToSystemTime(-657435.0).has_value());
  EXPECT_FALSE(env.SystemTimeToVariantTime(SystemTime{10000, 1, 0, 1, 0, 0, 0, 0}).has_value());
}

}  // namespace
}  // namespace asum
