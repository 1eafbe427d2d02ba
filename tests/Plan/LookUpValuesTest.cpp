// Elements that are found by a value in the index of the tree, and that nobody can tell.
#include "Expr/RandomChoices.h"
#include "Plan/PlanTesting.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeIndexes.h"

#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace plantest;

size_t lookupsIn(std::string_view text) {
  return choicesOf("values", text);
}

// 100 elements e under r, some with several values or none, one in another in a third of them.
std::string shelfText() {
  std::string text = "<r>";
  for (int i = 0; i < 100; ++i) {
    const std::string n = std::to_string(i % 25);
    text += "<e id='e" + std::to_string(i) + "' n='" + n + "'>";
    if (i % 3 == 0) text += "<e id='e" + n + "' n='" + n + "'><k>k" + n + "</k></e>";
    for (int k = 0; k < i % 4; ++k) text += "<k>k" + std::to_string((i + k) % 20) + "</k>";
    if (i % 7 == 0) text += "<k>k<b>1</b>0</k><v>" + n + ".0</v>";
    text += i % 5 == 0 ? "<!--k1--><s x='a'/>" : "<s x='b'/><s x='a'/>";
    text += "</e>";
  }
  return text + "</r>";
}

const Value& shelf() {
  static const Value parsed = document(shelfText());
  return parsed;
}

// Evaluated so often that an index that is of use is there in the end.
std::vector<std::string> resultOf(std::string_view text, const XQueryVariables& constants = {}) {
  const Outcome plain = outcomeOf(*compiled(text), shelf(), constants);
  const auto planned = compiled(text, XQueryWay::Planned);
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(outcomeOf(*planned, shelf(), constants).lines, plain.lines) << text;
  }
  return plain.lines;
}

TEST(LookUpValues, TakesStepsWithAnEqualityAmongTheirPredicates) {
  EXPECT_EQ(lookupsIn("/r/e[@id = 'e7']"), 1U);
  EXPECT_EQ(lookupsIn("//e[@id eq 'e7']/k"), 1U);
  EXPECT_EQ(lookupsIn("/r/e['k1' = k][s]"), 1U);
  EXPECT_EQ(lookupsIn("/r/e[s][k/b = '1' and @n]"), 1U);
  EXPECT_EQ(lookupsIn("/r/e[s/@x = ('a')]"), 1U);
  EXPECT_EQ(lookupsIn("//k[. = 'k1']"), 1U);
  EXPECT_EQ(lookupsIn("declare variable $id external; /r/e[@id = $id]"), 1U);
  EXPECT_EQ(lookupsIn("for $i in ('a', 'b') return /r/e[@id = concat($i, '1')]"), 1U);
  EXPECT_EQ(lookupsIn("for $i in //e return $i/e[@id = $i/@id]"), 1U);
}

// The root above a predicate's context item is that of the tree that is looked in.
TEST(LookUpValues, TakesProbesFromTheRootInPredicates) {
  for (const char* text :
       {"/r/e[@id = /r/e[8]/@id]/@n", "//e[/r/e[3]/k[1] = k]/@id",
        "(//e | //k)[@id = /r/e[3]/@id]/@n", "count(/r/*[k = //e[@n = '7'][1]/k])",
        "//e[some $k in k satisfies $k = /r/e[2]/k[1]]/@id", "//e[k[. = (//e)[2]/k[1]]]/@id",
        "for $i in 1 to 9 return /r/e[@id = //e[$i]/@id]/k",
        "for $e in /r/e where $e/@id = /r/e[8]/@id return $e/k",
        "for $e in //e let $n := string($e/@n) where $n = //e[k = 'k3']/@n and $e/k return $e/@id",
        "for $e in //e where some $k in $e/k satisfies $k = /r/e[2]/k return $e/@id"}) {
    EXPECT_GE(lookupsIn(text), 1U) << text;
    resultOf(text);
    resultOf("for $i in 1 to 9 return (" + std::string(text) + ")");
    resultOf("//e[@id = 'e3']/(" + std::string(text) + ")");
    resultOf("<a><b id='e8'/></a>/b/(" + std::string(text) + ")");
  }
  // In another focus there may be another root, or none.
  for (const char* text :
       {"for $i in //r for $e in $i/e where $e/@id = /r/e[8]/@id return $e/k",
        "for $e in r/e where $e/@id = /r/e[8]/@id return $e/k",
        "declare function local:f($e) { $e/@id = /r/e[8]/@id }; /r/e[local:f(.)]"}) {
    EXPECT_EQ(lookupsIn(text), 0U) << text;
    resultOf(text);
  }
}

// A predicate that says no more than that there is the value is not asked again.
// What meets either of several conditions is found by each, and put together.
TEST(LookUpValues, TakesConditionsThatHoldForOneOfSeveralValues) {
  for (const char* text :
       {"/r/e[@id = 'e7' or k = 'k3']",
        "(//e | //k)[@id = 'e7' or k = 'k3']",
        "for $x in ((), 'k3') return count(//e[@id = $x or k = 'k1'])",
        "//e[@id = 'e7' or @id = 'e6' or k/b = '1']/@n",
        "//e[(@id, k) = 'k3']/@id",
        "//e['e6' = (k, @id, s/@x)]",
        "//*[@id = 'e7' or k = 'k3']/@id",
        "//@n[. = '3' or . = '4']/..",
        "//e[s and (@id = 'e7' or k = 'k3' and @n)]/@id",

        "//e[@id eq 'e3' or k eq 'k3']/@id",
        "//e[string(@id) = 'e3' or string(@none) = '']/@id",

        "for $p in ('e3', 'k3', '') return //e[@id = $p or k = $p]/@n",
        "for $p in /r/e[position() < 9] return count(//e[k = $p/k or @id = $p/@id])",
        "for $p in ('e3', 'k3') return count(//e[(@id, k) = $p])",
        "for $e in /r/e where $e/@id = 'e7' or $e/k = 'k3' return $e/@n",
        "for $e in /r/e where ($e/@id, $e/k) = 'k3' and $e/s return $e/@n",
        "for $e in /r/e let $n := string($e/@n) where $n = '3' or $e/@id = 'e9' return $e/k",

        "//e[k[. = 'k3'] or exists(v[. = '7.0'])]/@id",
        "declare function local:is($e, $x) { $e/@id = $x or $e/k = $x }; //e[local:is(., "
        "'k3')]/@id",
        "//e[some $k in (k) satisfies ($k = 'k1' or $k = 'k3')]/@id"}) {
    EXPECT_GE(lookupsIn(text), 1U) << text;
    resultOf(text);
  }
  // Nine matches are more than are looked for.
  for (const char* text :
       {"//e[@id = () or k = 'k3']/@id", "//e[@id = 'e3' or k = 7]/@id",
        "(//e | //k)[@id = 'e7' or . = 'k3']", "//e[@id = 'e7' or s]",
        "//e[@id = 'e7' or @n != '3']", "//e[not(@id = 'e7' or k = 'k3')]",
        "//e[(@id, s/text()/..) = 'e7']", "//*[@id = 'e7' or . = 'k3']", "//e[(@id, 'e7') = 'e7']",
        "//e[@n=1 or @n='2' or @n='3' or @n='4' or @n='5' or @n='6' or @n='7' or @n='8' or @n='9']",
        "for $e in /r/e where $e/@id = 'e7' or $e/k eq 'k3' return $e/@n"}) {
    EXPECT_EQ(lookupsIn(text), 0U) << text;
    resultOf(text);
  }
}

TEST(LookUpValues, AnswersPredicatesThatAskForNothingElse) {
  const auto stepsOf = [](std::string_view text) {
    const auto query = compiled(text, XQueryWay::Planned);
    const auto evaluate = [&] {
      const auto context = XQueryContext::xqueryContext();
      _internal(*context).setContextItem(shelf(), 1);
      (void)_internal(*query).body()->evaluateWithContext(*context);
    };
    for (int i = 0; i < 3; ++i) evaluate();
    const int64_t before = workMeter.stepsLeft;
    evaluate();
    return before - workMeter.stepsLeft;
  };
  for (const char* key : {"s/@x", "(s/@x)", "'a' = s/@x and 'a'", "s/@x/."}) {
    const std::string probe = std::string(key).find('=') == std::string::npos ? " = 'a'" : "";
    const int64_t taken = stepsOf("count(//e[" + std::string(key) + probe + "])");
    const bool isBare = std::string_view(key).ends_with("@x") || *key == '(';
    EXPECT_EQ(taken < 80, isBare) << key << " " << taken;
  }
  for (const char* probe :
       {"()", "''", "('k1', 'k2', 'k1')", "1", "('k1', 3)", "xs:token('k1')", "//k[b]", "//e[2]/k",
        "xs:anyURI('k1')", "error()", "(//e)[5]", "$p", "string($p)", "($p, 'k3')"}) {
    for (const char* test :
         {"//e[k = P]", "//e[P = k][s]", "//e[k eq P]", "//e[@id eq P]", "//*[k = P]",
          "/r/e[k = P]", "//k[. = P]", "//k[. eq P]/..", "//@n[. = P]/..", "//e[s][k = P]",
          "//e[k = P]/string(@id)", "//e[k = P and @n]", "count(//e[k = P])", "exists(//e[k = P])",
          "(//e[k = P])[2]"}) {
      std::string text(test);
      text.replace(text.find('P'), 1, probe);
      resultOf("for $p in ('k1', 'k4', 'e3', '7') return (" + text + ")");
      resultOf("for $p in (//e)[k][1]/(@id | k) return " + text);
    }
  }
}

TEST(LookUpValues, LeavesOtherStepsAlone) {
  for (const char* text : {"for $e in r/e where $e/@id = /r/e[@n = '8'][1]/s return $e",
                           "/r/e[@id = ../@id]",
                           "/r/e[@id != 'e7']",
                           "/r/e[@id < 'e7']",
                           "/r/e[@id = 7]",
                           "/r/e[1][@id = 'e7']",
                           "/r/e[@id = 'e7'][1]",
                           "/r/e[@id = 'e7' or s]",
                           "/r/e[*/@x = 'a']",
                           "/r/e[.//text() = 'k1']",
                           "/r/*[text() = 'k1']",
                           "//@id[text() = 'e7']",
                           "/r/e[k/node() = 'k1']",
                           "/r/e[k/text()/.. = 'k1']",
                           "/r/e[k/self::text() = 'k1']",
                           "/r/e[string(k/text()) = 'k1']",
                           "/r/e[../@id = 'e7']",
                           "/r/e[@id = @n]",
                           "/r/e[@id = position()]",
                           "/r/e[@id = string(<a>e7</a>)]",
                           "/r/e[@id = 1 to 3]",
                           "/r/e/attribute::e[. = 'e7']",
                           "/r/*[. = 'e7']",
                           "/r/*[.//k = 'k1']",
                           "/r/e[.//@id = 'e7']",
                           "//@id[../k = 'k1']",
                           "/r/e[string(k) = 'k1']",
                           "/r/e[upper-case(@id) = 'E7']",
                           "/r/e[exists(@id = 'e7')]",
                           "/r/e[every $k in k satisfies $k = 'k1']",
                           "/r/e[count(for $k in k where $k = 'k1' return 1) = 0]",
                           "/r/e[count(for $k in k where $k = 'k1' return 1) < 2]",
                           "/r/e[count(for $k in k where $k = 'k1' return 1) != 2]",
                           "/r/e[not(k = 'k1')]",
                           "/r/e[empty(k = 'x')]",
                           "/r/e[some $k in k, $s in s satisfies $k = 'k1']",
                           "/r/e[some $k as element() in k satisfies $k = 'k1']",
                           "/r/e[some $k in k satisfies $k = $k/b]",
                           "/r/e[exists(for $k in k return $k = 'k1')]",
                           "/r/e[some $k in k satisfies 'k1' = $k/@id or $k/b]",
                           "/r/e[k = 'k1' or s]",
                           "/r/e[k[. = ../@id]]",

                           "/r/e/following-sibling::e[@id = 'e7']",
                           "(/r/e)[1][@id = 'e7']",
                           "(/r/e, /r)[@id = 'e7']",
                           "(/r/e[2])[@id = 'e7']",
                           "let $e := /r/e return ($e[@id = 'e7'], $e)"}) {
    EXPECT_EQ(lookupsIn(text), 0U) << text;
    resultOf(text);
  }
}

TEST(LookUpValues, TakesStepsOfSeveralNamesByWhatHasTheValue) {
  for (const char* text :
       {"/r/*[@id = 'e7']", "//*[k = 'k1']", "//(e | k)[k/b = '1']", "//*[self::e][s/@x = 'b']",
        "//*[name() = ('e', 's')][e/@id = 'e3']", "/r/node()[k = 'k3']", "//@id[. = 'e7']/..",
        "//@id['e7' eq .]", "//@n[string(.) = '3']/../@id", "//*[e/k = 'k3']/@id",
        "/r/element()[v = '3.0']", "count(//@*:id[. = 'e7'] | //@id[. = 'e7'])",
        "/r/descendant::e[@id = 'e7']", "/r/descendant::*[k = 'k1']"}) {
    EXPECT_EQ(lookupsIn(text), 1U) << text;
    resultOf(text);
    resultOf("count(" + std::string(text) + ")");
  }
}

TEST(LookUpValues, TakesWhatIsFurtherDown) {
  for (const char* text :
       {"/r/e[.//k = 'k1']/@id", "/r/e[e//b = '1']", "//e[descendant::k = 'k1']/@n",
        "//e[.//e/@id = 'e3']/@id", "/r[.//v = '3.0']/@id", "/r/e[.//s/@x = 'a'][.//b]/@id",
        "for $e in /r/e where $e//k = 'k3' return $e/@id", "//e[exists(.//b[. = '1'])]/@id"}) {
    EXPECT_GE(lookupsIn(text), 1U) << text;
    resultOf(text);
  }
}

// Those of mixed content as well, which are only a part of an element's value.
TEST(LookUpValues, TakesTexts) {
  for (const char* text :
       {"/r/e[k/text() = 'k1']/@id", "//k[text() = 'k']/..", "/r/e[k[text() = 'k1']]/@id",
        "//*[k/text() = 'k']/@id", "/r/e[some $k in k/text() satisfies $k = 'k']/@id",
        "/r/e[exists(k/text()[. = '0'])]/@id", "/r/e[e/k/b/text() eq '1']",
        "/r/e[.//k/text() = 'k10']/@id", "//k[child::text() = '0']",
        "for $e in /r/e where $e/k/text() = 'k' return $e/@id",
        "for $e in /r/e let $t := $e/v/text() where $t = '3.0' return $e/@id",
        "//e[data(k/text()) = 'k1']/@id", "(/r/e, /r)[1]/../e[k/text() = '']"}) {
    EXPECT_GE(lookupsIn(text), 1U) << text;
    resultOf(text);
    resultOf("count(" + std::string(text) + ")");
  }
}

TEST(LookUpValues, TakesConditionsThatHoldForAValueAlone) {
  for (const char* text :
       {"/r/e[some $k in k satisfies $k = 'k1']/@id",
        "/r/e[some $i in @id satisfies $i eq 'e7']",
        "/r/e[some $e in e satisfies ($e/s and 'k3' = $e/k)]",
        "/r/e[k[. = 'k1']]/@id",
        "/r/e[exists(k[. = 'k1'])]/@id",
        "/r/e[boolean(k[b][b = '1'])]/@id",
        "/r/e[not(empty(k[. = 'k3']))]/@id",
        "/r/e[not(not(@id = 'e7'))]",
        "/r/e[e[@id = 'e3']/k]",
        "/r/e[not(empty(for $k in k where $k = 'k1' return $k/b))]/@id",
        "/r/e[data(@id) = 'e7']",
        "/r/e[string(@id) = 'e7']",
        "/r/e[exists(k[1][. eq 'k1'])]/@id",
        "/r/e[some $k in k satisfies exists($k/b[. = '1'])]/@id",
        "/r/e[data(k) = 'k1']/@id",
        "/r/e[s[@x = 'b' and error()]]",
        "(/r/e)[@id = 'e7']",
        "(//e | //k)[k/b = '1']/@id",
        "(//e)[@id = 'e6'][1]/@n",
        "count((/r/e)[k = 'k1'][s])",
        "/r/e[count(k[. = 'k1']) > 0]/@id",
        "/r/e[1 <= count(e[@id = 'e3'])]/@id",
        "for $e in /r/e where count(for $k in $e//k where $k = 'k3' return $k) > 0 return $e/@id",
        "for $e in /r/e where some $k in $e/k satisfies $k = 'k1' return $e/@id",
        "for $e in /r/e where exists($e/k[. = 'k1']) and $e/s return $e/@id",
        "for $e in //e | //k where $e/k/b = '1' return $e/@id",
        "for $e in /r/e let $i := string($e/@id) where $i = 'e7' return $e/@n",
        "for $e in /r/e let $k := $e/k, $n := $e/@n where $k = 'k3' return $n",
        "for $e in /r/e where string($e/@id) = 'e7' return $e/@n",
        "for $e in /r/e where string($e/@none) = '' return $e/@id",
        "for $e in /r/e let $i := data($e/@id) where $i eq 'e7' and $e/s return $i"}) {
    EXPECT_GE(lookupsIn(text), 1U) << text;
    resultOf(text);
  }
}

TEST(LookUpValues, TakesConditionsOfDeclaredFunctions) {
  const std::string declarations =
      "declare function local:has($e, $k) { $e/k = $k };"
      "declare function local:any($k, $e) { some $each in $e satisfies $each = $k };"
      "declare function local:both($e) { exists($e/s[@x = 'b']) and $e/@n = '3' };"
      "declare function local:loop($e) { local:loop($e) };"
      "declare function local:twice($e) { local:both($e) };"
      "declare variable $g := 'k1'; declare function local:global($e) { $e/k = $g };";
  const size_t ofTheirOwn = lookupsIn(declarations + "1");
  for (const char* text :
       {"/r/e[local:has(., 'k1')]/@id", "for $e in /r/e where local:has($e, 'k1') return $e/@id",
        "for $i in ('k1', 'k3', '', 3) return /r/e[local:has(., $i)]/@id",
        "//e[local:any('k1', k)]/@id", "/r/e[local:both(.)]/@id", "/r/e[local:global(.)]/@id",
        "/r/e[local:has(., concat('k', '1'))]", "//*[local:has(., 'k1')]/@id",
        "for $e in /r/e where local:both($e) return $e/@id"}) {
    EXPECT_GT(lookupsIn(declarations + text), ofTheirOwn) << text;
    resultOf(declarations + text);
  }
  for (const char* text :
       {"/r/e[local:has(., @id)]", "/r/e[local:has(k, k)]", "/r/e[local:any(., k)]",
        "/r/e[local:has(., string(<a>k1</a>))]", "/r/e[local:has(., trace('k1', 't'))]",
        "for $e in /r/e where local:has($e, xs:string(('k1', 'k2'))) return $e",
        "/r/e[local:has(.., 'k1')]", "/r/e[local:loop(.)]"}) {
    EXPECT_EQ(lookupsIn(declarations + text), ofTheirOwn) << text;
    if (std::string_view(text).find("loop") == std::string_view::npos)
      resultOf(declarations + text);
  }
}

TEST(LookUpValues, TakesAnEarlierClauseBehindWhichNothingCanBeTold) {
  for (const char* text : {
           "for $e in /r/e, $k in $e/k where $e/@id = 'e7' return $k",
           "for $e in /r/e, $k in $e/k where $e/@n = '3' and $k = 'k3' return $k",
           "for $e in /r/e, $k at $n in $e/k where $e/@n = '3' return ($n, $k)",
           "for $e in /r/e let $i := $e/@id for $k in $e/k, $s in $e/s where $i = 'e7' return $s",
           "for $e in /r/e let $i := string($e/@id) for $k in $e/k where $i = 'e7' return $k",
           "for $e in /r/e, $k in $e/k where $e/@n = '3' and error() return $k",
           "for $e in /r/e, $k in $e/k where $e/@n = '3' order by $k return $k",
       }) {
    EXPECT_EQ(lookupsIn(text), 1U) << text;
    resultOf(text);
  }
  for (const char* text : {
           "for $e in /r/e, $k in xs:integer($e/@n) where $e/@id = 'e7' return $k",
           "for $e in /r/e, $k as element() in $e/k where $e/@id = 'e7' return $k",
           "for $e in /r/e, $k in <a>{$e/k}</a> where $e/@id = 'e7' return $k",
           "for $e in /r/e, $k in doc(string($e/k[1])) where $e/@id = 'e7' return $k",
           "for $e in /r/e, $k in $e/k where $k and $e/@id = 'e7' return $k",
           "for $e in /r/e, $k in $e/k where $e/@id = $k return $k",
           "for $e in //e, $k in $e/k let $i := string($k/@id) where $i = 'e7' return $k",
           "for $e at $n in /r/e, $k in $e/k where $e/@id = 'e7' return $n",
       }) {
    EXPECT_EQ(lookupsIn(text), 0U) << text;
    resultOf(text);
  }
}

TEST(LookUpValues, TakesTheLastClauseBeforeAWhere) {
  EXPECT_EQ(lookupsIn("for $e in /r/e where $e/@id = 'e7' return $e"), 1U);
  EXPECT_EQ(lookupsIn("for $e in /r/e[s] where ('e7' = $e/@id) and error() return $e"), 1U);
  for (const char* text : {
           "for $e in /r/e where $e/k eq 'k7' return $e",
           "for $e at $n in /r/e where $e/@id = 'e7' return $n",
           "for $e as element() in /r/e where $e/@id = 'e7' return $e",
           "for $e in /r/e let $k := xs:integer($e/@n) where $e/@id = 'e7' return $k",
           "for $e in /r/e let $k := <a>{$e/k}</a> where $e/@id = 'e7' return $k",
           "for $e in /r/e let $k := string($e/k) where $k = 'k7' return $k",
           "for $e in /r/e let $i as xs:string := string($e/@id) where $i = 'e7' return $i",
           "for $e in /r/e where string($e/k) = 'k1' return $e",
           "for $e in /r/e where trace($e/k, 'k')[. = 'k1'] return $e",
           "for $e in /r/e where $e/s and $e/@id = 'e7' return $e",
           "for $e in /r/e where $e/@id = $e/@n return $e",
           "for $e in (/r/e, /r/e) where $e/@id = 'e7' return $e",
           "for $e in /r/e[2] where $e/@id = 'e7' return $e",
           "for $i in ('e1', 'e2'), $e in /r/e where $e/@id = $i return $e",
       }) {
    EXPECT_EQ(lookupsIn(text), 0U) << text;
    resultOf(text);
  }
}

TEST(LookUpValues, FindsWhatWalkingFinds) {
  EXPECT_EQ(resultOf("count(/r/e[@id = 'e7'])").front(), "xs:integer 1");
  EXPECT_EQ(resultOf("count(//e[@id = 'e6'])").front(), "xs:integer 3");
  EXPECT_EQ(resultOf("count(/r/e[k = 'k10'])"),
            resultOf("count(/r/e[some $k in k satisfies $k = 'k10'])"));
  EXPECT_EQ(resultOf("(//e[k = 'k1'])[1]/string(@id)").front(), "xs:string e1");
  for (const char* text :
       {"/r/e[@id = 'nobody']",
        "//e[k = 'k1']/@id",
        "//e[k = '']",
        "/r/e[v = '0.0']",
        "/r/e[@n = '3'][k = 'k3'][s/@x = 'b']",
        "//e[@n = '3' and error()]",
        "//e[error() and @n = '3']",
        "/r/e[s/@x eq 'a']",
        "/r/e[k eq 'k1']/@id",
        "exists(/r/e[@id = 'e9'])",
        "empty(//e[@id = 'e199'])",
        "//e[@id = 'e6']//k",
        "//e[@id = 'e6']/ancestor::*/@id",
        "count(//e[e/@id = 'e3'])",
        "/r/e/e[@id = 'e3']",
        "//e//e[@id = 'e3']",
        "for $e in //e return count($e/e[@id = $e/@id])",
        "//k[. = 'k10']/..",
        "for $e in /r/e where $e/k = 'k2' and $e/@n return string($e/@id)",
        "for $e in /r/e where $e/@id = 'e8' and error() return $e",
        "for $i in ('e1', 'e2', 'e3'), $e in /r/e where $e/@id = $i return string($e/@id)",
        "for $i in 1 to 40, $e in /r/e where $e/@id = concat('e', $i) return string($e/@id)",
        "for $i in 1 to 40 return /r/e[@id = concat('e', $i)]/@n",
        "for $i in 1 to 40 return (//e | //k)[@id = concat('e', $i)]/@n",
        "for $i in 1 to 40 return (//e)[@id = concat('e', $i)][1]/@n",
        "for $i in 1 to 40 return count(//*[@id = concat('e', $i)])",
        "for $i in 1 to 40 return //@id[. = concat('e', $i)]/../@n",
        "for $i in 1 to 9, $e in //* let $k := string($e/@id) where $k = concat('e', $i) return $e",
        "for $e in //e return $e/*[@id = 'e3']/@n",
        "for $e in //e return exists($e/..//*[k = 'k3'])"}) {
    resultOf(text);
  }
}

TEST(LookUpValues, FindTextsAndLeaveOtherValuesToWalking) {
  for (const char* probe : {"'e7'",
                            "7",
                            "7.0",
                            "()",
                            "('e7', 'e8')",
                            "xs:anyURI('e7')",
                            "xs:date('2004-05-06')",
                            "true()",
                            "/r/e[8]/@id",
                            "//e[@id = 'e6']/@id",
                            "data(/r/e[8]/@id)",
                            "error()",
                            "xs:integer('x')",
                            "exactly-one(//none)",
                            "''",
                            "xs:QName('e7')",
                            "('e9', 'e8', 'e9', 'no')",
                            "('k3', 'k1')",
                            "('k1', '')",
                            "('e7', 8)",
                            "(8, 'e7')",
                            "('e7', error())",
                            "('e7', xs:date('2004-05-06'))",
                            "/r/e[@n = '3']/@id",
                            "//e[@n = '3']/k",
                            "(//k, 'k3')",
                            "('e7', <a>e8</a>)"}) {
    for (const char* key : {"@id", "@n", "k", "v", "."}) {
      resultOf("/r/e[" + std::string(key) + " = " + probe + "]/@id");
      resultOf("//e[" + std::string(probe) + " eq " + key + "]/@id");
      resultOf("for $e in /r/e where $e/" + std::string(key) + " = " + probe + " return $e/@id");
    }
  }
}

TEST(LookUpValues, TakeProbesFromTheHost) {
  const char* text = "declare variable $id external; (/r/e[@id = $id], //e[k = $id])/@id";
  XQueryVariables constants;
  for (const char* id : {"e7", "k3", "nobody"}) {
    constants["id"] = NSString::stringWithUTF8(id);
    resultOf(text, constants);
    constants["id"] = NSString::stringWithUTF8(id);
    resultOf(text, constants);
  }
  constants["id"] = NSNumber::numberWithLongLong(7);
  resultOf(text, constants);
  resultOf(text);  // without a value
}

TEST(LookUpValues, SeeATreeAsItIsAfterAChange) {
  const Value tree = document(shelfText());
  const auto query = compiled("string(/r/e[@id = 'e7']/@n)", XQueryWay::Planned);
  const auto answer = [&] { return outcomeOf(*query, tree).lines.front(); };
  for (int i = 0; i < 3; ++i) EXPECT_EQ(answer(), "xs:string 7");
  auto* root = cast<NSXMLDocument>(tree)->rootElement();
  auto* seventh = cast<NSXMLElement>(root->childAtIndex(7));
  seventh->attributeForName(NSStringView::ascii("id"))->setStringValue(NSStringView::ascii("x"));
  cast<NSXMLElement>(root->childAtIndex(8))
      ->attributeForName(NSStringView::ascii("id"))
      ->setStringValue(NSStringView::ascii("e7"));
  for (int i = 0; i < 3; ++i) EXPECT_EQ(answer(), "xs:string 8");
}

TEST(LookUpValues, AgreeWithWalkingOverGeneratedQueries) {
  RandomChoices random(20041029);
  const std::vector<std::string> keys = {"@id", "@n", "k",   "e/@id", "s/@x",     "k/b",
                                         "e/k", ".",  "./k", "e//k",  "k/text()", "text()"};
  const std::vector<std::string> probes = {"'e3'",
                                           "'3'",
                                           "'k3'",
                                           "'a'",
                                           "'k10'",
                                           "$p",
                                           "string($p)",
                                           "3",
                                           "($p, 'e4')",
                                           "'10'",
                                           "'k10a'",
                                           "$p/k",
                                           "('k3', 'e9', $p)",
                                           "/r/e[4]/@id",
                                           "//e[5]/k[1]",
                                           "//e[@n < 5]/k"};
  const std::vector<std::string> others = {"", "[s]", "[not(k)]", "[@n < 20]", "[count(k) > 1]"};
  for (int i = 0; i < 120; ++i) {
    const std::string key = random.oneOf(keys), probe = random.oneOf(probes);
    const std::string ends = random.oneOf({"", "/@id", "/k", "/..", "//k"});
    const std::string path = random.oneOf({"/r/e", "//e", "/r/e/e", "$p/e", "//e/e", "//k", "//*",
                                           "/r/*", "//(e | k)", "$p/*", "(//k | //e)"});
    std::string text = "for $p in (/r/e[3], 'e3', 'k3', /r/e[4]/@id) return ";
    if (path.starts_with("$")) text = "for $p in (/r, /r/e[7]) return ";
    if (random.below(3) == 0) {
      text += "for $e in " + path + random.oneOf(others) + " where $e/" + key + " = " + probe +
              (random.below(3) == 0 ? " and $e/s" : "") + " return $e" + ends;
    } else {
      const std::string equals = random.oneOf({" = ", " eq "}) + probe;
      const std::string other = random.oneOf(keys) + " = " + random.oneOf(probes);
      const std::string condition =
          random.oneOf({key + equals, key + equals + " or " + other,
                        "(" + key + ", " + random.oneOf(keys) + ")" + equals,
                        "some $v in " + key + " satisfies $v" + equals, key + "[." + equals + "]",
                        "not(empty(" + key + "[." + equals + "]))",
                        "exists(for $v in " + key + " where $v" + equals + " return $v)",
                        "data(" + key + ")" + equals, "string(" + key + ")" + equals});
      text += path + random.oneOf(others) + "[" + condition + "]" + random.oneOf(others) + ends;
    }
    resultOf("count(" + text + ")");
    resultOf(text);
  }
  // They were not all walked.
  const NSXMLExpandedNameRef e({}, NSStringView::ascii("e")), id({}, NSStringView::ascii("id"));
  const auto* root = cast<NSXMLDocument>(shelf())->rootElement();
  EXPECT_TRUE(NSXMLIndexedValues::of({e, {}, id}, root->firstChild(), nullptr).values);
}

}  // namespace
}  // namespace xquery
