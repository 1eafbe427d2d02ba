// Where values go: what is asked of them shows in which comparisons with nothing are told of.
#include "Check/Uses.h"
#include "CheckTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace checktest;

constexpr std::string_view told = "1 empty-comparison";

TEST(Uses, AreFollowedThroughWhatHandsValuesOn) {
  expectWarnings({
      {"if (//c) then (//a = 1) else false()", told},
      {"//b[if (c) then a = 1 else false()]", ""},
      {"ordered { //a = 1 }", told},
      {"//b[ordered { a = 1 }]", ""},
      {"typeswitch (/*) case element(x) return //a = 1 default return 2", told},
      {"//b[typeswitch (.) case element(x) return a = 1 default return false()]", ""},
      {"let $x := //a = 1 let $y := $x return //b[$y]", ""},
      {"let $x := //a = 1 let $y := $x return $y", told},
      {"let $x := //a = 1 return (//b[$x], $x)", told},
      {"(//a = 1, //b = 1)", "1 empty-comparison, 1 empty-comparison"},
      {"not(//a = 1) and (//b = 1 or //c = 1)", ""},
      {"for $x in (//a = 1) return 1", told},
      {"string(//a = 1)", told},
      {"let $_x := //a = 1 return 2", ""},
  });
}

TEST(Uses, AreFollowedThroughFunctionsThatCallThemselves) {
  expectWarnings({
      {"declare function local:f($n) { if ($n/a = 1) then $n/b = 1 else local:f($n/..) };"
       "//c[local:f(.)]",
       ""},
      {"declare function local:f($n) { if ($n/a = 1) then $n/b = 1 else local:f($n/..) };"
       "local:f(//c[1])",
       told},
      {"declare function local:f($t, $n) { if ($n = 0) then 1 else if ($t) then 2 else"
       " local:f($t, $n - 1) }; local:f(//a = 1, 3)",
       ""},
  });
}

TEST(Uses, OfVeryManyPlacesAreNotFollowed) {
  std::string query = "declare function local:f() { //a = 1 }; (";
  for (int i = 0; i < 1000; ++i) query += (i > 0 ? ", " : "") + std::string("//b[local:f()]");
  const auto warnings = warningsOf(query + ")");
  EXPECT_EQ(warnings, "1 reads-context");
}

}  // namespace
}  // namespace xquery
