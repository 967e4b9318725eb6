#include "collect/process_alerts.h"

#include "collect/alert_message.h"
#include "collect/when_text.h"
#include "extract/body_fields.h"
#include "extract/html_table.h"
#include "extract/subject.h"
#include "extract/text_ops.h"
#include "log/log.h"
#include "store/setting_db_management.h"

namespace asum {
namespace {

constexpr std::u16string_view kEmailAlert = u"Email Alert";
constexpr std::u16string_view kScriptAlert = u"Script Alert";
constexpr std::u16string_view kDataLeakage = u"Potential Data Leakage";
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
  row.alert_path = path;
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

  size_t index = 0;
  for (; index < files.size(); ++index) {
    if (stop != nullptr && stop->Requested()) break;
    const std::u16string& path = files[index];
    try {
      AlertAnalysis a = AnalyzeAlertFile(path, status, component);
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
      const std::u16string row_id = store.ExecuteScalar(u"SELECT last_insert_rowid()");
      if (MarkProcessed(path, &failure) != MarkResult::kFailed) {
        WriteLog(path + u"Successfully renamed");
        ++t.stored;
        continue;
      }
      // The file keeps its name and comes back next cycle; without its row
      // going too, every cycle would store the same alert once more.
      LogMarkFailure(path, failure);
      if (!row_id.empty() && store.ExecuteQuery(u"DELETE FROM AlertDB WHERE rowid = ?1", {row_id})) {
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
