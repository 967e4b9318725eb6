#include "mail/ck_email.h"

#include <gtest/gtest.h>

#include <string>

#include "mail/body_choice.h"
#include "support/test_support.h"

namespace asum::mail {
namespace {

using platform::SystemTime;
using test::TempDir;
using test::U16;

struct Read {
  bool loaded = false;
  std::string from, subject, body;
};

Read LoadText(const std::string& text) {
  ClsEmail email;
  Read r;
  r.loaded = email.LoadEmlFromMemory(text, DateContext{0, SystemTime{2024, 5, 1, 20, 12, 0, 0, 0}});
  r.from = test::Narrow(email.FromAddress());
  r.subject = test::Narrow(email.Subject());
  r.body = test::Narrow(email.Body());
  return r;
}

std::string ToLf(std::string text) {
  std::string out;
  for (char c : text) {
    if (c != '\r') out.push_back(c);
  }
  return out;
}

const std::string kAlternative =
    "From: \"Alert, Service\" <alerts@example.com>\r\n"
    "Subject: =?utf-8?B?RGlzayBmdWxsIOKAkyBzZXJ2ZXIx?=\r\n"
    "Date: Mon, 11 Jun 2018 09:05:03 +0530\r\n"
    "MIME-Version: 1.0\r\n"
    "Content-Type: multipart/alternative;\r\n"
    "\tboundary=\"b1\"\r\n"
    "\r\n"
    "preamble\r\n"
    "--b1\r\n"
    "Content-Type: text/plain; charset=us-ascii\r\n"
    "\r\n"
    "plain text\r\n"
    "--b1\r\n"
    "Content-Type: text/html; charset=iso-8859-1\r\n"
    "Content-Transfer-Encoding: quoted-printable\r\n"
    "\r\n"
    "<p>Caf=E9 =\r\nover</p>\r\n"
    "--b1--\r\n"
    "epilogue\r\n";

TEST(LoadEml, LineEndVariantsAndBomGiveTheSameMessage) {
  const Read reference = LoadText(kAlternative);
  EXPECT_EQ(reference.subject, "Disk full \xE2\x80\x93 server1");
  EXPECT_EQ(reference.body, "<p>Caf\xC3\xA9 over</p>");
  EXPECT_EQ(reference.from, "alerts@example.com");
  std::string bare_cr = ToLf(kAlternative);
  for (char& c : bare_cr) {
    if (c == '\n') c = '\r';
  }
  const std::string variants[] = {
      "\xEF\xBB\xBF" + kAlternative,
      ToLf(kAlternative),
      bare_cr,
  };
  for (const std::string& text : variants) {
    const Read r = LoadText(text);
    EXPECT_TRUE(r.loaded);
    EXPECT_EQ(r.subject, reference.subject);
    EXPECT_EQ(r.body, reference.body);
    EXPECT_EQ(r.from, reference.from);
  }
}

TEST(LoadEml, HeaderRulesForSubjectAndFrom) {
  struct Case {
    const char* header;
    const char* subject;
    const char* from;
  } cases[] = {
      {"Subject:  two blanks and trailing  \r\n", " two blanks and trailing  ", ""},
      {"SUBJECT:\tTab\r\n", "Tab", ""},
      {"Subject: folded\r\n  line\r\n", "folded  line", ""},
      {"Subject: =?utf-8?q?a_b?= =?utf-8?Q?c?=\r\n", "a bc", ""},
      {"Subject: =?utf-8?B?w6k=?=\r\n =?utf-8?B?w6k=?= x\r\n", "\xC3\xA9\xC3\xA9 x", ""},
      {"Subject: =?UTF-8?B?4oK=?= =?UTF-8?B?rA==?=\r\n", "\xE2\x82\xAC", ""},  // euro split across words
      {"Subject: =?iso-8859-1?Q?Gr=FC=DFe?=\r\n", "Gr\xC3\xBC\xC3\x9F" "e", ""},
      {"Subject: =?koi8-r?B?8NLJ18XU?=\r\n", "\xD0\x9F\xD1\x80\xD0\xB8\xD0\xB2\xD0\xB5\xD1\x82", ""},
      {"Subject: =?windows-1251?Q?=CF=F0=E8?=\r\n", "\xD0\x9F\xD1\x80\xD0\xB8", ""},
      {"Subject: =?shift_jis?B?k/qWe4zq?=\r\n", "\xE6\x97\xA5\xE6\x9C\xAC\xE8\xAA\x9E", ""},
      {"Subject: =?x-unknown?Q?caf=C3=A9?=\r\n", "caf\xC3\xA9", ""},
      {"Subject: =?utf-8?Q?broken\r\n", "=?utf-8?Q?broken", ""},
      {"Subject: =?utf-8?B?YWJj\r\n ZGVm?=\r\n", "abcdef", ""},  // a word cut by folding
      {"Subject: caf\xE9 latin\r\n", "caf\xC3\xA9 latin", ""},
      {"Subject: caf\xC3\xA9 utf8\r\n", "caf\xC3\xA9 utf8", ""},
      {"From: Name <a@b.c>\r\n", "", "a@b.c"},
      {"From: a@b.c (Comment <x@y>)\r\n", "", "a@b.c"},
      {"From: \"Last, First <x@y>\" <real@b.c>\r\n", "", "real@b.c"},
      {"From: =?utf-8?Q?=3Cevil=40x=3E?= <real@b.c>\r\n", "", "real@b.c"},
      {"From:   bare@b.c  \r\n", "", "bare@b.c"},
      {"From: <only@b.c>\r\n", "", "only@b.c"},
      {"From: \"john doe\"@b.c (John)\r\n", "", "\"john doe\"@b.c"},
      {"From: John <\"john doe\"@b.c>\r\n", "", "\"john doe\"@b.c"},
      {"From: team: Name <g@b.c>;\r\n", "", "g@b.c"},
      {"From: \r\n", "", ""},
      {"no colon here\r\nSubject: after junk\r\n", "after junk", ""},
  };
  for (const Case& c : cases) {
    const Read r = LoadText(std::string(c.header) + "\r\nbody");
    EXPECT_EQ(r.subject, c.subject) << c.header;
    EXPECT_EQ(r.from, c.from) << c.header;
  }
}

// The CR LF form of each text is the reference: another line-end form must
// split in the same place once its line ends are repaired.
TEST(LoadEml, HeaderEndsAtTheEarliestEmptyLine) {
  struct Case {
    const char* text;
    const char* subject;
    const char* body;
  } cases[] = {
      {"\r\nSubject: x\r\nFrom: a@b\r\n\r\nbody", "", "Subject: x\r\nFrom: a@b\r\n\r\nbody"},
      {"\nSubject: x\nFrom: a@b\n\nbody", "", "Subject: x\r\nFrom: a@b\r\n\r\nbody"},
      {"\nSubject: x", "", "Subject: x"},
      {"\r\r\nSubject: x\r\r\n\r\r\nbody", "", "Subject: x\r\n\r\nbody"},
      {"\rSubject: x\r\rbody", "", "Subject: x\r\n\r\nbody"},
      {"Subject: a\r\n\r\r\nbody line\n\nmore", "a", "body line\r\n\r\nmore"},
      {"Subject: a\r\n\rbody line\n\nmore", "a", "body line\r\n\r\nmore"},
  };
  for (const Case& c : cases) {
    ClsEmail email;
    ASSERT_TRUE(email.LoadEmlFromMemory(c.text, DateContext{}));
    EXPECT_EQ(test::Narrow(email.Subject()), c.subject) << c.text;
    EXPECT_EQ(test::Narrow(email.Body()), c.body) << c.text;
    if (*c.subject == '\0') {
      EXPECT_EQ(email.FromAddress(), u"") << c.text;
      EXPECT_EQ(email.message().date, SystemTime{}) << c.text;
    }
  }
}

struct BodyCase {
  const char* name;
  std::string text;
  const char* body;
};

std::string Multipart(const std::string& type, const std::string& parts) {
  return "Content-Type: " + type + "; boundary=XX\r\n\r\n" + parts + "--XX--\r\n";
}

std::string Part(const std::string& headers, const std::string& content) {
  return "--XX\r\n" + headers + "\r\n" + content + "\r\n";
}

TEST(GetBody, FollowsTheRulesInOrder) {
  const BodyCase cases[] = {
      {"plain only", "Subject: s\r\n\r\nplain", "plain"},
      {"html only", "Content-Type: text/html\r\n\r\n<b>x</b>", "<b>x</b>"},
      {"alternative prefers html",
       Multipart("multipart/alternative", Part("Content-Type: text/plain\r\n", "p") +
                                              Part("Content-Type: text/html\r\n", "<h>")),
       "<h>"},
      {"alternative without html gives the first",
       Multipart("multipart/alternative", Part("Content-Type: text/plain\r\n", "p1") +
                                              Part("Content-Type: text/enriched\r\n", "p2")),
       "p1"},
      {"html attachment is no alternative",
       Multipart("multipart/alternative",
                 Part("Content-Type: text/plain\r\n", "p") +
                     Part("Content-Type: text/html\r\nContent-Disposition: attachment\r\n", "<h>")),
       "p"},
      {"alternative inside mixed",
       Multipart("multipart/mixed",
                 "--XX\r\nContent-Type: multipart/alternative; boundary=\"YY\"\r\n\r\n"
                 "--YY\r\nContent-Type: text/plain\r\n\r\np\r\n--YY\r\nContent-Type: text/html\r\n\r\n<h>\r\n"
                 "--YY--\r\n" +
                     Part("Content-Type: application/pdf\r\nContent-Transfer-Encoding: base64\r\n", "JVBERg==")),
       "<h>"},
      {"only part application/pdf",
       Multipart("multipart/mixed", Part("Content-Type: application/pdf\r\n", "%PDF")), ""},
      {"top-level image", "Content-Type: image/png\r\n\r\n\x89PNG", ""},
      {"attachment first, text second",
       Multipart("multipart/mixed", Part("Content-Type: text/plain\r\nContent-Disposition: attachment\r\n", "att") +
                                        Part("Content-Type: text/plain\r\n", "main")),
       "main"},
      {"two attachments: the first",
       Multipart("multipart/mixed", Part("Content-Disposition: attachment\r\n", "a1") +
                                        Part("Content-Disposition: attachment\r\n", "a2")),
       "a1"},
      {"missing boundary: opaque text", "Content-Type: multipart/mixed\r\n\r\nraw", "raw"},
      {"base64 text in a declared charset",
       "Content-Type: text/plain; charset=windows-1252\r\nContent-Transfer-Encoding: BASE64\r\n\r\ngIA=",
       "\xE2\x82\xAC\xE2\x82\xAC"},
      {"garbled charsets fall back",
       Multipart("multipart/mixed", Part("Content-Type: text/plain; charset=uft-8\r\n", "caf\xC3\xA9") +
                                        Part("Content-Type: text/plain; charset=1\r\n", "x")),
       "caf\xC3\xA9"},
      {"lying utf-8 is read as ANSI", "Content-Type: text/plain; charset=utf-8\r\n\r\ncaf\xE9", "caf\xC3\xA9"},
      {"empty charset", "Content-Type: text/plain; charset=\"\"\r\n\r\ncaf\xE9", "caf\xC3\xA9"},
      {"unknown transfer encoding keeps bytes", "Content-Transfer-Encoding: x-uuencode\r\n\r\nbegin", "begin"},
      {"boundary is a prefix of the inner one",
       "Content-Type: multipart/mixed; boundary=ab\r\n\r\n--ab\r\n"
       "Content-Type: multipart/alternative; boundary=abc\r\n\r\n--abc\r\n\r\nin1\r\n--abc\r\n"
       "Content-Type: text/html\r\n\r\n<in2>\r\n--abc--\r\n--ab--\r\n",
       "<in2>"},
      {"never-closing boundary",
       Multipart("multipart/alternative", "") .substr(0, 0) +
           "Content-Type: multipart/alternative; boundary=XX\r\n\r\n--XX\r\n\r\nfirst\r\n--XX\r\n"
           "Content-Type: text/html\r\n\r\n<last",
       "<last"},
      {"boundary in RFC 2231 form",
       "Content-Type: multipart/alternative; boundary*=\"us-ascii''abc\"\r\n\r\n--abc\r\n\r\np\r\n--abc\r\n"
       "Content-Type: text/html\r\n\r\n<h>\r\n--abc--\r\n",
       "<h>"},
      {"charset in RFC 2231 form", "Content-Type: text/plain; charset*=us-ascii'en'koi8-r\r\n\r\n\xF0\xD2\xC9",
       "\xD0\x9F\xD1\x80\xD0\xB8"},
      {"file name in RFC 2231 continuations",
       Multipart("multipart/mixed", Part("Content-Type: text/plain; name*0*=utf-8''key%2E; name*1=pem\r\n", "att") +
                                        Part("Content-Type: text/plain\r\n", "main")),
       "main"},
      {"part without an empty line is all content",
       "Content-Type: multipart/mixed; boundary=XX\r\n\r\n--XX\r\nhello\r\n--XX--", "hello"},
  };
  for (const BodyCase& c : cases) EXPECT_EQ(LoadText(c.text).body, c.body) << c.name;
}

TEST(IsAttachment, RulesInOrder) {
  struct Case {
    const char* type;
    const char* disposition;
    const char* file_name;
    const char* encoding;
    bool attachment;
  } cases[] = {
      {"multipart/mixed", "attachment", "a.pem", "base64", false},
      {"Multipart/Related", "attachment", "", "", false},
      {"message/rfc822", "attachment", "Saved.MHT", "", true},
      {"message/rfc822", "attachment", "mail.eml", "", false},
      {"message/rfc822", "inline", "a.mht", "", false},
      {"text/plain", "ATTACHMENT", "", "", true},
      {"text/plain", "inline", "x.txt", "Base64", true},
      {"text/plain", "inline", "", "base64", false},
      {"text/plain", "inline", "x.txt", "7bit", false},
      {"text/plain", "", "key.PEM", "", true},
      {"application/edifact", "", "", "", true},
      {"application/smil", "", "", "", true},
      {"Application/EDIFACT", "", "", "", false},
      {"application/pdf", "", "", "", false},
      {"text/html", "inline", "", "", false},
  };
  for (const Case& c : cases) {
    MimePart part;
    part.content_type = c.type;
    part.disposition = c.disposition;
    part.file_name = c.file_name;
    part.transfer_encoding = c.encoding;
    EXPECT_EQ(IsAttachment(part), c.attachment) << c.type << " " << c.disposition << " " << c.file_name;
  }
}

class FailingReadEnv : public platform::Env {
 public:
  platform::FileResult ReadFile(const std::u16string&, std::string*, uint64_t) override {
    return {platform::FileStatus::kAccessDenied, 5};
  }
};

TEST(CkEmail, FailedLoadsKeepThePreviousMessage) {
  TempDir dir;
  const std::u16string good = dir.Join(u"good \u00e9\u4e2d.eml");
  test::WriteText(good, kAlternative);
  test::WriteText(dir.Join(u"empty.eml"), "");
  test::MakeFolders(dir.Join(u"folder.eml"));
  CkEmail email;
  ASSERT_TRUE(email.LoadEml(good));
  EXPECT_FALSE(email.LoadEml(dir.Join(u"missing.eml")));
  EXPECT_FALSE(email.LoadEml(dir.Join(u"folder.eml")));
  {
    FailingReadEnv env;
    platform::ScopedEnv scoped(&env);
    EXPECT_FALSE(email.LoadEml(good));
  }
  CkString subject;
  email.get_Subject(subject);
  EXPECT_EQ(test::Narrow(subject.getStringU()), "Disk full \xE2\x80\x93 server1");
  EXPECT_TRUE(email.LoadEml(dir.Join(u"empty.eml")));
  email.get_Subject(subject);
  EXPECT_EQ(subject.text(), u"");
}

TEST(CkEmail, GettersAfterLoadAndClear) {
  TempDir dir;
  test::WriteText(dir.Join(u"a.eml"), kAlternative);
  CkEmail email;
  ASSERT_TRUE(email.LoadEml(dir.Join(u"a.eml")));
  CkString from, body;
  email.get_FromAddress(from);
  email.get_Body(body);
  EXPECT_STREQ(from.getString(), "alerts@example.com");
  EXPECT_STREQ(body.getString(), "<p>Caf\xE9 over</p>");  // ANSI code page 1252 (TZ and ACP of the test run)
  SystemTime date;
  email.get_LocalDate(date);  // tests run with TZ=UTC
  EXPECT_EQ(date, (SystemTime{2018, 6, 1, 11, 3, 35, 3, 0}));
  email.Clear();
  email.get_Body(body);
  email.get_FromAddress(from);
  EXPECT_EQ(body.text(), u"");
  EXPECT_EQ(from.text(), u"");
  email.get_LocalDate(date);  // no date: the 1st of the current month, midnight
  const SystemTime now = platform::Current().UtcNow();
  EXPECT_EQ(date.day, 1);
  EXPECT_EQ(date.month, now.month);
  EXPECT_EQ(date.hour, 0);
  EXPECT_EQ(date.minute, 0);
}

TEST(LoadEml, UnknownMonthLeavesTheDateZero) {
  ClsEmail email;
  ASSERT_TRUE(email.LoadEmlFromMemory("Date: 1 Foo 2019 10:00:00\r\n\r\n", DateContext{}));
  EXPECT_EQ(email.message().date, SystemTime{});
}

}  // namespace
}  // namespace asum::mail
