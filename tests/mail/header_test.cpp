#include <gtest/gtest.h>

#include "mail/charset_table.h"
#include "mail/encoded_words.h"
#include "mail/header_block.h"
#include "mail/rfc822_address.h"
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

// Both builds run these cases, so none may need a code page only some machines install. Text its charset cannot
// read as a whole falls back to UTF-8 when valid, else the ANSI code page: never replacement characters.
TEST(ToUtf8, EveryListedCharsetReadsAlikeOnEveryBuild) {
  const std::string dash = "Disk full \xE2\x80\x93 server1", zh = "\xE4\xB8\xAD\xE6\x96\x87",
                    ja = "\xE6\x97\xA5\xE6\x9C\xAC";
  const struct {
    const char* charset;  // null: none declared
    std::string bytes, utf8;
  } cases[] = {
      {"iso-8859-2", "\xB1", "\xC4\x85"}, {"iso-8859-7", "\xE1", "\xCE\xB1"}, {"iso-8859-15", "\xA4", "\xE2\x82\xAC"},
      {"iso-8859-10", "\xBD\xFF", "\xE2\x80\x95\xC4\xB8"}, {"iso-8859-14", "\xA1\xFE", "\xE1\xB8\x82\xC5\xB7"},
      {"windows-1252", "\x80\x81", "\xE2\x82\xAC\xC2\x81"}, {"koi8-u", "\xAE", "\xD1\x9E"},
      {"windows-874", "\xA1", "\xE0\xB8\x81"}, {"gb2312", "\xD6\xD0\xCE\xC4", zh}, {"gb18030", "\xD6\xD0\xCE\xC4", zh},
      {"big5", "\xA4\xA4\xA4\xE5", zh}, {"shift_jis", "\x93\xFA\x96{", ja}, {"euc-jp", "\xC6\xFC\xCB\xDC", ja},
      {"euc-kr", "\xC7\xD1\xB1\xB9", "\xED\x95\x9C\xEA\xB5\xAD"}, {"iso-2022-jp", "\x1b$BF|K\\\x1b(B x", ja + " x"},
      {"iso-2022-jp", "\x1b$@F|\x1b(J\\~", "\xE6\x97\xA5\\~"},          // 1978 set; Roman as Shift_JIS reads it
      {"iso-2022-jp", "\x1b&@\x1b$BF|\x1b(B", "\xE6\x97\xA5"},          // revision announcer
      {"iso-2022-jp", "\x1b(I12\x1b(B", "\xEF\xBD\xB1\xEF\xBD\xB2"},    // half-width katakana
      {"iso-2022-jp", "\x1b$BF|\r\nab", "\xE6\x97\xA5\r\nab"},          // a line end returns to ASCII
      {"iso-2022-jp", "\x1b$B-!!A\x1b(B", "\xE2\x91\xA0\xEF\xBD\x9E"},  // NEC row 13; wave dash as 932
      {"iso-2022-jp", "\x1b$BF|K", "\x1b$BF|K"},                        // a cut character: no ISO-2022-JP
      {"iso-2022-jp", "\x1b$(DF|\x1b(B", "\x1b$(DF|\x1b(B"},            // JIS X 0212 is none either
      {"us-ascii", "\x1b$BF|\x1b(B", "\xE6\x97\xA5"},                   // 7-bit with ESC is guessed as it
      {nullptr, dash, dash}, {nullptr, "caf\xE9", "caf\xC3\xA9"}, {"utf-8", "caf\xE9", "caf\xC3\xA9"},
      {"iso-2022-jp", dash, dash}, {"iso-2022-jp", "caf\xE9", "caf\xC3\xA9"}, {"euc-kr", dash, dash},
      {"euc-kr", "caf\xE9 ok", "caf\xC3\xA9 ok"}, {"big5", "caf\xE9 ok", "caf\xC3\xA9 ok"},
      {"shift_jis", "caf\xE9", "caf\xC3\xA9"}, {"x-unknown", dash, dash},
  };
  for (const auto& c : cases) {
    const std::optional<uint32_t> code_page = c.charset ? CodePageForCharset(c.charset) : std::nullopt;
    EXPECT_EQ(ToUtf8(c.bytes, code_page), c.utf8) << (c.charset ? c.charset : "none") << ": " << c.bytes;
  }
}

TEST(ParseHeaderBlock, ValuesAreUnfoldedTrimmedAndReadInOneCodePage) {
  struct Case {
    const char* block;
    const char* name;
    const char* value;  // null: no such field
  } cases[] = {
      {"Subject:  two blanks and trailing  \r\n", "Subject", " two blanks and trailing  "},
      {"Subject:\tTab\r\n", "subject", "Tab"}, {"From:\t a@b \t\r\n", "FROM", "a@b"},
      {"X-Note: folded\r\n  line\r\n\tmore\r\n", "x-note", "folded  line\tmore"},
      {"no colon\r\n continued\r\nSubject: after junk\r\n", "Subject", "after junk"},
      {"Subject: first\r\nSubject: second\r\n", "Subject", "first"}, {" orphan: continuation\r\n", "orphan", nullptr},
      {"Subject: =?utf-8?q?a_b?=\r\n", "Subject", "a b"}, {"Subject: =?UTF-8?b?w6k=?= x\r\n", "Subject", "\xC3\xA9 x"},
      {"Subject: =?utf-8?B?YWJj\r\n ZGVm?=\r\n", "Subject", "abcdef"},  // a word cut by folding
      {"Subject: =?koi8-r?Q?x?= \xF0\r\n", "Subject", "x \xD0\x9F"},      // the word's charset reads the block
      {"Subject: caf\xE9 latin\r\n", "Subject", "caf\xC3\xA9 latin"},
      {"Subject: caf\xC3\xA9 utf8\r\n", "Subject", "caf\xC3\xA9 utf8"},
      {"From: caf\xE9\r\nSubject: caf\xC3\xA9\r\n", "Subject", "caf\xC3\x83\xC2\xA9"},  // one code page per block
      {"Subject: \x1b$BF|K\\\x1b(B\r\n", "Subject", "\xE6\x97\xA5\xE6\x9C\xAC"},
  };
  for (const Case& c : cases) {
    const std::vector<HeaderField> fields = ParseHeaderBlock(c.block);
    const HeaderField* field = FindField(fields, c.name);
    EXPECT_EQ(field ? field->value : "(none)", c.value ? c.value : "(none)") << c.block;
  }
}

TEST(DecodeEncodedWords, DecodesWellFormedWordsAndKeepsTheRest) {
  struct Case {
    const char* text;
    const char* decoded;
  } cases[] = {
      {"=?utf-8?B?w6k=?=", "\xC3\xA9"}, {"=?utf-8?b?w6k=?=", "\xC3\xA9"}, {"=?utf-8?Q?a_b=3D?=", "a b="},
      {"x =?utf-8?q?a?= =?utf-8?q?b?=\t=?utf-8?q?c?= y", "x abc y"}, {"=?utf-8?q?a?= x =?utf-8?q?b?=", "a x b"},
      {"=?UTF-8?B?4oK=?= =?utf-8?B?rA==?=", "\xE2\x82\xAC"},  // a character split across two words
      {"=?koi8-r*ru?Q?=F0?=", "\xD0\x9F"},                    // an RFC 2231 language suffix
      {"=?iso-8859-1?Q?Gr=FC=DFe?=", "Gr\xC3\xBC\xC3\x9F" "e"},
      {"=?koi8-r?B?8NLJ18XU?=", "\xD0\x9F\xD1\x80\xD0\xB8\xD0\xB2\xD0\xB5\xD1\x82"},
      {"=?windows-1251?Q?=CF=F0=E8?=", "\xD0\x9F\xD1\x80\xD0\xB8"},
      {"=?shift_jis?B?k/qWe4zq?=", "\xE6\x97\xA5\xE6\x9C\xAC\xE8\xAA\x9E"},
      {"=?x-unknown?Q?caf=C3=A9?=", "caf\xC3\xA9"}, {"=?x-unknown?Q?caf=E9?=", "caf\xC3\xA9"},
      {"=?utf-8?Q?broken", "=?utf-8?Q?broken"}, {"=?utf-8?X?a?=", "=?utf-8?X?a?="}, {"=??Q?a?=", "=??Q?a?="},
      {"=?utf 8?Q?a?=", "=?utf 8?Q?a?="}, {"=?=?utf-8?q?a?=", "=?a"},
  };
  for (const Case& c : cases) EXPECT_EQ(DecodeEncodedWords(c.text), c.decoded) << c.text;
}

TEST(ParseMailbox, FirstMailboxOfEveryForm) {
  struct Case {
    const char* value;
    const char* address;  // null: none
    const char* name;
  } cases[] = {
      {"Name <a@b.c>", "a@b.c", "Name"}, {"\"Last, First <x@y>\" <real@b.c>", "real@b.c", "Last, First <x@y>"},
      {"a@b.c (Comment <x@y>)", "a@b.c", "Comment <x@y>"}, {"  bare@b.c  ", "bare@b.c", ""},
      {"<only@b.c>", "only@b.c", ""}, {"(Only) <x@y>", "x@y", "Only"},
      {"\"john doe\"@b.c (John)", "\"john doe\"@b.c", "John"}, {"John <\"john doe\"@b.c>", "\"john doe\"@b.c", "John"},
      {"team: Name <g@b.c>;", "g@b.c", "Name"}, {"a@b.c, c@d.e", "a@b.c", ""}, {", a@b.c", "a@b.c", ""},
      {"=?utf-8?Q?=3Cevil=40x=3E?= <real@b.c>", "real@b.c", "<evil@x>"},
      {"Name <unclosed@x", "unclosed@x", "Name"}, {"Name <>", nullptr, ""}, {"", nullptr, ""},
  };
  for (const Case& c : cases) {
    const std::optional<Rfc822Address> got = ParseMailbox(c.value);
    EXPECT_EQ(got ? got->address + " / " + got->name : "(none)",
              c.address ? std::string(c.address) + " / " + c.name : "(none)") << c.value;
  }
}

}  // namespace
}  // namespace asum::mail
