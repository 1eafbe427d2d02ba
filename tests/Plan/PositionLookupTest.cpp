// Where values stand in a list: from a table what looking through the list answers.
#include "Plan/RulesTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Thirty-two items with texts, some of which are elements between texts.
const Value& things() {
  static const Value parsed = [] {
    std::string text = "<l>";
    for (int i = 0; i < 32; ++i) {
      const std::string value = std::to_string(i % 7);
      text += "<i k='" + value + "'>" + (i % 5 ? value : "<b>" + value + "</b>x") + "</i>";
    }
    return document(text + "<!--3--></l>");
  }();
  return parsed;
}

TEST(PositionLookup, FindsWhatLookingThroughTheListFinds) {
  for (const char* list :
       {"data(//@k)", "//i", "//@k", "(//i, 3, 3.0, '3', 3e0, 'é', xs:anyURI('3'))", "//comment()",
        "(1 to 40)", "(1 to 20, 2.5, 9007199254740993, 9007199254740992, 9007199254740992e0)",
        "(//@k, true(), xs:date('2004-10-29'), xs:token('3'))", "(//i, number('x'))",
        "(for $i in 1 to 20 return number('x'))", "(//i, xs:float('2.5'), xs:duration('P3Y'))",
        "(//i, xs:QName('a'))", "(//@k, xdt:dayTimeDuration('PT3S'))", "(1, 2)", "()", "3"}) {
    const std::string query =
        "let $l := " + std::string(list) +
        " for $x in ('3', 3, 3.0, 2.5, 2.5e0, '0x', //i[3], //@k[. = '3'][1], //comment(), 'x', "
        "'é', number('x'), true(), 1e0, xs:token('3'), xs:anyURI('3'), xs:date('2004-10-29'), "
        "9007199254740993, 9007199254740992e0, xdt:dayTimeDuration('PT3S'), xs:QName('a'), (), 3) "
        "return ";
    for (const char* question :
         {"index-of($l, $x)", "count(index-of($l, $x))", "exists(index-of(($l), string($x)))",
          "index-of($l, (3, $x)[1])", "for $n in 1 to 3 return index-of($l, 3)[$n]",
          "index-of($l, ())", "index-of($l, ($x, $x))", "index-of($l, xs:integer($x))"}) {
      sameBothWays(query + "(" + question + ")", things());
    }
  }
}

TEST(PositionLookup, IsOfListsThatComeAgain) {
  const auto lookups = [](std::string_view text) { return choicesOf("index-of", text); };
  EXPECT_EQ(lookups("let $l := //i for $x in //@k return index-of($l, string($x))"), 1U);
  EXPECT_EQ(lookups("for $x in //@k return index-of(//i//b, string($x))"), 1U);
  EXPECT_EQ(lookups("for $x in //i return index-of($x/@k, '1')"), 0U);
  EXPECT_EQ(lookups("let $l := //i for $x in //@k return index-of($l, trace($x, ''))"), 0U);
  EXPECT_EQ(lookups("let $l := //i for $x in //@k return index-of($l, $x, 'c')"), 0U);
}

TEST(PositionLookup, SeesThatTheListHasGrown) {
  sameBothWays(
      "for $e in (<e>{for $n in 1 to 20 return <f>{$n}</f>}</e>) let $l := $e/f return "
      "(for $x in ('1', '2', '3', '1') return (index-of($l, $x), <g>{$l[1]}</g>))");
}

// A node, whose value is not taken, is none of the values of the list.
TEST(PositionLookup, AnswersAtOnceForNodes) {
  constexpr const char* wanted[] = {"//i[3]", "/", "//comment()", "<i>3</i>", "//i[b][2]/b"};
  for (const char* node : wanted) {
    sameBothWays(
        "let $l := //i for $n in 1 to 3 return index-of($l, (" + std::string(node) + ")[1])",
        things());
    sameBothWays("let $l := (//i, true(), <i>3</i>) for $n in 1 to 3 return count(index-of($l, (" +
                     std::string(node) + ")[1]))",
                 things());
  }
  const auto steps = [](const std::string& value) {
    const std::string query = "let $l := (1 to 50000) for $n in 1 to 100 return index-of($l, (";
    return stepsOf((query + value + ", $n)[1])").c_str());
  };
  EXPECT_LT(steps("/r"), steps("xs:date('2004-10-29')") / 4);
}

}  // namespace
}  // namespace xquery
