// Feeds arbitrary UTF-16 (two bytes per code unit, so lone surrogates and NUL
// occur) as subject and body to every extraction function, and checks the
// promises the callers rely on: cuts never exceed their text, a decoded text
// never grows, a handed-out row has a cell.
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "extract/body_fields.h"
#include "extract/html_table.h"
#include "extract/subject.h"
#include "extract/text_ops.h"
#include "fuzz_support.h"
#include "platform/platform.h"

namespace {

using asum::fuzz::Check;

std::u16string Units(const uint8_t* data, size_t size) {
  std::u16string text;
  text.reserve(size / 2);
  for (size_t i = 0; i + 1 < size; i += 2) text.push_back(static_cast<char16_t>(data[i] | (data[i + 1] << 8)));
  return text;
}

void TextOps(const std::u16string& text, const std::u16string& marker, std::ptrdiff_t n) {
  const std::ptrdiff_t length = static_cast<std::ptrdiff_t>(text.size());
  const std::ptrdiff_t at = asum::Find(text, marker);
  Check(at >= -1 && at <= length);
  Check(at < 0 || text.compare(static_cast<size_t>(at), marker.size(), marker) == 0);
  const char16_t c = marker.empty() ? u'>' : marker[0];
  const std::ptrdiff_t last = asum::ReverseFind(text, c);
  Check(last < 0 || text[static_cast<size_t>(last)] == c);
  Check(asum::Left(text, n).size() + asum::Mid(text, n).size() == text.size());
  Check(asum::Right(text, n).size() <= text.size());
  Check(asum::TrimLeft(asum::TrimRight(text)).size() <= text.size());
  asum::Replace(text, marker, u"x");
  asum::WcstolBase10(text);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  asum::fuzz::KeepLogOff();
  if (size < 2) return 0;
  const uint8_t control = data[0];
  const std::u16string all = Units(data + 1, size - 1);
  const size_t split = all.empty() ? 0 : data[1] % (all.size() + 1);
  const std::u16string subject = all.substr(0, split);
  const std::u16string body = all.substr(split);

  TextOps(body, subject.substr(0, 8), static_cast<int8_t>(control));

  const std::u16string decoded = asum::DecodeHtmlNumericEntities(body);
  Check(decoded.size() <= body.size());

  const int index = asum::GetTableIndex(body);
  Check(index >= -1);
  for (int selected : {index, 0, 1, static_cast<int>(control % 4) - 1}) {
    std::vector<std::u16string> headers;
    std::vector<asum::CRowHtml> rows;
    asum::GetAllColFromHtmlTable(selected, headers, body);
    asum::GetAllRowFromHtmlTable(selected, body, rows);
    for (const asum::CRowHtml& row : rows) Check(!row.cells.empty());
  }

  std::u16string out[7];
  asum::GetSomeInfoFromScriptSubject(subject, out[0], out[1], out[2], out[3], out[4]);
  asum::GetSomeInfoFromScriptSubject(subject, out[0], out[1], out[2], out[3], out[4], out[5], out[6]);
  asum::GetSomeInfoFromScriptSubject(body, out[0], out[1], out[2], out[3], out[4], out[5], out[6]);

  for (const char16_t* action : {u"Email Alert", u"Script Alert"}) {
    asum::ParseHtmlBodyToGetComponentInfo(body, action);
  }
  asum::ParseHtmlBodyToGetComponentInfo(body, out[0]);
  for (const char16_t* field : {u"Who", u"File Server", u"Server", u""}) {
    asum::ParseHtmlBodyAndGetFieldData(body, field);
  }
  asum::ParseHtmlBodyAndGetFieldData(body, subject);
  return 0;
}
