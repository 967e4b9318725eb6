#include <gtest/gtest.h>

#include <optional>
#include <string>

#include "platform/platform.h"
#include "support/test_support.h"

namespace asum {
namespace {

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
  const std::optional<std::u16string> replaced = env.DecodeCodePage(932, "a\x85\x40", Invalid::kReplace);
  ASSERT_TRUE(replaced.has_value());
  EXPECT_EQ(replaced->substr(0, 1), u"a");
}

}  // namespace
}  // namespace asum
