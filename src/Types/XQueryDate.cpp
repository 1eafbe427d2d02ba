#include "Types/XQueryDate.h"

#include "Platform/Dates/GregorianCalendar.h"

#include <iterator>

namespace xquery {

Ref<XQueryDate> XQueryDate::xqueryDateWithInstant(const NSInstant& instant,
                                                  Ref<NSTimeZone> timeZone, XQueryTypeID forType) {
  return make<XQueryDate>(instant, std::move(timeZone), forType);
}

Ref<XQueryDate> XQueryDate::xqueryDateWithTimeIntervalSinceReferenceDate(double interval,
                                                                         XQueryTypeID forType) {
  return xqueryDateWithInstant(NSInstant::fromTimeInterval(interval), NSTimeZone::localTimeZone(),
                               forType);
}

Ref<XQueryDate> XQueryDate::xqueryDateWithGregorianDate(const NSGregorianDate& date,
                                                        Ref<NSTimeZone> timeZone,
                                                        XQueryTypeID forType) {
  const NSTimeZone& clock = timeZone ? *timeZone : *NSTimeZone::localTimeZone();
  return xqueryDateWithInstant(NSInstantForGregorianDate(date, clock), std::move(timeZone),
                               forType);
}

Ref<XQueryDate> XQueryDate::currentDateTime() {
  return xqueryDateWithInstant(NSInstant::now(), NSTimeZone::localTimeZone(), XQueryTypeDateTime);
}

Ref<XQueryDate> XQueryDate::currentDate() {
  return xqueryDateWithInstant(NSInstant::now(), NSTimeZone::localTimeZone(), XQueryTypeDate);
}

Ref<XQueryDate> XQueryDate::currentTime() {
  return xqueryDateWithInstant(NSInstant::now(), NSTimeZone::localTimeZone(), XQueryTypeTime);
}

Ref<NSTimeZone> XQueryDate::timeZoneForFields(const NSGregorianDate& date) const {
  if (!_timeZone || _timeZone->isFixed()) return _timeZone;
  const int32_t offset = _timeZone->secondsFromGMT(instant());
  const NSInstant moved = NSInstantForGregorianDate(date, *_timeZone);
  if (_timeZone->secondsFromGMT(moved) == offset) return _timeZone;
  return NSTimeZone::timeZoneForSecondsFromGMT(offset);
}

int xqueryUnitsOfType(XQueryTypeID type) {
  constexpr int year = NSGregorianYear;
  constexpr int month = NSGregorianMonth;
  constexpr int day = NSGregorianDay;
  constexpr int time = NSGregorianTime;
  static constexpr int units[] = {
      year | month,               // gYearMonth
      year,                       // gYear
      month | day,                // gMonthDay
      day,                        // gDay
      month,                      // gMonth
      year | month | day | time,  // dateTime
      year | month | day,         // date
      time,                       // time
  };
  static_assert(std::size(units) == XQueryTypeTime - XQueryTypeGYearMonth + 1);
  return units[type - XQueryTypeGYearMonth];
}

NSGregorianDate xqueryFieldsForType(NSGregorianDate date, XQueryTypeID type) {
  const int units = xqueryUnitsOfType(type);
  const int8_t first = type == XQueryTypeTime ? 0 : 1;
  if (!(units & NSGregorianYear)) date.year = 0;
  if (!(units & NSGregorianMonth)) date.month = first;
  if (!(units & NSGregorianDay)) date.day = first;
  if (!(units & NSGregorianTime)) {
    date.hour = 0;
    date.minute = 0;
    date.second = 0;
  }
  return date;
}

namespace {

// To the fragments from what has all their fields, and down or up between dateTime and its parts.
bool canCast(XQueryTypeID from, XQueryTypeID to) {
  switch (to) {
    case XQueryTypeGYearMonth:
    case XQueryTypeGYear:
    case XQueryTypeGMonthDay:
    case XQueryTypeGDay:
    case XQueryTypeGMonth:
      return from == XQueryTypeDateTime || from == XQueryTypeDate;
    case XQueryTypeDateTime:
      return from == XQueryTypeDate;
    case XQueryTypeDate:
    case XQueryTypeTime:
      return from == XQueryTypeDateTime;
    default:
      return false;
  }
}

}  // namespace

Ref<XQueryDate> XQueryDate::castToType(XQueryTypeID type) const {
  if (!canCast(typeID(), type)) return nullptr;
  const NSGregorianDate fields = xqueryFieldsForType(gregorianDate(), type);
  return xqueryDateWithGregorianDate(fields, timeZoneForFields(fields), type);
}

}  // namespace xquery
