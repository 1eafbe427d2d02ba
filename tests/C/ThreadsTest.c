/* Several threads with one query, one document and one value. */
#define _POSIX_C_SOURCE 200809L

#include "Testing.h"

#include <pthread.h>
#include <stdio.h>
#include <string.h>

enum { thread_count = 4, rounds = 20 };

typedef struct shared {
  const xq_query* query;
  const xq_node* document;
  const xq_value* value;
  xq_options* options;
} shared;

/* Nothing is checked by the functions of the tests here, which count without a lock. */
static void* ask(void* data) {
  const shared* with = (const shared*)data;
  int good = 0;
  int i;
  for (i = 0; i < rounds; i++) {
    xq_context* context = NULL;
    xq_value* items = NULL;
    xq_text text = XQ_TEXT_INIT;
    xq_node* node = NULL;
    xq_status status = xq_context_new(&context);
    if (!status) status = xq_context_set_options(context, with->options);
    if (!status) status = xq_context_set_node(context, with->document);
    if (!status) status = xq_context_set_variable(context, "v", XQ_NUL, with->value);
    if (!status) status = xq_evaluate(context, with->query, &items, NULL);
    if (!status) status = xq_value_string(items, 0, &text);
    if (!status) status = xq_node_step(with->document, XQ_STEP_FIRST_CHILD, &node);
    if (!status) status = xq_node_move(node, XQ_STEP_FIRST_CHILD);
    good += status == XQ_OK && strcmp(text.data, "5050") == 0;
    xq_node_free(node);
    xq_text_free(&text);
    xq_value_free(items);
    xq_context_free(context);
  }
  return good == rounds ? data : NULL;
}

static void threads_share_query_document_and_value(void) {
  char xml[2000] = "<a>";
  xq_node* document;
  xq_query* query = compiled("declare variable $v external; sum(/a/b) * $v[1]");
  xq_value* value = result_of("1, 2");
  pthread_t threads[thread_count];
  shared with;
  int i;
  for (i = 1; i <= 100; i++) sprintf(xml + strlen(xml), "<b>%d</b>", i);
  strcat(xml, "</a>");
  document = document_of(xml);
  with.query = query;
  with.document = document;
  with.value = value;
  CHECK_OK(xq_options_new(&with.options));
  CHECK_OK(xq_options_set_timeout(with.options, INT64_C(600000000000)));
  for (i = 0; i < thread_count; i++) CHECK(!pthread_create(&threads[i], NULL, ask, &with));
  for (i = 0; i < thread_count; i++) {
    void* good = NULL;
    CHECK(!pthread_join(threads[i], &good));
    CHECK(good != NULL);
  }
  CHECK_OK(xq_options_free(with.options));
  CHECK_OK(xq_value_free(value));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_node_free(document));
}

static void* compile_and_fail(void* data) {
  int good = 0;
  int i;
  for (i = 0; i < rounds; i++) {
    xq_query* query = NULL;
    xq_error* error = NULL;
    xq_string message;
    good += xq_compile("1 +", XQ_NUL, NULL, &query, &error) == XQ_ERROR &&
            xq_error_message(error, &message) == XQ_OK && message.length > 10;
    xq_error_free(error);
  }
  return good == rounds ? data : NULL;
}

static void threads_compile_at_once(void) {
  pthread_t threads[thread_count];
  int i;
  for (i = 0; i < thread_count; i++) {
    CHECK(!pthread_create(&threads[i], NULL, compile_and_fail, threads));
  }
  for (i = 0; i < thread_count; i++) {
    void* good = NULL;
    CHECK(!pthread_join(threads[i], &good));
    CHECK(good != NULL);
  }
}

static const char two_errors[] =
    "declare variable $a := 1; declare variable $a := 2; declare variable $a := 3; $a";

static void* look_at_error(void* data) {
  xq_place place;
  xq_error* next = NULL;
  int good = 0;
  int i;
  for (i = 0; i < rounds; i++) {
    good += xq_error_place((const xq_error*)data, &place) == XQ_OK &&
            strcmp(place.source_line.data, two_errors) == 0 &&
            xq_error_next((const xq_error*)data, &next) == XQ_OK;
    xq_error_free(next);
  }
  return good == rounds ? data : NULL;
}

static void threads_look_at_one_error(void) {
  pthread_t threads[thread_count];
  xq_query* query = NULL;
  xq_error* error = NULL;
  int i;
  CHECK_STATUS(xq_compile(two_errors, XQ_NUL, NULL, &query, &error), XQ_ERROR);
  for (i = 0; i < thread_count; i++) {
    CHECK(!pthread_create(&threads[i], NULL, look_at_error, error));
  }
  for (i = 0; i < thread_count; i++) {
    void* good = NULL;
    CHECK(!pthread_join(threads[i], &good));
    CHECK(good != NULL);
  }
  CHECK_OK(xq_error_free(error));
}

const test_case threads_tests[] = {
    {"threads share query, document and value", threads_share_query_document_and_value},
    {"threads compile at once", threads_compile_at_once},
    {"threads look at one error", threads_look_at_one_error},
    TEST_END,
};
