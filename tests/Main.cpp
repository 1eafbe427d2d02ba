// Starts every test program, in an environment that changes nothing.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <sys/resource.h>

namespace {

// What is nested too deeply for the stack in a test is so for the usual one, whatever the
// environment allows.
void limitTheStack() {
  constexpr rlim_t usual = rlim_t{8} << 20;
  rlimit limit;
  if (::getrlimit(RLIMIT_STACK, &limit) != 0 || limit.rlim_cur <= usual) return;
  limit.rlim_cur = usual;
  ::setrlimit(RLIMIT_STACK, &limit);
}

// With the log switched on, an error of a query is one of the program too.
void switchLogsOff() {
  for (const char* name : {"XQUERY_LOG", "XQUERY_LOG_DEFAULT", "XQUERY_LOG_TOKENS",
                           "XQUERY_LOG_STATES", "XQUERY_LOG_TOKEN_SOURCE", "XQUERY_YYDEBUG"}) {
    ::unsetenv(name);
  }
}

}  // namespace

int main(int argc, char** argv) {
  limitTheStack();
  switchLogsOff();
  testing::InitGoogleMock(&argc, argv);
  return RUN_ALL_TESTS();
}
