/* Evaluating: results, and what outlives what. */
#include "Testing.h"

static void one_query_serves_many_contexts(void) {
  xq_query* query = compiled("/a/b + 1");
  int i;
  for (i = 0; i < 5; i++) {
    xq_node* node = document_of("<a><b>1</b></a>");
    xq_context* context = NULL;
    xq_value* items = NULL;
    CHECK_OK(xq_context_new(&context));
    CHECK_OK(xq_context_set_node(context, node));
    CHECK_OK(xq_node_free(node));
    CHECK_OK(xq_evaluate(context, query, &items, NULL));
    CHECK_OK(xq_context_free(context));
    check_items(items, "2");
    CHECK_OK(xq_value_free(items));
  }
  CHECK_OK(xq_query_free(query));
}

static void empty_results_are_values(void) {
  check_answer("()", NULL, "");
  check_answer("", NULL, "");
  check_answer("module namespace m = 'urn:m'; declare variable $m:a := 1;", NULL, "");
}

static void results_outlive_query_and_context(void) {
  xq_value* items = result_of("<a><b>1</b></a>/b, 'literal', 1 to 3");
  check_items(items, "1 literal 1 2 3");
  CHECK_OK(xq_value_free(items));
}

static void results_may_be_changed(void) {
  xq_query* query = compiled("declare variable $v external; $v");
  xq_context* context = NULL;
  xq_value* value = result_of("1, 2");
  xq_value* items = NULL;
  CHECK_OK(xq_context_new(&context));
  CHECK_OK(xq_context_set_variable(context, "v", 1, value));
  CHECK_OK(xq_evaluate(context, query, &items, NULL));
  CHECK_OK(xq_value_add_integer(items, 3));
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_evaluate(context, query, &items, NULL));
  check_items(items, "1 2");
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_value_free(value));
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
}

static void a_deep_recursion_ends_in_an_error(void) {
  xq_query* query = compiled("declare function local:f($n) { 1 + local:f($n + 1) }; local:f(0)");
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_error* error = NULL;
  xq_category category = -1;
  CHECK_OK(xq_context_new(&context));
  CHECK_STATUS(xq_evaluate(context, query, &items, &error), XQ_ERROR);
  CHECK_OK(xq_error_category(error, &category));
  CHECK_NUMBER(category, XQ_CATEGORY_LIMIT);
  CHECK_OK(xq_error_free(error));
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
}

static int trace_and_free(void* data, const xq_value* value, const char* label, size_t length) {
  xq_query** query = (xq_query**)data;
  (void)value, (void)label, (void)length;
  CHECK_OK(xq_query_free(*query));
  *query = NULL;
  return 0;
}

static void a_callback_may_free_the_query(void) {
  xq_query* query = compiled("for $i in trace((1, 2), 'l') return concat('a', $i)");
  xq_context* context = NULL;
  xq_value* items = NULL;
  CHECK_OK(xq_context_new(&context));
  CHECK_OK(xq_context_set_trace(context, trace_and_free, &query, NULL));
  CHECK_OK(xq_evaluate(context, query, &items, NULL));
  CHECK(query == NULL);
  check_items(items, "a1 a2");
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_context_free(context));
}

static void wrong_uses_have_a_status(void) {
  xq_query* query = compiled("1");
  xq_context* context = NULL;
  xq_value* items = NULL;
  CHECK_OK(xq_context_new(&context));
  CHECK_STATUS(xq_evaluate(context, NULL, &items, NULL), XQ_USAGE);
  CHECK_STATUS(xq_evaluate(NULL, query, &items, NULL), XQ_USAGE);
  CHECK_STATUS(xq_evaluate((xq_context*)query, query, &items, NULL), XQ_USAGE);
  CHECK_STATUS(xq_evaluate(context, (xq_query*)context, &items, NULL), XQ_USAGE);
  CHECK_OK(xq_evaluate(context, query, &items, NULL));
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
}

const test_case evaluation_tests[] = {
    {"one query serves many contexts", one_query_serves_many_contexts},
    {"empty results are values", empty_results_are_values},
    {"results outlive query and context", results_outlive_query_and_context},
    {"results may be changed", results_may_be_changed},
    {"a deep recursion ends in an error", a_deep_recursion_ends_in_an_error},
    {"a callback may free the query", a_callback_may_free_the_query},
    {"wrong uses have a status", wrong_uses_have_a_status},
    TEST_END,
};
