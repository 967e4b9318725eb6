// The two query exports. Their work is the store's; here only the C surface,
// so nothing thrown can reach the host, and on Windows the host's string
// objects, which this export reads and destroys as their framework would.
#include "entry/alertsummary.h"
#include "entry/framework_string.h"
#include "entry/host_text.h"
#include "store/host_queries.h"

#ifdef _WIN32
extern "C" ALERTSUMMARY_EXPORT int ALERTSUMMARY_CALL _GetAlertCount(AlertSummaryHostString filter,
                                                                    AlertSummaryHostString range) {
  using asum::framework::StringArg;
  const auto filter_arg = reinterpret_cast<StringArg>(filter);
  const auto range_arg = reinterpret_cast<StringArg>(range);
  int count = 0;
  try {
    count = asum::CountForHost(asum::framework::TextOf(filter_arg), asum::framework::TextOf(range_arg));
  } catch (...) {
    count = 0;
  }
  // By-value parameters die with the call, after the count.
  asum::framework::Release(filter_arg);
  asum::framework::Release(range_arg);
  return count;
}
#else
extern "C" ALERTSUMMARY_EXPORT int ALERTSUMMARY_CALL _GetAlertCount(const wchar_t* filter, const wchar_t* range) {
  return asum::GetAlertCountForHost(filter, range);
}
#endif

extern "C" ALERTSUMMARY_EXPORT int ALERTSUMMARY_CALL _RunRetentionProc(void) {
  return asum::RunRetentionForHost();
}
