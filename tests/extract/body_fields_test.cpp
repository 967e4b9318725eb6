#include "extract/body_fields.h"

#include <gtest/gtest.h>

#include "extract/subject.h"
#include "support/test_support.h"

namespace asum {
namespace {

using Texts = std::vector<std::u16string>;

TEST(ParseHtmlBodyToGetComponentInfo, ReadsWhereTheActionSays) {
  const struct {
    std::u16string_view body, action, want;
  } cases[] = {
      {u"<p>Raised on <b>File Server(s).</b></p><p>x.</b></p>", u"Email Alert", u"File Server"},
      {u"<p><b>&#70;&#83;(s).</b></p>", u"Email Alert", u"FS"},
      {u"<p><b>File Server.</b> </p>", u"Email Alert", u""},
      {u"<p>on <b>X</b></p><p><b>Y.</b></p>", u"Email Alert", u"Y"},
      {u"<p>Component Name  : Exchange</p><p>Report Name  : r</p>", u"Script Alert", u"Exchange"},
      {u"<p><b>Component Name  :</b> &#65;&#68;</p><p>Report Name  :", u"Script Alert", u"AD"},
      {u"<p>Report Name  : r</p><p>Component Name  : X</p>", u"Script Alert", u""},
      {u"<p>Component Name  : X Report Name  :</p>", u"Script Alert", u""},
      {u"<p>Component Name : X</p><p>Report Name  : r</p>", u"Script Alert", u""},
      {u"<p>Component Name  : X</p><p>Report Name : r</p>", u"Script Alert", u""},
      {u"<p><b>File Server.</b></p>", u"email alert", u""},
      {u"<p>Component Name  : X</p><p>Report Name  :", u"Email Alert", u""},
      {u"", u"Script Alert", u""},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(ParseHtmlBodyToGetComponentInfo(c.body, c.action), c.want) << test::Narrow(c.body);
  }
}

std::u16string Table(std::u16string_view header, std::u16string_view rows) {
  return u"<table><tr>" + std::u16string(header) + u"</tr><tbody>" + std::u16string(rows) + u"</tbody></table>";
}

TEST(ParseHtmlBodyAndGetFieldData, JoinsDistinctValuesOfMatchingColumns) {
  const std::u16string body = Table(
      u"<th>Who</th><th>Operation</th><th>Server Name</th><th>File Server</th>",
      u"<tr><td>ALICE</td><td>Read</td><td>S1</td><td>FS1</td></tr>"
      u"<tr><td>alice</td><td>READ</td><td>S1</td><td>FS2</td></tr>"
      u"<tr><td>Bob</td><td>Read</td><td>S2</td><td>S1</td><td>extra</td></tr>"
      u"<tr><td>Carol</td></tr>");
  const std::u16string one = Table(u"<th>Who</th>", u"<tr><td>first</td></tr>");
  const std::u16string two = Table(u"<th>Who</th>", u"<tr><td>second</td></tr>");
  const struct {
    std::u16string body;
    std::u16string_view field, want;
  } cases[] = {
      {body, u"Who", u"ALICE, Bob, Carol"},
      {body, u"Operation", u"Read, READ"},
      {body, u"Server", u"S1, FS1, FS2, S2"},
      {body, u"File Server", u"FS1(File Server), FS2(File Server), S1(File Server)"},
      {body, u"who", u""},
      {body, u"", u"ALICE, Read, S1, FS1, alice, READ, FS2, Bob, S2, Carol"},
      {Table(u"<th>Who</th>", u""), u"Who", u""},
      {one + two, u"Who", u"second"},
      {one + two + two, u"Who", u""},
      {u"<p>no table</p>", u"Who", u""},
      // An empty first value adds no separator; a later empty one does.
      {Table(u"<th>Op</th>", u"<tr><td><i>x</i></td></tr><tr><td>A</td></tr>"), u"Op", u"A"},
      {Table(u"<th>Op</th>", u"<tr><td>A</td></tr><tr><td><i>x</i></td></tr>"), u"Op", u"A, "},
  };
  BodyFieldReader reader(body);  // reads the table once for all its fields
  for (const auto& c : cases) {
    EXPECT_EQ(ParseHtmlBodyAndGetFieldData(c.body, c.field), c.want) << test::Narrow(c.body);
    if (c.body == body) {
      EXPECT_EQ(reader.FieldData(c.field), c.want) << test::Narrow(c.field);
    }
  }
}

// Each function writes its entry line first, also for an empty text; a
// reader asked twice logs as two separate calls do.
TEST(ExtractionLog, EveryFunctionWritesItsLines) {
  test::CapturedLog log;
  std::u16string a, b, c, d, e, f, g;
  std::vector<CRowHtml> rows;
  GetSomeInfoFromScriptSubject(u"", a, b, c, d, e);
  GetSomeInfoFromScriptSubject(u"A: T \"N\"", a, b, c, d, e, f, g);
  GetAllRowFromHtmlTable(5, u"<tr><td>x</td></tr>", rows);
  ParseHtmlBodyToGetComponentInfo(u"", u"");
  ParseHtmlBodyAndGetFieldData(u"", u"Who");
  BodyFieldReader reader(u"<table>");
  reader.FieldData(u"Who"), reader.FieldData(u"Who");
  const std::u16string field = u"Inside ParseHtmlBodyAndGetFieldData function", subject =
      u"Inside GetSomeInfoFromScriptSubject function", rows_line = u"Inside GetAllRowFromHtmlTable function";
  const Texts table = {field, u"Inside GetTableIndex function", u"Inside GetAllColFromHtmlTable function",
                       rows_line, u"After calling \"GetAllRowFromHtmlTable\" function"};
  Texts want = {subject, subject, rows_line, u"Inside ParseHtmlBodyToGetComponentInfo function", field};
  for (int i = 0; i < 2; ++i) want.insert(want.end(), table.begin(), table.end());
  EXPECT_EQ(log.Messages(), want);
}

}  // namespace
}  // namespace asum
