/* Looking at the items of results. */
#include "Testing.h"

#include <math.h>
#include <string.h>

static void positions_go_from_item_to_item(void) {
  xq_value* items = result_of("'a', 'b', 'c'");
  size_t at = XQ_BEFORE;
  size_t count = 0;
  CHECK_OK(xq_value_count(items, &count));
  CHECK_NUMBER(count, 3);
  CHECK_OK(xq_value_next(items, &at));
  CHECK_NUMBER(at, 0);
  CHECK_OK(xq_value_next(items, &at));
  CHECK_OK(xq_value_next(items, &at));
  CHECK_NUMBER(at, 2);
  CHECK_STATUS(xq_value_next(items, &at), XQ_END);
  CHECK(at == XQ_BEFORE);
  at = 100;
  CHECK_STATUS(xq_value_next(items, &at), XQ_END);
  CHECK_OK(xq_value_free(items));
  items = result_of("()");
  CHECK_STATUS(xq_value_next(items, &at), XQ_END);
  CHECK_OK(xq_value_free(items));
}

static void behind_the_last_item_is_none(void) {
  xq_value* items = result_of("1");
  static const size_t behind[] = {1, 2, XQ_BEFORE};
  size_t i;
  for (i = 0; i < 3; i++) {
    xq_text text = XQ_TEXT_INIT;
    xq_text other = XQ_TEXT_INIT;
    xq_text third = XQ_TEXT_INIT;
    xq_type type = 0;
    int64_t integer = 0;
    uint64_t big = 0;
    double number = 0;
    int flag = 0;
    xq_date_time date;
    xq_duration duration;
    xq_node* node = NULL;
    const size_t at = behind[i];
    CHECK_STATUS(xq_value_type(items, at, &type), XQ_END);
    CHECK_STATUS(xq_value_type_name(items, at, &text), XQ_END);
    CHECK_STATUS(xq_value_string(items, at, &text), XQ_END);
    CHECK_STATUS(xq_value_xml(items, at, &text), XQ_END);
    CHECK_STATUS(xq_value_integer(items, at, &integer), XQ_END);
    CHECK_STATUS(xq_value_unsigned(items, at, &big), XQ_END);
    CHECK_STATUS(xq_value_double(items, at, &number), XQ_END);
    CHECK_STATUS(xq_value_boolean(items, at, &flag), XQ_END);
    CHECK_STATUS(xq_value_qname(items, at, &text, &other, &third), XQ_END);
    CHECK_STATUS(xq_value_bytes(items, at, &text), XQ_END);
    CHECK_STATUS(xq_value_date_time(items, at, &date), XQ_END);
    CHECK_STATUS(xq_value_duration(items, at, &duration), XQ_END);
    CHECK_STATUS(xq_value_node(items, at, &node), XQ_END);
    CHECK(node == NULL);
  }
  CHECK_OK(xq_value_free(items));
}

static void an_item_of_another_type_is_a_mismatch(void) {
  xq_value* items = result_of("'text'");
  xq_text text = XQ_TEXT_INIT;
  xq_text other = XQ_TEXT_INIT;
  xq_text third = XQ_TEXT_INIT;
  int64_t integer = 1;
  uint64_t big = 1;
  double number = 1;
  int flag = 1;
  xq_date_time date = {1, 1, 1, 1, 1, 1, 1, 1, 1};
  xq_duration duration = {1, 1, 1, 1};
  xq_node* node = NULL;
  CHECK_STATUS(xq_value_integer(items, 0, &integer), XQ_MISMATCH);
  CHECK_STATUS(xq_value_unsigned(items, 0, &big), XQ_MISMATCH);
  CHECK_STATUS(xq_value_double(items, 0, &number), XQ_MISMATCH);
  CHECK_STATUS(xq_value_boolean(items, 0, &flag), XQ_MISMATCH);
  CHECK_STATUS(xq_value_qname(items, 0, &text, &other, &third), XQ_MISMATCH);
  CHECK_STATUS(xq_value_bytes(items, 0, &text), XQ_MISMATCH);
  CHECK_STATUS(xq_value_date_time(items, 0, &date), XQ_MISMATCH);
  CHECK_STATUS(xq_value_duration(items, 0, &duration), XQ_MISMATCH);
  CHECK_STATUS(xq_value_node(items, 0, &node), XQ_MISMATCH);
  CHECK(integer == 0 && big == 0 && number == 0 && flag == 0 && date.year == 0);
  CHECK(duration.months == 0 && node == NULL);
  CHECK_TEXT(text, "");
  CHECK_OK(xq_value_free(items));
}

static void numbers_of_every_type_are_doubles(void) {
  xq_value* items = result_of("1, 2.5, xs:float('0.5'), 1e0, xs:byte(7), xs:duration('P1Y')");
  double number = 0;
  int64_t integer = 0;
  CHECK_OK(xq_value_double(items, 0, &number));
  CHECK(number == 1.0);
  CHECK_OK(xq_value_double(items, 1, &number));
  CHECK(number == 2.5);
  CHECK_OK(xq_value_double(items, 2, &number));
  CHECK(number == 0.5);
  CHECK_OK(xq_value_double(items, 3, &number));
  CHECK(number == 1.0);
  CHECK_OK(xq_value_integer(items, 4, &integer));
  CHECK_NUMBER(integer, 7);
  CHECK_STATUS(xq_value_integer(items, 1, &integer), XQ_MISMATCH);
  CHECK_STATUS(xq_value_integer(items, 3, &integer), XQ_MISMATCH);
  CHECK_STATUS(xq_value_double(items, 5, &number), XQ_MISMATCH);
  CHECK_OK(xq_value_free(items));
}

static void integers_that_do_not_fit_are_a_mismatch(void) {
  xq_value* items = result_of("9223372036854775808, 18446744073709551616, -1");
  int64_t integer = 1;
  uint64_t big = 1;
  CHECK_STATUS(xq_value_integer(items, 0, &integer), XQ_MISMATCH);
  CHECK_OK(xq_value_unsigned(items, 0, &big));
  CHECK(big == UINT64_C(9223372036854775808));
  CHECK_STATUS(xq_value_unsigned(items, 1, &big), XQ_MISMATCH);
  CHECK_STATUS(xq_value_unsigned(items, 2, &big), XQ_MISMATCH);
  CHECK_NUMBER(big, 0);
  CHECK_OK(xq_value_integer(items, 2, &integer));
  CHECK_NUMBER(integer, -1);
  CHECK_OK(xq_value_free(items));
}

static void nodes_are_items(void) {
  xq_value* items = result_of("<a b='1'>t</a>, <a b='1'/>/@b, text { 'x&lt;' }");
  xq_text text = XQ_TEXT_INIT;
  xq_node* node = NULL;
  xq_type type = -1;
  CHECK_OK(xq_value_type(items, 0, &type));
  CHECK_NUMBER(type, XQ_TYPE_NODE);
  CHECK_OK(xq_value_type_name(items, 0, &text));
  CHECK_TEXT(text, "element()");
  CHECK_OK(xq_value_type_name(items, 1, &text));
  CHECK_TEXT(text, "attribute()");
  CHECK_OK(xq_value_xml(items, 0, &text));
  CHECK_TEXT(text, "<a b=\"1\">t</a>");
  CHECK_OK(xq_value_xml(items, 1, &text));
  CHECK_TEXT(text, "b=\"1\"");
  CHECK_OK(xq_value_string(items, 2, &text));
  CHECK_TEXT(text, "x<");
  CHECK_OK(xq_value_xml(items, 2, &text));
  CHECK_TEXT(text, "x&lt;");
  CHECK_OK(xq_value_node(items, 0, &node));
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_node_string(node, &text));
  CHECK_TEXT(text, "t");
  CHECK_OK(xq_node_free(node));
  CHECK_OK(xq_text_free(&text));
}

static void dates_of_queries_have_fields(void) {
  xq_value* items = result_of(
      "xs:dateTime('2004-10-29T01:02:03.25+02:00'), xs:gYear('2004'), xs:time('01:02:03'),"
      "xs:dateTime('1969-12-31T23:59:59.75Z')");
  xq_date_time fields;
  CHECK_OK(xq_value_date_time(items, 0, &fields));
  CHECK(fields.year == 2004 && fields.month == 10 && fields.day == 29);
  CHECK(fields.hour == 1 && fields.minute == 2 && fields.second == 3);
  CHECK_NUMBER(fields.nanosecond, 250000000);
  CHECK(fields.has_zone == 1 && fields.zone_seconds == 7200);
  CHECK_OK(xq_value_date_time(items, 1, &fields));
  CHECK(fields.year == 2004 && fields.month == 0 && fields.day == 0 && fields.has_zone == 0);
  CHECK_OK(xq_value_date_time(items, 2, &fields));
  CHECK(fields.year == 0 && fields.month == 0 && fields.day == 0 && fields.hour == 1);
  CHECK_OK(xq_value_date_time(items, 3, &fields));
  CHECK(fields.second == 59 && fields.nanosecond == 750000000);
  CHECK_OK(xq_value_free(items));
}

static void durations_beyond_64_bits_of_seconds_are_a_mismatch(void) {
  static const char beyond[] = "PT99999999999999999999S";
  xq_value* items = NULL;
  xq_duration duration = {1, 1, 1, 1};
  CHECK_OK(xq_value_new(&items));
  CHECK_OK(xq_value_add_text(items, XQ_TYPE_DURATION, beyond, XQ_NUL));
  CHECK_OK(xq_value_add_text(items, XQ_TYPE_DAY_TIME_DURATION, beyond, XQ_NUL));
  CHECK_OK(xq_value_add_text(items, XQ_TYPE_DURATION, "P1Y1DT0.5S", XQ_NUL));
  CHECK_STATUS(xq_value_duration(items, 0, &duration), XQ_MISMATCH);
  CHECK_NUMBER(duration.seconds, 0);
  CHECK_STATUS(xq_value_duration(items, 1, &duration), XQ_MISMATCH);
  CHECK_OK(xq_value_duration(items, 2, &duration));
  CHECK(duration.months == 12 && duration.seconds == 86400 && duration.nanoseconds == 500000000);
  CHECK_OK(xq_value_free(items));
}

static void raw_data_has_bytes_and_no_type(void) {
  xq_value* items = result_of("xs:hexBinary('00ff')");
  xq_text bytes = XQ_TEXT_INIT;
  CHECK_OK(xq_value_bytes(items, 0, &bytes));
  CHECK(bytes.length == 2 && bytes.data[0] == 0 && (unsigned char)bytes.data[1] == 255);
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_text_free(&bytes));
}

static void texts_beyond_ascii_are_whole(void) {
  xq_value* items = result_of("codepoints-to-string((228, 128512, 97))");
  xq_text text = XQ_TEXT_INIT;
  CHECK_OK(xq_value_string(items, 0, &text));
  CHECK_TEXT(text,
             "\xC3\xA4\xF0\x9F\x98\x80"
             "a");
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_text_free(&text));
}

const test_case items_tests[] = {
    {"positions go from item to item", positions_go_from_item_to_item},
    {"behind the last item is none", behind_the_last_item_is_none},
    {"an item of another type is a mismatch", an_item_of_another_type_is_a_mismatch},
    {"numbers of every type are doubles", numbers_of_every_type_are_doubles},
    {"integers that do not fit are a mismatch", integers_that_do_not_fit_are_a_mismatch},
    {"nodes are items", nodes_are_items},
    {"dates of queries have fields", dates_of_queries_have_fields},
    {"durations beyond 64 bits of seconds", durations_beyond_64_bits_of_seconds_are_a_mismatch},
    {"raw data has bytes and no type", raw_data_has_bytes_and_no_type},
    {"texts beyond ASCII are whole", texts_beyond_ascii_are_whole},
    TEST_END,
};
