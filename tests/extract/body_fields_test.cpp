#include "extract/body_fields.h"

#include <gtest/gtest.h>

#include "support/test_support.h"

namespace asum {
namespace {

TEST(ParseHtmlBodyToGetComponentInfo, ReadsWhereTheActionSays) {
  struct Case { std::u16string_view body, action, want; };
  const Case cases[] = {
      {u"<p>Raised on <b>File Server(s).</b></p><p>x.</b></p>", u"Email Alert", u"File Server"},
      {u"<p><b>&#70;&#83;(s).</b></p>", u"Email Alert", u"FS"},
      {u"<p><b>File Server.</b> </p>", u"Email Alert", u""},
      {u"<p>Component Name  : Exchange</p><p>Report Name  : r</p>", u"Script Alert", u"Exchange"},
      {u"<p><b>Component Name  :</b> &#65;&#68;</p><p>Report Name  :", u"Script Alert", u"AD"},
      {u"<p>Report Name  : r</p><p>Component Name  : X</p>", u"Script Alert", u""},
      {u"<p>Component Name  : X Report Name  :</p>", u"Script Alert", u""},
      {u"<p>Component Name : X</p><p>Report Name  : r</p>", u"Script Alert", u""},
      {u"<p><b>File Server.</b></p>", u"email alert", u""},
      {u"<p>Component Name  : X</p><p>Report Name  :", u"Email Alert", u""},
      {u"", u"Script Alert", u""},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(ParseHtmlBodyToGetComponentInfo(c.body, c.action), c.want) << test::Narrow(std::u16string(c.body));
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
  struct Case { std::u16string_view field, want; };
  const Case cases[] = {
      {u"Who", u"ALICE, Bob, Carol"},
      {u"Operation", u"Read, READ"},
      {u"Server", u"S1, FS1, FS2, S2"},
      {u"File Server", u"FS1(File Server), FS2(File Server), S1(File Server)"},
      {u"who", u""},
      {u"", u"ALICE, Read, S1, FS1, alice, READ, FS2, Bob, S2, Carol"},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(ParseHtmlBodyAndGetFieldData(body, c.field), c.want) << test::Narrow(std::u16string(c.field));
  }
}

TEST(ParseHtmlBodyAndGetFieldData, TableSelectionAndEmptyValues) {
  const std::u16string one = Table(u"<th>Op</th>", u"<tr><td>first</td></tr>");
  const std::u16string two = Table(u"<th>Op</th>", u"<tr><td>second</td></tr>");
  struct Case { std::u16string body; std::u16string_view want; };
  const Case cases[] = {
      {Table(u"<th>Op</th>", u""), u""},
      {one + two, u"second"},
      {one + two + two, u""},
      {u"<p>no table</p>", u""},
      // An empty first value adds no separator; a later empty one does.
      {Table(u"<th>Op</th>", u"<tr><td><i>x</i></td></tr><tr><td>A</td></tr>"), u"A"},
      {Table(u"<th>Op</th>", u"<tr><td>A</td></tr><tr><td><i>x</i></td></tr>"), u"A, "},
  };
  for (const Case& c : cases) EXPECT_EQ(ParseHtmlBodyAndGetFieldData(c.body, u"Op"), c.want) << test::Narrow(c.body);
}

TEST(ParseHtmlBodyAndGetFieldData, LogLines) {
  using Texts = std::vector<std::u16string>;
  test::CapturedLog log;
  ParseHtmlBodyAndGetFieldData(u"", u"Who");
  EXPECT_EQ(log.Messages(), (Texts{u"Inside ParseHtmlBodyAndGetFieldData function"}));
  ParseHtmlBodyAndGetFieldData(u"<table>", u"Who");
  ParseHtmlBodyToGetComponentInfo(u"", u"");
  const Texts all = log.Messages();
  EXPECT_EQ(Texts(all.begin() + 1, all.end()),
            (Texts{u"Inside ParseHtmlBodyAndGetFieldData function", u"Inside GetTableIndex function",
                   u"Inside GetAllColFromHtmlTable function", u"Inside GetAllRowFromHtmlTable function",
                   u"After calling \"GetAllRowFromHtmlTable\" function",
                   u"Inside ParseHtmlBodyToGetComponentInfo function"}));
}

TEST(BodyFieldReader, AnswersAndLogsAsSeparateCallsDo) {
  const std::u16string body =
      u"<table><tr><th>Who</th><th>Server Name</th><th>File Server</th></tr><tbody>"
      u"<tr><td>ALICE</td><td>S1</td><td>F1</td></tr><tr><td>alice</td><td>S2</td><td>F1</td></tr></tbody></table>";
  const std::u16string fields[] = {u"Who", u"Server", u"File Server", u"Nothing", u"Who"};
  std::vector<std::u16string> separate, together;
  std::vector<std::u16string> separate_log, together_log;
  {
    test::CapturedLog log;
    for (const auto& f : fields) separate.push_back(ParseHtmlBodyAndGetFieldData(body, f));
    separate_log = log.Messages();
  }
  {
    test::CapturedLog log;
    BodyFieldReader reader(body);
    for (const auto& f : fields) together.push_back(reader.FieldData(f));
    together_log = log.Messages();
  }
  EXPECT_EQ(together, separate);
  EXPECT_EQ(together_log, separate_log);
  EXPECT_EQ(together[1], u"S1, F1, S2");
}

}  // namespace
}  // namespace asum
