// Hostile alert files through a real cycle on a small stack: nothing crashes,
// the cycle ends, and each file reaches the end the processing rules give it.
#include <functional>

#ifndef _WIN32
#include <pthread.h>
#endif

#include "fault_support.h"

namespace asum::test {
namespace {

const std::string kHead =
    "From: \"Alert Service\" <alerts@corp.example>\r\nDate: Mon, 11 Jun 2026 09:05:03 +0000\r\nSubject: Script "
    "Execution Alert: Account Unlock \"Unlock\" (SRV01\\Account Lockout Report\\Daily)\r\n";
const std::string kHtml = "Content-Type: text/html\r\n\r\n<p><b>Who  :</b>CORP\\someone</p>";

std::string Repeat(const std::string& piece, size_t times) {
  std::string text;
  while (times-- > 0) text += piece;
  return text;
}

std::string Junk(size_t size) {
  std::string bytes(size, '\0');
  for (size_t i = 0; i < size; ++i) bytes[i] = static_cast<char>(i * 2654435761u >> 13);
  return bytes;
}

// The host may start the processing thread with a small stack (POSIX here;
// the Windows test program's own stack is small already).
void OnSmallStack(const std::function<void()>& fn) {
#ifdef _WIN32
  fn();
#else
  pthread_attr_t attr;
  pthread_t thread;
  ASSERT_EQ(pthread_attr_init(&attr), 0);
  ASSERT_EQ(pthread_attr_setstacksize(&attr, 256 * 1024), 0);
  const auto run = [](void* f) -> void* { return (*static_cast<const std::function<void()>*>(f))(), nullptr; };
  ASSERT_EQ(pthread_create(&thread, &attr, run, const_cast<std::function<void()>*>(&fn)), 0);
  pthread_join(thread, nullptr);
  pthread_attr_destroy(&attr);
#endif
}

TEST(HostileFiles, EachReachesItsEndOnASmallStackAndTheNextCycleChangesNothing) {
  struct Hostile {
    const char16_t* name;
    std::string bytes;
    End end;
  };
  const std::string multipart = "Content-Type: multipart/mixed; boundary=\"b\"\r\n\r\n";
  std::string nested;  // each level a boundary of its own
  for (int i = 0; i < 3000; ++i) nested += "Content-Type: multipart/mixed; boundary=\"b" + std::to_string(i) + "\"\r\n\r\n--b" + std::to_string(i) + "\r\n";
  std::vector<Hostile> files = {
      {u"control.eml", kHead + kHtml, kStored},
      {u"zero_bytes.eml", "", kMarked},
      {u"binary_junk.eml", Junk(64 * 1024), kMarked},
      {u"nul_in_body.eml", kHead + kHtml + std::string("\0after", 6) + Junk(512), kStored},
      {u"headers_only.eml", kHead + "Content-Type: text/html\r\n", kMarked},
      {u"huge_header.eml", kHead + "X-Pad: " + std::string(4 << 20, 'a') + "\r\n" + kHtml, kStored},
      {u"many_headers.eml", kHead + Repeat("X-H: v\r\n", 200000) + kHtml, kStored},
      {u"folded_forever.eml", kHead + "X-Folded: a" + Repeat("\r\n continued", 100000) + "\r\n" + kHtml, kStored},
      {u"deep_multipart.eml", kHead + nested + kHtml, kStored},
      {u"deep_tables.eml", kHead + kHtml + Repeat("<table><tr><td>", 20000) + Repeat("</td></tr></table>", 20000),
       kStored},
      {u"never_closed.eml", kHead + multipart + "--b\r\n" + kHtml + "\r\n--b\r\nContent-Type: text/html\r\n", kStored},
      {u"bad_base64.eml", kHead + "Content-Transfer-Encoding: base64\r\n" + kHtml + "!!==@@" + Junk(300), kStored},
      {u"junk_headers.eml", "From: =?utf-8?B?####?= <>\r\nSubject: =?bogus?Q?=FF?= =?utf-8?B?\r\nDate: no\r\n" + kHtml,
       kMarked},
      {u"no_line_ends.eml", std::string(2 << 20, 'z'), kMarked},
      {u"unclassified.eml", "From: a@b.c\r\nSubject: just a note\r\n" + kHtml, kMarked},
      {u"Alerte \u00e9t\u00e9 \u65e5\u672c \U0001F6A8.eml", kHead + kHtml, kStored},
      {u"name.eml.bak", kHead + kHtml, kStored},
  };
  if (!QuickRun()) {
    files.push_back({u"hundred_megabytes.eml", kHead + kHtml + "<table>" +
                         Repeat("<tr><td>CORP\\someone</td><td>\\\\FS01\\share\\file.txt</td></tr>\r\n", 1700000),
                     kStored});
  }
  CapturedLog log;
  Install install;
  std::vector<std::u16string> paths;
  for (const Hostile& f : files) paths.push_back(install.Drop(kSent, f.name, f.bytes));
  install.Drop(kSent, u"folder.eml\\inside", "");
  ProcessTally tally;
  OnSmallStack([&] { EXPECT_EQ(RunProcessingCycle(install.path(), &tally), CycleResult::kDone); });

  const std::vector<End> ends = EndsOf(install, paths);
  for (size_t i = 0; i < files.size(); ++i) EXPECT_EQ(ends[i], files[i].end) << Narrow(files[i].name);
  EXPECT_EQ(tally.left, 0u) << "a folder named like an alert is not listed";
  const auto rows = install.Sql("SELECT count(*) FROM AlertDB");
  EXPECT_EQ(RunProcessingCycle(install.path()), CycleResult::kDone);
  EXPECT_EQ(install.Sql("SELECT count(*) FROM AlertDB"), rows);
}

}  // namespace
}  // namespace asum::test
