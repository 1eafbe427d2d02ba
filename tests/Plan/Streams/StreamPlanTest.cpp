// Which programs can be evaluated record by record, from tables.
#include "Plan/PlanTesting.h"
#include "Plan/Streams/XQueryStreamPlan.h"

namespace xquery {
namespace {

using namespace plantest;

// "FOLD PATH", or "refused LINE: REASON".
std::string shownPlan(const std::string& text) {
  constexpr const char* names[] = {"items",  "count", "sum",      "avg",  "min",   "max",
                                   "exists", "empty", "distinct", "some", "every", "part"};
  const auto query = compiled(text);
  const XQueryProgram program = programOf(*query);
  const XQueryStreamPlan plan = XQueryPlanStream(program, XQueryFactTable(program));
  if (!plan.isPossible()) {
    const int64_t line = program[plan.refusedAt].expr->exprLine() + 1;
    return "refused " + std::to_string(line) + ": " + std::string(plan.reason);
  }
  std::string shown = names[static_cast<size_t>(plan.fold)];
  if (plan.fold == XQueryStreamFold::Part) {
    shown += " " + std::to_string(plan.first) + "-";
    if (plan.last != std::numeric_limits<uint64_t>::max()) shown += std::to_string(plan.last);
  }
  return shown + " " + plan.recordPath();
}

struct Row {
  const char* query;
  const char* plan;
};

TEST(StreamPlan, TheRecordIsWhatTheNamesOfThePathFind) {
  constexpr Row rows[] = {
      {"/site/people/person", "items /site/people/person"},
      {"site/people/person", "items /site/people/person"},
      {"(/site/people/person)", "items /site/people/person"},
      {"/site/people/person/name/text()", "items /site/people/person/name"},
      {"/site/people/person/@id", "items /site/people/person"},
      {"/site/people/person[@id = 'p1']/name", "items /site/people/person"},
      {"/site/people[@kind]/person/name", "items /site/people"},
      {"/site/people/person[2]", "items /site/people"},
      {"/site/people/person[last()]/name", "items /site/people"},
      {"/site/people/person[age + 1]", "items /site/people"},
      {"/site/*/person", "items /site/*/person"},
      {"//item", "items //item"},
      {"/site//item/name", "items /site//item/name"},
      {"/a/b/c//d", "items /a/b/c//d"},
      {"/a/descendant::b", "items /a//b"},
      {"//item[price > 10]/name", "items //item"},
      {"/a/b/c[d[2] = 1]", "items /a/b/c"},
      {"/a/b/(c, d)[1]/e", "items /a/b"},
  };
  for (const Row& row : rows) EXPECT_EQ(shownPlan(row.query), row.plan) << row.query;
}

TEST(StreamPlan, ClausesAndFoldsStandAroundAPath) {
  constexpr Row rows[] = {
      {"for $p in /a/b where $p/c > 1 return $p/d", "items /a/b"},
      {"for $p in /a/b, $c in $p/c let $d := $c/d return ($c, $d)", "items /a/b"},
      {"for $p in /a/b return for $c in $p/c order by $c return $c", "items /a/b"},
      {"for $p in /a/b return <x>{ $p/c }</x>", "items /a/b"},
      {"declare function local:f($x) { $x/c }; for $p in /a/b return local:f($p)", "items /a/b"},
      {"declare variable $g := 1; /a/b[c = $g]", "items /a/b"},
      {"for $b in /a/b return $b//c", "items /a/b"},
      {"for $b in /a/b where exists($b//c[d = 1]) return <r>{ $b/descendant::c/d }</r>",
       "items /a/b"},
      {"for $b in /a/b/c[d] return count($b//e)", "items /a/b/c"},
      {"some $b in /a/b satisfies $b//c = 1", "some /a/b"},
      {"count(/a/b)", "count /a/b"},
      {"sum(/a/b/c)", "sum /a/b/c"},
      {"avg(for $b in /a/b return $b/c * 2)", "avg /a/b"},
      {"min(/a/b/@c)", "min /a/b"},
      {"max(/a/b/@c)", "max /a/b"},
      {"exists(//b[c])", "exists //b"},
      {"empty(//b)", "empty //b"},
      {"distinct-values(/a/b/c)", "distinct /a/b/c"},
      {"some $b in /a/b satisfies $b/c = 1", "some /a/b"},
      {"every $b in /a/b satisfies (every $c in $b/c satisfies $c = 1)", "every /a/b"},
      {"(/a/b)[3]", "part 3-3 /a/b"},
      {"(for $b in /a/b return $b/c)[1]", "part 1-1 /a/b"},
      {"subsequence(/a/b, 3)", "part 3- /a/b"},
      {"subsequence(/a/b, 3, 2)", "part 3-4 /a/b"},
  };
  for (const Row& row : rows) EXPECT_EQ(shownPlan(row.query), row.plan) << row.query;
}

TEST(StreamPlan, PathsAreAsLongAsTheReaderCanLookFor) {
  std::string path;
  for (int i = 0; i < 63; ++i) path += "/a";
  EXPECT_EQ(shownPlan(path), "items " + path);
  EXPECT_EQ(shownPlan(path + "/a"), "refused 1: the path to the record is too long");
}

TEST(StreamPlan, ARefusalNamesItsPlaceAndReason) {
  constexpr Row rows[] = {
      {"1", "refused 1: no path goes through the document record by record"},
      {"/", "refused 1: the whole document would be one record"},
      {"/a", "refused 1: the whole document would be one record"},
      {"/a[b]/c", "refused 1: the whole document would be one record"},
      {"/a/b[2]", "refused 1: the whole document would be one record"},
      {"//b[2]", "refused 1: positions are counted below any element"},
      {"/a/b/..", "refused 1: a step may lead out of the record"},
      {"/a/b//c/d//e", "refused 1: the descendant axis may lead out of its node"},
      {"/a/b/c/d//e", "refused 1: the descendant axis may lead out of its node"},
      {"/a/b[c]//d", "refused 1: a step may lead out of the record"},
      {"/a/b/string(c)", "refused 1: a step answers what may be no node of the record"},
      {"/a/b/<c/>", "refused 1: a step answers what may be no node of the record"},
      {"declare variable $g := doc('urn:d'); /a/b/$g",
       "refused 1: a step answers what may be no node of the record"},
      {"/a/*", "refused 1: a record would be any element or instruction"},
      {"/a/*[b]/c", "refused 1: a record would be any element or instruction"},
      {"for $b in /a/b return $b//*", "refused 1: it may lead out of the record"},
      {"/a/b[c]/string(position())",
       "refused 1: a step counts what the one before it finds in all records"},
      {"/a/b[c]/(c[last()], last())",
       "refused 1: a step counts what the one before it finds in all records"},
      {"/a/b[following-sibling::b]", "refused 1: it may lead out of the record"},
      {"/a/b[c = /a/d]", "refused 1: it reads the document apart from the record"},
      {"for $b in /a/b\nreturn\n$b/..", "refused 3: it may lead out of the record"},
      {"for $b in /a/b\nreturn count(/a/b)",
       "refused 2: it reads the document apart from the record"},
      {"for $b at $i in /a/b return $i", "refused 1: the records before it are counted"},
      {"for $b in /a/b order by $b/c return $b",
       "refused 1: order by sorts what is found in all records"},
      {"let $b := /a/b return $b", "refused 1: the first clause does not go through a path"},
      {"for $i in 1 to 3 return /a/b", "refused 1: the first clause does not go through a path"},
      {"/a/b[position() = 1 or c]", "refused 1: the whole document would be one record"},
      {"/a/b[$g]", "refused 1: the whole document would be one record"},
      {"for $b in /a/b return ($b, .)", "refused 1: it reads the document apart from the record"},
      {"for $b in /a/b return root($b)", "refused 1: it may lead out of the record"},
      {"for $b in /a/b/c/d return $b//e", "refused 1: it may lead out of the record"},
      {"for $b in //b return $b//c", "refused 1: it may lead out of the record"},
      {"for $b in /a/b return $b//node()", "refused 1: it may lead out of the record"},
      {"for $b in /a/b return $b/c//d", "refused 1: it may lead out of the record"},
      {"for $b in /a/b return $b//c//d", "refused 1: it may lead out of the record"},
      {"for $b in /a/b/c/@d return $b//c", "refused 1: it may lead out of the record"},
      {"for $b in /a/b, $c in $b/c return $c//d", "refused 1: it may lead out of the record"},
      {"for $b in /a/b return root($b//c)", "refused 1: it may lead out of the record"},
      {"for $b in /a/b return $b//c/..", "refused 1: it may lead out of the record"},
      {"for $b in /a/b return $b//c[../d]", "refused 1: it may lead out of the record"},
      {"some $b in /a/b satisfies $b is (/a/b)[1]",
       "refused 1: it reads the document apart from the record"},
      {"every $b in /a/b, $c in $b/c satisfies $c = 1",
       "refused 1: the quantifier has more than one clause"},
      {"count((/a/b, /a/c))", "refused 1: no path goes through the document record by record"},
      {"count(/a/b) + 1", "refused 1: no path goes through the document record by record"},
      {"/a/b/.[../c]", "refused 1: it may lead out of the record"},
      {"for $b in /a/b return ext:eval('count(../b)', $b)",
       "refused 1: it may lead out of the record"},
      {"subsequence(/a/b, 1.5)",
       "refused 1: the first position is no number that is written there"},
      {"subsequence(/a/b, 1e0)",
       "refused 1: the first position is no number that is written there"},
      {"subsequence(/a/b, 1, 1.5)", "refused 1: the number of items is not written there"},
      {"subsequence(/a/b, 2, 18446744073709551615)",
       "refused 1: the number of items is not written there"},
      {"declare ordering unordered; //b",
       "refused 1: \"//\" is not in document order where it is unordered"},
      {"declare base-uri 'http://b/'; declare variable $g := <g/>; /a/b",
       "refused 1: a global variable makes nodes that have a base URI"},
      {"reverse(/a/b)", "refused 1: the function needs the whole of its argument"},
      {"<x>{ /a/b }</x>", "refused 1: no path goes through the document record by record"},
      {"declare variable $g := /a/c;\n/a/b[d = $g]",
       "refused 1: a global variable reads the document"},
      {"declare function local:f($x) { $x/.. };\nfor $b in /a/b return local:f($b)",
       "refused 2: it may lead out of the record"},
  };
  for (const Row& row : rows) EXPECT_EQ(shownPlan(row.query), row.plan) << row.query;
}

}  // namespace
}  // namespace xquery
