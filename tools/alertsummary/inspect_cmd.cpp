#include <cstdio>
#include <filesystem>
#include <memory>
#include <nlohmann/json.hpp>

#include "collect/process_alerts.h"
#include "commands.h"

namespace asum::tool {
namespace {

namespace fs = std::filesystem;

struct InspectOptions {
  CommonOptions common;
  std::vector<std::string> files;
  std::string component;
  std::string status;
};

// The component folder and status a file's place implies:
// <component>/AlertReports/<Sent items|Outbox>/<file>.
void DefaultsFromPlace(const fs::path& file, std::string* component, std::string* status) {
  const fs::path report = file.parent_path();
  if (status->empty()) *status = report.filename() == "Outbox" ? "Failed" : "Delivered";
  if (component->empty() && report.parent_path().filename() == "AlertReports") {
    *component = report.parent_path().parent_path().filename().string();
  }
}

std::string DateText(const platform::SystemTime& t) {
  char text[64];
  std::snprintf(text, sizeof text, "%04u/%02u/%02u %02u:%02u:%02u", t.year, t.month, t.day, t.hour, t.minute, t.second);
  return text;
}

nlohmann::ordered_json RowJson(const AlertRow& r) {
  nlohmann::ordered_json row;
  row["Alert Action"] = Utf8(r.alert_action);
  row["Alert Type"] = Utf8(r.alert_type);
  row["Alert Name"] = Utf8(r.alert_name);
  row["When"] = Utf8(r.when);
  row["Threshold"] = Utf8(r.threshold);
  row["Who"] = Utf8(r.who);
  row["Operation"] = Utf8(r.operation);
  row["Component Name"] = Utf8(r.component_name);
  row["EmailStatus"] = Utf8(r.email_status);
  row["Server Name"] = Utf8(r.server_name);
  row["Alert Path"] = Utf8(r.alert_path);
  return row;
}

}  // namespace

Runner AddInspect(CLI::App& app) {
  auto* sub = app.add_subcommand("inspect",
                                 "Show what would be stored for alert files, touching neither the files nor the database "
                                 "(one JSON object per line; exit 1 when a file cannot be read)");
  auto options = std::make_shared<InspectOptions>();
  AddCommonOptions(*sub, options->common, false);
  sub->add_option("files", options->files, "Alert files (.eml)")->required();
  sub->add_option("--component", options->component,
                  "Component folder name (default: the folder above AlertReports)");
  sub->add_option("--status", options->status, "Delivered or Failed (default: after the report folder)")
      ->check(CLI::IsMember({"Delivered", "Failed"}));
  return [options]() {
    ApplyCommonOptions(options->common, ServiceLog::kLeaveAlone);
    int code = kExitOk;
    for (const std::string& name : options->files) {
      const fs::path file = fs::absolute(fs::path(name)).lexically_normal();
      std::string component = options->component, status = options->status;
      DefaultsFromPlace(file, &component, &status);
      const AlertAnalysis a = AnalyzeAlertFile(PathText(file), Utf16(status), Utf16(component));
      nlohmann::ordered_json out;
      out["file"] = Utf8(PathText(file));
      out["loaded"] = a.loaded;
      if (!a.loaded) code = kExitFailure;
      if (a.loaded) {
        out["sender"] = Utf8(a.sender);
        out["subject"] = Utf8(a.subject);
        out["body"] = Utf8(a.body);
        out["when"] = DateText(a.local_date);
      }
      out["outcome"] = a.outcome == AlertOutcome::kStore ? "stored" : a.outcome == AlertOutcome::kMarkWithout ? "marked" : "left";
      if (a.outcome == AlertOutcome::kStore) out["row"] = RowJson(a.row);
      std::printf("%s\n", out.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace).c_str());
    }
    return code;
  };
}

}  // namespace asum::tool
