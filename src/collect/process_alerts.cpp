#include "collect/process_alerts.h"

#include <algorithm>
#include <condition_variable>
#include <mutex>
#include <vector>

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
  if (row_id > 0 && store.ExecuteQuery(u"DELETE FROM AlertDB WHERE rowid = ?1", {DecimalText(row_id)})) {
    WriteLog(u"Removed the row stored for " + path + u"; it is stored again when the file is processed");
  } else {
    WriteLog(u"Could not remove the row stored for " + path);
  }
  return false;
}

// Reads and classifies the next files on a helper thread while the current one
// is stored: the commit waits on the disk and the analysis on a processor, so
// with two cores a cycle runs at nearly the pace of its commits. The helper
// keeps a few files ahead, so that one slow file, or a moment in which a busy
// machine gives it no processor, does not hold up the commits.
//
// Only while the log is off. The log wants each line written as it happens,
// on the processing thread, so that the last file it names is the one in
// hand should reading a file bring the process down. So the helper writes
// nothing, and a file it analysed while the log was switched on is analysed
// again here; while the log is on, no file is analysed ahead.
class LookAhead {
 public:
  LookAhead(const StringList& files, const std::u16string& status, const std::u16string& component,
            const CycleContext& cycle)
      : files_(files), status_(status), component_(component), cycle_(cycle) {}

  // Waits for the helper's file in hand; it starts no other.
  ~LookAhead() {
    if (thread_ == nullptr) return;
    std::unique_lock<std::mutex> lock(mutex_);
    closing_ = true;
    changed_.notify_all();
    changed_.wait(lock, [&] { return finished_; });
    lock.unlock();
    // It has left everything of ours; the join only releases the thread.
    platform::Current().JoinThread(thread_, kJoinMs);
  }

  // The analysis of files[index], taken in order 0, 1, 2, ... False when it
  // failed (out of memory).
  bool Take(size_t index, AlertAnalysis* out) {
    const bool log_on = LogEnabled();
    const bool ahead = !log_on && !cycle_.StopRequested();
    Result result;
    if (thread_ != nullptr) {
      std::unique_lock<std::mutex> lock(mutex_);
      if (!log_on) changed_.wait(lock, [&] { return busy_ != index; });
      for (Result& ready : ready_) {
        if (ready.index == index && !log_on) result = std::move(ready);
      }
      std::erase_if(ready_, [&](const Result& ready) { return log_on || ready.index <= index; });
      next_ = log_on ? index + 1 : std::max(next_, index + 1);
      end_ = ahead ? std::min(index + 1 + kAhead, files_.size()) : next_;
      lock.unlock();
      changed_.notify_all();
    } else if (ahead && index + 1 < files_.size() && !failed_to_start_) {
      next_ = index + 1;
      end_ = std::min(index + 1 + kAhead, files_.size());
      thread_ = platform::Current().StartThread(&LookAhead::Main, this);
      failed_to_start_ = thread_ == nullptr;
    }
    if (!result.ok) result = Analyze(index);
    *out = std::move(result.analysis);
    return result.ok;
  }

 private:
  static constexpr size_t kNone = static_cast<size_t>(-1);
  static constexpr size_t kAhead = 3;
  static constexpr uint32_t kJoinMs = 60000;

  struct Result {
    size_t index = kNone;
    AlertAnalysis analysis;
    bool ok = false;
  };

  Result Analyze(size_t index) const {
    Result result;
    result.index = index;
    try {
      result.analysis = AnalyzeAlertFile(files_[index], status_, component_);
      // Only the row and the outcome are needed; the message's texts go on
      // the thread that made them rather than on the one that commits.
      result.analysis.sender = std::u16string();
      result.analysis.subject = std::u16string();
      result.analysis.body = std::u16string();
      result.ok = true;
    } catch (...) {
    }
    return result;
  }

  static void Main(void* self) { static_cast<LookAhead*>(self)->Work(); }

  void Work() {
    SilencedLog silenced;
    std::unique_lock<std::mutex> lock(mutex_);
    for (;;) {
      changed_.wait(lock, [&] { return closing_ || next_ < end_; });
      if (closing_) break;
      busy_ = next_++;
      lock.unlock();
      Result result = Analyze(busy_);
      lock.lock();
      busy_ = kNone;
      try {
        ready_.push_back(std::move(result));
      } catch (...) {
        // Out of memory: the file is analysed again in its turn.
      }
      changed_.notify_all();
    }
    finished_ = true;
    changed_.notify_all();
  }

  const StringList& files_;
  const std::u16string& status_;
  const std::u16string& component_;
  const CycleContext& cycle_;
  platform::ThreadHandle thread_ = nullptr;
  bool failed_to_start_ = false;

  std::mutex mutex_;
  std::condition_variable changed_;
  size_t next_ = 0;        // the file the helper analyses next
  size_t end_ = 0;         // ... as long as it is below this
  size_t busy_ = kNone;    // the file the helper is analysing
  std::vector<Result> ready_;  // analysed, not taken yet
  bool closing_ = false;
  bool finished_ = false;
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
                       const std::u16string& component, CycleContext* cycle, ProcessTally* tally) {
  CycleContext own;
  CycleContext& c = cycle != nullptr ? *cycle : own;
  ProcessTally local;
  ProcessTally& t = tally != nullptr ? *tally : local;
  if (c.StopRequested()) {
    t.left += files.size();
    return;
  }
  WriteLog(u"Inside void BEProcessSuccessfulAlerts::ProcessAlertFiles( CList<CString, CString>* strListofFilePaths)");
  // The first call of all only creates the database; the files wait for the
  // next cycle.
  if (!EnsureDatabase(install_folder)) {
    t.left += files.size();
    return;
  }
  const std::u16string db_path =
      CSettingDBManagement::DatabasePath(CSettingDBManagement::GetAlertSummaryFolder(install_folder));
  CSettingDBManagement store(&c.busy);
  if (!store.OpenDB(db_path)) {
    store.CloseDB();
    t.left += files.size();
    return;
  }
  WriteLog(u"AlertSummaryDB opened");

  LookAhead ahead(files, status, component, c);
  size_t index = 0;
  for (; index < files.size(); ++index) {
    if (c.StopRequested()) break;
    const std::u16string& path = files[index];
    try {
      AlertAnalysis a;
      if (!ahead.Take(index, &a) || a.outcome == AlertOutcome::kLeave) {
        ++t.left;
        continue;
      }
      platform::FileResult failure;
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
      LogMarkFailure(path, failure);
      if (KeepRowOfUnmarkedFile(store, row_id, path)) {
        ++t.stored;
      } else {
        ++t.left;
      }
    } catch (...) {
      // Out of memory on one message: it stays for the next cycle.
      ++t.left;
    }
  }
  t.left += files.size() - index;
  store.CloseDB();
}

}  // namespace asum
