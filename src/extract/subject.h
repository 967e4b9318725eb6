// Cuts an alert e-mail's subject into the alert fields it carries:
// Alert Action ("Email Alert" / "Script Alert"), Threshold ("Yes" / "No" /
// "N\A"), Alert Type, Alert Name and the working Category; the general
// variant also reads Server Name and Component Name from the subject's
// parenthesised tail.
//
// Two overloads of one name:
//   - predefined-alert variant (alerts of the "Predefine Alerts" folder; knows
//     the "Potential Data Leakage" alert; no server or component);
//   - general variant (every other alert folder).
//
// Outputs are in/out references. An output that the subject's path does not
// write keeps the value the caller passed (the caller normally passes empty
// texts), and some steps read an output's current value back: the
// predefined variant may copy the Alert Name into Category, the general
// variant compares the Component Name with "Threat Models". An empty subject
// writes nothing.
//
// Both log "Inside GetSomeInfoFromScriptSubject function" first. Pure apart
// from the log; callable from any thread; never fails on any subject; nothing
// is thrown but std::bad_alloc.
#pragma once

#include <string>
#include <string_view>

namespace asum {

// Predefined-alert variant.
void GetSomeInfoFromScriptSubject(std::u16string_view subject, std::u16string& alertAction,
                                  std::u16string& threshold, std::u16string& alertType,
                                  std::u16string& alertName, std::u16string& category);

// General variant.
void GetSomeInfoFromScriptSubject(std::u16string_view subject, std::u16string& alertAction,
                                  std::u16string& threshold, std::u16string& alertType,
                                  std::u16string& alertName, std::u16string& componentName,
                                  std::u16string& serverName, std::u16string& category);

}  // namespace asum
