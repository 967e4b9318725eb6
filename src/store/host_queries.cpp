#include "store/host_queries.h"

#include "store/alert_count.h"
#include "store/retention.h"
#include "store/setting_db_management.h"

namespace asum {

int CountForHost(const std::u16string& filter, const std::u16string& range) {
  try {
    return CountAlerts(HostInstallFolder(), filter, range);
  } catch (...) {
    return 0;
  }
}

int RunRetentionForHost() {
  try {
    return RunRetentionProc(HostInstallFolder());
  } catch (...) {
    return 0;
  }
}

}  // namespace asum
