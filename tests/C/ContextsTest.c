/* Contexts: variables, context items, namespaces, and who hears of traces and missing documents. */
#include "Testing.h"

#include <string.h>

static xq_context* new_context(void) {
  xq_context* context = NULL;
  CHECK_OK(xq_context_new(&context));
  return context;
}

static void check_evaluation(xq_context* context, const char* text, const char* expected) {
  xq_query* query = compiled(text);
  xq_value* items = NULL;
  CHECK_OK(xq_evaluate(context, query, &items, NULL));
  check_items(items, expected);
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_query_free(query));
}

static void check_failure(xq_context* context, const char* text, int64_t expected) {
  xq_query* query = compiled(text);
  xq_value* items = NULL;
  xq_error* error = NULL;
  int64_t number = -1;
  CHECK_STATUS(xq_evaluate(context, query, &items, &error), XQ_ERROR);
  CHECK_OK(xq_error_number(error, &number));
  CHECK_NUMBER(number, expected);
  CHECK_OK(xq_error_free(error));
  CHECK_OK(xq_query_free(query));
}

static const char asks_for_v[] = "declare variable $v external; count($v), $v";

static void variables_stay_until_they_are_cleared(void) {
  xq_context* context = new_context();
  xq_value* value = NULL;
  CHECK_OK(xq_value_new(&value));
  CHECK_OK(xq_context_set_variable(context, "v", XQ_NUL, value));
  check_evaluation(context, asks_for_v, "0");
  CHECK_OK(xq_value_add_integer(value, 4));
  check_evaluation(context, asks_for_v, "0");
  CHECK_OK(xq_context_set_variable(context, "v", 1, value));
  CHECK_OK(xq_value_add_integer(value, 5));
  check_evaluation(context, asks_for_v, "1 4");
  CHECK_OK(xq_context_set_variable(context, "v", 1, value));
  CHECK_OK(xq_value_add_integer(value, 6));
  check_evaluation(context, asks_for_v, "2 4 5");
  check_evaluation(context, asks_for_v, "2 4 5");
  CHECK_OK(xq_value_free(value));
  CHECK_OK(xq_context_clear_variables(context));
  check_failure(context, asks_for_v, 16);
  CHECK_OK(xq_context_free(context));
}

static void variables_are_texts_and_nodes(void) {
  xq_context* context = new_context();
  xq_node* node = document_of("<a>n</a>");
  CHECK_OK(xq_context_set_variable_text(context, "v", XQ_NUL, "20", XQ_NUL));
  check_evaluation(context, "declare variable $v external; $v + 1", "21");
  CHECK_OK(xq_context_set_variable_node(context, "v", XQ_NUL, node));
  CHECK_OK(xq_node_free(node));
  check_evaluation(context, "declare variable $v external; string($v/a)", "n");
  CHECK_STATUS(xq_context_set_variable_text(context, "v", 1, "\xFF", 1), XQ_INPUT);
  CHECK_STATUS(xq_context_set_variable_text(context, "\xFF", 1, "a", 1), XQ_INPUT);
  CHECK_STATUS(xq_context_set_variable_text(context, "v", 1, "a\0b", 3), XQ_MISMATCH);
  CHECK_STATUS(xq_context_set_variable_text(context, "v", 1, "\1", 1), XQ_MISMATCH);
  CHECK_STATUS(xq_context_set_variable_text(context, "v", 1, "\1\xFF", 2), XQ_INPUT);
  CHECK_STATUS(xq_context_set_variable_text(context, "v", 1, NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_context_set_variable_text(context, NULL, 1, "a", 1), XQ_USAGE);
  CHECK_STATUS(xq_context_set_variable_node(context, "v", 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_context_set_variable(context, "v", 1, NULL), XQ_USAGE);
  check_evaluation(context, "declare variable $v external; string($v/a)", "n");
  CHECK_OK(xq_context_free(context));
}

static void names_of_variables_have_prefixes(void) {
  xq_context* context = new_context();
  CHECK_OK(xq_context_set_variable_text(context, "p:v", XQ_NUL, "x", XQ_NUL));
  CHECK_OK(xq_context_set_variable_text(context, "not a name", XQ_NUL, "x", XQ_NUL));
  check_evaluation(context, "declare namespace p = 'urn:p'; declare variable $p:v external; $p:v",
                   "x");
  CHECK_OK(xq_context_free(context));
}

static void values_come_back_as_they_went_in(void) {
  xq_context* context = new_context();
  xq_value* value = NULL;
  xq_date_time date = {2004, 10, 29, 0, 0, 0, 0, 0, 0};
  CHECK_OK(xq_value_new(&value));
  CHECK_OK(xq_value_add_text(value, XQ_TYPE_DECIMAL, "0.10", XQ_NUL));
  CHECK_OK(xq_value_add_date_time(value, XQ_TYPE_DATE, &date));
  CHECK_OK(xq_value_add_boolean(value, 1));
  CHECK_OK(xq_value_add_qname(value, "urn:p", XQ_NUL, "l", XQ_NUL, "p", XQ_NUL));
  CHECK_OK(xq_context_set_variable(context, "v", 1, value));
  check_evaluation(context,
                   "declare variable $v external; $v[1] + 0.2, $v[1] instance of xs:decimal,"
                   "year-from-date($v[2]), not($v[3]), namespace-uri-from-QName($v[4])",
                   "0.3 true 2004 false urn:p");
  CHECK_OK(xq_value_free(value));
  CHECK_OK(xq_context_free(context));
}

static void the_context_item_stays(void) {
  xq_context* context = new_context();
  xq_node* node = document_of("<a>n</a>");
  xq_value* value = result_of("7, 8");
  check_failure(context, "/a", 20);
  CHECK_OK(xq_context_set_node(context, node));
  CHECK_OK(xq_node_free(node));
  check_evaluation(context, "string(/a)", "n");
  check_evaluation(context, "string(/a)", "n");
  CHECK_OK(xq_context_set_item(context, value, 1));
  CHECK_STATUS(xq_context_set_item(context, value, 2), XQ_END);
  CHECK_STATUS(xq_context_set_item(context, NULL, 0), XQ_USAGE);
  CHECK_STATUS(xq_context_set_node(context, NULL), XQ_USAGE);
  CHECK_OK(xq_value_free(value));
  check_evaluation(context, ". + 1", "9");
  CHECK_OK(xq_context_free(context));
}

static void namespaces_are_those_of_unresolved_names(void) {
  static const xq_namespace namespaces[] = {{"p", "urn:p"}, {"q", "urn:q"}};
  static const xq_namespace no_uri[] = {{"p", NULL}};
  static const xq_namespace not_utf8[] = {{"p", "\xFF"}};
  xq_context* context = NULL;
  xq_node* node = document_of("<x:a xmlns:x='urn:p'>n</x:a>");
  CHECK_OK(xq_context_new_with_namespaces(namespaces, 2, &context));
  CHECK_OK(xq_context_set_node(context, node));
  check_evaluation(context, "string(/p:a), count(/q:a)", "n 0");
  CHECK_OK(xq_context_free(context));
  CHECK_STATUS(xq_context_new_with_namespaces(no_uri, 1, &context), XQ_USAGE);
  CHECK(context == NULL);
  CHECK_STATUS(xq_context_new_with_namespaces(not_utf8, 1, &context), XQ_INPUT);
  CHECK_STATUS(xq_context_new_with_namespaces(NULL, 1, &context), XQ_USAGE);
  CHECK_STATUS(xq_context_new_with_namespaces(namespaces, 2, NULL), XQ_USAGE);
  CHECK_OK(xq_node_free(node));
}

/* ---- callbacks ------------------------------------------------------------------------------- */

typedef struct heard {
  int calls;
  int destroyed;
  int answer;
  char label[40];
  char text[200];
  xq_context* context;
} heard;

static int hear_trace(void* data, const xq_value* value, const char* label, size_t length) {
  heard* by = (heard*)data;
  xq_text text = XQ_TEXT_INIT;
  size_t count = 0;
  CHECK_OK(xq_value_count(value, &count));
  by->calls += (int)count;
  if (count && CHECK_OK(xq_value_string(value, 0, &text))) strncpy(by->text, text.data, 199);
  CHECK_NUMBER(strlen(label), length);
  strncpy(by->label, label, 39);
  CHECK_OK(xq_text_free(&text));
  /* What is lent can be neither freed nor changed. */
  CHECK_STATUS(xq_value_free((xq_value*)value), XQ_USAGE);
  CHECK_STATUS(xq_value_add_integer((xq_value*)value, 1), XQ_USAGE);
  CHECK_STATUS(xq_value_add_string((xq_value*)value, "", 0), XQ_USAGE);
  CHECK_STATUS(xq_value_add_all((xq_value*)value, value), XQ_USAGE);
  if (by->context) {
    xq_query* query = compiled("1");
    xq_value* items = NULL;
    CHECK_STATUS(xq_evaluate(by->context, query, &items, NULL), XQ_USAGE);
    CHECK_STATUS(xq_context_free(by->context), XQ_USAGE);
    CHECK_STATUS(xq_context_clear_variables(by->context), XQ_USAGE);
    CHECK_STATUS(xq_context_set_options(by->context, NULL), XQ_USAGE);
    CHECK_STATUS(xq_context_set_trace(by->context, NULL, NULL, NULL), XQ_USAGE);
    CHECK_OK(xq_query_free(query));
    check_still_works();
  }
  return by->answer;
}

static void hear_destruction(void* data) {
  ((heard*)data)->destroyed++;
}

static void traces_are_heard(void) {
  xq_context* context = new_context();
  heard by;
  memset(&by, 0, sizeof(by));
  CHECK_OK(xq_context_set_trace(context, hear_trace, &by, hear_destruction));
  check_evaluation(context, "trace((1, 2), 'l\xC3\xA4')", "1 2");
  CHECK_NUMBER(by.calls, 2);
  CHECK(strcmp(by.label, "l\xC3\xA4") == 0);
  CHECK(strcmp(by.text, "1") == 0);
  check_evaluation(context, "count(trace((), 'none'))", "0");
  CHECK_NUMBER(by.calls, 2);
  CHECK(strcmp(by.label, "none") == 0);
  CHECK_OK(xq_context_set_trace(context, NULL, NULL, NULL));
  CHECK_NUMBER(by.destroyed, 1);
  check_evaluation(context, "trace(3, 'c')", "3");
  CHECK_NUMBER(by.calls, 2);
  CHECK_OK(xq_context_free(context));
  CHECK_NUMBER(by.destroyed, 1);
}

static void a_trace_that_fails_ends_the_evaluation(void) {
  xq_context* context = new_context();
  xq_query* query = compiled("for $i in 1 to 10 return trace($i, 'n')");
  xq_value* items = NULL;
  xq_error* error = NULL;
  heard by;
  memset(&by, 0, sizeof(by));
  by.answer = -1;
  CHECK_OK(xq_context_set_trace(context, hear_trace, &by, hear_destruction));
  CHECK_STATUS(xq_evaluate(context, query, &items, &error), XQ_HOST);
  CHECK(items == NULL && error == NULL);
  CHECK_NUMBER(by.calls, 1);
  by.answer = 0;
  CHECK_OK(xq_evaluate(context, query, &items, NULL));
  check_items(items, "1 2 3 4 5 6 7 8 9 10");
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_context_free(context));
  CHECK_NUMBER(by.destroyed, 1);
}

static void a_context_in_use_is_not_used_again(void) {
  xq_context* context = new_context();
  heard by;
  memset(&by, 0, sizeof(by));
  by.context = context;
  CHECK_OK(xq_context_set_trace(context, hear_trace, &by, NULL));
  check_evaluation(context, "trace(1, 'n')", "1");
  CHECK_NUMBER(by.calls, 1);
  CHECK_OK(xq_context_free(context));
}

static int hear_missing(void* data, const char* url, size_t length, const char* reason,
                        size_t reason_length) {
  heard* by = (heard*)data;
  by->calls++;
  CHECK_NUMBER(strlen(url), length);
  CHECK_NUMBER(strlen(reason), reason_length);
  strncpy(by->text, url, 199);
  strncpy(by->label, reason, 39);
  return by->answer;
}

static void missing_documents_are_heard_of(void) {
  xq_context* context = new_context();
  xq_options* options = NULL;
  xq_query* query = compiled("count(doc('file:///nowhere/b.xml'))");
  xq_value* items = NULL;
  heard by;
  memset(&by, 0, sizeof(by));
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_options_deny_all(options));
  CHECK_OK(xq_context_set_options(context, options));
  CHECK_OK(xq_context_set_missing(context, hear_missing, &by, hear_destruction));
  check_evaluation(context, "count(doc('file:///etc/passwd'))", "0");
  CHECK_NUMBER(by.calls, 1);
  CHECK(strcmp(by.text, "file:///etc/passwd") == 0);
  CHECK(strcmp(by.label, "not allowed") == 0);
  by.answer = 1;
  CHECK_STATUS(xq_evaluate(context, query, &items, NULL), XQ_HOST);
  CHECK(items == NULL);
  CHECK_OK(xq_context_set_missing(context, NULL, NULL, NULL));
  CHECK_NUMBER(by.destroyed, 1);
  CHECK_STATUS(xq_context_set_missing(NULL, hear_missing, &by, hear_destruction), XQ_USAGE);
  CHECK_NUMBER(by.destroyed, 2);
  CHECK_OK(xq_options_free(options));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_context_free(context));
}

const test_case contexts_tests[] = {
    {"variables stay until they are cleared", variables_stay_until_they_are_cleared},
    {"variables are texts and nodes", variables_are_texts_and_nodes},
    {"names of variables have prefixes", names_of_variables_have_prefixes},
    {"values come back as they went in", values_come_back_as_they_went_in},
    {"the context item stays", the_context_item_stays},
    {"namespaces are those of unresolved names", namespaces_are_those_of_unresolved_names},
    {"traces are heard", traces_are_heard},
    {"a trace that fails ends the evaluation", a_trace_that_fails_ends_the_evaluation},
    {"a context in use is not used again", a_context_in_use_is_not_used_again},
    {"missing documents are heard of", missing_documents_are_heard_of},
    TEST_END,
};
