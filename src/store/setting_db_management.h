// The alert summary database facade: where the file lives, opening it (and
// creating its table when the file is new), running statements with the
// store's retry and log rules, and inserting one alert row.
//
// One object is one connection for one operation on one thread: a processing
// call, a count or a purge each make their own, open it, use it and close it
// (the destructor closes what is still open). Objects are not shared between
// threads.
//
// Failures are results: false, or an empty text. Nothing is thrown except
// std::bad_alloc.
#pragma once

#include <string>
#include <vector>

#include "store/busy_budget.h"
#include "store/sqlite_db.h"

namespace asum {

// The host executable's folder: its path up to the last separator (empty when
// there is none).
std::u16string HostInstallFolder();

class CSettingDBManagement {
 public:
  // `budget` (may be null: lock conflicts then fail at once) bounds the
  // waiting for locks of this connection; it must outlive the object.
  explicit CSettingDBManagement(BusyBudget* budget = nullptr);
  virtual ~CSettingDBManagement() = default;
  CSettingDBManagement(const CSettingDBManagement&) = delete;
  CSettingDBManagement& operator=(const CSettingDBManagement&) = delete;

  // `install_folder` + separator (unless empty or already ending in one) +
  // "Alert_Summary"; the folder is created (one level) when missing, and a
  // failure to create it is ignored.
  static std::u16string GetAlertSummaryFolder(const std::u16string& install_folder);
  // The same folder's path, for readers that must not create it.
  static std::u16string AlertSummaryFolderPath(const std::u16string& install_folder);
  // The database file in a database folder: folder + "\AlertSummaryDB.db".
  static std::u16string DatabasePath(const std::u16string& summary_folder);

  // Opens the file, logging "Inside OpenDB function: " + path. A file that did
  // not exist before gets the AlertDB table (the result is then that of the
  // CREATE TABLE, except that a table another caller created meanwhile, two
  // first callers racing, counts as created). An existing database without
  // the table (left empty by a crash during its creation) gets it too, with a
  // log line; a file that is not a database is opened and left untouched.
  bool OpenDB(const std::u16string& path);
  bool CloseDB();

  // Up to seven attempts, each compiling the text afresh and binding
  // `params` to ?1, ?2, ...; logs "Inside ExecuteQuery function - Status: "
  // and "success" or "failure" after the first. True when an attempt ran.
  // (The statement of the last call is kept for the next call of the same
  // text; that changes nothing but the time a repeated statement takes.)
  bool ExecuteQuery(const std::u16string& sql, const std::vector<std::u16string>& params = {});
  // One attempt: column 0 of the first row, or empty.
  std::u16string ExecuteScalar(const std::u16string& sql, const std::vector<std::u16string>& params = {});

  // Logs "Inside FillDatainDB function" and inserts one alert row. Note the
  // parameter order: alert path comes before server name; each value lands in
  // its own column. Values are bound, so quotes are stored as they are; each
  // value ends before its first character of code 0.
  bool FillDatainDB(const std::u16string& alert_action, const std::u16string& alert_type,
                    const std::u16string& alert_name, const std::u16string& when,
                    const std::u16string& threshold, const std::u16string& who,
                    const std::u16string& operation, const std::u16string& component_name,
                    const std::u16string& email_status, const std::u16string& alert_path,
                    const std::u16string& server_name);

  CDbSQLite& Connection() { return db_; }

 private:
  bool CreateTable();
  bool HasAlertTable();
  void CreateMissingTable(const std::u16string& path);

  CDbSQLite db_;
  // The statement ExecuteQuery ran last, and its text; gone before db_ goes.
  std::unique_ptr<CSqlStatement> kept_;
  std::u16string kept_sql_;
};

// The log line's text after the first attempt of ExecuteQuery.
std::u16string ExecuteQueryStatusLine(bool succeeded);

}  // namespace asum
