// Reads the tables of an alert e-mail's HTML body by plain text search, without
// a document tree: which table to read (GetTableIndex), the texts of its header
// cells (GetAllColFromHtmlTable) and its data rows (GetAllRowFromHtmlTable).
// Also the decoder of numeric character references that cell texts and the
// alert file processing use.
//
// Usage: t = GetTableIndex(body); then GetAllColFromHtmlTable(t, headers, body)
// and GetAllRowFromHtmlTable(t, body, rows) with the same body.
//
// Cell text: the text after the last '>' before the cell's closing tag, passed
// through DecodeHtmlNumericEntities; in data cells every "<p>&nbsp;</p>" is
// first replaced by " ". No other tag stripping: a cell ending in an inner
// closing tag gives "".
//
// Table index: 0 reads headers from the first "<table" and rows from the first
// "<tbody>"; 1 reads both from the first "</table>" (passing the first table
// over); a start marker that is missing means "from the beginning". Any other
// index reads nothing. Once started, every "</th>" / "</tr>" up to the end of
// the body is read, across later tables.
//
// Pure functions with no shared state: callable from any thread. Each table
// function writes its "Inside ... function" line to the diagnostic log first,
// even for an empty body. Any UTF-16 text is accepted; the work is linear in
// the body's length. Nothing is thrown but std::bad_alloc.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace asum {

// One data row of a table: its cell texts in document order. A row handed out
// by GetAllRowFromHtmlTable always has at least one cell.
struct CRowHtml {
  std::vector<std::u16string> cells;
};

// Turns a run of "&#" digits ";" references into the characters they stand
// for. A text without ';' (or empty) comes back unchanged. Otherwise each
// piece before a ';' has every "&#" removed and is read by WcstolBase10; the
// low 16 bits of the number become one character (a piece without a number
// gives the character of code 0, which stays in the text). Text after the
// last ';' is dropped. Named references are not known: they give code 0.
std::u16string DecodeHtmlNumericEntities(std::u16string_view text);

// The zero-based index of the last table of the body (0 for one table, 1 for
// two), or -1 when the body has no "<table". A body that begins with "<table"
// counts like any other. Logs "Inside GetTableIndex function".
int GetTableIndex(std::u16string_view body);

// Appends the header cell texts of the selected table, and of every table
// after it, to `headerList`; never removes anything from it. Logs
// "Inside GetAllColFromHtmlTable function".
void GetAllColFromHtmlTable(int tableIndex, std::vector<std::u16string>& headerList,
                            std::u16string_view body);

// Appends one CRowHtml per data row of the selected table (and of every table
// after it) to `rowList`, which the caller owns along with its rows. Rows that
// contain "<strong>" and rows without a "</td>" cell are passed over, as is an
// empty row between two "</tr>". Logs "Inside GetAllRowFromHtmlTable function".
void GetAllRowFromHtmlTable(int tableIndex, std::u16string_view body,
                            std::vector<CRowHtml>& rowList);

}  // namespace asum
