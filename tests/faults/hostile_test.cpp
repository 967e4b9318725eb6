// Hostile alert files through a real cycle on a small stack: nothing crashes,
// the cycle ends, and each file reaches the end the processing rules give it.
#include <functional>
#include <tuple>

#ifndef _WIN32
#include <pthread.h>
#endif

#include "fault_support.h"

namespace asum::test {
namespace {

TEST(HostileFiles, EachReachesItsEndInACycleOnASmallStack) {
  const std::string head =
      "From: \"Alert Service\" <alerts@corp.example>\r\nDate: Mon, 11 Jun 2026 09:05:03 +0000\r\nSubject: Script "
      "Execution Alert: Account Unlock \"Unlock\" (SRV01\\Account Lockout Report\\Daily)\r\n";
  const std::string html = "Content-Type: text/html\r\n\r\n<p><b>Who  :</b>CORP\\someone</p>";
  const auto Repeat = [](const std::string& piece, int times) {
    std::string t;
    while (times-- > 0) t += piece;
    return t;
  };
  std::string junk(64 * 1024, '\0'), nested;
  for (size_t i = 0; i < junk.size(); ++i) junk[i] = static_cast<char>(i * 2654435761u >> 13);
  for (int i = 0; i < 3000; ++i) {  // multipart in multipart, each with a boundary of its own
    nested += "Content-Type: multipart/mixed; boundary=\"b" + std::to_string(i) + "\"\r\n\r\n--b" + std::to_string(i) +
              "\r\n";
  }
  const std::vector<std::tuple<const char16_t*, std::string, End>> files = {
      // name, bytes, end
      {u"control.eml", head + html, kStored},
      {u"zero_bytes.eml", "", kMarked},
      {u"binary_junk.eml", junk, kMarked},
      {u"nul_in_body.eml", head + html + std::string("\0after", 6) + junk.substr(0, 512), kStored},
      {u"huge_header.eml", head + "X-Pad: " + std::string(4 << 20, 'a') + "\r\n" + html, kStored},
      {u"many_headers.eml", head + Repeat("X-H: v\r\n", 200000) + html, kStored},
      {u"folded_forever.eml", head + "X-Folded: a" + Repeat("\r\n continued", 100000) + "\r\n" + html, kStored},
      {u"deep_multipart.eml", head + nested + html, kStored},
      {u"deep_tables.eml", head + html + Repeat("<table><tr><td>", 20000) + Repeat("</td></tr></table>", 20000),
       kStored},
      {u"bad_base64.eml", head + "Content-Transfer-Encoding: base64\r\n" + html + "!!==@@" + junk, kStored},
      {u"no_line_ends.eml", std::string(2 << 20, 'z'), kMarked},
      {u"Alerte \u00e9t\u00e9 \u65e5\u672c \U0001F6A8.eml", head + html, kStored},
      {u"twenty_megabytes.eml", head + html + "<table>" + Repeat("<tr><td>CORP\\a</td><td>\\\\FS\\f</td></tr>", 600000),
       kStored},
  };
  CapturedLog log;
  Install install;
  std::vector<std::u16string> paths;
  for (const auto& [name, bytes, end] : files) paths.push_back(install.Drop(kSent, name, bytes));
  install.Drop(kSent, u"folder.eml\\inside", "");
  ProcessTally tally;
  std::function<void()> cycle = [&] { EXPECT_EQ(RunProcessingCycle(install.path(), &tally), CycleResult::kDone); };
#ifdef _WIN32
  cycle();  // the test program's own stack is small
#else
  pthread_attr_t small;  // a host may give its threads little stack
  pthread_t thread;
  ASSERT_EQ(pthread_attr_init(&small) || pthread_attr_setstacksize(&small, 256 * 1024), 0);
  const auto run = [](void* fn) -> void* { return (*static_cast<std::function<void()>*>(fn))(), nullptr; };
  ASSERT_EQ(pthread_create(&thread, &small, run, &cycle), 0);
  pthread_join(thread, nullptr);
#endif

  const std::vector<End> ends = EndsOf(install, paths);
  for (size_t i = 0; i < files.size(); ++i) EXPECT_EQ(ends[i], std::get<2>(files[i])) << Narrow(std::get<0>(files[i]));
  EXPECT_EQ(tally.left, 0u) << "a folder named like an alert is not listed";
}

}  // namespace
}  // namespace asum::test
