// The families leave no built-in function out.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

#include <map>

namespace xquery::arguments {
namespace {

TEST(AllFunctions, HaveOneRuleEach) {
  std::map<std::string, int> rules;
  std::map<std::string, int> inNamespace;
  for (const auto* family : families()) {
    for (const Function& function : *family) {
      EXPECT_EQ(++rules[function.name], 1) << function.name;
      ++inNamespace[function.name.substr(0, function.name.find(':'))];
    }
  }
  EXPECT_EQ(rules.size(), 173U);
  EXPECT_EQ(inNamespace,
            (std::map<std::string, int>{{"fn", 109}, {"xs", 41}, {"xdt", 3}, {"ext", 20}}));
}

}  // namespace
}  // namespace xquery::arguments
