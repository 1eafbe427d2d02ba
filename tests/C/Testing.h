/* What the tests of the C interface share: checks that tell where they fail, and short ways to what
 * every test needs. */
#ifndef XQUERY_TESTS_C_TESTING_H
#define XQUERY_TESTS_C_TESTING_H

#include <xquery/capi.h>

#include <stddef.h>
#include <stdint.h>

/* A failed check is told and counted, and the test goes on. */
#define CHECK(condition) check_that((condition) != 0, #condition, __FILE__, __LINE__)
#define CHECK_STATUS(call, status) check_status((call), (status), #call, __FILE__, __LINE__)
#define CHECK_OK(call) CHECK_STATUS(call, XQ_OK)
#define CHECK_NUMBER(value, expected) \
  check_number((long long)(value), (long long)(expected), #value, __FILE__, __LINE__)
/* `text` is an xq_text or an xq_string. */
#define CHECK_TEXT(text, expected) \
  check_text((text).data, (text).length, (expected), #text, __FILE__, __LINE__)
#define CHECK_BEGINS(text, expected) \
  check_begins((text).data, (expected), #text, __FILE__, __LINE__)

int check_that(int is_true, const char* condition, const char* file, int line);
int check_status(xq_status status, xq_status expected, const char* call, const char* file,
                 int line);
int check_number(long long value, long long expected, const char* what, const char* file, int line);
int check_text(const char* data, size_t length, const char* expected, const char* what,
               const char* file, int line);
int check_begins(const char* data, const char* expected, const char* what, const char* file,
                 int line);
int failed_checks(void);

typedef struct test_case {
  const char* name;
  void (*run)(void);
} test_case;
#define TEST_END \
  { NULL, NULL }

typedef struct test_suite {
  const char* name;
  const test_case* cases;
} test_suite;

extern const test_case basics_tests[];
extern const test_case contexts_tests[];
extern const test_case documents_tests[];
extern const test_case errors_tests[];
extern const test_case evaluation_tests[];
extern const test_case faults_tests[];
extern const test_case items_tests[];
extern const test_case limits_tests[];
extern const test_case loading_tests[];
extern const test_case nodes_tests[];
extern const test_case profiles_tests[];
extern const test_case queries_tests[];
extern const test_case streams_tests[];
extern const test_case threads_tests[];
extern const test_case values_tests[];

/* Null where it fails, which is checked. The caller frees it. */
xq_query* compiled(const char* text);
xq_query* compiled_in(xq_way way, const char* text);
xq_node* document_of(const char* xml);
/* The result of a query without input. */
xq_value* result_of(const char* text);
/* Checks that a query answers items with these string values, separated by blanks; the node, if it
 * is not null, is the context item. */
void check_answer(const char* text, const xq_node* node, const char* expected);
/* Checks the string values of the items. */
void check_items(const xq_value* items, const char* expected);
/* Checks that the next evaluation of a fresh context works. */
void check_still_works(void);
/* Gives a stream a few bytes at a time of the text that the pointer at `data` points to, and moves
 * it on. */
ptrdiff_t read_string(void* data, char* buffer, size_t size);
/* A handle of a kind that the function under test does not take. */
void* handle_of_another_kind(void);

#endif
