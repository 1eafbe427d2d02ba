// Dates and times: dateTime, date, time and the five Gregorian fragments.
//
// All eight are one instant and perhaps a time zone. What was written without a zone is an instant
// all the same, the one at which the clock of the process's zone shows the fields, and its fields
// are read in that zone again. The fields that a type does not have stand at the start of year 0:
//
//   date, gYearMonth, gYear       0 o'clock, of the first day, of January
//   gMonthDay, gMonth, gDay       the same in year 0
//   time                          on day 0 of month 0 of year 0
#pragma once

#include "Types/XQueryTypeTable.h"
#include "xquery/Date.h"
#include "xquery/String.h"

namespace xquery {

class XQueryDate : public NSDate {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::TypedDate; }

  static NSTimeZone* timeZoneGMT() { return NSTimeZone::GMT(); }

  // In the local zone.
  [[nodiscard]] static Ref<XQueryDate> xqueryDateWithTimeIntervalSinceReferenceDate(
      double interval, XQueryTypeID forType);
  // The instant at which a clock in the zone, or in the local one when there is none, shows the
  // fields. They are taken as they are: see `xqueryFieldsForType`.
  [[nodiscard]] static Ref<XQueryDate> xqueryDateWithGregorianDate(const NSGregorianDate& date,
                                                                   Ref<NSTimeZone> timeZone,
                                                                   XQueryTypeID forType);
  [[nodiscard]] static Ref<XQueryDate> xqueryDateWithInstant(const NSInstant& instant,
                                                             Ref<NSTimeZone> timeZone,
                                                             XQueryTypeID forType);
  // The present, in the local zone.
  [[nodiscard]] static Ref<XQueryDate> currentDateTime();
  [[nodiscard]] static Ref<XQueryDate> currentDate();
  [[nodiscard]] static Ref<XQueryDate> currentTime();

  // Null for any deviation from the lexical forms, and for a year beyond 32 bits.
  [[nodiscard]] static Ref<XQueryDate> xqueryDateTimeFromString(NSStringView text);
  [[nodiscard]] static Ref<XQueryDate> xqueryDateFromString(NSStringView text);
  [[nodiscard]] static Ref<XQueryDate> xqueryTimeFromString(NSStringView text);
  [[nodiscard]] static Ref<XQueryDate> xqueryGMonthYearFromString(NSStringView text);
  [[nodiscard]] static Ref<XQueryDate> xqueryGYearFromString(NSStringView text);
  [[nodiscard]] static Ref<XQueryDate> xqueryGMonthDayFromString(NSStringView text);
  [[nodiscard]] static Ref<XQueryDate> xqueryGDayFromString(NSStringView text);
  [[nodiscard]] static Ref<XQueryDate> xqueryGMonthFromString(NSStringView text);

  XQueryTypeID typeID() const { return static_cast<XQueryTypeID>(_aux); }
  // Null for a value without a zone.
  const Ref<NSTimeZone>& timeZone() const { return _timeZone; }
  // Only for a value that its maker has not handed out yet.
  void setTimeZone(Ref<NSTimeZone> timeZone) { _timeZone = std::move(timeZone); }
  // The value's zone, or the local one.
  const NSTimeZone& clockZone() const {
    return _timeZone ? *_timeZone : *NSTimeZone::localTimeZone();
  }
  // The zone for a value with other fields that is to show this one's offset: the value's own, or a
  // fixed one where the zone's rules say otherwise for those fields.
  Ref<NSTimeZone> timeZoneForFields(const NSGregorianDate& date) const;

  NSGregorianDate gregorianDate() const {
    return NSGregorianDateForInstant(instant(), clockZone());
  }
  NSGregorianDate gregorianDateGMT() const {
    return NSGregorianDateForInstant(instant(), *timeZoneGMT());
  }

  // The fields in the value's own zone, followed by the suffix of the given one; no suffix when it
  // is null. A fraction of a second has six digits.
  Ref<NSString> localizedStringForTimeZone(const NSTimeZone* zone) const;
  Ref<NSString> XQueryStringValue() const { return localizedStringForTimeZone(_timeZone.get()); }
  // "Z", "+hh:mm" or "-hh:mm"; the offset need not be one that a clock may have.
  static std::string suffixForSecondsFromGMT(int32_t seconds);

  // The value of another type of this family. Null when there is no cast between the types.
  Ref<XQueryDate> castToType(XQueryTypeID type) const;

 protected:
  XQueryDate(const NSInstant& instant, Ref<NSTimeZone> timeZone, XQueryTypeID type)
      : NSDate(Kind::TypedDate, static_cast<uint16_t>(type), instant),
        _timeZone(std::move(timeZone)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSTimeZone> _timeZone;
};

// Which fields a type of this family has, as NSGregorianUnits.
int xqueryUnitsOfType(XQueryTypeID type);

// The fields with those that the type does not have at their resting values.
NSGregorianDate xqueryFieldsForType(NSGregorianDate date, XQueryTypeID type);

}  // namespace xquery
