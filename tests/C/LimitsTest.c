/* Time, memory and cancellation, of evaluations and compilations. */
#define _POSIX_C_SOURCE 200809L

#include "JumpingClock.h"
#include "Testing.h"

#include <pthread.h>
#include <signal.h>
#include <string.h>
#include <time.h>

static const char endless[] = "count(for $i in 1 to 1000000, $j in 1 to 1000000 return $i)";

static double now(void) {
  struct timespec time;
  clock_gettime(CLOCK_MONOTONIC, &time);
  return (double)time.tv_sec + (double)time.tv_nsec / 1e9;
}

/* Evaluates under the options and checks the message of the limit that ends it. */
static void check_limit(const xq_options* options, const char* text, const char* message) {
  xq_query* query = compiled(text);
  xq_query* small = compiled("1");
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_error* error = NULL;
  xq_category category = -1;
  xq_string found;
  CHECK_OK(xq_context_new(&context));
  CHECK_OK(xq_context_set_options(context, options));
  CHECK_STATUS(xq_evaluate(context, query, &items, &error), XQ_ERROR);
  CHECK_OK(xq_error_category(error, &category));
  CHECK_NUMBER(category, XQ_CATEGORY_LIMIT);
  CHECK_OK(xq_error_message(error, &found));
  CHECK_TEXT(found, message);
  CHECK_OK(xq_error_free(error));
  /* The context can be used again at once. */
  CHECK_OK(xq_context_set_options(context, NULL));
  CHECK_OK(xq_evaluate(context, small, &items, NULL));
  check_items(items, "1");
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_query_free(small));
}

static void a_timeout_ends_an_evaluation(void) {
  xq_options* options = NULL;
  const double start = now();
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_options_set_timeout(options, 50000000));
  check_limit(options, endless, "limit: deadline passed");
  CHECK(now() - start < 30);
  CHECK_OK(xq_options_set_timeout(options, 0));
  check_limit(options, "1", "limit: deadline passed");
  CHECK_OK(xq_options_set_timeout(options, INT64_MIN));
  check_limit(options, "1", "limit: deadline passed");
  CHECK_OK(xq_options_free(options));
}

static void a_deadline_is_one_for_all(void) {
  xq_options* options = NULL;
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_options_set_deadline(options, 20000000));
  check_limit(options, endless, "limit: deadline passed");
  check_limit(options, "1", "limit: deadline passed");
  CHECK_OK(xq_options_set_deadline(options, INT64_MIN));
  check_limit(options, "1", "limit: deadline passed");
  CHECK_OK(xq_options_set_deadline(options, INT64_MAX));
  CHECK_OK(xq_options_set_timeout(options, 20000000));
  check_limit(options, endless, "limit: deadline passed");
  CHECK_OK(xq_options_free(options));
}

static void a_memory_ceiling_ends_an_evaluation(void) {
  xq_options* options = NULL;
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_options_set_memory(options, 4000000));
  check_limit(options, "count((1 to 10000000, 1))", "limit: memory ceiling reached");
  CHECK_OK(xq_options_free(options));
}

static void limits_can_be_taken_back(void) {
  xq_options* options = NULL;
  xq_cancel* cancel = NULL;
  xq_query* query = NULL;
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_cancel_new(&cancel));
  CHECK_OK(xq_cancel_raise(cancel));
  CHECK_OK(xq_options_set_cancel(options, cancel));
  CHECK_OK(xq_options_set_timeout(options, 0));
  CHECK_OK(xq_options_set_deadline(options, 0));
  CHECK_OK(xq_options_set_memory(options, 0));
  CHECK_STATUS(xq_compile("1", 1, options, &query, NULL), XQ_ERROR);
  CHECK_OK(xq_options_clear_limits(options));
  CHECK_OK(xq_compile("1", 1, options, &query, NULL));
  CHECK_OK(xq_query_free(query));
  /* A flag alone can be taken back as well. */
  CHECK_OK(xq_options_set_cancel(options, cancel));
  CHECK_STATUS(xq_compile("1", 1, options, &query, NULL), XQ_ERROR);
  CHECK_OK(xq_options_set_cancel(options, NULL));
  CHECK_OK(xq_compile("1", 1, options, &query, NULL));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_cancel_free(cancel));
  CHECK_OK(xq_options_free(options));
}

static void* raise_soon(void* cancel) {
  const struct timespec pause = {0, 30000000};
  nanosleep(&pause, NULL);
  CHECK_OK(xq_cancel_raise((const xq_cancel*)cancel));
  return NULL;
}

static void another_thread_cancels_an_evaluation(void) {
  xq_options* options = NULL;
  xq_cancel* cancel = NULL;
  pthread_t thread;
  int is_raised = 0;
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_cancel_new(&cancel));
  CHECK_OK(xq_options_set_cancel(options, cancel));
  CHECK(pthread_create(&thread, NULL, raise_soon, cancel) == 0);
  check_limit(options, endless, "limit: evaluation cancelled");
  CHECK(pthread_join(thread, NULL) == 0);
  CHECK_OK(xq_cancel_is_raised(cancel, &is_raised));
  CHECK_NUMBER(is_raised, 1);
  /* It stays raised, until it is lowered. */
  check_limit(options, "1", "limit: evaluation cancelled");
  CHECK_OK(xq_cancel_lower(cancel));
  CHECK_OK(xq_cancel_is_raised(cancel, &is_raised));
  CHECK_NUMBER(is_raised, 0);
  CHECK_OK(xq_options_free(options));
  CHECK_OK(xq_cancel_free(cancel));
  check_still_works();
}

static xq_cancel* cancel_of_signal = NULL;

static void on_alarm(int signal) {
  (void)signal;
  xq_cancel_raise(cancel_of_signal);
}

static void a_signal_handler_cancels_an_evaluation(void) {
  xq_options* options = NULL;
  struct sigaction action;
  struct sigaction former;
  timer_t timer;
  const struct itimerspec soon = {{0, 0}, {0, 30000000}};
  memset(&action, 0, sizeof(action));
  action.sa_handler = on_alarm;
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_cancel_new(&cancel_of_signal));
  CHECK_OK(xq_options_set_cancel(options, cancel_of_signal));
  CHECK(sigaction(SIGALRM, &action, &former) == 0);
  CHECK(timer_create(CLOCK_MONOTONIC, NULL, &timer) == 0);
  CHECK(timer_settime(timer, 0, &soon, NULL) == 0);
  check_limit(options, endless, "limit: evaluation cancelled");
  CHECK(timer_delete(timer) == 0);
  CHECK(sigaction(SIGALRM, &former, NULL) == 0);
  CHECK_OK(xq_options_free(options));
  CHECK_OK(xq_cancel_free(cancel_of_signal));
}

static void a_flag_outlives_its_handle(void) {
  xq_options* options = NULL;
  xq_cancel* cancel = NULL;
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_cancel_new(&cancel));
  CHECK_OK(xq_options_set_cancel(options, cancel));
  CHECK_OK(xq_cancel_raise(cancel));
  CHECK_OK(xq_cancel_free(cancel));
  check_limit(options, "1", "limit: evaluation cancelled");
  CHECK_OK(xq_options_free(options));
}

/* What a callback does until the limit of the evaluation around it ends that; each answers the
 * status that ended it. */
typedef xq_status (*endless_work)(xq_error** error);

static xq_status evaluate_endlessly(xq_error** error) {
  xq_query* query = compiled(endless);
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_status status;
  CHECK_OK(xq_context_new(&context));
  status = xq_evaluate(context, query, &items, error);
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
  return status;
}

/* Until one compilation does not fit into what the evaluation has left. */
static xq_status compile_endlessly(xq_error** error) {
  char text[4000] = "1";
  xq_query* query = NULL;
  xq_status status;
  while (strlen(text) + 3 < sizeof(text)) strcat(text, "+1");
  while ((status = xq_compile(text, XQ_NUL, NULL, &query, error)) == XQ_OK) xq_query_free(query);
  return status;
}

static ptrdiff_t more_text(void* data, char* buffer, size_t size) {
  const int is_first = *(int*)data;
  *(int*)data = 0;
  memset(buffer, 'x', size);
  if (is_first) memcpy(buffer, "<a>", 3);
  return (ptrdiff_t)size;
}

static xq_status read_endlessly(xq_error** error) {
  int is_first = 1;
  xq_node* document = NULL;
  return xq_read_input(more_text, &is_first, XQ_READ_XML, &document, error);
}

static int do_endlessly(void* data, const xq_value* value, const char* label, size_t length) {
  xq_error* error = NULL;
  xq_category category = -1;
  xq_string message;
  (void)value, (void)label, (void)length;
  CHECK_STATUS((*(const endless_work*)data)(&error), XQ_ERROR);
  CHECK_OK(xq_error_category(error, &category));
  CHECK_NUMBER(category, XQ_CATEGORY_LIMIT);
  CHECK_OK(xq_error_message(error, &message));
  CHECK(strstr(message.data, "limit: deadline passed") != NULL);
  CHECK_OK(xq_error_free(error));
  return 0;
}

static void check_limit_within_callback(endless_work work) {
  xq_query* query = compiled("trace(1, 'label') + count(for $i in 1 to 1000000 return $i)");
  xq_options* options = NULL;
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_error* error = NULL;
  xq_string message;
  CHECK_OK(xq_options_new(&options));
  CHECK_OK(xq_options_set_timeout(options, 30000000));
  CHECK_OK(xq_context_new(&context));
  CHECK_OK(xq_context_set_options(context, options));
  CHECK_OK(xq_context_set_trace(context, do_endlessly, &work, NULL));
  CHECK_STATUS(xq_evaluate(context, query, &items, &error), XQ_ERROR);
  CHECK_OK(xq_error_message(error, &message));
  CHECK_TEXT(message, "limit: deadline passed");
  CHECK_OK(xq_error_free(error));
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_options_free(options));
  CHECK_OK(xq_query_free(query));
}

static void a_limit_ends_what_callbacks_do(void) {
  check_limit_within_callback(evaluate_endlessly);
  check_limit_within_callback(compile_endlessly);
  check_limit_within_callback(read_endlessly);
}

/* A day, or a lifetime, in either direction whenever somebody looks. Time that passes is not what
 * the clock of the day shows. */
static void a_clock_that_jumps_is_no_limit(void) {
  static const long long steps[] = {86400, -86400, 2000000000, -2000000000};
  xq_query* query = compiled(
      "count(for $i in 1 to 1000 return string(current-dateTime())),"
      "count(distinct-values(for $i in 1 to 10 return string(current-dateTime()))),"
      "exists(current-date() + xdt:dayTimeDuration('P1D'))");
  size_t i;
  for (i = 0; i < sizeof(steps) / sizeof(steps[0]); i++) {
    xq_options* options = NULL;
    xq_context* context = NULL;
    xq_value* items = NULL;
    double start;
    CHECK_OK(xq_options_new(&options));
    CHECK_OK(xq_options_set_timeout(options, 3600000000000));
    CHECK_OK(xq_context_new(&context));
    CHECK_OK(xq_context_set_options(context, options));
    jump_by(steps[i]);
    CHECK_OK(xq_evaluate(context, query, &items, NULL));
    check_items(items, "1000 1 true");
    CHECK_OK(xq_options_set_timeout(options, 20000000));
    start = now();
    check_limit(options, endless, "limit: deadline passed");
    CHECK(now() - start < 30);
#ifndef XQUERY_SANITIZED
    CHECK(looks_at_clock() > 0);
#endif
    stop_jumping();
    CHECK_OK(xq_value_free(items));
    CHECK_OK(xq_context_free(context));
    CHECK_OK(xq_options_free(options));
  }
  CHECK_OK(xq_query_free(query));
}

static void ways_and_limits_that_there_are_not_are_wrong_use(void) {
  xq_options* options = NULL;
  CHECK_OK(xq_options_new(&options));
  CHECK_STATUS(xq_options_set_way(options, XQ_WAY_PROFILED + 1), XQ_USAGE);
  CHECK_STATUS(xq_options_set_way(options, -1), XQ_USAGE);
  CHECK_STATUS(xq_options_set_loading_limit(options, -1, 1), XQ_USAGE);
  CHECK_STATUS(xq_options_set_loading_limit(options, XQ_LOADING_MODULES + 1, 1), XQ_USAGE);
  CHECK_STATUS(xq_options_forbid_addresses(options, XQ_ADDRESSES_LOCAL + 1), XQ_USAGE);
  CHECK_STATUS(xq_options_forbid_addresses(options, -1), XQ_USAGE);
  CHECK_OK(xq_options_free(options));
}

const test_case limits_tests[] = {
    {"a timeout ends an evaluation", a_timeout_ends_an_evaluation},
    {"a deadline is one for all", a_deadline_is_one_for_all},
    {"a memory ceiling ends an evaluation", a_memory_ceiling_ends_an_evaluation},
    {"limits can be taken back", limits_can_be_taken_back},
    {"another thread cancels an evaluation", another_thread_cancels_an_evaluation},
    {"a signal handler cancels an evaluation", a_signal_handler_cancels_an_evaluation},
    {"a flag outlives its handle", a_flag_outlives_its_handle},
    {"a limit ends what callbacks do", a_limit_ends_what_callbacks_do},
    {"a clock that jumps is no limit", a_clock_that_jumps_is_no_limit},
    {"ways and limits that there are not", ways_and_limits_that_there_are_not_are_wrong_use},
    TEST_END,
};
