#include "Types/XQueryDate.h"

#include <charconv>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <string>

namespace xquery {

namespace {

template <class... Numbers>
std::string formatted(const char* format, Numbers... numbers) {
  char text[64];
  const int length = std::snprintf(text, sizeof text, format, numbers...);
  return {text, static_cast<size_t>(length)};
}

std::string yearText(const NSGregorianDate& date) {
  return formatted("%.4d", static_cast<int>(date.year));
}

std::string monthText(const NSGregorianDate& date) {
  return formatted("%.2d", date.month);
}

std::string dayText(const NSGregorianDate& date) {
  return formatted("%.2d", date.day);
}

std::string dateText(const NSGregorianDate& date) {
  return yearText(date) + "-" + monthText(date) + "-" + dayText(date);
}

// Independent of the process's locale.
std::string sixDecimals(double seconds) {
  char text[32];
  const auto end =
      std::to_chars(text, text + sizeof text, seconds, std::chars_format::fixed, 6).ptr;
  return {text, end};
}

std::string timeText(const NSGregorianDate& date) {
  std::string text = formatted("%.2d:%.2d:", date.hour, date.minute);
  const double seconds = date.second;
  if (seconds == std::trunc(seconds)) return text + formatted("%.2d", static_cast<int>(seconds));
  // The padding is decided before the rounding: 9.9999999 prints as 010.000000.
  return text + (seconds < 10 ? "0" : "") + sixDecimals(seconds);
}

std::string fieldsText(const NSGregorianDate& date, XQueryTypeID type) {
  switch (type) {
    case XQueryTypeGYearMonth:
      return yearText(date) + "-" + monthText(date);
    case XQueryTypeGYear:
      return yearText(date);
    case XQueryTypeGMonthDay:
      return "--" + monthText(date) + "-" + dayText(date);
    case XQueryTypeGDay:
      return "---" + dayText(date);
    case XQueryTypeGMonth:
      return "--" + monthText(date) + "--";
    case XQueryTypeDateTime:
      return dateText(date) + "T" + timeText(date);
    case XQueryTypeDate:
      return dateText(date);
    case XQueryTypeTime:
      return timeText(date);
    default:
      return "";
  }
}

}  // namespace

std::string XQueryDate::suffixForSecondsFromGMT(int32_t seconds) {
  if (seconds == 0) return "Z";
  const int64_t magnitude = std::abs(int64_t{seconds});
  return (seconds < 0 ? "-" : "+") + formatted("%.2ld:%.2ld", static_cast<long>(magnitude / 3600),
                                               static_cast<long>(magnitude % 3600 / 60));
}

Ref<NSString> XQueryDate::localizedStringForTimeZone(const NSTimeZone* zone) const {
  std::string text = fieldsText(gregorianDate(), typeID());
  if (zone) text += suffixForSecondsFromGMT(zone->secondsFromGMT(instant()));
  return NSString::stringWithASCII(text);
}

}  // namespace xquery
