// The diagnostic log: one timestamped line per message in ErrorLog.txt inside
// the log folder (platform::LogFolder()), written only while that folder exists.
//
// Callable from any thread at any time. Never fails towards its caller and
// never throws: a line that cannot be written (folder missing, file held by
// another writer, disk full) is dropped.
#pragma once

#include <cstdint>
#include <string>

namespace asum {

// The file is emptied once it holds this many bytes; not 5 MiB on purpose, the
// people who read these logs know the number.
inline constexpr uint64_t kLogSizeLimit = 5266225;

void WriteLog(const std::u16string& message);

}  // namespace asum
