// audit: every processed file should have its row, and no alert should be
// stored twice. A crash between a commit and a rename, a database restored
// from an old copy or a hand edit breaks that silently; this finds it, and
// with --fix mends what can be mended without ever bringing back what
// retention removed.
#include <algorithm>
#include <cstdio>
#include <memory>
#include <nlohmann/json.hpp>
#include <optional>
#include <unordered_map>
#include <unordered_set>

#include "collect/process_alerts.h"
#include "commands.h"
#include "install_view.h"
#include "platform/platform.h"
#include "progress.h"
#include "store/alert_table.h"
#include "store/busy_budget.h"
#include "store/retention.h"
#include "store/retention_settings.h"

namespace asum::tool {
namespace {

using Json = nlohmann::ordered_json;

// A file's path below the install folder: component, "AlertReports", report
// folder, file name.
constexpr size_t kRelativeElements = 4;

struct AuditOptions {
  CommonOptions common;
  bool fix = false;
  std::string format = "table";
};

struct ProcessedFile {
  std::u16string path;      // its PROC_ name
  std::u16string original;  // the name it had when it was stored
  const ReportFolder* folder = nullptr;
  std::u16string ending;    // its path below the install folder, original name, '/' separators
  size_t elements = 0;      // path elements of `ending`
};

struct Unsure {
  std::u16string file;
  std::string why;
};

struct Findings {
  uint64_t files = 0, fine = 0, purged = 0, marked = 0, rows_without_file = 0;
  std::vector<const ProcessedFile*> missing;
  std::vector<Unsure> unsure;
  std::vector<std::pair<std::vector<int64_t>, std::u16string>> duplicates;  // rowids (lowest first), path
};

bool IsSeparator(char16_t c) { return c == u'\\' || c == u'/'; }

// Both separators read as '/', so a path written on the other platform, or an
// install folder reached through another path, still matches.
std::u16string Normalized(std::u16string path) {
  std::replace(path.begin(), path.end(), u'\\', u'/');
  return path;
}

// The last `elements` path elements of a normalized path, when a separator
// stands before them; empty otherwise.
std::u16string Ending(const std::u16string& normalized, size_t elements) {
  size_t at = normalized.size();
  for (size_t found = 0; found < elements; ++found) {
    if (at == 0) return {};
    at = normalized.rfind(u'/', at - 1);
    if (at == std::u16string::npos) return {};
  }
  return normalized.substr(at + 1);
}

// The path with "PROC_" before its file name, for either separator.
std::u16string ProcNameOf(const std::u16string& path) {
  const auto last = std::find_if(path.rbegin(), path.rend(), IsSeparator);
  const size_t cut = last == path.rend() ? 0 : static_cast<size_t>(path.rend() - last);
  return path.substr(0, cut) + u"PROC_" + path.substr(cut);
}

std::vector<ProcessedFile> ProcessedFiles(const std::u16string& install, const std::vector<ReportFolder>& folders) {
  std::vector<ProcessedFile> files;
  for (const ReportFolder& folder : folders) {
    for (std::u16string& path : ProcessedFilesIn(folder)) {
      const size_t name_at = path.rfind(platform::kPathSeparator) + 1;
      ProcessedFile file;
      file.original = path.substr(0, name_at) + path.substr(name_at + 5);
      file.ending = Normalized(file.original.substr(install.size() + 1));
      file.elements = static_cast<size_t>(std::count(file.ending.begin(), file.ending.end(), u'/')) + 1;
      file.path = std::move(path);
      file.folder = &folder;
      files.push_back(std::move(file));
    }
  }
  return files;
}

// What the stored rows say, read in one pass: the endings of their paths
// (one set per ending length the files need), the oldest dated "When", and
// how many rows have no file under either name.
struct RowIndex {
  std::unordered_map<size_t, std::unordered_set<std::u16string>> endings;
  std::optional<std::u16string> oldest_when;
  uint64_t without_file = 0;
};

bool FileOfRowExists(const std::u16string& install, const std::u16string& path,
                     const std::unordered_set<std::u16string>& processed_endings) {
  const std::u16string ending = Ending(Normalized(path), kRelativeElements);
  if (!ending.empty() && processed_endings.count(ending) > 0) return true;
  platform::Env& env = platform::Current();
  if (env.PathExists(path) || env.PathExists(ProcNameOf(path))) return true;
  if (ending.empty()) return false;
  std::u16string here = install + platform::kPathSeparator + ending;
  std::replace(here.begin(), here.end(), u'/', platform::kPathSeparator);
  return env.PathExists(here) || env.PathExists(ProcNameOf(here));
}

RowIndex ReadRows(CDbSQLite& db, const std::u16string& install, const std::vector<ProcessedFile>& files) {
  RowIndex index;
  std::unordered_set<std::u16string> processed_endings;
  for (const ProcessedFile& file : files) {
    index.endings[file.elements];
    if (file.elements == kRelativeElements) processed_endings.insert(file.ending);
  }
  std::unique_ptr<CSqlStatement> rows = db.Statement(u"SELECT \"When\", \"Alert Path\" FROM AlertDB");
  while (rows->NextRow()) {
    // Only a dated row tells how far purges reached: one of an unusable date
    // ("-1/-1/-1 -1:-1:-1") sorts first but may have come after the last purge.
    const std::u16string when = rows->ValueString(0);
    const bool dated = !when.empty() && when[0] >= u'0' && when[0] <= u'9';
    if (dated && (!index.oldest_when || when < *index.oldest_when)) index.oldest_when = when;
    const std::u16string path = rows->ValueString(1);
    const std::u16string normalized = Normalized(path);
    for (auto& [elements, endings] : index.endings) {
      std::u16string ending = Ending(normalized, elements);
      if (!ending.empty()) endings.insert(std::move(ending));
    }
    if (!FileOfRowExists(install, path, processed_endings)) ++index.without_file;
  }
  return index;
}

std::vector<std::pair<std::vector<int64_t>, std::u16string>> Duplicates(CDbSQLite& db) {
  std::u16string columns;
  for (const char16_t* column : kAlertColumns) columns += (columns.empty() ? u"\"" : u", \"") + std::u16string(column) + u"\"";
  std::unique_ptr<CSqlStatement> groups = db.Statement(u"SELECT group_concat(rowid), \"Alert Path\" FROM AlertDB GROUP BY " +
                                                       columns + u" HAVING count(*) > 1");
  std::vector<std::pair<std::vector<int64_t>, std::u16string>> out;
  while (groups->NextRow()) {
    std::vector<int64_t> rowids;
    const std::string list = Utf8(groups->ValueString(0));
    for (size_t at = 0; at < list.size();) {
      size_t used = 0;
      rowids.push_back(std::stoll(list.substr(at), &used));
      at += used + 1;
    }
    std::sort(rowids.begin(), rowids.end());
    out.emplace_back(std::move(rowids), groups->ValueString(1));
  }
  std::sort(out.begin(), out.end());
  return out;
}

// The clock the analysis sees: every field of its UTC "now" is impossible, so
// a message date that had to be mended from the clock comes back holding one
// of them (and cannot be converted). Such a file's "When" depends on the day
// it was processed, so no row can be looked for by it.
class DateRepairProbe : public platform::Env {
 public:
  static constexpr uint16_t kImpossible = 0xFFFF;
  platform::SystemTime UtcNow() override {
    platform::SystemTime t;
    t.year = t.month = t.day = t.hour = t.minute = t.second = kImpossible;
    return t;
  }
  static bool Repaired(const platform::SystemTime& t) {
    for (uint16_t field : {t.year, t.month, t.hour, t.minute, t.second}) {
      if (field == kImpossible) return true;
    }
    return false;
  }
};

Findings Audit(CDbSQLite& db, const std::u16string& install, const std::vector<ProcessedFile>& files) {
  Findings found;
  found.files = files.size();
  const RowIndex rows = ReadRows(db, install, files);
  found.rows_without_file = rows.without_file;
  const bool retention = ReadRetentionSetting(kRetentionEnabledSetting, kRetentionEnabledDefault) == u"TRUE";
  const std::u16string cutoff =
      CutoffText(platform::Current().LocalNow(),
                 RetentionDays(ReadRetentionSetting(kRetentionDaysSetting, kRetentionDaysDefault)));

  Progress progress(files.size());
  DateRepairProbe probe;
  platform::ScopedEnv clock(&probe);
  uint64_t done = 0;
  for (const ProcessedFile& file : files) {
    progress.Advance(++done);
    const AlertAnalysis a = AnalyzeAlertFile(file.path, file.folder->status, file.folder->component);
    if (a.loaded && a.outcome == AlertOutcome::kMarkWithout) {
      ++found.marked;
    } else if (!a.loaded || a.outcome != AlertOutcome::kStore) {
      found.unsure.push_back({file.path, "cannot be read now"});
    } else if (DateRepairProbe::Repaired(a.local_date)) {
      found.unsure.push_back({file.path, "no usable message date: its \"When\" depends on the day it was processed"});
    } else if (rows.endings.at(file.elements).count(file.ending) > 0) {
      ++found.fine;
    } else if (retention && a.row.when <= cutoff) {
      ++found.purged;
    } else if (!rows.oldest_when || a.row.when < *rows.oldest_when) {
      found.unsure.push_back({file.path, "older than every stored alert: a purge under other settings may have removed it"});
    } else {
      found.missing.push_back(&file);
    }
  }
  found.duplicates = Duplicates(db);
  return found;
}

struct Fixed {
  uint64_t rows_deleted = 0, files_reoffered = 0;
  std::vector<Unsure> failed;
};

Fixed Fix(const std::u16string& database, const Findings& found) {
  Fixed fixed;
  BusyBudget budget(kQueryBusyTimeoutMs);
  CDbSQLite db;
  db.SetBusyBudget(&budget);
  uint64_t extra = 0;
  for (const auto& group : found.duplicates) extra += group.first.size() - 1;
  if (extra > 0 && db.Open(database)) {
    // One transaction: either every extra copy goes or none does.
    bool ok = db.Statement(u"BEGIN IMMEDIATE")->Execute();
    std::unique_ptr<CSqlStatement> remove = db.Statement(u"DELETE FROM AlertDB WHERE rowid = ?1");
    for (const auto& [rowids, path] : found.duplicates) {
      for (size_t i = 1; ok && i < rowids.size(); ++i) {
        ok = remove->BindText(1, Utf16(std::to_string(rowids[i]))) && remove->Execute();
      }
    }
    remove.reset();
    if (ok && db.Statement(u"COMMIT")->Execute()) {
      fixed.rows_deleted = extra;
    } else {
      db.Statement(u"ROLLBACK")->Execute();
    }
  }
  if (fixed.rows_deleted != extra) {
    fixed.failed.push_back({database, "the extra copies could not be deleted (database locked or read-only)"});
  }
  for (const ProcessedFile* file : found.missing) {
    const platform::FileResult moved = platform::Current().RenameNoReplace(file->path, file->original);
    if (moved.ok()) {
      ++fixed.files_reoffered;
    } else {
      fixed.failed.push_back({file->path, moved.status == platform::FileStatus::kAlreadyExists
                                              ? "its original name is taken"
                                              : "cannot be renamed: " + Utf8(moved.Describe())});
    }
  }
  return fixed;
}

Json UnsureJson(const std::vector<Unsure>& list) {
  Json out = Json::array();
  for (const Unsure& u : list) out.push_back(Json{{"file", Utf8(u.file)}, {"why", u.why}});
  return out;
}

Json ToJson(const Findings& found, const Fixed* fixed) {
  Json missing = Json::array(), duplicates = Json::array();
  for (const ProcessedFile* file : found.missing) {
    missing.push_back(Json{{"file", Utf8(file->path)}, {"original", Utf8(file->original)}});
  }
  for (const auto& [rowids, path] : found.duplicates) {
    duplicates.push_back(Json{{"rowids", rowids}, {"alert_path", Utf8(path)}});
  }
  Json out{{"missing", missing},   {"duplicates", duplicates},          {"purged", found.purged},
           {"marked", found.marked}, {"unsure", UnsureJson(found.unsure)}, {"rows_without_file", found.rows_without_file}};
  if (fixed != nullptr) {
    out["fixed"] = Json{{"rows_deleted", fixed->rows_deleted},
                        {"files_reoffered", fixed->files_reoffered},
                        {"failed", UnsureJson(fixed->failed)}};
  }
  return out;
}

void PrintTable(const Findings& found, const Fixed* fixed) {
  const auto line = [](const char* label, uint64_t n) { std::printf("%-19s%llu\n", label, static_cast<unsigned long long>(n)); };
  line("PROC_ files read", found.files);
  line("fine", found.fine);
  line("missing", found.missing.size());
  for (const ProcessedFile* f : found.missing) std::printf("  %s (was %s)\n", Utf8(f->path).c_str(), Utf8(f->original).c_str());
  line("duplicate groups", found.duplicates.size());
  for (const auto& [rowids, path] : found.duplicates) {
    std::string ids;
    for (int64_t id : rowids) ids += (ids.empty() ? "" : ", ") + std::to_string(id);
    std::printf("  rowids %s: %s\n", ids.c_str(), Utf8(path).c_str());
  }
  line("purged", found.purged);
  line("marked", found.marked);
  line("unsure", found.unsure.size());
  for (const Unsure& u : found.unsure) std::printf("  %s: %s\n", Utf8(u.file).c_str(), u.why.c_str());
  line("rows without file", found.rows_without_file);
  if (fixed == nullptr) return;
  std::printf("fixed: deleted %llu duplicate row(s), re-offered %llu file(s) under their original names\n",
              static_cast<unsigned long long>(fixed->rows_deleted),
              static_cast<unsigned long long>(fixed->files_reoffered));
  for (const Unsure& u : fixed->failed) std::printf("  not mended: %s: %s\n", Utf8(u.file).c_str(), u.why.c_str());
}

}  // namespace

Runner AddAudit(CLI::App& app) {
  auto* sub = app.add_subcommand(
      "audit",
      "Check that every processed (PROC_) file has its row and no alert is stored twice; exit 3 when something is "
      "missing or duplicated");
  auto options = std::make_shared<AuditOptions>();
  AddCommonOptions(*sub, options->common);
  sub->add_flag("--fix", options->fix,
                "Under the collector lock, delete every duplicate but the lowest rowid and give each missing file its "
                "original name back, so the next cycle stores it (never deletes a file, never re-offers a purged or "
                "marked one)");
  sub->add_option("--format", options->format, "table (default) or json")->check(CLI::IsMember({"table", "json"}));
  return [options]() {
    const std::u16string install = ApplyCommonOptions(options->common, ServiceLog::kLeaveAlone);
    const InstallPaths paths = PathsOf(install);
    platform::FileLock lock = nullptr;
    {
      CDbSQLite probe;
      OpenForReading(probe, paths.database);
    }
    if (options->fix) {
      lock = TakeCollectorLock(install, paths.lock);
    }
    struct Unlock {
      platform::FileLock lock;
      ~Unlock() { platform::Current().UnlockFile(lock); }
    } unlock{lock};

    const std::vector<ReportFolder> folders = ReportFoldersOf(install);
    const std::vector<ProcessedFile> files = ProcessedFiles(install, folders);
    Findings found;
    {
      BusyBudget budget(kQueryBusyTimeoutMs);
      CDbSQLite db;
      db.SetBusyBudget(&budget);
      OpenForReading(db, paths.database);
      found = Audit(db, install, files);
    }
    std::optional<Fixed> fixed;
    if (options->fix) fixed = Fix(paths.database, found);
    const Fixed* shown = fixed ? &*fixed : nullptr;
    if (options->format == "json") {
      std::printf("%s\n", ToJson(found, shown).dump(2, ' ', false, Json::error_handler_t::replace).c_str());
    } else {
      PrintTable(found, shown);
    }
    if (fixed) return fixed->failed.empty() ? kExitOk : kExitFound;
    return found.missing.empty() && found.duplicates.empty() ? kExitOk : kExitFound;
  };
}

}  // namespace asum::tool
