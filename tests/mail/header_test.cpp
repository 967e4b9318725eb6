#include <gtest/gtest.h>

#include "mail/encoded_words.h"
#include "mail/header_block.h"
#include "mail/rfc822_address.h"

namespace asum::mail {
namespace {

TEST(ParseHeaderBlock, ValuesAreUnfoldedTrimmedAndReadInOneCodePage) {
  struct Case {
    const char* block;
    const char* name;
    const char* value;  // null: no such field
  } cases[] = {
      {"Subject:  two blanks and trailing  \r\n", "Subject", " two blanks and trailing  "},
      {"Subject:\tTab\r\n", "subject", "Tab"},
      {"From:\t a@b \t\r\n", "FROM", "a@b"},
      {"X-Note: folded\r\n  line\r\n\tmore\r\n", "x-note", "folded  line\tmore"},
      {"no colon\r\n continued\r\nSubject: after junk\r\n", "Subject", "after junk"},
      {"Subject: first\r\nSubject: second\r\n", "Subject", "first"},
      {" orphan: continuation\r\n", "orphan", nullptr},
      {"Subject: =?utf-8?q?a_b?=\r\n", "Subject", "a b"},
      {"Subject: =?UTF-8?b?w6k=?= x\r\n", "Subject", "\xC3\xA9 x"},
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
      {"=?utf-8?B?w6k=?=", "\xC3\xA9"},
      {"=?utf-8?b?w6k=?=", "\xC3\xA9"},
      {"=?utf-8?Q?a_b=3D?=", "a b="},
      {"x =?utf-8?q?a?= =?utf-8?q?b?=\t=?utf-8?q?c?= y", "x abc y"},
      {"=?utf-8?q?a?= x =?utf-8?q?b?=", "a x b"},
      {"=?UTF-8?B?4oK=?= =?utf-8?B?rA==?=", "\xE2\x82\xAC"},  // a character split across two words
      {"=?koi8-r*ru?Q?=F0?=", "\xD0\x9F"},  // an RFC 2231 language suffix
      {"=?iso-8859-1?Q?Gr=FC=DFe?=", "Gr\xC3\xBC\xC3\x9F" "e"},
      {"=?koi8-r?B?8NLJ18XU?=", "\xD0\x9F\xD1\x80\xD0\xB8\xD0\xB2\xD0\xB5\xD1\x82"},
      {"=?windows-1251?Q?=CF=F0=E8?=", "\xD0\x9F\xD1\x80\xD0\xB8"},
      {"=?shift_jis?B?k/qWe4zq?=", "\xE6\x97\xA5\xE6\x9C\xAC\xE8\xAA\x9E"},
      {"=?x-unknown?Q?caf=C3=A9?=", "caf\xC3\xA9"},
      {"=?x-unknown?Q?caf=E9?=", "caf\xC3\xA9"},
      {"=?utf-8?Q?broken", "=?utf-8?Q?broken"},
      {"=?utf-8?X?a?=", "=?utf-8?X?a?="},
      {"=??Q?a?=", "=??Q?a?="},
      {"=?utf 8?Q?a?=", "=?utf 8?Q?a?="},
      {"=?=?utf-8?q?a?=", "=?a"},
  };
  for (const Case& c : cases) EXPECT_EQ(DecodeEncodedWords(c.text), c.decoded) << c.text;
}

TEST(ParseMailbox, FirstMailboxOfEveryForm) {
  struct Case {
    const char* value;
    const char* address;  // null: none
    const char* name;
  } cases[] = {
      {"Name <a@b.c>", "a@b.c", "Name"},
      {"\"Last, First <x@y>\" <real@b.c>", "real@b.c", "Last, First <x@y>"},
      {"a@b.c (Comment <x@y>)", "a@b.c", "Comment <x@y>"},
      {"  bare@b.c  ", "bare@b.c", ""},
      {"<only@b.c>", "only@b.c", ""},
      {"(Only) <x@y>", "x@y", "Only"},
      {"\"john doe\"@b.c (John)", "\"john doe\"@b.c", "John"},
      {"John <\"john doe\"@b.c>", "\"john doe\"@b.c", "John"},
      {"team: Name <g@b.c>;", "g@b.c", "Name"},
      {"a@b.c, c@d.e", "a@b.c", ""},
      {", a@b.c", "a@b.c", ""},
      {"=?utf-8?Q?=3Cevil=40x=3E?= <real@b.c>", "real@b.c", "<evil@x>"},
      {"Name <unclosed@x", "unclosed@x", "Name"},
      {"Name <>", nullptr, ""},
      {"", nullptr, ""},
  };
  for (const Case& c : cases) {
    const std::optional<Rfc822Address> got = ParseMailbox(c.value);
    EXPECT_EQ(got ? got->address + " / " + got->name : "(none)",
              c.address ? std::string(c.address) + " / " + c.name : "(none)") << c.value;
  }
}

}  // namespace
}  // namespace asum::mail
