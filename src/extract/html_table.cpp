#include "extract/html_table.h"

#include <algorithm>
#include <cstdint>

#include "extract/text_ops.h"
#include "log/log.h"

namespace asum {

namespace {

constexpr std::size_t kNone = std::u16string_view::npos;

constexpr std::u16string_view kTableOpen = u"<table";
constexpr std::u16string_view kTableClose = u"</table>";
constexpr std::u16string_view kBodyOpen = u"<tbody>";
constexpr std::u16string_view kHeaderCellEnd = u"</th>";
constexpr std::u16string_view kDataCellEnd = u"</td>";
constexpr std::u16string_view kRowEnd = u"</tr>";
constexpr std::u16string_view kBoldMarker = u"<strong>";
constexpr std::u16string_view kEmptyParagraph = u"<p>&nbsp;</p>";
constexpr std::u16string_view kReferenceOpen = u"&#";

// The first occurrence of a marker at or after a position that only ever
// grows. Remembering the last answer keeps a scan that asks again and again
// from drifting into quadratic time: the text between two asks is never
// searched twice.
class ForwardSearch {
 public:
  ForwardSearch(std::u16string_view text, std::u16string_view marker)
      : text_(text), marker_(marker) {}

  std::size_t From(std::size_t from) {
    if (!searched_ || (hit_ != kNone && hit_ < from)) {
      hit_ = text_.find(marker_, from);
      searched_ = true;
    }
    return hit_;
  }

 private:
  std::u16string_view text_;
  std::u16string_view marker_;
  std::size_t hit_ = kNone;
  bool searched_ = false;
};

std::u16string CellText(std::u16string_view piece, bool data_cell) {
  std::u16string replaced;
  if (data_cell && piece.find(kEmptyParagraph) != kNone) {
    replaced = Replace(piece, kEmptyParagraph, u" ");
    piece = replaced;
  }
  return DecodeHtmlNumericEntities(MidView(piece, ReverseFind(piece, u'>') + 1));
}

}  // namespace

std::u16string DecodeHtmlNumericEntities(std::u16string_view text) {
  if (text.empty() || text.find(u';') == kNone) return std::u16string(text);
  std::u16string result;
  std::u16string number;
  std::size_t from = 0;
  while (from < text.size()) {
    const std::size_t semicolon = text.find(u';', from);
    if (semicolon == kNone) break;  // the tail after the last ';' is dropped
    const std::u16string_view piece = text.substr(from, semicolon - from);
    std::u16string_view digits;
    if (piece.starts_with(kReferenceOpen) && piece.find(kReferenceOpen, kReferenceOpen.size()) == kNone) {
      // The usual "&#" and digits: read where they stand.
      digits = piece.substr(kReferenceOpen.size());
    } else {
      number.clear();
      for (std::size_t i = 0; i < piece.size(); ++i) {
        if (piece.substr(i, kReferenceOpen.size()) == kReferenceOpen) {
          ++i;
          continue;
        }
        number.push_back(piece[i]);
      }
      digits = number;
    }
    const uint32_t code = static_cast<uint32_t>(WcstolBase10(digits));
    result.push_back(static_cast<char16_t>(code & 0xFFFFu));
    from = semicolon + 1;
  }
  return result;
}

int GetTableIndex(std::u16string_view body) {
  WriteLog(u"Inside GetTableIndex function");
  int result = -1;
  ForwardSearch open(body, kTableOpen);
  ForwardSearch close(body, kTableClose);
  std::size_t rest = 0;  // the remaining text is body[rest..]
  for (int i = 0; open.From(rest) != kNone; ++i) {
    const std::size_t end = close.From(rest);
    // Without a "</table>" the step still moves on by the length of one:
    // seven characters, as the cut Right(length - (-1) - 8) does.
    rest = end == kNone ? std::min(rest + kTableClose.size() - 1, body.size())
                        : end + kTableClose.size();
    if (open.From(rest) == kNone) result = i;
  }
  return result;
}

void GetAllColFromHtmlTable(int tableIndex, std::vector<std::u16string>& headerList,
                            std::u16string_view body) {
  WriteLog(u"Inside GetAllColFromHtmlTable function");
  if (body.empty()) return;
  std::u16string_view rest;
  if (tableIndex == 0) {
    rest = MidView(body, Find(body, kTableOpen));
  } else if (tableIndex == 1) {
    rest = MidView(body, Find(body, kTableClose));
  } else {
    return;
  }
  std::size_t from = 0;
  for (std::size_t end; (end = rest.find(kHeaderCellEnd, from)) != kNone;
       from = end + kHeaderCellEnd.size()) {
    headerList.push_back(CellText(rest.substr(from, end - from), false));
  }
}

void GetAllRowFromHtmlTable(int tableIndex, std::u16string_view body,
                            std::vector<CRowHtml>& rowList) {
  WriteLog(u"Inside GetAllRowFromHtmlTable function");
  if (body.empty()) return;
  std::u16string_view rest;
  if (tableIndex == 0) {
    rest = MidView(body, Find(body, kBodyOpen));
  } else if (tableIndex == 1) {
    rest = MidView(body, Find(body, kTableClose));
  } else {
    return;
  }
  std::size_t from = 0;
  for (std::size_t end; (end = rest.find(kRowEnd, from)) != kNone;
       from = end + kRowEnd.size()) {
    const std::u16string_view row = rest.substr(from, end - from);
    // Bold rows are captions and group titles inside the table, not data.
    if (row.find(kBoldMarker) != kNone) continue;
    CRowHtml candidate;
    std::size_t cell_from = 0;
    for (std::size_t cell_end; (cell_end = row.find(kDataCellEnd, cell_from)) != kNone;
         cell_from = cell_end + kDataCellEnd.size()) {
      candidate.cells.push_back(CellText(row.substr(cell_from, cell_end - cell_from), true));
    }
    if (!candidate.cells.empty()) rowList.push_back(std::move(candidate));
  }
}

}  // namespace asum
