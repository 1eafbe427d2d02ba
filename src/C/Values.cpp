// Making values: an item of every type.
#include "C/Values.h"

#include "C/Nodes.h"
#include "C/Texts.h"
#include "xquery/Values.h"

#include <algorithm>
#include <limits>
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

// What a maker answers: the value, or null where there is an error.
Value valueOf(const XQueryResult<Value>& made) {
  return made ? *made : nullptr;
}

// Adds what `make` answers, which is a result, of texts; whether they are UTF-8 is asked only where
// it is an error.
template <class Make>
xq_status addOfTexts(xq_value* value, std::initializer_list<GivenText> texts, Make make) {
  if (!areGood(value) || value->isLent) return XQ_USAGE;
  for (const GivenText& text : texts) {
    if (!text.isGood()) return XQ_USAGE;
  }
  const xq_status status = addItem(value, [&] { return valueOf(make()); });
  if (status != XQ_MISMATCH) return status;
  return guarded([&]() -> xq_status {
    const bool isUTF8 = std::all_of(texts.begin(), texts.end(),
                                    [](const GivenText& text) { return text.string() != nullptr; });
    return isUTF8 ? XQ_MISMATCH : XQ_INPUT;
  });
}

}  // namespace

xq_status xq_value_add_integer(xq_value* value, int64_t integer) {
  return addItem(value, [&] { return XQueryMakeSignedInteger(integer); });
}

xq_status xq_value_add_unsigned(xq_value* value, uint64_t integer) {
  return addItem(value, [&] { return XQueryMakeUnsignedInteger(integer); });
}

xq_status xq_value_add_double(xq_value* value, double number) {
  return addItem(value, [&] { return XQueryMakeDouble(number); });
}

xq_status xq_value_add_float(xq_value* value, float number) {
  return addItem(value, [&] { return XQueryMakeFloat(number); });
}

xq_status xq_value_add_boolean(xq_value* value, int boolean) {
  return addItem(value, [&] { return XQueryMakeBoolean(boolean != 0); });
}

xq_status xq_value_add_string(xq_value* value, const char* text, size_t length) {
  const GivenText given(text, length);
  return addOfTexts(value, {given}, [&] { return XQueryMakeString(given.view()); });
}

xq_status xq_value_add_untyped(xq_value* value, const char* text, size_t length) {
  const GivenText given(text, length);
  return addOfTexts(value, {given}, [&] { return XQueryMakeUntypedAtomic(given.view()); });
}

namespace {

// The types that a text alone makes an item of.
bool isMadeOfText(xq_type type) {
  if (type < XQ_TYPE_UNTYPED_ATOMIC || type > XQ_TYPE_UNSIGNED_BYTE) return false;
  switch (static_cast<XQueryItemType>(type)) {
    case XQueryItemType::QName:
    case XQueryItemType::IDREFS:
    case XQueryItemType::ENTITIES:
    case XQueryItemType::NMTOKENS:
      return false;
    default:
      return true;
  }
}

}  // namespace

xq_status xq_value_add_text(xq_value* value, xq_type type, const char* text, size_t length) {
  if (!isMadeOfText(type)) return XQ_USAGE;
  const GivenText given(text, length);
  return addOfTexts(value, {given}, [&] {
    return XQueryMakeFromText(static_cast<XQueryItemType>(type), given.view());
  });
}

xq_status xq_value_add_qname(xq_value* value, const char* uri, size_t uri_length,
                             const char* local_name, size_t local_name_length, const char* prefix,
                             size_t prefix_length) {
  const GivenText URI(uri, uri_length);
  const GivenText local(local_name, local_name_length);
  const GivenText hint(prefix, prefix_length);
  return addOfTexts(value, {URI, local, hint}, [&] {
    return XQueryMakeQName(
        {std::string(URI.view()), std::string(local.view()), std::string(hint.view())});
  });
}

xq_status xq_value_add_bytes(xq_value* value, xq_type type, const char* bytes, size_t length) {
  if (type != XQ_TYPE_HEX_BINARY && type != XQ_TYPE_BASE64_BINARY) return XQ_USAGE;
  if (length == XQ_NUL || (!bytes && length != 0)) return XQ_USAGE;
  const std::string_view given(bytes ? bytes : "", length);
  return addItem(value, [&] {
    return type == XQ_TYPE_HEX_BINARY ? XQueryMakeHexBinary(given) : XQueryMakeBase64Binary(given);
  });
}

// --- dates and durations -------------------------------------------------------------------------

namespace {

XQueryResult<Value> dateTimeOf(XQueryItemType type, const xq_date_time& fields) {
  XQueryDateTimeParts parts = {fields.year,   fields.month,  fields.day,        fields.hour,
                               fields.minute, fields.second, fields.nanosecond, std::nullopt};
  if (fields.has_zone) parts.zone = std::chrono::minutes(fields.zone_seconds / 60);
  return XQueryMakeDateOfType(type, parts);
}

constexpr int64_t secondsPerDay = 86400;

Value durationOf(xq_type type, const xq_duration& duration) {
  constexpr int64_t mostField = std::numeric_limits<int32_t>::max();
  constexpr int64_t mostExact = int64_t{1} << 53;  // seconds are a double
  const auto& [isNegative, months, seconds, nanoseconds] = duration;
  if (months < 0 || seconds < 0 || nanoseconds < 0 || nanoseconds > 999999999) return nullptr;
  const double fraction = nanoseconds / 1e9;
  if (type == XQ_TYPE_DURATION) {
    if (months / 12 > mostField || seconds / secondsPerDay > mostField) return nullptr;
    const auto field = [](int64_t value) { return static_cast<int32_t>(value); };
    return valueOf(XQueryMakeDuration(
        {isNegative != 0, field(months / 12), field(months % 12), field(seconds / secondsPerDay),
         field(seconds % secondsPerDay / 3600), field(seconds % 3600 / 60),
         static_cast<double>(seconds % 60) + fraction}));
  }
  if (type == XQ_TYPE_YEAR_MONTH_DURATION) {
    if (seconds != 0 || nanoseconds != 0) return nullptr;
    return XQueryMakeYearMonthDuration(std::chrono::months(isNegative ? -months : months));
  }
  if (months != 0 || seconds > mostExact) return nullptr;
  const double all = static_cast<double>(seconds) + fraction;
  return valueOf(XQueryMakeDayTimeDuration(std::chrono::duration<double>(isNegative ? -all : all)));
}

}  // namespace

xq_status xq_value_add_date_time(xq_value* value, xq_type type, const xq_date_time* fields) {
  if (type < XQ_TYPE_G_YEAR_MONTH || type > XQ_TYPE_TIME || !fields) return XQ_USAGE;
  return addItem(value, [&]() -> Value {
    if (fields->has_zone && fields->zone_seconds % 60 != 0) return nullptr;
    return valueOf(dateTimeOf(static_cast<XQueryItemType>(type), *fields));
  });
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
    std::vector<Value>& items = value->items;
    const size_t count = other->items.size();
    if (items.capacity() - items.size() < count) {
      items.reserve(std::max(items.size() + count, 2 * items.size()));
    }
    // From here on nothing fails, and nothing moves, which matters where both are the same.
    for (size_t i = 0; i < count; ++i) items.push_back(other->items[i]);
    return XQ_OK;
  });
}
