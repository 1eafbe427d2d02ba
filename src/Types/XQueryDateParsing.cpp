// The lexical forms of dates and times. All eight are read by one procedure, which asks for
// the fields that the type has. Numbers are of digits only and nothing is skipped.
#include "Platform/Base/WorkMeter.h"
#include "Platform/Dates/GregorianCalendar.h"
#include "Platform/Numbers/NumberText.h"
#include "Types/XQueryDate.h"
#include "xquery/Number.h"

#include <limits>

namespace xquery {

namespace {

class DateReader {
 public:
  explicit DateReader(NSStringView text) : _text(text) {}

  // Null unless the whole text was of the form.
  Ref<XQueryDate> read(XQueryTypeID type) {
    const int units = xqueryUnitsOfType(type);
    NSGregorianDate date;
    Ref<NSTimeZone> zone;
    const bool hasDate = (units & ~NSGregorianTime) != 0;
    if (hasDate && !readDate(units, date)) return nullptr;
    if (units & NSGregorianTime) {
      if (hasDate && !take("T")) return nullptr;
      if (!readTime(date)) return nullptr;
    }
    if (!readZone(zone) || !atEnd()) return nullptr;
    if (!NSGregorianDateIsValid(date, units)) return nullptr;
    if (_negativeYear) date.year = -date.year;
    return XQueryDate::xqueryDateWithGregorianDate(xqueryFieldsForType(date, type), std::move(zone),
                                                   type);
  }

 private:
  bool atEnd() const { return _position >= _text.length(); }

  bool take(std::string_view text) {
    if (!_text.substring(_position).startsWith(NSStringView::ascii(text))) return false;
    _position += static_cast<uint32_t>(text.size());
    return true;
  }

  // At least `width` digits; fails on more than 32 bits hold.
  bool number(uint32_t width, int32_t& out) {
    const uint32_t start = _position;
    int64_t value = 0;
    WorkPacer pacer;  // a year may begin with millions of zeros
    for (; !atEnd() && _text[_position] >= '0' && _text[_position] <= '9'; ++_position) {
      pacer.turn();
      value = value * 10 + (_text[_position] - '0');
      if (value > std::numeric_limits<int32_t>::max()) return false;
    }
    out = static_cast<int32_t>(value);
    return _position - start >= width;
  }

  bool twoDigits(int32_t first, int32_t last, int32_t& out) {
    const uint32_t start = _position;
    return number(2, out) && _position - start == 2 && out >= first && out <= last;
  }

  bool twoDigits(int32_t first, int32_t last, int8_t& out) {
    int32_t value = 0;
    if (!twoDigits(first, last, value)) return false;
    out = static_cast<int8_t>(value);
    return true;
  }

  bool readDate(int units, NSGregorianDate& date) {
    const bool hasYear = (units & NSGregorianYear) != 0;
    const bool hasMonth = (units & NSGregorianMonth) != 0;
    const bool hasDay = (units & NSGregorianDay) != 0;
    if (hasYear) {
      _negativeYear = take("-");
      if (!number(4, date.year)) return false;
    }
    if (hasMonth) {
      if (!take(hasYear ? "-" : "--") || !twoDigits(1, 12, date.month)) return false;
      if (!hasDay && !hasYear && !take("--")) return false;
    }
    if (hasDay) return take(hasMonth ? "-" : "---") && twoDigits(1, 31, date.day);
    return true;
  }

  bool readTime(NSGregorianDate& date) {
    return twoDigits(0, 23, date.hour) && take(":") && twoDigits(0, 59, date.minute) && take(":") &&
           readSeconds(date.second) && date.second <= 60;
  }

  // Digits, perhaps with a point among them.
  bool readSeconds(double& seconds) {
    const NSStringView rest = _text.substring(_position);
    const char16_t first = rest.isEmpty() ? u' ' : rest[0];
    NumberExtent extent;
    if (first != '.' && (first < '0' || first > '9')) return false;
    if (!findNumber(rest, extent)) return false;
    _position += extent.mantissaEnd;
    return scanDouble(rest.substring(0, extent.mantissaEnd), seconds);
  }

  // The offset is bounded by its digits only.
  bool readZone(Ref<NSTimeZone>& zone) {
    if (take("Z")) {
      zone = XQueryDate::timeZoneGMT();
      return true;
    }
    const bool west = take("-");
    if (!west && !take("+")) return true;
    int32_t hours = 0;
    int32_t minutes = 0;
    if (!twoDigits(0, 99, hours) || !take(":") || !twoDigits(0, 99, minutes)) return false;
    const int32_t seconds = hours * 3600 + minutes * 60;
    zone = NSTimeZone::timeZoneForSecondsFromGMT(west ? -seconds : seconds);
    return true;
  }

  NSStringView _text;
  uint32_t _position = 0;
  bool _negativeYear = false;
};

}  // namespace

Ref<XQueryDate> XQueryDate::xqueryDateTimeFromString(NSStringView text) {
  return DateReader(text).read(XQueryTypeDateTime);
}

Ref<XQueryDate> XQueryDate::xqueryDateFromString(NSStringView text) {
  return DateReader(text).read(XQueryTypeDate);
}

Ref<XQueryDate> XQueryDate::xqueryTimeFromString(NSStringView text) {
  return DateReader(text).read(XQueryTypeTime);
}

Ref<XQueryDate> XQueryDate::xqueryGMonthYearFromString(NSStringView text) {
  return DateReader(text).read(XQueryTypeGYearMonth);
}

Ref<XQueryDate> XQueryDate::xqueryGYearFromString(NSStringView text) {
  return DateReader(text).read(XQueryTypeGYear);
}

Ref<XQueryDate> XQueryDate::xqueryGMonthDayFromString(NSStringView text) {
  return DateReader(text).read(XQueryTypeGMonthDay);
}

Ref<XQueryDate> XQueryDate::xqueryGDayFromString(NSStringView text) {
  return DateReader(text).read(XQueryTypeGDay);
}

Ref<XQueryDate> XQueryDate::xqueryGMonthFromString(NSStringView text) {
  return DateReader(text).read(XQueryTypeGMonth);
}

}  // namespace xquery
