// status: what a person asks first when alerts seem missing. Reads only.
#include <chrono>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <nlohmann/json.hpp>

#include "collect/discovery.h"
#include "commands.h"
#include "install_view.h"
#include "platform/platform.h"
#include "store/alert_table.h"
#include "store/busy_budget.h"
#include "store/retention.h"
#include "store/retention_settings.h"
#include "store/when_index.h"

namespace asum::tool {
namespace {

namespace fs = std::filesystem;
using Json = nlohmann::ordered_json;

struct StatusOptions {
  CommonOptions common;
  std::string format = "table";
};

std::optional<uint64_t> FileBytes(const std::u16string& path) {
  std::error_code error;
  const uintmax_t bytes = fs::file_size(fs::path(path), error);
  if (error) return std::nullopt;
  return bytes;
}

// Seconds since the file was last written, or nothing when it cannot be read.
std::optional<int64_t> AgeSeconds(const std::u16string& path) {
  std::error_code error;
  const fs::file_time_type written = fs::last_write_time(fs::path(path), error);
  if (error) return std::nullopt;
  const auto age = fs::file_time_type::clock::now() - written;
  return std::chrono::duration_cast<std::chrono::seconds>(age).count();
}

Json Pending(const std::u16string& install) {
  Json folders = Json::array();
  uint64_t total = 0;
  for (const ReportFolder& folder : ReportFoldersOf(install)) {
    StringList files;
    GetDomainFolders(folder.path, files);
    std::optional<int64_t> oldest;
    for (const std::u16string& file : files) {
      const std::optional<int64_t> age = AgeSeconds(file);
      if (age && (!oldest || *age > *oldest)) oldest = age;
    }
    total += files.size();
    folders.push_back(Json{{"component", Utf8(folder.component)},
                           {"folder", Utf8(folder.name)},
                           {"files", files.size()},
                           {"oldest_age_s", oldest ? Json(*oldest) : Json(nullptr)}});
  }
  return Json{{"pending", folders}, {"pending_total", total}};
}

Json Database(const InstallPaths& paths) {
  Json out{{"path", Utf8(paths.database)}, {"exists", false}, {"bytes", nullptr}, {"rows", nullptr},
           {"oldest_when", nullptr}, {"newest_when", nullptr}, {"schema_exact", false},
           {"quick_check", nullptr}, {"when_index", false}};
  if (!platform::Current().PathExists(paths.database)) return out;
  BusyBudget budget(kQueryBusyTimeoutMs);
  CDbSQLite db;
  db.SetBusyBudget(&budget);
  OpenForReading(db, paths.database);
  out["exists"] = true;
  if (const auto bytes = FileBytes(paths.database)) out["bytes"] = *bytes;
  std::string check;
  std::unique_ptr<CSqlStatement> quick = db.Statement(u"PRAGMA quick_check");
  while (quick->NextRow()) check += (check.empty() ? "" : "; ") + Utf8(quick->ValueString(0));
  out["quick_check"] = check.empty() ? Json("not readable") : Json(check);
  out["when_index"] = HasWhenIndex(db);
  if (!HasAlertTable(db)) return out;
  out["schema_exact"] =
      QueryText(db, u"SELECT sql FROM sqlite_master WHERE type = 'table' AND name = 'AlertDB'") == CreateAlertTableSql();
  std::unique_ptr<CSqlStatement> summary = db.Statement(u"SELECT count(*), min(\"When\"), max(\"When\") FROM AlertDB");
  if (summary->NextRow()) {
    out["rows"] = std::stoull(Utf8(summary->ValueString(0)));
    if (out["rows"] != 0) {
      out["oldest_when"] = Utf8(summary->ValueString(1));
      out["newest_when"] = Utf8(summary->ValueString(2));
    }
  }
  return out;
}

Json Retention() {
  const std::u16string value = ReadRetentionSetting(kRetentionEnabledSetting, kRetentionEnabledDefault);
  const std::u16string days_text = ReadRetentionSetting(kRetentionDaysSetting, kRetentionDaysDefault);
  const bool enabled = value == u"TRUE";
  const int32_t days = RetentionDays(days_text);
  return Json{{"enabled", enabled},
              {"value", Utf8(value)},
              {"days_text", Utf8(days_text)},
              {"days", days},
              {"cutoff", enabled ? Json(Utf8(CutoffText(platform::Current().LocalNow(), days))) : Json(nullptr)}};
}

Json Log() {
  const std::u16string folder = ServiceLogFolder();
  const std::u16string path = folder + platform::NativeSeparators(u"\\ErrorLog.txt");
  const bool on = !folder.empty() && platform::Current().PathExists(folder);
  const std::optional<uint64_t> bytes = on ? FileBytes(path) : std::nullopt;
  return Json{{"on", on}, {"path", Utf8(path)}, {"bytes", bytes ? Json(*bytes) : Json(nullptr)}};
}

std::string Text(const Json& value) {
  if (value.is_null()) return "-";
  return value.is_string() ? value.get<std::string>() : value.dump();
}

void PrintTable(const Json& s) {
  const auto line = [](const char* label, const std::string& text) { std::printf("%-11s%s\n", label, text.c_str()); };
  line("install", Text(s["install_dir"]));
  line("pending", Text(s["pending_total"]) + " file(s) waiting in " + std::to_string(s["pending"].size()) +
                     " report folder(s)");
  for (const Json& f : s["pending"]) {
    if (f["files"] == 0) continue;
    line("", "  " + Text(f["component"]) + "/" + Text(f["folder"]) + ": " + Text(f["files"]) + ", the oldest " +
                 Text(f["oldest_age_s"]) + " s old");
  }
  const Json& d = s["database"];
  if (d["exists"] == false) {
    line("database", Text(d["path"]) + ": absent");
  } else {
    line("database", Text(d["path"]) + ", " + Text(d["bytes"]) + " bytes, " + Text(d["rows"]) + " row(s) from " +
                         Text(d["oldest_when"]) + " to " + Text(d["newest_when"]));
    line("", std::string("schema ") + (d["schema_exact"] == true ? "exact" : "NOT as created by the library") +
                 ", quick_check " + Text(d["quick_check"]) + ", " +
                 (d["when_index"] == true ? "index on \"When\"" : "no index on \"When\""));
  }
  line("collector", Text(s["collector"]));
  const Json& r = s["retention"];
  line("retention", (r["enabled"] == true ? "on, keeps " + Text(r["days"]) + " day(s), cut-off " + Text(r["cutoff"])
                                          : std::string("off")) +
                        " (Sch_Retention \"" + Text(r["value"]) + "\", Sch_Retention_Val \"" + Text(r["days_text"]) +
                        "\")");
  const Json& l = s["log"];
  line("log", (l["on"] == true ? "on, " + Text(l["bytes"]) + " bytes in " : std::string("off: ")) + Text(l["path"]));
}

}  // namespace

Runner AddStatus(CLI::App& app) {
  auto* sub = app.add_subcommand("status",
                                 "Show what is waiting, the database's health, the collector lock, retention and the "
                                 "log of an install folder, changing and creating nothing");
  auto options = std::make_shared<StatusOptions>();
  AddCommonOptions(*sub, options->common);
  sub->add_option("--format", options->format, "table (default) or json")->check(CLI::IsMember({"table", "json"}));
  return [options]() {
    const std::u16string install = ApplyCommonOptions(options->common, ServiceLog::kLeaveAlone);
    const InstallPaths paths = PathsOf(install);
    Json status{{"install_dir", Utf8(install)}};
    status.update(Pending(install));
    status["database"] = Database(paths);
    status["collector"] = platform::Current().FileLockHeld(paths.lock) ? "held" : "free";
    status["retention"] = Retention();
    status["log"] = Log();
    if (options->format == "json") {
      std::printf("%s\n", status.dump(2, ' ', false, Json::error_handler_t::replace).c_str());
    } else {
      PrintTable(status);
    }
    return kExitOk;
  };
}

}  // namespace asum::tool
