#include "report_page.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <set>

#include "input_checks.h"

namespace asum::tool {
namespace {

namespace chr = std::chrono;

constexpr char kNoDay[] = "none";
constexpr char kOther[] = "Other";
// Eight named types and "Other" (grey, always last).
constexpr const char* kColors[] = {"#4e79a7", "#f28e2b", "#e15759", "#76b7b2", "#59a14f",
                                   "#edc948", "#b07aa1", "#ff9da7", "#9c9c9c"};

// Day chart geometry, in CSS pixels. Bars share one scale, so their heights
// are proportional to their counts.
constexpr double kPlotHeight = 220, kPlotWidth = 900, kLeft = 52, kTop = 14, kBottom = 40;
constexpr double kMaxSlot = 28, kMinSlot = 1;
// Bar charts of names.
constexpr double kNameWidth = 180, kBarMax = 250, kRowHeight = 22, kBarHeight = 14;
constexpr size_t kNameChars = 28;

using Ranked = std::vector<std::pair<std::string, uint64_t>>;

std::string Escape(const std::string& text) {
  std::string out;
  out.reserve(text.size());
  for (char c : text) {
    switch (c) {
      case '&': out += "&amp;"; break;
      case '<': out += "&lt;"; break;
      case '>': out += "&gt;"; break;
      case '"': out += "&quot;"; break;
      case '\'': out += "&#39;"; break;
      default: out += c;
    }
  }
  return out;
}

std::string Fixed(double value) {
  char text[32];
  std::snprintf(text, sizeof text, "%.3f", value);
  return text;
}

// Counted by count, then by name.
Ranked Rank(const std::map<std::string, uint64_t>& counts) {
  Ranked ranked(counts.begin(), counts.end());
  std::stable_sort(ranked.begin(), ranked.end(), [](const auto& a, const auto& b) { return a.second > b.second; });
  return ranked;
}

// At most `chars` characters (not bytes) of a UTF-8 text, with an ellipsis when cut.
std::string Shortened(const std::string& text, size_t chars) {
  size_t count = 0;
  for (size_t i = 0; i < text.size(); ++i) {
    if ((text[i] & 0xC0) != 0x80 && count++ == chars) return text.substr(0, i) + "\xE2\x80\xA6";
  }
  return text;
}

std::string Plural(uint64_t n, const char* one) {
  return std::to_string(n) + " " + one + (n == 1 ? "" : "s");
}

chr::sys_days ParseDay(const std::string& day) {
  return chr::sys_days(chr::year_month_day(chr::year(std::stoi(day.substr(0, 4))),
                                           chr::month(static_cast<unsigned>(std::stoi(day.substr(5, 2)))),
                                           chr::day(static_cast<unsigned>(std::stoi(day.substr(8, 2))))));
}

std::string DayText(chr::sys_days day) {
  const chr::year_month_day ymd(day);
  char text[16];
  std::snprintf(text, sizeof text, "%04d/%02u/%02u", static_cast<int>(ymd.year()), static_cast<unsigned>(ymd.month()),
                static_cast<unsigned>(ymd.day()));
  return text;
}

// A step of 1, 2 or 5 times a power of ten giving at most five gridlines.
uint64_t GridStep(uint64_t max) {
  uint64_t step = 1;
  for (;;) {
    for (uint64_t m : {1, 2, 5}) {
      if (max <= step * m * 5) return step * m;
    }
    step *= 10;
  }
}

std::string Swatch(const char* color) {
  return std::string("<svg width=\"11\" height=\"11\" aria-hidden=\"true\"><rect width=\"11\" height=\"11\" rx=\"2\" fill=\"") +
         color + "\"/></svg>";
}

struct DayColumn {
  std::string day;  // "YYYY/MM/DD" or "none"
  double x = 0;
  std::map<std::string, uint64_t> counts;  // merged type -> count
};

std::string DayChart(const std::vector<DayColumn>& columns, const std::vector<std::string>& legend, double slot) {
  uint64_t max = 0;
  for (const DayColumn& c : columns) {
    uint64_t sum = 0;
    for (const auto& [type, n] : c.counts) sum += n;
    max = std::max(max, sum);
  }
  const double end_x = columns.empty() ? kLeft : columns.back().x + slot;
  const double width = end_x + 16, height = kTop + kPlotHeight + kBottom, base = kTop + kPlotHeight;
  const double scale = max > 0 ? kPlotHeight / static_cast<double>(max) : 0;
  const double bar = slot >= 4 ? slot * 0.76 : slot;
  std::string svg = "<svg class=\"days\" width=\"" + Fixed(width) + "\" height=\"" + Fixed(height) +
                    "\" role=\"img\" aria-label=\"Alerts per day, stacked by alert type\">";
  const uint64_t step = GridStep(std::max<uint64_t>(max, 1));
  for (uint64_t v = 0; v <= max; v += step) {
    const std::string y = Fixed(base - static_cast<double>(v) * scale);
    svg += "<line class=\"grid\" x1=\"" + Fixed(kLeft) + "\" x2=\"" + Fixed(end_x) + "\" y1=\"" + y + "\" y2=\"" + y +
           "\"/><text x=\"" + Fixed(kLeft - 6) + "\" y=\"" + y + "\" dy=\"4\" text-anchor=\"end\">" +
           std::to_string(v) + "</text>";
  }
  // A label wherever there is room for one; "no date" always.
  const size_t every = static_cast<size_t>(std::ceil(84 / slot));
  size_t index = 0;
  for (const DayColumn& c : columns) {
    const bool none = c.day == kNoDay;
    const std::string mid = Fixed(c.x + slot / 2);
    if (none || index % every == 0) {
      svg += "<line class=\"tick\" x1=\"" + mid + "\" x2=\"" + mid + "\" y1=\"" + Fixed(base) + "\" y2=\"" +
             Fixed(base + 4) + "\"/><text x=\"" + mid + "\" y=\"" + Fixed(base + 17) + "\" text-anchor=\"middle\">" +
             (none ? std::string("no date") : c.day) + "</text>";
    }
    ++index;
    double y = base;
    for (size_t t = 0; t < legend.size(); ++t) {
      const auto found = c.counts.find(legend[t]);
      if (found == c.counts.end()) continue;
      const double h = static_cast<double>(found->second) * scale;
      y -= h;
      const std::string shown_day = none ? "no date" : c.day;
      svg += "<rect class=\"piece\" x=\"" + Fixed(c.x + (slot - bar) / 2) + "\" y=\"" + Fixed(y) + "\" width=\"" +
             Fixed(bar) + "\" height=\"" + Fixed(h) + "\" fill=\"" + kColors[std::min<size_t>(t, 8)] +
             "\" data-day=\"" + c.day + "\" data-type=\"" + Escape(legend[t]) + "\" data-count=\"" +
             std::to_string(found->second) + "\"><title>" + shown_day + " \xC2\xB7 " + Escape(legend[t]) + ": " +
             Plural(found->second, "alert") + "</title></rect>";
    }
  }
  svg += "<line class=\"axis\" x1=\"" + Fixed(kLeft) + "\" x2=\"" + Fixed(end_x) + "\" y1=\"" + Fixed(base) +
         "\" y2=\"" + Fixed(base) + "\"/></svg>";
  return svg;
}

std::string BarChart(const Ranked& entries, const char* attribute, const char* label) {
  if (entries.empty()) return "<p class=\"empty\">None in this period.</p>";
  const double scale = kBarMax / static_cast<double>(entries.front().second);
  const double height = static_cast<double>(entries.size()) * kRowHeight + 4;
  std::string svg = "<svg class=\"bars\" width=\"" + Fixed(kNameWidth + kBarMax + 60) + "\" height=\"" +
                    Fixed(height) + "\" role=\"img\" aria-label=\"" + label + "\">";
  double y = 2;
  for (const auto& [name, n] : entries) {
    const std::string shown = name.empty() ? "(none)" : name;
    const double w = static_cast<double>(n) * scale;
    svg += "<text x=\"" + Fixed(kNameWidth - 8) + "\" y=\"" + Fixed(y + kBarHeight - 3) + "\" text-anchor=\"end\">" +
           Escape(Shortened(shown, kNameChars)) + "</text><rect class=\"bar\" x=\"" + Fixed(kNameWidth) + "\" y=\"" +
           Fixed(y) + "\" width=\"" + Fixed(w) + "\" height=\"" + Fixed(kBarHeight) + "\" " + attribute + "=\"" +
           Escape(name) + "\" data-count=\"" + std::to_string(n) + "\"><title>" + Escape(shown) + ": " +
           Plural(n, "alert") + "</title></rect><text x=\"" + Fixed(kNameWidth + w + 6) + "\" y=\"" +
           Fixed(y + kBarHeight - 3) + "\">" + std::to_string(n) + "</text>";
    y += kRowHeight;
  }
  return svg + "</svg>";
}

constexpr char kStyle[] = R"(
:root{--ink:#1d2430;--muted:#5b6472;--line:#d9dee5;--panel:#f4f6f9}
*{box-sizing:border-box;-webkit-print-color-adjust:exact;print-color-adjust:exact}
body{margin:0 auto;max-width:1120px;padding:28px 32px;font:14px/1.45 system-ui,-apple-system,"Segoe UI",Roboto,"Helvetica Neue",Arial,sans-serif;color:var(--ink);background:#fff}
h1{font-size:24px;margin:0 0 4px}
h2{font-size:16px;margin:0 0 10px}
.meta{color:var(--muted);margin:0}
.meta b{color:var(--ink);font-weight:600}
.totals{display:flex;gap:16px;margin:20px 0 24px}
.totals div{flex:1;background:var(--panel);border:1px solid var(--line);border-radius:8px;padding:12px 16px}
.figure{display:block;font-size:28px;font-weight:600;font-variant-numeric:tabular-nums}
.label{color:var(--muted)}
section{margin:0 0 26px;break-inside:avoid}
.chart{overflow-x:auto}
.legend{display:flex;flex-wrap:wrap;gap:4px 16px;margin:0 0 8px;padding:0;list-style:none;color:var(--muted);font-size:12px}
.legend svg{vertical-align:-1px;margin-right:5px}
svg text{font-size:11px;fill:var(--muted)}
svg .grid{stroke:var(--line);stroke-width:1}
svg .axis,svg .tick{stroke:#8a93a0;stroke-width:1}
svg .bar{fill:#4e79a7}
.two{display:flex;flex-wrap:wrap;gap:0 32px}
.empty{color:var(--muted)}
table{border-collapse:collapse;width:100%;font-size:13px}
th,td{padding:5px 10px;border-bottom:1px solid var(--line);text-align:left}
th{font-weight:600;border-bottom:2px solid var(--line)}
.n{text-align:right;font-variant-numeric:tabular-nums}
tbody tr:nth-child(even){background:var(--panel)}
tfoot td{font-weight:600;border-bottom:none}
footer{color:var(--muted);font-size:12px}
@page{size:A4 landscape;margin:12mm}
@media print{body{padding:0;max-width:none}.chart{overflow:visible}}
)";

}  // namespace

std::string DayOf(const std::string& when) { return IsWhenText(when) ? when.substr(0, 10) : std::string(); }

void ReportPage::Add(const ReportRow& row) {
  ++total_;
  if (row.status == "Delivered") ++delivered_;
  if (row.status == "Failed") ++failed_;
  const std::string day = DayOf(row.when);
  ++per_day_[day.empty() ? kNoDay : day][row.type];
  ++types_[row.type];
  ++components_[row.component];
  // Each name once per alert, however often the alert lists it.
  std::set<std::string> names;
  for (size_t at = 0; at <= row.who.size();) {
    size_t end = row.who.find(", ", at);
    if (end == std::string::npos) end = row.who.size();
    const std::string name = row.who.substr(at, end - at);
    if (!name.empty() && name != "N\\A") names.insert(name);
    at = end + 2;
  }
  for (const std::string& name : names) ++performers_[name];
}

std::string ReportPage::Render(const ReportHeading& heading, const std::vector<GroupedLine>& table) const {
  // The period: as given, else from the oldest to the newest dated alert.
  std::string first = DayOf(heading.from), last = DayOf(heading.to);
  for (const auto& [day, counts] : per_day_) {
    if (day == kNoDay) continue;
    if (heading.from.empty() && (first.empty() || day < first)) first = day;
    if (heading.to.empty() && (last.empty() || day > last)) last = day;
  }

  const Ranked types = Rank(types_);
  std::vector<std::string> legend;
  std::map<std::string, std::string> shown_as;  // type -> its legend entry
  for (size_t i = 0; i < types.size(); ++i) {
    const std::string entry = i < kNamedTypes ? types[i].first : kOther;
    if (legend.empty() || legend.back() != entry) legend.push_back(entry);
    shown_as[types[i].first] = entry;
  }

  std::vector<DayColumn> columns;
  const bool dated = !first.empty() && !last.empty() && first <= last;
  const bool undated = per_day_.count(kNoDay) > 0;
  if (dated) {
    for (chr::sys_days d = ParseDay(first); d <= ParseDay(last); d += chr::days(1)) columns.push_back(DayColumn{DayText(d), 0, {}});
  }
  const size_t slots = columns.size() + (undated ? 2 : 0);  // a gap before "no date"
  const double slot = std::clamp(kPlotWidth / static_cast<double>(std::max<size_t>(slots, 1)), kMinSlot, kMaxSlot);
  for (size_t i = 0; i < columns.size(); ++i) columns[i].x = kLeft + static_cast<double>(i) * slot;
  if (undated) columns.push_back(DayColumn{kNoDay, kLeft + static_cast<double>(slots - 1) * slot, {}});
  for (DayColumn& c : columns) {
    const auto found = per_day_.find(c.day);
    if (found == per_day_.end()) continue;
    for (const auto& [type, n] : found->second) c.counts[shown_as[type]] += n;
  }

  const std::string period = (first.empty() ? std::string("-") : first) + " to " + (last.empty() ? "-" : last);
  std::string html = "<!DOCTYPE html>\n<html lang=\"en\"><head><meta charset=\"utf-8\">"
                     "<meta http-equiv=\"Content-Security-Policy\" content=\"default-src 'none'; style-src 'unsafe-inline'\">"
                     "<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\"><title>Alert summary \xC2\xB7 " +
                     Escape(heading.install) + "</title><style>" + kStyle + "</style></head><body>\n";
  html += "<header><h1>Alert summary</h1><p class=\"meta\">Install folder <b>" + Escape(heading.install) +
          "</b> \xC2\xB7 period <b>" + period + "</b> \xC2\xB7 made <b>" + Escape(heading.made_at) +
          "</b></p></header>\n";
  html += "<div class=\"totals\" data-total=\"" + std::to_string(total_) + "\" data-delivered=\"" +
          std::to_string(delivered_) + "\" data-failed=\"" + std::to_string(failed_) + "\"><div><span class=\"figure\">" +
          std::to_string(total_) + "</span><span class=\"label\">alerts</span></div><div><span class=\"figure\">" +
          std::to_string(delivered_) + "</span><span class=\"label\">delivered</span></div><div><span class=\"figure\">" +
          std::to_string(failed_) + "</span><span class=\"label\">failed to send</span></div></div>\n";

  html += "<section><h2>Alerts per day, by alert type</h2><ul class=\"legend\">";
  for (size_t t = 0; t < legend.size(); ++t) {
    html += "<li>" + Swatch(kColors[std::min<size_t>(t, 8)]) + Escape(legend[t]) + "</li>";
  }
  html += "</ul><div class=\"chart\">" +
          (columns.empty() ? std::string("<p class=\"empty\">No alerts in this period.</p>")
                           : DayChart(columns, legend, slot)) +
          "</div></section>\n";

  Ranked performers = Rank(performers_);
  if (performers.size() > kPerformers) performers.resize(kPerformers);
  html += "<div class=\"two\"><section><h2>Alerts by component</h2>" +
          BarChart(Rank(components_), "data-component", "Alerts by component") +
          "</section><section><h2>Busiest performers</h2>" +
          BarChart(performers, "data-who", "The ten busiest performers") + "</section></div>\n";

  html += "<section><h2>Alerts by action, type, component and status</h2><table><thead><tr><th>Alert Action</th>"
          "<th>Alert Type</th><th>Component Name</th><th>EmailStatus</th><th class=\"n\">Count</th></tr></thead><tbody>";
  uint64_t sum = 0;
  for (const GroupedLine& line : table) {
    html += "<tr>";
    for (size_t c = 0; c < line.size(); ++c) {
      html += (c + 1 == line.size() ? "<td class=\"n\">" : "<td>") + Escape(line[c]) + "</td>";
    }
    html += "</tr>";
    sum += std::stoull(line.back());
  }
  html += "</tbody><tfoot><tr><td colspan=\"4\">All</td><td class=\"n\">" + std::to_string(sum) +
          "</td></tr></tfoot></table></section>\n<footer>alertsummary report</footer>\n</body></html>\n";
  return html;
}

}  // namespace asum::tool
