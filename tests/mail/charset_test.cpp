#include <gtest/gtest.h>

#include <string>

#include "mail/charset_table.h"
#include "mail/text_convert.h"

namespace asum::mail {
namespace {

TEST(CodePageForCharset, NamesFoldToTheirCodePage) {
  struct Case {
    std::string name;
    uint32_t code_page;  // 0: none
  } cases[] = {
      {"UTF-8", 65001},        {"utf8", 65001},          {"US-ASCII", 20127},      {"ISO_8859-1", 28591},
      {"\"Latin1\"", 28591},   {"iso8859-15", 28605},    {"latin6", 28600},        {"windows-1250", 1250},
      {"CP1258", 1258},        {"x-cp1252", 1252},       {"windows-1259", 0},      {"windows-125", 0},
      {"euc-kr", 949},         {"ks_c_5601-1987", 949},  {"ISO-2022-JP", 50220},   {"gb2312", 936},
      {"GB18030", 54936},      {"Shift_JIS", 932},       {"koi8-u", 21866},        {"TIS-620", 874},
      {"big5", 950},           {"", 0},                  {"uft-8", 0},             {std::string(41, '-') + "utf8", 0},
  };
  for (const Case& c : cases) EXPECT_EQ(CodePageForCharset(c.name).value_or(0), c.code_page) << c.name;
}

struct Case {
  const char* charset;  // null: none declared
  std::string bytes;
  std::string utf8;
};

void ExpectConverted(const Case& c) {
  const std::optional<uint32_t> code_page = c.charset ? CodePageForCharset(c.charset) : std::nullopt;
  EXPECT_EQ(ToUtf8(c.bytes, code_page), c.utf8) << (c.charset ? c.charset : "none") << ": " << c.bytes;
}

// The Linux and the Windows builds run these same cases: none of them may
// depend on a code page that only some machines install.
TEST(ToUtf8, EveryListedCharsetReadsAlikeOnEveryBuild) {
  const Case cases[] = {
      {"iso-8859-2", "\xB1", "\xC4\x85"},
      {"iso-8859-7", "\xE1", "\xCE\xB1"},
      {"iso-8859-10", "\xBD\xFF", "\xE2\x80\x95\xC4\xB8"},
      {"iso-8859-14", "\xA1\xFE", "\xE1\xB8\x82\xC5\xB7"},
      {"iso-8859-15", "\xA4", "\xE2\x82\xAC"},
      {"windows-1252", "\x80\x81", "\xE2\x82\xAC\xC2\x81"},
      {"koi8-u", "\xAE", "\xD1\x9E"},
      {"windows-874", "\xA1", "\xE0\xB8\x81"},
      {"gb2312", "\xD6\xD0\xCE\xC4", "\xE4\xB8\xAD\xE6\x96\x87"},
      {"gb18030", "\xD6\xD0\xCE\xC4", "\xE4\xB8\xAD\xE6\x96\x87"},
      {"big5", "\xA4\xA4\xA4\xE5", "\xE4\xB8\xAD\xE6\x96\x87"},
      {"shift_jis", "\x93\xFA\x96{", "\xE6\x97\xA5\xE6\x9C\xAC"},
      {"euc-jp", "\xC6\xFC\xCB\xDC", "\xE6\x97\xA5\xE6\x9C\xAC"},
      {"euc-kr", "\xC7\xD1\xB1\xB9", "\xED\x95\x9C\xEA\xB5\xAD"},
      {"iso-2022-jp", "\x1b$BF|K\\\x1b(B x", "\xE6\x97\xA5\xE6\x9C\xAC x"},
      {"iso-2022-jp", "\x1b$@F|\x1b(J\\~", "\xE6\x97\xA5\\~"},          // 1978 set; Roman as Shift_JIS reads it
      {"iso-2022-jp", "\x1b&@\x1b$BF|\x1b(B", "\xE6\x97\xA5"},          // revision announcer
      {"iso-2022-jp", "\x1b(I12\x1b(B", "\xEF\xBD\xB1\xEF\xBD\xB2"},    // half-width katakana
      {"iso-2022-jp", "\x1b$BF|\r\nab", "\xE6\x97\xA5\r\nab"},          // a line end returns to ASCII
      {"iso-2022-jp", "\x1b$B-!!A\x1b(B", "\xE2\x91\xA0\xEF\xBD\x9E"},  // NEC row 13; wave dash as 932
      {"iso-2022-jp", "\x1b$BF|K", "\x1b$BF|K"},                        // a cut character: no ISO-2022-JP
      {"iso-2022-jp", "\x1b$(DF|\x1b(B", "\x1b$(DF|\x1b(B"},            // JIS X 0212 is none either
      {"us-ascii", "\x1b$BF|\x1b(B", "\xE6\x97\xA5"},                   // 7-bit with ESC is guessed as it
  };
  for (const Case& c : cases) ExpectConverted(c);
}

// Text that the declared charset cannot read as a whole (or no charset) is
// read by the header rule: UTF-8 when valid, else the ANSI code page; never
// replacement characters.
TEST(ToUtf8, UndeclaredOrUnfittingCharsetFallsBackToTheHeaderRule) {
  const std::string dash = "Disk full \xE2\x80\x93 server1";
  const Case cases[] = {
      {nullptr, dash, dash},
      {nullptr, "caf\xE9", "caf\xC3\xA9"},
      {"utf-8", "caf\xE9", "caf\xC3\xA9"},
      {"iso-2022-jp", dash, dash},
      {"iso-2022-jp", "caf\xE9", "caf\xC3\xA9"},
      {"euc-kr", dash, dash},
      {"euc-kr", "caf\xE9 ok", "caf\xC3\xA9 ok"},
      {"big5", "caf\xE9 ok", "caf\xC3\xA9 ok"},
      {"shift_jis", "caf\xE9", "caf\xC3\xA9"},
      {"x-unknown", dash, dash},
  };
  for (const Case& c : cases) ExpectConverted(c);
}

}  // namespace
}  // namespace asum::mail
