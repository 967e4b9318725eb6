#include "extract/subject.h"

#include <gtest/gtest.h>

#include "support/test_support.h"

namespace asum {
namespace {

// Outputs start as this, so "left unwritten" and "written empty" differ.
const std::u16string U = u"<unset>";

// action, threshold, type, name[, component, server], category
using Out = std::vector<std::u16string>;

TEST(GetSomeInfoFromScriptSubject, PredefinedAlertVariant) {
  struct Case { std::u16string_view subject; Out want; };
  const Case cases[] = {
      {u"", {U, U, U, U, U}},
      {u"Potential Data Leakage Alert: Script Execution: Files copied!! ",
       {u"Email Alert", u"N\\A", u"Potential Data Leakage : Script Execution", u"Files copied", u"Email Sent"}},
      {u"Potential Data Leakage!", {u"Email Alert", u"N\\A", u"", u"Potential Data Leakage", u"Email Sent"}},
      // "Script Execution" wins over "Threshold"; the type ends at the quote.
      {u"Script Execution Threshold: Logon Script \"Night Run\" (x)",
       {u"Script Alert", u"N\\A", u"Logon Script", u"Night Run", U}},
      {u"Script Execution: no quotes", {u"Script Alert", u"N\\A", U, U, U}},
      // Three characters after the colon are dropped unread.
      {u"Account Threshold Alert: - Many Logons\"  ", {u"Email Alert", u"Yes", u"Account", u"Many Logons", u"Many Logons"}},
      {u"Account Threshold Alert: - Many Logons\" (more)", {u"Email Alert", u"Yes", u"Account", u"Many Logons", U}},
      {u"Object Change Alert: \"Deleted Files\" (x)", {u"Email Alert", u"No", u"Object Change", u"eleted Files", U}},
      {u"Just \"a name", {U, U, U, u"Just ", U}},
      {u"Plain words", {U, U, U, U, U}},
      // Nothing follows: the Category takes whatever the Alert Name holds.
      {u"X:", {u"Email Alert", u"No", u"X", U, U}},
  };
  for (const Case& c : cases) {
    Out got(5, U);
    GetSomeInfoFromScriptSubject(c.subject, got[0], got[1], got[2], got[3], got[4]);
    EXPECT_EQ(got, c.want) << test::Narrow(c.subject);
  }
}

TEST(GetSomeInfoFromScriptSubject, GeneralVariant) {
  const std::u16string kAd = u"Active Directory, Exchange Server & Group Policy";
  struct Case { std::u16string_view subject; Out want; };
  const Case cases[] = {
      {u"", {U, U, U, U, U, U, U}},
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
      {u"T \"N\" (X)", {U, U, u"T", u"N", U, U, u"X"}},
      {u"Alert: nothing quoted", {u"Email Alert", u"No", U, U, U, U, u""}},
      {u"no colon, no quote", {U, U, U, U, U, U, u""}},
      {u"A:", {u"Email Alert", u"No", U, U, u"Threat Models", U, U}},
  };
  for (const Case& c : cases) {
    Out got(7, U);
    GetSomeInfoFromScriptSubject(c.subject, got[0], got[1], got[2], got[3], got[4], got[5], got[6]);
    EXPECT_EQ(got, c.want) << test::Narrow(c.subject);
  }
}

}  // namespace
}  // namespace asum
