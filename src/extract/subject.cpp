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
  std::u16string s(subject);

  if (Contains(s, kDataLeakage)) {
    const std::ptrdiff_t c = ReverseFind(s, u':');
    std::u16string type = Left(s, c);
    alertName = Trim(Replace(Mid(s, c + 1), u"!", u""));
    category = u"Email Sent";
    alertAction = kEmailAlert;
    threshold = kThresholdNone;
    alertType = Trim(Replace(type, u"Alert", u""));
    return;
  }

  const std::ptrdiff_t p = Find(s, u":");
  if (p >= 0) {
    const std::u16string prefix = Left(s, p);
    if (Contains(prefix, kScriptWords)) {
      alertAction = kScriptAlert;
      threshold = kThresholdNone;
      s = Mid(s, p + 1);
      const std::ptrdiff_t q = Find(s, u"\"");
      if (!s.empty() && q >= 0) {
        alertType = Trim(Left(s, q));
        s = Mid(s, q + 1);
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
      s = Right(s, Length(s) - p - 4);
    }
  }

  // The quote that ends the name is followed by two characters (a blank and
  // an opening parenthesis) that are dropped with it.
  const std::ptrdiff_t q = Find(s, u"\"");
  if (q >= 0) {
    alertName = Left(s, q);
    s = Right(s, Length(s) - q - 3);
  }
  // A subject that ends with its name files the alert under that name.
  if (s.empty()) category = alertName;
}

void GetSomeInfoFromScriptSubject(std::u16string_view subject, std::u16string& alertAction,
                                  std::u16string& threshold, std::u16string& alertType,
                                  std::u16string& alertName, std::u16string& componentName,
                                  std::u16string& serverName, std::u16string& category) {
  LogEntry();
  if (subject.empty()) return;
  std::u16string s(subject);

  const std::ptrdiff_t p = Find(s, u":");
  if (p >= 0) {
    const std::u16string_view prefix = LeftView(s, p);
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
    s = Mid(s, p + 1);
  }

  const std::ptrdiff_t q = Find(s, u"\"");
  if (!s.empty() && q >= 0) {
    alertType = Trim(Left(s, q));
    s = Mid(s, q + 1);
  }

  // The name ends preferably at the quote that opens the "(server...)" tail,
  // so a name that itself holds a quote survives.
  std::ptrdiff_t r = Find(s, u"\" (");
  if (r < 0) r = Find(s, u"\"");
  if (r >= 0) {
    alertName = Left(s, r);
    s = Right(s, Length(s) - r - 3);
  }

  if (s.empty()) {
    category = alertName;
    componentName = kThreatModels;
    return;
  }

  const std::ptrdiff_t t = Find(s, u"\\");
  if (t >= 0) {
    const std::u16string_view part = LeftView(s, t);
    const std::ptrdiff_t u = Find(part, u"(");
    if (u >= 0) {
      serverName = Left(part, u);
      componentName = Replace(Replace(MidView(part, u + 1), u"(", u""), u")", u"");
      if (componentName == u"SQL" || componentName == u"SharePoint") componentName += u" Server";
    } else {
      componentName = u"Active Directory, Exchange Server & Group Policy";
    }
    s = Mid(s, t + 1);
  } else {
    const std::ptrdiff_t v = Find(s, u")");
    if (v >= 0) {
      category = Left(s, v);
      s = Mid(s, v + 1);
    }
  }

  // The Category is the report path up to its last backslash; a tail with no
  // backslash left clears what the ')' step set.
  if (!s.empty() && componentName != kThreatModels) {
    category = Left(s, ReverseFind(s, u'\\'));
  }
}

}  // namespace asum
