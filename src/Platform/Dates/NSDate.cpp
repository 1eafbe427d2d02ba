// Instants and the calendar.
#include "Platform/Dates/GregorianCalendar.h"
#include "xquery/Date.h"

#include <chrono>
#include <cmath>
#include <functional>
#include <limits>

namespace xquery {

namespace {

constexpr int64_t nanosecondsPerSecond = 1'000'000'000;

constexpr int64_t firstYear = std::numeric_limits<int32_t>::min();
constexpr int64_t lastYear = std::numeric_limits<int32_t>::max();
constexpr int64_t firstSecond = dayNumber(firstYear, 1, 1) * secondsPerDay;
constexpr int64_t endSecond = dayNumber(lastYear + 1, 1, 1) * secondsPerDay;

// Seconds split into whole ones and nanoseconds; the magnitude is below that of `endSecond`.
NSInstant split(double seconds) {
  const double whole = std::floor(seconds);
  NSInstant instant{static_cast<int64_t>(whole),
                    static_cast<int32_t>(std::llround((seconds - whole) * nanosecondsPerSecond))};
  if (instant.nanoseconds == nanosecondsPerSecond) {
    ++instant.seconds;
    instant.nanoseconds = 0;
  }
  return instant;
}

}  // namespace

NSInstant NSInstant::now() {
  using namespace std::chrono;
  const int64_t microseconds =
      duration_cast<std::chrono::microseconds>(system_clock::now().time_since_epoch()).count();
  constexpr int64_t epoch = dayNumber(1970, 1, 1) * secondsPerDay;
  return {epoch + floorDivide(microseconds, 1'000'000),
          static_cast<int32_t>(floorRemainder(microseconds, 1'000'000) * 1000)};
}

NSInstant NSInstant::fromTimeInterval(double seconds) {
  if (std::isnan(seconds)) return {};
  if (seconds < static_cast<double>(firstSecond)) return {firstSecond, 0};
  if (seconds >= static_cast<double>(endSecond)) return {endSecond - 1, 0};
  return split(seconds);
}

double NSInstant::timeInterval() const {
  return static_cast<double>(seconds) + static_cast<double>(nanoseconds) / nanosecondsPerSecond;
}

std::optional<NSInstant> NSInstant::adding(double interval) const {
  // The widest distance between two instants is less than twice this.
  if (!(std::fabs(interval) < 2 * static_cast<double>(endSecond))) return std::nullopt;
  NSInstant sum = split(interval);
  sum.seconds += seconds;
  sum.nanoseconds += nanoseconds;
  if (sum.nanoseconds >= nanosecondsPerSecond) {
    ++sum.seconds;
    sum.nanoseconds -= nanosecondsPerSecond;
  }
  if (sum.seconds < firstSecond || sum.seconds >= endSecond) return std::nullopt;
  return sum;
}

double NSInstant::secondsSince(const NSInstant& other) const {
  return static_cast<double>(seconds - other.seconds) +
         static_cast<double>(nanoseconds - other.nanoseconds) / nanosecondsPerSecond;
}

bool NSGregorianDateIsValid(const NSGregorianDate& date, int units) {
  const bool hasMonth = (units & NSGregorianMonth) != 0;
  if (hasMonth && (date.month < 1 || date.month > 12)) return false;
  if (units & NSGregorianDay) {
    const int lastDay = hasMonth ? daysInMonth(date.year, date.month) : 31;
    if (date.day < 1 || date.day > lastDay) return false;
  }
  if (units & NSGregorianTime) {
    if (date.hour < 0 || date.hour > 23 || date.minute < 0 || date.minute > 59) return false;
    if (!(date.second >= 0 && date.second <= 60)) return false;
  }
  return true;
}

NSInstant NSInstantForGregorianDate(const NSGregorianDate& date, const NSTimeZone& inZone) {
  NSInstant instant = split(date.second);
  instant.seconds += dayNumber(date.year, date.month, date.day) * secondsPerDay +
                     date.hour * int64_t{3600} + date.minute * int64_t{60};
  instant.seconds -= inZone.secondsFromGMTForClock(instant.seconds);
  return instant;
}

NSGregorianDate NSGregorianDateForInstant(const NSInstant& instant, const NSTimeZone& inZone) {
  const int64_t clock = instant.seconds + inZone.secondsFromGMT(instant);
  const CalendarDay day = calendarDay(floorDivide(clock, secondsPerDay));
  const int64_t time = floorRemainder(clock, secondsPerDay);
  NSGregorianDate date;
  date.year = static_cast<int32_t>(std::clamp(day.year, firstYear, lastYear));
  date.month = static_cast<int8_t>(day.month);
  date.day = static_cast<int8_t>(day.day);
  date.hour = static_cast<int8_t>(time / 3600);
  date.minute = static_cast<int8_t>(time / 60 % 60);
  // One division, so that the seconds are the double nearest to their digits.
  date.second = static_cast<double>(time % 60 * nanosecondsPerSecond + instant.nanoseconds) /
                nanosecondsPerSecond;
  return date;
}

Ref<NSDate> NSDate::date() {
  return make<NSDate>(Kind::Date, uint16_t{0}, NSInstant::now());
}

Ref<NSDate> NSDate::dateWithTimeIntervalSinceReferenceDate(double seconds) {
  return make<NSDate>(Kind::Date, uint16_t{0}, NSInstant::fromTimeInterval(seconds));
}

uint32_t NSDate::hash() const {
  const auto mixed = static_cast<uint64_t>(_instant.seconds) * 0x9E3779B97F4A7C15U +
                     static_cast<uint64_t>(_instant.nanoseconds);
  return static_cast<uint32_t>(mixed ^ mixed >> 32);
}

}  // namespace xquery
