#include "extract/html_table.h"

#include <algorithm>
#include <array>
#include <cstdint>

#include "extract/text_ops.h"
#include "log/log.h"

namespace asum {

namespace {

constexpr std::size_t kNone = std::u16string_view::npos;

// A marker found with the Horspool skip: an alert body is scanned for the
// same few tags again and again, and a search that looked at every character
// was the largest part of reading its tables. Markers are ASCII.
class Marker {
 public:
  constexpr explicit Marker(std::u16string_view text) : text_(text) {
    skip_.fill(static_cast<uint8_t>(text.size()));
    for (std::size_t i = 0; i + 1 < text.size(); ++i) skip_[text[i] & 0x7F] = static_cast<uint8_t>(text.size() - 1 - i);
  }
  constexpr operator std::u16string_view() const { return text_; }
  constexpr std::size_t size() const { return text_.size(); }

  // As std::u16string_view::find(marker, from).
  std::size_t In(std::u16string_view text, std::size_t from = 0) const {
    const std::size_t m = text_.size();
    if (text.size() < m || from > text.size() - m) return kNone;
    const char16_t last = text_[m - 1];
    for (std::size_t pos = from; pos <= text.size() - m;) {
      const char16_t c = text[pos + m - 1];
      if (c == last && text.substr(pos, m - 1) == text_.substr(0, m - 1)) return pos;
      pos += c < 0x80 ? skip_[c] : m;
    }
    return kNone;
  }

 private:
  std::u16string_view text_;
  std::array<uint8_t, 0x80> skip_{};
};

// Find's answer (-1 when absent) for a marker.
std::ptrdiff_t FirstAt(std::u16string_view text, const Marker& marker) {
  const std::size_t at = marker.In(text);
  return at == kNone ? -1 : static_cast<std::ptrdiff_t>(at);
}

constexpr Marker kTableOpen{u"<table"};
constexpr Marker kTableClose{u"</table>"};
constexpr Marker kBodyOpen{u"<tbody>"};
constexpr Marker kHeaderCellEnd{u"</th>"};
constexpr Marker kDataCellEnd{u"</td>"};
constexpr Marker kRowEnd{u"</tr>"};
constexpr Marker kBoldMarker{u"<strong>"};
constexpr Marker kEmptyParagraph{u"<p>&nbsp;</p>"};
constexpr std::u16string_view kReferenceOpen = u"&#";

// The first occurrence of a marker at or after a position that only ever
// grows. Remembering the last answer keeps a scan that asks again and again
// from drifting into quadratic time: the text between two asks is never
// searched twice.
class ForwardSearch {
 public:
  ForwardSearch(std::u16string_view text, const Marker& marker) : text_(text), marker_(marker) {}

  std::size_t From(std::size_t from) {
    if (!searched_ || (hit_ != kNone && hit_ < from)) {
      hit_ = marker_.In(text_, from);
      searched_ = true;
    }
    return hit_;
  }

 private:
  std::u16string_view text_;
  const Marker& marker_;
  std::size_t hit_ = kNone;
  bool searched_ = false;
};

std::u16string CellText(std::u16string_view piece, bool data_cell) {
  std::u16string replaced;
  if (data_cell && kEmptyParagraph.In(piece) != kNone) {
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
    rest = MidView(body, FirstAt(body, kTableOpen));
  } else if (tableIndex == 1) {
    rest = MidView(body, FirstAt(body, kTableClose));
  } else {
    return;
  }
  std::size_t from = 0;
  for (std::size_t end; (end = kHeaderCellEnd.In(rest, from)) != kNone;
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
    rest = MidView(body, FirstAt(body, kBodyOpen));
  } else if (tableIndex == 1) {
    rest = MidView(body, FirstAt(body, kTableClose));
  } else {
    return;
  }
  std::size_t from = 0;
  for (std::size_t end; (end = kRowEnd.In(rest, from)) != kNone;
       from = end + kRowEnd.size()) {
    const std::u16string_view row = rest.substr(from, end - from);
    // Bold rows are captions and group titles inside the table, not data.
    if (kBoldMarker.In(row) != kNone) continue;
    CRowHtml candidate;
    std::size_t cell_from = 0;
    for (std::size_t cell_end; (cell_end = kDataCellEnd.In(row, cell_from)) != kNone;
         cell_from = cell_end + kDataCellEnd.size()) {
      candidate.cells.push_back(CellText(row.substr(cell_from, cell_end - cell_from), true));
    }
    if (!candidate.cells.empty()) rowList.push_back(std::move(candidate));
  }
}

}  // namespace asum
