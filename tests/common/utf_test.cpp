#include "common/utf.h"

#include <gtest/gtest.h>

#include <climits>

#include "common/wide_number.h"

namespace asum {
namespace {

// Each ill-formed piece of UTF-8 becomes U+FFFD per byte that starts no
// well-formed sequence; a POSIX name keeps those bytes as escapes and goes
// back to the system byte for byte.
TEST(Utf8ToUtf16, EveryIllFormedKindBecomesReplacementCharacters) {
  const struct {
    std::string bytes;
    std::u16string text;
  } cases[] = {
      {"a\xC3\xA9\xDF\xBF\xE2\x82\xAC\xF0\x9F\x98\x80", u"a\u00E9\u07FF\u20AC\U0001F600"},  // 1 to 4 bytes
      {"\xC0\xAF", u"\uFFFD\uFFFD"},                                           // overlong two-byte form
      {"\xE0\x80\xAF", u"\uFFFD\uFFFD\uFFFD"},                                 // overlong three-byte form
      {"\xED\xA0\x80", u"\uFFFD\uFFFD\uFFFD"},                                 // an encoded surrogate
      {"\xF4\x90\x80\x80", u"\uFFFD\uFFFD\uFFFD\uFFFD"},                       // beyond U+10FFFF
      {"\xF8\x88\x80\x80\x80", u"\uFFFD\uFFFD\uFFFD\uFFFD\uFFFD"},             // no such lead byte
      {"\x80x", u"\uFFFDx"},                                                   // a lone continuation byte
      {"\xE2\x82x", u"\uFFFD\uFFFDx"},                                         // a sequence broken off
      {"x\xE2\x82", u"x\uFFFD\uFFFD"},                                         // cut at the end
  };
  for (const auto& c : cases) {
    EXPECT_EQ(Utf8ToUtf16(c.bytes), c.text) << c.bytes;
    EXPECT_EQ(IsValidUtf8(c.bytes), c.text.find(u'\uFFFD') == std::u16string::npos) << c.bytes;
    const std::u16string name = BytesToNativeName(c.bytes);
    EXPECT_EQ(NativeNameToBytes(name), c.bytes) << c.bytes;
    EXPECT_EQ(DisplayText(name), c.text) << c.bytes;
  }
}

TEST(Utf16Conversions, LoneSurrogatesAreReplaced) {
  const std::u16string lone = u"a\xD800" u"b\xDC80";
  EXPECT_EQ(Utf16ToUtf8(lone), "a\xEF\xBF\xBD" "b\xEF\xBF\xBD");
  EXPECT_EQ(Utf16ToUtf8(u"caf\u00e9\u0080 \U0001F600"), "caf\xC3\xA9\xC2\x80 \xF0\x9F\x98\x80");
  EXPECT_EQ(DisplayText(lone), u"a\uFFFDb\uFFFD");
  EXPECT_EQ(NativeNameToBytes(u"\xDC41\xDCFF\xD800"), "\xEF\xBF\xBD\xFF\xEF\xBF\xBD");  // only 0x80-0xFF are bytes
  EXPECT_EQ(Utf32ToUtf16(U"a\U0001F600"), u"a\U0001F600");
  EXPECT_EQ(Utf32ToUtf16(std::u32string{0xD800, 0x110000}), u"\uFFFD\uFFFD");
  EXPECT_EQ(Utf16ToLatin1Lossy(u"caf\u00e9 \u4e2d \U0001F600 \xD800"), "caf\xe9 ? ? ?");
}

TEST(WcstolBase10, ReadsLikeTheCLibraryWithOneWhiteSpaceTable) {
  const struct {
    std::u16string_view text;
    int32_t value;
  } cases[] = {
      {u"72", 72}, {u" \t\n\v\f\r\u0085\u00A0\u1680\u2000\u200A\u2028\u2029\u202F\u205F\u3000+15 Days", 15},
      {u"-8", -8}, {u"", 0}, {u"abc", 0}, {u"- 5", 0}, {u"+", 0}, {u"12ab34", 12}, {u"\uFF11\uFF12", 0},
      {u"\u200B1", 0}, {u"\uFEFF1", 0}, {u"\u180E1", 0}, {u"\u001F1", 0},  // look-alikes of white space
      {u"2147483647", INT32_MAX}, {u"2147483648", INT32_MAX}, {u"-2147483648", INT32_MIN},
      {u"-99999999999999999999999", INT32_MIN}, {u"18446744073709551621", INT32_MAX},  // 2^64 + 5
      {u"000000000000000000000000042", 42},
  };
  for (const auto& c : cases) EXPECT_EQ(WcstolBase10(c.text), c.value) << Utf16ToUtf8(c.text);
}

}  // namespace
}  // namespace asum
