// The diagnostic log: one timestamped line per message in ErrorLog.txt inside
// the log folder (platform::LogFolder()), written only while that folder exists.
//
// Callable from any thread at any time. Never fails towards its caller and
// never throws: a line that cannot be written (folder missing, file held by
// another writer, disk full) is dropped.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace asum {

// The file is emptied once it holds this many bytes; not 5 MiB on purpose, the
// people who read these logs know the number.
inline constexpr uint64_t kLogSizeLimit = 5266225;

void WriteLog(const std::u16string& message);

// Holds back the messages this thread writes while the object lives, so that
// work done ahead on a helper thread can have its lines written later, in the
// order a single thread would have written them. Only the messages are kept:
// the timestamp is taken when they are written.
class DeferredLog {
 public:
  DeferredLog();
  ~DeferredLog();
  DeferredLog(const DeferredLog&) = delete;
  DeferredLog& operator=(const DeferredLog&) = delete;

  std::vector<std::u16string> Take() { return std::move(messages_); }

 private:
  friend void WriteLog(const std::u16string& message);
  DeferredLog* previous_;
  std::vector<std::u16string> messages_;
};

}  // namespace asum
