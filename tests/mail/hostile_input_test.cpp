#include <gtest/gtest.h>

#include <string>

#include "mail/cls_email.h"
#include "mail/mime_parser.h"
#include "mail/transfer_decoding.h"
#include "support/test_support.h"

namespace asum::mail {
namespace {

std::string Repeat(const std::string& piece, size_t times) {
  std::string out;
  out.reserve(piece.size() * times);
  for (size_t i = 0; i < times; ++i) out += piece;
  return out;
}

size_t CountParts(const MimePart& root, int* depth) {
  size_t count = 0;
  *depth = 0;
  std::vector<std::pair<const MimePart*, int>> stack = {{&root, 0}};
  while (!stack.empty()) {
    auto [part, level] = stack.back();
    stack.pop_back();
    ++count;
    *depth = std::max(*depth, level);
    for (const MimePart& sub : part->parts) stack.push_back({&sub, level + 1});
  }
  return count;
}

std::string Nested(int levels) {
  std::string text = "Content-Type: multipart/mixed; boundary=b0\r\n\r\n";
  for (int i = 1; i <= levels; ++i) {
    text += "--b" + std::to_string(i - 1) + "\r\nContent-Type: multipart/mixed; boundary=b" + std::to_string(i) +
            "\r\n\r\n";
  }
  return text + "--b" + std::to_string(levels) + "\r\n\r\ndeepest\r\n";
}

// Each input must load (or be refused) without crashing or hanging; the
// checks say what the reader keeps.
TEST(HostileInput, LoadsWithinTheCaps) {
  struct Case {
    const char* name;
    std::string text;
    size_t max_parts;
    int max_depth;
  } cases[] = {
      {"nested thousands deep", Nested(5000), kMaxPartDepth + 1, kMaxPartDepth},
      {"a million tiny parts",
       "Content-Type: multipart/mixed; boundary=x\r\n\r\n" + Repeat("--x\r\n\r\n.\r\n", 1000000), kMaxParts, 1},
      {"empty boundary", "Content-Type: multipart/mixed; boundary=\"\"\r\n\r\n--\r\n\r\na\r\n", 1, 0},
      {"boundary longer than allowed",
       "Content-Type: multipart/mixed; boundary=" + std::string(300, 'q') + "\r\n\r\n--" + std::string(300, 'q') +
           "\r\n\r\na\r\n",
       1, 0},
      {"boundary inside a base64 body",
       "Content-Type: multipart/mixed; boundary=z\r\n\r\n--z\r\nContent-Transfer-Encoding: base64\r\n\r\n"
       "QUJD\r\n--z\r\nREVG\r\n--z--\r\n",
       3, 1},
  };
  for (const Case& c : cases) {
    ClsEmail email;
    ASSERT_TRUE(email.LoadEmlFromMemory(c.text, DateContext{})) << c.name;
    int depth = 0;
    const size_t parts = CountParts(email.message().root, &depth);
    EXPECT_LE(parts, c.max_parts) << c.name;
    EXPECT_LE(depth, c.max_depth) << c.name;
    (void)email.Body();
  }
}

TEST(HostileInput, JunkNeverFailsTheLoad) {
  std::string junk;
  uint32_t seed = 12345;
  for (int i = 0; i < 200000; ++i) {
    seed = seed * 1103515245 + 12345;
    junk.push_back(static_cast<char>(seed >> 16));
  }
  const std::string texts[] = {
      junk,
      std::string("Subject: a\0b\r\nFrom: x\0@y\r\n\r\nbo\0dy", 34),
      "Subject: no end of the header block\r\nFrom: a@b",
      "Subject: truncated =?utf-8?B?QUJ",
      "Content-Type: multipart/mixed; boundary=q\r\n\r\n--q\r\nContent-Type: text/plain; charset=iso-2022-jp\r\n",
      "Subject: x\r\nContent-Type: text/plain;" + Repeat(";", 1000000) + "charset=utf-8\r\n\r\nbody",
      "Subject: x" + Repeat("\r\n y", 1000000) + "\r\n\r\nbody",
      "Subject: " + Repeat("=?", 500000) + "\r\n\r\n",
      "From: " + Repeat("(", 500000) + "\r\n\r\n",
      "From: " + Repeat("\"", 500001) + "\r\n\r\n",
      Repeat("\r", 100000) + "Subject: only CRs",
      Repeat("\n", 100000),
      "Date: " + Repeat("9", 100000) + "\r\n\r\n",
  };
  for (const std::string& text : texts) {
    ClsEmail email;
    EXPECT_TRUE(email.LoadEmlFromMemory(text, DateContext{}));
    (void)email.FromAddress();
    (void)email.Subject();
    (void)email.Body();
    (void)email.LocalDate();
  }
  ClsEmail unfolded;
  ASSERT_TRUE(unfolded.LoadEmlFromMemory("Subject: x" + Repeat("\r\n y", 1000) + "\r\n\r\n", DateContext{}));
  EXPECT_EQ(unfolded.Subject().size(), 1 + 2 * 1000u);
}

TEST(HostileInput, HeaderBlockWithoutEndIsAllHeader) {
  ClsEmail email;
  ASSERT_TRUE(email.LoadEmlFromMemory("Subject: s\r\nFrom: a@b.c\r\nbody?", DateContext{}));
  EXPECT_EQ(email.Subject(), u"s");
  EXPECT_EQ(email.FromAddress(), u"a@b.c");
  EXPECT_EQ(email.Body(), u"");
}

TEST(TransferDecoding, InvalidInputDecodesAsFarAsItMakesSense) {
  struct Case {
    const char* encoding;
    std::string input;
    std::string output;
  } cases[] = {
      {"base64", "QUJD", "ABC"},
      {"base64", "QU\r\nJD\r\n", "ABC"},
      {"base64", "QQ==QkM=", "ABC"},
      {"base64", "Q*U!J D", "ABC"},
      {"base64", "Q", ""},
      {"base64", "====", ""},
      {"quoted-printable", "a=3Db", "a=b"},
      {"quoted-printable", "soft=\r\nbreak=\nend", "softbreakend"},
      {"quoted-printable", "trail= \r\nx", "trailx"},
      {"quoted-printable", "bad=ZZ=4", "bad=ZZ=4"},
      {"quoted-printable", "end=", "end"},
      {"Quoted-Printable", "=e9", "\xE9"},
      {"7bit", "=41", "=41"},
      {"x-unknown", "QUJD", "QUJD"},
  };
  for (const Case& c : cases) EXPECT_EQ(DecodeTransfer(c.input, c.encoding), c.output) << c.input;
}

}  // namespace
}  // namespace asum::mail
