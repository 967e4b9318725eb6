#include <algorithm>
#include <cstdio>
#include <memory>
#include <nlohmann/json.hpp>
#include <vector>

#include "collect/cycle.h"
#include "commands.h"
#include "platform/platform.h"
#include "store/setting_db_management.h"

namespace asum::tool {
namespace {

struct ReportOptions {
  CommonOptions common;
  std::string from;
  std::string to = "9999/99/99 99:99:99";
  std::string format = "table";
};

const char* const kColumns[] = {"Alert Action", "Alert Type", "Component Name", "EmailStatus", "Count"};

struct Line {
  std::vector<std::string> cells;  // the four group values, then the count
};

std::string CsvField(const std::string& text) {
  if (text.find_first_of(",\"\r\n") == std::string::npos) return text;
  std::string out = "\"";
  for (char c : text) out += c == '"' ? std::string("\"\"") : std::string(1, c);
  return out + "\"";
}

// Display width in characters, not bytes, so non-ASCII names line up.
size_t Width(const std::string& utf8) {
  return static_cast<size_t>(std::count_if(utf8.begin(), utf8.end(), [](char c) { return (c & 0xC0) != 0x80; }));
}

void PrintTable(const std::vector<Line>& lines) {
  std::vector<size_t> widths;
  for (const char* c : kColumns) widths.push_back(Width(c));
  for (const Line& l : lines) {
    for (size_t i = 0; i < l.cells.size(); ++i) widths[i] = std::max(widths[i], Width(l.cells[i]));
  }
  auto print_row = [&](const std::vector<std::string>& cells) {
    std::string out;
    for (size_t i = 0; i < cells.size(); ++i) {
      const std::string pad(widths[i] - Width(cells[i]), ' ');
      out += i + 1 == cells.size() ? pad + cells[i] : cells[i] + pad + "  ";
    }
    std::printf("%s\n", out.c_str());
  };
  print_row(std::vector<std::string>(std::begin(kColumns), std::end(kColumns)));
  std::vector<std::string> rule;
  for (size_t w : widths) rule.push_back(std::string(w, '-'));
  print_row(rule);
  uint64_t total = 0;
  for (const Line& l : lines) {
    print_row(l.cells);
    total += std::stoull(l.cells.back());
  }
  std::printf("%llu alert(s)\n", static_cast<unsigned long long>(total));
}

}  // namespace

Runner AddReport(CLI::App& app) {
  auto* sub = app.add_subcommand("report", "Count the stored alerts by Alert Action, Alert Type, Component Name and EmailStatus");
  auto options = std::make_shared<ReportOptions>();
  AddCommonOptions(*sub, options->common);
  sub->add_option("--from", options->from, "Lower bound of \"When\", \"YYYY/MM/DD hh:mm:ss\" (inclusive)");
  sub->add_option("--to", options->to, "Upper bound of \"When\", \"YYYY/MM/DD hh:mm:ss\" (inclusive)");
  sub->add_option("--format", options->format, "table (default), csv or json")
      ->check(CLI::IsMember({"table", "csv", "json"}));
  return [options]() {
    const std::u16string install = ApplyCommonOptions(options->common);
    const std::u16string db_path = DatabasePathOf(install);
    if (!platform::Current().PathExists(db_path)) {
      std::fprintf(stderr, "alertsummary: no alert database in %s\n", Utf8(install).c_str());
      return kExitFailure;
    }
    BusyBudget budget(kQueryBusyTimeoutMs);
    CSettingDBManagement store(&budget);
    if (!store.OpenDB(db_path)) {
      std::fprintf(stderr, "alertsummary: cannot open %s\n", Utf8(db_path).c_str());
      return kExitFailure;
    }
    auto statement = store.Connection().Statement(
        u"SELECT \"Alert Action\", \"Alert Type\", \"Component Name\", \"EmailStatus\", Count(*) FROM AlertDB "
        u"WHERE \"When\" BETWEEN ?1 AND ?2 GROUP BY 1, 2, 3, 4 ORDER BY 5 DESC, 1, 2, 3, 4");
    if (!statement->IsValid()) {
      std::fprintf(stderr, "alertsummary: %s holds no alert table\n", Utf8(db_path).c_str());
      return kExitFailure;
    }
    statement->BindText(1, Utf16(options->from));
    statement->BindText(2, Utf16(options->to));
    std::vector<Line> lines;
    while (statement->NextRow()) {
      Line line;
      for (int c = 0; c < 5; ++c) line.cells.push_back(Utf8(statement->ValueString(c)));
      lines.push_back(std::move(line));
    }
    statement.reset();
    store.CloseDB();

    if (options->format == "json") {
      nlohmann::ordered_json out = nlohmann::ordered_json::array();
      for (const Line& l : lines) {
        nlohmann::ordered_json row;
        for (int c = 0; c < 4; ++c) row[kColumns[c]] = l.cells[c];
        row["Count"] = std::stoull(l.cells[4]);
        out.push_back(row);
      }
      std::printf("%s\n", out.dump(2, ' ', false, nlohmann::json::error_handler_t::replace).c_str());
    } else if (options->format == "csv") {
      std::printf("Alert Action,Alert Type,Component Name,EmailStatus,Count\n");
      for (const Line& l : lines) {
        std::string out;
        for (size_t c = 0; c < l.cells.size(); ++c) out += (c ? "," : "") + CsvField(l.cells[c]);
        std::printf("%s\n", out.c_str());
      }
    } else {
      PrintTable(lines);
    }
    return kExitOk;
  };
}

}  // namespace asum::tool
