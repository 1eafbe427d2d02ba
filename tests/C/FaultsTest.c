/* Allocations that fail at the n-th call, for every n until the work is done without: a status each
 * time, and the next evaluation works. */
#include "FailingAllocations.h"
#include "Testing.h"

#include <stdio.h>
#include <string.h>

/* One piece of work, from its beginning to its end, whatever fails. Its status. */
typedef xq_status (*work)(void);

/* Whether a callback of the work found no memory, which its caller is told as its failure. */
static int callback_failed;

/* Where an error tells more than the status it is that of a query or of a document. */
static int is_expected(xq_status status) {
  return status == XQ_MEMORY || status == XQ_ERROR || status == XQ_INPUT ||
         (status == XQ_HOST && callback_failed);
}

static xq_status told(xq_status status) {
  if (status == XQ_MEMORY) callback_failed = 1;
  return status;
}

/* At some numbers only where there are many: all of the first, then every so many. */
static long next_number(long number) {
  return number < 400 ? number + 1 : number + 1 + number / 50;
}

static void fail_everywhere(const char* name, work run, int only_one) {
  long number = 1;
  for (;;) {
    xq_status status;
    long asked;
    callback_failed = 0;
    fail_from(number, only_one);
    status = run();
    asked = stop_failing();
    if (asked < number) {
      CHECK_STATUS(status, XQ_OK);
      break;
    }
    if (status != XQ_OK && !is_expected(status)) {
      printf("%s, allocation %ld: %s\n", name, number, xq_status_text(status));
      CHECK(is_expected(status));
    }
    if (number % 16 == 1) check_still_works();
    number = next_number(number);
  }
  check_still_works();
}

/* What a thread and the process make once is there before: that a thread will give back its memory
 * when it ends cannot be noted without memory, which ends the process. */
static void fail_in(const char* name, work run) {
  CHECK_OK(run());
  fail_everywhere(name, run, 1);
  fail_everywhere(name, run, 0);
}

static xq_status evaluate_over(const char* text, const char* xml) {
  xq_query* query = NULL;
  xq_context* context = NULL;
  xq_node* document = NULL;
  xq_value* items = NULL;
  xq_error* error = NULL;
  xq_text result = XQ_TEXT_INIT;
  size_t at = XQ_BEFORE;
  xq_status status = xq_compile(text, XQ_NUL, NULL, &query, &error);
  if (!status && xml) {
    status = xq_read_memory(xml, strlen(xml), XQ_READ_XML, &document, &error);
  }
  if (!status) status = xq_context_new(&context);
  if (!status && xml) status = xq_context_set_node(context, document);
  if (!status) status = xq_context_set_variable_text(context, "v", 1, "7", 1);
  if (!status) status = xq_evaluate(context, query, &items, &error);
  while (!status && (status = xq_value_next(items, &at)) == XQ_OK) {
    status = xq_value_xml(items, at, &result);
  }
  if (status == XQ_END) status = XQ_OK;
  xq_error_free(error);
  xq_text_free(&result);
  xq_value_free(items);
  xq_context_free(context);
  xq_node_free(document);
  xq_query_free(query);
  return status;
}

static const char books[] =
    "<books><book id='1'><title>A</title><price>10</price></book>"
    "<book id='2'><title>B\xC3\xA4</title><price>20</price></book></books>";

static xq_status arithmetic(void) {
  return evaluate_over("declare variable $v external; sum(for $i in 1 to 5 return $i * $v)", NULL);
}

static xq_status paths(void) {
  return evaluate_over("//book[price > 15]/title, //book/@id", books);
}

static xq_status construction(void) {
  return evaluate_over(
      "<r xmlns:p='urn:p'>{for $b in //book order by $b/title descending "
      "return <p:b n='{$b/@id}'>{$b/title/text()}</p:b>}</r>",
      books);
}

static xq_status join(void) {
  return evaluate_over("for $a in //book, $b in //book where $a/@id = $b/@id return $b/price + 1",
                       books);
}

static xq_status recursion(void) {
  return evaluate_over(
      "declare function local:f($n) { if ($n = 0) then () else ($n, "
      "local:f($n - 1)) }; local:f(10)",
      NULL);
}

static xq_status texts(void) {
  return evaluate_over(
      "replace('abc', 'b', 'x'), tokenize('a b c', ' '), upper-case('\xC3\xA4'),"
      "string-join(('a', 'b'), '-'), matches('aaa', '^a+$')",
      NULL);
}

static xq_status dates(void) {
  return evaluate_over(
      "xs:date('2004-10-29') + xdt:dayTimeDuration('P1D'),"
      "xs:dateTime('2004-10-29T12:00:00Z'), xs:decimal('12345678901234567890') * 3",
      NULL);
}

static xq_status grouping(void) {
  return evaluate_over("for $p in distinct-values(//price) return count(//book[price = $p])",
                       books);
}

static xq_status libxml_document(void) {
  return evaluate_over("count(//*)", "<!DOCTYPE a [<!ENTITY e 'x'>]><a>&e;<b/></a>");
}

static xq_status failing_query(void) {
  xq_status status = evaluate_over("declare function local:f($x) { 1 idiv $x }; local:f(0)", NULL);
  return status == XQ_ERROR ? XQ_OK : status;
}

static xq_status failing_compilation(void) {
  xq_status status = evaluate_over("$a + ", NULL);
  return status == XQ_ERROR ? XQ_OK : status;
}

static xq_status explained(void) {
  xq_options* options = NULL;
  xq_query* query = NULL;
  xq_error* error = NULL;
  xq_text plan = XQ_TEXT_INIT;
  xq_status status = xq_options_new(&options);
  if (!status) status = xq_options_set_way(options, XQ_WAY_EXPLAINED);
  if (!status) status = xq_options_allow_host(options, "example.org", XQ_NUL);
  if (!status)
    status = xq_compile("let $a := 1 return //x[y = $a]", XQ_NUL, options, &query, &error);
  if (!status) status = xq_query_plan(query, XQ_PLAN_JSON, &plan);
  xq_error_free(error);
  xq_text_free(&plan);
  xq_query_free(query);
  xq_options_free(options);
  return status;
}

static xq_status making_values(void) {
  const xq_date_time date = {2004, 10, 29, 0, 0, 0, 0, 1, 0};
  const xq_duration duration = {0, 0, 90, 0};
  xq_value* value = NULL;
  xq_value* copy = NULL;
  xq_text text = XQ_TEXT_INIT;
  size_t at = XQ_BEFORE;
  xq_status status = xq_value_new(&value);
  if (!status) status = xq_value_add_integer(value, 1);
  if (!status) status = xq_value_add_unsigned(value, UINT64_MAX);
  if (!status) status = xq_value_add_double(value, 0.5);
  if (!status) status = xq_value_add_string(value, "a text that is longer than others", XQ_NUL);
  if (!status) status = xq_value_add_text(value, XQ_TYPE_DECIMAL, "1.5", XQ_NUL);
  if (!status) status = xq_value_add_qname(value, "urn:p", XQ_NUL, "l", 1, "p", 1);
  if (!status) status = xq_value_add_bytes(value, XQ_TYPE_HEX_BINARY, "ab", 2);
  if (!status) status = xq_value_add_date_time(value, XQ_TYPE_DATE, &date);
  if (!status) status = xq_value_add_duration(value, XQ_TYPE_DAY_TIME_DURATION, &duration);
  if (!status) status = xq_value_copy(value, &copy);
  if (!status) status = xq_value_add_all(copy, value);
  while (!status && (status = xq_value_next(copy, &at)) == XQ_OK) {
    status = xq_value_string(copy, at, &text);
  }
  xq_text_free(&text);
  xq_value_free(copy);
  xq_value_free(value);
  return status == XQ_END ? XQ_OK : status;
}

static xq_status receive_text(void* data, const xq_value* item) {
  return told(xq_value_xml(item, 0, (xq_text*)data));
}

static xq_status stream(void) {
  const char* rest = books;
  xq_options* options = NULL;
  xq_query* query = NULL;
  xq_context* context = NULL;
  xq_error* error = NULL;
  xq_text text = XQ_TEXT_INIT;
  xq_status status = xq_options_new(&options);
  if (!status) status = xq_options_set_way(options, XQ_WAY_STREAMED);
  if (!status) {
    status = xq_compile("for $b in /books/book where $b/price > 5 return <t>{$b/title}</t>", XQ_NUL,
                        options, &query, &error);
  }
  if (!status) status = xq_context_new(&context);
  if (!status) {
    status =
        xq_stream_input(context, query, read_string, &rest, XQ_READ_XML, receive_text, &text, &error);
  }
  xq_error_free(error);
  xq_text_free(&text);
  xq_context_free(context);
  xq_query_free(query);
  xq_options_free(options);
  return status;
}

static xq_status load(void* data, const char* url, size_t length, xq_purpose purpose,
                      xq_resource* resource) {
  (void)data, (void)length, (void)purpose;
  if (strcmp(url, "archive://m.xq") == 0) {
    return told(xq_resource_set_data(
        resource, "module namespace m = 'urn:m'; declare function m:f($x) { $x + 1 };", XQ_NUL));
  }
  return told(xq_resource_set_data(resource, "<a><b>1</b></a>", XQ_NUL));
}

static xq_status loading(void) {
  xq_options* options = NULL;
  xq_query* query = NULL;
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_error* error = NULL;
  xq_status status = xq_options_new(&options);
  if (!status) status = xq_options_allow_scheme(options, "archive", XQ_NUL);
  if (!status) status = xq_options_set_loader(options, load, NULL, NULL);
  if (!status) {
    status = xq_compile(
        "import module namespace m = 'urn:m' at 'archive://m.xq';"
        "m:f(doc('archive://a.xml')/a/b)",
        XQ_NUL, options, &query, &error);
  }
  if (!status) status = xq_context_new(&context);
  if (!status) status = xq_context_set_options(context, options);
  if (!status) status = xq_evaluate(context, query, &items, &error);
  xq_error_free(error);
  xq_value_free(items);
  xq_context_free(context);
  xq_query_free(query);
  xq_options_free(options);
  return status;
}

static xq_status profile(void) {
  xq_options* options = NULL;
  xq_query* query = NULL;
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_profile* made = NULL;
  xq_error* error = NULL;
  xq_text text = XQ_TEXT_INIT;
  xq_status status = xq_options_new(&options);
  if (!status) status = xq_options_set_way(options, XQ_WAY_PROFILED);
  if (!status) {
    status = xq_compile("sum(for $i in 1 to 3 return $i * 2)", XQ_NUL, options, &query, &error);
  }
  if (!status) status = xq_context_new(&context);
  if (!status) status = xq_profile_new(query, &made);
  if (!status) status = xq_evaluate(context, query, &items, &error);
  if (!status) status = xq_profile_add(made, context);
  if (!status) status = xq_profile_describe(made, XQ_PROFILE_JSON, "q", 1, &text);
  xq_error_free(error);
  xq_text_free(&text);
  xq_profile_free(made);
  xq_value_free(items);
  xq_context_free(context);
  xq_query_free(query);
  xq_options_free(options);
  return status;
}

/* HTML is read on a thread of its own, whose allocations do not fail; what surrounds it does. */
static xq_status html(void) {
  static const char markup[] = "<p>one<p>two";
  xq_node* document = NULL;
  xq_error* error = NULL;
  xq_text text = XQ_TEXT_INIT;
  xq_status status = xq_read_memory(markup, strlen(markup), XQ_READ_HTML, &document, &error);
  if (!status) status = xq_node_string(document, &text);
  xq_error_free(error);
  xq_text_free(&text);
  xq_node_free(document);
  return status;
}

#define FAULT_TEST(name)              \
  static void name##_survives(void) { \
    fail_in(#name, name);             \
  }
FAULT_TEST(arithmetic)
FAULT_TEST(paths)
FAULT_TEST(construction)
FAULT_TEST(join)
FAULT_TEST(recursion)
FAULT_TEST(texts)
FAULT_TEST(dates)
FAULT_TEST(grouping)
FAULT_TEST(libxml_document)
FAULT_TEST(failing_query)
FAULT_TEST(failing_compilation)
FAULT_TEST(explained)
FAULT_TEST(making_values)
FAULT_TEST(stream)
FAULT_TEST(loading)
FAULT_TEST(profile)
FAULT_TEST(html)

const test_case faults_tests[] = {
    {"arithmetic", arithmetic_survives},
    {"paths", paths_survives},
    {"construction", construction_survives},
    {"join", join_survives},
    {"recursion", recursion_survives},
    {"texts", texts_survives},
    {"dates", dates_survives},
    {"grouping", grouping_survives},
    {"a document that libxml2 reads", libxml_document_survives},
    {"a query that fails", failing_query_survives},
    {"a query that does not compile", failing_compilation_survives},
    {"a plan", explained_survives},
    {"making values", making_values_survives},
    {"a stream", stream_survives},
    {"modules and documents of a loader", loading_survives},
    {"a profile", profile_survives},
    {"HTML", html_survives},
    TEST_END,
};
