// The zone of a process is looked up once, so what depends on it is tested in processes of their
// own: EXPECT_IN_ZONE starts the test again as a child that sets TZ, evaluates the expression (a
// std::string) and compares.
#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <string>

namespace xquery {

[[noreturn]] inline void reportAndExit(const std::string& text) {
  std::fprintf(stderr, "[%s]", text.c_str());
  std::fflush(stderr);
  std::_Exit(0);
}

class InZoneDeathTest : public ::testing::Test {
 protected:
  // A child started anew, not a fork that inherits the zone looked up here.
  void SetUp() override { GTEST_FLAG_SET(death_test_style, "threadsafe"); }
};

}  // namespace xquery

#define EXPECT_IN_ZONE(zone, expression, expected)    \
  EXPECT_EXIT(                                        \
      {                                               \
        ::setenv("TZ", std::string(zone).c_str(), 1); \
        ::xquery::reportAndExit(expression);          \
      },                                              \
      ::testing::ExitedWithCode(0), ::testing::HasSubstr("[" + std::string(expected) + "]"))
