// Dates, times and durations.
//
// The types of Python take what they can hold: the years 1 to 9999, whole microseconds, zones of
// datetimes and times. All else is of the classes of the package's own, which hold what is written.
#include "Values.h"

#include <cmath>
#include <datetime.h>

namespace xquery::python {
namespace {

constexpr int nanosecondsInMicrosecond = 1000;

// The C interface of the module datetime, which every file has a pointer of its own to.
void needDatetime() {
  if (PyDateTimeAPI) return;
  PyDateTime_IMPORT;
  if (!PyDateTimeAPI) throw py::error_already_set();
}

py::object toTimezone(const std::optional<std::chrono::minutes>& zone) {
  if (!zone) return py::none();
  if (zone->count() == 0) return py::reinterpret_borrow<py::object>(PyDateTime_TimeZone_UTC);
  const int seconds = static_cast<int>(zone->count()) * 60;
  const py::object offset = steal(PyDelta_FromDSU(0, seconds, 0));
  return steal(PyTimeZone_FromOffset(offset.ptr()));
}

bool isYearOfPython(int32_t year) {
  return year >= 1 && year <= 9999;
}

py::object toDateTime(const XQueryDateTimeParts& parts) {
  const py::object zone = toTimezone(parts.zone);
  if (isYearOfPython(parts.year) && parts.nanosecond % nanosecondsInMicrosecond == 0) {
    return steal(PyDateTimeAPI->DateTime_FromDateAndTime(
        parts.year, parts.month, parts.day, parts.hour, parts.minute, parts.second,
        parts.nanosecond / nanosecondsInMicrosecond, zone.ptr(), PyDateTimeAPI->DateTimeType));
  }
  return known().dateTime(parts.year, parts.month, parts.day, parts.hour, parts.minute,
                          parts.second, parts.nanosecond, zone);
}

py::object toDate(const XQueryDateTimeParts& parts) {
  if (!parts.zone && isYearOfPython(parts.year)) {
    return steal(PyDate_FromDate(parts.year, parts.month, parts.day));
  }
  return known().date(parts.year, parts.month, parts.day, toTimezone(parts.zone));
}

py::object toTime(const XQueryDateTimeParts& parts) {
  const py::object zone = toTimezone(parts.zone);
  if (parts.nanosecond % nanosecondsInMicrosecond == 0) {
    return steal(PyDateTimeAPI->Time_FromTime(parts.hour, parts.minute, parts.second,
                                              parts.nanosecond / nanosecondsInMicrosecond,
                                              zone.ptr(), PyDateTimeAPI->TimeType));
  }
  return known().time(parts.hour, parts.minute, parts.second, parts.nanosecond, zone);
}

py::object toFragment(const XQueryDateTimeParts& parts, XQueryItemType type) {
  const py::object zone = toTimezone(parts.zone);
  switch (type) {
    case XQueryItemType::GYearMonth:
      return known().gYearMonth(parts.year, parts.month, zone);
    case XQueryItemType::GYear:
      return known().gYear(parts.year, zone);
    case XQueryItemType::GMonthDay:
      return known().gMonthDay(parts.month, parts.day, zone);
    case XQueryItemType::GMonth:
      return known().gMonth(parts.month, zone);
    default:
      return known().gDay(parts.day, zone);
  }
}

py::object toTimedelta(const Value& value) {
  constexpr double secondsInDay = 86400, microseconds = 1e6, mostDays = 999999999;
  const auto duration = XQueryReadDayTimeDuration(value);
  if (!duration) throw py::value_error(duration.error()->msg()->utf8());
  const double seconds = duration->count();
  double days = std::floor(seconds / secondsInDay);
  // A multiple of a microsecond as near as a double comes to it, which may be that of the next day.
  double rest = std::round((seconds - days * secondsInDay) * microseconds);
  if (rest >= secondsInDay * microseconds) {
    rest = 0;
    ++days;
  }
  if (days < -mostDays || days > mostDays) {
    const double magnitude = std::fabs(seconds), wholeDays = std::floor(magnitude / secondsInDay);
    return known().duration(py::arg("days") = py::int_(py::float_(wholeDays)),
                            py::arg("seconds") = magnitude - wholeDays * secondsInDay,
                            py::arg("negative") = seconds < 0);
  }
  const auto wholeSeconds = static_cast<int64_t>(rest / microseconds);
  const auto left = static_cast<int64_t>(rest) - wholeSeconds * 1'000'000;
  return steal(PyDelta_FromDSU(static_cast<int>(days), static_cast<int>(wholeSeconds),
                               static_cast<int>(left)));
}

py::object toDuration(const Value& value) {
  const auto parts = XQueryReadDuration(value);
  if (!parts) throw py::value_error(parts.error()->msg()->utf8());
  return known().duration(parts->years, parts->months, parts->days, parts->hours, parts->minutes,
                          parts->seconds, parts->isNegative);
}

// --- from Python ---------------------------------------------------------------------------------

// The zone of a datetime or a time, as far as it has one. That of a ZoneInfo has no offset without
// a day, and would be lost in silence.
std::optional<std::chrono::minutes> zoneOf(py::handle object) {
  const py::object offset = object.attr("utcoffset")();
  if (offset.is_none()) {
    const py::object zone = object.attr("tzinfo");
    if (zone.is_none()) return std::nullopt;
    throw py::value_error(fromStr(py::str(zone)) +
                          " has no offset from UTC without a day and a time");
  }
  const int64_t seconds = int64_t{PyDateTime_DELTA_GET_DAYS(offset.ptr())} * 86400 +
                          PyDateTime_DELTA_GET_SECONDS(offset.ptr());
  if (seconds % 60 != 0 || PyDateTime_DELTA_GET_MICROSECONDS(offset.ptr()) != 0) {
    throw py::value_error("an offset from UTC is of whole minutes: " +
                          fromStr(py::str(py::handle(offset))));
  }
  return std::chrono::minutes(seconds / 60);
}

Value fromDateTime(py::handle object) {
  PyObject* date = object.ptr();
  XQueryDateTimeParts parts;
  parts.year = PyDateTime_GET_YEAR(date);
  parts.month = PyDateTime_GET_MONTH(date);
  parts.day = PyDateTime_GET_DAY(date);
  parts.hour = PyDateTime_DATE_GET_HOUR(date);
  parts.minute = PyDateTime_DATE_GET_MINUTE(date);
  parts.second = PyDateTime_DATE_GET_SECOND(date);
  parts.nanosecond = PyDateTime_DATE_GET_MICROSECOND(date) * nanosecondsInMicrosecond;
  parts.zone = zoneOf(object);
  return valueOrRaise(XQueryMakeDateOfType(XQueryItemType::DateTime, parts));
}

Value fromDate(py::handle object) {
  XQueryDateTimeParts parts;
  parts.year = PyDateTime_GET_YEAR(object.ptr());
  parts.month = PyDateTime_GET_MONTH(object.ptr());
  parts.day = PyDateTime_GET_DAY(object.ptr());
  return valueOrRaise(XQueryMakeDateOfType(XQueryItemType::Date, parts));
}

Value fromTime(py::handle object) {
  PyObject* time = object.ptr();
  XQueryDateTimeParts parts;
  parts.hour = PyDateTime_TIME_GET_HOUR(time);
  parts.minute = PyDateTime_TIME_GET_MINUTE(time);
  parts.second = PyDateTime_TIME_GET_SECOND(time);
  parts.nanosecond = PyDateTime_TIME_GET_MICROSECOND(time) * nanosecondsInMicrosecond;
  parts.zone = zoneOf(object);
  return valueOrRaise(XQueryMakeDateOfType(XQueryItemType::Time, parts));
}

Value fromTimedelta(py::handle object) {
  const double seconds = object.attr("total_seconds")().cast<double>();
  return valueOrRaise(XQueryMakeDayTimeDuration(std::chrono::duration<double>(seconds)));
}

}  // namespace

py::object dateToPython(const Value& value, XQueryItemType type) {
  needDatetime();
  const auto parts = XQueryReadDateTimeParts(value);
  if (!parts) throw py::value_error(parts.error()->msg()->utf8());
  if (type == XQueryItemType::DateTime) return toDateTime(*parts);
  if (type == XQueryItemType::Date) return toDate(*parts);
  return type == XQueryItemType::Time ? toTime(*parts) : toFragment(*parts, type);
}

py::object durationToPython(const Value& value, XQueryItemType type) {
  needDatetime();
  if (type == XQueryItemType::DayTimeDuration) return toTimedelta(value);
  if (type == XQueryItemType::Duration) return toDuration(value);
  const auto months = XQueryReadYearMonthDuration(value);
  if (!months) throw py::value_error(months.error()->msg()->utf8());
  return known().monthDuration(months->count());
}

Value dateFromPython(py::handle object) {
  needDatetime();
  PyObject* plain = object.ptr();
  if (PyDateTime_Check(plain)) return fromDateTime(object);
  if (PyDate_Check(plain)) return fromDate(object);
  if (PyTime_Check(plain)) return fromTime(object);
  if (PyDelta_Check(plain)) return fromTimedelta(object);
  return nullptr;
}

}  // namespace xquery::python
