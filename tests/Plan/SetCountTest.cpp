// How many nodes are in sets of what paths find.
#include "Plan/RulesTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

constexpr const char* sets[] = {"//a",      "//b",
                                "//a//b",   "/r/a/c",
                                "//c/b",    "//*",
                                "//a[b]",   "//@x",
                                "//a/..",   "//b[parent::c]",
                                "//(a|b)",  "//*[name() = ('c', 'p:a')]",
                                "/r",       "//b[2]",
                                "//text()", "/r/*",
                                "//none",   "(//a, //d)/a",
                                "//node()", "//a[@x = '1']"};
constexpr const char* operators[] = {" | ", " intersect ", " except "};

// Asked so often that the index is made on the way.
void isSame(const std::string& text) {
  for (const Value& tree : {names(), manyNames()}) {
    sameBothWays("for $turn in 1 to 4 return (" + text + ")", tree);
  }
}

TEST(SetCount, CountsWhatTheSetHolds) {
  size_t turn = 0;
  for (const char* one : sets) {
    for (const char* other : sets) {
      // Pairs enough.
      if (++turn % 9 != 0) continue;
      std::string all = "(";
      for (const char* type : operators) {
        const std::string set = std::string(one) + type + other;
        all += "count(" + set + "), exists(" + set + "), not((" + set + ") except //c), ";
        all += "count(//b intersect (" + set + ")), ";
      }
      isSame(all + "empty(" + one + "))");
    }
  }
}

TEST(SetCount, KnowsTheWays) {
  for (const char* text : {"count(//a intersect //b)", "exists(//a except //c/a)",
                           "count((//a | //b/c) except //c)", "empty(//a/b intersect (//c))",
                           "count(//a[ancestor::b] except //c/a)", "not(//a//b except //c//b)"}) {
    EXPECT_EQ(choicesOf("set counts", text), 1U) << text;
  }
  for (const char* text :
       {"count(//a | //b)", "count(//a)", "count(//a except $x)", "count(a except //b)",
        "count(//a except <b/>)", "//a except //b", "count((//a except //c/b)[1])"}) {
    EXPECT_EQ(choicesOf("set counts", std::string("let $x := /r return ") + text), 0U) << text;
  }
}

TEST(SetCount, LooksAtNoNode) {
  EXPECT_LT(stepsOf("count(//a/b except //c/b)"), 40);
  EXPECT_GT(stepsOf("//a/b except //c/b"), 0);
}

TEST(SetCount, FailsAsItDid) {
  for (const char* text : {"count(//a except //c/b)", "exists(//a intersect //c/b)"}) {
    sameBothWays(text);
    sameBothWays(std::string("for $i in (1, 2) return ($i, 3)[") + text + "]", names());
    sameBothWays(std::string("let $e := <r><a><b/></a><c><b/></c></r> return $e/") + text, names());
  }
}

}  // namespace
}  // namespace xquery
