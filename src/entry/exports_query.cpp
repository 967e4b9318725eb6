// The two query exports. Their work is the store's; here only the C surface,
// so nothing thrown can reach the host.
#include "entry/alertsummary.h"
#include "store/host_queries.h"

extern "C" ALERTSUMMARY_EXPORT int ALERTSUMMARY_CALL _GetAlertCount(const wchar_t* filter, const wchar_t* range) {
  return asum::GetAlertCountForHost(filter, range);
}

extern "C" ALERTSUMMARY_EXPORT int ALERTSUMMARY_CALL _RunRetentionProc(void) {
  return asum::RunRetentionForHost();
}
