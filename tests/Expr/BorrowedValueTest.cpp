#include "Expr/BorrowedValue.h"
#include "Functions/FunctionsTesting.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

using functiontest::answer;

TEST(BorrowedValue, OfALiteralAndOfTheContextItemIsTheObjectItself) {
  const auto context = XQueryContext::xqueryContext();
  const auto literal = XQueryLiteral::literalWithValue(functiontest::integer(7));
  EXPECT_EQ(&*XQueryBorrowedValue(*literal, *context), &literal->literalValue());
  // Without an item there is nothing to borrow.
  EXPECT_FALSE(*XQueryBorrowedValue(*XQueryContextItem::contextItem(), *context));
  _internal(*context).setContextItem(functiontest::integer(8), 1);
  EXPECT_EQ(&*XQueryBorrowedValue(*XQueryContextItem::contextItem(), *context),
            &_internal(*context).contextItem());
}

// Where the right operand sets what the left one was read from, the left one is what it was.
TEST(BorrowedValue, AnOperandIsWhatItWasWhenItWasEvaluated) {
  const char* const cases[][2] = {
      {"let $x := 5 return $x - count(for $y in 1 to 3 return $y)", "2"},
      {"let $x := 5 return (let $y := 7 return $y) - $x", "2"},
      {"(3, 4)[. = (5, 4)[. = 4]]", "4"},
      {"(3, 4)[. + count((1, 2, 3)[. > 1]) = 6]", "4"},
      {"declare function local:f($a) { $a * 2 }; let $x := 3 return $x + local:f($x + 1) + $x",
       "14"},
      {"for $x in (1, 2) return 10 - $x - $x", "8, 6"},
      {"for $x in 1 return typeswitch ($x) case $n as xs:integer return $n + $x + $n default "
       "return 0",
       "3"},
      {"let $x := () return ($x or true()), let $x := () return (false() or $x)",
       "true(), false()"},
      {"let $x := <a>4</a> return ($x * $x, $x = $x, $x is $x, count($x union $x))",
       "16e0, true(), true(), 1"},
  };
  for (const auto& [query, expected] : cases) {
    EXPECT_EQ(answer(query), answer(expected)) << query;
  }
  EXPECT_EQ(answer(". + 1").substr(0, 6), "error ");
}

}  // namespace
}  // namespace xquery
