// Reads the text of a message's Date field into a UTC time: the ISO 8601 form
// and, more leniently than RFC 5322 asks, the RFC 822 form mail programs
// write, including two- and three-digit years, two month-name tables, numeric
// and named zones, and the historical daylight-saving correction of the zone
// offset for machines 4 to 8 hours behind UTC.
//
// A parser holds only the machine facts it was given, so it is cheap to make
// and safe to use from one thread at a time; separate parsers share nothing.
// Parsing never throws and runs in time linear in the text (at most 199
// characters of an RFC 822 text are read).
#pragma once

#include <cstdint>
#include <string_view>

#include "platform/platform.h"

namespace asum::mail {

struct DateContext {
  // Env::CurrentBiasMinutes(): minutes to add to local time to get UTC.
  int32_t bias_minutes = 0;
  // Env::LocalNow(): the current local date decides one side of the daylight
  // correction.
  platform::SystemTime local_now;
};

// The facts of the machine this process runs on, from platform::Current().
DateContext CurrentDateContext();

class DateParser {
 public:
  explicit DateParser(DateContext context) : context_(context) {}

  // On success overwrites `*date` with the UTC time (milliseconds 0) and
  // returns true; otherwise returns false and leaves `*date` as it was. A
  // date that reads but holds impossible fields (day 45, hour 99) is stored as
  // read; LocalDate repairs it.
  bool Parse(std::string_view text, platform::SystemTime* date) const;

 private:
  bool ParseIso8601(std::string_view text, platform::SystemTime* date) const;
  bool ParseRfc822(std::string_view text, platform::SystemTime* date) const;

  DateContext context_;
};

}  // namespace asum::mail
