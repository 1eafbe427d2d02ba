/* Making values, of every type. */
#include "Testing.h"

#include <math.h>
#include <stdio.h>
#include <string.h>

static xq_value* new_value(void) {
  xq_value* value = NULL;
  CHECK_OK(xq_value_new(&value));
  return value;
}

/* Checks type and text of the only item of a value, as a query sees it, and frees the value. */
static void check_only(xq_value* value, xq_type type, const char* name, const char* string) {
  xq_text text = XQ_TEXT_INIT;
  xq_type found = -1;
  size_t count = 0;
  CHECK_OK(xq_value_count(value, &count));
  CHECK_NUMBER(count, 1);
  CHECK_OK(xq_value_type(value, 0, &found));
  CHECK_NUMBER(found, type);
  CHECK_OK(xq_value_type_name(value, 0, &text));
  CHECK_TEXT(text, name);
  CHECK_OK(xq_value_string(value, 0, &text));
  CHECK_TEXT(text, string);
  CHECK_OK(xq_value_xml(value, 0, &text));
  CHECK_TEXT(text, string);
  CHECK_OK(xq_text_free(&text));
  CHECK_OK(xq_value_free(value));
}

static void check_integer(int64_t integer, const char* string) {
  xq_value* value = new_value();
  int64_t back = 0;
  CHECK_OK(xq_value_add_integer(value, integer));
  CHECK_OK(xq_value_integer(value, 0, &back));
  CHECK(back == integer);
  check_only(value, XQ_TYPE_INTEGER, "xs:integer", string);
}

static void integers_are_exact(void) {
  xq_value* value = new_value();
  uint64_t back = 0;
  int64_t none = 1;
  check_integer(0, "0");
  check_integer(INT64_MAX, "9223372036854775807");
  check_integer(INT64_MIN, "-9223372036854775808");
  CHECK_OK(xq_value_add_unsigned(value, UINT64_MAX));
  CHECK_OK(xq_value_unsigned(value, 0, &back));
  CHECK(back == UINT64_MAX);
  CHECK_STATUS(xq_value_integer(value, 0, &none), XQ_MISMATCH);
  CHECK_NUMBER(none, 0);
  check_only(value, XQ_TYPE_INTEGER, "xs:integer", "18446744073709551615");
}

static void check_double(double number, const char* string) {
  xq_value* value = new_value();
  double back = 0.5;
  CHECK_OK(xq_value_add_double(value, number));
  CHECK_OK(xq_value_double(value, 0, &back));
  CHECK(back == number || (isnan(back) && isnan(number)));
  check_only(value, XQ_TYPE_DOUBLE, "xs:double", string);
}

static void doubles_and_floats_are_what_they_were(void) {
  xq_value* value = new_value();
  double back = 0;
  check_double(0.1, "0.1");
  check_double(-1e300, "-1e+300");
  check_double((double)INFINITY, "INF");
  check_double((double)NAN, "NaN");
  CHECK_OK(xq_value_add_float(value, 0.1F));
  CHECK_OK(xq_value_double(value, 0, &back));
  CHECK(back == (double)0.1F);
  check_only(value, XQ_TYPE_FLOAT, "xs:float", "0.1");
  value = new_value();
  CHECK_OK(xq_value_add_float(value, -INFINITY));
  check_only(value, XQ_TYPE_DOUBLE, "xs:double", "-INF");
  value = new_value();
  CHECK_OK(xq_value_add_text(value, XQ_TYPE_FLOAT, "INF", XQ_NUL));
  check_only(value, XQ_TYPE_DOUBLE, "xs:double", "INF");
}

static void booleans_are_true_or_false(void) {
  xq_value* value = new_value();
  int back = 0;
  CHECK_OK(xq_value_add_boolean(value, 7));
  CHECK_OK(xq_value_boolean(value, 0, &back));
  CHECK_NUMBER(back, 1);
  check_only(value, XQ_TYPE_BOOLEAN, "xs:boolean", "true");
  value = new_value();
  CHECK_OK(xq_value_add_boolean(value, 0));
  check_only(value, XQ_TYPE_BOOLEAN, "xs:boolean", "false");
}

static void text_is_string_or_untyped(void) {
  xq_value* value = new_value();
  CHECK_OK(xq_value_add_string(value, "\xC3\xA4\xF0\x9F\x98\x80z", 6));
  check_only(value, XQ_TYPE_STRING, "xs:string", "\xC3\xA4\xF0\x9F\x98\x80");
  value = new_value();
  CHECK_OK(xq_value_add_untyped(value, "20", XQ_NUL));
  check_only(value, XQ_TYPE_UNTYPED_ATOMIC, "xdt:untypedAtomic", "20");
  value = new_value();
  CHECK_OK(xq_value_add_string(value, NULL, 0));
  check_only(value, XQ_TYPE_STRING, "xs:string", "");
}

static void text_is_checked(void) {
  xq_value* value = new_value();
  size_t count = 1;
  CHECK_STATUS(xq_value_add_string(value, "\xC3", 1), XQ_INPUT);
  CHECK_STATUS(xq_value_add_string(value, "\xED\xA0\x80", 3), XQ_INPUT);
  CHECK_STATUS(xq_value_add_untyped(value, "\xFF", 1), XQ_INPUT);
  CHECK_STATUS(xq_value_add_text(value, XQ_TYPE_DATE, "\xFF", 1), XQ_INPUT);
  CHECK_STATUS(xq_value_add_string(value, "a\0b", 3), XQ_MISMATCH);
  CHECK_STATUS(xq_value_add_untyped(value, "\xEF\xBF\xBF", 3), XQ_MISMATCH);
  CHECK_STATUS(xq_value_add_string(value, "\1\xFF", 2), XQ_INPUT);
  CHECK_STATUS(xq_value_add_string(value, NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_value_add_untyped(value, NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_value_add_text(value, XQ_TYPE_DATE, NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_value_add_qname(value, "", 0, "\xFF", 1, "", 0), XQ_INPUT);
  CHECK_STATUS(xq_value_add_qname(value, "", 0, NULL, 1, "", 0), XQ_USAGE);
  CHECK_OK(xq_value_count(value, &count));
  CHECK_NUMBER(count, 0);
  CHECK_OK(xq_value_free(value));
}

/* A row for each type: a text of it, its canonical form, and one that is none of it. */
static const struct {
  xq_type type;
  const char* name;
  const char* text;
  const char* canonical;
  const char* wrong;
} typed_texts[] = {
    {XQ_TYPE_UNTYPED_ATOMIC, "xdt:untypedAtomic", " a ", " a ", "\1"},
    {XQ_TYPE_STRING, "xs:string", " a ", " a ", "\1"},
    {XQ_TYPE_BOOLEAN, "xs:boolean", "1", "true", "yes"},
    {XQ_TYPE_DOUBLE, "xs:double", "1e3", "1000", "x"},
    {XQ_TYPE_FLOAT, "xs:float", "2.50", "2.5", "x"},
    {XQ_TYPE_DECIMAL, "xs:decimal", "12345678901234567890.50", "12345678901234567890.5", "1abc"},
    {XQ_TYPE_ANY_URI, "xs:anyURI", "urn:a", "urn:a", "a b"},
    {XQ_TYPE_G_YEAR_MONTH, "xs:gYearMonth", "2004-10", "2004-10", "2004-13"},
    {XQ_TYPE_G_YEAR, "xs:gYear", "2004", "2004", "x"},
    {XQ_TYPE_G_MONTH_DAY, "xs:gMonthDay", "--10-29", "--10-29", "--02-30"},
    {XQ_TYPE_G_DAY, "xs:gDay", "---29", "---29", "29"},
    {XQ_TYPE_G_MONTH, "xs:gMonth", "--10--", "--10--", "10"},
    {XQ_TYPE_DATE_TIME, "xs:dateTime", "2004-10-29T12:00:00Z", "2004-10-29T12:00:00Z", "2004"},
    {XQ_TYPE_DATE, "xs:date", "2004-10-29", "2004-10-29", "2004-02-30"},
    {XQ_TYPE_TIME, "xs:time", "12:30:00+01:00", "12:30:00+01:00", "12:30:00+14:01"},
    {XQ_TYPE_DURATION, "xs:duration", "P1Y2DT3H", "P1Y2DT3H", "P"},
    {XQ_TYPE_BASE64_BINARY, "xs:base64Binary", "AQI=", "AQI=", "A"},
    {XQ_TYPE_HEX_BINARY, "xs:hexBinary", "0aff", "0AFF", "0"},
    {XQ_TYPE_YEAR_MONTH_DURATION, "xdt:yearMonthDuration", "P14M", "P1Y2M", "P1D"},
    {XQ_TYPE_DAY_TIME_DURATION, "xdt:dayTimeDuration", "PT36H", "P1DT12H", "P1Y"},
    {XQ_TYPE_NOTATION, "xs:NOTATION", "a:b", "a:b", "1"},
    {XQ_TYPE_NORMALIZED_STRING, "xs:normalizedString", "a\nb", "a b", "a\1"},
    {XQ_TYPE_TOKEN, "xs:token", " a  b", "a b", "a\1"},
    {XQ_TYPE_LANGUAGE, "xs:language", "en-GB", "en-GB", "a  b"},
    {XQ_TYPE_NAME, "xs:Name", "a:b", "a:b", "1"},
    {XQ_TYPE_NCNAME, "xs:NCName", "a", "a", "a:b"},
    {XQ_TYPE_ID, "xs:ID", "a", "a", "1"},
    {XQ_TYPE_IDREF, "xs:IDREF", "a", "a", "1"},
    {XQ_TYPE_ENTITY, "xs:ENTITY", "a", "a", "1"},
    {XQ_TYPE_NMTOKEN, "xs:NMTOKEN", "1a", "1a", " "},
    {XQ_TYPE_INTEGER, "xs:integer", "123456789012345678901", "123456789012345678901", "12abc"},
    {XQ_TYPE_NON_NEGATIVE_INTEGER, "xs:nonNegativeInteger", "0", "0", "-1"},
    {XQ_TYPE_POSITIVE_INTEGER, "xs:positiveInteger", "1", "1", "0"},
    {XQ_TYPE_NON_POSITIVE_INTEGER, "xs:nonPositiveInteger", "0", "0", "1"},
    {XQ_TYPE_NEGATIVE_INTEGER, "xs:negativeInteger", "-1", "-1", "0"},
    {XQ_TYPE_LONG, "xs:long", "-5", "-5", "99999999999999999999"},
    {XQ_TYPE_INT, "xs:int", "-5", "-5", "2147483648"},
    {XQ_TYPE_SHORT, "xs:short", "-5", "-5", "32768"},
    {XQ_TYPE_BYTE, "xs:byte", "-5", "-5", "128"},
    {XQ_TYPE_UNSIGNED_LONG, "xs:unsignedLong", "5", "5", "-1"},
    {XQ_TYPE_UNSIGNED_INT, "xs:unsignedInt", "5", "5", "-1"},
    {XQ_TYPE_UNSIGNED_SHORT, "xs:unsignedShort", "5", "5", "65536"},
    {XQ_TYPE_UNSIGNED_BYTE, "xs:unsignedByte", "5", "5", "256"},
};

static void text_becomes_a_value_of_every_type(void) {
  size_t i;
  for (i = 0; i < sizeof(typed_texts) / sizeof(typed_texts[0]); i++) {
    xq_value* value = new_value();
    CHECK_OK(xq_value_add_text(value, typed_texts[i].type, typed_texts[i].text, XQ_NUL));
    if (!CHECK_STATUS(xq_value_add_text(value, typed_texts[i].type, typed_texts[i].wrong, XQ_NUL),
                      XQ_MISMATCH)) {
      printf("as %s: %s\n", typed_texts[i].name, typed_texts[i].wrong);
    }
    check_only(value, typed_texts[i].type, typed_texts[i].name, typed_texts[i].canonical);
  }
}

static void types_that_are_not_made_of_text_are_wrong_use(void) {
  static const xq_type others[] = {-1, XQ_TYPE_OTHER, XQ_TYPE_NODE, 7, XQ_TYPE_QNAME, 37, 39, 41,
                                   55};
  xq_value* value = new_value();
  size_t i;
  for (i = 0; i < sizeof(others) / sizeof(others[0]); i++) {
    CHECK_STATUS(xq_value_add_text(value, others[i], "a", 1), XQ_USAGE);
  }
  CHECK_OK(xq_value_free(value));
}

static void qnames_have_three_parts(void) {
  xq_value* value = new_value();
  xq_text uri = XQ_TEXT_INIT;
  xq_text local = XQ_TEXT_INIT;
  xq_text prefix = XQ_TEXT_INIT;
  CHECK_OK(xq_value_add_qname(value, "urn:p", XQ_NUL, "a", XQ_NUL, "p", XQ_NUL));
  CHECK_OK(xq_value_qname(value, 0, &uri, &local, &prefix));
  CHECK_TEXT(uri, "urn:p");
  CHECK_TEXT(local, "a");
  CHECK_TEXT(prefix, "p");
  check_only(value, XQ_TYPE_QNAME, "xs:QName", "p:a");
  value = new_value();
  CHECK_OK(xq_value_add_qname(value, NULL, 0, "b", 1, NULL, 0));
  CHECK_OK(xq_value_qname(value, 0, &uri, &local, &prefix));
  CHECK_TEXT(uri, "");
  CHECK_TEXT(local, "b");
  CHECK_TEXT(prefix, "");
  CHECK_STATUS(xq_value_add_qname(value, "", 0, "", 0, "", 0), XQ_MISMATCH);
  CHECK_STATUS(xq_value_add_qname(value, "", 0, "a:b", 3, "", 0), XQ_MISMATCH);
  CHECK_STATUS(xq_value_add_qname(value, "", 0, "a", 1, "1", 1), XQ_MISMATCH);
  CHECK_OK(xq_value_add_integer(value, 1));
  CHECK_STATUS(xq_value_qname(value, 1, &uri, &local, &prefix), XQ_MISMATCH);
  CHECK_TEXT(local, "");
  CHECK_OK(xq_value_free(value));
  CHECK_OK(xq_text_free(&uri));
  CHECK_OK(xq_text_free(&local));
  CHECK_OK(xq_text_free(&prefix));
}

static void bytes_are_either_binary(void) {
  xq_value* value = new_value();
  xq_text bytes = XQ_TEXT_INIT;
  CHECK_OK(xq_value_add_bytes(value, XQ_TYPE_HEX_BINARY, "\0\xFF", 2));
  CHECK_OK(xq_value_bytes(value, 0, &bytes));
  CHECK(bytes.length == 2 && memcmp(bytes.data, "\0\xFF", 3) == 0);
  check_only(value, XQ_TYPE_HEX_BINARY, "xs:hexBinary", "00FF");
  value = new_value();
  CHECK_OK(xq_value_add_bytes(value, XQ_TYPE_BASE64_BINARY, NULL, 0));
  CHECK_STATUS(xq_value_add_bytes(value, XQ_TYPE_STRING, "a", 1), XQ_USAGE);
  CHECK_STATUS(xq_value_add_bytes(value, XQ_TYPE_HEX_BINARY, "a", XQ_NUL), XQ_USAGE);
  CHECK_STATUS(xq_value_add_bytes(value, XQ_TYPE_HEX_BINARY, NULL, 1), XQ_USAGE);
  check_only(value, XQ_TYPE_BASE64_BINARY, "xs:base64Binary", "");
  CHECK_OK(xq_text_free(&bytes));
}

/* ---- dates and durations --------------------------------------------------------------------- */

static void check_date(xq_type type, xq_date_time fields, const char* string) {
  xq_value* value = new_value();
  xq_date_time back;
  xq_text text = XQ_TEXT_INIT;
  CHECK_OK(xq_value_add_date_time(value, type, &fields));
  CHECK_OK(xq_value_date_time(value, 0, &back));
  CHECK_OK(xq_value_string(value, 0, &text));
  CHECK_TEXT(text, string);
  CHECK(back.year == fields.year && back.month == fields.month && back.day == fields.day);
  CHECK(back.hour == fields.hour && back.minute == fields.minute && back.second == fields.second);
  CHECK_NUMBER(back.nanosecond, fields.nanosecond);
  CHECK_NUMBER(back.has_zone, fields.has_zone);
  CHECK_NUMBER(back.zone_seconds, fields.zone_seconds);
  CHECK_OK(xq_text_free(&text));
  CHECK_OK(xq_value_free(value));
}

static void dates_have_their_fields(void) {
  const xq_date_time moment = {2004, 10, 29, 23, 59, 58, 123456000, 1, 5400};
  const xq_date_time date = {2004, 2, 29, 0, 0, 0, 0, 0, 0};
  const xq_date_time far_back = {-44, 3, 15, 0, 0, 0, 0, 1, 0};
  const xq_date_time time = {0, 0, 0, 12, 30, 0, 0, 1, -18000};
  const xq_date_time year_month = {2004, 10, 0, 0, 0, 0, 0, 0, 0};
  const xq_date_time year = {12004, 0, 0, 0, 0, 0, 0, 0, 0};
  const xq_date_time month_day = {0, 2, 29, 0, 0, 0, 0, 0, 0};
  const xq_date_time day = {0, 0, 31, 0, 0, 0, 0, 0, 0};
  const xq_date_time month = {0, 12, 0, 0, 0, 0, 0, 1, 0};
  check_date(XQ_TYPE_DATE_TIME, moment, "2004-10-29T23:59:58.123456+01:30");
  check_date(XQ_TYPE_DATE, date, "2004-02-29");
  check_date(XQ_TYPE_DATE, far_back, "-0044-03-15Z");
  check_date(XQ_TYPE_TIME, time, "12:30:00-05:00");
  check_date(XQ_TYPE_G_YEAR_MONTH, year_month, "2004-10");
  check_date(XQ_TYPE_G_YEAR, year, "12004");
  check_date(XQ_TYPE_G_MONTH_DAY, month_day, "--02-29");
  check_date(XQ_TYPE_G_DAY, day, "---31");
  check_date(XQ_TYPE_G_MONTH, month, "--12--Z");
}

static void check_no_date(xq_type type, xq_date_time fields, xq_status status) {
  xq_value* value = new_value();
  CHECK_STATUS(xq_value_add_date_time(value, type, &fields), status);
  CHECK_OK(xq_value_free(value));
}

static void fields_out_of_range_make_no_date(void) {
  static const xq_date_time wrong[] = {
      {2004, 0, 1, 0, 0, 0, 0, 0, 0},         {2004, 13, 1, 0, 0, 0, 0, 0, 0},
      {2004, -1, 1, 0, 0, 0, 0, 0, 0},        {2003, 2, 29, 0, 0, 0, 0, 0, 0},
      {2004, 1, 0, 0, 0, 0, 0, 0, 0},         {2004, 1, 32, 0, 0, 0, 0, 0, 0},
      {2004, 1, 1, -1, 0, 0, 0, 0, 0},        {2004, 1, 1, 24, 0, 0, 0, 0, 0},
      {2004, 1, 1, 0, 60, 0, 0, 0, 0},        {2004, 1, 1, 0, 0, 60, 0, 0, 0},
      {2004, 1, 1, 0, 0, 0, -1, 0, 0},        {2004, 1, 1, 0, 0, 0, 1000000000, 0, 0},
      {2004, 1, 1, 0, 0, 0, 0, 1, 30},        {2004, 1, 1, 0, 0, 0, 0, 1, 60000},
      {2004, INT32_MIN, 1, 0, 0, 0, 0, 0, 0}, {2004, 1, INT32_MAX, 0, 0, 0, 0, 0, 0},
      {2004, 1, 1, 0, 0, 0, 0, 1, INT32_MIN},
  };
  xq_value* value = new_value();
  size_t i;
  for (i = 0; i < sizeof(wrong) / sizeof(wrong[0]); i++) {
    check_no_date(XQ_TYPE_DATE_TIME, wrong[i], XQ_MISMATCH);
  }
  check_no_date(XQ_TYPE_STRING, wrong[0], XQ_USAGE);
  check_no_date(XQ_TYPE_DURATION, wrong[0], XQ_USAGE);
  check_no_date(-1, wrong[0], XQ_USAGE);
  CHECK_STATUS(xq_value_add_date_time(value, XQ_TYPE_DATE, NULL), XQ_USAGE);
  CHECK_OK(xq_value_free(value));
}

static void check_duration(xq_type type, xq_duration duration, const char* string) {
  xq_value* value = new_value();
  xq_duration back;
  xq_text text = XQ_TEXT_INIT;
  CHECK_OK(xq_value_add_duration(value, type, &duration));
  CHECK_OK(xq_value_duration(value, 0, &back));
  CHECK_NUMBER(back.is_negative, duration.is_negative);
  CHECK_NUMBER(back.months, duration.months);
  CHECK_NUMBER(back.seconds, duration.seconds);
  CHECK_NUMBER(back.nanoseconds, duration.nanoseconds);
  CHECK_OK(xq_value_string(value, 0, &text));
  CHECK_TEXT(text, string);
  CHECK_OK(xq_text_free(&text));
  CHECK_OK(xq_value_free(value));
}

static void durations_have_months_and_seconds(void) {
  const xq_duration months = {1, 14, 0, 0};
  const xq_duration seconds = {0, 0, 129600, 500000000};
  const xq_duration back = {1, 0, 90, 0};
  const xq_duration both = {0, 14, 93784, 0};
  check_duration(XQ_TYPE_YEAR_MONTH_DURATION, months, "-P1Y2M");
  check_duration(XQ_TYPE_DAY_TIME_DURATION, seconds, "P1DT12H0.5S");
  check_duration(XQ_TYPE_DAY_TIME_DURATION, back, "-PT1M30S");
  check_duration(XQ_TYPE_DURATION, both, "P1Y2M1DT2H3M4S");
}

static void what_a_duration_cannot_hold_is_refused(void) {
  static const struct {
    xq_type type;
    xq_duration duration;
    xq_status status;
  } wrong[] = {
      {XQ_TYPE_YEAR_MONTH_DURATION, {0, 1, 1, 0}, XQ_MISMATCH},
      {XQ_TYPE_YEAR_MONTH_DURATION, {0, -1, 0, 0}, XQ_MISMATCH},
      {XQ_TYPE_DAY_TIME_DURATION, {0, 1, 1, 0}, XQ_MISMATCH},
      {XQ_TYPE_DAY_TIME_DURATION, {0, 0, -1, 0}, XQ_MISMATCH},
      {XQ_TYPE_DAY_TIME_DURATION, {0, 0, 1, 1000000000}, XQ_MISMATCH},
      {XQ_TYPE_DAY_TIME_DURATION, {0, 0, 1, -1}, XQ_MISMATCH},
      {XQ_TYPE_DAY_TIME_DURATION, {0, 0, INT64_MAX, 0}, XQ_MISMATCH},
      {XQ_TYPE_DURATION, {0, INT64_MAX, 0, 0}, XQ_MISMATCH},
      {XQ_TYPE_DURATION, {0, 0, INT64_MAX, 0}, XQ_MISMATCH},
      {XQ_TYPE_DATE, {0, 0, 0, 0}, XQ_USAGE},
  };
  xq_value* value = new_value();
  size_t i;
  for (i = 0; i < sizeof(wrong) / sizeof(wrong[0]); i++) {
    CHECK_STATUS(xq_value_add_duration(value, wrong[i].type, &wrong[i].duration), wrong[i].status);
  }
  CHECK_STATUS(xq_value_add_duration(value, XQ_TYPE_DURATION, NULL), XQ_USAGE);
  CHECK_OK(xq_value_free(value));
}

/* ---- sequences ------------------------------------------------------------------------------- */

static void values_are_put_together(void) {
  xq_value* value = new_value();
  xq_value* copy = NULL;
  xq_node* node = document_of("<a>n</a>");
  CHECK_OK(xq_value_add_integer(value, 1));
  CHECK_OK(xq_value_add_node(value, node));
  CHECK_OK(xq_value_copy(value, &copy));
  CHECK_OK(xq_value_add_string(value, "s", 1));
  CHECK_OK(xq_value_add_all(value, value));
  check_items(value, "1 n s 1 n s");
  check_items(copy, "1 n");
  CHECK_OK(xq_value_add_all(copy, value));
  CHECK_OK(xq_value_free(value));
  CHECK_OK(xq_node_free(node));
  check_items(copy, "1 n 1 n s 1 n s");
  CHECK_STATUS(xq_value_add_all(copy, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_add_node(copy, NULL), XQ_USAGE);
  CHECK_OK(xq_value_free(copy));
}

const test_case values_tests[] = {
    {"integers are exact", integers_are_exact},
    {"doubles and floats are what they were", doubles_and_floats_are_what_they_were},
    {"booleans are true or false", booleans_are_true_or_false},
    {"text is string or untyped", text_is_string_or_untyped},
    {"text is checked", text_is_checked},
    {"text becomes a value of every type", text_becomes_a_value_of_every_type},
    {"types that are not made of text", types_that_are_not_made_of_text_are_wrong_use},
    {"QNames have three parts", qnames_have_three_parts},
    {"bytes are either binary", bytes_are_either_binary},
    {"dates have their fields", dates_have_their_fields},
    {"fields out of range make no date", fields_out_of_range_make_no_date},
    {"durations have months and seconds", durations_have_months_and_seconds},
    {"what a duration cannot hold is refused", what_a_duration_cannot_hold_is_refused},
    {"values are put together", values_are_put_together},
    TEST_END,
};
