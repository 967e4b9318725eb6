// What the fuzz targets share: a check that stops the fuzzer on a broken
// promise, and the diagnostic log kept off so inputs run at full speed.
#pragma once

#include "platform/platform.h"

namespace asum::fuzz {

inline void Check(bool ok) {
  if (!ok) __builtin_trap();
}

// Points the log at a folder that does not exist, once per process.
inline void KeepLogOff() {
  static const bool done = [] {
    platform::SetLogFolder(u"no-such-folder-for-the-fuzzer");
    return true;
  }();
  (void)done;
}

}  // namespace asum::fuzz
