#include "extract/body_fields.h"

#include <algorithm>
#include <unordered_set>
#include <vector>

#include "extract/html_table.h"
#include "extract/text_ops.h"
#include "log/log.h"

namespace asum {

namespace {

constexpr std::u16string_view kComponentLabel = u"Component Name  :";
constexpr std::u16string_view kReportLabel = u"Report Name  :";

std::u16string ComponentOfEmailAlert(std::u16string_view body) {
  // The component is the last text run before the first sentence that ends
  // in bold, e.g. "... for <b>File Server(s).</b></p>".
  const std::ptrdiff_t p = Find(body, u".</b></p>");
  if (p < 0) return {};
  const std::u16string_view head = LeftView(body, p);
  const std::u16string_view run = MidView(head, ReverseFind(head, u'>') + 1);
  return Replace(DecodeHtmlNumericEntities(run), u"(s)", u"");
}

std::u16string ComponentOfScriptAlert(std::u16string_view body) {
  // Only the text before the report line is searched: the component line
  // always comes first in these bodies.
  const std::ptrdiff_t p = Find(body, kReportLabel);
  if (p < 0) return {};
  const std::u16string_view head = LeftView(body, p);
  const std::ptrdiff_t c = Find(head, kComponentLabel);
  if (c < 0) return {};
  std::u16string result = Replace(MidView(head, c), kComponentLabel, u"");
  result = Replace(TrimLeft(result), u"</b>", u"");
  return DecodeHtmlNumericEntities(LeftView(result, Find(result, u"</p>")));
}

char16_t AsciiLower(char16_t c) { return c >= u'A' && c <= u'Z' ? c + (u'a' - u'A') : c; }

std::u16string AsciiLower(std::u16string_view text) {
  std::u16string lower(text);
  for (char16_t& c : lower) c = AsciiLower(c);
  return lower;
}

}  // namespace

std::u16string ParseHtmlBodyToGetComponentInfo(std::u16string_view body,
                                               std::u16string_view alertAction) {
  WriteLog(u"Inside ParseHtmlBodyToGetComponentInfo function");
  if (alertAction == u"Email Alert") return ComponentOfEmailAlert(body);
  if (alertAction == u"Script Alert") return ComponentOfScriptAlert(body);
  return {};
}

BodyFieldReader::BodyFieldReader(std::u16string_view body) : body_(body) {}

std::u16string BodyFieldReader::FieldData(std::u16string_view fieldName) {
  WriteLog(u"Inside ParseHtmlBodyAndGetFieldData function");
  std::u16string result;
  if (body_.empty()) return result;

  if (!parsed_) {
    const int table = GetTableIndex(body_);
    GetAllColFromHtmlTable(table, headers_, body_);
    GetAllRowFromHtmlTable(table, body_, rows_);
    parsed_ = true;
  } else {
    // The table was read for an earlier field; its readers' lines are written
    // again so the log reads as if it had been read anew.
    WriteLog(u"Inside GetTableIndex function");
    WriteLog(u"Inside GetAllColFromHtmlTable function");
    WriteLog(u"Inside GetAllRowFromHtmlTable function");
  }
  WriteLog(u"After calling \"GetAllRowFromHtmlTable\" function");

  std::vector<bool> wanted(headers_.size());
  for (std::size_t i = 0; i < headers_.size(); ++i) wanted[i] = Find(headers_[i], fieldName) >= 0;

  // People's names arrive in whatever case the auditing source wrote them;
  // every other field is compared exactly.
  const bool fold_case = fieldName == u"Who";
  const bool mark_file_server = fieldName == u"File Server";
  std::unordered_set<std::u16string> seen;
  for (const CRowHtml& row : rows_) {
    // A short row pairs only the cells it has; extra cells have no header.
    const std::size_t pairs = std::min(headers_.size(), row.cells.size());
    for (std::size_t i = 0; i < pairs; ++i) {
      if (!wanted[i]) continue;
      const std::u16string& value = row.cells[i];
      if (!seen.insert(fold_case ? AsciiLower(value) : value).second) continue;
      if (!result.empty()) result += u", ";
      result += value;
      if (mark_file_server) result += u"(File Server)";
    }
  }
  return result;
}

std::u16string ParseHtmlBodyAndGetFieldData(std::u16string_view body, std::u16string_view fieldName) {
  return BodyFieldReader(body).FieldData(fieldName);
}

}  // namespace asum
