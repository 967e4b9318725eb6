#include "mail/date_parser.h"

#include <algorithm>
#include <cstdint>
#include <iterator>
#include <string>

#include "mail/local_date.h"

namespace asum::mail {
namespace {

constexpr size_t kMaxRfc822Chars = 199;
constexpr int kMinutesPerDay = 1440;
constexpr uint16_t kInvalidField = 0xFFFF;  // out of every range; repaired later
constexpr int64_t kSaturated = 999999999;   // where a long "%d" number stops growing

struct Zone {
  std::string_view name;
  int sign;  // +1 east of UTC, -1 west
  int hours;
  int minutes;
};

constexpr Zone kNamedZones[] = {
    {"ut", 1, 0, 0},   {"gmt", 1, 0, 0},  {"est", -1, 5, 0}, {"edt", -1, 4, 0}, {"cst", -1, 6, 0},
    {"cdt", -1, 5, 0}, {"mst", -1, 7, 0}, {"mdt", -1, 6, 0}, {"pst", -1, 8, 0}, {"pdt", -1, 7, 0},
    {"a", -1, 1, 0},   {"m", -1, 12, 0},  {"n", 1, 1, 0},    {"y", 1, 12, 0},   {"z", 1, 0, 0},
};

constexpr std::string_view kDayNames[] = {"sun", "mon", "tue", "wed", "thu", "fri", "sat"};
constexpr std::string_view kMonths[] = {"jan", "feb", "mar", "apr", "may", "jun",
                                        "jul", "aug", "sep", "oct", "nov", "dec"};
constexpr std::string_view kMonthsAlt[] = {"ian", "fev", "mar", "apr", "mai", "jun",
                                           "jul", "aug", "set", "okt", "nov", "dez"};

// Daylight windows by year, 2006 first: from (month, day) 02:00 to
// (month, day) 02:00, both included.
struct Window {
  int from_month, from_day, to_month, to_day;
};
constexpr int kFirstWindowYear = 2006;
constexpr Window kWindows[] = {
    {4, 2, 10, 28}, {3, 11, 11, 3}, {3, 9, 11, 1}, {3, 8, 10, 31}, {3, 14, 11, 6},
    {3, 13, 11, 5}, {3, 11, 11, 3}, {3, 10, 11, 2}, {3, 9, 11, 1},  {3, 8, 10, 31},
};
constexpr int kLastWindowYear = kFirstWindowYear + static_cast<int>(std::size(kWindows)) - 1;
constexpr int kFirstCurrentWindowYear = 2010;
constexpr int kWindowHour = 2;

bool InWindow(int year, int month, int day, int hour) {
  if (year < kFirstWindowYear || year > kLastWindowYear) return false;
  const Window& w = kWindows[year - kFirstWindowYear];
  const int64_t key = (static_cast<int64_t>(month) * 100 + day) * 100 + hour;
  return key >= (w.from_month * 100 + w.from_day) * 100 + kWindowHour &&
         key <= (w.to_month * 100 + w.to_day) * 100 + kWindowHour;
}

class Cursor {
 public:
  explicit Cursor(std::string_view text) : text_(text) {}
  bool AtEnd() const { return pos_ >= text_.size(); }
  char Peek(size_t ahead = 0) const { return pos_ + ahead < text_.size() ? text_[pos_ + ahead] : '\0'; }
  void Skip(size_t n = 1) { pos_ += n; }
  size_t pos() const { return pos_; }
  void set_pos(size_t pos) { pos_ = pos; }

  void SkipAny(std::string_view chars) {
    while (!AtEnd() && chars.find(text_[pos_]) != std::string_view::npos) ++pos_;
  }
  std::string_view Letters() {
    const size_t begin = pos_;
    while (!AtEnd() && text_[pos_] >= 'a' && text_[pos_] <= 'z') ++pos_;
    return text_.substr(begin, pos_ - begin);
  }
  // Up to `max_digits` digits (0 when none); the count read goes to *count.
  int64_t Digits(size_t max_digits, size_t* count) {
    int64_t value = 0;
    *count = 0;
    while (!AtEnd() && *count < max_digits && text_[pos_] >= '0' && text_[pos_] <= '9') {
      value = value * 10 + (text_[pos_] - '0');
      ++pos_;
      ++*count;
    }
    return value;
  }
  // As "%d" reads: blanks, an optional sign, at least one digit. A very long
  // number saturates instead of overflowing, so it stays out of every field's
  // range and is repaired later; its leading zeros count for nothing, so
  // "000000000009" is still 9.
  bool Int(int64_t* value) {
    const size_t start = pos_;
    SkipAny(" \t\r\n");
    int sign = 1;
    if (Peek() == '+' || Peek() == '-') {
      sign = Peek() == '-' ? -1 : 1;
      Skip();
    }
    size_t count = 0;
    int64_t v = 0;
    while (!AtEnd() && text_[pos_] >= '0' && text_[pos_] <= '9') {
      v = std::min<int64_t>(v * 10 + (text_[pos_] - '0'), kSaturated);
      ++pos_;
      ++count;
    }
    if (count == 0) {
      pos_ = start;
      return false;
    }
    *value = sign * v;
    return true;
  }

 private:
  std::string_view text_;
  size_t pos_ = 0;
};

uint16_t Field(int64_t value) {
  return value < 0 || value > 0xFFFF ? kInvalidField : static_cast<uint16_t>(value);
}

// Writes date and time of day after subtracting `offset_minutes`, carrying
// at most one day either way.
void StoreUtc(int64_t year, int64_t month, int64_t day, int64_t hour, int64_t minute, int64_t second,
              int64_t offset_minutes, platform::SystemTime* out) {
  int64_t minutes = hour * 60 + minute - offset_minutes;
  int carry = 0;
  if (minutes < 0) {
    minutes += kMinutesPerDay;
    carry = -1;
  } else if (minutes >= kMinutesPerDay) {
    minutes -= kMinutesPerDay;
    carry = 1;
  }
  const bool valid = year >= 1 && year <= 0xFFFF && day >= 1 &&
                     day <= DaysInMonth(static_cast<int>(year), static_cast<int>(month));
  if (valid && carry != 0) {
    day += carry;
    if (day == 0) {
      if (--month == 0) {
        month = 12;
        --year;
      }
      day = DaysInMonth(static_cast<int>(year), static_cast<int>(month));
    } else if (day > DaysInMonth(static_cast<int>(year), static_cast<int>(month))) {
      day = 1;
      if (++month == 13) {
        month = 1;
        ++year;
      }
    }
  } else if (carry != 0) {
    day = day + carry < 0 ? 0 : day + carry;
  }
  platform::SystemTime st;
  st.year = Field(year);
  st.month = Field(month);
  st.day = Field(day);
  st.hour = minutes < 0 ? kInvalidField : Field(minutes / 60);
  st.minute = minutes < 0 ? kInvalidField : Field(minutes % 60);
  st.second = Field(second);
  st.milliseconds = 0;
  const bool now_valid = st.year >= 1 && st.day >= 1 && st.day <= DaysInMonth(st.year, st.month);
  st.day_of_week = now_valid ? static_cast<uint16_t>(DayOfWeek(st.year, st.month, st.day)) : 0;
  *out = st;
}

int MonthIndex(std::string_view name) {
  if (name.size() < 3 || name.size() > 5) return 0;
  const std::string_view head = name.substr(0, 3);
  for (int i = 0; i < 12; ++i) {
    if (head == kMonths[i] || head == kMonthsAlt[i]) return i + 1;
  }
  return 0;
}

}  // namespace

DateContext CurrentDateContext() {
  platform::Env& env = platform::Current();
  DateContext context;
  context.bias_minutes = env.CurrentBiasMinutes();
  context.local_now = env.LocalNow();
  return context;
}

bool DateParser::Parse(std::string_view text, platform::SystemTime* date) const {
  if (text.size() > 10 && text[10] == 'T' && text[4] == '-' && text[7] == '-') {
    return ParseIso8601(text, date);
  }
  return ParseRfc822(text, date);
}

bool DateParser::ParseIso8601(std::string_view text, platform::SystemTime* date) const {
  Cursor c(text);
  size_t n = 0;
  const int64_t year = c.Digits(4, &n);
  if (n != 4) return false;
  c.Skip();
  const int64_t month = c.Digits(2, &n);
  if (n == 0 || c.Peek() != '-') return false;
  c.Skip();
  const int64_t day = c.Digits(2, &n);
  if (n == 0 || c.Peek() != 'T') return false;
  c.Skip();
  const int64_t hour = c.Digits(2, &n);
  if (n == 0 || c.Peek() != ':') return false;
  c.Skip();
  const int64_t minute = c.Digits(2, &n);
  if (n == 0) return false;
  int64_t second = 0;
  if (c.Peek() == ':') {
    c.Skip();
    second = c.Digits(2, &n);
    if (n == 0) return false;
  }
  if (c.Peek() == '.' || c.Peek() == ',') {  // fractions of a second are dropped
    c.Skip();
    while (c.Peek() >= '0' && c.Peek() <= '9') c.Skip();
  }
  // Writers put blanks before the offset as they do in the RFC 822 form.
  c.SkipAny(" \t");
  int64_t offset = 0;
  if (c.Peek() == '+' || c.Peek() == '-') {
    const int sign = c.Peek() == '-' ? -1 : 1;
    c.Skip();
    const int64_t zone_hours = c.Digits(2, &n);
    if (n == 0) return false;
    if (c.Peek() == ':') c.Skip();
    const int64_t zone_minutes = c.Digits(2, &n);
    offset = sign * (zone_hours * 60 + zone_minutes);
  }
  // A trailing 'Z' and a missing zone both mean UTC.
  StoreUtc(year, month, day, hour, minute, second, offset, date);
  return true;
}

bool DateParser::ParseRfc822(std::string_view full_text, platform::SystemTime* date) const {
  std::string lowered(full_text.substr(0, kMaxRfc822Chars));
  for (char& ch : lowered) {
    if (ch >= 'A' && ch <= 'Z') ch = static_cast<char>(ch - 'A' + 'a');
  }
  Cursor c(lowered);
  c.SkipAny(" \t");
  if (c.AtEnd()) return false;

  const size_t word_start = c.pos();
  const std::string_view word = c.Letters();
  if (!word.empty()) {
    bool day_name = false;
    for (std::string_view name : kDayNames) day_name = day_name || word.substr(0, 3) == name;
    if (!day_name) return false;
    c.SkipAny(" \t");
    if (c.Peek() == ',') c.Skip();
    c.SkipAny(" \t");
  } else {
    c.set_pos(word_start);
  }

  size_t n = 0;
  const int64_t day = c.Digits(3, &n);
  if (n == 0 || (c.Peek() >= '0' && c.Peek() <= '9')) return false;
  c.SkipAny(" \t-");
  const std::string_view month_name = c.Letters();
  const int month = MonthIndex(month_name);
  if (month == 0) return false;
  c.SkipAny(" \t-");
  int64_t year = c.Digits(6, &n);
  if (n == 0 || (c.Peek() >= '0' && c.Peek() <= '9')) return false;
  if (year < 1900) year += year >= 50 ? 1900 : 2000;
  // '-' separates the time from the date as it does the other parts; it is
  // never the hour's sign.
  c.SkipAny(" \t-");

  int64_t hour = 0;
  int64_t minute = 0;
  int64_t second = 0;
  if (!c.Int(&hour) || c.Peek() != ':') return false;
  c.Skip();
  if (!c.Int(&minute)) return false;
  if (c.Peek() == ':') {
    const size_t before = c.pos();
    c.Skip();
    if (!c.Int(&second)) {
      second = 0;
      c.set_pos(before);
    }
  }

  c.SkipAny(" \t");
  if (c.Peek() == '+') c.Skip();
  int sign = 1;
  int64_t zone_hours = 0;
  int64_t zone_minutes = 0;
  if (c.Peek() == '-' || (c.Peek() >= '0' && c.Peek() <= '9')) {
    if (c.Peek() == '-') {
      sign = -1;
      c.Skip();
    }
    zone_hours = c.Digits(2, &n);
    if (n > 0) {
      if (c.Peek() >= '0' && c.Peek() <= '9') {
        zone_minutes = c.Digits(2, &n);
      } else if (c.Peek() == ':' && c.Peek(1) >= '0' && c.Peek(1) <= '9') {
        c.Skip();
        zone_minutes = c.Digits(2, &n);
      }
    }
  } else {
    const std::string_view name = c.Letters();
    for (const Zone& zone : kNamedZones) {
      if (zone.name == name) {
        sign = zone.sign;
        zone_hours = zone.hours;
        zone_minutes = zone.minutes;
        break;
      }
    }
  }

  // The historical daylight correction: the hour count as written moves by
  // one when exactly one of the message date and the current local date lies
  // in its year's daylight window.
  const int bias_hours = context_.bias_minutes / 60;
  if (bias_hours >= 4 && bias_hours <= 8) {
    const bool message_inside = InWindow(static_cast<int>(year), month, static_cast<int>(day), static_cast<int>(hour));
    const platform::SystemTime& now = context_.local_now;
    const bool current_inside =
        now.year >= kFirstCurrentWindowYear && InWindow(now.year, now.month, now.day, now.hour);
    if (message_inside && !current_inside) ++zone_hours;
    if (current_inside && !message_inside) --zone_hours;
  }
  StoreUtc(year, month, day, hour, minute, second, sign * (zone_hours * 60 + zone_minutes), date);
  return true;
}

}  // namespace asum::mail
