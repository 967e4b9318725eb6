#include "install_view.h"

#include <algorithm>

#include "collect/cycle.h"
#include "collect/discovery.h"
#include "commands.h"
#include "platform/platform.h"
#include "store/database_probe.h"
#include "store/setting_db_management.h"

namespace asum::tool {

InstallPaths PathsOf(const std::u16string& install) {
  InstallPaths paths;
  paths.install = install;
  paths.summary_folder = CSettingDBManagement::AlertSummaryFolderPath(install);
  paths.database = CSettingDBManagement::DatabasePath(paths.summary_folder);
  paths.lock = CollectorLockPathIn(paths.summary_folder);
  return paths;
}

std::vector<ReportFolder> ReportFoldersOf(const std::u16string& install) {
  platform::Env& env = platform::Current();
  StringList components;
  GetComponentFolders(install, components);
  for (const char16_t* name : kFixedComponentFolders) {
    if (env.PathExists(install + platform::kPathSeparator + name)) components.push_back(name);
  }
  std::vector<ReportFolder> folders;
  StringList seen;
  for (const std::u16string& component : components) {
    if (std::find(seen.begin(), seen.end(), component) != seen.end()) continue;
    seen.push_back(component);
    const std::u16string reports =
        install + platform::kPathSeparator + component + platform::NativeSeparators(u"\\AlertReports");
    if (!env.PathExists(reports)) continue;
    for (const auto& [name, status] : {std::pair<const char16_t*, const char16_t*>{u"Sent items", u"Delivered"},
                                       {u"Outbox", u"Failed"}}) {
      const std::u16string path = reports + platform::kPathSeparator + name;
      if (env.PathExists(path)) folders.push_back({component, name, status, path});
    }
  }
  return folders;
}

std::vector<std::u16string> ProcessedFilesIn(const ReportFolder& folder) {
  std::vector<platform::DirEntry> entries;
  platform::Current().ListFolder(folder.path, u"*.eml*", &entries);
  std::vector<std::u16string> files;
  for (const platform::DirEntry& entry : entries) {
    if (!entry.is_folder && entry.name.rfind(u"PROC_", 0) == 0) files.push_back(entry.full_path);
  }
  return files;
}

void OpenForReading(CDbSQLite& db, const std::u16string& database) {
  if (!platform::Current().PathExists(database)) {
    throw ToolError(kExitFailure,
                    "no alert database at " + Utf8(database) + "; `alertsummary collect --once` creates it");
  }
  if (!IsDatabaseFile(database)) throw ToolError(kExitFailure, Utf8(database) + " is not an alert database");
  if (!db.OpenReadOnly(database)) throw ToolError(kExitFailure, "cannot open " + Utf8(database) + " for reading");
}

std::u16string QueryText(CDbSQLite& db, const std::u16string& sql) {
  std::unique_ptr<CSqlStatement> statement = db.Statement(sql);
  return statement->NextRow() ? statement->ValueString(0) : std::u16string();
}

bool HasAlertTable(CDbSQLite& db) {
  return QueryText(db, u"SELECT count(*) FROM sqlite_master WHERE type = 'table' AND name = 'AlertDB'") == u"1";
}

}  // namespace asum::tool
