#include "collect/cycle.h"

#include "log/log.h"
#include "platform/platform.h"
#include "store/database_probe.h"
#include "store/setting_db_management.h"

namespace asum {

std::u16string DatabasePathOf(const std::u16string& install_folder) {
  return CSettingDBManagement::DatabasePath(CSettingDBManagement::GetAlertSummaryFolder(install_folder));
}

std::u16string CollectorLockPathOf(const std::u16string& install_folder) {
  return CollectorLockPathIn(CSettingDBManagement::GetAlertSummaryFolder(install_folder));
}

std::u16string CollectorLockPathIn(const std::u16string& summary_folder) {
  return summary_folder + platform::NativeSeparators(u"\\AlertSummaryDB.collector.lock");
}

CycleResult RunLockedCycle(const std::u16string& install_folder, const AlertFileProcessor& process) {
  platform::Env& env = platform::Current();
  platform::FileLock lock = env.TryLockFile(CollectorLockPathOf(install_folder));
  if (lock == nullptr) {
    WriteLog(u"Another collector is processing " + install_folder + u"; this cycle does nothing");
    return CycleResult::kBusy;
  }
  CycleResult result = CycleResult::kDone;
  try {
    const std::u16string db_path = DatabasePathOf(install_folder);
    if (env.PathExists(db_path) && !IsDatabaseFile(db_path)) {
      WriteLog(db_path + u" is not an alert database; no alert file is processed");
      result = CycleResult::kNotADatabase;
    } else {
      RunCollectionCycle(install_folder, process);
    }
  } catch (...) {
    // A cycle that ran out of memory ends here; its files come back next time.
  }
  env.UnlockFile(lock);
  return result;
}

}  // namespace asum
