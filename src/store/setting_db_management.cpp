#include "store/setting_db_management.h"

#include "log/log.h"
#include "platform/platform.h"
#include "store/alert_table.h"

namespace asum {
namespace {

constexpr int kExecuteAttempts = 7;

std::unique_ptr<CSqlStatement> Prepare(CDbSQLite& db, const std::u16string& sql,
                                       const std::vector<std::u16string>& params) {
  std::unique_ptr<CSqlStatement> statement = db.Statement(sql);
  for (size_t i = 0; i < params.size(); ++i) statement->BindText(static_cast<int>(i + 1), params[i]);
  return statement;
}

}  // namespace

std::u16string HostInstallFolder() {
  const std::u16string exe = platform::Current().ExecutablePath();
  const size_t last = exe.rfind(platform::kPathSeparator);
  return last == std::u16string::npos ? std::u16string() : exe.substr(0, last);
}

std::u16string ExecuteQueryStatusLine(bool succeeded) {
  return std::u16string(u"Inside ExecuteQuery function - Status: ") + (succeeded ? u"success" : u"failure");
}

CSettingDBManagement::CSettingDBManagement(BusyBudget* budget) { db_.SetBusyBudget(budget); }

std::u16string CSettingDBManagement::AlertSummaryFolderPath(const std::u16string& install_folder) {
  std::u16string folder = install_folder;
  if (!folder.empty() && folder.back() != platform::kPathSeparator) folder += platform::kPathSeparator;
  return folder + u"Alert_Summary";
}

std::u16string CSettingDBManagement::GetAlertSummaryFolder(const std::u16string& install_folder) {
  const std::u16string folder = AlertSummaryFolderPath(install_folder);
  platform::Env& env = platform::Current();
  if (!env.PathExists(folder)) env.CreateFolder(folder);
  return folder;
}


std::u16string CSettingDBManagement::DatabasePath(const std::u16string& summary_folder) {
  return summary_folder + platform::NativeSeparators(u"\\AlertSummaryDB.db");
}

bool CSettingDBManagement::OpenDB(const std::u16string& path) {
  kept_.reset();
  const bool existed = platform::Current().PathExists(path);
  const bool opened = db_.Open(path);
  WriteLog(u"Inside OpenDB function: " + path);
  if (!existed) return CreateTable() || (opened && HasAlertTable());
  if (opened) CreateMissingTable(path);
  return opened;
}

bool CSettingDBManagement::CreateTable() { return db_.Statement(CreateAlertTableSql())->Execute(); }

bool CSettingDBManagement::HasAlertTable() {
  std::unique_ptr<CSqlStatement> probe =
      db_.Statement(u"SELECT count(*) FROM sqlite_master WHERE type = 'table' AND name = 'AlertDB'");
  return probe->NextRow() && probe->ValueString(0) == u"1";
}

void CSettingDBManagement::CreateMissingTable(const std::u16string& path) {
  // A process that died while first creating the file leaves a database
  // without its table; every insert would then fail forever. A file that is
  // not a database fails the probe and is left untouched.
  std::unique_ptr<CSqlStatement> probe =
      db_.Statement(u"SELECT count(*) FROM sqlite_master WHERE type = 'table' AND name = 'AlertDB'");
  if (!probe->NextRow() || probe->ValueString(0) != u"0") return;
  probe.reset();
  const bool created = CreateTable();
  WriteLog(u"AlertDB table missing in " + path + (created ? u"; created it" : u"; could not create it"));
}

bool CSettingDBManagement::CloseDB() {
  kept_.reset();
  return db_.Close();
}

bool CSettingDBManagement::ExecuteQuery(const std::u16string& sql, const std::vector<std::u16string>& params) {
  // The statement that last ran is kept and run again when the same text
  // comes back, as the insert does for every alert: compiling it afresh cost
  // the processing thread more than the rest of its share of an alert. A kept
  // statement that fails (a schema changed by another connection, a busy
  // database) is dropped, and the attempts go on exactly as with fresh
  // statements, the log line included.
  if (kept_ != nullptr && kept_sql_ == sql) {
    bool bound = true;
    for (size_t i = 0; i < params.size(); ++i) bound = kept_->BindText(static_cast<int>(i + 1), params[i]) && bound;
    if (bound && kept_->Execute()) {
      WriteLog(ExecuteQueryStatusLine(true));
      return true;
    }
    kept_.reset();
  }
  bool ok = false;
  for (int attempt = 0; !ok && attempt < kExecuteAttempts; ++attempt) {
    std::unique_ptr<CSqlStatement> statement = Prepare(db_, sql, params);
    ok = statement->Execute();
    if (attempt == 0) WriteLog(ExecuteQueryStatusLine(ok));
    if (ok) {
      kept_ = std::move(statement);
      kept_sql_ = sql;
    }
  }
  return ok;
}

std::u16string CSettingDBManagement::ExecuteScalar(const std::u16string& sql,
                                                   const std::vector<std::u16string>& params) {
  std::unique_ptr<CSqlStatement> statement = Prepare(db_, sql, params);
  return statement->NextRow() ? statement->ValueString(0) : std::u16string();
}

bool CSettingDBManagement::FillDatainDB(const std::u16string& alert_action, const std::u16string& alert_type,
                                        const std::u16string& alert_name, const std::u16string& when,
                                        const std::u16string& threshold, const std::u16string& who,
                                        const std::u16string& operation, const std::u16string& component_name,
                                        const std::u16string& email_status, const std::u16string& alert_path,
                                        const std::u16string& server_name) {
  WriteLog(u"Inside FillDatainDB function");
  // Bound rather than spliced: a quote in a subject must not break the
  // statement and keep the alert out of the table in every cycle.
  return ExecuteQuery(u"INSERT into AlertDB VALUES(?,?,?,?,?,?,?,?,?, ?, ?)",
                      {alert_action, alert_type, alert_name, when, threshold, who, operation, component_name,
                       email_status, server_name, alert_path});
}

}  // namespace asum
