#include "mail/charset_table.h"

#include <string>

namespace asum::mail {
namespace {

struct Alias {
  std::string_view name;  // already folded: lower case, no '-', '_' or blank
  uint32_t code_page;
};

constexpr Alias kAliases[] = {
    {"utf8", kCodePageUtf8},
    {"usascii", kCodePageAscii},
    {"ascii", kCodePageAscii},
    {"ansix3.41968", kCodePageAscii},
    {"iso646us", kCodePageAscii},
    {"usascii7", kCodePageAscii},
    {"iso88591", 28591},
    {"latin1", 28591},
    {"l1", 28591},
    {"iso88592", 28592},
    {"latin2", 28592},
    {"iso88593", 28593},
    {"latin3", 28593},
    {"iso88594", 28594},
    {"latin4", 28594},
    {"iso88595", 28595},
    {"cyrillic", 28595},
    {"iso88596", 28596},
    {"arabic", 28596},
    {"iso88597", 28597},
    {"greek", 28597},
    {"iso88598", 28598},
    {"iso88598i", 28598},
    {"hebrew", 28598},
    {"iso88599", 28599},
    {"latin5", 28599},
    {"iso885910", kCodePageIso8859_10},
    {"latin6", kCodePageIso8859_10},
    {"iso885911", 874},
    {"iso885913", 28603},
    {"latin7", 28603},
    {"iso885914", kCodePageIso8859_14},
    {"latin8", kCodePageIso8859_14},
    {"iso885915", 28605},
    {"latin9", 28605},
    {"latin0", 28605},
    {"windows874", 874},
    {"cp874", 874},
    {"tis620", 874},
    {"koi8r", 20866},
    {"koi8u", 21866},
    {"gb2312", 936},
    {"gbk", 936},
    {"cp936", 936},
    {"xgbk", 936},
    {"euccn", 936},
    {"xeuccn", 936},
    {"gb231280", 936},
    {"chinese", 936},
    {"gb18030", 54936},
    {"big5", 950},
    {"big5hkscs", 950},
    {"cp950", 950},
    {"xxbig5", 950},
    {"shiftjis", 932},
    {"sjis", 932},
    {"xsjis", 932},
    {"mskanji", 932},
    {"cp932", 932},
    {"windows31j", 932},
    {"eucjp", 20932},
    {"xeucjp", 20932},
    {"iso2022jp", kCodePageIso2022Jp},
    // EUC-KR is read as its superset 949, as web browsers do: Windows does not
    // install 51949 everywhere.
    {"euckr", 949},
    {"xeuckr", 949},
    {"ksc56011987", 949},
    {"ksc56011989", 949},
    {"ksc5601", 949},
    {"cp949", 949},
    {"korean", 949},
};

}  // namespace

std::optional<uint32_t> CodePageForCharset(std::string_view name) {
  // Names longer than any we know are garbled; do not fold them at all.
  if (name.size() > 40) return std::nullopt;
  std::string folded;
  for (char c : name) {
    if (c == '-' || c == '_' || c == ' ' || c == '\t' || c == '"' || c == '\'') continue;
    if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
    folded.push_back(c);
  }
  // windows-1250 .. windows-1258, cp1250 .. cp1258, x-cp1250 ...
  for (std::string_view prefix : {"windows", "cp", "xcp"}) {
    if (folded.size() == prefix.size() + 4 && folded.compare(0, prefix.size(), prefix) == 0 &&
        folded.compare(prefix.size(), 3, "125") == 0) {
      const char last = folded.back();
      if (last >= '0' && last <= '8') return 1250u + static_cast<uint32_t>(last - '0');
    }
  }
  for (const Alias& alias : kAliases) {
    if (alias.name == folded) return alias.code_page;
  }
  return std::nullopt;
}

}  // namespace asum::mail
