// The "When" text of an alert row: the message's local date written as
// "%d/%02d/%02d %02d:%02d:%02d", after a round trip through an OLE Automation
// date. A date that does not survive the round trip is written
// "-1/-1/-1 -1:-1:-1", which sorts before every real date (so the next
// retention purge removes it).
//
// Pure apart from the platform's date conversions; any thread.
#pragma once

#include <string>

#include "platform/platform.h"

namespace asum {

std::u16string FormatWhen(const platform::SystemTime& local);

}  // namespace asum
