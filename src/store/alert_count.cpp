#include "store/alert_count.h"

#include "store/setting_db_management.h"
#include "common/wide_number.h"

namespace asum {
namespace {

constexpr std::u16string_view kMarker = u"</FROM>";
// The marker's seven characters and room for a four-character opening tag.
constexpr size_t kUpperSkip = 11;

}  // namespace

RangeBounds SplitRange(const std::u16string& range) {
  RangeBounds bounds;
  const size_t found = range.find(kMarker);
  const int64_t m = found == std::u16string::npos ? -1 : static_cast<int64_t>(found);
  bounds.has_date_condition = m != 0;

  if (m > 0) {
    bounds.lower = range.substr(0, static_cast<size_t>(m));
    const size_t gt = bounds.lower.rfind(u'>');
    if (gt != std::u16string::npos) bounds.lower.erase(0, gt + 1);
  }

  const int64_t length = static_cast<int64_t>(range.size());
  const int64_t count = length - m - static_cast<int64_t>(kUpperSkip);
  std::u16string upper;
  if (count >= length) {
    upper = range;
  } else if (count > 0) {
    upper = range.substr(static_cast<size_t>(length - count));
  }
  const size_t lt = upper.rfind(u'<');
  if (lt != std::u16string::npos) bounds.upper = upper.substr(0, lt);
  return bounds;
}

CountStatement BuildCountStatement(const std::u16string& filter, const std::u16string& range) {
  CountStatement out;
  out.sql = u"SELECT Count(*) FROM AlertDB WHERE";
  const RangeBounds bounds = SplitRange(range);
  if (bounds.has_date_condition) {
    out.sql += u"(\"When\" BETWEEN ? AND ?)AND ";
    out.params.push_back(bounds.lower);
    out.params.push_back(bounds.upper);
  } else {
    // No date condition: the filter alone decides, so the request counts
    // every row that matches it.
    out.sql += u" ";
  }
  const bool action = filter.find(u"Script Alert") != std::u16string::npos ||
                      filter.find(u"Email Alert") != std::u16string::npos;
  out.sql += action ? u"(\"Alert Action\" LIKE '%'||?||'%')" : u"(\"Alert Type\" LIKE '%'||?||'%')";
  out.params.push_back(filter);
  // Placeholders are numbered so the parameter list reads in text order.
  std::u16string numbered;
  int next = 1;
  for (char16_t c : out.sql) {
    numbered += c;
    if (c == u'?') numbered += static_cast<char16_t>(u'0' + next++);
  }
  out.sql = numbered;
  return out;
}

int CountAlerts(const std::u16string& install_folder, const std::u16string& filter, const std::u16string& range,
                uint32_t busy_timeout_ms) {
  BusyBudget budget(busy_timeout_ms);
  CSettingDBManagement store(&budget);
  const std::u16string path =
      DatabasePathOf(install_folder);
  if (!store.OpenDB(path)) return 0;  // the connection object releases what the open left
  const CountStatement statement = BuildCountStatement(filter, range);
  const int32_t count = WcstolBase10(store.ExecuteScalar(statement.sql, statement.params));
  store.Connection().Close();
  return count;
}

}  // namespace asum
