// Reads structured MIME header values such as
// `text/html; charset="utf-8"; name=report.html`, including parameters in
// the RFC 2231 form: `boundary*=us-ascii''abc`, and values continued over
// numbered sections (`name*0*=utf-8''caf%C3%A9; name*1=.pdf`), with their
// charset and language prefix and percent-encoding.
//
// Pure apart from code page conversion through platform::Current(); thread-
// safe; one pass over the value per call (the sections of a continued value
// are sorted by their numbers).
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace asum::mail {

// The value before its first ';', trimmed ("text/html").
std::string_view MainValue(std::string_view value);

// The parameter of that name (ASCII case ignored), unquoted; none when
// absent. Quoted values may hold ';' and backslash escapes. The RFC 2231
// form wins over a plain one of the same name, since writers give the plain
// one only as a fallback for older readers: first `name*`, then the sections
// `name*0`, `name*1`... (read up to the first missing number), then the first
// plain `name`. An RFC 2231 value is percent-decoded and, when it is not
// plain ASCII, converted to UTF-8 from its declared charset.
std::optional<std::string> Parameter(std::string_view value, std::string_view name);

}  // namespace asum::mail
