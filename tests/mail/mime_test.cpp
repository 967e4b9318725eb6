#include <gtest/gtest.h>

#include <string>

#include "mail/body_choice.h"
#include "mail/cls_email.h"
#include "mail/mime_params.h"
#include "mail/mime_parser.h"
#include "mail/transfer_decoding.h"
#include "support/test_support.h"

namespace asum::mail {
namespace {

TEST(MimeParameter, ReadsPlainAndRfc2231Forms) {
  const struct {
    const char *value, *name, *expected;  // null: absent
  } cases[] = {
      {"text/plain; Name=\"a;b\\\"c\"; name=second", "name", "a;b\"c"}, {"text/plain; name", "name", nullptr},
      {"text/plain; name=plain.txt; name*=iso-8859-1'fr'caf%E9.txt", "name", "caf\xC3\xA9.txt"},
      {"text/plain; charset*=us-ascii'en'koi8-r", "charset", "koi8-r"},
      {"text/plain; name*1=\"b c\"; name*0*=utf-8''%E2%82%AC%20; name*2*=%2Epem", "name", "\xE2\x82\xAC b c.pem"},
      {"text/plain; name*0=a; name*2=c", "name", "a"}, {"text/plain; name*1=b; name=fallback", "name", "fallback"},
      {"text/plain; name*=100%25%zz%4", "name", "100%%zz%4"}, {"text/plain; filename*=utf-8''x", "name", nullptr},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(Parameter(c.value, c.name).value_or("(absent)"), c.expected ? c.expected : "(absent)") << c.value;
  }
  EXPECT_EQ(MainValue(" text/html ; charset=x"), "text/html");
}

TEST(DecodeTransfer, InvalidInputDecodesAsFarAsItMakesSense) {
  const std::string b64 = "base64", qp = "quoted-printable";
  const struct {
    std::string encoding, input, output;
  } cases[] = {
      {b64, "QUJD", "ABC"}, {"BASE64", "QU\r\nJD\r\n", "ABC"}, {b64, "QQ==QkM=", "ABC"}, {b64, "Q*U!J D", "ABC"},
      {b64, "Q", ""},       {b64, "====", ""},                 {qp, "a=3Db", "a=b"},  {qp, "end=", "end"},
      {qp, "soft=\r\nbreak=\nend", "softbreakend"},         {qp, "trail= \r\nx", "trailx"},
      {qp, "bad=ZZ=4", "bad=ZZ=4"}, {"Quoted-Printable", "=e9", "\xE9"}, {"7bit", "=41", "=41"},
      {"x-unknown", "QUJD", "QUJD"},
  };
  for (const auto& c : cases) EXPECT_EQ(DecodeTransfer(c.input, c.encoding), c.output) << c.input;
}

TEST(IsAttachment, RulesInOrder) {
  const struct {
    bool attachment;
    std::string type, disposition = "", file_name = "", encoding = "";
  } cases[] = {
      {false, "multipart/mixed", "attachment", "a.pem", "base64"}, {false, "Multipart/Related", "attachment"},
      {true, "message/rfc822", "attachment", "Saved.MHT"},       {false, "message/rfc822", "attachment", "mail.eml"},
      {false, "message/rfc822", "inline", "a.mht"},              {true, "text/plain", "ATTACHMENT"},
      {true, "text/plain", "inline", "x.txt", "Base64"},         {false, "text/plain", "inline", "", "base64"},
      {false, "text/plain", "inline", "x.txt", "7bit"},          {true, "text/plain", "", "key.PEM"},
      {true, "application/edifact"}, {true, "application/smil"}, {false, "Application/EDIFACT"},
      {false, "application/pdf"},
  };
  for (const auto& c : cases) {
    MimePart part{c.type, c.disposition, c.file_name, c.encoding, "", {}};
    EXPECT_EQ(IsAttachment(part), c.attachment) << c.type << " " << c.disposition << " " << c.file_name;
  }
}

std::string Multipart(const std::string& type, const std::string& parts, const std::string& boundary = "XX") {
  return "Content-Type: " + type + "; boundary=" + boundary + "\r\n\r\n" + parts + "--" + boundary + "--\r\n";
}

std::string Part(const std::string& headers, const std::string& content, const std::string& boundary = "XX") {
  return "--" + boundary + "\r\n" + headers + "\r\n" + content + "\r\n";
}

TEST(GetBody, FollowsTheRulesInOrder) {
  const std::string alt = "multipart/alternative", mixed = "multipart/mixed", plain = "Content-Type: text/plain\r\n",
                    html = "Content-Type: text/html\r\n", attached = "Content-Disposition: attachment\r\n",
                    pdf = "Content-Type: application/pdf\r\n";
  const struct {
    const char* name;
    std::string text;
    const char* body;
  } cases[] = {
      {"plain only", "Subject: s\r\n\r\nplain", "plain"}, {"html only", html + "\r\n<b>x</b>", "<b>x</b>"},
      {"alternative prefers html", Multipart(alt, Part(plain, "p") + Part(html, "<h>")), "<h>"},
      {"alternative without html: the first", Multipart(alt, Part(plain, "p1") + Part(plain, "p2")), "p1"},
      {"html attachment is no alternative", Multipart(alt, Part(plain, "p") + Part(html + attached, "<h>")), "p"},
      {"alternative inside mixed", Multipart(mixed, "--XX\r\n" + Multipart(alt, Part(plain, "p", "YY") +
                                                   Part(html, "<h>", "YY"), "YY") + Part(pdf, "%PDF")), "<h>"},
      {"only part application/pdf", Multipart(mixed, Part(pdf, "%PDF")), ""},
      {"top-level image", "Content-Type: image/png\r\n\r\n\x89PNG", ""},
      {"top-level video", "Content-Type: video/mp4\r\n\r\nx", ""},
      {"attachment first, text second", Multipart(mixed, Part(plain + attached, "att") + Part(plain, "main")), "main"},
      {"two attachments: the first", Multipart(mixed, Part(attached, "a1") + Part(attached, "a2")), "a1"},
      {"file name in RFC 2231 continuations", Multipart(mixed, Part("Content-Type: text/plain; "
                                                                    "name*0*=utf-8''key%2E; name*1=pem\r\n", "a") +
                                                               Part("", "m")), "m"},
      {"missing boundary: opaque text", "Content-Type: multipart/mixed\r\n\r\nraw", "raw"},
      {"base64 text in a declared charset",
       "Content-Type: text/plain; charset=windows-1252\r\nContent-Transfer-Encoding: BASE64\r\n\r\ngIA=",
       "\xE2\x82\xAC\xE2\x82\xAC"},
      {"garbled charsets fall back",
       Multipart(mixed, Part("Content-Type: text/plain; charset=uft-8\r\n", "caf\xC3\xA9") + Part(plain, "x")),
       "caf\xC3\xA9"},
      {"lying utf-8 is read as ANSI", "Content-Type: text/plain; charset=utf-8\r\n\r\ncaf\xE9", "caf\xC3\xA9"},
      {"multibyte html part", "Content-Type: text/html; charset=big5\r\n\r\n<p>\xA4\xA4</p>", "<p>\xE4\xB8\xAD</p>"},
      {"boundary is a prefix of the inner one",
       Multipart(mixed, "--ab\r\n" + Multipart(alt, Part("", "in1", "abc") + Part(html, "<in2>", "abc"), "abc"), "ab"),
       "<in2>"},
      {"never-closing boundary",
       "Content-Type: " + alt + "; boundary=XX\r\n\r\n" + Part("", "first") + "--XX\r\n" + html + "\r\n<last", "<last"},
      {"boundary in RFC 2231 form", "Content-Type: multipart/alternative; boundary*=\"us-ascii''abc\"\r\n\r\n" +
                                        Part("", "p", "abc") + Part(html, "<h>", "abc") + "--abc--\r\n", "<h>"},
      {"part without an empty line is all content", Multipart(mixed, "--XX\r\nhello\r\n"), "hello"},
  };
  for (const auto& c : cases) {
    ClsEmail email;
    ASSERT_TRUE(email.LoadEmlFromMemory(c.text, DateContext{}));
    EXPECT_EQ(test::Narrow(email.Body()), c.body) << c.name;
  }
}

std::string Repeat(const std::string& piece, size_t times) {
  std::string out;
  for (size_t i = 0; i < times; ++i) out += piece;
  return out;
}

void Measure(const MimePart& part, int level, size_t* parts, int* depth) {
  ++*parts;
  *depth = std::max(*depth, level);
  for (const MimePart& sub : part.parts) Measure(sub, level + 1, parts, depth);
}

// Hostile nesting, part counts and junk load within the caps, without
// crashing or hanging.
TEST(LoadEml, HostileInputLoadsWithinTheCaps) {
  std::string nested = "Content-Type: multipart/mixed; boundary=b0\r\n\r\n", junk;
  for (int i = 1; i <= 5000; ++i) nested += Part("Content-Type: multipart/mixed; boundary=b" + std::to_string(i) +
                                                 "\r\n", "", "b" + std::to_string(i - 1));
  uint32_t seed = 12345;
  for (int i = 0; i < 200000; ++i) junk.push_back(static_cast<char>((seed = seed * 1103515245 + 12345) >> 16));
  const std::string q(300, 'q');
  const struct {
    std::string text;
    size_t max_parts = kMaxParts;
    int max_depth = kMaxPartDepth;
  } cases[] = {
      {nested, kMaxPartDepth + 1, kMaxPartDepth},
      {Multipart("multipart/mixed", Repeat(Part("", "."), 1000000)), kMaxParts, 1},
      {"Content-Type: multipart/mixed; boundary=\"\"\r\n\r\n--\r\n\r\na\r\n", 1, 0},
      {Multipart("multipart/mixed", Part("", "a", q), q), 1, 0},
      {Multipart("multipart/mixed", Part("Content-Transfer-Encoding: base64\r\n", "QUJD\r\n--XX\r\nREVG")), 3, 1},
      {junk}, {std::string("Subject: a\0b\r\nFrom: x\0@y\r\n\r\nbo\0dy", 34)}, {"Subject: truncated =?utf-8?B?QUJ"},
      {Multipart("multipart/mixed", "--XX\r\nContent-Type: text/plain; charset=iso-2022-jp\r\n")},
      {"Subject: x\r\nContent-Type: text/plain;" + Repeat(";", 1000000) + "charset=utf-8\r\n\r\nbody"},
      {"Subject: x" + Repeat("\r\n y", 1000000) + "\r\n\r\nbody"},
      {"Subject: " + Repeat("=?", 500000) + "\r\n\r\n"}, {"From: " + Repeat("(", 500000) + "\r\n\r\n"},
      {"From: " + Repeat("\"", 500001) + "\r\n\r\n"}, {Repeat("\r", 100000) + "Subject: only CRs"},
      {Repeat("\n", 100000)}, {"Date: " + Repeat("9", 100000) + "\r\n\r\n"},
  };
  for (const auto& c : cases) {
    ClsEmail email;
    ASSERT_TRUE(email.LoadEmlFromMemory(c.text, DateContext{}));
    (void)email.FromAddress(), (void)email.Subject(), (void)email.Body(), (void)email.LocalDate();
    size_t parts = 0;
    int depth = 0;
    Measure(email.message().root, 0, &parts, &depth);
    EXPECT_LE(parts, c.max_parts) << c.text.substr(0, 60);
    EXPECT_LE(depth, c.max_depth) << c.text.substr(0, 60);
  }
}

}  // namespace
}  // namespace asum::mail
