#include "extract/subject.h"

#include "extract/alert_values.h"
#include "extract/text_ops.h"
#include "log/log.h"

namespace asum {

namespace {

constexpr std::u16string_view kScriptWords = u"Script Execution";
constexpr std::u16string_view kThresholdWord = u"Threshold";

constexpr std::u16string_view kThresholdYes = u"Yes";
constexpr std::u16string_view kThresholdNo = u"No";
constexpr std::u16string_view kThresholdNone = u"N\\A";
constexpr std::u16string_view kThreatModels = u"Threat Models";

bool Contains(std::u16string_view text, std::u16string_view marker) {
  return Find(text, marker) >= 0;
}

std::u16string Trim(std::u16string_view text) { return TrimLeft(TrimRight(text)); }

std::ptrdiff_t Length(std::u16string_view text) {
  return static_cast<std::ptrdiff_t>(text.size());
}

void LogEntry() { WriteLog(u"Inside GetSomeInfoFromScriptSubject function"); }

}  // namespace

void GetSomeInfoFromScriptSubject(std::u16string_view subject, std::u16string& alertAction,
                                  std::u16string& threshold, std::u16string& alertType,
                                  std::u16string& alertName, std::u16string& category) {
  LogEntry();
  if (subject.empty()) return;
  std::u16string rest(subject);

  if (Contains(rest, kDataLeakage)) {
    const std::ptrdiff_t lastColon = ReverseFind(rest, u':');
    std::u16string type = Left(rest, lastColon);
    alertName = Trim(Replace(Mid(rest, lastColon + 1), u"!", u""));
    category = u"Email Sent";
    alertAction = kEmailAlert;
    threshold = kThresholdNone;
    alertType = Trim(Replace(type, u"Alert", u""));
    return;
  }

  const std::ptrdiff_t colon = Find(rest, u":");
  if (colon >= 0) {
    const std::u16string prefix = Left(rest, colon);
    if (Contains(prefix, kScriptWords)) {
      alertAction = kScriptAlert;
      threshold = kThresholdNone;
      rest = Mid(rest, colon + 1);
      const std::ptrdiff_t quote = Find(rest, u"\"");
      if (!rest.empty() && quote >= 0) {
        alertType = Trim(Left(rest, quote));
        rest = Mid(rest, quote + 1);
      }
    } else {
      // These subjects put three characters (a blank, a quote, ...) between
      // the colon and the Alert Name; they are dropped unread.
      if (Contains(prefix, kThresholdWord)) {
        alertAction = kEmailAlert;
        threshold = kThresholdYes;
        alertType = Trim(Replace(prefix, u"Threshold Alert", u""));
      } else {
        alertAction = kEmailAlert;
        threshold = kThresholdNo;
        alertType = Trim(Replace(prefix, u"Alert", u""));
      }
      rest = Right(rest, Length(rest) - colon - 4);
    }
  }

  // The quote that ends the name is followed by two characters (a blank and
  // an opening parenthesis) that are dropped with it.
  const std::ptrdiff_t quote = Find(rest, u"\"");
  if (quote >= 0) {
    alertName = Left(rest, quote);
    rest = Right(rest, Length(rest) - quote - 3);
  }
  // A subject that ends with its name files the alert under that name.
  if (rest.empty()) category = alertName;
}

void GetSomeInfoFromScriptSubject(std::u16string_view subject, std::u16string& alertAction,
                                  std::u16string& threshold, std::u16string& alertType,
                                  std::u16string& alertName, std::u16string& componentName,
                                  std::u16string& serverName, std::u16string& category) {
  LogEntry();
  if (subject.empty()) return;
  std::u16string rest(subject);

  const std::ptrdiff_t colon = Find(rest, u":");
  if (colon >= 0) {
    const std::u16string_view prefix = LeftView(rest, colon);
    if (Contains(prefix, kScriptWords)) {
      alertAction = kScriptAlert;
      threshold = kThresholdNone;
    } else if (Contains(prefix, kThresholdWord)) {
      alertAction = kEmailAlert;
      threshold = kThresholdYes;
    } else {
      alertAction = kEmailAlert;
      threshold = kThresholdNo;
    }
    rest = Mid(rest, colon + 1);
  }

  const std::ptrdiff_t quote = Find(rest, u"\"");
  if (!rest.empty() && quote >= 0) {
    alertType = Trim(Left(rest, quote));
    rest = Mid(rest, quote + 1);
  }

  // The name ends preferably at the quote that opens the "(server...)" tail,
  // so a name that itself holds a quote survives.
  std::ptrdiff_t nameEnd = Find(rest, u"\" (");
  if (nameEnd < 0) nameEnd = Find(rest, u"\"");
  if (nameEnd >= 0) {
    alertName = Left(rest, nameEnd);
    rest = Right(rest, Length(rest) - nameEnd - 3);
  }

  if (rest.empty()) {
    category = alertName;
    componentName = kThreatModels;
    return;
  }

  const std::ptrdiff_t backslash = Find(rest, u"\\");
  if (backslash >= 0) {
    const std::u16string_view part = LeftView(rest, backslash);
    const std::ptrdiff_t paren = Find(part, u"(");
    if (paren >= 0) {
      serverName = Left(part, paren);
      componentName = Replace(Replace(MidView(part, paren + 1), u"(", u""), u")", u"");
      if (componentName == u"SQL" || componentName == u"SharePoint") componentName += u" Server";
    } else {
      componentName = u"Active Directory, Exchange Server & Group Policy";
    }
    rest = Mid(rest, backslash + 1);
  } else {
    const std::ptrdiff_t closeParen = Find(rest, u")");
    if (closeParen >= 0) {
      category = Left(rest, closeParen);
      rest = Mid(rest, closeParen + 1);
    }
  }

  // The Category is the report path up to its last backslash; a tail with no
  // backslash left clears what the ')' step set.
  if (!rest.empty() && componentName != kThreatModels) {
    category = Left(rest, ReverseFind(rest, u'\\'));
  }
}

}  // namespace asum
