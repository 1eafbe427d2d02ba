/* Errors: number, category, texts, places, calls, and all that a compilation found. */
#include "Testing.h"

#include <string.h>

/* The error of a query that does not compile, or of its evaluation. The caller frees it. */
static xq_error* error_of(const char* text) {
  xq_query* query = NULL;
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_error* error = NULL;
  if (xq_compile(text, XQ_NUL, NULL, &query, &error) == XQ_OK) {
    CHECK_OK(xq_context_new(&context));
    CHECK_STATUS(xq_evaluate(context, query, &items, &error), XQ_ERROR);
    CHECK(items == NULL);
  }
  CHECK(error != NULL);
  xq_context_free(context);
  xq_query_free(query);
  return error;
}

static void check_error(const char* text, int number, xq_category category, const char* message) {
  xq_error* error = error_of(text);
  int64_t found = -1;
  xq_category kind = -1;
  xq_string string;
  CHECK_OK(xq_error_number(error, &found));
  CHECK_NUMBER(found, number);
  CHECK_OK(xq_error_category(error, &kind));
  CHECK_NUMBER(kind, category);
  CHECK_OK(xq_error_message(error, &string));
  CHECK_TEXT(string, message);
  CHECK_OK(xq_error_free(error));
}

static void errors_have_number_category_and_message(void) {
  check_error("$nowhere", 8, XQ_CATEGORY_NAMES, "reference to undefined variable \"nowhere\"");
  check_error("1 + 'x'", 6, XQ_CATEGORY_TYPES, "invalid type for operator");
  check_error("error(QName('urn:e', 'E'), 'text')", 0, XQ_CATEGORY_RAISED_BY_QUERY,
              "urn:e#E - text");
  check_error("declare variable $v external; $v", 16, XQ_CATEGORY_NAMES,
              "unresloved external variable - v");
}

static void an_error_record_in_a_result_is_an_error(void) {
  check_error("<!-- a -- b -->", 72, XQ_CATEGORY_VALUES, "invalid comment");
  check_error("1, <!-- a -- b -->, 2", 72, XQ_CATEGORY_VALUES, "invalid comment");
}

static void the_description_has_all_in_one(void) {
  xq_error* error = error_of("1 +\n$nowhere");
  xq_string description;
  int64_t line = 0;
  int64_t column = -1;
  CHECK_OK(xq_error_description(error, &description));
  CHECK_TEXT(description,
             "XQueryError:8 - \"reference to undefined variable \"nowhere\"\" at line:2");
  CHECK_OK(xq_error_line(error, &line, &column));
  CHECK_NUMBER(line, 2);
  CHECK_OK(xq_error_free(error));
}

static void an_error_has_the_place_of_its_expression(void) {
  xq_error* error = error_of("(: \xC3\xA4 :)\n  1 + (2 idiv 0)");
  xq_place place;
  CHECK_OK(xq_error_place(error, &place));
  CHECK_TEXT(place.module_url, "");
  CHECK_NUMBER(place.line, 2);
  CHECK_NUMBER(place.column, 8);
  CHECK_NUMBER(place.length, 8);
  CHECK_TEXT(place.source_line, "  1 + (2 idiv 0)");
  CHECK_OK(xq_error_free(error));
}

static void calls_are_listed_from_the_innermost_one(void) {
  xq_error* error = error_of(
      "declare function local:a($x) { 1 idiv $x };\n"
      "declare function local:b($x) { local:a($x) + 1 };\n"
      "local:b(0)");
  xq_call call;
  int64_t left_out = -1;
  CHECK_OK(xq_error_call(error, 0, &call));
  CHECK_TEXT(call.function, "local:a");
  CHECK_NUMBER(call.has_place, 1);
  CHECK_NUMBER(call.place.line, 2);
  CHECK_OK(xq_error_call(error, 1, &call));
  CHECK_TEXT(call.function, "local:b");
  CHECK_NUMBER(call.place.line, 3);
  CHECK_NUMBER(call.place.column, 1);
  CHECK_STATUS(xq_error_call(error, 2, &call), XQ_END);
  CHECK_TEXT(call.function, "");
  CHECK_NUMBER(call.has_place, 0);
  CHECK_STATUS(xq_error_call(error, (size_t)-1, &call), XQ_END);
  CHECK_OK(xq_error_calls_left_out(error, &left_out));
  CHECK_NUMBER(left_out, 0);
  CHECK_OK(xq_error_free(error));
}

static void calls_in_the_middle_are_left_out(void) {
  xq_error* error = error_of(
      "declare function local:f($n) { if ($n = 0) then 1 idiv 0 else local:f($n - 1) + 1 };"
      "local:f(99)");
  xq_call call;
  size_t count = 0;
  int64_t left_out = 0;
  while (xq_error_call(error, count, &call) == XQ_OK) count++;
  CHECK_NUMBER(count, 64);
  CHECK_OK(xq_error_calls_left_out(error, &left_out));
  CHECK_NUMBER(left_out, 36);
  CHECK_OK(xq_error_free(error));
}

static void a_compilation_may_have_several_errors(void) {
  xq_error* error = error_of(
      "declare variable $a := 1;\ndeclare variable $a := 2;\n"
      "declare variable $a := 3;\ndeclare variable $a := 4;\n$a");
  xq_error* next = NULL;
  xq_error* last = NULL;
  xq_string message;
  CHECK_OK(xq_error_next(error, &next));
  /* Each keeps itself. */
  CHECK_OK(xq_error_free(error));
  CHECK_OK(xq_error_message(next, &message));
  CHECK(strstr(message.data, "line:2") != NULL);
  CHECK_OK(xq_error_next(next, &last));
  CHECK_OK(xq_error_message(last, &message));
  CHECK(strstr(message.data, "line:3") != NULL);
  CHECK_STATUS(xq_error_next(last, &error), XQ_END);
  CHECK(error == NULL);
  CHECK_OK(xq_error_free(next));
  CHECK_OK(xq_error_free(last));
}

static void an_error_may_be_left_out(void) {
  xq_query* query = compiled("1 idiv 0");
  xq_query* broken = NULL;
  xq_context* context = NULL;
  xq_value* items = NULL;
  CHECK_STATUS(xq_compile("1 +", XQ_NUL, NULL, &broken, NULL), XQ_ERROR);
  CHECK(broken == NULL);
  CHECK_OK(xq_context_new(&context));
  CHECK_STATUS(xq_evaluate(context, query, &items, NULL), XQ_ERROR);
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
}

static void an_error_keeps_what_it_points_to(void) {
  xq_query* query = compiled("1,\n2 idiv 0");
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_error* error = NULL;
  xq_place place;
  CHECK_OK(xq_context_new(&context));
  CHECK_STATUS(xq_evaluate(context, query, &items, &error), XQ_ERROR);
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_error_place(error, &place));
  CHECK_TEXT(place.source_line, "2 idiv 0");
  CHECK_OK(xq_error_free(error));
}

static void text_that_is_not_utf8_does_not_compile(void) {
  check_error("\xFF", 3, XQ_CATEGORY_SYNTAX, "the query is not well-formed UTF-8");
}

const test_case errors_tests[] = {
    {"errors have number, category and message", errors_have_number_category_and_message},
    {"an error record in a result is an error", an_error_record_in_a_result_is_an_error},
    {"the description has all in one", the_description_has_all_in_one},
    {"an error has the place of its expression", an_error_has_the_place_of_its_expression},
    {"calls are listed from the innermost one", calls_are_listed_from_the_innermost_one},
    {"calls in the middle are left out", calls_in_the_middle_are_left_out},
    {"a compilation may have several errors", a_compilation_may_have_several_errors},
    {"an error may be left out", an_error_may_be_left_out},
    {"an error keeps what it points to", an_error_keeps_what_it_points_to},
    {"text that is not UTF-8 does not compile", text_that_is_not_utf8_does_not_compile},
    TEST_END,
};
