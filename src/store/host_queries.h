// The two query exports' bodies: texts as the host passes them (wchar_t, UTF-16
// on Windows, UTF-32 on Linux; null reads as the empty text), the database in
// the "Alert_Summary" folder beside the host executable.
//
// Callable from any host thread at once. Nothing thrown leaves them: any
// failure gives 0.
#pragma once

#include <string>

namespace asum {

// The host's wide text as UTF-16, up to its terminating zero.
std::u16string HostText(const wchar_t* text);

int GetAlertCountForHost(const wchar_t* filter, const wchar_t* range);
// The same for texts already read from the host's string objects.
int CountForHost(const std::u16string& filter, const std::u16string& range);
int RunRetentionForHost();

}  // namespace asum
