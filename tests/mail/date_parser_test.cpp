#include "mail/date_parser.h"

#include <gtest/gtest.h>

#include "mail/local_date.h"

namespace asum::mail {
namespace {

using platform::SystemTime;

SystemTime At(int y, int mo, int d, int h = 0, int mi = 0, int s = 0) {
  SystemTime st;
  st.year = static_cast<uint16_t>(y);
  st.month = static_cast<uint16_t>(mo);
  st.day = static_cast<uint16_t>(d);
  st.hour = static_cast<uint16_t>(h);
  st.minute = static_cast<uint16_t>(mi);
  st.second = static_cast<uint16_t>(s);
  st.day_of_week = static_cast<uint16_t>(DayOfWeek(y, mo, d));
  return st;
}

// A machine in UTC, today 2024-05-20.
DateContext UtcMachine() { return DateContext{0, At(2024, 5, 20, 12)}; }

struct FormCase {
  const char* text;
  SystemTime expected;
};

TEST(DateParser, ReadsEveryFormAndZone) {
  const FormCase cases[] = {
      {"Mon, 11 Jun 2018 09:05:03 +0530", At(2018, 6, 11, 3, 35, 3)},
      {"11-Jun-18 9:05", At(2018, 6, 11, 9, 5, 0)},
      {"Fri, 1 Jan 2021 23:30:00 -0100", At(2021, 1, 2, 0, 30, 0)},
      {"Sat, 1 Jan 2022 00:30:00 +0100", At(2021, 12, 31, 23, 30, 0)},
      {"  Tuesday 5 March 2019 10:00:00 GMT", At(2019, 3, 5, 10, 0, 0)},
      {"5 mai 2019 10:00:00", At(2019, 5, 5, 10, 0, 0)},
      {"5 OKT 2019 10:00:00 Z", At(2019, 10, 5, 10, 0, 0)},
      {"5 dez 2019 10:00:00 ut", At(2019, 12, 5, 10, 0, 0)},
      {"1 Jan 99 10:00:00", At(1999, 1, 1, 10, 0, 0)},
      {"1 Jan 49 10:00:00", At(2049, 1, 1, 10, 0, 0)},
      {"1 Jan 112 10:00:00", At(2012, 1, 1, 10, 0, 0)},
      {"1 Jan 2019 10:00:00 EST", At(2019, 1, 1, 15, 0, 0)},
      {"1 Jan 2019 10:00:00 edt", At(2019, 1, 1, 14, 0, 0)},
      {"1 Jan 2019 10:00:00 CST", At(2019, 1, 1, 16, 0, 0)},
      {"1 Jan 2019 10:00:00 cdt", At(2019, 1, 1, 15, 0, 0)},
      {"1 Jan 2019 10:00:00 MST", At(2019, 1, 1, 17, 0, 0)},
      {"1 Jan 2019 10:00:00 MDT", At(2019, 1, 1, 16, 0, 0)},
      {"1 Jan 2019 10:00:00 PST", At(2019, 1, 1, 18, 0, 0)},
      {"1 Jan 2019 10:00:00 PDT", At(2019, 1, 1, 17, 0, 0)},
      {"1 Jan 2019 10:00:00 A", At(2019, 1, 1, 11, 0, 0)},
      {"1 Jan 2019 10:00:00 M", At(2019, 1, 1, 22, 0, 0)},
      {"1 Jan 2019 10:00:00 N", At(2019, 1, 1, 9, 0, 0)},
      {"1 Jan 2019 13:00:00 Y", At(2019, 1, 1, 1, 0, 0)},
      {"1 Jan 2019 10:00:00 XYZ", At(2019, 1, 1, 10, 0, 0)},
      {"1 Jan 2019 10:00:00 +05:30", At(2019, 1, 1, 4, 30, 0)},
      {"1 Jan 2019 10:00:00 -5", At(2019, 1, 1, 15, 0, 0)},
      {"1 Jan 2019 10:00:00 -0000 (UTC)", At(2019, 1, 1, 10, 0, 0)},
      {"29 Feb 2020 23:00:00 -0200", At(2020, 3, 1, 1, 0, 0)},
      {"1 Mar 2021 00:10:00 +0100", At(2021, 2, 28, 23, 10, 0)},
      {"2018-06-11T09:05:03Z", At(2018, 6, 11, 9, 5, 3)},
      {"2018-06-11T09:05:03+05:30", At(2018, 6, 11, 3, 35, 3)},
      {"2018-06-11T22:05:03.250-0400", At(2018, 6, 12, 2, 5, 3)},
      {"2018-06-11T09:05-01", At(2018, 6, 11, 10, 5, 0)},
      {"2018-06-11T09:05:03 +05:30", At(2018, 6, 11, 3, 35, 3)},
      {"11-Jun-2018-09:05:03", At(2018, 6, 11, 9, 5, 3)},
      {"Mon, 11 Jun 2018 - 09:05:03 GMT", At(2018, 6, 11, 9, 5, 3)},
      {"11 Jun 2018 0000000000009:05:03", At(2018, 6, 11, 9, 5, 3)},  // long numbers are not cut
  };
  const DateParser parser(UtcMachine());
  for (const FormCase& c : cases) {
    SystemTime got;
    EXPECT_TRUE(parser.Parse(c.text, &got)) << c.text;
    EXPECT_EQ(got, c.expected) << c.text << " gave " << got.year << "-" << got.month << "-" << got.day
                               << " " << got.hour << ":" << got.minute << ":" << got.second;
  }
}

TEST(DateParser, RejectedTextsLeaveTheDateAsItWas) {
  const char* texts[] = {
      "", "   ", "Someday, 1 Jan 2019 10:00:00", "1 Foo 2019 10:00:00", "1 Janvier 2019 10:00:00",
      "1234 Jan 2019 10:00:00", "1 Jan 1234567 10:00:00", "1 Jan 2019", "1 Jan 2019 noon",
      "Mon, Jan 1 2019 10:00:00", "2018-06-11Txx:05:03Z", "\x01\xff\x80",
  };
  const DateParser parser(UtcMachine());
  for (const char* text : texts) {
    SystemTime date = At(2001, 2, 3, 4, 5, 6);
    EXPECT_FALSE(parser.Parse(text, &date)) << text;
    EXPECT_EQ(date, At(2001, 2, 3, 4, 5, 6)) << text;
  }
}

TEST(DateParser, ImpossibleFieldsAreStoredForTheRepair) {
  SystemTime date;
  ASSERT_TRUE(DateParser(UtcMachine()).Parse("45 Jun 2018 99:75:80", &date));
  const SystemTime repaired = RepairDate(date, At(2024, 5, 20, 12, 34, 56));
  EXPECT_EQ(repaired.year, 2018);
  EXPECT_EQ(repaired.month, 6);
  EXPECT_EQ(repaired.day, 1);  // day 45 (plus the carry) is impossible
  EXPECT_LE(repaired.hour, 23);
  EXPECT_LE(repaired.minute, 59);
  EXPECT_EQ(repaired.second, 56);
}

struct DaylightCase {
  const char* name;
  int32_t bias_minutes;
  SystemTime local_now;
  const char* text;
  SystemTime expected;
};

TEST(DateParser, DaylightCorrectionOnlyForMachinesFourToEightHoursWest) {
  const SystemTime after_2015 = At(2024, 1, 15, 12);
  const SystemTime summer_2012 = At(2012, 7, 1, 12);
  const DaylightCase cases[] = {
      {"west 4h, message in window, now after 2015: one hour later", 240, after_2015,
       "1 Jul 2012 10:00:00 -0400", At(2012, 7, 1, 15)},
      {"west 8h with daylight bias", 420, after_2015, "1 Jul 2012 10:00:00 -0700", At(2012, 7, 1, 18)},
      {"west 5h, east zone gains an hour", 300, after_2015, "1 Jul 2012 10:00:00 +0530", At(2012, 7, 1, 3, 30)},
      {"west 4h, message outside window", 240, after_2015, "1 Dec 2012 10:00:00 -0400", At(2012, 12, 1, 14)},
      {"west 4h, message year after 2015", 240, after_2015, "1 Jul 2018 10:00:00 -0400", At(2018, 7, 1, 14)},
      {"west 4h, both inside", 240, summer_2012, "1 Jul 2012 10:00:00 -0400", At(2012, 7, 1, 14)},
      {"west 4h, only now inside: one hour less", 240, summer_2012, "1 Dec 2012 10:00:00 -0500",
       At(2012, 12, 1, 14)},
      {"window starts 02:00 on its first day", 240, after_2015, "11 Mar 2012 02:00:00 -0400",
       At(2012, 3, 11, 7)},
      {"before 02:00 on the first day is outside", 240, after_2015, "11 Mar 2012 01:00:00 -0400",
       At(2012, 3, 11, 5)},
      {"last day 02:00 is inside", 240, after_2015, "3 Nov 2012 02:00:00 -0400", At(2012, 11, 3, 7)},
      {"last day 03:00 is outside", 240, after_2015, "3 Nov 2012 03:00:00 -0400", At(2012, 11, 3, 7)},
      {"UTC machine: zone alone", 0, after_2015, "1 Jul 2012 10:00:00 -0400", At(2012, 7, 1, 14)},
      {"west 3h: zone alone", 180, after_2015, "1 Jul 2012 10:00:00 -0400", At(2012, 7, 1, 14)},
      {"west 9h: zone alone", 540, after_2015, "1 Jul 2012 10:00:00 -0400", At(2012, 7, 1, 14)},
      {"east 5h: zone alone", -300, after_2015, "1 Jul 2012 10:00:00 -0400", At(2012, 7, 1, 14)},
      {"ISO form is never corrected", 240, after_2015, "2012-07-01T10:00:00-04:00", At(2012, 7, 1, 14)},
  };
  for (const DaylightCase& c : cases) {
    SystemTime got;
    ASSERT_TRUE(DateParser(DateContext{c.bias_minutes, c.local_now}).Parse(c.text, &got)) << c.name;
    EXPECT_EQ(got, c.expected) << c.name << ": hour " << got.hour << " minute " << got.minute;
  }
}

TEST(LocalDate, RepairsEachFieldFromTheCurrentUtcTime) {
  SystemTime now = At(2024, 5, 20, 12, 34, 56);
  now.milliseconds = 789;
  struct Case {
    const char* name;
    SystemTime input;
    SystemTime expected;
  } cases[] = {
      {"all zero: 1st of the current month, midnight", SystemTime{}, SystemTime{2024, 5, 0, 1, 0, 0, 0, 0}},
      {"year too small", SystemTime{1959, 3, 0, 2, 1, 2, 3, 0}, SystemTime{2024, 3, 0, 2, 1, 2, 3, 0}},
      {"year too large", SystemTime{2101, 3, 0, 2, 1, 2, 3, 0}, SystemTime{2024, 3, 0, 2, 1, 2, 3, 0}},
      {"year bounds kept", SystemTime{1960, 3, 0, 2, 1, 2, 3, 0}, SystemTime{1960, 3, 0, 2, 1, 2, 3, 0}},
      {"month 13", SystemTime{2020, 13, 0, 2, 1, 2, 3, 0}, SystemTime{2020, 5, 0, 2, 1, 2, 3, 0}},
      {"day of week 7", SystemTime{2020, 3, 7, 2, 1, 2, 3, 0}, SystemTime{2020, 3, 1, 2, 1, 2, 3, 0}},
      {"hour 24", SystemTime{2020, 3, 0, 2, 24, 2, 3, 0}, SystemTime{2020, 3, 0, 2, 12, 2, 3, 0}},
      {"minute 60", SystemTime{2020, 3, 0, 2, 1, 60, 3, 0}, SystemTime{2020, 3, 0, 2, 1, 34, 3, 0}},
      {"second 60", SystemTime{2020, 3, 0, 2, 1, 2, 60, 0}, SystemTime{2020, 3, 0, 2, 1, 2, 56, 0}},
      {"millisecond 10000", SystemTime{2020, 3, 0, 2, 1, 2, 3, 10000}, SystemTime{2020, 3, 0, 2, 1, 2, 3, 789}},
      {"29 Feb in a leap year", SystemTime{2020, 2, 0, 29, 1, 2, 3, 0}, SystemTime{2020, 2, 0, 29, 1, 2, 3, 0}},
      {"29 Feb in 2100", SystemTime{2100, 2, 0, 29, 1, 2, 3, 0}, SystemTime{2100, 2, 0, 1, 1, 2, 3, 0}},
      {"31 April", SystemTime{2020, 4, 0, 31, 1, 2, 3, 0}, SystemTime{2020, 4, 0, 1, 1, 2, 3, 0}},
  };
  for (const Case& c : cases) EXPECT_EQ(RepairDate(c.input, now), c.expected) << c.name;
}

}  // namespace
}  // namespace asum::mail
