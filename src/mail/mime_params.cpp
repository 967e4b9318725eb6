#include "mail/mime_params.h"

#include <algorithm>
#include <vector>

#include "mail/charset_table.h"
#include "mail/text_convert.h"
#include "mail/text_util.h"

namespace asum::mail {
namespace {

// Calls `visit(attribute, unquoted value)` for each parameter after the main
// value, in the order written.
template <class Visit>
void ForEachParameter(std::string_view value, Visit visit) {
  size_t pos = value.find(';');
  while (pos != std::string_view::npos && pos < value.size()) {
    ++pos;  // past ';'
    const size_t eq = value.find_first_of("=;", pos);
    if (eq == std::string_view::npos) return;
    if (value[eq] == ';') {
      pos = eq;
      continue;
    }
    const std::string_view attribute = TrimBlanks(value.substr(pos, eq - pos));
    size_t i = eq + 1;
    while (i < value.size() && (value[i] == ' ' || value[i] == '\t')) ++i;
    if (i < value.size() && value[i] == '"') {
      std::string text;
      ++i;
      while (i < value.size() && value[i] != '"') {
        if (value[i] == '\\' && i + 1 < value.size()) ++i;
        text.push_back(value[i++]);
      }
      pos = value.find(';', i);
      visit(attribute, std::move(text));
      continue;
    }
    pos = value.find(';', i);
    visit(attribute, std::string(TrimBlanks(value.substr(i, pos == std::string_view::npos ? pos : pos - i))));
  }
}

// An attribute split into its RFC 2231 pieces: "name*1*" is section 1 of
// "name", percent-encoded.
struct Attribute {
  std::string_view base;
  bool encoded = false;
  bool has_section = false;
  size_t section = 0;
};

Attribute ReadAttribute(std::string_view attribute) {
  Attribute a;
  if (!attribute.empty() && attribute.back() == '*') {
    a.encoded = true;
    attribute.remove_suffix(1);
  }
  const size_t star = attribute.rfind('*');
  const std::string_view digits = star == std::string_view::npos ? std::string_view() : attribute.substr(star + 1);
  if (!digits.empty() && digits.size() <= 9 &&
      std::all_of(digits.begin(), digits.end(), [](char c) { return c >= '0' && c <= '9'; })) {
    a.has_section = true;
    for (char c : digits) a.section = a.section * 10 + static_cast<size_t>(c - '0');
    attribute = attribute.substr(0, star);
  }
  a.base = attribute;
  return a;
}

int HexValue(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  c = LowerAscii(c);
  return c >= 'a' && c <= 'f' ? c - 'a' + 10 : -1;
}

// A '%' that two hex digits do not follow stays as written.
void AppendPercentDecoded(std::string_view text, std::string* out) {
  for (size_t i = 0; i < text.size(); ++i) {
    const int high = text[i] == '%' && i + 2 < text.size() ? HexValue(text[i + 1]) : -1;
    const int low = high >= 0 ? HexValue(text[i + 2]) : -1;
    if (low >= 0) {
      out->push_back(static_cast<char>(high * 16 + low));
      i += 2;
    } else {
      out->push_back(text[i]);
    }
  }
}

// Drops the "charset'language'" prefix of an encoded value, returning the
// charset; a value without both apostrophes has no prefix.
std::string_view TakeCharset(std::string_view* text) {
  const size_t first = text->find('\'');
  const size_t second = first == std::string_view::npos ? first : text->find('\'', first + 1);
  if (second == std::string_view::npos) return {};
  const std::string_view charset = text->substr(0, first);
  text->remove_prefix(second + 1);
  return charset;
}

std::string ToUtf8From(std::string bytes, std::string_view charset) {
  if (IsPlainAscii(bytes)) return bytes;
  return ToUtf8(bytes, CodePageForCharset(charset));
}

struct Section {
  size_t number;
  bool encoded;
  std::string text;
};

}  // namespace

std::string_view MainValue(std::string_view value) {
  const size_t semicolon = value.find(';');
  return TrimBlanks(value.substr(0, semicolon));
}

std::optional<std::string> Parameter(std::string_view value, std::string_view name) {
  std::optional<std::string> plain;
  std::optional<std::string> encoded;
  std::vector<Section> sections;
  ForEachParameter(value, [&](std::string_view attribute, std::string text) {
    const Attribute a = ReadAttribute(attribute);
    if (!EqualsNoCase(a.base, name)) return;
    if (a.has_section) {
      sections.push_back({a.section, a.encoded, std::move(text)});
    } else if (a.encoded) {
      if (!encoded) encoded = std::move(text);
    } else if (!plain) {
      plain = std::move(text);
    }
  });
  if (encoded) {
    std::string_view text = *encoded;
    const std::string_view charset = TakeCharset(&text);
    std::string bytes;
    AppendPercentDecoded(text, &bytes);
    return ToUtf8From(std::move(bytes), charset);
  }
  // Sections may be written in any order; a repeated number counts once.
  std::stable_sort(sections.begin(), sections.end(),
                   [](const Section& a, const Section& b) { return a.number < b.number; });
  if (!sections.empty() && sections.front().number == 0) {
    std::string_view charset;
    std::string bytes;
    size_t next = 0;
    for (const Section& section : sections) {
      if (section.number != next) {
        if (section.number + 1 == next) continue;  // repeated
        break;                                     // missing: the value ends
      }
      std::string_view text = section.text;
      if (section.encoded) {
        if (next == 0) charset = TakeCharset(&text);
        AppendPercentDecoded(text, &bytes);
      } else {
        bytes += text;
      }
      ++next;
    }
    return ToUtf8From(std::move(bytes), charset);
  }
  return plain;
}

}  // namespace asum::mail
