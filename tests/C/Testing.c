/* Checks, and short ways to what every test needs. */
#include "Testing.h"

#include <stdio.h>
#include <string.h>

static int failures = 0;

int failed_checks(void) {
  return failures;
}

int check_that(int is_true, const char* condition, const char* file, int line) {
  if (is_true) return 1;
  failures++;
  printf("%s:%d: not so: %s\n", file, line, condition);
  return 0;
}

int check_status(xq_status status, xq_status expected, const char* call, const char* file,
                 int line) {
  if (status == expected) return 1;
  failures++;
  printf("%s:%d: %s answers \"%s\" and not \"%s\"\n", file, line, call, xq_status_text(status),
         xq_status_text(expected));
  return 0;
}

int check_number(long long value, long long expected, const char* what, const char* file,
                 int line) {
  if (value == expected) return 1;
  failures++;
  printf("%s:%d: %s is %lld and not %lld\n", file, line, what, value, expected);
  return 0;
}

int check_text(const char* data, size_t length, const char* expected, const char* what,
               const char* file, int line) {
  if (data && expected && strlen(expected) == length && memcmp(data, expected, length + 1) == 0)
    return 1;
  failures++;
  printf("%s:%d: %s is \"%s\" (%lu) and not \"%s\"\n", file, line, what, data ? data : "(null)",
         (unsigned long)length, expected ? expected : "(nothing)");
  return 0;
}

int check_begins(const char* data, const char* expected, const char* what, const char* file,
                 int line) {
  if (data && strncmp(data, expected, strlen(expected)) == 0) return 1;
  failures++;
  printf("%s:%d: %s is \"%s\" and does not begin with \"%s\"\n", file, line, what,
         data ? data : "(null)", expected);
  return 0;
}

static void show(xq_error* error) {
  xq_string description;
  if (xq_error_description(error, &description) == XQ_OK) printf("%s\n", description.data);
  xq_error_free(error);
}

xq_query* compiled_in(xq_way way, const char* text) {
  xq_options* options;
  xq_query* query = NULL;
  xq_error* error = NULL;
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_options_set_way(options, way));
  CHECK_OK(xq_compile(text, XQ_NUL, options, &query, &error));
  show(error);
  CHECK_OK(xq_options_free(options));
  return query;
}

xq_query* compiled(const char* text) {
  xq_query* query = NULL;
  xq_error* error = NULL;
  CHECK_OK(xq_compile(text, XQ_NUL, NULL, &query, &error));
  show(error);
  return query;
}

xq_node* document_of(const char* xml) {
  xq_node* document = NULL;
  CHECK_OK(xq_read_memory(xml, strlen(xml), XQ_READ_XML, &document, NULL));
  return document;
}

static xq_value* result_for(const char* text, const xq_node* node) {
  xq_query* query = compiled(text);
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_error* error = NULL;
  CHECK_OK(xq_context_new(&context));
  if (node) CHECK_OK(xq_context_set_node(context, node));
  CHECK_OK(xq_evaluate(context, query, &items, &error));
  show(error);
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
  return items;
}

xq_value* result_of(const char* text) {
  return result_for(text, NULL);
}

void check_items(const xq_value* items, const char* expected) {
  char all[2000] = "";
  xq_text text = XQ_TEXT_INIT;
  size_t at = XQ_BEFORE;
  while (xq_value_next(items, &at) == XQ_OK) {
    CHECK_OK(xq_value_string(items, at, &text));
    if (strlen(all) + text.length + 2 > sizeof(all)) break;
    if (at > 0) strcat(all, " ");
    strcat(all, text.data);
  }
  check_text(all, strlen(all), expected, "the result", __FILE__, __LINE__);
  CHECK_OK(xq_text_free(&text));
}

void check_answer(const char* text, const xq_node* node, const char* expected) {
  xq_value* items = result_for(text, node);
  check_items(items, expected);
  CHECK_OK(xq_value_free(items));
}

void check_still_works(void) {
  check_answer("sum(for $i in 1 to 10 return $i * $i)", NULL, "385");
}

void* handle_of_another_kind(void) {
  static xq_cancel* cancel = NULL;
  if (!cancel) CHECK_OK(xq_cancel_new(&cancel));
  return cancel;
}

ptrdiff_t read_string(void* data, char* buffer, size_t size) {
  const char** rest = (const char**)data;
  size_t count = strlen(*rest);
  if (count > size) count = size;
  if (count > 7) count = 7;
  memcpy(buffer, *rest, count);
  *rest += count;
  return (ptrdiff_t)count;
}
