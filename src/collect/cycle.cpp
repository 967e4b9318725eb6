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

CycleResult RunLockedCycle(const std::u16string& install_folder, const AlertFileProcessor& process,
                           const platform::StopSignal* stop) {
  platform::Env& env = platform::Current();
  const std::u16string lock_path = CollectorLockPathOf(install_folder);
  platform::FileResult failure;
  platform::FileLock lock = env.TryLockFile(lock_path, &failure);
  if (lock == nullptr) {
    if (failure.status == platform::FileStatus::kSharingViolation) {
      WriteLog(u"Another collector is processing " + install_folder + u"; this cycle does nothing");
      return CycleResult::kBusy;
    }
    // A read-only install folder or one the service may not write: without
    // the lock no cycle may run, and the log says what is wrong.
    WriteLog(u"The collector lock " + lock_path + u" cannot be created or opened: " + failure.Describe() +
             u"; this cycle does nothing");
    return CycleResult::kNoLock;
  }
  CycleResult result = CycleResult::kDone;
  try {
    const std::u16string db_path = DatabasePathOf(install_folder);
    if (stop != nullptr && stop->Requested()) {
      // Stopped: nothing more is touched.
    } else if (env.PathExists(db_path) && !IsDatabaseFile(db_path)) {
      WriteLog(db_path + u" is not an alert database; no alert file is processed");
      result = CycleResult::kNotADatabase;
    } else {
      RunCollectionCycle(install_folder, process, stop);
    }
  } catch (...) {
    // A cycle that ran out of memory ends here; its files come back next time.
  }
  env.UnlockFile(lock);
  return result;
}

CycleResult RunProcessingCycle(const std::u16string& install_folder, CycleContext& cycle, ProcessTally* tally) {
  return RunLockedCycle(
      install_folder,
      [&](StringList& files, const std::u16string& status, const std::u16string& component) {
        ProcessAlertFiles(install_folder, files, status, component, &cycle, tally);
      },
      cycle.stop);
}

}  // namespace asum
