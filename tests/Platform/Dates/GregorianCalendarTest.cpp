#include "Platform/Dates/GregorianCalendar.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <random>

namespace xquery {
namespace {

// Days of the years before `year`, counted from year 0; an independent way of counting.
int64_t daysBeforeYear(int64_t year) {
  const auto floorOf = [](int64_t a, int64_t b) { return (a - (((a % b) + b) % b)) / b; };
  const int64_t last = year - 1;
  // Year 0 is a leap year itself.
  return 365 * year + floorOf(last, 4) - floorOf(last, 100) + floorOf(last, 400) + 1;
}

constexpr int monthLengths[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};

bool leap(int64_t year) {
  if (year % 400 == 0) return true;
  if (year % 100 == 0) return false;
  return year % 4 == 0;
}

TEST(GregorianCalendar, TheReferenceDayIsNumberZero) {
  EXPECT_EQ(dayNumber(2001, 1, 1), 0);
  EXPECT_EQ(dayNumber(2001, 1, 2), 1);
  EXPECT_EQ(dayNumber(2000, 12, 31), -1);
  EXPECT_EQ(dayNumber(1970, 1, 1), -11323);
  EXPECT_EQ(dayNumber(0, 1, 1), -730851);
}

TEST(GregorianCalendar, FollowsACalendarThatIsTurnedDayByDay) {
  int64_t year = -5000;
  int month = 1;
  int day = 1;
  for (int64_t number = dayNumber(-5000, 1, 1); year < 7000; ++number) {
    ASSERT_EQ(dayNumber(year, month, day), number) << year << "-" << month << "-" << day;
    const CalendarDay read = calendarDay(number);
    ASSERT_TRUE(read.year == year && read.month == month && read.day == day)
        << year << "-" << month << "-" << day;
    const int length = month == 2 && leap(year) ? 29 : monthLengths[month - 1];
    if (++day > length) {
      day = 1;
      if (++month > 12) {
        month = 1;
        ++year;
      }
    }
  }
}

TEST(GregorianCalendar, CountsTheDaysOfAllYearsOf32Bits) {
  constexpr int64_t first = std::numeric_limits<int32_t>::min();
  constexpr int64_t last = std::numeric_limits<int32_t>::max();
  const int64_t reference = daysBeforeYear(2001);
  std::mt19937_64 random(5);
  std::uniform_int_distribution<int64_t> anyYear(first, last);
  for (int round = 0; round < 20000; ++round) {
    const int64_t year = round < 500     ? first + round
                         : round < 1000  ? last - (round - 500)
                         : round < 11000 ? round - 6000
                                         : anyYear(random);
    const int64_t expected = daysBeforeYear(year) - reference;
    ASSERT_EQ(dayNumber(year, 1, 1), expected) << year;
    ASSERT_EQ(dayNumber(year, 12, 31), expected + (leap(year) ? 365 : 364)) << year;
    const CalendarDay read = calendarDay(expected);
    ASSERT_TRUE(read.year == year && read.month == 1 && read.day == 1) << year;
    ASSERT_EQ(isLeapYear(year), leap(year)) << year;
  }
}

TEST(GregorianCalendar, MonthsAndDaysOutsideTheirRangesCountOn) {
  EXPECT_EQ(dayNumber(2004, 0, 1), dayNumber(2003, 12, 1));
  EXPECT_EQ(dayNumber(2004, 13, 1), dayNumber(2005, 1, 1));
  EXPECT_EQ(dayNumber(2004, -1, 1), dayNumber(2003, 11, 1));
  EXPECT_EQ(dayNumber(2004, 3, 0), dayNumber(2004, 2, 29));
  EXPECT_EQ(dayNumber(0, 0, 0), dayNumber(-1, 11, 30));
}

NSGregorianDate fields(int32_t year, int month, int day, int hour = 0, int minute = 0,
                       double second = 0) {
  return {year,
          static_cast<int8_t>(month),
          static_cast<int8_t>(day),
          static_cast<int8_t>(hour),
          static_cast<int8_t>(minute),
          second};
}

TEST(GregorianDateIsValid, ADayIsCheckedAgainstItsMonth) {
  constexpr int date = NSGregorianYear | NSGregorianMonth | NSGregorianDay;
  EXPECT_TRUE(NSGregorianDateIsValid(fields(2004, 2, 29), date));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(2004, 2, 30), date));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(2003, 2, 29), date));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(1900, 2, 29), date));
  EXPECT_TRUE(NSGregorianDateIsValid(fields(2000, 2, 29), date));
  EXPECT_TRUE(NSGregorianDateIsValid(fields(0, 2, 29), date));
  EXPECT_TRUE(NSGregorianDateIsValid(fields(-4, 2, 29), date));
  for (int month = 1; month <= 12; ++month) {
    EXPECT_TRUE(NSGregorianDateIsValid(fields(2001, month, monthLengths[month - 1]), date));
    EXPECT_FALSE(NSGregorianDateIsValid(fields(2001, month, monthLengths[month - 1] + 1), date));
    EXPECT_FALSE(NSGregorianDateIsValid(fields(2001, month, 0), date));
  }
  EXPECT_FALSE(NSGregorianDateIsValid(fields(2001, 0, 1), date));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(2001, 13, 1), date));
}

TEST(GregorianDateIsValid, OnlyTheFieldsAskedForAreLookedAt) {
  EXPECT_TRUE(NSGregorianDateIsValid(fields(2001, 0, 0), NSGregorianYear));
  EXPECT_TRUE(NSGregorianDateIsValid(fields(0, 0, 31), NSGregorianDay));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(0, 0, 32), NSGregorianDay));
  EXPECT_TRUE(NSGregorianDateIsValid(fields(0, 2, 29), NSGregorianMonth | NSGregorianDay));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(0, 2, 30), NSGregorianMonth | NSGregorianDay));
  EXPECT_TRUE(NSGregorianDateIsValid(fields(0, 0, 0, 23, 59, 59.5), NSGregorianTime));
}

TEST(GregorianDateIsValid, ASixtiethSecondIsAllowedAndNoMore) {
  EXPECT_TRUE(NSGregorianDateIsValid(fields(0, 0, 0, 23, 59, 60), NSGregorianTime));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(0, 0, 0, 23, 59, 60.1), NSGregorianTime));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(0, 0, 0, 24, 0, 0), NSGregorianTime));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(0, 0, 0, 0, 60, 0), NSGregorianTime));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(0, 0, 0, -1, 0, 0), NSGregorianTime));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(0, 0, 0, 0, -1, 0), NSGregorianTime));
  EXPECT_FALSE(NSGregorianDateIsValid(fields(0, 0, 0, 0, 0, -0.5), NSGregorianTime));
}

}  // namespace
}  // namespace xquery
