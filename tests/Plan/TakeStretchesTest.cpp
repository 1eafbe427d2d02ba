// Of lists in document order what lies below a node.
#include "Plan/PlanTesting.h"
#include "Plan/RulesTesting.h"

#include <string>
#include <string_view>

namespace xquery {
namespace {

using namespace plantest;

size_t stretchesIn(std::string_view text) {
  return choicesOf("stretches", text);
}

// Units in each other, with staff on each level and beside them.
std::string unitText(int depth) {
  if (depth == 0) return "<s n='0'/>";
  std::string text = "<u d='" + std::to_string(depth) + "'><s n='1'/>";
  for (int i = 0; i < 3; ++i) text += unitText(depth - 1) + "<s n='2'>x</s>";
  return text + "</u>";
}

const Value& company() {
  static const Value parsed = document("<r><s/>" + unitText(4) + "<s/></r>");
  return parsed;
}

TEST(TakeStretches, TakesListsInOrderThatAreAskedForANodeAbove) {
  for (const char* condition :
       {"ancestor::u intersect $u", "$u intersect ancestor-or-self::u", ".. intersect $u",
        "../.. intersect $u", "@n and (ancestor::u intersect $u)",
        "(ancestor::u intersect $u) and not(@n = '1')"}) {
    for (const char* list : {"//s", "(//s | //u)", "//s/@n", "//text()", "/r/u//s[@n]"}) {
      const std::string text = "let $l := " + std::string(list) + " for $u in //u return ";
      const std::string filter = "$l[" + std::string(condition) + "]";
      EXPECT_EQ(stretchesIn(text + filter), 1U) << text << filter;
      resultOf(text + "count(" + filter + ")", company());
      resultOf(text + "(" + filter + "[last()]/@n, " + filter + "[2])", company());
      resultOf(text + "<e>{" + filter + "}</e>", company());
    }
  }
}

TEST(TakeStretches, LeavesOthersAlone) {
  for (const char* text : {
           "let $l := (//s, //u) for $u in //u return $l[ancestor::u intersect $u]",
           "let $l := //s for $u in //u return $l[not(ancestor::u intersect $u)]",
           "let $l := //s for $u in //u return $l[@n or (ancestor::u intersect $u)]",
           "let $l := //s for $u in //u return $l[following-sibling::u intersect $u]",
           "let $l := //s for $u in //u return $l[u intersect $u]",
           "let $l := //s for $u in //u return $l[@n][ancestor::u intersect $u]",
           "let $l := //s[1] for $u in //u return $l[1][ancestor::u intersect $u]",
           "for $u in //u return //s[ancestor::u intersect $u]",
       }) {
    EXPECT_EQ(stretchesIn(text), 0U) << text;
    resultOf(text, company());
  }
}

// Nodes of other trees, or none or several, and lists that no longer lie in one document.
TEST(TakeStretches, AnswerTheSameForAnyNode) {
  for (const char* nodes :
       {"//u", "(//u, /)", "(/r, //@n, //text())", "(<u><s/></u>, //u[2])", "(1, //u)", "//none"}) {
    for (const char* list : {"//s", "//u", "(<u>{//s}</u>)//s", "//none"}) {
      const std::string text = "let $l := " + std::string(list) + " for $u in " + nodes + " ";
      resultOf(text + "return $l[ancestor::u intersect $u]", company());
      resultOf(text + "return count($l[ancestor-or-self::node() intersect $u])", company());
    }
  }
  for (const char* text : {
           "let $u := //u, $l := //s return $l[ancestor::u intersect $u]",
           "let $u := (), $l := //s return $l[ancestor::u intersect $u]",
           "let $t := <u><u><s/><s/></u></u>, $l := ($t, $t//s)[2]/../s, $e := <u>{$t}</u> "
           "return count($l[ancestor::u intersect $e])",
           "let $l := //s for $u in //u return ($l[ancestor::u intersect $u], position(), last())",
           "//u[3]/(let $l := //s for $u in //u return ($l[.. intersect $u]/@n, name()))",
           "declare function local:below($l, $u) { $l[ancestor::u intersect $u] }; "
           "for $u in //u return count(local:below(//s, $u))",
       }) {
    resultOf(text, company());
  }
}

}  // namespace
}  // namespace xquery
