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

// True while the log is on (its folder exists). A message written right after
// may still find it switched the other way.
bool LogEnabled();

// Drops the messages this thread writes while the object lives. For work done
// ahead on a helper thread while the log is off: such work has nothing to
// write, and must not write from the wrong thread, out of order, should the
// log be switched on meanwhile (its owner then does that work again itself).
class SilencedLog {
 public:
  SilencedLog();
  ~SilencedLog();
  SilencedLog(const SilencedLog&) = delete;
  SilencedLog& operator=(const SilencedLog&) = delete;

 private:
  bool previous_;
};

}  // namespace asum
