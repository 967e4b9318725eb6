#include "collect/cycle.h"

#include "common/utf.h"
#include "log/log.h"
#include "platform/platform.h"
#include "store/database_probe.h"
#include "store/setting_db_management.h"

namespace asum {
namespace {

using platform::NativeSeparators;

void WalkReportFolder(const std::u16string& report_folder, const char16_t* status,
                      const std::u16string& component, StringList& files,
                      const AlertFileProcessor& process) {
  files.clear();
  GetDomainFolders(report_folder, files);
  WriteLog(u"After calling GetDomainFolders Function: " + report_folder + u" path contains " +
           DecimalText(static_cast<int64_t>(files.size())) + u" file(s).");
  if (!files.empty()) process(files, status, component);
}

}  // namespace


void RunCollectionCycle(const std::u16string& install_folder, const AlertFileProcessor& process,
                        const platform::StopSignal* stop) {
  const auto stopped = [stop] { return stop != nullptr && stop->Requested(); };
  platform::Env& env = platform::Current();
  StringList components;
  GetComponentFolders(install_folder, components);
  for (const char16_t* name : kFixedComponentFolders) {
    if (!env.PathExists(install_folder + platform::kPathSeparator + name)) continue;
    components.push_back(name);
    if (std::u16string(name) == u"Anomaly Alerts") {
      WriteLog(u"Anomaly Alerts");
      WriteLog(install_folder);
    }
  }
  WriteLog(u"After calling GetDomainFolders Function: " + install_folder + u" path contains " +
           DecimalText(static_cast<int64_t>(components.size())) + u" Component(s).");

  StringList files;
  for (const std::u16string& name : components) {
    const std::u16string component = install_folder + platform::kPathSeparator + name;
    if (!env.PathExists(component + NativeSeparators(u"\\AlertReports"))) continue;
    const std::u16string sent = component + NativeSeparators(u"\\AlertReports\\Sent items");
    if (stopped()) return;
    if (env.PathExists(sent)) WalkReportFolder(sent, u"Delivered", name, files, process);
    const std::u16string outbox = component + NativeSeparators(u"\\AlertReports\\Outbox");
    if (stopped()) return;
    if (env.PathExists(outbox)) WalkReportFolder(outbox, u"Failed", name, files, process);
  }
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

CycleResult RunProcessingCycle(const std::u16string& install_folder, ProcessTally* tally, CycleContext* cycle,
                               const std::function<void()>& after_folder) {
  CycleContext own_context;
  CycleContext& context = cycle != nullptr ? *cycle : own_context;
  return RunLockedCycle(
      install_folder,
      [&](StringList& files, const std::u16string& status, const std::u16string& component) {
        ProcessAlertFiles(install_folder, files, status, component, &context, tally);
        if (after_folder) after_folder();
      },
      context.stop);
}

}  // namespace asum
