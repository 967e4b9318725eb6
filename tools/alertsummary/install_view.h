// What the readers of the tool (count, report, status, audit) see of an
// install folder, worked out without creating or changing anything: no
// "Alert_Summary" folder, no database, no lock file.
#pragma once

#include <string>
#include <vector>

#include "store/sqlite_db.h"

namespace asum::tool {

struct InstallPaths {
  std::u16string install;
  std::u16string summary_folder;
  std::u16string database;
  std::u16string lock;
};
InstallPaths PathsOf(const std::u16string& install);

// One report folder as the collection cycle visits it.
struct ReportFolder {
  std::u16string component;  // the component folder's name
  std::u16string name;       // "Sent items" or "Outbox"
  std::u16string status;     // "Delivered" or "Failed"
  std::u16string path;
};

// Every report folder that exists, in the order a cycle visits them, each
// once (a cycle may visit a component twice; its second visit finds nothing new).
std::vector<ReportFolder> ReportFoldersOf(const std::u16string& install);

// The "PROC_" files of a report folder (full paths), as the directory search lists them.
std::vector<std::u16string> ProcessedFilesIn(const ReportFolder& folder);

// Opens the database for reading only. ToolError (exit 1) when it is missing
// or is not a database; a database without the alert table opens.
void OpenForReading(CDbSQLite& db, const std::u16string& database);

// The first column of the first row of `sql`, or empty.
std::u16string QueryText(CDbSQLite& db, const std::u16string& sql);

// True when the database holds the AlertDB table.
bool HasAlertTable(CDbSQLite& db);

}  // namespace asum::tool
