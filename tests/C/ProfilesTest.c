/* Profiles of queries that were compiled for it. */
#include "Testing.h"

#include <string.h>

static void evaluations_are_counted(void) {
  xq_query* query = compiled_in(XQ_WAY_PROFILED, "sum(for $i in 1 to 10 return $i * 2)");
  xq_context* context = NULL;
  xq_profile* profile = NULL;
  xq_text text = XQ_TEXT_INIT;
  uint64_t count = 1;
  int i;
  CHECK_OK(xq_context_new(&context));
  CHECK_OK(xq_profile_new(query, &profile));
  CHECK_OK(xq_profile_evaluations(profile, &count));
  CHECK_NUMBER(count, 0);
  for (i = 0; i < 3; i++) {
    xq_value* items = NULL;
    CHECK_OK(xq_evaluate(context, query, &items, NULL));
    check_items(items, "110");
    CHECK_OK(xq_value_free(items));
  }
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_profile_add(profile, context));
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_profile_evaluations(profile, &count));
  CHECK_NUMBER(count, 3);
  CHECK_OK(xq_profile_describe(profile, XQ_PROFILE_JSON, "sums.xq", XQ_NUL, &text));
  CHECK_BEGINS(text, "{");
  CHECK(strstr(text.data, "sums.xq") != NULL);
  CHECK_OK(xq_profile_describe(profile, XQ_PROFILE_TEXT, NULL, 0, &text));
  CHECK(strstr(text.data, "sum") != NULL);
  CHECK_OK(xq_profile_describe(profile, XQ_PROFILE_HTML, "", 0, &text));
  CHECK_BEGINS(text, "<!");
  CHECK_STATUS(xq_profile_describe(profile, XQ_PROFILE_HTML + 1, "", 0, &text), XQ_USAGE);
  CHECK_STATUS(xq_profile_describe(profile, -1, "", 0, &text), XQ_USAGE);
  CHECK_STATUS(xq_profile_describe(profile, XQ_PROFILE_JSON, NULL, 1, &text), XQ_USAGE);
  CHECK_STATUS(xq_profile_describe(profile, XQ_PROFILE_JSON, "\xFF", 1, &text), XQ_INPUT);
  CHECK_STATUS(xq_profile_evaluations(profile, NULL), XQ_USAGE);
  CHECK_OK(xq_profile_free(profile));
  CHECK_OK(xq_text_free(&text));
}

static void other_queries_have_no_profile(void) {
  xq_query* query = compiled("1");
  xq_query* profiled = compiled_in(XQ_WAY_PROFILED, "1");
  xq_context* context = NULL;
  xq_profile* profile = NULL;
  CHECK_STATUS(xq_profile_new(query, &profile), XQ_MISMATCH);
  CHECK(profile == NULL);
  CHECK_OK(xq_profile_new(profiled, &profile));
  CHECK_OK(xq_context_new(&context));
  CHECK_STATUS(xq_profile_add(profile, context), XQ_MISMATCH);
  CHECK_STATUS(xq_profile_add(profile, NULL), XQ_USAGE);
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_profile_free(profile));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_query_free(profiled));
}

const test_case profiles_tests[] = {
    {"evaluations are counted", evaluations_are_counted},
    {"other queries have no profile", other_queries_have_no_profile},
    TEST_END,
};
