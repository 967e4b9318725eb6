// The host's wide texts: wchar_t, UTF-16 on Windows and UTF-32 on Linux; a
// null text reads as the empty one. The count export's body for hosts that
// pass such texts (Linux); the store's queries take UTF-16 (store/host_queries.h).
//
// Callable from any host thread at once. Nothing thrown leaves them.
#pragma once

#include <string>

namespace asum {

// The host's wide text as UTF-16, up to its terminating zero.
std::u16string HostText(const wchar_t* text);

// CountForHost over the host's texts; 0 on any failure.
int GetAlertCountForHost(const wchar_t* filter, const wchar_t* range);

}  // namespace asum
