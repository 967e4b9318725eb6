// The two query exports' bodies: texts already read from the host (its wide
// texts are read in entry/host_text.h), the database in the "Alert_Summary"
// folder beside the host executable.
//
// Callable from any host thread at once. Nothing thrown leaves them: any
// failure gives 0.
#pragma once

#include <string>

namespace asum {

// The count export's body; 0 on any failure.
int CountForHost(const std::u16string& filter, const std::u16string& range);
int RunRetentionForHost();

}  // namespace asum
