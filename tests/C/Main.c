/* Runs the tests of the C interface: `C_tests` all of them, `C_tests SUITE...` some. */
#include "Testing.h"

#include <stdio.h>
#include <string.h>

static const test_suite suites[] = {
    {"basics", basics_tests},     {"errors", errors_tests},         {"limits", limits_tests},
    {"loading", loading_tests},   {"documents", documents_tests},   {"nodes", nodes_tests},
    {"values", values_tests},     {"items", items_tests},           {"queries", queries_tests},
    {"contexts", contexts_tests}, {"evaluation", evaluation_tests}, {"streams", streams_tests},
    {"profiles", profiles_tests}, {"threads", threads_tests},       {"faults", faults_tests},
};
enum { suite_count = sizeof(suites) / sizeof(suites[0]) };

static int is_asked_for(const char* name, int argc, char** argv) {
  int i;
  for (i = 1; i < argc; i++) {
    if (strcmp(argv[i], name) == 0) return 1;
  }
  return argc < 2;
}

int main(int argc, char** argv) {
  int passed = 0;
  int failed = 0;
  int i;
  for (i = 0; i < suite_count; i++) {
    const test_case* test = suites[i].cases;
    if (!is_asked_for(suites[i].name, argc, argv)) continue;
    for (; test->name; test++) {
      const int before = failed_checks();
      test->run();
      if (failed_checks() == before) {
        passed++;
      } else {
        failed++;
        printf("failed: %s.%s\n", suites[i].name, test->name);
      }
      fflush(stdout);
    }
  }
  printf("%d passed, %d failed\n", passed, failed);
  return failed != 0 || passed == 0;
}
