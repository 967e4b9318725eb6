#include <gtest/gtest.h>

#include <string>

#include "mail/charset_table.h"
#include "mail/cls_email.h"
#include "mail/text_convert.h"
#include "support/test_support.h"

namespace asum::mail {
namespace {

struct Case {
  const char* charset;
  std::string bytes;
  std::string utf8;
};

void ExpectConverted(const Case& c) {
  EXPECT_EQ(ToUtf8(c.bytes, CodePageForCharset(c.charset)), c.utf8) << c.charset << ": " << c.bytes;
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
      {"ks_c_5601-1987", "\xC7\xD1\xB1\xB9", "\xED\x95\x9C\xEA\xB5\xAD"},
      {"iso-2022-jp", "\x1b$BF|K\\\x1b(B x", "\xE6\x97\xA5\xE6\x9C\xAC x"},
  };
  for (const Case& c : cases) ExpectConverted(c);
}

TEST(ToUtf8, Iso2022JpEscapesSelectTheCharacterSet) {
  const Case cases[] = {
      {"iso-2022-jp", "\x1b$@F|\x1b(J\\~", "\xE6\x97\xA5\\~"},            // 1978 set; Roman read as Shift_JIS reads it
      {"iso-2022-jp", "\x1b&@\x1b$BF|\x1b(B", "\xE6\x97\xA5"},            // revision announcer
      {"iso-2022-jp", "\x1b(I12\x1b(B", "\xEF\xBD\xB1\xEF\xBD\xB2"},      // half-width katakana
      {"iso-2022-jp", "\x1b$BF|\r\nab", "\xE6\x97\xA5\r\nab"},            // a line end returns to ASCII
      {"iso-2022-jp", "\x1b$B-!!A\x1b(B", "\xE2\x91\xA0\xEF\xBD\x9E"},    // NEC row 13; wave dash as code page 932
      {"iso-2022-jp", "\x1b$BF|K", "\x1b$BF|K"},                          // a cut character: no ISO-2022-JP
      {"iso-2022-jp", "\x1b$(DF|\x1b(B", "\x1b$(DF|\x1b(B"},              // JIS X 0212 is none either
      {"us-ascii", "\x1b$BF|\x1b(B", "\xE6\x97\xA5"},                     // 7-bit with ESC is guessed as it
  };
  for (const Case& c : cases) ExpectConverted(c);
}

// UTF-8 and Latin-1 text that the declared charset cannot read as a whole is
// read by the header rule, never turned into replacement characters.
TEST(ToUtf8, DeclaredCharsetThatDoesNotFitFallsBackToTheHeaderRule) {
  const std::string dash = "Disk full \xE2\x80\x93 server1";
  const Case cases[] = {
      {"iso-2022-jp", dash, dash},
      {"iso-2022-jp", "caf\xE9", "caf\xC3\xA9"},
      {"euc-kr", dash, dash},
      {"euc-kr", "caf\xE9 ok", "caf\xC3\xA9 ok"},
      {"big5", dash, dash},
      {"big5", "caf\xE9 ok", "caf\xC3\xA9 ok"},
      {"shift_jis", "caf\xE9", "caf\xC3\xA9"},
      {"x-unknown", dash, dash},
  };
  for (const Case& c : cases) ExpectConverted(c);
}

TEST(LoadEml, MultibyteSubjectsAndBodiesReadAlikeOnEveryBuild) {
  struct Message {
    std::string text;
    const char* subject;
    const char* body;
  } messages[] = {
      {"Subject: \x1b$BF|K\\\x1b(B\r\nContent-Type: text/plain; charset=ISO-2022-JP\r\n\r\n\x1b$BF|K\\8l\x1b(B",
       "\xE6\x97\xA5\xE6\x9C\xAC", "\xE6\x97\xA5\xE6\x9C\xAC\xE8\xAA\x9E"},
      {"From: =?euc-kr?B?2aPu8Q==?= <a@b.c>\r\nSubject: \xC7\xD1\xB1\xB9\r\n\r\nbody",
       "\xED\x95\x9C\xEA\xB5\xAD", "body"},
      {"Subject: s\r\nContent-Type: text/html; charset=big5\r\n\r\n<p>\xE2\x80\x93</p>", "s",
       "<p>\xE2\x80\x93</p>"},
  };
  for (const Message& m : messages) {
    ClsEmail email;
    ASSERT_TRUE(email.LoadEmlFromMemory(m.text, DateContext{}));
    EXPECT_EQ(test::Narrow(email.Subject()), m.subject) << m.text;
    EXPECT_EQ(test::Narrow(email.Body()), m.body) << m.text;
  }
}

}  // namespace
}  // namespace asum::mail
