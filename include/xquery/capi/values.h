/* Values: sequences of items, each a node or an atomic value. Results are values, and so is what
 * variables are bound to. */
#ifndef XQUERY_CAPI_VALUES_H
#define XQUERY_CAPI_VALUES_H

#include "xquery/capi/basics.h"
#include "xquery/capi/nodes.h"

#ifdef __cplusplus
extern "C" {
#endif

/* A sequence with its items. Whoever uses a value takes its items as they are then: adding to it
 * afterwards changes nothing there. */
typedef struct xq_value xq_value;

/* The type of an item. An atomic value has the most special of its types: XQ_TYPE_INT is an integer
 * and a decimal as well. The numbers of types that no item has are left out. */
typedef int xq_type;
enum {
  XQ_TYPE_OTHER = 0, /* an item without a type, such as raw data */
  XQ_TYPE_NODE = 1,
  XQ_TYPE_UNTYPED_ATOMIC = 8, /* text that is compared as what it is compared with */
  XQ_TYPE_STRING = 9,
  XQ_TYPE_BOOLEAN = 10,
  XQ_TYPE_DOUBLE = 11,
  XQ_TYPE_FLOAT = 12,
  XQ_TYPE_DECIMAL = 13,
  XQ_TYPE_ANY_URI = 14,
  XQ_TYPE_QNAME = 15,
  XQ_TYPE_G_YEAR_MONTH = 16,
  XQ_TYPE_G_YEAR = 17,
  XQ_TYPE_G_MONTH_DAY = 18,
  XQ_TYPE_G_DAY = 19,
  XQ_TYPE_G_MONTH = 20,
  XQ_TYPE_DATE_TIME = 21,
  XQ_TYPE_DATE = 22,
  XQ_TYPE_TIME = 23,
  XQ_TYPE_DURATION = 24,
  XQ_TYPE_BASE64_BINARY = 25,
  XQ_TYPE_HEX_BINARY = 26,
  XQ_TYPE_NOTATION = 27,
  XQ_TYPE_YEAR_MONTH_DURATION = 28,
  XQ_TYPE_DAY_TIME_DURATION = 29,
  XQ_TYPE_NORMALIZED_STRING = 30,
  XQ_TYPE_TOKEN = 31,
  XQ_TYPE_LANGUAGE = 32,
  XQ_TYPE_NAME = 33,
  XQ_TYPE_NCNAME = 34,
  XQ_TYPE_ID = 35,
  XQ_TYPE_IDREF = 36,
  XQ_TYPE_ENTITY = 38,
  XQ_TYPE_NMTOKEN = 40,
  XQ_TYPE_INTEGER = 42,
  XQ_TYPE_NON_NEGATIVE_INTEGER = 43,
  XQ_TYPE_POSITIVE_INTEGER = 44,
  XQ_TYPE_NON_POSITIVE_INTEGER = 45,
  XQ_TYPE_NEGATIVE_INTEGER = 46,
  XQ_TYPE_LONG = 47,
  XQ_TYPE_INT = 48,
  XQ_TYPE_SHORT = 49,
  XQ_TYPE_BYTE = 50,
  XQ_TYPE_UNSIGNED_LONG = 51,
  XQ_TYPE_UNSIGNED_INT = 52,
  XQ_TYPE_UNSIGNED_SHORT = 53,
  XQ_TYPE_UNSIGNED_BYTE = 54
};

/* The fields of a date, a time or a part of one; those that its type does not have are 0. */
typedef struct xq_date_time {
  int32_t year; /* proleptic Gregorian calendar; there is a year 0 */
  int32_t month;
  int32_t day;
  int32_t hour;
  int32_t minute;
  int32_t second;
  int32_t nanosecond;
  int32_t has_zone;     /* 0: no zone was given */
  int32_t zone_seconds; /* east of GMT is positive; whole minutes, at most 14 hours */
} xq_date_time;

/* All fields together have the sign. An xdt:dayTimeDuration is kept as a double of seconds: exact
 * to the nanosecond up to 97 days, to the microsecond up to 270 years. */
typedef struct xq_duration {
  int32_t is_negative;
  int64_t months;
  int64_t seconds;
  int32_t nanoseconds;
} xq_duration;

/* ---- making ---------------------------------------------------------------------------------- */

/* The empty sequence. */
XQUERY_EXPORT xq_status xq_value_new(xq_value** value);
/* Another handle with the same items. */
XQUERY_EXPORT xq_status xq_value_copy(const xq_value* value, xq_value** copy);
/* Null is let pass. */
XQUERY_EXPORT xq_status xq_value_free(xq_value* value);

/* Each adds an item at the end. XQ_OK, XQ_USAGE, XQ_MEMORY; where something does not fit
 * XQ_MISMATCH, as a character that XML does not have does not fit into any text; XQ_INPUT for text
 * that is not UTF-8. */
XQUERY_EXPORT xq_status xq_value_add_integer(xq_value* value, int64_t integer);
XQUERY_EXPORT xq_status xq_value_add_unsigned(xq_value* value, uint64_t integer);
XQUERY_EXPORT xq_status xq_value_add_double(xq_value* value, double number);
/* NaN and the infinities are those of xs:double, as they are in a query. */
XQUERY_EXPORT xq_status xq_value_add_float(xq_value* value, float number);
/* Anything but 0 is true. */
XQUERY_EXPORT xq_status xq_value_add_boolean(xq_value* value, int boolean);
XQUERY_EXPORT xq_status xq_value_add_string(xq_value* value, const char* text, size_t length);
/* An xdt:untypedAtomic, as the text of a document is: compared with a number it is one. */
XQUERY_EXPORT xq_status xq_value_add_untyped(xq_value* value, const char* text, size_t length);
/* A value of any atomic type but QName from its text, as XML Schema has it: "12.50" for
 * XQ_TYPE_DECIMAL, "2004-10-29" for XQ_TYPE_DATE. White space is treated as the type has it.
 * XQ_MISMATCH for a text that is none or out of the range of the type. This is stricter than a cast
 * in a query, which reads "12abc" as 12. */
XQUERY_EXPORT xq_status xq_value_add_text(xq_value* value, xq_type type, const char* text,
                                          size_t length);
/* The URI may be empty, for no namespace. The prefix may be empty and plays no part but in
 * printing. XQ_MISMATCH where a part is no name. */
XQUERY_EXPORT xq_status xq_value_add_qname(xq_value* value, const char* uri, size_t uri_length,
                                           const char* local_name, size_t local_name_length,
                                           const char* prefix, size_t prefix_length);
/* XQ_TYPE_HEX_BINARY or XQ_TYPE_BASE64_BINARY. XQ_NUL is no length here. */
XQUERY_EXPORT xq_status xq_value_add_bytes(xq_value* value, xq_type type, const char* bytes,
                                           size_t length);
/* One of the eight types from XQ_TYPE_G_YEAR_MONTH to XQ_TYPE_TIME. Fields that the type does not
 * have are not looked at; XQ_MISMATCH where one that it has is out of its range. */
XQUERY_EXPORT xq_status xq_value_add_date_time(xq_value* value, xq_type type,
                                               const xq_date_time* fields);
/* One of the three types of durations. XQ_MISMATCH for a field that the type does not have and that
 * is not 0, for one below 0, and for one that it cannot hold. */
XQUERY_EXPORT xq_status xq_value_add_duration(xq_value* value, xq_type type,
                                              const xq_duration* duration);
XQUERY_EXPORT xq_status xq_value_add_node(xq_value* value, const xq_node* node);
/* All items of another value, which may be the same one. */
XQUERY_EXPORT xq_status xq_value_add_all(xq_value* value, const xq_value* other);

/* ---- looking at items ------------------------------------------------------------------------ */

XQUERY_EXPORT xq_status xq_value_count(const xq_value* value, size_t* count);

/* Before the first item. */
#define XQ_BEFORE ((size_t)-1)
/* Moves a position on by one item: from XQ_BEFORE to 0 and so on. XQ_END behind the last one, and
 * then the position is XQ_BEFORE again.
 *
 *   size_t at = XQ_BEFORE;
 *   while (xq_value_next(items, &at) == XQ_OK) ...
 */
XQUERY_EXPORT xq_status xq_value_next(const xq_value* value, size_t* at);

/* All that follow answer XQ_END behind the last item, and XQ_MISMATCH for an item of another type
 * than they are about. */

XQUERY_EXPORT xq_status xq_value_type(const xq_value* value, size_t at, xq_type* type);
/* As a query would write it: "xs:integer", "xdt:untypedAtomic", "element()". */
XQUERY_EXPORT xq_status xq_value_type_name(const xq_value* value, size_t at, xq_text* name);
/* Of any item: an atomic value's canonical form, which is exact for decimals, a node's text, the
 * hexadecimal digits of raw data. */
XQUERY_EXPORT xq_status xq_value_string(const xq_value* value, size_t at, xq_text* text);
/* Of any item: nodes as XML, atomic values as their strings. */
XQUERY_EXPORT xq_status xq_value_xml(const xq_value* value, size_t at, xq_text* xml);
/* Integers of every type; XQ_MISMATCH where it does not fit as well. */
XQUERY_EXPORT xq_status xq_value_integer(const xq_value* value, size_t at, int64_t* integer);
XQUERY_EXPORT xq_status xq_value_unsigned(const xq_value* value, size_t at, uint64_t* integer);
/* The double that is nearest to a number of any type. */
XQUERY_EXPORT xq_status xq_value_double(const xq_value* value, size_t at, double* number);
/* 1 or 0 of an xs:boolean. */
XQUERY_EXPORT xq_status xq_value_boolean(const xq_value* value, size_t at, int* boolean);
/* The three parts of an xs:QName; URI and prefix may be empty. */
XQUERY_EXPORT xq_status xq_value_qname(const xq_value* value, size_t at, xq_text* uri,
                                       xq_text* local_name, xq_text* prefix);
/* The bytes of either binary type, and raw data. */
XQUERY_EXPORT xq_status xq_value_bytes(const xq_value* value, size_t at, xq_text* bytes);
/* The eight types of dates and times. */
XQUERY_EXPORT xq_status xq_value_date_time(const xq_value* value, size_t at, xq_date_time* fields);
/* The three types of durations. */
XQUERY_EXPORT xq_status xq_value_duration(const xq_value* value, size_t at, xq_duration* duration);
/* A handle to the node, which the caller owns. */
XQUERY_EXPORT xq_status xq_value_node(const xq_value* value, size_t at, xq_node** node);

#ifdef __cplusplus
}
#endif

#endif
