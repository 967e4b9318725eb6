// The HTML report: one self-contained page (CSS and SVG charts inline, no
// script, font, image or style from anywhere else) that opens offline and
// prints. Tests and scripts read it back through its data-* attributes:
//   per-day chart pieces   data-day="YYYY/MM/DD" (or "none"), data-type, data-count
//   the totals             data-total, data-delivered, data-failed
//   performers             data-who, data-count
//   components             data-component, data-count
// Pure: the caller reads the rows and hands them over one by one.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace asum::tool {

// The texts of one stored alert that the page uses (UTF-8).
struct ReportRow {
  std::string when, type, component, status, who;
};

// One line of the grouped table: Alert Action, Alert Type, Component Name,
// EmailStatus and the count.
using GroupedLine = std::vector<std::string>;

struct ReportHeading {
  std::string install;  // as shown: a path, or any name the caller chose
  std::string from;     // "YYYY/MM/DD hh:mm:ss" as given, or empty: from the oldest stored alert
  std::string to;       // likewise, to the newest
  std::string made_at;
};

class ReportPage {
 public:
  // How many types the per-day chart shows by name (the rest are "Other"),
  // and how many performers it lists.
  static constexpr size_t kNamedTypes = 8;
  static constexpr size_t kPerformers = 10;

  void Add(const ReportRow& row);
  // The whole page.
  std::string Render(const ReportHeading& heading, const std::vector<GroupedLine>& table) const;

 private:
  uint64_t total_ = 0, delivered_ = 0, failed_ = 0;
  std::map<std::string, std::map<std::string, uint64_t>> per_day_;  // day, or "none" -> type -> count
  std::map<std::string, uint64_t> types_, components_, performers_;
};

// The "YYYY/MM/DD" of a "When" text that names a real date and time, else empty.
std::string DayOf(const std::string& when);

}  // namespace asum::tool
