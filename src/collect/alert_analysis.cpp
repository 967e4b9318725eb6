#include "collect/alert_analysis.h"

#include "collect/alert_message.h"
#include "collect/when_text.h"
#include "common/utf.h"
#include "extract/alert_values.h"
#include "extract/body_fields.h"
#include "extract/html_table.h"
#include "extract/subject.h"
#include "extract/text_ops.h"
#include "log/log.h"

namespace asum {
namespace {

constexpr std::u16string_view kOutsideHours = u"Activity Outside of Business Hours";
constexpr std::u16string_view kEnvironmentChanges = u"All Environment Changes";

bool IsActivityCategory(const std::u16string& category) {
  return category == kOutsideHours || category == kEnvironmentChanges;
}

// The performer of a script alert, from the body's "Who  :" paragraph.
std::u16string ScriptAlertWho(const std::u16string& body) {
  const std::ptrdiff_t at = Find(body, u"Who  :");
  if (at < 0) return {};
  std::u16string text = Replace(Mid(body, at), u"Who  :", u"");
  text = Replace(TrimLeft(text), u"</b>", u"");
  // Without a paragraph end there is no name: Left(-1) is empty.
  return DecodeHtmlNumericEntities(Left(text, Find(text, u"</p>")));
}

}  // namespace

AlertAnalysis AnalyzeAlertFile(const std::u16string& path, const std::u16string& status,
                               const std::u16string& component) {
  AlertAnalysis analysis;
  AlertMessage message;
  if (!LoadAlertMessage(path, &message)) return analysis;
  analysis.loaded = true;
  analysis.sender = std::move(message.sender);
  analysis.subject = std::move(message.subject);
  analysis.body = std::move(message.body);
  analysis.local_date = message.local_date;

  AlertRow& row = analysis.row;
  row.when = FormatWhen(analysis.local_date);
  row.email_status = status;
  row.alert_path = DisplayText(path);
  if (analysis.subject.empty() || analysis.body.empty()) {
    WriteLog(u"Alert subject and body are empty.");
    analysis.outcome = AlertOutcome::kMarkWithout;
    return analysis;
  }

  std::u16string category;
  BodyFieldReader fields(analysis.body);
  if (component == u"Predefine Alerts") {
    GetSomeInfoFromScriptSubject(analysis.subject, row.alert_action, row.threshold, row.alert_type, row.alert_name,
                                 category);
    row.component_name = ParseHtmlBodyToGetComponentInfo(analysis.body, row.alert_action);
    if (row.component_name.empty() && row.alert_name == kDataLeakage) row.component_name = u"Exchange Server";
    if (row.alert_action == kEmailAlert) row.server_name = fields.FieldData(u"Server");
  } else {
    GetSomeInfoFromScriptSubject(analysis.subject, row.alert_action, row.threshold, row.alert_type, row.alert_name,
                                 row.component_name, row.server_name, category);
  }

  if (row.alert_action == kEmailAlert) {
    if (IsActivityCategory(category)) {
      row.component_name = fields.FieldData(u"Component Name");
      row.server_name = fields.FieldData(u"Server Name");
    }
    row.who = fields.FieldData(u"Who");
    row.operation = fields.FieldData(u"Operation");
    if (row.who.empty() && row.alert_name == kDataLeakage) row.who = analysis.sender;
  } else if (row.component_name.empty() && IsActivityCategory(category)) {
    row.component_name = ParseHtmlBodyToGetComponentInfo(analysis.body, row.alert_action);
  }

  WriteLog(u"After calling \"ParseHtmlBodyAndGetFieldData\" function Who & Operation Fields are " + row.who +
           u" & " + row.operation);

  if (row.who.empty() && row.alert_action == kScriptAlert) row.who = ScriptAlertWho(analysis.body);
  if (row.who.empty() && category == u"Account Lockout Report") row.who = u"N\\A";
  if (row.operation.empty()) row.operation = category;

  analysis.outcome = row.alert_type.empty() ? AlertOutcome::kMarkWithout : AlertOutcome::kStore;
  return analysis;
}

}  // namespace asum
