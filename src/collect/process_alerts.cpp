#include "collect/process_alerts.h"

#include <condition_variable>
#include <mutex>
#include <thread>

#include "collect/alert_message.h"
#include "common/utf.h"
#include "collect/when_text.h"
#include "extract/alert_values.h"
#include "extract/body_fields.h"
#include "extract/html_table.h"
#include "extract/subject.h"
#include "extract/text_ops.h"
#include "log/log.h"
#include "store/setting_db_management.h"

namespace asum {
namespace {

constexpr std::u16string_view kOutsideHours = u"Activity Outside of Business Hours";
constexpr std::u16string_view kEnvironmentChanges = u"All Environment Changes";

bool IsActivityCategory(const std::u16string& category) {
  return category == kOutsideHours || category == kEnvironmentChanges;
}

// The performer of a script alert, from the body's "Who  :" paragraph.
std::u16string ScriptAlertWho(const std::u16string& body) {
  const std::ptrdiff_t at = Find(body, u"Who  :");
  if (at < 0) return {};
  std::u16string text = Replace(Mid(body, at), u"Who  :", u"");
  text = Replace(TrimLeft(text), u"</b>", u"");
  // Without a paragraph end there is no name: Left(-1) is empty.
  return DecodeHtmlNumericEntities(Left(text, Find(text, u"</p>")));
}

enum class MarkResult { kRenamed, kDeleted, kFailed };

// Gives a file its PROC_ name, or deletes it when that name is taken.
MarkResult MarkProcessed(const std::u16string& path, platform::FileResult* failure) {
  platform::Env& env = platform::Current();
  const std::u16string target = ProcName(path);
  if (!env.PathExists(target)) {
    *failure = env.RenameNoReplace(path, target);
    if (failure->ok()) return MarkResult::kRenamed;
    if (failure->status != platform::FileStatus::kAlreadyExists) return MarkResult::kFailed;
  }
  *failure = env.RemoveFile(path);
  return failure->ok() ? MarkResult::kDeleted : MarkResult::kFailed;
}

void LogMarkFailure(const std::u16string& path, const platform::FileResult& failure) {
  WriteLog(path + u" could not be renamed to its PROC_ name: " + failure.Describe());
}

// Reads and classifies the next file on a helper thread while the current one
// is stored: the commit waits on the disk and the analysis on a processor, so
// with two cores a cycle runs at nearly the pace of its commits. The helper's
// log lines are held back and written when its file's turn comes, so the log
// reads exactly as if one thread had done everything.
class AnalysisPipeline {
 public:
  AnalysisPipeline(const StringList& files, const std::u16string& status, const std::u16string& component)
      : files_(files), status_(status), component_(component) {
    try {
      worker_ = std::thread([this] { Work(); });
    } catch (...) {
      // No thread to be had: every file is analysed in turn on the caller's.
    }
  }

  ~AnalysisPipeline() {
    {
      std::lock_guard<std::mutex> lock(mutex_);
      closing_ = true;
    }
    changed_.notify_all();
    if (worker_.joinable()) worker_.join();
  }

  // The analysis of files[index], taken in order 0, 1, 2, ...; its held-back
  // log lines are written first. False when it failed (out of memory).
  bool Next(size_t index, AlertAnalysis* out) {
    Result result;
    if (worker_.joinable()) {
      std::unique_lock<std::mutex> lock(mutex_);
      changed_.wait(lock, [&] { return ready_; });
      result = std::move(slot_);
      ready_ = false;
      wanted_ = index + 1;
      lock.unlock();
      changed_.notify_all();
    } else {
      result = Analyze(index);
    }
    for (const std::u16string& line : result.log) WriteLog(line);
    *out = std::move(result.analysis);
    return result.ok;
  }

 private:
  struct Result {
    AlertAnalysis analysis;
    std::vector<std::u16string> log;
    bool ok = false;
  };

  Result Analyze(size_t index) {
    Result result;
    DeferredLog deferred;
    try {
      result.analysis = AnalyzeAlertFile(files_[index], status_, component_);
      result.ok = true;
    } catch (...) {
    }
    result.log = deferred.Take();
    return result;
  }

  void Work() {
    for (size_t index = 0; index < files_.size(); ++index) {
      {
        std::unique_lock<std::mutex> lock(mutex_);
        changed_.wait(lock, [&] { return closing_ || wanted_ >= index; });
        if (closing_) return;
      }
      Result result = Analyze(index);
      {
        std::unique_lock<std::mutex> lock(mutex_);
        changed_.wait(lock, [&] { return closing_ || !ready_; });
        if (closing_) return;
        slot_ = std::move(result);
        ready_ = true;
      }
      changed_.notify_all();
    }
  }

  const StringList& files_;
  const std::u16string& status_;
  const std::u16string& component_;
  std::mutex mutex_;
  std::condition_variable changed_;
  Result slot_;
  bool ready_ = false;
  bool closing_ = false;
  size_t wanted_ = 0;  // the worker analyses files up to this index ahead
  std::thread worker_;
};

}  // namespace

std::u16string ProcName(const std::u16string& path) {
  const size_t cut = path.rfind(platform::kPathSeparator);
  const std::u16string folder = cut == std::u16string::npos ? std::u16string() : path.substr(0, cut);
  const std::u16string name = cut == std::u16string::npos ? path : path.substr(cut + 1);
  return folder + platform::kPathSeparator + u"PROC_" + name;
}

AlertAnalysis AnalyzeAlertFile(const std::u16string& path, const std::u16string& status,
                               const std::u16string& component) {
  AlertAnalysis a;
  AlertMessage message;
  if (!LoadAlertMessage(path, &message)) return a;
  a.loaded = true;
  a.sender = std::move(message.sender);
  a.subject = std::move(message.subject);
  a.body = std::move(message.body);
  a.local_date = message.local_date;

  AlertRow& row = a.row;
  row.when = FormatWhen(a.local_date);
  row.email_status = status;
  row.alert_path = DisplayText(path);
  if (a.subject.empty() || a.body.empty()) {
    WriteLog(u"Alert subject and body are empty.");
    a.outcome = AlertOutcome::kMarkWithout;
    return a;
  }

  std::u16string category;
  BodyFieldReader fields(a.body);
  if (component == u"Predefine Alerts") {
    GetSomeInfoFromScriptSubject(a.subject, row.alert_action, row.threshold, row.alert_type, row.alert_name,
                                 category);
    row.component_name = ParseHtmlBodyToGetComponentInfo(a.body, row.alert_action);
    if (row.component_name.empty() && row.alert_name == kDataLeakage) row.component_name = u"Exchange Server";
    if (row.alert_action == kEmailAlert) row.server_name = fields.FieldData(u"Server");
  } else {
    GetSomeInfoFromScriptSubject(a.subject, row.alert_action, row.threshold, row.alert_type, row.alert_name,
                                 row.component_name, row.server_name, category);
  }

  if (row.alert_action == kEmailAlert) {
    if (IsActivityCategory(category)) {
      row.component_name = fields.FieldData(u"Component Name");
      row.server_name = fields.FieldData(u"Server Name");
    }
    row.who = fields.FieldData(u"Who");
    row.operation = fields.FieldData(u"Operation");
    if (row.who.empty() && row.alert_name == kDataLeakage) row.who = a.sender;
  } else if (row.component_name.empty() && IsActivityCategory(category)) {
    row.component_name = ParseHtmlBodyToGetComponentInfo(a.body, row.alert_action);
  }

  WriteLog(u"After calling \"ParseHtmlBodyAndGetFieldData\" function Who & Operation Fields are " + row.who +
           u" & " + row.operation);

  if (row.who.empty() && row.alert_action == kScriptAlert) row.who = ScriptAlertWho(a.body);
  if (row.who.empty() && category == u"Account Lockout Report") row.who = u"N\\A";
  if (row.operation.empty()) row.operation = category;

  a.outcome = row.alert_type.empty() ? AlertOutcome::kMarkWithout : AlertOutcome::kStore;
  return a;
}

bool EnsureDatabase(const std::u16string& install_folder) {
  const std::u16string db_path =
      CSettingDBManagement::DatabasePath(CSettingDBManagement::GetAlertSummaryFolder(install_folder));
  if (platform::Current().PathExists(db_path)) return true;
  CSettingDBManagement store;
  if (store.OpenDB(db_path)) store.CloseDB();
  return false;
}

void ProcessAlertFiles(const std::u16string& install_folder, StringList& files, const std::u16string& status,
                       const std::u16string& component, const platform::StopSignal* stop, ProcessTally* tally) {
  ProcessTally local;
  ProcessTally& t = tally != nullptr ? *tally : local;
  WriteLog(u"Inside void BEProcessSuccessfulAlerts::ProcessAlertFiles( CList<CString, CString>* strListofFilePaths)");
  // The first call of all only creates the database; the files wait for the
  // next cycle.
  if (!EnsureDatabase(install_folder)) {
    t.left += files.size();
    return;
  }
  const std::u16string db_path =
      CSettingDBManagement::DatabasePath(CSettingDBManagement::GetAlertSummaryFolder(install_folder));
  // One budget for the whole call: a database another program keeps locked
  // costs this call a few seconds, not a timeout per file.
  BusyBudget budget(kProcessingBusyBudgetMs);
  CSettingDBManagement store(&budget);
  if (!store.OpenDB(db_path)) {
    store.CloseDB();
    t.left += files.size();
    return;
  }
  WriteLog(u"AlertSummaryDB opened");

  AnalysisPipeline pipeline(files, status, component);
  size_t index = 0;
  for (; index < files.size(); ++index) {
    if (stop != nullptr && stop->Requested()) break;
    const std::u16string& path = files[index];
    try {
      AlertAnalysis a;
      if (!pipeline.Next(index, &a)) {
        ++t.left;
        continue;
      }
      platform::FileResult failure;
      if (a.outcome == AlertOutcome::kLeave) {
        ++t.left;
        continue;
      }
      if (a.outcome == AlertOutcome::kMarkWithout) {
        if (MarkProcessed(path, &failure) == MarkResult::kFailed) {
          LogMarkFailure(path, failure);
          ++t.left;
        } else {
          ++t.marked;
        }
        continue;
      }
      const AlertRow& r = a.row;
      WriteLog(u"Before calling \"FillDataDB\" function ");
      const bool inserted = store.FillDatainDB(r.alert_action, r.alert_type, r.alert_name, r.when, r.threshold, r.who,
                                               r.operation, r.component_name, r.email_status, r.alert_path,
                                               r.server_name);
      WriteLog(u"After calling \"FillDataDB\" function ");
      if (!inserted) {
        WriteLog(u"Data is not inserted in DB");
        ++t.left;
        continue;
      }
      const int64_t row_id = store.Connection().LastInsertRowId();
      if (MarkProcessed(path, &failure) != MarkResult::kFailed) {
        WriteLog(path + u"Successfully renamed");
        ++t.stored;
        continue;
      }
      // The file keeps its name and comes back next cycle; without its row
      // going too, every cycle would store the same alert once more.
      LogMarkFailure(path, failure);
      if (row_id > 0 && store.ExecuteQuery(u"DELETE FROM AlertDB WHERE rowid = ?1", {DecimalText(row_id)})) {
        WriteLog(u"Removed the row stored for " + path + u"; it is stored again when the file is processed");
      } else {
        WriteLog(u"Could not remove the row stored for " + path);
      }
      ++t.left;
    } catch (...) {
      // Out of memory on one message: it stays for the next cycle.
      ++t.left;
    }
  }
  t.left += files.size() - index;
  store.CloseDB();
}

}  // namespace asum
