#include "mail/date_parser.h"

#include <gtest/gtest.h>

#include "mail/local_date.h"

namespace asum::mail {
namespace {

using platform::SystemTime;

SystemTime At(uint16_t y, uint16_t mo, uint16_t d, uint16_t h = 0, uint16_t mi = 0, uint16_t s = 0) {
  return SystemTime{y, mo, static_cast<uint16_t>(DayOfWeek(y, mo, d)), d, h, mi, s, 0};
}

TEST(DateParser, ReadsEveryFormAndZone) {
  const struct {
    const char* text;
    SystemTime expected;
  } cases[] = {
      {"Mon, 11 Jun 2018 09:05:03 +0530", At(2018, 6, 11, 3, 35, 3)}, {"11-Jun-18 9:05", At(2018, 6, 11, 9, 5)},
      {"Fri, 1 Jan 2021 23:30:00 -0100", At(2021, 1, 2, 0, 30)}, {"1 Mar 2021 00:10:00 +0100", At(2021, 2, 28, 23, 10)},
      {"Sat, 1 Jan 2022 00:30:00 +0100", At(2021, 12, 31, 23, 30)}, {"29 Feb 2020 23:00:00 -0200", At(2020, 3, 1, 1)},
      {"  Tuesday 5 March 2019 10:00:00 GMT", At(2019, 3, 5, 10)}, {"5 mai 2019 10:00:00", At(2019, 5, 5, 10)},
      {"5 OKT 2019 10:00:00 Z", At(2019, 10, 5, 10)}, {"5 dez 2019 10:00:00 ut", At(2019, 12, 5, 10)},
      {"1 Jan 99 10:00:00", At(1999, 1, 1, 10)}, {"1 Jan 49 10:00:00", At(2049, 1, 1, 10)},
      {"1 Jan 50 10:00:00", At(1950, 1, 1, 10)}, {"1 Jan 112 10:00:00", At(2012, 1, 1, 10)},
      {"1 Jan 2019 10:00:00 +05:30", At(2019, 1, 1, 4, 30)}, {"1 Jan 2019 10:00:00 -5", At(2019, 1, 1, 15)},
      {"1 Jan 2019 10:00:00 -0000 (UTC)", At(2019, 1, 1, 10)}, {"2018-06-11T09:05:03Z", At(2018, 6, 11, 9, 5, 3)},
      {"2018-06-11T09:05:03+05:30", At(2018, 6, 11, 3, 35, 3)}, {"2018-06-11T09:05-01", At(2018, 6, 11, 10, 5)},
      {"2018-06-11T22:05:03.250-0400", At(2018, 6, 12, 2, 5, 3)},
      {"2018-06-11T09:05:03 +05:30", At(2018, 6, 11, 3, 35, 3)}, {"11-Jun-2018-09:05:03", At(2018, 6, 11, 9, 5, 3)},
      {"Mon, 11 Jun 2018 - 09:05:03 GMT", At(2018, 6, 11, 9, 5, 3)},
      {"11 Jun 2018 0000000000009:05:03", At(2018, 6, 11, 9, 5, 3)},        // long numbers are not cut
      {"45 Jun 2018 99:75:80", SystemTime{2018, 6, 0, 46, 76, 15, 80, 0}},  // stored as read, for the repair
  };
  const DateParser parser(DateContext{0, At(2024, 5, 20, 12)});  // a UTC machine
  for (const auto& c : cases) {
    SystemTime got;
    EXPECT_TRUE(parser.Parse(c.text, &got)) << c.text;
    EXPECT_EQ(got, c.expected) << c.text << ": hour " << got.hour << ", day " << got.day;
  }
  // Each zone applied to 13:00 on 1 Jan 2019; the UTC hour, 25 on the next day.
  const std::pair<const char*, int> zones[] = {
      {"EST", 18}, {"edt", 17}, {"CST", 19}, {"cdt", 18}, {"MST", 20}, {"mdt", 19}, {"PST", 21}, {"PDT", 20},
      {"A", 14},   {"M", 25},   {"N", 12},   {"Y", 1},    {"XYZ", 13},
  };
  for (const auto& [zone, hour] : zones) {
    SystemTime got;
    EXPECT_TRUE(parser.Parse(std::string("1 Jan 2019 13:00:00 ") + zone, &got)) << zone;
    EXPECT_EQ(got, At(2019, 1, hour / 24 + 1, hour % 24)) << zone;
  }
}

TEST(DateParser, RejectedTextsLeaveTheDateAsItWas) {
  const char* texts[] = {
      "", "   ", "Someday, 1 Jan 2019 10:00:00", "1 Foo 2019 10:00:00", "1 Janvier 2019 10:00:00",
      "1234 Jan 2019 10:00:00", "1 Jan 1234567 10:00:00", "1 Jan 2019", "1 Jan 2019 noon",
      "Mon, Jan 1 2019 10:00:00", "2018-06-11Txx:05:03Z", "\x01\xff\x80",
  };
  const DateParser parser(DateContext{0, At(2024, 5, 20, 12)});  // a UTC machine
  for (const char* text : texts) {
    SystemTime date = At(2001, 2, 3, 4, 5, 6);
    EXPECT_FALSE(parser.Parse(text, &date)) << text;
    EXPECT_EQ(date, At(2001, 2, 3, 4, 5, 6)) << text;
  }
}

// The zone's hour count moves by one when exactly one of the message date
// and today lies in its year's daylight window (windows from 02:00 to 02:00).
TEST(DateParser, DaylightCorrectionOnlyForMachinesFourToEightHoursWest) {
  const SystemTime later = At(2024, 1, 15, 12), summer_2012 = At(2012, 7, 1, 12), summer_2009 = At(2009, 7, 1, 12);
  const char* const july = "1 Jul 2012 10:00:00 -0400";
  const SystemTime uncorrected = At(2012, 7, 1, 14);
  const struct {
    int32_t bias_minutes;
    SystemTime today;
    const char* text;
    SystemTime expected;
  } cases[] = {
      {240, later, july, At(2012, 7, 1, 15)},                               // only the message inside: +1
      {480, later, "1 Jul 2012 10:00:00 -0700", At(2012, 7, 1, 18)},
      {300, later, "1 Jul 2012 10:00:00 +0530", At(2012, 7, 1, 3, 30)},     // east zones gain an hour too
      {240, later, "1 Dec 2012 10:00:00 -0400", At(2012, 12, 1, 14)},
      {240, later, "1 Jul 2018 10:00:00 -0400", At(2018, 7, 1, 14)},        // no window after 2015
      {240, summer_2012, july, uncorrected},                                // both inside
      {240, summer_2012, "1 Dec 2012 10:00:00 -0500", At(2012, 12, 1, 14)}, // only today inside: -1
      {240, summer_2009, "1 Dec 2012 10:00:00 -0400", At(2012, 12, 1, 14)}, // today counts from 2010 on
      {240, later, "11 Mar 2012 02:00:00 -0400", At(2012, 3, 11, 7)}, {0, later, july, uncorrected},
      {240, later, "11 Mar 2012 01:00:00 -0400", At(2012, 3, 11, 5)}, {180, later, july, uncorrected},
      {240, later, "3 Nov 2012 02:00:00 -0400", At(2012, 11, 3, 7)}, {540, later, july, uncorrected},
      {240, later, "3 Nov 2012 03:00:00 -0400", At(2012, 11, 3, 7)}, {-300, later, july, uncorrected},
      {240, later, "2012-07-01T10:00:00-04:00", uncorrected},               // never for the ISO form
  };
  for (const auto& c : cases) {
    SystemTime got;
    ASSERT_TRUE(DateParser(DateContext{c.bias_minutes, c.today}).Parse(c.text, &got)) << c.text;
    EXPECT_EQ(got, c.expected) << c.bias_minutes << " " << c.today.year << " " << c.text << ": hour " << got.hour;
  }
}

TEST(LocalDate, RepairsEachFieldFromTheCurrentUtcTime) {
  const SystemTime now{2024, 5, 1, 20, 12, 34, 56, 789};
  const SystemTime kept[] = {{1960, 3, 0, 2, 1, 2, 3, 0}, {2100, 12, 6, 31, 23, 59, 59, 9999},
                             {2020, 2, 0, 29, 1, 2, 3, 0}};
  for (const SystemTime& date : kept) EXPECT_EQ(RepairDate(date, now), date) << date.year;
  // Only the field out of range is replaced; a day its month lacks becomes the 1st.
  const std::pair<SystemTime, SystemTime> repaired[] = {
      {{}, {2024, 5, 0, 1, 0, 0, 0, 0}},  // the 1st of the current month, midnight
      {{1959, 3, 0, 2, 1, 2, 3, 0}, {2024, 3, 0, 2, 1, 2, 3, 0}},
      {{2101, 3, 0, 2, 1, 2, 3, 0}, {2024, 3, 0, 2, 1, 2, 3, 0}},
      {{2020, 13, 0, 2, 1, 2, 3, 0}, {2020, 5, 0, 2, 1, 2, 3, 0}},
      {{2020, 3, 7, 2, 1, 2, 3, 0}, {2020, 3, 1, 2, 1, 2, 3, 0}},
      {{2020, 3, 0, 2, 24, 2, 3, 0}, {2020, 3, 0, 2, 12, 2, 3, 0}},
      {{2020, 3, 0, 2, 1, 60, 3, 0}, {2020, 3, 0, 2, 1, 34, 3, 0}},
      {{2020, 3, 0, 2, 1, 2, 60, 0}, {2020, 3, 0, 2, 1, 2, 56, 0}},
      {{2020, 3, 0, 2, 1, 2, 3, 10000}, {2020, 3, 0, 2, 1, 2, 3, 789}},
      {{2100, 2, 0, 29, 1, 2, 3, 0}, {2100, 2, 0, 1, 1, 2, 3, 0}},
      {{2020, 4, 0, 31, 1, 2, 3, 0}, {2020, 4, 0, 1, 1, 2, 3, 0}},
  };
  for (const auto& [input, expected] : repaired) EXPECT_EQ(RepairDate(input, now), expected);
}

}  // namespace
}  // namespace asum::mail
