#include "mail/iso8859_tables.h"

#include <array>
#include <span>

#include "common/utf.h"
#include "mail/charset_table.h"

namespace asum::mail {
namespace {

struct Letter {
  unsigned char byte;
  char16_t ch;
};

// Both agree with ISO 8859-1 except in these bytes.
constexpr Letter kNordic[] = {
    {0xA1, u'\u0104'}, {0xA2, u'\u0112'}, {0xA3, u'\u0122'}, {0xA4, u'\u012A'}, {0xA5, u'\u0128'},
    {0xA6, u'\u0136'}, {0xA8, u'\u013B'}, {0xA9, u'\u0110'}, {0xAA, u'\u0160'}, {0xAB, u'\u0166'},
    {0xAC, u'\u017D'}, {0xAE, u'\u016A'}, {0xAF, u'\u014A'}, {0xB1, u'\u0105'}, {0xB2, u'\u0113'},
    {0xB3, u'\u0123'}, {0xB4, u'\u012B'}, {0xB5, u'\u0129'}, {0xB6, u'\u0137'}, {0xB8, u'\u013C'},
    {0xB9, u'\u0111'}, {0xBA, u'\u0161'}, {0xBB, u'\u0167'}, {0xBC, u'\u017E'}, {0xBD, u'\u2015'},
    {0xBE, u'\u016B'}, {0xBF, u'\u014B'}, {0xC0, u'\u0100'}, {0xC7, u'\u012E'}, {0xC8, u'\u010C'},
    {0xCA, u'\u0118'}, {0xCC, u'\u0116'}, {0xD1, u'\u0145'}, {0xD2, u'\u014C'}, {0xD7, u'\u0168'},
    {0xD9, u'\u0172'}, {0xE0, u'\u0101'}, {0xE7, u'\u012F'}, {0xE8, u'\u010D'}, {0xEA, u'\u0119'},
    {0xEC, u'\u0117'}, {0xF1, u'\u0146'}, {0xF2, u'\u014D'}, {0xF7, u'\u0169'}, {0xF9, u'\u0173'},
    {0xFF, u'\u0138'},
};
constexpr Letter kCeltic[] = {
    {0xA1, u'\u1E02'}, {0xA2, u'\u1E03'}, {0xA4, u'\u010A'}, {0xA5, u'\u010B'}, {0xA6, u'\u1E0A'},
    {0xA8, u'\u1E80'}, {0xAA, u'\u1E82'}, {0xAB, u'\u1E0B'}, {0xAC, u'\u1EF2'}, {0xAF, u'\u0178'},
    {0xB0, u'\u1E1E'}, {0xB1, u'\u1E1F'}, {0xB2, u'\u0120'}, {0xB3, u'\u0121'}, {0xB4, u'\u1E40'},
    {0xB5, u'\u1E41'}, {0xB7, u'\u1E56'}, {0xB8, u'\u1E81'}, {0xB9, u'\u1E57'}, {0xBA, u'\u1E83'},
    {0xBB, u'\u1E60'}, {0xBC, u'\u1EF3'}, {0xBD, u'\u1E84'}, {0xBE, u'\u1E85'}, {0xBF, u'\u1E61'},
    {0xD0, u'\u0174'}, {0xD7, u'\u1E6A'}, {0xDE, u'\u0176'}, {0xF0, u'\u0175'}, {0xF7, u'\u1E6B'},
    {0xFE, u'\u0177'},
};

}  // namespace

std::optional<std::string> Iso8859TableToUtf8(uint32_t code_page, std::string_view bytes) {
  std::span<const Letter> letters;
  if (code_page == kCodePageIso8859_10) {
    letters = kNordic;
  } else if (code_page == kCodePageIso8859_14) {
    letters = kCeltic;
  } else {
    return std::nullopt;
  }
  std::array<char16_t, 256> table;
  for (size_t b = 0; b < table.size(); ++b) table[b] = static_cast<char16_t>(b);
  for (const Letter& letter : letters) table[letter.byte] = letter.ch;
  std::u16string text(bytes.size(), u'\0');
  for (size_t i = 0; i < bytes.size(); ++i) text[i] = table[static_cast<unsigned char>(bytes[i])];
  return Utf16ToUtf8(text);
}

}  // namespace asum::mail
