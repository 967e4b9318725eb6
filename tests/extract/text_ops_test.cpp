#include "extract/text_ops.h"

#include <gtest/gtest.h>

#include <climits>

#include "support/test_support.h"

namespace asum {
namespace {

TEST(TextOps, CutsClampAtBothEnds) {
  enum Op { kLeft, kRight, kMid };
  struct Case { Op op; std::u16string_view text; std::ptrdiff_t n; std::u16string_view want; };
  const Case cases[] = {
      {kLeft, u"abc", -1, u""},  {kLeft, u"abc", 0, u""},     {kLeft, u"abc", 2, u"ab"},
      {kLeft, u"abc", 3, u"abc"}, {kLeft, u"abc", 99, u"abc"}, {kLeft, u"", 1, u""},
      {kRight, u"abc", -5, u""}, {kRight, u"abc", 0, u""},    {kRight, u"abc", 1, u"c"},
      {kRight, u"abc", 3, u"abc"}, {kRight, u"abc", 4, u"abc"},
      {kMid, u"abc", -1, u"abc"}, {kMid, u"abc", 0, u"abc"},  {kMid, u"abc", 1, u"bc"},
      {kMid, u"abc", 3, u""},    {kMid, u"abc", 7, u""},
  };
  for (const Case& c : cases) {
    const std::u16string got = c.op == kLeft ? Left(c.text, c.n)
                             : c.op == kRight ? Right(c.text, c.n) : Mid(c.text, c.n);
    EXPECT_EQ(got, c.want) << "op " << c.op << " n " << c.n;
  }
}

TEST(TextOps, ReplaceScansLeftToRightOnce) {
  struct Case { std::u16string_view text, old_text, new_text, want; };
  const Case cases[] = {
      {u"aaa", u"aa", u"b", u"ba"},
      {u"&&##7", u"&#", u"", u"&#7"},  // what a removal leaves is not rescanned
      {u"x(s)y(s)", u"(s)", u"", u"xy"},
      {u"abc", u"", u"z", u"abc"},
      {u"abc", u"abcd", u"z", u"abc"},
      {u"a", u"a", u"aa", u"aa"},
  };
  for (const Case& c : cases) EXPECT_EQ(Replace(c.text, c.old_text, c.new_text), c.want);
}

TEST(TextOps, TrimsUseTheFixedWhiteSpaceTable) {
  const std::u16string all_space = u"\t\n\v\f\r \u0085\u00A0\u1680\u2000\u200A\u2028\u2029\u202F\u205F\u3000";
  EXPECT_EQ(TrimLeft(all_space + u"x" + all_space), u"x" + all_space);
  EXPECT_EQ(TrimRight(all_space + u"x" + all_space), all_space + u"x");
  EXPECT_EQ(TrimLeft(all_space), u"");
  // Look-alikes that are not white space: zero width space, BOM, NUL.
  for (char16_t c : {u'\u200B', u'\uFEFF', u'\u0000', u'\u180E', u'\u001F'}) {
    EXPECT_FALSE(IsWhiteSpace(c)) << static_cast<int>(c);
    EXPECT_EQ(TrimLeft(std::u16string(1, c)).size(), 1u);
  }
}

TEST(TextOps, WcstolReadsLikeTheCLibrary) {
  struct Case { std::u16string_view text; int32_t want; };
  const Case cases[] = {
      {u"72", 72},          {u"  \u3000+15 Days", 15}, {u"-8", -8},
      {u"", 0},             {u"abc", 0},               {u"- 5", 0},
      {u"+", 0},            {u"12ab34", 12},           {u"\uFF11\uFF12", 0},  // full-width digits
      {u"2147483647", INT32_MAX}, {u"2147483648", INT32_MAX},
      {u"-2147483648", INT32_MIN}, {u"-99999999999999999999999", INT32_MIN},
      {u"000000000000000000000000042", 42},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(WcstolBase10(c.text), c.want) << test::Narrow(std::u16string(c.text));
  }
}

}  // namespace
}  // namespace asum
