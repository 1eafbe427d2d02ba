#include "Context/KeptValues.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/FunctionsTesting.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

namespace xquery {
namespace {

using functiontest::integer;
using functiontest::string;

std::string uses(XQueryKeptValues& values, const std::vector<Value>& dependencies) {
  const Ref<XQueryExpr> owner = XQueryLiteral::literalWithValue(integer(0));
  std::string text;
  for (const Value& dependency : dependencies) {
    if (values.looksAway(*owner)) {
      text += "-";
      continue;
    }
    std::shared_ptr<XQueryKeptValue> kept;
    switch (values.use(*owner, {&dependency, 1}, kept)) {
      case XQueryKeptValues::Use::First:
        text += "1";
        break;
      case XQueryKeptValues::Use::Second:
        text += "2";
        values.keep(*owner, nullptr);
        break;
      case XQueryKeptValues::Use::Further:
        text += "+";
        break;
    }
  }
  return text;
}

TEST(KeptValues, KnowsTheUsesInARowWithTheSameDependencies) {
  XQueryKeptValues values;
  const Value a = string("a");
  const Value b = string("b");
  EXPECT_EQ(uses(values, {a, a, a, a, b, b, b, a, b, b}), "12++12+112");
}

TEST(KeptValues, LooksNowAndThenOnlyAfterManyFirstUses) {
  XQueryKeptValues values;
  std::vector<Value> dependencies;
  for (int i = 0; i < 1000; ++i) dependencies.push_back(string(std::to_string(i)));
  const Value again = string("again");
  dependencies.insert(dependencies.end(), 50, again);
  const std::string text = uses(values, dependencies);
  EXPECT_EQ(text.find('-'), 16U);
  EXPECT_LT(std::count(text.begin(), text.begin() + 1000, '1'), 100);
  EXPECT_GT(text.find('2'), 1000U);
  EXPECT_EQ(text.substr(text.find('2') + 1), std::string(text.size() - text.find('2') - 1, '+'));
  EXPECT_EQ(text.back(), '+');
}

}  // namespace
}  // namespace xquery
