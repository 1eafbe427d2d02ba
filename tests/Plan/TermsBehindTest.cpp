// Clauses that walk what a predicate picks, and ask more of it behind.
#include "Plan/RulesTesting.h"

#include <iterator>
#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Thirty entries with two keys each, of which some have none or several, and other nodes.
const Value& entries() {
  static const Value parsed = [] {
    std::string text = "<r>";
    for (int i = 0; i < 30; ++i) {
      text += "<e x='" + std::to_string(i % 7) + "'";
      if (i % 11 != 3) text += " y='" + std::to_string(i % 4) + "'";
      text += "><k>" + std::to_string(i % 5) + "</k>";
      if (i % 6 == 1) text += "<k>u</k>";
      text += "</e>";
    }
    return document(text + "</r>");
  }();
  return parsed;
}

TEST(TermsBehind, PickWithThePredicate) {
  constexpr const char* answers[] = {"$b", "($a/@y, $b/@y)", "<e>{$b}</e>"};
  size_t turn = 0;
  for (const char* clause :
       {"$b in //e[@x = $a/@x]", "$b in $l[@x = $a/@x]", "$b in (//e[@x = $a/@x])",
        "$b in /r/e[@x = $a/@x][k]", "$b in ($l, 3, 'u')[. = $a/k]", "$b in //e[@x = $a/@x]/k",
        "$b at $n in //e[@x = $a/@x]", "$b in //e[@x = $a/@x][1]", "$b in //e[k < $a/k]"}) {
    for (const char* condition :
         {"$b/@y = $a/@y", "$a/k = $b/k", "$b/@y = $a/@y and $b/k = $a/k",
          "$b/@y = $a/@y and $b/k > 2", "$b/k > 2 and $b/@y = $a/@y", "$b/@y != $a/@y",
          "$b/@y eq $a/@y", "$b/.. is $a/..", "$b/../@z = $a/@y", "$b/@y = '1'",
          "string($b/@y) = string($a/@y)", "$b = $a", "$b/@y = $a/@y or $b/k = $a/k",
          "(some $s in $b/k satisfies $s = $a/k) and $b/@y = $a/@y"}) {
      const std::string query = std::string("let $l := //e for $a in //e for ") + clause +
                                " where " + condition + " return " +
                                answers[++turn % std::size(answers)];
      resultOf(query, entries());
      resultOf("count(" + query + ")", entries());
    }
  }
}

TEST(TermsBehind, SeeWhatIsMadeMeanwhile) {
  resultOf(
      "for $a in //e for $b in (//e, <e x='1' y='1'/>)[@x = $a/@x] where $b/@y = $a/@y "
      "return <r>{$a, $b}</r>",
      entries());
  resultOf(
      "declare function local:of($a) { for $b in //e[@x = $a/@x] where $b/@y = $a/@y "
      "return $b/k }; for $a in //e return local:of($a), //e[local:of(.) = '3']",
      entries());
  resultOf("for $a in //e for $b in //e[@x = $a/@x] where $b/@y = $a/@y and error() return $b",
           entries());
}

// Items that are not picked are not asked, each of which is a step of work.
TEST(TermsBehind, AskFewer) {
  const std::string clauses =
      "count(for $a in /r/a, $b in /r/a[@x = $a/@x] where $b/c/b/@y = $a/@z";
  EXPECT_LT(stepsOf((clauses + " return $b)").c_str()),
            stepsOf((clauses + "1 or $b/c/b/@y = $a/@z return $b)").c_str()) / 4);
}

}  // namespace
}  // namespace xquery
