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
  std::string shown;
  for (const XQueryStreamPart& part : plan.parts) {
    shown += names[static_cast<size_t>(part.fold)];
    if (part.fold == XQueryStreamFold::Part) {
      shown += " " + std::to_string(part.first) + "-";
      if (part.last != std::numeric_limits<uint64_t>::max()) shown += std::to_string(part.last);
    }
    shown += " ";
  }
  return (plan.around == XQueryNoPlace ? "" : "around ") + shown + plan.recordPath();
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
      {"/site/people/person/name/string()", "items /site/people/person/name"},
      {"/site/people/person/string(name)", "items /site/people/person"},
      {"/site/people/person/@id/data(.)", "items /site/people/person"},
      {"/site/people/person[@id = 'p1']/name", "items /site/people/person"},
      {"/site/people[@kind]/person/name", "items /site/people"},
      {"/site/people/person[2]", "items /site/people"},
      {"/site/people/person[last()]/name", "items /site/people"},
      {"/site/people/person[age + 1]", "items /site/people"},
      {"/site/*/person", "items /site/*/person"},
      {"/site/people/*", "items /site/people"},
      {"/site/people/*/*/name()", "items /site/people"},
      {"/site/people/*[name]/@id", "items /site/people"},
      {"//person/*", "items //person"},
      {"//item", "items //item"},
      {"/site//item/name", "items /site//item/name"},
      {"/a/b/c//d", "items /a/b/c//d"},
      {"/a/descendant::b", "items /a//b"},
      {"//item[price > 10]/name", "items //item"},
      {"/a/b/c[d[2] = 1]", "items /a/b/c"},
      {"/a/b/(c, d)[1]/e", "items /a/b"},
      {"/a/b/(c | d)/e", "items /a/b"},
      {"/a//b/c", "items /a//b/c"},
      {"/a/descendant::b/string(c[1])", "items /a//b"},
      {"/a/descendant::b[c]/c/string()", "items /a//b"},
  };
  for (const Row& row : rows) EXPECT_EQ(shownPlan(row.query), row.plan) << row.query;
}

TEST(StreamPlan, ClausesAndFoldsStandAroundAPath) {
  constexpr Row rows[] = {
      {"for $p in /a/b where $p/c > 1 return $p/d", "items /a/b"},
      {"for $p in /a/b, $c in $p/c let $d := $c/d return ($c, $d)", "items /a/b"},
      {"for $p in /a/b return for $c in $p/c order by $c return $c", "items /a/b"},
      {"for $p in /a/b return ($p/d | $p/c) except $p/c[d]", "items /a/b"},
      {"for $p in /a/b where some $c in $p/c, $d in $c/d satisfies $d = 1 return $p", "items /a/b"},
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
      {"(/a/b)[position() <= 10]", "part 1-10 /a/b"},
      {"(/a/b)[position() lt 10]", "part 1-9 /a/b"},
      {"(/a/b)[position() < 0]", "part 1-0 /a/b"},
      {"(/a/b)[position() = 2]", "part 2-2 /a/b"},
      {"(/a/b/c)[position() > 2]", "part 3- /a/b/c"},
      {"(for $b in /a/b return $b/c)[position() ge 2]", "part 2- /a/b"},
      {"let $n := 3 for $b in /a/b where $b/c > $n return $b/d", "items /a/b"},
      {"let $n := 1, $m := $n for $b in /a/b[c = $m] return $b", "items /a/b"},
      {"sum(let $n := 3 for $b in /a/b return $b/c * $n)", "sum /a/b"},
      {"subsequence(/a/b, 3)", "part 3- /a/b"},
      {"subsequence(/a/b, 3, 2)", "part 3-4 /a/b"},
  };
  for (const Row& row : rows) EXPECT_EQ(shownPlan(row.query), row.plan) << row.query;
}

TEST(StreamPlan, AnExpressionMayStandAroundFolds) {
  constexpr Row rows[] = {
      {"count(/a/b) + 1", "around count /a/b"},
      {"sum(/a/b/c) div count(/a/b)", "around sum count /a/b/c, /a/b"},
      {"count(/a/b), count(/a/b[c])", "around count count /a/b"},
      {"(sum(/a/b))", "sum /a/b"},
      {"count(distinct-values(/a/b/c))", "around distinct /a/b/c"},
      {"(distinct-values(/a/b/c))[2]", "around distinct /a/b/c"},
      {"<x n='{ count(/a/b) }'>{ sum(/a/b/c), text { max(/a/b) } }</x>",
       "around count sum max /a/b, /a/b/c"},
      {"if (exists(/a/b)) then 'yes' else 'no'", "around exists /a/b"},
      {"if (1 = 2) then count(/a/b) else 0", "around count /a/b"},
      {"not(exists(//b)) or empty(//c)", "around exists empty //b, //c"},
      {"let $s := sum(/a/b), $n := count(/a/b) return $s div $n", "around sum count /a/b"},
      {"for $i in 1 to count(/a/b) return $i", "around count /a/b"},
      {"for $i in 1 to 3 return $i * count(/a/b)", "around count /a/b"},
      {"declare function local:f($x) { $x * 2 }; local:f(max(/a/b)) + local:f(1)",
       "around max /a/b"},
      {"string-join((string(count(/a/b)), string(sum(/a/c))), ' ')", "around count sum /a/b, /a/c"},
      {"(some $b in /a/b satisfies $b/c = 1) and (every $b in /a/b satisfies $b/c)",
       "around some every /a/b"},
      {"let $n := count(/a/b) where $n > 2 return $n", "around count /a/b"},
      {"let $n := 1 where $n = 2 return (exists(/a/b[xs:date(c)]), empty(//c))",
       "around exists empty /a/b, //c"},
      {"count(/a/b) cast as xs:string", "around count /a/b"},
      {"let $x := <x/> for $b in /a/b return $x",
       "refused 1: what the path finds is needed as a whole"},
      {"let $x := xs:date('x') for $b in /a/b return $x",
       "refused 1: what the path finds is needed as a whole"},
      {"let $n := count(/a/b) for $b in /a/b return $n",
       "refused 1: what the path finds is needed as a whole"},
      {"(/a/b)[position() < 2.5]", "refused 1: what the path finds is needed as a whole"},
      {"(/a/b)[last()]", "refused 1: what the path finds is needed as a whole"},
      {"(/a/b, count(/a/b))", "refused 1: what the path finds is needed as a whole"},
      {"if (1 = 2) then sum(/a/b) else 0", "around sum /a/b"},
      {"let $n := count(/a/b) where $n > 2 return max(/a/b)", "around count max /a/b"},
      {"for $i in 1 to 3 return\ncount(/a/b[c = $i])",
       "refused 2: it depends on a variable that is set around it"},
      {"count(/a/b) + position()", "refused 1: it reads the document apart from the record"},
      {"(count(/a/b), string())", "refused 1: it reads the document apart from the record"},
      {"lang(string(count(/a/b)))", "refused 1: it reads the document apart from the record"},
      {"declare function local:f($x) { /a/c };\nlocal:f(count(/a/b))",
       "refused 2: it reads the document apart from the record"},
      {"string((/a/b)[1])", "refused 1: what the path finds is needed as a whole"},
      {"count(subsequence(/a/b, 2))", "refused 1: nodes of a record are kept"},
      {"let $b := subsequence(/a/b, 2)\nreturn count($b)", "refused 1: nodes of a record are kept"},
      {"(subsequence(/a/b, 1, 1), count(/a/b))", "refused 1: nodes of a record are kept"},
      {"((/a/b)[1], count(/a/b))", "refused 1: what the path finds is needed as a whole"},
      {"count(/a/b) +\ncount(/a/b | /a/c)", "refused 2: what the path finds is needed as a whole"},
      {"count(/a/b) +\ncount(for $b in /a/b order by $b return $b)",
       "refused 2: order by sorts what is found in all records"},
      {"exists(/a/b) and\n(some $b in /a/b, $c in $b/c satisfies $c = 1)",
       "refused 2: the quantifier has more than one clause"},
      {"count(/a/b) + sum(/a/b, 0)", "refused 1: the function has more than one argument"},
      {"count(/a/b) + count(reverse(/a/b))",
       "refused 1: the function needs the whole of its argument"},
      {"(some $b in /a/b satisfies $b/c = 1, $b)",
       "refused 1: the variable is set for each record"},
  };
  for (const Row& row : rows) EXPECT_EQ(shownPlan(row.query), row.plan) << row.query;
}

TEST(StreamPlan, PathsAreAsLongAsTheReaderCanLookFor) {
  std::string path;
  for (int i = 0; i < 63; ++i) path += "/a";
  EXPECT_EQ(shownPlan(path), "items " + path);
  EXPECT_EQ(shownPlan(path + "/a"), "refused 1: the path to the record is too long");
  const std::string half(path, 0, path.size() / 2 + 1);  // 32 steps
  EXPECT_EQ(shownPlan("count(" + half + ") + sum(" + half + ")"), "around count sum " + half);
  EXPECT_EQ(shownPlan("count(" + half + ") + sum(" + half.substr(4) + ")"),
            "around count sum " + half + ", " + half.substr(4));
  EXPECT_EQ(shownPlan("count(" + half + ") + sum(" + half.substr(2) + ")"),
            "refused 1: the paths to the records are too long");
}

TEST(StreamPlan, ARefusalNamesItsPlaceAndReason) {
  constexpr Row rows[] = {
      {"1", "refused 1: no path goes through the document record by record"},
      {"/", "refused 1: the whole document would be one record"},
      {"/a", "refused 1: the whole document would be one record"},
      {"/a[b]/c", "refused 1: the whole document would be one record"},
      {"/a/b[2]", "refused 1: the whole document would be one record"},
      {"/a/(b | c)", "refused 1: the whole document would be one record"},
      {"//.", "refused 1: any node may be a record"},
      {"/a/b//node()", "refused 1: any node may be a record"},
      {"//b[2]", "refused 1: positions are counted below any element"},
      {"/a/b/..", "refused 1: a step may lead out of the record"},
      {"/a/b//c/d//e", "refused 1: the descendant axis may lead out of its node"},
      {"/a/b/c/d//e", "refused 1: the descendant axis may lead out of its node"},
      {"/a/b[c]//d", "refused 1: a step may lead out of the record"},
      {"/a/b/string('c')", "refused 1: a step answers what may be no node of the record"},
      {"/a/b/string(c)/d", "refused 1: a step answers what may be no node of the record"},
      {"//b/string()",
       "refused 1: values of what is found below any element are not in document order"},
      {"//b/c/string()",
       "refused 1: values of what is found below any element are not in document order"},
      {"//b[c]/c/string()",
       "refused 1: values of what is found below any element are not in document order"},
      {"//b/*/name()",
       "refused 1: values of what is found below any element are not in document order"},
      {"/a//b/c/@d/data(.)",
       "refused 1: values of what is found below any element are not in document order"},
      {"(//b/*/c[d]/name())[2]",
       "refused 1: values of what is found below any element are not in document order"},
      {"/a/descendant::b/c/string()",
       "refused 1: values of what is found below any element are not in document order"},
      {"count(//b/string(c))",
       "refused 1: values of what is found below any element are not in document order"},
      {"/a/b/exists(c)", "refused 1: a step answers what may be no node of the record"},
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
      {"count(for $b in /a/b order by $b/c return $b)",
       "refused 1: order by sorts what is found in all records"},
      {"/a/b | /a/c", "refused 1: what the path finds is needed as a whole"},
      {"/a/b union /a/c", "refused 1: what the path finds is needed as a whole"},
      {"/a/b intersect /a/*", "refused 1: what the path finds is needed as a whole"},
      {"/a/b except /a/c", "refused 1: what the path finds is needed as a whole"},
      {"for $b in /a/b | /a/c return $b", "refused 1: what the path finds is needed as a whole"},
      {"some $b in (/a/b, /a/c) satisfies $b = 1",
       "refused 1: what the path finds is needed as a whole"},
      {"max(/a/b, 'collation')", "refused 1: the function has more than one argument"},
      {"some $b in /a/b, $c in $b/c satisfies $c = 1",
       "refused 1: the quantifier has more than one clause"},
      {"let $b := /a/b return $b", "refused 1: what the path finds is needed as a whole"},
      {"for $i in 1 to 3 return /a/b", "refused 1: what the path finds is needed as a whole"},
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
      {"count((/a/b, /a/c))", "refused 1: what the path finds is needed as a whole"},
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
      {"<x>{ /a/b }</x>", "refused 1: what the path finds is needed as a whole"},
      {"declare variable $g := /a/c;\n/a/b[d = $g]",
       "refused 1: a global variable reads the document"},
      {"declare function local:f($x) { $x/.. };\nfor $b in /a/b return local:f($b)",
       "refused 2: it may lead out of the record"},
  };
  for (const Row& row : rows) EXPECT_EQ(shownPlan(row.query), row.plan) << row.query;
}

}  // namespace
}  // namespace xquery
