// How many nodes nested loops find.
#include "Plan/RulesTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Asked so often that the index is made on the way.
void isSame(const std::string& text) {
  for (const Value& tree : {names(), manyNames()}) {
    sameBothWays("for $turn in 1 to 4 return (" + text + ")", tree);
    sameBothWays(text, tree);
  }
  sameBothWays(text);
  sameBothWays("(1, 2)[" + text + "]", names());
  sameBothWays("for $i in (1, 2) return ($i, 3)[" + text + "]", names());
}

constexpr const char* questions[] = {"count(", "exists(", "empty(", "not(", "boolean("};

TEST(LoopCount, IsThatOfThePath) {
  for (const char* loops :
       {"for $a in //a return $a", "for $a in //a return $a/b",
        "for $a in /r/*, $b in $a/b return $b", "for $a in //a for $b in ($a)/c/b return ($b/@y)",
        "for $a in /r return $a/a/node()", "for $a in //*, $b in $a/@* return $b",
        "for $a in //a, $b in $a/c, $c in $b/b return $c", "for $a in /r//a return $a/text()",
        "for $a in //@x return $a"}) {
    for (const char* question : questions) {
      const std::string text = std::string(question) + loops + ")";
      EXPECT_EQ(choicesOf("loop counts", text), 1U) << text;
      isSame(text);
    }
  }
}

TEST(LoopCount, LeavesOthersAlone) {
  for (const char* loops :
       {"for $a in //a where $a/b return $a", "for $a in //a return $a/..",
        "for $a in //a return 1", "for $a in //a return ($a, $a)",
        "for $a in //a, $b in //a return $b", "for $a in //a//b return $a",
        "for $a in //a[b] return $a", "for $a at $n in //a return $a",
        "for $a as element() in //a return $a", "for $a in //a return $a//b",
        "for $a in //a, $b in $a/b return $a", "for $a in a return $a/b",
        "for $a in //a let $b := $a/b return $b", "for $a in //a order by $a return $a",
        "for $a in //a, $b in $a/p:* return $b", "for $a in //a return $a/b[1]"}) {
    const std::string text = std::string("count(") + loops + ")";
    EXPECT_EQ(choicesOf("loop counts", text), 0U) << text;
    isSame(text);
  }
}

}  // namespace
}  // namespace xquery
