#include <xquery/capi.h>

#include <stdio.h>
#include <stdlib.h>
#include <string.h>

/* Ends the program at a failure, with what is known of it. */
static void check(xq_status status, xq_error* error) {
  xq_string description;
  if (status == XQ_OK) return;
  if (!error || xq_error_description(error, &description) != XQ_OK) {
    description.data = xq_status_text(status);
  }
  fprintf(stderr, "%s\n", description.data);
  exit(1);
}

static xq_query* compiled(const char* text) {
  xq_query* query;
  xq_error* error;
  check(xq_compile(text, XQ_NUL, NULL, &query, &error), error);
  return query;
}

static void print_titles(const xq_node* books) {
  xq_query* query = compiled("declare variable $limit external; //book[price > $limit]/title");
  xq_context* context;
  xq_value *limit, *items;
  xq_error* error;
  xq_text text = XQ_TEXT_INIT;
  size_t at = XQ_BEFORE;
  check(xq_value_new(&limit), NULL);
  check(xq_value_add_integer(limit, 20), NULL);
  check(xq_context_new(&context), NULL);
  check(xq_context_set_node(context, books), NULL);
  check(xq_context_set_variable(context, "limit", XQ_NUL, limit), NULL);
  check(xq_evaluate(context, query, &items, &error), error);
  while (xq_value_next(items, &at) == XQ_OK) {
    check(xq_value_type_name(items, at, &text), NULL);
    printf("%s ", text.data);
    check(xq_value_xml(items, at, &text), NULL);
    printf("%s\n", text.data);
  }
  xq_text_free(&text);
  xq_value_free(items);
  xq_value_free(limit);
  xq_context_free(context);
  xq_query_free(query);
}

static void print_values(void) {
  xq_query* query = compiled("2 + 3, 0.1 + 0.2, xs:date('2004-10-29')");
  xq_context* context;
  xq_value* items;
  xq_error* error;
  xq_text decimal = XQ_TEXT_INIT;
  xq_date_time date;
  int64_t sum;
  check(xq_context_new(&context), NULL);
  check(xq_evaluate(context, query, &items, &error), error);
  check(xq_value_integer(items, 0, &sum), NULL);
  check(xq_value_string(items, 1, &decimal), NULL);
  check(xq_value_date_time(items, 2, &date), NULL);
  printf("%d, %s, %d of %d\n", (int)sum, decimal.data, (int)date.month, (int)date.year);
  xq_text_free(&decimal);
  xq_value_free(items);
  xq_context_free(context);
  xq_query_free(query);
}

static void walk(const xq_node* books) {
  xq_node* node;
  xq_text text = XQ_TEXT_INIT;
  check(xq_node_share(books, &node), NULL);
  while (xq_node_move(node, XQ_STEP_NEXT) == XQ_OK) {
    if (xq_node_attribute(node, "isbn", XQ_NUL, &text) == XQ_OK) printf("%s ", text.data);
  }
  printf("\n");
  xq_text_free(&text);
  xq_node_free(node);
}

static void print_error(void) {
  xq_query* query = compiled("declare function local:f($x) { 1 idiv $x };\nlocal:f(0)");
  xq_context* context;
  xq_value* items;
  xq_error* error;
  xq_string message;
  xq_place place;
  xq_call call;
  check(xq_context_new(&context), NULL);
  if (xq_evaluate(context, query, &items, &error) == XQ_ERROR &&
      xq_error_message(error, &message) == XQ_OK && xq_error_place(error, &place) == XQ_OK &&
      xq_error_call(error, 0, &call) == XQ_OK) {
    printf("%s at %d:%d, in %s called at %d:%d\n", message.data, (int)place.line, (int)place.column,
           call.function.data, (int)call.place.line, (int)call.place.column);
  }
  xq_error_free(error);
  xq_context_free(context);
  xq_query_free(query);
}

static void stay_within_limits(void) {
  xq_query* query = compiled("count(for $i in 1 to 1000000, $j in 1 to 1000000 return $i)");
  xq_options* options;
  xq_cancel* cancel; /* for another thread or a signal handler: xq_cancel_raise(cancel) */
  xq_context* context;
  xq_value* items;
  xq_error* error;
  xq_string message;
  check(xq_options_new(&options), NULL);
  check(xq_cancel_new(&cancel), NULL);
  check(xq_options_set_cancel(options, cancel), NULL);
  check(xq_options_set_timeout(options, 50000000), NULL);
  check(xq_options_set_memory(options, 512000000), NULL);
  check(xq_context_new(&context), NULL);
  check(xq_context_set_options(context, options), NULL);
  if (xq_evaluate(context, query, &items, &error) == XQ_ERROR &&
      xq_error_message(error, &message) == XQ_OK) {
    printf("%s\n", message.data);
  }
  xq_error_free(error);
  xq_context_free(context);
  xq_cancel_free(cancel);
  xq_options_free(options);
  xq_query_free(query);
}

static xq_status load(void* data, const char* url, size_t length, xq_purpose purpose,
                      xq_resource* resource) {
  (void)data, (void)length, (void)purpose;
  if (strcmp(url, "archive://host/greeting.xml") != 0) return XQ_END;
  return xq_resource_set_data(resource, "<greeting>hello</greeting>", XQ_NUL);
}

static int missing(void* data, const char* url, size_t length, const char* reason,
                   size_t reason_length) {
  (void)data, (void)length, (void)reason_length;
  printf("%s is missing: %s\n", url, reason);
  return 0;
}

static void load_from_an_archive(void) {
  xq_query* query =
      compiled("string(doc('archive://host/greeting.xml')), doc('file:///etc/passwd')");
  xq_options* options;
  xq_context* context;
  xq_value* items;
  xq_error* error;
  xq_text text = XQ_TEXT_INIT;
  check(xq_options_new(&options), NULL);
  check(xq_options_deny_all(options), NULL);
  check(xq_options_allow_urls_below(options, "archive://host/", XQ_NUL), NULL);
  check(xq_options_set_loader(options, load, NULL, NULL), NULL);
  check(xq_context_new(&context), NULL);
  check(xq_context_set_options(context, options), NULL);
  check(xq_context_set_missing(context, missing, NULL, NULL), NULL);
  check(xq_evaluate(context, query, &items, &error), error);
  check(xq_value_string(items, 0, &text), NULL);
  printf("%s\n", text.data);
  xq_text_free(&text);
  xq_value_free(items);
  xq_context_free(context);
  xq_options_free(options);
  xq_query_free(query);
}

int main(int argc, char** argv) {
  const char* file = argc > 1 ? argv[1] : "examples/books.xml";
  xq_node* books;
  xq_error* error;
  check(xq_read_file(file, XQ_NUL, XQ_READ_XML, &books, &error), error);
  print_titles(books);
  print_values();
  walk(books);
  print_error();
  stay_within_limits();
  load_from_an_archive();
  xq_node_free(books);
  return 0;
}
