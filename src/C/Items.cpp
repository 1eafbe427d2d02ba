// Looking at the items of values.
#include "C/Nodes.h"
#include "C/Texts.h"
#include "C/Values.h"
#include "Types/XQueryBinary.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryDuration.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Data.h"
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
  return guarded([&]() -> xq_status { return read(*value->items[at]); });
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

// Whether the item is an integer, of whatever type, and then which.
bool isInteger(const NSObject& item, NSDecimal& integer) {
  if (!XQueryIsKindOfType(XQueryObjectTypeID(&item), XQueryTypeInteger)) return false;
  integer = cast<NSNumber>(&item)->decimalValue();
  return integer.isInteger();
}

static_assert(XQ_TYPE_UNTYPED_ATOMIC == static_cast<int>(XQueryTypeUntypedAtomic));
static_assert(XQ_TYPE_QNAME == static_cast<int>(XQueryTypeQName));
static_assert(XQ_TYPE_TIME == static_cast<int>(XQueryTypeTime));
static_assert(XQ_TYPE_DAY_TIME_DURATION == static_cast<int>(XQueryTypeDayTimeDuration));
static_assert(XQ_TYPE_NMTOKEN == static_cast<int>(XQueryTypeNMTOKEN));
static_assert(XQ_TYPE_INTEGER == static_cast<int>(XQueryTypeInteger));
static_assert(XQ_TYPE_UNSIGNED_BYTE == static_cast<int>(XQueryTypeUnsignedByte));

}  // namespace

// --- what an item is -----------------------------------------------------------------------------

xq_status xq_value_type(const xq_value* value, size_t at, xq_type* type) {
  return readItemTo(type, xq_type{XQ_TYPE_OTHER}, value, at, [&](const NSObject& item) {
    const XQueryTypeID found = XQueryObjectTypeID(&item);
    if (item.isNode()) {
      *type = XQ_TYPE_NODE;
    } else if (found >= XQueryTypeUntypedAtomic) {
      *type = static_cast<xq_type>(found);
    }
    return XQ_OK;
  });
}

xq_status xq_value_type_name(const xq_value* value, size_t at, xq_text* name) {
  return readItemTo(name, value, at,
                    [&](const NSObject& item) { return fill(*name, XQueryItemTypeName(item)); });
}

xq_status xq_value_string(const xq_value* value, size_t at, xq_text* text) {
  return readItemTo(text, value, at, [&](const NSObject& item) {
    if (const auto* string = dyn_cast<NSString>(&item)) return fill(*text, string->view());
    return fill(*text, XQueryItemStringValue(item));
  });
}

xq_status xq_value_xml(const xq_value* value, size_t at, xq_text* xml) {
  return readItemTo(xml, value, at, [&](const NSObject& item) {
    const auto* node = dyn_cast<NSXMLNode>(&item);
    if (!node) return fill(*xml, XQueryItemStringValue(item));
    std::string text;
    node->appendXMLTo(text);
    return fill(*xml, text);
  });
}

// --- atomic values -------------------------------------------------------------------------------

xq_status xq_value_integer(const xq_value* value, size_t at, int64_t* integer) {
  return readItemTo(integer, int64_t{0}, value, at, [&](const NSObject& item) {
    NSDecimal number;
    if (!isInteger(item, number) || !number.isSmallInteger()) return XQ_MISMATCH;
    *integer = number.smallInteger();
    return XQ_OK;
  });
}

xq_status xq_value_unsigned(const xq_value* value, size_t at, uint64_t* integer) {
  return readItemTo(integer, uint64_t{0}, value, at, [&](const NSObject& item) {
    NSDecimal number;
    if (!isInteger(item, number) || number.sign() < 0) return XQ_MISMATCH;
    if (number.compare(NSDecimal::fromUnsigned(UINT64_MAX)) > 0) return XQ_MISMATCH;
    *integer = number.uint64Value();
    return XQ_OK;
  });
}

xq_status xq_value_double(const xq_value* value, size_t at, double* number) {
  return readItemTo(number, 0.0, value, at, [&](const NSObject& item) {
    if (!XQueryIsNumericTypeID(XQueryObjectTypeID(&item))) return XQ_MISMATCH;
    *number = cast<NSNumber>(&item)->doubleValue();
    return XQ_OK;
  });
}

xq_status xq_value_boolean(const xq_value* value, size_t at, int* boolean) {
  return readItemTo(boolean, 0, value, at, [&](const NSObject& item) {
    const auto* number = dyn_cast<NSNumber>(&item);
    if (!number || !number->isBoolean()) return XQ_MISMATCH;
    *boolean = number->boolValue();
    return XQ_OK;
  });
}

xq_status xq_value_qname(const xq_value* value, size_t at, xq_text* uri, xq_text* local_name,
                         xq_text* prefix) {
  bool isUsable = uri != local_name && uri != prefix && local_name != prefix;
  for (xq_text* text : {uri, local_name, prefix}) isUsable = emptied(text) && isUsable;
  if (!isUsable) return XQ_USAGE;
  const auto fillAny = [](xq_text& text, const Ref<NSString>& string) {
    if (string) fill(text, string);
  };
  const xq_status status = readItem(value, at, [&](const NSObject& item) {
    const auto* name = dyn_cast<XQueryQName>(&item);
    if (!name) return XQ_MISMATCH;
    fillAny(*uri, name->namespaceURI());
    fillAny(*local_name, name->localPart());
    fillAny(*prefix, name->prefixHint());
    return XQ_OK;
  });
  if (status != XQ_OK) {
    for (xq_text* text : {uri, local_name, prefix}) emptied(text);
  }
  return status;
}

xq_status xq_value_bytes(const xq_value* value, size_t at, xq_text* bytes) {
  return readItemTo(bytes, value, at, [&](const NSObject& item) -> xq_status {
    if (const auto* data = dyn_cast<NSData>(&item)) return fill(*bytes, data->bytes());
    const auto* binary = dyn_cast<XQueryBinary>(&item);
    return binary ? fill(*bytes, binary->data()->bytes()) : XQ_MISMATCH;
  });
}

namespace {

// The fields at rest, which the type does not have, are nobody's.
void clearFields(xq_date_time& fields, XQueryTypeID type) {
  const bool hasTime = type == XQueryTypeDateTime || type == XQueryTypeTime;
  const bool hasDate = type == XQueryTypeDateTime || type == XQueryTypeDate;
  if (!hasTime) fields.hour = fields.minute = fields.second = fields.nanosecond = 0;
  if (!hasDate && type != XQueryTypeGYearMonth && type != XQueryTypeGYear) fields.year = 0;
  if (!hasDate && type != XQueryTypeGYearMonth && type != XQueryTypeGMonthDay &&
      type != XQueryTypeGMonth) {
    fields.month = 0;
  }
  if (!hasDate && type != XQueryTypeGMonthDay && type != XQueryTypeGDay) fields.day = 0;
}

}  // namespace

xq_status xq_value_date_time(const xq_value* value, size_t at, xq_date_time* fields) {
  return readItemTo(fields, xq_date_time{}, value, at, [&](const NSObject& item) {
    const auto* date = dyn_cast<XQueryDate>(&item);
    if (!date) return XQ_MISMATCH;
    const NSGregorianDate shown = date->gregorianDate();
    *fields = {shown.year,
               shown.month,
               shown.day,
               shown.hour,
               shown.minute,
               static_cast<int32_t>(shown.second),
               date->instant().nanoseconds,
               0,
               0};
    clearFields(*fields, date->typeID());
    if (date->timeZone()) {
      fields->has_zone = 1;
      fields->zone_seconds = date->timeZone()->secondsFromGMT(date->instant());
    }
    return XQ_OK;
  });
}

namespace {

xq_duration durationOfSeconds(double seconds) {
  const double magnitude = std::fabs(seconds);
  const double whole = std::floor(magnitude);
  xq_duration duration = {seconds < 0, 0, static_cast<int64_t>(whole),
                          static_cast<int32_t>(std::llround((magnitude - whole) * 1e9))};
  if (duration.nanoseconds == 1000000000) {
    ++duration.seconds;
    duration.nanoseconds = 0;
  }
  return duration;
}

xq_duration durationOf(const XQueryDuration& written) {
  xq_duration duration = durationOfSeconds(written.second());
  duration.is_negative = written.isNeg();
  duration.months = int64_t{written.year()} * 12 + written.month();
  duration.seconds +=
      (int64_t{written.day()} * 24 + written.hour()) * 3600 + int64_t{written.minute()} * 60;
  return duration;
}

}  // namespace

xq_status xq_value_duration(const xq_value* value, size_t at, xq_duration* duration) {
  return readItemTo(duration, xq_duration{}, value, at, [&](const NSObject& item) {
    constexpr double mostSeconds = 9e18;
    if (const auto* written = dyn_cast<XQueryDuration>(&item)) {
      *duration = durationOf(*written);
      return XQ_OK;
    }
    const XQueryTypeID type = XQueryObjectTypeID(&item);
    if (type == XQueryTypeYearMonthDuration) {
      const int64_t months = cast<NSNumber>(&item)->longLongValue();
      if (months == INT64_MIN) return XQ_MISMATCH;
      *duration = {months < 0, months < 0 ? -months : months, 0, 0};
      return XQ_OK;
    }
    if (type != XQueryTypeDayTimeDuration) return XQ_MISMATCH;
    const double seconds = cast<NSNumber>(&item)->doubleValue();
    if (!(std::fabs(seconds) < mostSeconds)) return XQ_MISMATCH;
    *duration = durationOfSeconds(seconds);
    return XQ_OK;
  });
}

// --- nodes ---------------------------------------------------------------------------------------

xq_status xq_value_node(const xq_value* value, size_t at, xq_node** node) {
  return readItemTo(node, static_cast<xq_node*>(nullptr), value, at,
                    [&](const NSObject& item) -> xq_status {
                      if (!item.isNode()) return XQ_MISMATCH;
                      const auto& found = *cast<NSXMLNode>(&item);
                      return giveNew(node, const_cast<NSXMLNode*>(&found));
                    });
}
