#include "extract/html_table.h"

#include <gtest/gtest.h>

#include "support/test_support.h"

namespace asum {
namespace {

using Texts = std::vector<std::u16string>;

TEST(DecodeHtmlNumericEntities, ReadsRunsOfReferences) {
  struct Case { std::u16string_view text; std::u16string want; };
  const Case cases[] = {
      {u"&#72;&#105;", u"Hi"},
      {u"&#72;&#105;!", u"Hi"},            // text after the last ';' is dropped
      {u"FileServer", u"FileServer"},      // no ';': unchanged
      {u"", u""},
      {u"word;word", std::u16string(1, u'\0')},
      {u"&nbsp;", std::u16string(1, u'\0')},  // named references are not known
      {u"&#70;&nbsp;&#49;", std::u16string(u"F\0" u"1", 3)},
      {u"&# 65;&#&#66;;", std::u16string(u"AB\0", 3)},
      {u"&#-1;&#65601;", u"\uFFFF" u"A"},  // low 16 bits of the number
      {u"&#99999999999;", u"\uFFFF"},      // clamped to 2147483647 first
      {u"&#55357;", u"\xD83D"},            // a lone surrogate passes through
  };
  for (const Case& c : cases) {
    EXPECT_EQ(DecodeHtmlNumericEntities(c.text), c.want) << test::Narrow(std::u16string(c.text));
  }
}

TEST(GetTableIndex, IndexOfLastTable) {
  struct Case { std::u16string_view body; int want; };
  const Case cases[] = {
      {u"", -1},
      {u"<p>no table</p>", -1},
      {u"<table></table>", 0},
      {u"x<table>a</table>y", 0},
      {u"<table>a</table><table>b</table>", 1},
      {u"<table></table><table></table><table></table>", 2},
      {u"<table></table>\n<table></table>", 1},
      {u"<table><table></table>", 0},        // nested: counted by closings
      {u"<table x", 0},                       // no closing tag
      {u"</table><table", 1},
      {u"<tab", -1},
  };
  for (const Case& c : cases) EXPECT_EQ(GetTableIndex(c.body), c.want) << test::Narrow(std::u16string(c.body));
}

constexpr std::u16string_view kOneTable =
    u"<html><table><tr><th>Who</th><th><b>Server</b> Name</th></tr>"
    u"<tbody><tr><td>Alice</td><td>S1</td></tr>"
    u"<tr><td><strong>Group</strong></td><td>x</td></tr>"
    u"<tr><td><p>&nbsp;</p></td><td><p>S2</p></td></tr>"
    u"</tr><tr><th>A</th></tr>"
    u"<tr><td>&#70;&#83;&#49;</td><td>before<i>after</i></td><td>extra</td></tr></tbody></table>";

TEST(HtmlTableReaders, HeadersAndRowsOfSelectedTable) {
  const std::u16string second =
      u"<table><tr><th>Ignored</th></tr><tr><td>first</td></tr></table>"
      u"<table><tr><th>Op</th></tr><tr><td>Read</td></tr></table>"
      u"<table><tr><th>Late</th></tr><tr><td>Third</td></tr></table>";
  struct Case { std::u16string_view body; int index; Texts headers; std::vector<Texts> rows; };
  const Case cases[] = {
      // th cells before <tbody> are not rows, but every th up to the end is a
      // header; <strong>, th-only and empty rows are passed over; an empty
      // paragraph is one blank; an inner closing tag leaves nothing.
      {kOneTable, 0, {u"Who", u" Name", u"A"}, {{u"Alice", u"S1"}, {u" ", u""}, {u"FS1", u"", u"extra"}}},
      // Index 1 starts at the first "</table>" and reads to the end.
      {second, 1, {u"Op", u"Late"}, {{u"Read"}, {u"Third"}}},
      {second, 2, {}, {}},
      {second, -1, {}, {}},
      {u"", 0, {}, {}},
      // Missing start markers: from the beginning of the text.
      {u"<th>H</th><tr><td>C</td></tr>", 0, {u"H"}, {{u"C"}}},
      {u"<th>H</th><tr><td>C</td></tr>", 1, {u"H"}, {{u"C"}}},
      {u"<tr><td>a</td>", 0, {}, {}},  // row never closed
  };
  for (const Case& c : cases) {
    Texts headers{u"kept"};
    std::vector<CRowHtml> rows(1);
    GetAllColFromHtmlTable(c.index, headers, c.body);
    GetAllRowFromHtmlTable(c.index, c.body, rows);
    Texts want_headers{u"kept"};
    want_headers.insert(want_headers.end(), c.headers.begin(), c.headers.end());
    EXPECT_EQ(headers, want_headers) << test::Narrow(std::u16string(c.body));
    ASSERT_EQ(rows.size(), c.rows.size() + 1) << test::Narrow(std::u16string(c.body));
    for (std::size_t i = 0; i < c.rows.size(); ++i) EXPECT_EQ(rows[i + 1].cells, c.rows[i]);
  }
}

TEST(HtmlTableReaders, LogEntryLineFirstEvenForEmptyText) {
  test::CapturedLog log;
  Texts headers;
  std::vector<CRowHtml> rows;
  GetTableIndex(u"");
  GetAllColFromHtmlTable(0, headers, u"");
  GetAllRowFromHtmlTable(5, u"<tr><td>x</td></tr>", rows);
  EXPECT_EQ(log.Messages(), (Texts{u"Inside GetTableIndex function", u"Inside GetAllColFromHtmlTable function",
                                   u"Inside GetAllRowFromHtmlTable function"}));
}

}  // namespace
}  // namespace asum
