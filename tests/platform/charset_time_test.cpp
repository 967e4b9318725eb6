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
using Invalid = platform::Env::InvalidBytes;

// Both backends read these bytes alike, and report what they cannot read
// rather than hide it behind replacement characters.
TEST(DecodeCodePage, ReadsAsWindowsDoesAndReportsInvalidBytes) {
  const struct {
    uint32_t code_page;
    std::string bytes;
    std::optional<std::u16string> text;
  } cases[] = {
      {1252, "caf\xE9 \x80", u"caf\u00E9 \u20AC"},  {1252, "\x81\x8D\x8F\x90\x9D", u"\u0081\u008D\u008F\u0090\u009D"},
      {1250, "\x81\x83\x88\x90\x98", u"\u0081\u0083\u0088\u0090\u0098"},  {1255, "\xCA", u"\u05BA"},
      {1258, "a\xCC", u"a\u0300"},  // a letter and its combining mark stay two characters
      {28597, "\xA1\xA2", u"\u02BD\u02BC"}, {28597, "\xA4", std::nullopt},   {28598, "\xAF", u"\u203E"},
      {21866, "\xAE\xBE", u"\u045E\u040E"}, {20127, "a\xE1", u"aa"},          {65001, "\xC3\xA9", u"\u00E9"},
      {65001, "\xE9", std::nullopt},        {932, "\x93\xFA\x87\x40\x80", u"\u65E5\u2460\u0080"},
      {932, "\x93", std::nullopt},          {932, "\x85\x40", std::nullopt}, {949, "\xC7\xD1\x80", u"\uD55C\u0080"},
      {949, "a\xC7", std::nullopt},         {950, "\xA4\xA4", u"\u4E2D"},     {950, "\xA4 ", std::nullopt},
      {936, "\xD6\xD0", u"\u4E2D"},         {936, "\xD6", std::nullopt},      {1, "x", std::nullopt},
  };
  platform::Env& env = platform::Current();
  for (const auto& c : cases) {
    EXPECT_EQ(env.DecodeCodePage(c.code_page, c.bytes, Invalid::kFail), c.text) << c.code_page << " " << c.bytes;
  }
  EXPECT_EQ(env.DecodeCodePage(65001, "a\xC3", Invalid::kReplace), u"a\uFFFD");
}

#ifndef _WIN32
// Sets (null: unsets) an environment variable until the object goes.
struct ScopedVariable {
  ScopedVariable(const char* name, const char* value) : name(name) {
    if (const char* old = std::getenv(name)) saved = old;
    Set(name, value);
  }
  ~ScopedVariable() { Set(name, saved ? saved->c_str() : nullptr); }
  static void Set(const char* name, const char* value) {
    value ? setenv(name, value, 1) : unsetenv(name);
    tzset();
  }
  const char* name;
  std::optional<std::string> saved;
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
  const char *kC = "12/07/26 01:02:03", *kDe = "07.12.2026 01:02:03", *de = "de_DE.UTF-8";
  const struct {
    const char *lc_all, *lc_time, *lang, *expected;
  } cases[] = {
      {nullptr, nullptr, nullptr, kC}, {nullptr, "xx_XX.UTF-8", nullptr, kC}, {"C", de, de, kC},
      {de, nullptr, nullptr, kDe},     {nullptr, de, "C", kDe},                {nullptr, nullptr, de, kDe},
  };
  for (const auto& c : cases) {
    if (!german && c.expected == kDe) continue;
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
  const SystemTime bad[] = {{1600, 12, 0, 31, 0, 0, 0, 0}, {2024, 13, 0, 1, 0, 0, 0, 0}, {2024, 1, 0, 1, 24, 0, 0, 0}};
  for (const SystemTime& b : bad) EXPECT_FALSE(env.UtcToLocal(b).has_value()) << b.year << "-" << b.month;
}

// OLE Automation dates count days from 1899-12-30; before it the fraction
// still runs forward in time. Years 100 to 9999.
TEST(VariantTime, CountsDaysFrom30December1899BothWays) {
  const struct {
    SystemTime time;
    double date;
  } cases[] = {
      {{1899, 12, 6, 30, 0, 0, 0, 0}, 0.0},     {{1899, 12, 5, 29, 6, 0, 0, 0}, -1.25},
      {{1900, 1, 1, 1, 12, 0, 0, 0}, 2.5},      {{100, 1, 5, 1, 0, 0, 0, 0}, -657434.0},
      {{9999, 12, 5, 31, 0, 0, 0, 0}, 2958465.0}, {{2024, 3, 2, 5, 14, 7, 9, 0}, 45356 + 50829 / 86400.0},
  };
  platform::Env& env = platform::Env::Default();
  for (const auto& c : cases) {
    EXPECT_NEAR(env.SystemTimeToVariantTime(c.time).value_or(-1e9), c.date, 1e-9) << c.date;
    EXPECT_EQ(env.VariantTimeToSystemTime(c.date), c.time) << c.date;
  }
  for (const double date : {2958466.0, -657435.0}) EXPECT_FALSE(env.VariantTimeToSystemTime(date).has_value());
  EXPECT_FALSE(env.SystemTimeToVariantTime(SystemTime{10000, 1, 0, 1, 0, 0, 0, 0}).has_value());
}

}  // namespace
}  // namespace asum
