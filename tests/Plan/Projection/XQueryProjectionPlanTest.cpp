// What programs need of their document, from tables.
#include "Functions/XQueryBuiltInFunction.h"
#include "Plan/PlanTesting.h"
#include "Plan/Projection/XQueryProjectionPlan.h"
#include "xquery/Exception.h"

namespace xquery {
namespace {

using namespace plantest;

// What is needed, "nothing" for no part of it, or "all, line LINE: REASON".
std::string shownNeeds(const std::string& text) {
  const auto query = compiled(text);
  const XQueryProgram program = programOf(*query);
  const XQueryProjectionPlan plan = XQueryPlanProjection(program, XQueryFactTable(program));
  if (!plan.isPossible()) {
    const int64_t line = program[plan.refusedAt].expr->exprLine() + 1;
    return "all, line " + std::to_string(line) + ": " + std::string(plan.reason);
  }
  const std::string needs = plan.projection.description();
  return needs.empty() ? "nothing" : needs;
}

struct Row {
  const char* query;
  const char* needs;
};

TEST(ProjectionPlan, PathsOfNamesAreNeededAsTheirUsersLookAtThem) {
  constexpr Row rows[] = {
      {"count(//item)", "//item"},
      {"count(item)", "/item"},
      {"exists(/a/b/c)", "/a/b/c"},
      {"/a/b", "all of /a/b"},
      {"/a/b/text()", "/a/b/text()"},
      {"/a/b/@id", "/a/b/@id"},
      {"//@id", "/@id, //*/@id"},
      {"/a/@*", "/a/@*"},
      {"sum(//sale/price)", "the text of //sale/price"},
      {"string(/a)", "the text of /a"},
      {"//person[@id = 'p0']/name", "//person/@id, all of //person/name"},
      {"//person[3]", "all of //person"},
      {"//person[last()]/@id", "//person/@id"},
      {"//person[age > 50]/@id", "//person/@id, the text of //person/age"},
      {"//person[not(homepage)]/@id", "//person/@id, //person/homepage"},
      {"/a//b/c", "all of /a//b/c"},
      {"/a/b/c//d/text()", "/a/b/c//d/text()"},
      {"/a/descendant::b/@x", "/a//b/@x"},
      {"/a/*/c/@x", "/a/processing-instruction(), /a/*/c/@x"},
      {"//p:a/@p:b", "//a/@b"},
      {"//text()", "/text(), //*/text()"},
      {"name(/a/b)", "/a/b"},
      {"/a/b/self::b/@x", "/a/b/@x"},
      {"count(/a/b/node())", "all of /a/b"},
      {"data(/a/b/@x)", "/a/b/@x"},
      {"/a/b/string()", "the text of /a/b"},
      {"/a/b/(c, d)/@x", "/a/b, /a/b/c/@x, /a/b/d/@x"},
      {"count(//a | //b)", "//a, //b"},
      {"count(//a intersect /r/a)", "//a, /r/a"},
      {"max(for $d in //date return xs:date($d))", "the text of //date"},
      {"distinct-values(//author)", "the text of //author"},
      {"1 + 1", "nothing"},
      {"string-join(for $p in /s/p where $p/age > 50 return $p/name/string(), ',')",
       "/s/p, the text of /s/p/age, the text of /s/p/name"},
  };
  for (const Row& row : rows) {
    const std::string prolog =
        std::string(row.query).find("p:") == std::string::npos ? "" : "declare namespace p='u'; ";
    EXPECT_EQ(shownNeeds(prolog + row.query), row.needs) << row.query;
  }
}

TEST(ProjectionPlan, ClausesHandTheirNodesOn) {
  constexpr Row rows[] = {
      {"for $b in /a/b where $b/c > 1 return $b/d", "/a/b, the text of /a/b/c, all of /a/b/d"},
      {"let $b := /a/b return count($b/c)", "/a/b/c"},
      {"for $b at $i in /a/b return $i", "/a/b"},
      {"for $b in /a/b order by $b/c return $b/@d", "/a/b/@d, the text of /a/b/c"},
      {"some $b in /a/b satisfies $b/c = 1", "/a/b, the text of /a/b/c"},
      {"if (/a/b) then /a/c else count(/a/d)", "/a/b, all of /a/c, /a/d"},
      {"<r n='{ /a/b }'>{ count(/a/c) }{ /a/d/text() }</r>", "the text of /a/b, /a/c, /a/d/text()"},
      {"<r>{ //a }</r>", "all of //a"},
      {"document { //a/b }", "all of //a/b"},
      {"element r { //a/@x, attribute { name(/b) } { /c } }", "//a/@x, /b, the text of /c"},
      {"for $b in /a/b return <r n='{ $b/@n }'>{ $b/name, $b/@id }</r>",
       "/a/b/@n, /a/b/@id, all of /a/b/name"},
      {"(<r>{ //a }</r>)/a/b/../preceding::c", "all of //a"},
      {"declare variable $n := count(//a); $n + 1", "//a"},
      {"declare function local:f($n) { $n + 1 }; local:f(count(//a))", "//a"},
      {"doc('x.xml')//a/..", "nothing"},
      {"typeswitch (count(//a)) case $n as xs:integer return $n default return 0", "//a"},
      {"subsequence(//a, /r/from)", "all of //a, the text of /r/from"},
      {"(//a, //b)[2]/@x", "//a/@x, //b/@x"},
  };
  for (const Row& row : rows) EXPECT_EQ(shownNeeds(row.query), row.needs) << row.query;
}

TEST(ProjectionPlan, WhoeverCouldSeeTheDifferenceGetsTheWholeDocument) {
  constexpr Row rows[] = {
      {"/", "all, line 1: the document is used as a whole"},
      {".", "all, line 1: the document is used as a whole"},
      {"count(/node())", "all, line 1: the document is used as a whole"},
      {"//a/..", "all, line 1: a step leads sideways or upwards"},
      {"//a/ancestor::b", "all, line 1: a step leads sideways or upwards"},
      {"//a/following-sibling::b", "all, line 1: a step leads sideways or upwards"},
      {"//a[preceding::b]", "all, line 1: a step leads sideways or upwards"},
      {"//a//b", "all, line 1: the descendant axis may lead out of its node"},
      {"/a/b/c/d//e", "all, line 1: the descendant axis may lead out of its node"},
      {"//a[.//b]", "all, line 1: the descendant axis may lead out of its node"},
      {"/a/text()/descendant::b", "all, line 1: the descendant axis may lead out of its node"},
      {"//node()", "all, line 1: a step leads down to any node"},
      {"//comment()", "all, line 1: a step leads down to any node"},
      {"/a/descendant::*", "all, line 1: a step leads down to any node"},
      {"//.", "all, line 1: a step leads down from any node"},
      {"//a << //b", "all, line 1: nodes of the document are compared"},
      {"//a is //b", "all, line 1: nodes of the document are compared"},
      {"//a instance of element()", "all, line 1: a type is asked of nodes of the document"},
      {"//a treat as element()+", "all, line 1: a type is asked of nodes of the document"},
      {"for $a as element() in //a return 1",
       "all, line 1: a type is asked of nodes of the document"},
      {"typeswitch (//a) case element() return 1 default return 2",
       "all, line 1: a type is asked of nodes of the document"},
      {"<r>{ / }</r>", "all, line 1: the document is used as a whole"},
      {"<r>{ /node() }</r>", "all, line 1: the document is used as a whole"},
      {"<r>{ //a/.. }</r>", "all, line 1: a step leads sideways or upwards"},
      {"declare variable $a := //a; 1",
       "all, line 1: a global variable holds nodes of the document"},
      {"declare function local:f($a) { 1 }; local:f(//a)",
       "all, line 1: nodes of the document are given to a function"},
      {"declare function local:f() { //a }; 1,\nlocal:f()",
       "all, line 2: a declared function looks at the document"},
      {"root(//a)", "all, line 1: it is not known what of a node the function looks at"},
      {"root()", "all, line 1: it is not known what of a node the function looks at"},
      {"base-uri(//a)", "all, line 1: it is not known what of a node the function looks at"},
      {"id('x')", "all, line 1: it is not known what of a node the function looks at"},
      {"deep-equal(//a, //b)", "all, line 1: it is not known what of a node the function looks at"},
      {"trace(//a, 'a')", "all, line 1: it is not known what of a node the function looks at"},
      {"lang('en')", "all, line 1: it is not known what of a node the function looks at"},
      {"count(//a, //b)", "all, line 1: the function takes another number of arguments"},
      {"count(//q:a)", "all, line 1: the namespace of a name is not known"},
  };
  for (const Row& row : rows) EXPECT_EQ(shownNeeds(row.query), row.needs) << row.query;
}

std::string nested(int depth) {
  std::string text = "1";
  for (int i = 0; i < depth; ++i) text = "(1, " + text + ")";
  return text;
}

TEST(ProjectionPlan, ProgramsThatNestDeeplyGetTheWholeDocument) {
  EXPECT_EQ(shownNeeds(nested(198)), "nothing");
  EXPECT_EQ(shownNeeds(nested(201)), "all, line 1: the query nests too deeply");
}

std::string manyPaths(int count) {
  std::string text = "count((/a0";
  for (int i = 1; i < count; ++i) text += ", /a" + std::to_string(i);
  return text + "))";
}

TEST(ProjectionPlan, ProgramsOfManyPathsGetTheWholeDocument) {
  EXPECT_TRUE(shownNeeds(manyPaths(199)).starts_with("/a0, /a1, "));
  EXPECT_EQ(shownNeeds(manyPaths(200)), "all, line 1: there are too many paths");
}

// --- the columns of the registry -----------------------------------------------------------------

// A function whose column says that it looks at values or names alone does not tell apart nodes
// that differ in nothing of these.
TEST(ProjectionPlan, ColumnsOfTheRegistryHoldForNodesThatDifferElsewhere) {
  using Function = XQueryBuiltInFunction;
  const Value one = document("<a q='5'><!--c-->1<b>2</b><c/><?p q?></a>");
  const Value other = document("<a><b>12</b></a>");
  const auto context = XQueryContext::xqueryContext();
  const Value first(cast<NSXMLDocument>(one)->rootElement());
  const Value second(cast<NSXMLDocument>(other)->rootElement());
  const auto shown = [](const Value& value) -> std::string {
    return value ? XQueryItemStringValue(*value) : "none";
  };
  size_t called = 0;
  for (const Function::Registration& row : Function::registrations()) {
    const bool isKnown = row.has(Function::LooksAtValues) || row.has(Function::LooksAtNames);
    const bool answersNode = (row.answer.kinds & (Function::OfFirst | Function::OfAll)) != 0;
    if (!isKnown || answersNode || !row.takes(1) || row.has(Function::LoadsDocuments)) continue;
    std::vector<std::string> answers;
    for (const Value& node : {first, second}) {
      try {
        const Value answer = row.proc(&node, 1, *context);
        EXPECT_NE(answer, node) << row.localName;
        answers.push_back(shown(answer));
      } catch (const NSException&) {
        answers.push_back("raised");
      }
    }
    EXPECT_EQ(answers[0], answers[1]) << row.localName;
    ++called;
  }
  EXPECT_GT(called, 60U);
}

}  // namespace
}  // namespace xquery
