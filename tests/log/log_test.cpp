#include "log/log.h"

#include <gtest/gtest.h>

#include <thread>

#include "support/test_support.h"

namespace asum {
namespace {

// A clock whose timestamp text the test chooses ("" when it cannot be rendered).
class StampEnv : public platform::Env {
 public:
  std::u16string stamp = u"07.12.2026 01:02:03";
  std::u16string TimestampText(const platform::SystemTime&) override { return stamp; }
};

TEST(WriteLog, LinesAreStampTabMessageCrLfInCallOrder) {
  test::CapturedLog log;
  StampEnv env;
  platform::ScopedEnv scoped(&env);
  WriteLog(u"first");
  WriteLog(u"");
  WriteLog(u"a\nb\rc caf\u00e9 \u4e2d \U0001F600");
  env.stamp.clear();
  WriteLog(u"no clock");
  EXPECT_EQ(test::ReadText(log.folder() + platform::NativeSeparators(u"\\ErrorLog.txt")),
            "07.12.2026 01:02:03\tfirst\r\n07.12.2026 01:02:03\t\r\n"
            "07.12.2026 01:02:03\ta\r\nb\rc caf\xe9 ? ?\r\nInvalid DateTime\tno clock\r\n");
}

TEST(WriteLog, FileIsEmptiedOnceItHoldsTheLimit) {
  test::CapturedLog log;
  StampEnv env;
  platform::ScopedEnv scoped(&env);
  const std::u16string path = log.folder() + platform::NativeSeparators(u"\\ErrorLog.txt");
  const std::string line = "07.12.2026 01:02:03\tnext\r\n";
  for (size_t size : {5266224, 5266225, 5266226}) {
    test::WriteText(path, std::string(size, 'x'));
    WriteLog(u"next");
    const std::string text = test::ReadText(path);
    EXPECT_EQ(text, size < 5266225 ? std::string(size, 'x') + line : line) << size;
  }
}

TEST(WriteLog, AbsentFolderCreatesNothing) {
  test::TempDir dir;
  const std::u16string previous = platform::LogFolder();
  platform::SetLogFolder(dir.Join(u"missing"));
  WriteLog(u"dropped");
  platform::SetLogFolder(previous);
  EXPECT_TRUE(test::ListNames(dir.path()).empty());
}

TEST(WriteLog, ConcurrentWritersNeverInterleaveALine) {
  test::CapturedLog log;
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
