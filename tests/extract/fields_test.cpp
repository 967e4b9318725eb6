#include "extract/body_fields.h"

#include <gtest/gtest.h>

#include "extract/subject.h"
#include "support/test_support.h"

namespace asum {
namespace {

using Texts = std::vector<std::u16string>;

// Outputs start as this, so "left unwritten" and "written empty" differ.
const std::u16string U = u"<unset>";

struct Case {
  std::u16string_view subject;
  Texts want;  // action, threshold, type, name[, component, server], category
};

// Five outputs call the predefined alert variant, seven the general one.
TEST(GetSomeInfoFromScriptSubject, BothVariantsFillTheirFields) {
  const std::u16string kAd = u"Active Directory, Exchange Server & Group Policy";
  const Case cases[] = {
      {u"Potential Data Leakage Alert: Script Execution: Files copied!! ",
       {u"Email Alert", u"N\\A", u"Potential Data Leakage : Script Execution", u"Files copied", u"Email Sent"}},
      {u"Potential Data Leakage!", {u"Email Alert", u"N\\A", u"", u"Potential Data Leakage", u"Email Sent"}},
      // "Script Execution" wins over "Threshold"; the type ends at the quote.
      {u"Script Execution Threshold: Logon Script \"Night Run\" (x)",
       {u"Script Alert", u"N\\A", u"Logon Script", u"Night Run", U}},
      {u"Script Execution: no quotes", {u"Script Alert", u"N\\A", U, U, U}},
      // Three characters after the colon are dropped unread.
      {u"Account Threshold Alert: - Many Logons\"  ",
       {u"Email Alert", u"Yes", u"Account", u"Many Logons", u"Many Logons"}},
      {u"Account Threshold Alert: - Many Logons\" (more)", {u"Email Alert", u"Yes", u"Account", u"Many Logons", U}},
      {u"Object Change Alert: \"Deleted Files\" (x)", {u"Email Alert", u"No", u"Object Change", u"eleted Files", U}},
      {u"Just \"a name", {U, U, U, u"Just ", U}}, {u"Plain words", {U, U, U, U, U}}, {u"", {U, U, U, U, U}},
      // Nothing follows: the Category takes whatever the Alert Name holds.
      {u"X:", {u"Email Alert", u"No", u"X", U, U}},
      {u"Email Alert: File Access \"Deleted Files\" (FS01(File Server)\\Reports\\Deletions\\x)",
       {u"Email Alert", u"No", u"File Access", u"Deleted Files", u"File Server", u"FS01", u"Reports\\Deletions"}},
      {u"Threshold Alert: Logons \"Too \"many\" (DB1(SQL)\\Audit\\Logons\\y)",
       {u"Email Alert", u"Yes", u"Logons", u"Too \"many", u"SQL Server", u"DB1", u"Audit\\Logons"}},
      {u"A: T \"N\" (SP1(SharePoint)\\R\\x)", {u"Email Alert", u"No", u"T", u"N", u"SharePoint Server", u"SP1", u"R"}},
      {u"A: T \"N\" (DB1(sql)\\R\\x)", {u"Email Alert", u"No", u"T", u"N", u"sql", u"DB1", u"R"}},
      {u"A: T \"N\" (DB1(SQL) \\R\\x)", {u"Email Alert", u"No", u"T", u"N", u"SQL ", u"DB1", u"R"}},
      {u"Script Execution Threshold: Policy \"GPO Changed\" (DC01\\Reports\\GPO\\z)",
       {u"Script Alert", u"N\\A", u"Policy", u"GPO Changed", kAd, U, u"Reports\\GPO"}},
      {u"A: T \"N\" (S1(C)\\Report)", {u"Email Alert", u"No", u"T", u"N", u"C", u"S1", u""}},
      {u"A: T \"Name\"", {u"Email Alert", u"No", u"T", u"Name", u"Threat Models", U, u"Name"}},
      {u"A: T \"N\" (Account Lockout Report)", {u"Email Alert", u"No", u"T", u"N", U, U, u"Account Lockout Report"}},
      {u"A: T \"N\" (Account Lockout Report) more", {u"Email Alert", u"No", u"T", u"N", U, U, u""}},
      {u"T \"N\" (X)", {U, U, u"T", u"N", U, U, u"X"}}, {u"no colon, no quote", {U, U, U, U, U, U, u""}},
      {u"Alert: nothing quoted", {u"Email Alert", u"No", U, U, U, U, u""}}, {u"", {U, U, U, U, U, U, U}},
      {u"A:", {u"Email Alert", u"No", U, U, u"Threat Models", U, U}},
  };
  for (const Case& c : cases) {
    Texts got(c.want.size(), U);
    if (got.size() == 5) {
      GetSomeInfoFromScriptSubject(c.subject, got[0], got[1], got[2], got[3], got[4]);
    } else {
      GetSomeInfoFromScriptSubject(c.subject, got[0], got[1], got[2], got[3], got[4], got[5], got[6]);
    }
    EXPECT_EQ(got, c.want) << test::Narrow(c.subject);
  }
}

TEST(ParseHtmlBodyToGetComponentInfo, ReadsWhereTheActionSays) {
  const std::u16string_view email = u"Email Alert", script = u"Script Alert";
  const struct {
    std::u16string_view body, action, want;
  } cases[] = {
      {u"<p>Raised on <b>File Server(s).</b></p><p>x.</b></p>", email, u"File Server"}, {u"", script, u""},
      {u"<p><b>&#70;&#83;(s).</b></p>", email, u"FS"}, {u"<p><b>File Server.</b> </p>", email, u""},
      {u"<p>on <b>X</b></p><p><b>Y.</b></p>", email, u"Y"}, {u"<p><b>File Server.</b></p>", u"email alert", u""},
      {u"<p>Component Name  : Exchange</p><p>Report Name  : r</p>", script, u"Exchange"},
      {u"<p><b>Component Name  :</b> &#65;&#68;</p><p>Report Name  :", script, u"AD"},
      {u"Report Name  : r Component Name  : X</p>", script, u""}, {u"Component Name  : X Report Name  :", script, u""},
      {u"Component Name : X</p>Report Name  :", script, u""}, {u"Component Name  : X</p>Report Name :", script, u""},
      {u"<p>Component Name  : X</p><p>Report Name  :", email, u""},
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
  const std::u16string one = Table(u"<th>Who</th>", u"<tr><td>1</td></tr>"),
                       two = Table(u"<th>Who</th>", u"<tr><td>2</td></tr>");
  const struct {
    std::u16string body;
    std::u16string_view field, want;
  } cases[] = {
      {body, u"Who", u"ALICE, Bob, Carol"}, {body, u"Operation", u"Read, READ"}, {body, u"who", u""},
      {body, u"Server", u"S1, FS1, FS2, S2"},
      {body, u"File Server", u"FS1(File Server), FS2(File Server), S1(File Server)"},
      {body, u"", u"ALICE, Read, S1, FS1, alice, READ, FS2, Bob, S2, Carol"},
      {Table(u"<th>Who</th>", u""), u"Who", u""}, {u"<p>no table</p>", u"Who", u""},
      {one + two, u"Who", u"2"}, {one + two + two, u"Who", u""},
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
