// Paths that begin with other paths.
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
}

TEST(SplicedPaths, GoOnFromTheInnerSteps) {
  for (const char* path :
       {"(//a)/b", "((//a))//b", "(//a/c)/b/@y", "(/r/a)/b[1]", "(//c)/b[@y]/..", "(//a | //d)/a",
        "(//a, //c)/b", "((//c), (//a | //d))/*", "(//b)/parent::a/c", "(//*:a)/@x",
        "(//b)/ancestor::a", "(//b, //b)/..", "(/)/r"}) {
    EXPECT_GE(choicesOf("paths in paths", path), 1U) << path;
    isSame(path);
    isSame(std::string("count(") + path + ")");
    isSame(std::string("(") + path + ")[2]");
    isSame(std::string("unordered { ") + path + " }");
  }
}

TEST(SplicedPaths, LeaveOthersAlone) {
  for (const char* path :
       {"(//a[1])/b", "(//a)[1]/b", "(//a)/position()", "(//a)/(b, @x)", "(a)/b", "(//a/name())/b",
        "(//a, 1)/b", "(//p:a)/b", "(//a)/<e/>", "(//a)", "unordered { (//a)/b }",
        "for $d in //d return ($d/a)/..", "(//a)/b/<e>{.}</e>/.."}) {
    EXPECT_EQ(choicesOf("paths in paths", path), 0U) << path;
    isSame(path);
  }
}

TEST(SplicedPaths, FailAsTheyDid) {
  for (const char* path : {"(//a)/b", "(//a | //b)/c", "(//a, //b)/c", "count((//a, //b)/c)"}) {
    sameBothWays(path);
    sameBothWays(std::string("for $i in (1, 2) return $i/(") + path + ")", names());
    sameBothWays(std::string("(1, 2)[") + path + "]", names());
  }
}

}  // namespace
}  // namespace xquery
