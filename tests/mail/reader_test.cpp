#include "mail/ck_email.h"

#include <gtest/gtest.h>

#include <string>

#include "support/test_support.h"

namespace asum::mail {
namespace {

using platform::SystemTime;

const std::string kAlternative =
    "From: \"Alert, Service\" <alerts@example.com>\r\nSubject: =?utf-8?B?RGlzayBmdWxsIOKAkyBzZXJ2ZXIx?=\r\n"
    "Date: Mon, 11 Jun 2018 09:05:03 +0530\r\nMIME-Version: 1.0\r\nContent-Type: multipart/alternative;\r\n"
    "\tboundary=\"b1\"\r\n\r\npreamble\r\n--b1\r\nContent-Type: text/plain; charset=us-ascii\r\n\r\nplain\r\n"
    "--b1\r\nContent-Type: text/html; charset=iso-8859-1\r\nContent-Transfer-Encoding: quoted-printable\r\n\r\n"
    "<p>Caf=E9 =\r\nover</p>\r\n--b1--\r\nepilogue\r\n";

// The CR LF form of each text is the reference: another line-end form must
// split in the same place once its line ends are repaired.
TEST(LoadEml, HeaderEndsAtTheEarliestEmptyLineWhateverTheLineEnds) {
  const char *subject = "Disk full \xE2\x80\x93 server1", *html = "<p>Caf\xC3\xA9 over</p>";
  const char* all_body = "Subject: x\r\n\r\nbody";  // an empty first line: no header fields
  const auto ends = [](std::string text, char end) {  // each CR LF as one other end
    for (size_t at; (at = text.find("\r\n")) != std::string::npos;) text.replace(at, 2, 1, end);
    return text;
  };
  const struct {
    std::string text;
    const char *subject, *body;
  } cases[] = {
      {kAlternative, subject, html}, {"\xEF\xBB\xBF" + kAlternative, subject, html},
      {ends(kAlternative, '\n'), subject, html}, {"\xEF\xBB\xBFSubject: a\r\n\r\nb", "a", "b"},
      {ends(kAlternative, '\r'), subject, html}, {"\nSubject: x", "", "Subject: x"},
      {"\r\nSubject: x\r\n\r\nbody", "", all_body}, {"\nSubject: x\n\nbody", "", all_body},
      {"\r\r\nSubject: x\r\r\n\r\r\nbody", "", all_body}, {"\rSubject: x\r\rbody", "", all_body},
      {"Subject: a\r\n\r\r\nbody line\n\nmore", "a", "body line\r\n\r\nmore"},
      {"Subject: a\r\n\rbody line\n\nmore", "a", "body line\r\n\r\nmore"},
      {"Subject: s\r\nFrom: a@b.c\r\nno empty line", "s", ""},  // all header
  };
  for (const auto& c : cases) {
    ClsEmail email;
    ASSERT_TRUE(email.LoadEmlFromMemory(c.text, DateContext{}));
    EXPECT_EQ(test::Narrow(email.Subject()), c.subject) << c.text;
    EXPECT_EQ(test::Narrow(email.Body()), c.body) << c.text;
  }
}

// The message reader's facade on a machine of the test's making: two hours
// east of UTC, today 2024-05-20, ANSI code page 1252.
class FixedMachine : public platform::Env {
 public:
  bool convert = true;
  SystemTime UtcNow() override { return SystemTime{2024, 5, 1, 20, 12, 34, 56, 0}; }
  SystemTime LocalNow() override { return SystemTime{2024, 5, 1, 20, 14, 34, 56, 0}; }
  int32_t CurrentBiasMinutes() override { return -120; }
  uint32_t AnsiCodePage() override { return 1252; }
  std::optional<SystemTime> UtcToLocal(const SystemTime& utc) override {
    if (!convert || utc.milliseconds > 999) return std::nullopt;
    SystemTime local = utc;
    local.hour = static_cast<uint16_t>(local.hour + 2);
    return local;
  }
};

TEST(CkEmail, GettersAnswerTheLastLoadedMessage) {
  FixedMachine machine;
  platform::ScopedEnv scoped(&machine);
  test::TempDir dir;
  const std::u16string good = dir.Join(u"good \u00e9\u4e2d.eml");
  test::WriteText(good, kAlternative);
  test::WriteText(dir.Join(u"empty.eml"), "");
  test::MakeFolders(dir.Join(u"folder.eml"));
  CkEmail email;
  CkString from, subject, body;
  SystemTime date;
  ASSERT_TRUE(email.LoadEml(good));
  for (const char16_t* bad : {u"missing.eml", u"folder.eml"}) {
    EXPECT_FALSE(email.LoadEml(dir.Join(bad))) << "a failed load keeps the message";
  }
  email.get_FromAddress(from), email.get_Subject(subject), email.get_Body(body), email.get_LocalDate(date);
  EXPECT_STREQ(from.getString(), "alerts@example.com");
  EXPECT_EQ(test::Narrow(subject.getStringU()), "Disk full \xE2\x80\x93 server1");
  EXPECT_STREQ(body.getString(), "<p>Caf\xE9 over</p>");
  EXPECT_EQ(date, (SystemTime{2018, 6, 1, 11, 5, 35, 3, 0})) << "03:35:03 UTC, two hours east";

  EXPECT_TRUE(email.LoadEml(dir.Join(u"empty.eml")));
  email.get_Subject(subject);
  EXPECT_EQ(subject.text(), u"");
  email.Clear();
  email.get_Body(body), email.get_FromAddress(from), email.get_LocalDate(date);
  EXPECT_EQ(body.text(), u"");
  EXPECT_EQ(from.text(), u"");
  EXPECT_EQ(date, (SystemTime{2024, 5, 0, 1, 2, 0, 0, 0})) << "no date: the 1st of this month, midnight UTC";
  machine.convert = false;
  email.get_LocalDate(date);
  EXPECT_EQ(date, (SystemTime{2024, 5, 0, 1, 0, 0, 0, 0})) << "not convertible: the repaired UTC date";
}

}  // namespace
}  // namespace asum::mail
