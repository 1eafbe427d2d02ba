/* Compiling, plans and warnings. */
#include "Testing.h"

#include <string.h>

static void text_ends_at_its_length_or_its_zero(void) {
  xq_query* query = NULL;
  CHECK_OK(xq_compile("1 + 1 )", 5, NULL, &query, NULL));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_compile("", XQ_NUL, NULL, &query, NULL));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_compile(NULL, 0, NULL, &query, NULL));
  CHECK_OK(xq_query_free(query));
  CHECK_STATUS(xq_compile(NULL, 1, NULL, &query, NULL), XQ_USAGE);
  CHECK(query == NULL);
}

static void an_explained_query_has_a_plan(void) {
  xq_query* query = compiled_in(XQ_WAY_EXPLAINED, "count(//a[b = 1])");
  xq_query* other = compiled("1");
  xq_text plan = XQ_TEXT_INIT;
  CHECK_OK(xq_query_plan(query, XQ_PLAN_TEXT, &plan));
  CHECK(strstr(plan.data, "count") != NULL);
  CHECK_OK(xq_query_plan(query, XQ_PLAN_JSON, &plan));
  CHECK_BEGINS(plan, "[");
  CHECK_OK(xq_query_plan(query, XQ_PLAN_DOT, &plan));
  CHECK_BEGINS(plan, "digraph");
  CHECK_STATUS(xq_query_plan(query, XQ_PLAN_DOT + 1, &plan), XQ_USAGE);
  CHECK_STATUS(xq_query_plan(query, -1, &plan), XQ_USAGE);
  CHECK_STATUS(xq_query_plan(other, XQ_PLAN_TEXT, &plan), XQ_END);
  CHECK_TEXT(plan, "");
  CHECK_OK(xq_text_free(&plan));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_query_free(other));
}

static void an_explained_query_has_warnings(void) {
  const char* text = "let $a := 1\nreturn nowhere()";
  xq_query* query = compiled_in(XQ_WAY_EXPLAINED, text);
  xq_query* other = compiled(text);
  xq_warning warning;
  size_t count = 0;
  int has_function = 0;
  while (xq_query_warning(query, count, &warning) == XQ_OK) {
    CHECK(warning.text.length > 5);
    if (strcmp(warning.identifier.data, "unknown-function") == 0) {
      has_function = 1;
      CHECK_TEXT(warning.name, "nowhere");
      CHECK_TEXT(warning.module_url, "");
      CHECK_NUMBER(warning.line, 2);
      CHECK_NUMBER(warning.column, 8);
    }
    count++;
  }
  CHECK_NUMBER(has_function, 1);
  CHECK_NUMBER(count, 2);
  CHECK_STATUS(xq_query_warning(query, count, &warning), XQ_END);
  CHECK_TEXT(warning.identifier, "");
  CHECK_STATUS(xq_query_warning(other, 0, &warning), XQ_END);
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_query_free(other));
}

static void a_streamed_query_tells_how(void) {
  xq_query* query = compiled_in(XQ_WAY_STREAMED, "count(/a/b)");
  xq_query* other = compiled("1");
  xq_text plan = XQ_TEXT_INIT;
  CHECK_OK(xq_query_stream_plan(query, &plan));
  CHECK_BEGINS(plan, "record: /a/b\n");
  CHECK_STATUS(xq_query_stream_plan(other, &plan), XQ_END);
  CHECK_OK(xq_text_free(&plan));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_query_free(other));
}

static void a_query_that_cannot_be_streamed_tells_why(void) {
  xq_options* options = NULL;
  xq_query* query = NULL;
  xq_error* error = NULL;
  xq_string message;
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_options_set_way(options, XQ_WAY_STREAMED));
  CHECK_STATUS(xq_compile("/a/b[last()]", XQ_NUL, options, &query, &error), XQ_ERROR);
  CHECK_OK(xq_error_message(error, &message));
  CHECK_BEGINS(message, "cannot be evaluated as a stream: ");
  CHECK_OK(xq_error_free(error));
  CHECK_OK(xq_options_free(options));
}

static void all_ways_answer_alike(void) {
  xq_way way;
  for (way = XQ_WAY_PLANNED; way <= XQ_WAY_PROFILED; way++) {
    xq_query* query = compiled_in(way, "sum(/a/b)");
    xq_node* document = document_of("<a><b>1</b><b>2</b></a>");
    xq_context* context = NULL;
    xq_value* items = NULL;
    CHECK_OK(xq_context_new(&context));
    CHECK_OK(xq_context_set_node(context, document));
    CHECK_OK(xq_evaluate(context, query, &items, NULL));
    check_items(items, "3");
    CHECK_OK(xq_value_free(items));
    CHECK_OK(xq_context_free(context));
    CHECK_OK(xq_node_free(document));
    CHECK_OK(xq_query_free(query));
  }
}

const test_case queries_tests[] = {
    {"text ends at its length or its zero", text_ends_at_its_length_or_its_zero},
    {"an explained query has a plan", an_explained_query_has_a_plan},
    {"an explained query has warnings", an_explained_query_has_warnings},
    {"a streamed query tells how", a_streamed_query_tells_how},
    {"a query that cannot be streamed tells why", a_query_that_cannot_be_streamed_tells_why},
    {"all ways answer alike", all_ways_answer_alike},
    TEST_END,
};
