// Making values: an item of every type.
#include "C/Values.h"

#include "C/Nodes.h"
#include "C/Texts.h"
#include "Types/XQueryBinary.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryDuration.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryString.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Data.h"
#include "xquery/XQuery.h"

#include <cstdio>
#include <string>

using namespace xquery;
using namespace xquery::capi;

namespace xquery::capi {

Value asOneValue(const xq_value& value) {
  if (value.items.empty()) return NSNull::null();
  if (value.items.size() == 1) return value.items.front();
  return NSArray::arrayWithObjects(value.items);
}

}  // namespace xquery::capi

// --- handles -------------------------------------------------------------------------------------

xq_status xq_value_new(xq_value** value) {
  if (!value) return XQ_USAGE;
  *value = nullptr;
  return guarded([&] { return giveNew(value); });
}

xq_status xq_value_copy(const xq_value* value, xq_value** copy) {
  if (!copy) return XQ_USAGE;
  *copy = nullptr;
  if (!areGood(value)) return XQ_USAGE;
  return guarded([&] { return giveNew(copy, value->items); });
}

xq_status xq_value_free(xq_value* value) {
  if (areGood(value) && value->isLent) return XQ_USAGE;
  return freeHandle(value);
}

// --- adding --------------------------------------------------------------------------------------

namespace {

// Adds the item that `make` answers; a null one does not fit.
template <class Make>
xq_status addItem(xq_value* value, Make make) {
  if (!areGood(value) || value->isLent) return XQ_USAGE;
  return guarded([&] {
    Value item = make();
    if (!item) return XQ_MISMATCH;
    value->items.push_back(std::move(item));
    return XQ_OK;
  });
}

// The same of a text that has to be UTF-8.
template <class Make>
xq_status addText(xq_value* value, const char* text, size_t length, Make make) {
  const GivenText given(text, length);
  if (!areGood(value) || value->isLent || !given.isGood()) return XQ_USAGE;
  return guarded([&]() -> xq_status {
    const Ref<NSString> string = given.string();
    return string ? addItem(value, [&] { return make(*string); }) : XQ_INPUT;
  });
}

}  // namespace

xq_status xq_value_add_integer(xq_value* value, int64_t integer) {
  return addItem(value, [&] { return XQueryNumber::integerWithInt64(integer); });
}

xq_status xq_value_add_unsigned(xq_value* value, uint64_t integer) {
  return addItem(
      value, [&] { return XQueryNumber::integerWithDecimal(NSDecimal::fromUnsigned(integer)); });
}

xq_status xq_value_add_double(xq_value* value, double number) {
  return addItem(value, [&] { return XQueryNumber::numberWithDouble(number); });
}

xq_status xq_value_add_float(xq_value* value, float number) {
  return addItem(value,
                 [&] { return XQueryNumber::floatWithNumber(*NSNumber::numberWithFloat(number)); });
}

xq_status xq_value_add_boolean(xq_value* value, int boolean) {
  return addItem(value, [&] { return NSNumber::numberWithBool(boolean != 0); });
}

xq_status xq_value_add_string(xq_value* value, const char* text, size_t length) {
  return addText(value, text, length,
                 [](const NSString& string) { return XQueryString::stringWithString(string); });
}

xq_status xq_value_add_untyped(xq_value* value, const char* text, size_t length) {
  return addText(value, text, length,
                 [](const NSString& string) { return Value(const_cast<NSString*>(&string)); });
}

namespace {

// The types that a text can be cast to, without context.
bool isMadeOfText(xq_type type) {
  switch (type) {
    case XQ_TYPE_QNAME:
    case XQueryTypeIDREFS:
    case XQueryTypeENTITIES:
    case XQueryTypeNMTOKENS:
      return false;
    default:
      return type >= XQ_TYPE_UNTYPED_ATOMIC && type <= XQ_TYPE_UNSIGNED_BYTE;
  }
}

}  // namespace

xq_status xq_value_add_text(xq_value* value, xq_type type, const char* text, size_t length) {
  if (!isMadeOfText(type)) return XQ_USAGE;
  return addText(value, text, length, [&](const NSString& string) {
    const Value untyped(const_cast<NSString*>(&string));
    return XQueryCastAs(untyped, type, *XQueryContext::xqueryContext());
  });
}

namespace {

Value qNameOf(const NSString& URI, const NSString& local, const NSString& prefix) {
  const bool hasPrefix = prefix.length() != 0;
  if (!XQueryString::isNCName(local.view())) return nullptr;
  if (hasPrefix && !XQueryString::isNCName(prefix.view())) return nullptr;
  const Ref<NSString> namespaceURI(URI.length() ? const_cast<NSString*>(&URI) : nullptr);
  NSMutableString name;
  if (hasPrefix) {
    name.append(prefix.view());
    name.append(u':');
  }
  name.append(local.view());
  return hasPrefix ? XQueryQName::qname(name.string(), namespaceURI)
                   : XQueryQName::qnameWithLocalPart(name.string(), namespaceURI);
}

}  // namespace

xq_status xq_value_add_qname(xq_value* value, const char* uri, size_t uri_length,
                             const char* local_name, size_t local_name_length, const char* prefix,
                             size_t prefix_length) {
  const GivenText givenURI(uri, uri_length);
  const GivenText givenLocal(local_name, local_name_length);
  const GivenText givenPrefix(prefix, prefix_length);
  if (!areGood(value) || value->isLent) return XQ_USAGE;
  if (!givenURI.isGood() || !givenLocal.isGood() || !givenPrefix.isGood()) return XQ_USAGE;
  return guarded([&]() -> xq_status {
    const Ref<NSString> URI = givenURI.string();
    const Ref<NSString> local = givenLocal.string();
    const Ref<NSString> hint = givenPrefix.string();
    if (!URI || !local || !hint) return XQ_INPUT;
    return addItem(value, [&] { return qNameOf(*URI, *local, *hint); });
  });
}

xq_status xq_value_add_bytes(xq_value* value, xq_type type, const char* bytes, size_t length) {
  if (type != XQ_TYPE_HEX_BINARY && type != XQ_TYPE_BASE64_BINARY) return XQ_USAGE;
  if (length == XQ_NUL || (!bytes && length != 0)) return XQ_USAGE;
  return addItem(value, [&]() -> Value {
    const auto data = NSData::dataWithBytes(bytes ? std::string(bytes, length) : std::string());
    if (type == XQ_TYPE_HEX_BINARY) return XQueryHexBinary::binaryWithData(data);
    return XQueryBase64Binary::binaryWithData(data);
  });
}

// --- dates and durations -------------------------------------------------------------------------

namespace {

// Dates are made from their text, by the parser that a query would use, which checks every field.
struct DateTimeParts {
  bool hasYear, hasMonth, hasDay, hasTime;
  const char* beforeMonth;
  const char* beforeDay;
  const char* atEnd;
  Ref<XQueryDate> (*read)(NSStringView text);
};

// Null for a type that is none of dates and times.
const DateTimeParts* partsOf(xq_type type) {
  static const DateTimeParts dateTime = {true, true, true, true,
                                         "-",  "-",  "",   XQueryDate::xqueryDateTimeFromString};
  static const DateTimeParts date = {true, true, true, false,
                                     "-",  "-",  "",   XQueryDate::xqueryDateFromString};
  static const DateTimeParts time = {false, false, false, true,
                                     "",    "",    "",    XQueryDate::xqueryTimeFromString};
  static const DateTimeParts yearMonth = {
      true, true, false, false, "-", "", "", XQueryDate::xqueryGMonthYearFromString};
  static const DateTimeParts year = {true, false, false, false,
                                     "",   "",    "",    XQueryDate::xqueryGYearFromString};
  static const DateTimeParts monthDay = {false, true, true, false,
                                         "--",  "-",  "",   XQueryDate::xqueryGMonthDayFromString};
  static const DateTimeParts day = {false, false, true, false,
                                    "",    "---", "",   XQueryDate::xqueryGDayFromString};
  static const DateTimeParts month = {false, true, false, false,
                                      "--",  "",   "--",  XQueryDate::xqueryGMonthFromString};
  switch (type) {
    case XQ_TYPE_DATE_TIME:
      return &dateTime;
    case XQ_TYPE_DATE:
      return &date;
    case XQ_TYPE_TIME:
      return &time;
    case XQ_TYPE_G_YEAR_MONTH:
      return &yearMonth;
    case XQ_TYPE_G_YEAR:
      return &year;
    case XQ_TYPE_G_MONTH_DAY:
      return &monthDay;
    case XQ_TYPE_G_DAY:
      return &day;
    case XQ_TYPE_G_MONTH:
      return &month;
    default:
      return nullptr;
  }
}

std::string digits(int64_t value, int width) {
  std::string text = std::to_string(value);
  if (text.size() < static_cast<size_t>(width)) text.insert(0, width - text.size(), '0');
  return text;
}

// What is out of its range becomes text that is no date.
std::string yearText(int64_t year) {
  return year < 0 ? "-" + digits(-year, 4) : digits(year, 4);
}

std::string timeText(const xq_date_time& fields) {
  std::string text =
      digits(fields.hour, 2) + ":" + digits(fields.minute, 2) + ":" + digits(fields.second, 2);
  if (fields.nanosecond != 0) text += "." + digits(fields.nanosecond, 9);
  return text;
}

std::string zoneText(int32_t seconds) {
  if (seconds == 0) return "Z";
  const int64_t minutes = (seconds < 0 ? -int64_t{seconds} : int64_t{seconds}) / 60;
  return (seconds < 0 ? "-" : "+") + digits(minutes / 60, 2) + ":" + digits(minutes % 60, 2);
}

bool isZone(int32_t seconds) {
  constexpr int32_t mostSeconds = 14 * 3600;
  return seconds % 60 == 0 && seconds >= -mostSeconds && seconds <= mostSeconds;
}

Value dateTimeOf(const DateTimeParts& parts, const xq_date_time& fields) {
  if (parts.hasTime && (fields.nanosecond < 0 || fields.nanosecond > 999999999)) return nullptr;
  if (parts.hasTime && fields.second > 59) return nullptr;
  if (fields.has_zone && !isZone(fields.zone_seconds)) return nullptr;
  std::string text;
  if (parts.hasYear) text += yearText(fields.year);
  if (parts.hasMonth) text += parts.beforeMonth + digits(fields.month, 2);
  if (parts.hasDay) text += parts.beforeDay + digits(fields.day, 2);
  if (parts.hasTime && parts.hasDay) text += "T";
  if (parts.hasTime) text += timeText(fields);
  text += parts.atEnd;
  if (fields.has_zone) text += zoneText(fields.zone_seconds);
  return parts.read(NSStringView::ascii(text));
}

constexpr int64_t secondsPerDay = 86400;

std::string durationText(const xq_duration& duration) {
  char text[160];
  const int64_t seconds = duration.seconds;
  std::snprintf(text, sizeof(text), "%sP%lldY%lldM%lldDT%lldH%lldM%lld.%09dS",
                duration.is_negative ? "-" : "", static_cast<long long>(duration.months / 12),
                static_cast<long long>(duration.months % 12),
                static_cast<long long>(seconds / secondsPerDay),
                static_cast<long long>(seconds % secondsPerDay / 3600),
                static_cast<long long>(seconds % 3600 / 60), static_cast<long long>(seconds % 60),
                duration.nanoseconds);
  return text;
}

Value durationOf(xq_type type, const xq_duration& duration) {
  constexpr int64_t mostExact = int64_t{1} << 53;  // seconds are a double
  if (duration.months < 0 || duration.seconds < 0) return nullptr;
  if (duration.nanoseconds < 0 || duration.nanoseconds > 999999999) return nullptr;
  if (type == XQ_TYPE_DURATION) {
    return XQueryDuration::durationWithString(NSStringView::ascii(durationText(duration)));
  }
  if (type == XQ_TYPE_YEAR_MONTH_DURATION) {
    if (duration.seconds != 0 || duration.nanoseconds != 0) return nullptr;
    return XQueryNumber::yearMonthDurationWithMonths(duration.is_negative ? -duration.months
                                                                          : duration.months);
  }
  if (duration.months != 0 || duration.seconds > mostExact) return nullptr;
  const double seconds = static_cast<double>(duration.seconds) + duration.nanoseconds / 1e9;
  return XQueryNumber::dayTimeDurationWithSeconds(duration.is_negative ? -seconds : seconds);
}

}  // namespace

xq_status xq_value_add_date_time(xq_value* value, xq_type type, const xq_date_time* fields) {
  const DateTimeParts* parts = partsOf(type);
  if (!parts || !fields) return XQ_USAGE;
  return addItem(value, [&] { return dateTimeOf(*parts, *fields); });
}

xq_status xq_value_add_duration(xq_value* value, xq_type type, const xq_duration* duration) {
  if (type != XQ_TYPE_DURATION && type != XQ_TYPE_YEAR_MONTH_DURATION &&
      type != XQ_TYPE_DAY_TIME_DURATION) {
    return XQ_USAGE;
  }
  if (!duration) return XQ_USAGE;
  return addItem(value, [&] { return durationOf(type, *duration); });
}

// --- nodes and other values ----------------------------------------------------------------------

xq_status xq_value_add_node(xq_value* value, const xq_node* node) {
  if (!areGood(node)) return XQ_USAGE;
  return addItem(value, [&]() -> Value { return node->node; });
}

xq_status xq_value_add_all(xq_value* value, const xq_value* other) {
  if (!areGood(value, other) || value->isLent) return XQ_USAGE;
  return guarded([&] {
    std::vector<Value> items;
    items.reserve(value->items.size() + other->items.size());
    items.insert(items.end(), value->items.begin(), value->items.end());
    items.insert(items.end(), other->items.begin(), other->items.end());
    value->items = std::move(items);
    return XQ_OK;
  });
}
