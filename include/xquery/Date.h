// Instants, calendar fields and time zones.
//
// The calendar is the proleptic Gregorian one: its rules hold for all years, and there is a year 0
// before year 1. A day has 86,400 seconds; there are no leap seconds.
//
// As a result item every date, time and Gregorian fragment is an NSDate:
//
//   if (const NSDate* date = dyn_cast<NSDate>(items->objectAtIndex(0))) {
//     double seconds = date->timeIntervalSinceReferenceDate();
//   }
#pragma once

#include "xquery/Object.h"

#include <compare>
#include <cstdint>
#include <memory>
#include <optional>
#include <string_view>

namespace xquery {

// A point in time: whole seconds since 2001-01-01T00:00:00 GMT and the nanoseconds after them, from
// 0 to 999,999,999. A double would lose seconds in far years and the digits of a fraction today.
struct XQUERY_EXPORT NSInstant {
  int64_t seconds = 0;
  int32_t nanoseconds = 0;

  // The present, in whole microseconds.
  static NSInstant now();
  // Rounded to nanoseconds. What lies beyond the 32-bit years becomes the end of them; NaN is the
  // reference instant.
  static NSInstant fromTimeInterval(double seconds);

  double timeInterval() const;
  // Null when the sum lies beyond the 32-bit years.
  std::optional<NSInstant> adding(double seconds) const;
  // The seconds from `other` to this one.
  double secondsSince(const NSInstant& other) const;

  friend auto operator<=>(const NSInstant&, const NSInstant&) = default;
};

// An instant as the calendar and the clock of a zone show it.
struct NSGregorianDate {
  int32_t year = 0;
  int8_t month = 0;  // 1 to 12
  int8_t day = 0;    // 1 to 31
  int8_t hour = 0;
  int8_t minute = 0;
  double second = 0;
};

class ICUTimeZone;

// A zone: a fixed offset from GMT, or the rules of a named zone. Immutable.
class XQUERY_EXPORT NSTimeZone : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::TimeZone; }

  // East of GMT is positive.
  [[nodiscard]] static Ref<NSTimeZone> timeZoneForSecondsFromGMT(int32_t seconds);
  // "Europe/Berlin"; null for a name that is not known.
  [[nodiscard]] static Ref<NSTimeZone> timeZoneWithName(std::string_view name);
  // The shared zone at offset 0.
  static NSTimeZone* GMT();
  // The zone of the process, from the environment variable TZ or the system's setting; looked up
  // once, at first use.
  static NSTimeZone* localTimeZone();

  bool isFixed() const { return _rules == nullptr; }
  int32_t secondsFromGMT(const NSInstant& at) const;
  bool isDaylightSavingTime(const NSInstant& at) const;
  // The offset for what a clock in the zone shows, in seconds since it showed the reference date.
  // Clock times that a change of the offset skips are read with the offset before the change, those
  // that it repeats are the first of the two.
  int32_t secondsFromGMTForClock(int64_t seconds) const;

 protected:
  NSTimeZone(int32_t offset, std::unique_ptr<const ICUTimeZone> rules);
  ~NSTimeZone() override;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  int32_t _offset;  // of a fixed zone
  std::unique_ptr<const ICUTimeZone> _rules;
};

// The fields may lie outside their ranges: they are carried over. Seconds are rounded to
// nanoseconds.
XQUERY_EXPORT NSInstant NSInstantForGregorianDate(const NSGregorianDate& date,
                                                  const NSTimeZone& inZone);
// A year beyond 32 bits becomes the last or the first one.
XQUERY_EXPORT NSGregorianDate NSGregorianDateForInstant(const NSInstant& instant,
                                                        const NSTimeZone& inZone);

class XQUERY_EXPORT NSDate : public NSCounted {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::Date || object.kind() == Kind::TypedDate;
  }

  // Now.
  [[nodiscard]] static Ref<NSDate> date();
  [[nodiscard]] static Ref<NSDate> dateWithTimeIntervalSinceReferenceDate(double seconds);

  const NSInstant& instant() const { return _instant; }
  // Seconds since 2001-01-01T00:00:00 GMT.
  double timeIntervalSinceReferenceDate() const { return _instant.timeInterval(); }
  bool isEqualToDate(const NSDate& other) const { return _instant == other._instant; }
  uint32_t hash() const;

 protected:
  NSDate(Kind kind, uint16_t aux, const NSInstant& instant) : NSCounted(kind), _instant(instant) {
    _aux = aux;
  }
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  NSInstant _instant;
};

}  // namespace xquery
