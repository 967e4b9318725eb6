// Reads structured MIME header values such as
// `text/html; charset="utf-8"; name=report.html`.
//
// Pure and thread-safe; one linear pass per call, whatever the number of ';'.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace asum::mail {

// The value before its first ';', trimmed ("text/html").
std::string_view MainValue(std::string_view value);

// The first parameter of that name (ASCII case ignored), unquoted; none when
// absent. Quoted values may hold ';' and backslash escapes.
std::optional<std::string> Parameter(std::string_view value, std::string_view name);

}  // namespace asum::mail
