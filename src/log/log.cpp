#include "log/log.h"

#include "common/utf.h"
#include "platform/platform.h"

namespace asum {
namespace {

// A plain pointer: nothing to destroy when a thread ends.
thread_local DeferredLog* t_deferred = nullptr;

}  // namespace

DeferredLog::DeferredLog() : previous_(t_deferred) { t_deferred = this; }
DeferredLog::~DeferredLog() { t_deferred = previous_; }

void WriteLog(const std::u16string& message) {
  try {
    if (t_deferred != nullptr) {
      t_deferred->messages_.push_back(message);
      return;
    }
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
