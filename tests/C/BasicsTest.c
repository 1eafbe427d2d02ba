/* Statuses, text, versions, memory, and what every function does with null and foreign handles. */
#include "Testing.h"

#include <stdio.h>
#include <string.h>

static void every_status_has_a_text_of_its_own(void) {
  int status;
  for (status = XQ_OK; status <= XQ_INTERNAL; status++) {
    int other;
    CHECK(strlen(xq_status_text(status)) > 1);
    for (other = XQ_OK; other < status; other++) {
      CHECK(strcmp(xq_status_text(status), xq_status_text(other)) != 0);
    }
  }
  CHECK(strcmp(xq_status_text(XQ_INTERNAL + 1), "unknown status") == 0);
  CHECK(strcmp(xq_status_text(-1), "unknown status") == 0);
}

static void header_and_library_are_of_one_version(void) {
  char text[40];
  sprintf(text, "%d.%d.%d", XQ_VERSION_MAJOR, XQ_VERSION_MINOR, XQ_VERSION_PATCH);
  CHECK(strcmp(xq_version(), text) == 0);
  CHECK_NUMBER(xq_version_number(),
               XQ_VERSION_MAJOR * 1000000 + XQ_VERSION_MINOR * 1000 + XQ_VERSION_PATCH);
}

static void a_text_is_used_again_and_again(void) {
  xq_text text = XQ_TEXT_INIT;
  xq_value* value = result_of("'a', string-join(for $i in 1 to 500 return 'xy', ''), 'b'");
  const char* data;
  CHECK_OK(xq_value_string(value, 0, &text));
  CHECK_TEXT(text, "a");
  CHECK_OK(xq_value_string(value, 1, &text));
  CHECK_NUMBER(text.length, 1000);
  CHECK_NUMBER(strlen(text.data), 1000);
  data = text.data;
  CHECK_OK(xq_value_string(value, 2, &text));
  CHECK_TEXT(text, "b");
  CHECK(text.data == data);
  /* A failure empties it. */
  CHECK_STATUS(xq_value_string(value, 3, &text), XQ_END);
  CHECK_TEXT(text, "");
  CHECK_OK(xq_value_string(value, 0, &text));
  CHECK_STATUS(xq_value_string(NULL, 0, &text), XQ_USAGE);
  CHECK_TEXT(text, "");
  CHECK_OK(xq_text_free(&text));
  CHECK_TEXT(text, "");
  CHECK_OK(xq_text_free(&text));
  CHECK_OK(xq_text_free(NULL));
  CHECK_OK(xq_value_free(value));
}

static void an_unused_text_is_empty_after_a_failure(void) {
  xq_text text = XQ_TEXT_INIT;
  CHECK_STATUS(xq_node_name(NULL, &text), XQ_USAGE);
  CHECK_TEXT(text, "");
  CHECK_OK(xq_text_free(&text));
}

static void idle_memory_is_given_back(void) {
  CHECK_OK(xq_release_idle_memory());
  check_still_works();
}

/* Each of these has to answer XQ_USAGE, or XQ_OK where null is let pass. */
static void null_handles_are_wrong_use(void) {
  int64_t number = 1;
  int flag = 1;
  size_t count = 1;
  xq_text text = XQ_TEXT_INIT;
  xq_text second = XQ_TEXT_INIT;
  xq_text third = XQ_TEXT_INIT;
  xq_string string;
  xq_place place;
  xq_call call;
  xq_error* error = NULL;
  xq_node* node = NULL;
  xq_value* value = NULL;
  xq_profile* profile = NULL;
  xq_warning warning;
  uint64_t big = 1;
  double real = 1;
  xq_date_time fields = {2004, 1, 1, 0, 0, 0, 0, 0, 0};
  xq_duration duration = {0, 0, 0, 0};
  CHECK_STATUS(xq_error_number(NULL, &number), XQ_USAGE);
  CHECK_NUMBER(number, 0);
  CHECK_STATUS(xq_error_category(NULL, &flag), XQ_USAGE);
  CHECK_NUMBER(flag, 0);
  CHECK_STATUS(xq_error_message(NULL, &string), XQ_USAGE);
  CHECK_TEXT(string, "");
  CHECK_STATUS(xq_error_description(NULL, &string), XQ_USAGE);
  CHECK_STATUS(xq_error_line(NULL, &number, &number), XQ_USAGE);
  CHECK_STATUS(xq_error_place(NULL, &place), XQ_USAGE);
  CHECK_TEXT(place.source_line, "");
  CHECK_STATUS(xq_error_call(NULL, 0, &call), XQ_USAGE);
  CHECK_STATUS(xq_error_calls_left_out(NULL, &number), XQ_USAGE);
  CHECK_STATUS(xq_error_next(NULL, &error), XQ_USAGE);
  CHECK_STATUS(xq_cancel_raise(NULL), XQ_USAGE);
  CHECK_STATUS(xq_cancel_lower(NULL), XQ_USAGE);
  CHECK_STATUS(xq_cancel_is_raised(NULL, &flag), XQ_USAGE);
  CHECK_STATUS(xq_options_set_way(NULL, XQ_WAY_PLAIN), XQ_USAGE);
  CHECK_STATUS(xq_options_set_timeout(NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_options_set_deadline(NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_options_set_memory(NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_options_set_cancel(NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_options_clear_limits(NULL), XQ_USAGE);
  CHECK_STATUS(xq_options_deny_all(NULL), XQ_USAGE);
  CHECK_STATUS(xq_options_allow_all(NULL), XQ_USAGE);
  CHECK_STATUS(xq_options_allow_scheme(NULL, "http", XQ_NUL), XQ_USAGE);
  CHECK_STATUS(xq_options_allow_files_below(NULL, "/", XQ_NUL), XQ_USAGE);
  CHECK_STATUS(xq_options_allow_urls_below(NULL, "http://h/", XQ_NUL), XQ_USAGE);
  CHECK_STATUS(xq_options_allow_host(NULL, "h", XQ_NUL), XQ_USAGE);
  CHECK_STATUS(xq_options_forbid_addresses(NULL, XQ_ADDRESSES_LOCAL), XQ_USAGE);
  CHECK_STATUS(xq_options_allows_url(NULL, "http://h/", XQ_NUL, &flag), XQ_USAGE);
  CHECK_STATUS(xq_options_set_loading_limit(NULL, XQ_LOADING_BYTES, 1), XQ_USAGE);
  CHECK_STATUS(xq_options_set_base_url(NULL, "http://h/", XQ_NUL), XQ_USAGE);
  CHECK_STATUS(xq_options_set_base_path(NULL, "/", XQ_NUL), XQ_USAGE);
  CHECK_STATUS(xq_options_set_loader(NULL, NULL, NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_resource_set_data(NULL, "", 0), XQ_USAGE);
  CHECK_STATUS(xq_resource_add_data(NULL, "", 0), XQ_USAGE);
  CHECK_STATUS(xq_resource_set_status(NULL, 200), XQ_USAGE);
  CHECK_STATUS(xq_resource_set_media_type(NULL, "a/b", XQ_NUL), XQ_USAGE);
  CHECK_STATUS(xq_node_document_uri(NULL, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_share(NULL, &node), XQ_USAGE);
  CHECK_STATUS(xq_node_kind(NULL, &flag), XQ_USAGE);
  CHECK_STATUS(xq_node_name(NULL, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_local_name(NULL, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_prefix(NULL, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_namespace_uri(NULL, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_string(NULL, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_path(NULL, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_step(NULL, XQ_STEP_PARENT, &node), XQ_USAGE);
  CHECK_STATUS(xq_node_move(NULL, XQ_STEP_PARENT), XQ_USAGE);
  CHECK_STATUS(xq_node_child_count(NULL, &count), XQ_USAGE);
  CHECK_STATUS(xq_node_attribute_count(NULL, &count), XQ_USAGE);
  CHECK_STATUS(xq_node_child(NULL, 0, &node), XQ_USAGE);
  CHECK_STATUS(xq_node_attribute(NULL, "a", XQ_NUL, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_attribute_ns(NULL, "", 0, "a", XQ_NUL, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_is_same(NULL, NULL, &flag), XQ_USAGE);
  CHECK_STATUS(xq_node_compare(NULL, NULL, &flag), XQ_USAGE);
  CHECK_STATUS(xq_node_xml(NULL, XQ_WRITE_XML, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_write(NULL, XQ_WRITE_XML, NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_copy(NULL, &value), XQ_USAGE);
  CHECK_STATUS(xq_value_add_integer(NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_value_add_unsigned(NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_value_add_double(NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_value_add_float(NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_value_add_boolean(NULL, 1), XQ_USAGE);
  CHECK_STATUS(xq_value_add_string(NULL, "", 0), XQ_USAGE);
  CHECK_STATUS(xq_value_add_untyped(NULL, "", 0), XQ_USAGE);
  CHECK_STATUS(xq_value_add_text(NULL, XQ_TYPE_DATE, "2004-01-01", XQ_NUL), XQ_USAGE);
  CHECK_STATUS(xq_value_add_qname(NULL, "", 0, "a", 1, "", 0), XQ_USAGE);
  CHECK_STATUS(xq_value_add_bytes(NULL, XQ_TYPE_HEX_BINARY, "", 0), XQ_USAGE);
  CHECK_STATUS(xq_value_add_date_time(NULL, XQ_TYPE_DATE, &fields), XQ_USAGE);
  CHECK_STATUS(xq_value_add_duration(NULL, XQ_TYPE_DURATION, &duration), XQ_USAGE);
  CHECK_STATUS(xq_value_add_node(NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_add_all(NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_count(NULL, &count), XQ_USAGE);
  CHECK_STATUS(xq_value_next(NULL, &count), XQ_USAGE);
  CHECK_STATUS(xq_value_type(NULL, 0, &flag), XQ_USAGE);
  CHECK_STATUS(xq_value_type_name(NULL, 0, &text), XQ_USAGE);
  CHECK_STATUS(xq_value_string(NULL, 0, &text), XQ_USAGE);
  CHECK_STATUS(xq_value_xml(NULL, 0, &text), XQ_USAGE);
  CHECK_STATUS(xq_value_integer(NULL, 0, &number), XQ_USAGE);
  CHECK_STATUS(xq_value_unsigned(NULL, 0, &big), XQ_USAGE);
  CHECK_STATUS(xq_value_double(NULL, 0, &real), XQ_USAGE);
  CHECK_STATUS(xq_value_boolean(NULL, 0, &flag), XQ_USAGE);
  CHECK_STATUS(xq_value_qname(NULL, 0, &text, &second, &third), XQ_USAGE);
  CHECK_STATUS(xq_value_bytes(NULL, 0, &text), XQ_USAGE);
  CHECK_STATUS(xq_value_date_time(NULL, 0, &fields), XQ_USAGE);
  CHECK_STATUS(xq_value_duration(NULL, 0, &duration), XQ_USAGE);
  CHECK_STATUS(xq_value_node(NULL, 0, &node), XQ_USAGE);
  CHECK_STATUS(xq_query_plan(NULL, XQ_PLAN_TEXT, &text), XQ_USAGE);
  CHECK_STATUS(xq_query_stream_plan(NULL, &text), XQ_USAGE);
  CHECK_STATUS(xq_query_warning(NULL, 0, &warning), XQ_USAGE);
  CHECK_STATUS(xq_context_set_options(NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_context_set_variable(NULL, "a", 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_context_set_variable_text(NULL, "a", 1, "b", 1), XQ_USAGE);
  CHECK_STATUS(xq_context_set_variable_node(NULL, "a", 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_context_clear_variables(NULL), XQ_USAGE);
  CHECK_STATUS(xq_context_set_node(NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_context_set_item(NULL, NULL, 0), XQ_USAGE);
  CHECK_STATUS(xq_context_set_trace(NULL, NULL, NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_context_set_missing(NULL, NULL, NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_evaluate(NULL, NULL, &value, &error), XQ_USAGE);
  CHECK_STATUS(xq_stream_file(NULL, NULL, "a", 1, 0, NULL, NULL, &error), XQ_USAGE);
  CHECK_STATUS(xq_stream_input(NULL, NULL, NULL, NULL, 0, NULL, NULL, &error), XQ_USAGE);
  CHECK_STATUS(xq_profile_new(NULL, &profile), XQ_USAGE);
  CHECK_STATUS(xq_profile_add(NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_profile_evaluations(NULL, &big), XQ_USAGE);
  CHECK_STATUS(xq_profile_describe(NULL, XQ_PROFILE_JSON, "", 0, &text), XQ_USAGE);
  CHECK(!error && !node && !value && !profile);
  xq_text_free(&text);
  xq_text_free(&second);
  xq_text_free(&third);
}

static void freeing_null_is_let_pass(void) {
  CHECK_OK(xq_error_free(NULL));
  CHECK_OK(xq_cancel_free(NULL));
  CHECK_OK(xq_options_free(NULL));
  CHECK_OK(xq_node_free(NULL));
  CHECK_OK(xq_value_free(NULL));
  CHECK_OK(xq_query_free(NULL));
  CHECK_OK(xq_context_free(NULL));
  CHECK_OK(xq_profile_free(NULL));
}

static void handles_of_another_kind_are_neither_used_nor_freed(void) {
  void* foreign = handle_of_another_kind();
  xq_text text = XQ_TEXT_INIT;
  xq_query* query = NULL;
  xq_value* value = NULL;
  size_t count = 0;
  int64_t number = 0;
  int is_raised = 1;
  CHECK_STATUS(xq_error_free((xq_error*)foreign), XQ_USAGE);
  CHECK_STATUS(xq_options_free((xq_options*)foreign), XQ_USAGE);
  CHECK_STATUS(xq_node_free((xq_node*)foreign), XQ_USAGE);
  CHECK_STATUS(xq_value_free((xq_value*)foreign), XQ_USAGE);
  CHECK_STATUS(xq_query_free((xq_query*)foreign), XQ_USAGE);
  CHECK_STATUS(xq_context_free((xq_context*)foreign), XQ_USAGE);
  CHECK_STATUS(xq_profile_free((xq_profile*)foreign), XQ_USAGE);
  CHECK_STATUS(xq_error_number((xq_error*)foreign, &number), XQ_USAGE);
  CHECK_STATUS(xq_options_set_way((xq_options*)foreign, XQ_WAY_PLAIN), XQ_USAGE);
  CHECK_STATUS(xq_compile("1", 1, (xq_options*)foreign, &query, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_name((xq_node*)foreign, &text), XQ_USAGE);
  CHECK_STATUS(xq_value_count((xq_value*)foreign, &count), XQ_USAGE);
  CHECK_STATUS(xq_value_add_integer((xq_value*)foreign, 1), XQ_USAGE);
  CHECK_STATUS(xq_evaluate((xq_context*)foreign, (xq_query*)foreign, &value, NULL), XQ_USAGE);
  CHECK_STATUS(xq_query_plan((xq_query*)foreign, XQ_PLAN_TEXT, &text), XQ_USAGE);
  CHECK_STATUS(xq_profile_add((xq_profile*)foreign, (xq_context*)foreign), XQ_USAGE);
  CHECK_STATUS(xq_resource_set_status((xq_resource*)foreign, 1), XQ_USAGE);
  CHECK_STATUS(xq_options_set_cancel((xq_options*)foreign, (xq_cancel*)foreign), XQ_USAGE);
  /* It is as good as before. */
  CHECK_OK(xq_cancel_is_raised((xq_cancel*)foreign, &is_raised));
  CHECK_NUMBER(is_raised, 0);
  xq_text_free(&text);
}

/* Nothing may be written where there is no place for it. */
static void missing_places_for_answers_are_wrong_use(void) {
  xq_value* items = result_of("<a b='1'>c</a>, 1, xs:date('2004-01-01'), xs:QName('a')");
  xq_node* node = NULL;
  xq_query* query = compiled("1");
  xq_context* context = NULL;
  xq_cancel* cancel = (xq_cancel*)handle_of_another_kind();
  xq_text text = XQ_TEXT_INIT;
  xq_text other = XQ_TEXT_INIT;
  CHECK_OK(xq_context_new(&context));
  CHECK_OK(xq_value_node(items, 0, &node));
  CHECK_STATUS(xq_cancel_new(NULL), XQ_USAGE);
  CHECK_STATUS(xq_cancel_is_raised(cancel, NULL), XQ_USAGE);
  CHECK_STATUS(xq_options_new(NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_new(NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_copy(items, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_count(items, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_next(items, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_type(items, 0, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_type_name(items, 0, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_string(items, 0, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_xml(items, 0, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_integer(items, 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_unsigned(items, 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_double(items, 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_boolean(items, 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_bytes(items, 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_date_time(items, 2, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_duration(items, 2, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_node(items, 0, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_qname(items, 3, NULL, &text, &other), XQ_USAGE);
  CHECK_STATUS(xq_value_qname(items, 3, &text, NULL, &other), XQ_USAGE);
  CHECK_STATUS(xq_value_qname(items, 3, &text, &other, NULL), XQ_USAGE);
  CHECK_STATUS(xq_value_qname(items, 3, &text, &text, &other), XQ_USAGE);
  CHECK_STATUS(xq_node_share(node, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_kind(node, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_name(node, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_step(node, XQ_STEP_PARENT, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_child(node, 0, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_child_count(node, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_attribute_count(node, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_attribute(node, "b", 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_attribute_ns(node, "", 0, "b", 1, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_is_same(node, node, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_compare(node, node, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_xml(node, XQ_WRITE_XML, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_write(node, XQ_WRITE_XML, NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_node_document_uri(node, NULL), XQ_USAGE);
  CHECK_STATUS(xq_read_memory("<a/>", 4, XQ_READ_XML, NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_read_file("a", 1, XQ_READ_XML, NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_compile("1", 1, NULL, NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_query_plan(query, XQ_PLAN_TEXT, NULL), XQ_USAGE);
  CHECK_STATUS(xq_query_stream_plan(query, NULL), XQ_USAGE);
  CHECK_STATUS(xq_query_warning(query, 0, NULL), XQ_USAGE);
  CHECK_STATUS(xq_context_new(NULL), XQ_USAGE);
  CHECK_STATUS(xq_evaluate(context, query, NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_profile_new(query, NULL), XQ_USAGE);
  xq_node_free(node);
  xq_value_free(items);
  xq_context_free(context);
  xq_query_free(query);
  xq_text_free(&text);
  xq_text_free(&other);
}

const test_case basics_tests[] = {
    {"every status has a text of its own", every_status_has_a_text_of_its_own},
    {"header and library are of one version", header_and_library_are_of_one_version},
    {"a text is used again and again", a_text_is_used_again_and_again},
    {"an unused text is empty after a failure", an_unused_text_is_empty_after_a_failure},
    {"idle memory is given back", idle_memory_is_given_back},
    {"null handles are wrong use", null_handles_are_wrong_use},
    {"freeing null is let pass", freeing_null_is_let_pass},
    {"handles of another kind", handles_of_another_kind_are_neither_used_nor_freed},
    {"missing places for answers are wrong use", missing_places_for_answers_are_wrong_use},
    TEST_END,
};
