// Dates and times beside a slow model. The first byte chooses two types, the first line and the
// second are dates, the third a duration. Both sides agree on what a date is, how it prints, when
// it is, and what is so many months or seconds later.
#include "support/Failure.h"
#include "support/Input.h"
#include "support/SlowDate.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryDateArithmetic.h"
#include "Types/XQueryNumber.h"
#include "xquery/xquery.h"

#include <cstdlib>
#include <string>

using namespace xquery;
using namespace xquery::fuzz;

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  ::setenv("TZ", "UTC", 1);
  return 0;
}

namespace {

using Parser = Ref<XQueryDate> (*)(NSStringView);

constexpr Parser parsers[] = {
    XQueryDate::xqueryGMonthYearFromString, XQueryDate::xqueryGYearFromString,
    XQueryDate::xqueryGMonthDayFromString,  XQueryDate::xqueryGDayFromString,
    XQueryDate::xqueryGMonthFromString,     XQueryDate::xqueryDateTimeFromString,
    XQueryDate::xqueryDateFromString,       XQueryDate::xqueryTimeFromString};
constexpr size_t typeCount = std::size(parsers);

struct Both {
  Ref<XQueryDate> fast;
  SlowDate slow;
  SlowDate::Type type = SlowDate::Date;
};

void checkText(const Value& fast, const SlowDate& slow, SlowDate::Type type, const char* what) {
  check(fast && dyn_cast<XQueryDate>(fast), std::string(what) + " is none", slow.text(type));
  checkEqual(cast<XQueryDate>(fast)->XQueryStringValue()->utf8(), slow.text(type), what);
}

SlowDate::Instant instantOf(const XQueryDate& date) {
  return SlowDate::Instant{date.instant().seconds} * 1'000'000'000 + date.instant().nanoseconds;
}

bool read(std::string_view line, SlowDate::Type type, Both& out) {
  const auto text = NSString::stringWithUTF8Replacing(line);
  bool isBeyond = false;
  const auto slow = SlowDate::parse(line, type, isBeyond);
  out.fast = parsers[type](text->view());
  if (isBeyond) return false;
  check(!out.fast == !slow, out.fast ? "a date to the engine alone" : "no date to the engine",
        line);
  if (!slow) return false;
  out.slow = *slow;
  out.type = type;
  checkText(out.fast, out.slow, type, "printed");
  // The minutes of an offset may be more than an hour, which makes hours of three digits.
  constexpr int64_t readableZone = 100 * 3600;
  if (std::abs(slow->zone.value_or(0)) >= readableZone) return true;
  const auto again = parsers[type](out.fast->XQueryStringValue()->view());
  check(again != nullptr, "printed as what is no date", line);
  checkEqual(again->XQueryStringValue()->utf8(), out.slow.text(type), "printed once more");
  return true;
}

// Instants are counted from different beginnings.
void checkOrder(const Both& a, const Both& b) {
  check(instantOf(*a.fast) - instantOf(*b.fast) == a.slow.instant() - b.slow.instant(),
        "another distance", a.slow.text(a.type) + "\n" + b.slow.text(b.type));
}

void checkMonths(const Both& a, int64_t months, XQueryContext& context) {
  if (a.type != SlowDate::Date && a.type != SlowDate::DateTime) return;
  const Value duration = XQueryNumber::yearMonthDurationWithMonths(months);
  const bool isDate = a.type == SlowDate::Date;
  const auto add = isDate ? op_add_yearMonthDuration_to_date : op_add_yearMonthDuration_to_dateTime;
  const auto subtract = isDate ? op_subtract_yearMonthDuration_from_date
                               : op_subtract_yearMonthDuration_from_dateTime;
  SlowDate shown = SlowDate::at(a.slow.instant(), a.slow.zone);
  checkText(add(a.fast, duration, context), shown.plusMonths(months), a.type, "months later");
  checkText(subtract(a.fast, duration, context), shown.plusMonths(-months), a.type,
            "months earlier");
}

void checkSeconds(const Both& a, int64_t seconds, XQueryContext& context) {
  using Operation = Value (*)(const Value&, const Value&, XQueryContext&);
  Operation add = op_add_dayTimeDuration_to_dateTime;
  Operation subtract = op_subtract_dayTimeDuration_from_dateTime;
  if (a.type == SlowDate::Date) {
    add = op_add_dayTimeDuration_to_date;
    subtract = op_subtract_dayTimeDuration_from_date;
  } else if (a.type == SlowDate::Time) {
    add = op_add_dayTimeDuration_to_time;
    subtract = op_subtract_dayTimeDuration_from_time;
  } else if (a.type != SlowDate::DateTime) {
    return;
  }
  const Value duration = XQueryNumber::dayTimeDurationWithSeconds(static_cast<double>(seconds));
  checkText(add(a.fast, duration, context), a.slow.plusSeconds(seconds, a.type), a.type,
            "seconds later");
  checkText(subtract(a.fast, duration, context), a.slow.plusSeconds(-seconds, a.type), a.type,
            "seconds earlier");
}

// What a type keeps of a date and time.
void checkParts(const Both& a) {
  constexpr XQueryTypeID first = XQueryTypeGYearMonth;
  for (size_t type = 0; type < typeCount; ++type) {
    const auto part = a.fast->castToType(first + static_cast<XQueryTypeID>(type));
    const auto to = static_cast<SlowDate::Type>(type);
    const bool isFromDate = a.type == SlowDate::DateTime || a.type == SlowDate::Date;
    const bool isCast = to == a.type || (isFromDate && to < SlowDate::DateTime) ||
                        (a.type == SlowDate::Date && to == SlowDate::DateTime) ||
                        (a.type == SlowDate::DateTime && to >= SlowDate::DateTime);
    if (to == a.type) continue;
    check(!part == !isCast, "a cast to one of them", a.slow.text(a.type));
    if (!part) continue;
    SlowDate rest = SlowDate::at(a.slow.instant(), a.slow.zone);
    rest.rest(to);
    checkText(part, rest, to, "cast");
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  const size_t types = input.byte();
  Both a;
  Both b;
  const bool isFirst = read(input.line(), static_cast<SlowDate::Type>(types % typeCount), a);
  const auto secondType = static_cast<SlowDate::Type>(types / typeCount % typeCount);
  const bool isSecond = read(input.line(), secondType, b);
  const std::string_view number = input.line();
  const int64_t amount = std::strtoll(std::string(number.substr(0, 9)).c_str(), nullptr, 10);
  const auto context = XQueryContext::xqueryContext();
  for (const Both* each : {isFirst ? &a : nullptr, isSecond ? &b : nullptr}) {
    if (!each) continue;
    checkMonths(*each, amount % 100'000, *context);
    checkSeconds(*each, amount, *context);
    checkParts(*each);
  }
  if (isFirst && isSecond) checkOrder(a, b);
  return 0;
}
