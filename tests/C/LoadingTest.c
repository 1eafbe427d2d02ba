/* The policy, and loaders of the host's own. */
#include "Testing.h"

#include <string.h>

static xq_options* new_options(void) {
  xq_options* options = NULL;
  CHECK_OK(xq_options_new(&options));
  return options;
}

static int allows(const xq_options* options, const char* url) {
  int is_allowed = -1;
  CHECK_OK(xq_options_allows_url(options, url, XQ_NUL, &is_allowed));
  return is_allowed;
}

static void the_policy_allows_what_it_is_told(void) {
  xq_options* options = new_options();
  CHECK(allows(options, "file:///etc/passwd"));
  CHECK(allows(options, "https://example.org/"));
  CHECK(!allows(options, "gopher://example.org/"));
  CHECK_OK(xq_options_deny_all(options));
  CHECK(!allows(options, "https://example.org/"));
  CHECK_OK(xq_options_allow_scheme(options, "https", XQ_NUL));
  CHECK(allows(options, "https://example.org/"));
  CHECK(!allows(options, "http://example.org/"));
  CHECK_OK(xq_options_allow_host(options, "*.example.org", XQ_NUL));
  CHECK(!allows(options, "https://example.org/"));
  CHECK(allows(options, "https://a.example.org/"));
  CHECK_OK(xq_options_allow_urls_below(options, "http://h/a", 10));
  CHECK(allows(options, "http://h/a/b"));
  CHECK(!allows(options, "http://h/ab"));
  CHECK_OK(xq_options_allow_files_below(options, "/tmp", XQ_NUL));
  CHECK(allows(options, "file:///tmp/a"));
  CHECK(!allows(options, "file:///etc/passwd"));
  CHECK_OK(xq_options_allow_all(options));
  CHECK(allows(options, "file:///etc/passwd"));
  CHECK_OK(xq_options_forbid_addresses(options, XQ_ADDRESSES_PRIVATE));
  CHECK_OK(xq_options_forbid_addresses(options, XQ_ADDRESSES_LOCAL));
  CHECK_OK(xq_options_free(options));
}

static void text_for_the_policy_is_checked(void) {
  xq_options* options = new_options();
  int is_allowed = 1;
  CHECK_STATUS(xq_options_allow_scheme(options, "\xFF", 1), XQ_INPUT);
  CHECK_STATUS(xq_options_allow_scheme(options, NULL, 4), XQ_USAGE);
  CHECK_STATUS(xq_options_allow_host(options, "\xC3", 1), XQ_INPUT);
  CHECK_STATUS(xq_options_allow_files_below(options, "/t\0p", 4), XQ_USAGE);
  CHECK_STATUS(xq_options_allows_url(options, "a b", XQ_NUL, &is_allowed), XQ_INPUT);
  CHECK_NUMBER(is_allowed, 0);
  CHECK_STATUS(xq_options_allows_url(options, "a", 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_options_set_base_url(options, "relative", XQ_NUL), XQ_INPUT);
  CHECK_STATUS(xq_options_set_base_url(options, "a b:", XQ_NUL), XQ_INPUT);
  CHECK_STATUS(xq_options_set_base_url(options, "\xFF", 1), XQ_INPUT);
  CHECK_STATUS(xq_options_set_base_path(options, "a\0b", 3), XQ_USAGE);
  CHECK_OK(xq_options_set_base_path(options, "/tmp/query.xq", XQ_NUL));
  CHECK_OK(xq_options_free(options));
}

static void loading_limits_are_set(void) {
  xq_options* options = new_options();
  int limit;
  for (limit = XQ_LOADING_CONNECT_MILLISECONDS; limit <= XQ_LOADING_MODULES; limit++) {
    CHECK_OK(xq_options_set_loading_limit(options, limit, 7));
    CHECK_OK(xq_options_set_loading_limit(options, limit, UINT64_MAX));
  }
  CHECK_OK(xq_options_free(options));
}

/* ---- a loader of the host's own -------------------------------------------------------------- */

typedef struct archive {
  int calls;
  int destroyed;
  xq_purpose purpose; /* of the last call */
  xq_status answer;   /* for what is not there */
} archive;

static xq_status load(void* data, const char* url, size_t length, xq_purpose purpose,
                      xq_resource* resource) {
  archive* from = (archive*)data;
  from->calls++;
  from->purpose = purpose;
  CHECK_NUMBER(strlen(url), length);
  if (strcmp(url, "archive://host/greeting.xml") == 0) {
    CHECK_OK(xq_resource_set_data(resource, "<greeting>", XQ_NUL));
    CHECK_OK(xq_resource_add_data(resource, "hello</greeting>", XQ_NUL));
    CHECK_OK(xq_resource_set_media_type(resource, "application/xml", XQ_NUL));
    CHECK_OK(xq_resource_set_status(resource, 200));
    CHECK_STATUS(xq_resource_set_data(resource, NULL, 1), XQ_USAGE);
    return XQ_OK;
  }
  if (strcmp(url, "archive://host/gone.xml") == 0) {
    CHECK_OK(xq_resource_set_data(resource, "<a/>", 4));
    CHECK_OK(xq_resource_set_status(resource, 404));
    return XQ_OK;
  }
  if (strcmp(url, "archive://host/m.xq") == 0) {
    CHECK_OK(xq_resource_set_data(
        resource, "module namespace m = 'urn:m'; declare variable $m:a := 42;", XQ_NUL));
    return XQ_OK;
  }
  return from->answer;
}

static void count_destruction(void* data) {
  ((archive*)data)->destroyed++;
}

static xq_options* options_with(archive* from) {
  xq_options* options = new_options();
  from->answer = XQ_END;
  CHECK_OK(xq_options_deny_all(options));
  CHECK_OK(xq_options_allow_urls_below(options, "archive://host/", XQ_NUL));
  CHECK_OK(xq_options_set_loader(options, load, from, count_destruction));
  return options;
}

static xq_status evaluate_with(const xq_options* options, const char* text, xq_value** items) {
  xq_query* query = compiled(text);
  xq_context* context = NULL;
  xq_status status;
  CHECK_OK(xq_context_new(&context));
  CHECK_OK(xq_context_set_options(context, options));
  status = xq_evaluate(context, query, items, NULL);
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
  return status;
}

static void a_loader_fetches_what_the_policy_allows(void) {
  archive from = {0, 0, -1, XQ_END};
  xq_options* options = options_with(&from);
  xq_value* items = NULL;
  CHECK_OK(evaluate_with(options,
                         "string(doc('archive://host/greeting.xml')),"
                         "count(doc('archive://host/none.xml')),"
                         "count(doc('archive://host/gone.xml')),"
                         "count(doc('archive://other/greeting.xml'))",
                         &items));
  check_items(items, "hello 0 0 0");
  CHECK_NUMBER(from.calls, 3);
  CHECK_NUMBER(from.purpose, XQ_PURPOSE_DOCUMENT);
  CHECK_OK(xq_value_free(items));
  CHECK_NUMBER(from.destroyed, 0);
  CHECK_OK(xq_options_free(options));
  CHECK_NUMBER(from.destroyed, 1);
}

static void a_loader_fetches_modules(void) {
  archive from = {0, 0, -1, XQ_END};
  xq_options* options = options_with(&from);
  xq_query* query = NULL;
  xq_error* error = NULL;
  int64_t number = 0;
  CHECK_OK(xq_options_set_base_url(options, "archive://host/main.xq", XQ_NUL));
  CHECK_OK(xq_compile("import module namespace m = 'urn:m' at 'm.xq'; $m:a", XQ_NUL, options,
                      &query, &error));
  CHECK_NUMBER(from.purpose, XQ_PURPOSE_MODULE);
  CHECK_OK(xq_query_free(query));
  CHECK_STATUS(xq_compile("import module namespace m = 'urn:m' at 'none.xq'; $m:a", XQ_NUL, options,
                          &query, &error),
               XQ_ERROR);
  CHECK_OK(xq_error_number(error, &number));
  CHECK_NUMBER(number, 47);
  CHECK_OK(xq_error_free(error));
  CHECK_OK(xq_options_free(options));
}

static void a_loader_that_fails_ends_the_work(void) {
  archive from = {0, 0, -1, XQ_END};
  xq_options* options = options_with(&from);
  xq_value* items = NULL;
  xq_query* query = NULL;
  from.answer = XQ_MEMORY;
  CHECK_STATUS(evaluate_with(options, "doc('archive://host/none.xml')", &items), XQ_HOST);
  CHECK(items == NULL);
  CHECK_STATUS(xq_compile("import module namespace m = 'urn:m' at 'archive://host/x.xq'; 1", XQ_NUL,
                          options, &query, NULL),
               XQ_HOST);
  CHECK(query == NULL);
  /* On a thread of its own as well. */
  CHECK_OK(xq_options_set_timeout(options, INT64_C(60000000000)));
  CHECK_STATUS(evaluate_with(options, "doc('archive://host/none.xml')", &items), XQ_HOST);
  CHECK_NUMBER(from.calls, 3);
  CHECK_OK(xq_options_free(options));
  check_still_works();
}

static void data_of_a_loader_is_destroyed_once(void) {
  archive first = {0, 0, -1, XQ_END};
  archive second = {0, 0, -1, XQ_END};
  xq_options* options = options_with(&first);
  xq_context* context = NULL;
  CHECK_OK(xq_context_new(&context));
  CHECK_OK(xq_context_set_options(context, options));
  CHECK_OK(xq_options_set_loader(options, load, &second, count_destruction));
  CHECK_NUMBER(first.destroyed, 0); /* the context has it */
  CHECK_OK(xq_context_free(context));
  CHECK_NUMBER(first.destroyed, 1);
  CHECK_OK(xq_options_set_loader(options, NULL, NULL, NULL));
  CHECK_NUMBER(second.destroyed, 1);
  /* Where it is not taken, too. */
  CHECK_STATUS(xq_options_set_loader(NULL, load, &second, count_destruction), XQ_USAGE);
  CHECK_NUMBER(second.destroyed, 2);
  CHECK_OK(xq_options_set_loader(options, NULL, &second, count_destruction));
  CHECK_NUMBER(second.destroyed, 3);
  CHECK_OK(xq_options_free(options));
  CHECK_NUMBER(second.destroyed, 3);
}

const test_case loading_tests[] = {
    {"the policy allows what it is told", the_policy_allows_what_it_is_told},
    {"text for the policy is checked", text_for_the_policy_is_checked},
    {"loading limits are set", loading_limits_are_set},
    {"a loader fetches what the policy allows", a_loader_fetches_what_the_policy_allows},
    {"a loader fetches modules", a_loader_fetches_modules},
    {"a loader that fails ends the work", a_loader_that_fails_ends_the_work},
    {"data of a loader is destroyed once", data_of_a_loader_is_destroyed_once},
    TEST_END,
};
