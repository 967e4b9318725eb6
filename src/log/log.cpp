#include "log/log.h"

#include "common/utf.h"
#include "platform/platform.h"

namespace asum {
namespace {

thread_local bool t_silenced = false;

}  // namespace

SilencedLog::SilencedLog() : previous_(t_silenced) { t_silenced = true; }
SilencedLog::~SilencedLog() { t_silenced = previous_; }

bool LogEnabled() {
  try {
    return platform::Current().PathExists(platform::LogFolder());
  } catch (...) {
    return false;
  }
}

void WriteLog(const std::u16string& message) {
  if (t_silenced) return;
  try {
    platform::Env& env = platform::Current();
    const std::u16string folder = platform::LogFolder();
    if (folder.empty() || !env.PathExists(folder)) return;
    const std::u16string path = folder + platform::NativeSeparators(u"\\ErrorLog.txt");

    std::u16string timestamp = env.TimestampText(env.LocalNow());
    if (timestamp.empty()) timestamp = u"Invalid DateTime";

    std::u16string line = timestamp + u'\t';
    line.reserve(line.size() + message.size() + 2);
    // A path of a file whose name is not UTF-8 reads as it does everywhere else.
    for (char16_t c : DisplayText(message)) {
      if (c == u'\n') line.push_back(u'\r');
      line.push_back(c);
    }
    line += u"\r\n";
    env.AppendExclusive(path, Utf16ToLatin1Lossy(line), kLogSizeLimit);
  } catch (...) {
    // Out of memory while building the line: the line is dropped, the caller
    // goes on.
  }
}

}  // namespace asum
