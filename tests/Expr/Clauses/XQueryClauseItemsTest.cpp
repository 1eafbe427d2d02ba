#include "Expr/BindingTesting.h"
#include "Expr/Clauses/XQueryClauseItems.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <string>

namespace xquery::bindingtest {
namespace {

class ClauseItems : public BindingTesting {
 protected:
  static Ref<XQueryExpr> range(Value first, Value last) {
    return operation(XQueryOperatorTo, always(std::move(first)), always(std::move(last)));
  }
  std::string itemsOf(const Ref<XQueryExpr>& expr, bool flattens = true) {
    return outcome([&](XQueryContext& with) {
      XQueryClauseItems items(expr.get(), with);
      if (items.haveFailed()) _internal(with).throwFailure();
      if (flattens) items.flatten();
      std::vector<Value> values;
      for (size_t i = 0; i < items.count(); ++i) values.push_back(items[i]);
      return sequence(std::move(values));
    });
  }
  // What the range has as a value of its own, and as the items of a clause.
  void expectAlike(const Value& first, const Value& last) {
    const auto expr = range(first, last);
    std::string whole =
        outcome([&](XQueryContext& with) { return flattened(evaluatedOrThrown(*expr, with)); });
    if (!whole.starts_with("(") && !whole.starts_with("error")) whole = "(" + whole + ")";
    for (const bool flattens : {true, false}) EXPECT_EQ(itemsOf(expr, flattens), whole);
    EXPECT_EQ(itemsOf(commas({commas({expr})})), whole);
  }
};

TEST_F(ClauseItems, ARangeHasTheItemsOfItsValue) {
  constexpr int64_t greatest = std::numeric_limits<int64_t>::max();
  constexpr int64_t least = std::numeric_limits<int64_t>::min();
  for (const int64_t first : {int64_t{-3}, int64_t{0}, int64_t{5}, greatest - 2, least}) {
    for (const int64_t distance : {-1, 0, 1, 2}) {
      if (distance < 0 && first == least) continue;
      expectAlike(integer(first), integer(first + distance));
    }
  }
}

TEST_F(ClauseItems, OperandsOfARangeAreTakenAsTheRangeOperatorTakesThem) {
  expectAlike(empty(), integer(1));
  expectAlike(integer(1), empty());
  expectAlike(sequence({integer(1)}), sequence({integer(2)}));
  expectAlike(untyped("1"), untyped("3"));
  expectAlike(number(1), number(2));
  expectAlike(string("a"), integer(1));
  expectAlike(integers({1, 2}), integer(3));
  expectAlike(error(17, "a"), integer(3));
  expectAlike(Value(), integer(3));
  expectAlike(integer(1), integer(std::numeric_limits<int64_t>::max()));
}

TEST_F(ClauseItems, ARangeOfTooManyItemsIsRefused) {
  EXPECT_EQ(itemsOf(range(integer(0), integer(std::numeric_limits<int64_t>::max()))),
            "error 0 limit: range of too many items");
}

TEST_F(ClauseItems, AListOfSeveralExpressionsIsNoRange) {
  EXPECT_EQ(itemsOf(commas({range(integer(1), integer(2)), always(integer(7))})),
            "(integer 1, integer 2, integer 7)");
}

TEST_F(ClauseItems, AnyOtherExpressionHasTheItemsOfItsValue) {
  EXPECT_EQ(itemsOf(nullptr), "()");
  EXPECT_EQ(itemsOf(always(Value())), "()");
  EXPECT_EQ(itemsOf(always(integer(1))), "(integer 1)");
  const Value nested = sequence({empty(), integers({1, 2})});
  EXPECT_EQ(itemsOf(always(nested), true), "(integer 1, integer 2)");
  EXPECT_EQ(itemsOf(always(nested), false), "((), (integer 1, integer 2))");
}

TEST_F(ClauseItems, EveryLoopHasItemsOfItsOwn) {
  EXPECT_EQ(outcomeOf(flwor({forClause("x", range(integer(1), integer(2))),
                             forClause("y", range(integer(1), integer(2)))},
                            operation(XQueryOperatorPlus, variable("x"), variable("y")))),
            "(integer 2, integer 3, integer 3, integer 4)");
}

}  // namespace
}  // namespace xquery::bindingtest
