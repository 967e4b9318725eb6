#include <gtest/gtest.h>

#include <cstdlib>
#include <locale>
#include <optional>
#include <stdexcept>
#include <string>

#include "platform/platform.h"
#include "support/test_support.h"

namespace asum {
namespace {

#ifndef _WIN32
// Sets or unsets environment variables for the object's lifetime.
class ScopedVariables {
 public:
  ScopedVariables(std::initializer_list<std::pair<const char*, const char*>> values) {
    for (const auto& [name, value] : values) {
      const char* old = std::getenv(name);
      saved_.push_back({name, old ? std::optional<std::string>(old) : std::nullopt});
      Set(name, value);
    }
  }
  ~ScopedVariables() {
    for (const auto& [name, value] : saved_) Set(name, value ? value->c_str() : nullptr);
  }

 private:
  static void Set(const char* name, const char* value) {
    if (value != nullptr) {
      setenv(name, value, 1);
    } else {
      unsetenv(name);
    }
  }
  std::vector<std::pair<const char*, std::optional<std::string>>> saved_;
};

bool HasLocale(const char* name) {
  try {
    std::locale{name};
    return true;
  } catch (const std::runtime_error&) {
    return false;
  }
}

// The log's timestamp follows the locale the environment names, as the user's
// default locale does on Windows, and falls back to the C form.
TEST(TimestampText, FollowsTheEnvironmentsLocale) {
  if (!HasLocale("de_DE.UTF-8")) {
    GTEST_SKIP() << "this machine has no de_DE.UTF-8 locale (scripts/setup-locale.sh makes it)";
  }
  const char* kGerman = "07.12.2026 01:02:03";
  const char* kC = "12/07/26 01:02:03";
  const struct {
    const char* lc_all;
    const char* lc_time;
    const char* lang;
    const char* expected;
  } cases[] = {
      {nullptr, nullptr, nullptr, kC},
      {"de_DE.UTF-8", nullptr, nullptr, kGerman},
      {nullptr, "de_DE.UTF-8", "C", kGerman},
      {nullptr, nullptr, "de_DE.UTF-8", kGerman},
      {"C", "de_DE.UTF-8", "de_DE.UTF-8", kC},
      {nullptr, "xx_XX.UTF-8", nullptr, kC},  // no such locale here
  };
  platform::SystemTime t;
  t.year = 2026, t.month = 12, t.day = 7, t.day_of_week = 1, t.hour = 1, t.minute = 2, t.second = 3;
  for (const auto& c : cases) {
    ScopedVariables env{{"LC_ALL", c.lc_all}, {"LC_TIME", c.lc_time}, {"LANG", c.lang}};
    EXPECT_EQ(test::Narrow(platform::Env::Default().TimestampText(t)), c.expected)
        << (c.lc_all ? c.lc_all : "-") << " " << (c.lc_time ? c.lc_time : "-") << " " << (c.lang ? c.lang : "-");
  }
}
#endif

}  // namespace
}  // namespace asum
