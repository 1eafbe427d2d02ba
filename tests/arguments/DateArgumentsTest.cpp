// Parts of dates and durations, zones, differences, and the present.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>

namespace xquery::arguments {
namespace {

// The zone of the process, as the samples set it.
constexpr double localOffset = 9 * 3600;

// --- fields --------------------------------------------------------------------------------------

// What stands in the text of a date, time or dateTime.
struct Fields {
  int type = 0;
  int64_t year = 0;
  unsigned month = 0;
  unsigned day = 0;
  int64_t hour = 0;
  int64_t minute = 0;
  double second = 0;
  std::optional<double> zone;  // offset in seconds
};

Fields read(const Item& item) {
  Fields fields;
  fields.type = item.type;
  const char* at = item.text.c_str();
  char* end = nullptr;
  const auto number = [&](size_t width) {
    const std::string digits(at, width);
    at += width;
    return std::strtoll(digits.c_str(), nullptr, 10);
  };
  const auto skip = [&](char c) { at += *at == c; };
  if (item.type != 23) {
    const bool isNegative = *at == '-';
    skip('-');
    fields.year = number(4) * (isNegative ? -1 : 1);
    skip('-');
    fields.month = static_cast<unsigned>(number(2));
    skip('-');
    fields.day = static_cast<unsigned>(number(2));
    skip('T');
  }
  if (item.type != 22) {
    fields.hour = number(2);
    skip(':');
    fields.minute = number(2);
    skip(':');
    fields.second = std::strtod(at, &end);
    at = end;
  }
  if (*at == 'Z') fields.zone = 0;
  if (*at == '+' || *at == '-') {
    const double sign = *at++ == '-' ? -1 : 1;
    const double hours = static_cast<double>(number(2));
    skip(':');
    fields.zone = sign * (hours * 3600 + static_cast<double>(number(2)) * 60);
  }
  return fields;
}

double secondsOf(const Fields& fields) {
  using namespace std::chrono;
  const year_month_day date{year(static_cast<int>(fields.year)), month(fields.month),
                            day(fields.day)};
  const double days =
      fields.type == 23 ? 0 : static_cast<double>(sys_days(date).time_since_epoch().count());
  return days * 86400 + static_cast<double>(fields.hour * 3600 + fields.minute * 60) +
         fields.second - fields.zone.value_or(localOffset);
}

std::string secondText(double second) {
  char text[32];
  std::snprintf(text, sizeof text, second == std::trunc(second) ? "%02.0f" : "%09.6f", second);
  return text;
}

std::string zoneText(double offset) {
  if (offset == 0) return "Z";
  const auto minutes = static_cast<int>(std::fabs(offset) / 60);
  char text[32];
  std::snprintf(text, sizeof text, "%c%02d:%02d", offset < 0 ? '-' : '+', minutes / 60,
                minutes % 60);
  return text;
}

// The fields without zone.
std::string fieldsText(const Fields& fields) {
  char text[64];
  std::string result;
  if (fields.type != 23) {
    std::snprintf(text, sizeof text, "%.4d-%.2u-%.2u", static_cast<int>(fields.year), fields.month,
                  fields.day);
    result = text;
  }
  if (fields.type == 21) result += "T";
  if (fields.type != 22) {
    std::snprintf(text, sizeof text, "%.2d:%.2d:", static_cast<int>(fields.hour),
                  static_cast<int>(fields.minute));
    result += text + secondText(fields.second);
  }
  return result;
}

Fields atInstant(double instant, double zone, int type) {
  using namespace std::chrono;
  const double local = instant + zone;
  const double dayNumber = std::floor(local / 86400);
  double rest = local - dayNumber * 86400;
  const year_month_day date{sys_days(days(static_cast<int>(dayNumber)))};
  Fields fields;
  fields.type = type;
  fields.year = static_cast<int>(date.year());
  fields.month = static_cast<unsigned>(date.month());
  fields.day = static_cast<unsigned>(date.day());
  fields.hour = static_cast<int64_t>(rest / 3600);
  rest -= static_cast<double>(fields.hour) * 3600;
  fields.minute = static_cast<int64_t>(rest / 60);
  fields.second = rest - static_cast<double>(fields.minute) * 60;
  fields.zone = zone;
  return fields;
}

// --- components ----------------------------------------------------------------------------------

// Nothing for nothing; else a component of the one item cast to the type.
template <class Part>
Rule component(int type, Part part) {
  return [=](const Call& call) -> Sequence {
    if (call[0].empty()) return {};
    return part(castTo(call[0], type));
  };
}

Item wholeNumber(double value) {
  return integer(static_cast<int64_t>(value));
}

// A decimal.
Item decimalSeconds(double value) {
  return numberOf(13, value);
}

Rule ofMonths(int64_t (*part)(int64_t)) {
  return component(28, [=](const Item& item) {
    return one(integer(part(static_cast<int64_t>(durationValue(item)))));
  });
}

// What is left over whole multiples of `over` (0: everything), in whole units; signed.
Rule ofSeconds(double over, double unit) {
  return component(29, [=](const Item& item) {
    const double seconds = durationValue(item);
    const double rest = over == 0 ? seconds : std::fmod(seconds, over);
    return one(unit == 1 ? decimalSeconds(rest) : wholeNumber(std::trunc(rest / unit)));
  });
}

Rule year(int type) {
  return component(type, [](const Item& item) { return one(integer(read(item).year)); });
}
Rule month(int type) {
  return component(type, [](const Item& item) { return one(integer(read(item).month)); });
}
Rule day(int type) {
  return component(type, [](const Item& item) { return one(integer(read(item).day)); });
}
Rule hour(int type) {
  return component(type, [](const Item& item) { return one(integer(read(item).hour)); });
}
Rule minute(int type) {
  return component(type, [](const Item& item) { return one(integer(read(item).minute)); });
}
Rule second(int type) {
  return component(type, [](const Item& item) { return one(decimalSeconds(read(item).second)); });
}
Rule zone(int type) {
  return component(type, [](const Item& item) -> Sequence {
    const std::optional<double> offset = read(item).zone;
    if (!offset) return {};
    return one(dayTime(*offset));
  });
}

// --- zones and differences -----------------------------------------------------------------------

Sequence adjusted(const Call& call, int type) {
  if (call[0].empty()) {
    // Whether the second argument is looked at then is open.
    if (call.count() > 1) call.orElse("error 6 *");
    return {};
  }
  Attempts attempt;
  const Item item = attempt([&] { return castTo(call[0], type); });
  std::optional<double> offset = localOffset;
  if (call.count() > 1) {
    offset = attempt([&]() -> std::optional<double> {
      if (call[1].empty()) return std::nullopt;
      return durationValue(castTo(call[1], 29));
    });
  }
  attempt.finish();
  const Fields fields = read(item);
  if (!offset) return one({type, fieldsText(fields)});
  // A zone is a number of whole seconds; what becomes of a part of one is open.
  if (*offset != std::trunc(*offset)) return one(anyOf(type));
  if (!fields.zone) return one({type, fieldsText(fields) + zoneText(*offset)});
  const Fields moved = atInstant(secondsOf(fields), *offset, type);
  return one({type, fieldsText(moved) + zoneText(*offset)});
}

Rule adjustedTo(int type) {
  return [=](const Call& call) { return adjusted(call, type); };
}

Rule difference(int type) {
  return [=](const Call& call) {
    Attempts attempt;
    const Item a = attempt([&] { return castTo(call[0], type); });
    const Item b = attempt([&] { return castTo(call[1], type); });
    attempt.finish();
    return one(dayTime(secondsOf(read(a)) - secondsOf(read(b))));
  };
}

// A date and a time in one. What else may be given, and what their zones become, is open.
Sequence dateAndTime(const Call& call) {
  Attempts attempt;
  const Item date = attempt([&] { return castTo(call[0], 22); });
  const Item time = attempt([&] { return castTo(call[1], 23); });
  if (call[0].empty() || call[1].empty()) call.orElse("()");
  const bool areSo =
      call[0].size() == 1 && call[0][0].type == 22 && call[1].size() == 1 && call[1][0].type == 23;
  if (!areSo) {
    call.orRefused();
    call.orElse("error 6 *");
  }
  attempt.finish();
  const std::string time8 = time.text.substr(0, 8);
  return one(anyOf(21, areSo ? date.text.substr(0, 10) + "T" + time8 : ""));
}

Rule present(int type) {
  return [=](const Call&) { return one(anyOf(type, type == 23 ? "" : "20")); };
}

}  // namespace

const std::vector<Function>& dateFunctions() {
  static const std::vector<Function> functions = {
      {"fn:years-from-duration", 1, 1, ofMonths([](int64_t months) { return months / 12; })},
      {"fn:months-from-duration", 1, 1, ofMonths([](int64_t months) { return months % 12; })},
      {"fn:days-from-duration", 1, 1, ofSeconds(0, 86400)},
      {"fn:hours-from-duration", 1, 1, ofSeconds(86400, 3600)},
      {"fn:minutes-from-duration", 1, 1, ofSeconds(3600, 60)},
      {"fn:seconds-from-duration", 1, 1, ofSeconds(60, 1)},
      {"fn:year-from-dateTime", 1, 1, year(21)},
      {"fn:month-from-dateTime", 1, 1, month(21)},
      {"fn:day-from-dateTime", 1, 1, day(21)},
      {"fn:hours-from-dateTime", 1, 1, hour(21)},
      {"fn:minutes-from-dateTime", 1, 1, minute(21)},
      {"fn:seconds-from-dateTime", 1, 1, second(21)},
      {"fn:timezone-from-dateTime", 1, 1, zone(21)},
      {"fn:year-from-date", 1, 1, year(22)},
      {"fn:month-from-date", 1, 1, month(22)},
      {"fn:day-from-date", 1, 1, day(22)},
      {"fn:timezone-from-date", 1, 1, zone(22)},
      {"fn:hours-from-time", 1, 1, hour(23)},
      {"fn:minutes-from-time", 1, 1, minute(23)},
      {"fn:seconds-from-time", 1, 1, second(23)},
      {"fn:timezone-from-time", 1, 1, zone(23)},
      {"fn:adjust-dateTime-to-timezone", 1, 2, adjustedTo(21)},
      {"fn:adjust-date-to-timezone", 1, 2, adjustedTo(22)},
      {"fn:adjust-time-to-timezone", 1, 2, adjustedTo(23)},
      {"fn:subtract-dateTimes-yielding-dayTimeDuration", 2, 2, difference(21)},
      {"fn:subtract-dates-yielding-dayTimeDuration", 2, 2, difference(22)},
      {"fn:subtract-times", 2, 2, difference(23)},
      {"fn:current-dateTime", 0, 0, present(21)},
      {"fn:current-date", 0, 0, present(22)},
      {"fn:current-time", 0, 0, present(23)},
      {"fn:dateTime", 2, 2, dateAndTime},
      {"fn:implicit-timezone", 0, 0, [](const Call&) { return one(dayTime(localOffset)); }},
  };
  return functions;
}

TEST(DateArguments, EndAsTheRulesSay) {
  expectRules(dateFunctions());
}

}  // namespace xquery::arguments
