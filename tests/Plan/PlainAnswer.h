// What a query answers when it is evaluated as it is written.
#pragma once

#include "Functions/FunctionsTesting.h"
#include "xquery/xquery.h"

#include <cstdlib>
#include <string>
#include <string_view>

namespace xquery::plantest {

inline std::string plainAnswer(std::string_view query, const Value& contextItem = Value(),
                               const XQueryVariables& constants = {}) {
  ::setenv("XQUERY_PLAN", "0", 1);
  std::string text = functiontest::answer(query, contextItem, constants);
  ::unsetenv("XQUERY_PLAN");
  return text;
}

}  // namespace xquery::plantest
