#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <nlohmann/json.hpp>
#include <vector>

#include "commands.h"
#include "input_checks.h"
#include "install_view.h"
#include "platform/platform.h"
#include "report_page.h"
#include "store/busy_budget.h"

namespace asum::tool {
namespace {

struct ReportOptions {
  CommonOptions common;
  std::string from;
  std::string to = "9999/99/99 99:99:99";
  std::string format = "table";
  std::string output;
  std::string made_at;
  std::string install_label;
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

void PrintTable(const std::vector<Line>& lines, std::string& text) {
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
    text += out + "\n";
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
  text += std::to_string(total) + " alert(s)\n";
}

std::string NowText() {
  const platform::SystemTime t = platform::Current().LocalNow();
  char text[64];
  std::snprintf(text, sizeof text, "%04u/%02u/%02u %02u:%02u:%02u", t.year, t.month, t.day, t.hour, t.minute,
                t.second);
  return text;
}

std::string HtmlPage(CDbSQLite& db, const ReportOptions& options, const std::u16string& install,
                     const std::vector<Line>& lines, bool from_given, bool to_given) {
  ReportPage page;
  std::unique_ptr<CSqlStatement> rows = db.Statement(
      u"SELECT \"When\", \"Alert Type\", \"Component Name\", \"EmailStatus\", \"Who\" FROM AlertDB "
      u"WHERE \"When\" BETWEEN ?1 AND ?2");
  rows->BindText(1, Utf16(options.from));
  rows->BindText(2, Utf16(options.to));
  while (rows->NextRow()) {
    page.Add({Utf8(rows->ValueString(0)), Utf8(rows->ValueString(1)), Utf8(rows->ValueString(2)),
              Utf8(rows->ValueString(3)), Utf8(rows->ValueString(4))});
  }
  std::vector<GroupedLine> table;
  for (const Line& l : lines) table.push_back(l.cells);
  ReportHeading heading{options.install_label.empty() ? Utf8(install) : options.install_label,
                        from_given ? options.from : "", to_given ? options.to : "",
                        options.made_at.empty() ? NowText() : options.made_at};
  return page.Render(heading, table);
}

}  // namespace

Runner AddReport(CLI::App& app) {
  auto* sub = app.add_subcommand("report", "Count the stored alerts by Alert Action, Alert Type, Component Name and EmailStatus");
  auto options = std::make_shared<ReportOptions>();
  AddCommonOptions(*sub, options->common);
  auto* from = sub->add_option("--from", options->from, "Lower bound of \"When\", \"YYYY/MM/DD hh:mm:ss\" (inclusive)");
  auto* to = sub->add_option("--to", options->to, "Upper bound of \"When\", \"YYYY/MM/DD hh:mm:ss\" (inclusive)");
  sub->add_option("--format", options->format,
                  "table (default), csv, json, or html: one self-contained page with charts, to open or print")
      ->check(CLI::IsMember({"table", "csv", "json", "html"}));
  sub->add_option("--output", options->output, "Write the report into this file (default: standard output)");
  auto* made_at = sub->add_option("--made-at", options->made_at,
                                  "html: the time the page names as made, \"YYYY/MM/DD hh:mm:ss\" (default: now), "
                                  "for pages that must come out the same");
  sub->add_option("--install-label", options->install_label,
                  "html: the name the page shows for the install folder (default: its path)");
  return [options, from, to, made_at]() {
    const std::u16string install = ApplyCommonOptions(options->common, ServiceLog::kLeaveAlone);
    CheckPeriod(from, options->from, to, options->to);
    if (made_at->count() > 0 && !IsWhenText(options->made_at)) {
      throw ToolError(kExitUsage, "--made-at \"" + options->made_at + "\" is not a date and time written YYYY/MM/DD hh:mm:ss");
    }
    const std::u16string db_path = PathsOf(install).database;
    BusyBudget budget(kQueryBusyTimeoutMs);
    CDbSQLite db;
    db.SetBusyBudget(&budget);
    OpenForReading(db, db_path);
    auto statement = db.Statement(
        u"SELECT \"Alert Action\", \"Alert Type\", \"Component Name\", \"EmailStatus\", Count(*) FROM AlertDB "
        u"WHERE \"When\" BETWEEN ?1 AND ?2 GROUP BY 1, 2, 3, 4 ORDER BY 5 DESC, 1, 2, 3, 4");
    if (!statement->IsValid()) throw ToolError(kExitFailure, Utf8(db_path) + " holds no alert table");
    statement->BindText(1, Utf16(options->from));
    statement->BindText(2, Utf16(options->to));
    std::vector<Line> lines;
    while (statement->NextRow()) {
      Line line;
      for (int c = 0; c < 5; ++c) line.cells.push_back(Utf8(statement->ValueString(c)));
      lines.push_back(std::move(line));
    }
    statement.reset();

    std::string text;
    if (options->format == "html") {
      text = HtmlPage(db, *options, install, lines, from->count() > 0, to->count() > 0);
    } else if (options->format == "json") {
      nlohmann::ordered_json json = nlohmann::ordered_json::array();
      for (const Line& l : lines) {
        nlohmann::ordered_json row;
        for (int c = 0; c < 4; ++c) row[kColumns[c]] = l.cells[c];
        row["Count"] = std::stoull(l.cells[4]);
        json.push_back(row);
      }
      text = json.dump(2, ' ', false, nlohmann::json::error_handler_t::replace) + "\n";
    } else if (options->format == "csv") {
      text = "Alert Action,Alert Type,Component Name,EmailStatus,Count\n";
      for (const Line& l : lines) {
        for (size_t c = 0; c < l.cells.size(); ++c) text += (c ? "," : "") + CsvField(l.cells[c]);
        text += "\n";
      }
    } else {
      PrintTable(lines, text);
    }
    if (options->output.empty()) {
      std::fwrite(text.data(), 1, text.size(), stdout);
    } else {
      const std::u16string file = std::filesystem::absolute(std::filesystem::path(Utf16(options->output))).u16string();
      const platform::FileResult written = platform::Current().WriteFile(file, text);
      if (!written.ok()) throw ToolError(kExitFailure, "cannot write " + Utf8(file) + ": " + Utf8(written.Describe()));
    }
    return kExitOk;
  };
}

}  // namespace asum::tool
