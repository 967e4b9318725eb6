#include "mail/iso2022jp.h"

namespace asum::mail {
namespace {

enum class Set { kAscii, kKatakana, kJisX0208 };

struct Designation {
  std::string_view sequence;
  Set set;
};

constexpr Designation kDesignations[] = {
    {"\x1b(B", Set::kAscii},    {"\x1b(J", Set::kAscii},    {"\x1b(I", Set::kKatakana},
    {"\x1b$@", Set::kJisX0208}, {"\x1b$B", Set::kJisX0208},
};
// Announces the 1990 revision of JIS X 0208; the ESC $ B that follows selects it.
constexpr std::string_view kRevisionAnnouncer = "\x1b&@";

// Row and cell of JIS X 0208 (0x21..0x7E each) as a Shift_JIS pair: two rows
// share one lead byte, the odd row taking the lower half of the trail bytes.
void AppendShiftJis(unsigned row, unsigned cell, std::string* out) {
  const unsigned lead = ((row + 1) >> 1) + (row <= 0x5E ? 0x70 : 0xB0);
  unsigned trail = cell + 0x7E;
  if ((row & 1) != 0) trail = cell + (cell < 0x60 ? 0x1F : 0x20);  // 0x7F is no trail byte
  out->push_back(static_cast<char>(lead));
  out->push_back(static_cast<char>(trail));
}

bool IsGraphic(unsigned c) { return c >= 0x21 && c <= 0x7E; }

}  // namespace

std::optional<std::string> Iso2022JpToShiftJis(std::string_view bytes) {
  std::string out;
  out.reserve(bytes.size());
  Set set = Set::kAscii;
  size_t i = 0;
  while (i < bytes.size()) {
    const unsigned c = static_cast<unsigned char>(bytes[i]);
    if (c == 0x1B) {
      const std::string_view rest = bytes.substr(i);
      if (rest.starts_with(kRevisionAnnouncer)) {
        i += kRevisionAnnouncer.size();
        continue;
      }
      bool known = false;
      for (const Designation& d : kDesignations) {
        if (rest.starts_with(d.sequence)) {
          set = d.set;
          i += d.sequence.size();
          known = true;
          break;
        }
      }
      if (!known) return std::nullopt;
      continue;
    }
    if (c >= 0x80) return std::nullopt;
    ++i;
    if (set == Set::kAscii || !IsGraphic(c)) {
      // Controls and blanks stand for themselves in every set.
      if (c == '\r' || c == '\n') set = Set::kAscii;
      out.push_back(static_cast<char>(c));
    } else if (set == Set::kKatakana) {
      if (c > 0x5F) return std::nullopt;
      out.push_back(static_cast<char>(c + 0x80));  // Shift_JIS's single-byte katakana
    } else {
      if (i >= bytes.size() || !IsGraphic(static_cast<unsigned char>(bytes[i]))) return std::nullopt;
      AppendShiftJis(c, static_cast<unsigned char>(bytes[i]), &out);
      ++i;
    }
  }
  return out;
}

}  // namespace asum::mail
