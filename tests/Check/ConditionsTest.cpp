#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedConditions, ThatAreAlwaysAlike) {
  expectWarnings({
      {"if (true()) then 1 else 2", "1 constant-condition"},
      {"if (not(())) then 1 else 2", "1 constant-condition"},
      {"if (<a/>) then 1 else 2", "1 constant-condition"},
      {"if ('') then 1 else 2", "1 constant-condition"},
      {"for $a in //a\nwhere 0\nreturn $a", "2 constant-condition"},
      {"//a[false()]", "1 constant-condition"},
      {"//a[@b and true()]", "1 constant-condition"},
      {"let $a := () return if ($a) then 1 else 2", "1 constant-condition"},
      {"if (//a) then 1 else 2", ""},
      {"if (//a[1]) then 1 else 2", ""},
      {"//a[1], //a[last()], //a['x' = @b]", ""},
      {"declare variable $debug external; if ($debug) then 1 else 2", ""},
      {"declare function local:f($n) { if ($n) then local:f($n/..) else () }; local:f(//a[1])", ""},
      {"some $a in //a satisfies true()", ""},
  });
  EXPECT_EQ(textOf("if (false()) then 1 else 2"),
            "the condition is always false: the part behind then is never reached");
}

TEST(CheckedConditions, OfValuesThatAreNone) {
  expectWarnings({
      {"if ((0, 0)) then 1 else 2", "1 truth-of-several"},
      {"//a[tokenize(., ',')]", "1 truth-of-several"},
      {"not(distinct-values(//a))", "1 truth-of-several"},
      {"boolean(current-date())", "1 truth-of-value"},
      {"//a[xs:date(@d)]", "1 truth-of-value"},
      {"if (namespace-uri(/*)) then 1 else 2", "1 truth-of-uri"},
      {"if (string(namespace-uri(/*))) then 1 else 2", ""},
      {"if (count(//a)) then 1 else 2", ""},
      {"if (data(//a[1])) then 1 else 2", "1 truth-of-several"},
      {"if (exists((0, 0))) then 1 else 2", ""},
      {"if (@a = 1 and string(@b)) then 1 else 2", ""},
  });
}

}  // namespace
}  // namespace xquery
