// Looking at the items of values.
#include "C/Nodes.h"
#include "C/Texts.h"
#include "C/Values.h"
#include "Types/XQueryBinary.h"
#include "xquery/Data.h"
#include "xquery/Values.h"
#include "xquery/XQuery.h"

#include <cmath>

using namespace xquery;
using namespace xquery::capi;

xq_status xq_value_count(const xq_value* value, size_t* count) {
  if (!count) return XQ_USAGE;
  *count = 0;
  if (!areGood(value)) return XQ_USAGE;
  *count = value->items.size();
  return XQ_OK;
}

xq_status xq_value_next(const xq_value* value, size_t* at) {
  if (!at || !areGood(value)) return XQ_USAGE;
  const size_t next = *at == XQ_BEFORE ? 0 : *at + 1;
  const bool isThere = next < value->items.size();
  *at = isThere ? next : XQ_BEFORE;
  return isThere ? XQ_OK : XQ_END;
}

namespace {

// Hands the item to `read`, where there is one.
template <class Read>
xq_status readItem(const xq_value* value, size_t at, Read read) {
  if (!areGood(value)) return XQ_USAGE;
  if (at >= value->items.size()) return XQ_END;
  return guarded([&]() -> xq_status { return read(value->items[at]); });
}

// The same for what goes into a variable of the host's, which is `otherwise` at first.
template <class Out, class Read>
xq_status readItemTo(Out* out, Out otherwise, const xq_value* value, size_t at, Read read) {
  if (!out) return XQ_USAGE;
  *out = otherwise;
  return readItem(value, at, read);
}

template <class Read>
xq_status readItemTo(xq_text* out, const xq_value* value, size_t at, Read read) {
  if (!emptied(out)) return XQ_USAGE;
  return readItem(value, at, read);
}

// The same for what one of the engine's readers answers, which do not convert; its error is a
// mismatch.
template <class Out, class Found>
xq_status readItemBy(XQueryResult<Found> (*reader)(const Value&), const xq_value* value, size_t at,
                     Out* out) {
  return readItemTo(out, Out{}, value, at, [&](const Value& item) {
    const XQueryResult<Found> found = reader(item);
    if (!found) return XQ_MISMATCH;
    *out = *found;
    return XQ_OK;
  });
}

static_assert(XQ_TYPE_OTHER == static_cast<int>(XQueryItemType::None));
static_assert(XQ_TYPE_UNTYPED_ATOMIC == static_cast<int>(XQueryItemType::UntypedAtomic));
static_assert(XQ_TYPE_QNAME == static_cast<int>(XQueryItemType::QName));
static_assert(XQ_TYPE_TIME == static_cast<int>(XQueryItemType::Time));
static_assert(XQ_TYPE_DAY_TIME_DURATION == static_cast<int>(XQueryItemType::DayTimeDuration));
static_assert(XQ_TYPE_NMTOKEN == static_cast<int>(XQueryItemType::NMTOKEN));
static_assert(XQ_TYPE_INTEGER == static_cast<int>(XQueryItemType::Integer));
static_assert(XQ_TYPE_UNSIGNED_BYTE == static_cast<int>(XQueryItemType::UnsignedByte));

}  // namespace

// --- what an item is -----------------------------------------------------------------------------

xq_status xq_value_type(const xq_value* value, size_t at, xq_type* type) {
  return readItemTo(type, xq_type{XQ_TYPE_OTHER}, value, at, [&](const Value& item) {
    const XQueryItemType found = XQueryTypeOfItem(*item);
    *type = XQueryIsNodeType(found) ? XQ_TYPE_NODE : static_cast<xq_type>(found);
    return XQ_OK;
  });
}

xq_status xq_value_type_name(const xq_value* value, size_t at, xq_text* name) {
  return readItemTo(name, value, at,
                    [&](const Value& item) { return fill(*name, XQueryItemTypeName(*item)); });
}

xq_status xq_value_string(const xq_value* value, size_t at, xq_text* text) {
  return readItemTo(text, value, at, [&](const Value& item) {
    if (const auto* string = dyn_cast<NSString>(item)) return fill(*text, string->view());
    return fill(*text, XQueryItemStringValue(*item));
  });
}

xq_status xq_value_xml(const xq_value* value, size_t at, xq_text* xml) {
  return readItemTo(xml, value, at, [&](const Value& item) {
    const auto* node = dyn_cast<NSXMLNode>(item);
    if (!node) return fill(*xml, XQueryItemStringValue(*item));
    std::string text;
    node->appendXMLTo(text);
    return fill(*xml, text);
  });
}

// --- atomic values -------------------------------------------------------------------------------

xq_status xq_value_integer(const xq_value* value, size_t at, int64_t* integer) {
  return readItemBy(XQueryReadInteger, value, at, integer);
}

xq_status xq_value_unsigned(const xq_value* value, size_t at, uint64_t* integer) {
  return readItemBy(XQueryReadUnsignedInteger, value, at, integer);
}

xq_status xq_value_double(const xq_value* value, size_t at, double* number) {
  return readItemBy(XQueryReadDouble, value, at, number);
}

xq_status xq_value_boolean(const xq_value* value, size_t at, int* boolean) {
  return readItemBy(XQueryReadBoolean, value, at, boolean);
}

xq_status xq_value_qname(const xq_value* value, size_t at, xq_text* uri, xq_text* local_name,
                         xq_text* prefix) {
  bool isUsable = uri != local_name && uri != prefix && local_name != prefix;
  for (xq_text* text : {uri, local_name, prefix}) isUsable = emptied(text) && isUsable;
  if (!isUsable) return XQ_USAGE;
  const xq_status status = readItem(value, at, [&](const Value& item) {
    const auto name = XQueryReadQName(item);
    if (!name) return XQ_MISMATCH;
    fill(*uri, name->namespaceURI);
    fill(*local_name, name->localName);
    fill(*prefix, name->prefix);
    return XQ_OK;
  });
  if (status != XQ_OK) {
    for (xq_text* text : {uri, local_name, prefix}) emptied(text);
  }
  return status;
}

// Not by the reader, which would copy the bytes once more.
xq_status xq_value_bytes(const xq_value* value, size_t at, xq_text* bytes) {
  return readItemTo(bytes, value, at, [&](const Value& item) -> xq_status {
    if (const auto* data = dyn_cast<NSData>(item)) return fill(*bytes, data->bytes());
    const auto* binary = dyn_cast<XQueryBinary>(item);
    return binary ? fill(*bytes, binary->data()->bytes()) : XQ_MISMATCH;
  });
}

xq_status xq_value_date_time(const xq_value* value, size_t at, xq_date_time* fields) {
  return readItemTo(fields, xq_date_time{}, value, at, [&](const Value& item) {
    const auto parts = XQueryReadDateTimeParts(item);
    if (!parts) return XQ_MISMATCH;
    *fields = {parts->year,
               parts->month,
               parts->day,
               parts->hour,
               parts->minute,
               parts->second,
               parts->nanosecond,
               0,
               0};
    if (parts->zone) {
      fields->has_zone = 1;
      fields->zone_seconds = static_cast<int32_t>(parts->zone->count() * 60);
    }
    return XQ_OK;
  });
}

namespace {

// Adds seconds to a duration; false where they are more than it holds.
bool addSeconds(xq_duration& duration, double seconds) {
  constexpr double mostSeconds = 9e18;  // leaves room for the days of 32 bits
  if (!(seconds < mostSeconds)) return false;
  const double whole = std::floor(seconds);
  duration.seconds += static_cast<int64_t>(whole);
  duration.nanoseconds = static_cast<int32_t>(std::llround((seconds - whole) * 1e9));
  if (duration.nanoseconds == 1000000000) {
    ++duration.seconds;
    duration.nanoseconds = 0;
  }
  return true;
}

// Each type by the reader that has all of its range.
bool readDuration(const Value& item, xq_duration& duration) {
  const XQueryItemType type = XQueryTypeOfItem(*item);
  if (type == XQueryItemType::YearMonthDuration) {
    const int64_t months = XQueryReadYearMonthDuration(item)->count();
    if (months == INT64_MIN) return false;
    duration.is_negative = months < 0;
    duration.months = months < 0 ? -months : months;
    return true;
  }
  if (type == XQueryItemType::DayTimeDuration) {
    const double seconds = XQueryReadDayTimeDuration(item)->count();
    duration.is_negative = seconds < 0;
    return addSeconds(duration, std::fabs(seconds));
  }
  const auto parts = XQueryReadDuration(item);
  if (!parts) return false;
  duration.is_negative = parts->isNegative;
  duration.months = int64_t{parts->years} * 12 + parts->months;
  duration.seconds =
      (int64_t{parts->days} * 24 + parts->hours) * 3600 + int64_t{parts->minutes} * 60;
  return addSeconds(duration, parts->seconds);
}

}  // namespace

xq_status xq_value_duration(const xq_value* value, size_t at, xq_duration* duration) {
  return readItemTo(duration, xq_duration{}, value, at, [&](const Value& item) {
    xq_duration read = {};
    if (!readDuration(item, read)) return XQ_MISMATCH;
    *duration = read;
    return XQ_OK;
  });
}

// --- nodes ---------------------------------------------------------------------------------------

xq_status xq_value_node(const xq_value* value, size_t at, xq_node** node) {
  return readItemTo(node, static_cast<xq_node*>(nullptr), value, at,
                    [&](const Value& item) -> xq_status {
                      auto* found = dyn_cast<NSXMLNode>(item);
                      return found ? giveNew(node, found) : XQ_MISMATCH;
                    });
}
