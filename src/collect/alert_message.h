// The four things the processing reads from an alert message, loaded with the
// e-mail message reader. One reader object per file, gone when this returns.
#pragma once

#include <string>

#include "platform/platform.h"

namespace asum {

struct AlertMessage {
  std::u16string sender;   // the From address
  std::u16string subject;  // decoded
  std::u16string body;     // HTML preferred
  platform::SystemTime local_date;
};

// False when the file cannot be loaded (missing, unreadable, still held by its
// writer, too large); `message` is then untouched. A file still held by its
// writer and one larger than the reader takes get a log line each time.
bool LoadAlertMessage(const std::u16string& path, AlertMessage* message);

}  // namespace asum
