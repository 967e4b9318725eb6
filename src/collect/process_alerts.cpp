#include "collect/process_alerts.h"

#include "collect/analysis_pipeline.h"
#include "log/log.h"
#include "store/setting_db_management.h"

namespace asum {
namespace {

enum class MarkResult { kRenamed, kDeleted, kFailed };

// Gives a file its PROC_ name, or deletes it when that name is taken. The
// rename refuses a taken name, so it is tried first: the existence test is
// needed only when it fails (a folder of that name may give another error).
MarkResult MarkProcessed(const std::u16string& path, platform::FileResult* failure) {
  platform::Env& env = platform::Current();
  const std::u16string target = ProcName(path);
  *failure = env.RenameNoReplace(path, target);
  if (failure->ok()) return MarkResult::kRenamed;
  if (failure->status != platform::FileStatus::kAlreadyExists && !env.PathExists(target)) return MarkResult::kFailed;
  *failure = env.RemoveFile(path);
  return failure->ok() ? MarkResult::kDeleted : MarkResult::kFailed;
}

void LogMarkFailure(const std::u16string& path, const platform::FileResult& failure) {
  WriteLog(path + u" could not be renamed to its PROC_ name: " + failure.Describe());
}

// A stored file that could not be marked keeps its name and comes back next
// cycle, so its row goes: otherwise every cycle would store the alert once
// more. A file that is gone (removed after it was read) never comes back, and
// its row is all that is left of the alert: that row stays. True when the row
// stays.
bool KeepRowOfUnmarkedFile(CSettingDBManagement& store, int64_t row_id, const std::u16string& path) {
  if (!platform::Current().PathExists(path)) {
    WriteLog(path + u" is gone; the row stored for it stays");
    return true;
  }
  if (row_id > 0 && store.RemoveAlert(row_id)) {
    WriteLog(u"Removed the row stored for " + path + u"; it is stored again when the file is processed");
  } else {
    WriteLog(u"Could not remove the row stored for " + path);
  }
  return false;
}

}  // namespace

std::u16string ProcName(const std::u16string& path) {
  return platform::FolderOf(path) + platform::kPathSeparator + u"PROC_" + platform::NameOf(path);
}

bool EnsureDatabase(const std::u16string& install_folder) {
  const std::u16string db_path = DatabasePathOf(install_folder);
  if (platform::Current().PathExists(db_path)) return true;
  CSettingDBManagement store;
  if (store.OpenDB(db_path)) store.CloseDB();
  return false;
}

void ProcessAlertFiles(const std::u16string& install_folder, StringList& files, const std::u16string& status,
                       const std::u16string& component, CycleContext* cycle, ProcessTally* tally) {
  CycleContext own_context;
  CycleContext& context = cycle != nullptr ? *cycle : own_context;
  ProcessTally own_counts;
  ProcessTally& counts = tally != nullptr ? *tally : own_counts;
  if (context.StopRequested()) {
    counts.left += files.size();
    return;
  }
  WriteLog(u"Inside void BEProcessSuccessfulAlerts::ProcessAlertFiles( CList<CString, CString>* strListofFilePaths)");
  // The first call of all only creates the database; the files wait for the
  // next cycle.
  if (!EnsureDatabase(install_folder)) {
    counts.left += files.size();
    return;
  }
  const std::u16string db_path = DatabasePathOf(install_folder);
  CSettingDBManagement store(&context.busy);
  if (!store.OpenDB(db_path)) {
    store.CloseDB();
    counts.left += files.size();
    return;
  }
  WriteLog(u"AlertSummaryDB opened");

  LookAhead ahead(files, status, component, context.stop);
  size_t index = 0;
  for (; index < files.size(); ++index) {
    if (context.StopRequested()) break;
    const std::u16string& path = files[index];
    try {
      AlertAnalysis analysis;
      if (!ahead.Take(index, &analysis) || analysis.outcome == AlertOutcome::kLeave) {
        ++counts.left;
        continue;
      }
      platform::FileResult failure;
      if (analysis.outcome == AlertOutcome::kMarkWithout) {
        if (MarkProcessed(path, &failure) == MarkResult::kFailed) {
          LogMarkFailure(path, failure);
          ++counts.left;
        } else {
          ++counts.marked;
        }
        continue;
      }
      WriteLog(u"Before calling \"FillDataDB\" function ");
      const bool inserted = store.FillDatainDB(analysis.row);
      WriteLog(u"After calling \"FillDataDB\" function ");
      if (!inserted) {
        WriteLog(u"Data is not inserted in DB");
        ++counts.left;
        continue;
      }
      const int64_t row_id = store.Connection().LastInsertRowId();
      if (MarkProcessed(path, &failure) != MarkResult::kFailed) {
        WriteLog(path + u"Successfully renamed");
        ++counts.stored;
        continue;
      }
      LogMarkFailure(path, failure);
      if (KeepRowOfUnmarkedFile(store, row_id, path)) {
        ++counts.stored;
      } else {
        ++counts.left;
      }
    } catch (...) {
      // Out of memory on one message: it stays for the next cycle.
      ++counts.left;
    }
  }
  counts.left += files.size() - index;
  store.CloseDB();
}

}  // namespace asum
