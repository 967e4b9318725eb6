#include "hostile_files.h"

#include <random>

namespace asum::test {
namespace {

constexpr char kSubject[] =
    "Script Execution Alert: Account Unlock \"Unlock locked accounts\" (SRV01\\Account Lockout Report\\Daily)";

std::string Head(const std::string& extra = "") {
  return std::string("From: \"Alert Service\" <alerts@corp.example>\r\nSubject: ") + kSubject +
         "\r\nDate: Mon, 11 Jun 2026 09:05:03 +0000\r\nMIME-Version: 1.0\r\n" + extra;
}

std::string Html(const std::string& who) {
  return "<html><body><p><b>Who  :</b>" + who + "</p></body></html>";
}

std::string Junk(size_t size, unsigned seed) {
  std::mt19937 rng(seed);
  std::string bytes(size, '\0');
  for (char& c : bytes) c = static_cast<char>(rng() & 0xFF);
  return bytes;
}

// multipart/mixed nested `depth` times, the HTML part at the bottom.
std::string DeepNesting(int depth) {
  std::string m = Head("Content-Type: multipart/mixed; boundary=\"b0\"\r\n\r\n");
  for (int i = 1; i <= depth; ++i) {
    m += "--b" + std::to_string(i - 1) + "\r\nContent-Type: multipart/mixed; boundary=\"b" + std::to_string(i) +
         "\"\r\n\r\n";
  }
  m += "--b" + std::to_string(depth) + "\r\nContent-Type: text/html\r\n\r\n" + Html("deep") + "\r\n";
  for (int i = depth; i >= 0; --i) m += "--b" + std::to_string(i) + "--\r\n";
  return m;
}

std::string NestedTables(int depth) {
  std::string open, close;
  for (int i = 0; i < depth; ++i) {
    open += "<table><tr><td>";
    close += "</td></tr></table>";
  }
  return Head("Content-Type: text/html\r\n\r\n") + "<p><b>Who  :</b>tables</p>" + open + "x" + close;
}

}  // namespace

std::string PlainAlert(const std::string& who) { return Head("Content-Type: text/html\r\n\r\n") + Html(who); }

std::vector<HostileFile> HostileFiles(bool huge) {
  std::vector<HostileFile> files;
  auto add = [&](std::u16string name, std::string bytes, Expect expect) {
    files.push_back({std::move(name), std::move(bytes), expect});
  };
  add(u"control.eml", PlainAlert("CORP\\control"), Expect::kStored);
  add(u"zero_bytes.eml", "", Expect::kMarked);
  add(u"binary_junk.eml", Junk(64 * 1024, 1), Expect::kMarked);
  add(u"nul_bytes_in_body.eml",
      Head("Content-Type: text/html\r\n\r\n") + std::string("<p><b>Who  :</b>nul\0name</p>", 29) + Junk(512, 2),
      Expect::kStored);
  add(u"headers_without_body.eml", Head("Content-Type: text/html\r\n"), Expect::kMarked);
  add(u"huge_header_line.eml",
      Head("X-Padding: " + std::string(4 << 20, 'a') + "\r\nContent-Type: text/html\r\n\r\n") + Html("long header"),
      Expect::kStored);
  {
    std::string many;
    for (int i = 0; i < 200000; ++i) many += "X-H" + std::to_string(i) + ": v\r\n";
    add(u"many_headers.eml", Head(many + "Content-Type: text/html\r\n\r\n") + Html("many"), Expect::kStored);
  }
  add(u"folded_forever.eml",
      Head("X-Folded: start") + [] {
        std::string f;
        for (int i = 0; i < 100000; ++i) f += "\r\n continued";
        return f;
      }() + "\r\nContent-Type: text/html\r\n\r\n" + Html("folded"),
      Expect::kStored);
  add(u"deep_multipart.eml", DeepNesting(3000), Expect::kStored);
  add(u"deep_tables.eml", NestedTables(20000), Expect::kStored);
  add(u"boundary_missing.eml",
      Head("Content-Type: multipart/alternative\r\n\r\n--x\r\nContent-Type: text/html\r\n\r\n") + Html("nobound"),
      Expect::kStored);
  add(u"boundary_never_closed.eml",
      Head("Content-Type: multipart/mixed; boundary=\"zz\"\r\n\r\n--zz\r\nContent-Type: text/html\r\n\r\n") +
          Html("open") + "\r\n--zz\r\nContent-Type: text/html\r\n",
      Expect::kStored);
  add(u"bad_base64.eml",
      Head("Content-Type: text/html\r\nContent-Transfer-Encoding: base64\r\n\r\n") + "!!!!====@@@@\r\n" +
          Junk(300, 3),
      Expect::kStored);
  add(u"bad_quoted_printable.eml",
      Head("Content-Type: text/html\r\nContent-Transfer-Encoding: quoted-printable\r\n\r\n") +
          "<p><b>Who  :</b>q=ZZp=\r\n=</p>=",
      Expect::kStored);
  add(u"unknown_charset.eml",
      Head("Content-Type: text/html; charset=\"x-no-such-charset-\xFF\"\r\n\r\n") + Html("charset"),
      Expect::kStored);
  add(u"encoded_word_junk.eml",
      "From: =?utf-8?B?####?= <>\r\nSubject: =?bogus?Q?=FF=FE?= =?utf-8?B?\r\nDate: not a date at all\r\n"
      "Content-Type: text/html\r\n\r\n" +
          Html("subject junk"),
      Expect::kMarked);
  add(u"lone_carriage_returns.eml",
      "From: a@b.c\rSubject: " + std::string(kSubject) + "\rContent-Type: text/html\r\r" + Html("cr"),
      Expect::kStored);
  add(u"no_line_ends.eml", std::string(2 << 20, 'z'), Expect::kMarked);
  {
    std::string unclassified = "From: a@b.c\r\nSubject: just a note\r\nContent-Type: text/html\r\n\r\n" + Html("n");
    add(u"unclassified_subject.eml", unclassified, Expect::kMarked);
  }
  add(u"Alerte \u00e9t\u00e9 \u65e5\u672c \u0416.eml", PlainAlert("unicode name"), Expect::kStored);
  add(u"emoji \U0001F6A8 alert.eml", PlainAlert("emoji name"), Expect::kStored);
  add(u"name.eml.bak", PlainAlert("suffix"), Expect::kStored);
  files.push_back({u"folder.eml", "", Expect::kLeft, true});
  if (huge) {
    std::string big = Head("Content-Type: text/html\r\n\r\n") + "<p><b>Who  :</b>huge</p>";
    const std::string row = "<tr><td>CORP\\someone</td><td>Deleted</td><td>\\\\FS01\\share\\file.txt</td></tr>\r\n";
    big += "<table>";
    while (big.size() < (100u << 20)) big += row;
    big += "</table>";
    add(u"hundred_megabytes.eml", std::move(big), Expect::kStored);
  }
  return files;
}

}  // namespace asum::test
