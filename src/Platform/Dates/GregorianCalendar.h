// Day arithmetic of the proleptic Gregorian calendar, exact for all 32-bit years and well beyond.
#pragma once

#include "xquery/Date.h"

#include <cstdint>

namespace xquery {

constexpr int64_t secondsPerDay = 86400;

// For a positive divisor.
constexpr int64_t floorDivide(int64_t dividend, int64_t divisor) {
  const int64_t quotient = dividend / divisor;
  return dividend % divisor < 0 ? quotient - 1 : quotient;
}

constexpr int64_t floorRemainder(int64_t dividend, int64_t divisor) {
  return dividend - floorDivide(dividend, divisor) * divisor;
}

constexpr bool isLeapYear(int64_t year) {
  return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0);
}

constexpr int daysInMonth(int64_t year, int month) {
  constexpr int days[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  return month == 2 && isLeapYear(year) ? 29 : days[month - 1];
}

// The calendar repeats after this many years and days, weekdays included.
constexpr int64_t yearsPerCycle = 400;
constexpr int64_t daysPerCycle = 146097;

// Days since 2001-01-01. A month or day outside its range counts on from the range's ends: month 0
// is December of the year before, day 0 the last day of the month before.
//
// Years are counted from March, so that the leap day is the last of its year, and a month's first
// day is a linear function of the month: 153 days make five months.
constexpr int64_t dayNumber(int64_t year, int month, int day) {
  constexpr int64_t reference = 5 * daysPerCycle + 306;  // 2001-01-01
  const int64_t marchYear = year + floorDivide(month - 3, 12);
  const int64_t marchMonth = floorRemainder(month - 3, 12);
  const int64_t cycle = floorDivide(marchYear, yearsPerCycle);
  const int64_t yearOfCycle = floorRemainder(marchYear, yearsPerCycle);
  const int64_t daysOfYears = yearOfCycle * 365 + yearOfCycle / 4 - yearOfCycle / 100;
  return cycle * daysPerCycle + daysOfYears + (153 * marchMonth + 2) / 5 + day - 1 - reference;
}

struct CalendarDay {
  int64_t year;
  int month;
  int day;
};

constexpr CalendarDay calendarDay(int64_t dayNumber) {
  const int64_t days = dayNumber + 5 * daysPerCycle + 306;
  const int64_t cycle = floorDivide(days, daysPerCycle);
  const int64_t dayOfCycle = floorRemainder(days, daysPerCycle);
  // Without its leap days a cycle is a row of years of 365 days.
  const int64_t yearOfCycle =
      (dayOfCycle - dayOfCycle / 1460 + dayOfCycle / 36524 - dayOfCycle / 146096) / 365;
  const int64_t dayOfYear = dayOfCycle - (yearOfCycle * 365 + yearOfCycle / 4 - yearOfCycle / 100);
  const int64_t marchMonth = (5 * dayOfYear + 2) / 153;
  const auto month = static_cast<int>(marchMonth < 10 ? marchMonth + 3 : marchMonth - 9);
  return {cycle * yearsPerCycle + yearOfCycle + (month <= 2 ? 1 : 0), month,
          static_cast<int>(dayOfYear - (153 * marchMonth + 2) / 5 + 1)};
}

// Which fields of a date are asked for.
enum NSGregorianUnits : uint8_t {
  NSGregorianYear = 1,
  NSGregorianMonth = 2,
  NSGregorianDay = 4,
  NSGregorianTime = 8,  // hour, minute and second
};

// Whether the fields asked for are in their ranges; a day is checked against its month when both
// are asked for. The second may be 60: a clock that shows it is one that shows the next minute.
bool NSGregorianDateIsValid(const NSGregorianDate& date, int units);

}  // namespace xquery
