#include "mail/mime_params.h"

#include "mail/text_util.h"

namespace asum::mail {

std::string_view MainValue(std::string_view value) {
  const size_t semicolon = value.find(';');
  return TrimBlanks(value.substr(0, semicolon));
}

std::optional<std::string> Parameter(std::string_view value, std::string_view name) {
  size_t pos = value.find(';');
  while (pos != std::string_view::npos && pos < value.size()) {
    ++pos;  // past ';'
    const size_t eq = value.find_first_of("=;", pos);
    if (eq == std::string_view::npos) return std::nullopt;
    if (value[eq] == ';') {
      pos = eq;
      continue;
    }
    const bool wanted = EqualsNoCase(TrimBlanks(value.substr(pos, eq - pos)), name);
    size_t i = eq + 1;
    while (i < value.size() && (value[i] == ' ' || value[i] == '\t')) ++i;
    std::string text;
    if (i < value.size() && value[i] == '"') {
      ++i;
      while (i < value.size() && value[i] != '"') {
        if (value[i] == '\\' && i + 1 < value.size()) ++i;
        text.push_back(value[i++]);
      }
      const size_t next = value.find(';', i);
      if (wanted) return text;
      pos = next;
      continue;
    }
    const size_t next = value.find(';', i);
    if (wanted) return std::string(TrimBlanks(value.substr(i, next == std::string_view::npos ? std::string_view::npos : next - i)));
    pos = next;
  }
  return std::nullopt;
}

}  // namespace asum::mail
