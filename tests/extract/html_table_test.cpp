#include "extract/html_table.h"

#include <gtest/gtest.h>

#include "extract/text_ops.h"
#include "support/test_support.h"

namespace asum {
namespace {

using Texts = std::vector<std::u16string>;

TEST(TextOps, CutsClampAndReplaceScansOnce) {
  const std::pair<std::u16string, std::u16string> cases[] = {
      {Left(u"abc", -1), u""},    {Left(u"abc", 2), u"ab"},   {Left(u"abc", 99), u"abc"}, {Right(u"abc", -5), u""},
      {Right(u"abc", 1), u"c"},   {Right(u"abc", 4), u"abc"}, {Mid(u"abc", -1), u"abc"},  {Mid(u"abc", 1), u"bc"},
      {Mid(u"abc", 7), u""},      {Replace(u"aaa", u"aa", u"b"), u"ba"}, {Replace(u"&&##7", u"&#", u""), u"&#7"},
      {Replace(u"abc", u"", u"z"), u"abc"}, {Replace(u"a", u"a", u"aa"), u"aa"},
      {TrimLeft(u" \u3000x \u00A0"), u"x \u00A0"}, {TrimRight(u" \u3000x \u00A0"), u" \u3000x"},
  };
  for (const auto& [got, want] : cases) EXPECT_EQ(got, want) << test::Narrow(want);
  const std::pair<std::ptrdiff_t, std::ptrdiff_t> found[] = {
      {Find(u"a::b", u"::"), 1}, {Find(u"ab", u"B"), -1}, {ReverseFind(u"a:b:c", u':'), 3},
      {ReverseFind(u"abc", u':'), -1}};
  for (const auto& [got, want] : found) EXPECT_EQ(got, want);
}

TEST(DecodeHtmlNumericEntities, ReadsRunsOfReferences) {
  const std::pair<std::u16string_view, std::u16string> cases[] = {
      // Text after the last ';' is dropped; no ';' leaves the text as it is;
      // named references are not known; the low 16 bits of the number count.
      {u"&#72;&#105;", u"Hi"}, {u"&#72;&#105;!", u"Hi"}, {u"FileServer", u"FileServer"}, {u"", u""},
      {u"word;word", std::u16string(1, u'\0')}, {u"&nbsp;", std::u16string(1, u'\0')},
      {u"&#70;&nbsp;&#49;", std::u16string(u"F\0" u"1", 3)}, {u"&# 65;&#&#66;;", std::u16string(u"AB\0", 3)},
      {u"&#-1;&#65601;", u"\uFFFF" u"A"}, {u"&#99999999999;", u"\uFFFF"}, {u"&#55357;", u"\xD83D"},
  };
  for (const auto& [text, want] : cases) EXPECT_EQ(DecodeHtmlNumericEntities(text), want) << test::Narrow(text);
}

TEST(GetTableIndex, IndexOfLastTable) {
  // Counted by closings; without a "</table>" a step passes over 7 characters.
  const std::pair<std::u16string_view, int> cases[] = {
      {u"", -1}, {u"<p>no table</p>", -1}, {u"<tab", -1}, {u"<table></table>", 0}, {u"x<table>a</table>y", 0},
      {u"<table>a</table><table>b</table>", 1}, {u"<table></table><table></table><table></table>", 2},
      {u"<table><table></table>", 0}, {u"<table x", 0}, {u"<table <table", 1}, {u"</table><table", 1},
  };
  for (const auto& [body, want] : cases) EXPECT_EQ(GetTableIndex(body), want) << test::Narrow(body);
}

constexpr std::u16string_view kOneTable =
    u"<html><table><tr><th>Who</th><th><b>Server</b> Name</th></tr><tr><td>caption</td></tr>"
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
  const struct {
    std::u16string_view body;
    int index;
    Texts headers;
    std::vector<Texts> rows;
  } cases[] = {
      // Rows start at "<tbody>", every th up to the end is a header; <strong>, th-only and empty rows are
      // passed over; an empty paragraph is one blank; an inner closing tag leaves nothing.
      {kOneTable, 0, {u"Who", u" Name", u"A"}, {{u"Alice", u"S1"}, {u" ", u""}, {u"FS1", u"", u"extra"}}},
      // Index 1 starts at the first "</table>" and reads to the end.
      {second, 1, {u"Op", u"Late"}, {{u"Read"}, {u"Third"}}}, {second, 2, {}, {}}, {second, -1, {}, {}},
      // Missing start markers: from the beginning of the text. A row never closed is none.
      {u"<th>H</th><tr><td>C</td></tr>", 0, {u"H"}, {{u"C"}}}, {u"<th>H</th><tr><td>C</td></tr>", 1, {u"H"}, {{u"C"}}},
      {u"<tr><td>a</td>", 0, {}, {}}, {u"", 0, {}, {}},
  };
  for (const auto& c : cases) {
    Texts headers{u"kept"};
    std::vector<CRowHtml> rows(1);
    GetAllColFromHtmlTable(c.index, headers, c.body);
    GetAllRowFromHtmlTable(c.index, c.body, rows);
    Texts want_headers{u"kept"};
    want_headers.insert(want_headers.end(), c.headers.begin(), c.headers.end());
    EXPECT_EQ(headers, want_headers) << test::Narrow(c.body);
    ASSERT_EQ(rows.size(), c.rows.size() + 1) << test::Narrow(c.body);
    for (std::size_t i = 0; i < c.rows.size(); ++i) EXPECT_EQ(rows[i + 1].cells, c.rows[i]);
  }
}

}  // namespace
}  // namespace asum
