#include "log/log.h"

#include <gtest/gtest.h>

#include <thread>

#include "support/test_support.h"

namespace asum {
namespace {

using test::CapturedLog;
using test::ReadText;
using test::TempDir;
using test::WriteText;

std::u16string LogPath(const CapturedLog& log) {
  return log.folder() + platform::kPathSeparator + u"ErrorLog.txt";
}

TEST(WriteLog, AbsentFolderCreatesNothing) {
  TempDir dir;
  const std::u16string previous = platform::LogFolder();
  platform::SetLogFolder(dir.Join(u"missing"));
  WriteLog(u"dropped");
  platform::SetLogFolder(previous);
  EXPECT_TRUE(test::ListNames(dir.path()).empty());
}

TEST(WriteLog, LinesAppearInCallOrderWithTabAndCrLf) {
  CapturedLog log;
  WriteLog(u"first");
  WriteLog(u"");
  WriteLog(u"a\nb");
  const std::string text = ReadText(LogPath(log));
  // Each line: timestamp, TAB, message, CR LF; a line feed inside becomes CR LF.
  size_t first = text.find("\tfirst\r\n");
  size_t empty = text.find("\t\r\n", first);
  size_t split = text.find("\ta\r\nb\r\n", empty);
  EXPECT_NE(first, std::string::npos);
  EXPECT_NE(empty, std::string::npos);
  EXPECT_NE(split, std::string::npos);
  EXPECT_EQ(text.find('\t'), first) << "the first line must be the first message";
  EXPECT_EQ(log.Messages().size(), 4u);
}

TEST(WriteLog, CharactersAboveLatin1BecomeQuestionMarks) {
  CapturedLog log;
  WriteLog(u"caf\u00e9 \u4e2d \U0001F600!");
  const std::string text = ReadText(LogPath(log));
  EXPECT_NE(text.find("\tcaf\xe9 ? ?!\r\n"), std::string::npos);
}

TEST(WriteLog, SizeLimitEmptiesTheFileExactlyAtTheLimit) {
  CapturedLog log;
  const std::string filler = "x";
  WriteText(LogPath(log), std::string(kLogSizeLimit - 1, 'x'));
  WriteLog(u"kept");
  EXPECT_EQ(ReadText(LogPath(log)).compare(0, kLogSizeLimit - 1, std::string(kLogSizeLimit - 1, 'x')), 0);

  WriteText(LogPath(log), std::string(kLogSizeLimit, 'x'));
  WriteLog(u"alone");
  const std::string text = ReadText(LogPath(log));
  EXPECT_EQ(text.find('x'), std::string::npos);
  EXPECT_EQ(log.Messages(), std::vector<std::u16string>{u"alone"});
}

TEST(WriteLog, ConcurrentWritersNeverInterleaveALine) {
  CapturedLog log;
  const std::u16string a(200, u'a'), b(200, u'b');
  std::thread ta([&] { for (int i = 0; i < 200; ++i) WriteLog(a); });
  std::thread tb([&] { for (int i = 0; i < 200; ++i) WriteLog(b); });
  ta.join();
  tb.join();
  const auto messages = log.Messages();
  EXPECT_GT(messages.size(), 0u);
  for (const auto& m : messages) EXPECT_TRUE(m == a || m == b);
}

}  // namespace
}  // namespace asum
