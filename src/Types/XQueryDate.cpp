#include "Types/XQueryDate.h"

#include "Platform/Dates/GregorianCalendar.h"

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

NSGregorianDate xqueryFieldsForType(NSGregorianDate date, XQueryTypeID type) {
  if (type == XQueryTypeDateTime) return date;
  if (type == XQueryTypeTime) {
    date.year = 0;
    date.month = 0;
    date.day = 0;
    return date;
  }
  date.hour = 0;
  date.minute = 0;
  date.second = 0;
  const bool hasYear =
      type == XQueryTypeDate || type == XQueryTypeGYearMonth || type == XQueryTypeGYear;
  const bool hasMonth = type != XQueryTypeGYear && type != XQueryTypeGDay;
  const bool hasDay =
      type == XQueryTypeDate || type == XQueryTypeGMonthDay || type == XQueryTypeGDay;
  if (!hasYear) date.year = 0;
  if (!hasMonth) date.month = 1;
  if (!hasDay) date.day = 1;
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
