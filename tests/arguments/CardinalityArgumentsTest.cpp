// Booleans, and what asks how many items there are.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

#include <limits>

namespace xquery::arguments {
namespace {

constexpr size_t anyCount = std::numeric_limits<size_t>::max();

Rule checked(size_t least, size_t most, const char* text) {
  return [=](const Call& call) {
    if (call[0].size() < least || call[0].size() > most) fail(6, text);
    return call[0];
  };
}

}  // namespace

const std::vector<Function>& cardinalityFunctions() {
  static const std::vector<Function> functions = {
      {"fn:true", 0, 0, [](const Call&) { return one(boolean(true)); }},
      {"fn:false", 0, 0, [](const Call&) { return one(boolean(false)); }},
      {"fn:boolean", 1, 1, [](const Call& c) { return one(boolean(effectiveBooleanValue(c[0]))); }},
      {"fn:not", 1, 1, [](const Call& c) { return one(boolean(!effectiveBooleanValue(c[0]))); }},
      {"fn:zero-or-one", 1, 1,
       checked(0, 1, "fn:zero-or-one called with a sequence containing more than one item")},
      {"fn:one-or-more", 1, 1,
       checked(1, anyCount, "fn:one-or-more called with a sequence containing zero items")},
      {"fn:exactly-one", 1, 1,
       checked(1, 1,
               "fn:exactly-one called with a sequence containing zero or more than one item")},
      {"fn:empty", 1, 1, [](const Call& c) { return one(boolean(c[0].empty())); }},
      {"fn:exists", 1, 1, [](const Call& c) { return one(boolean(!c[0].empty())); }},
      {"fn:count", 1, 1,
       [](const Call& c) { return one(integer(static_cast<int64_t>(c[0].size()))); }},
  };
  return functions;
}

TEST(CardinalityArguments, EndAsTheRulesSay) {
  expectRules(cardinalityFunctions());
}

}  // namespace xquery::arguments
