// The smallest of paths and comparisons.
#include "Plan/PlanTesting.h"
#include "Platform/Base/ProcessorTime.h"

namespace xquery {
namespace {

using namespace plantest;

const Value& things() {
  static const Value parsed = document(
      "<a xmlns:p='p' id='a1' p:id='a2'>"
      "<b id='1' p:id='9'>5<!--c--></b><b id='2'>7</b><p:b id='3'>x</p:b><b/><b>NaN</b>"
      "<c><d>1</d><d>2</d><d>1</d><e><d>3</d></e>t</c><c><d>x</d></c><c/><f>-0</f><f>0</f>"
      "<g>a<h>b</h>c</g><g> 12 </g><g>1e3</g><g>INF</g><?b b?></a>");
  return parsed;
}

// Contexts in which the rows below are evaluated, "#" for the row.
constexpr auto contexts = std::to_array<const char*>({
    "for $n in //node() return $n/(#)",
    "for $n in //@* return $n/(#)",
    "//node()[#]",
    "for $x in //* return #",
    "let $x := //b return #",
    "let $x := 1 return #",
    "for $x in (1, //c) return #",
    "let $x := () return #",
    "some $x in //c satisfies #",
    "#",
    "declare function local:f($x) { # }; (//c/local:f(.), local:f(()), local:f(//a))",
    "declare default element namespace 'p'; (//c, //b)/(#)",
});

void expectTheSameEverywhere(const std::string& row) {
  for (const std::string context : contexts) {
    std::string query = context;
    query.replace(query.find('#'), 1, row);
    // Without a "$x" around it, it is a compile error in a module and another one here.
    sameBothWays(query, things());
  }
}

// --- paths ---------------------------------------------------------------------------------------

constexpr auto shortPaths = std::to_array<const char*>({
    "$x/b",
    "$x/@id",
    "$x/c/d",
    "$x/c/e/d/text()",
    "$x/../@id",
    "$x/../../a/b",
    "b",
    "@id",
    "c/d",
    "text()",
    "c/node()",
    "../b",
    "..",
    "./b",
    "($x)/c/d",
    "@id/..",
    "../@id",
    "c/d/text()",
    "$x/ancestor-or-self::node()",
    "$x/following-sibling::b",
    "$x/preceding-sibling::node()",
    "$x/preceding-sibling::b/@id",
    "$x/preceding-sibling::node()/d/text()",
    "$x/following-sibling::c/e/d",
});

TEST(ShortPaths, AreTakenWhateverTheyStartFrom) {
  for (const std::string path : shortPaths) {
    // Of these the step upwards comes last.
    const size_t expected = path == "@id/.." ? 0 : 1;
    EXPECT_EQ(choicesOf("short paths", "for $x in //a return (" + path + ")"), expected) << path;
    expectTheSameEverywhere(path);
  }
}

TEST(ShortPaths, AreNoPathsThatHaveToBeSortedOrLookedAtTwice) {
  for (const char* path : {"$x//b",
                           "$x/b[1]",
                           "$x/b[true()]",
                           "$x[1]/b",
                           "$x/*",
                           "$x/b/..",
                           "$x/descendant::b",
                           "/a/b",
                           "$x/self::a",
                           "$x/a/b/c/d/e/f/g/h/i",
                           "$x/b/following-sibling::b",
                           "../following-sibling::b",
                           "$x/following::b",
                           "$x/b/string(.)",
                           "$x/p:*",
                           "f($x)/b",
                           "$g/b",
                           "(1, $x)/b",
                           "$x/element(b)",
                           "$x/ancestor::a/b",
                           "$x/b/ancestor::a",
                           "ancestor::a[1]"}) {
    EXPECT_EQ(choicesOf("short paths",
                        "declare namespace p = 'p'; declare variable $g external; "
                        "for $x in 1 return (" +
                            std::string(path) + ")"),
              0U)
        << path;
  }
}

TEST(ShortPaths, AreCounted) {
  for (const std::string path :
       {"b", "@id", "c/d", "..", "../b", "ancestor::c", "ancestor-or-self::node()",
        "preceding-sibling::c", "following-sibling::node()", "$x/preceding-sibling::node()/d",
        "ancestor::a/@id", "ancestor::node()/b", "ancestor::c/d/text()", "$x/ancestor::a/c"}) {
    for (const std::string question :
         {"count(#)", "exists(#)", "not(#)", "count(#) > 1", "if (#) then 1 else 2"}) {
      std::string row = question;
      row.replace(row.find('#'), 1, path);
      expectTheSameEverywhere(row);
    }
  }
}

TEST(ShortPaths, HaveTheNamespaceOfTheContext) {
  const auto query = compiled("for $x in /* return count($x/b)", XQueryWay::Planned);
  const auto plain = compiled("for $x in /* return count($x/b)");
  for (const char* space : {"", "p", "q"}) {
    const auto countWith = [&](const XQuery& each) {
      const auto context = XQueryContext::xqueryContextWithNamespaces(
          *space ? std::map<std::string, std::string>{{"", space}}
                 : std::map<std::string, std::string>{});
      const auto items = context->evaluateXQuery(each, {}, things());
      return items ? XQueryItemStringValue(*items->objectAtIndex(0)) : "error";
    };
    EXPECT_EQ(countWith(*query), countWith(*plain)) << space;
    EXPECT_EQ(countWith(*query), *space == '\0' ? "4" : *space == 'p' ? "1" : "0");
  }
}

TEST(ShortPaths, FindNodesThatAQueryHasJustMade) {
  sameBothWays("for $x in (<a><b>1</b><b>2</b></a>, <a id='3'/>) return <c>{$x/b, $x/@id}</c>");
  sameBothWays("let $x := <a><b/></a> let $y := <c>{$x/b, $x}</c> return ($x/b, $y/a/b, $x/..)");
  sameBothWays("for $x in document {<a><b/></a>} return ($x/a, $x/a/b, $x/..)");
}

// --- comparisons ---------------------------------------------------------------------------------

constexpr auto comparisons = std::to_array<const char*>({
    "$x/@id = '2'", "@id = '1'",
    "'1' = @id",    "b = 5",
    "b < 7",        "7 > b",
    "b <= 5.0",     "5e0 >= b",
    "c/d = '1'",    "c/d = 2",
    "c/d != 1",     "c/d != '1'",
    ". = 'x'",      ". = 7",
    ". != 7",       "$x = 5",
    "@id eq '1'",   "b eq '5'",
    "'3' eq @id",   "@id ne '1'",
    ". lt 'b'",     ". ge 'ab12'",
    "text() = 't'", "f = 0",
    "f = -0.0",     "g = 'abc'",
    "g = 12",       "g >= 1000",
    "d = 3",        "$x/d > 1",
    "$x/e/d = '3'", "../@id = 'a1'",
    "b = 'NaN'",    "b = 9007199254740993",
    "c/d = 1 + 1",  "(b) = ('5')",
    "$x/@id < 'b'", "b = ''",
    "b > ''",
});

TEST(ConstantComparisons, AreMadeWithTextsAndNumbers) {
  for (const char* comparison : comparisons) {
    const std::string text = "for $x in //a return " + std::string(comparison);
    EXPECT_EQ(choicesOf("texts", text), 1U) << comparison;
    expectTheSameEverywhere(comparison);
  }
}

TEST(ConstantComparisons, AreNoComparisonsOfOtherThings) {
  for (const char* comparison :
       {"$x/@id = xs:date('2000-01-01')", "$x/b eq 5", "$x/b = true()", "$x/b = $x/c", "1 = 1",
        "$x/b is $x", "$x//b = 1", "$x/b = ('5', '6')", "$x/b = xs:double('NaN')", "$x/b + 1",
        "$x/b = 1 to 5", "string($x) = '1'", "$x/b = xs:anyURI('x')", "not('5')"}) {
    EXPECT_EQ(choicesOf("texts", "for $x in //a return (" + std::string(comparison) + ")"), 0U)
        << comparison;
    expectTheSameEverywhere(comparison);
  }
}

TEST(ConstantComparisons, FailAsTheyAreWrittenTo) {
  // The first pair that holds decides, however the next ones would fail.
  EXPECT_EQ(sameBothWays("for $x in //a return $x/b = 5", things()).lines.front(),
            "xs:boolean true");
  EXPECT_EQ(sameBothWays("for $x in //a return $x/c/d = 7", things()).lines.front().substr(0, 5),
            "error");
  EXPECT_EQ(sameBothWays("for $x in //a return $x/b eq '5'", things()).lines.front().substr(0, 5),
            "error");
}

TEST(ConstantComparisons, ReadLongTextsAndManyNodes) {
  std::string xml = "<a>";
  for (int i = 0; i < 2000; ++i) xml += "<b>" + std::to_string(i) + "</b>";
  xml += "<c>" + std::string(300000, '1') + "</c></a>";
  const Value many = document(xml);
  for (const char* query :
       {"for $x in /a return ($x/b = 1999, $x/b = '1999', $x/b = -1, $x/b != 5, $x/b < 0)",
        "for $x in /a return ($x/c = '1', $x/c > '1', $x/c > 1e300)"}) {
    sameBothWays(query, many);
  }
}

// --- names that no node has two children of ------------------------------------------------------

// "one" and "last" below each "e", the one first and the other last, with others between them; of
// "many" there are several.
const Value& entries() {
  static const Value parsed = [] {
    std::string xml = "<r xmlns:p='urn:p'>";
    for (int i = 0; i < 60; ++i) {
      xml += "<e><one id='" + std::to_string(i) + "'>" + std::to_string(i % 7) + "</one><many/>";
      xml += i % 3 ? "<p:one/><f><one/></f>" : "<g/>";
      xml += i % 5 ? "<many>x</many>t<last/></e>" : "<last>3</last>t</e>";
    }
    return document(xml + "</r>");
  }();
  return parsed;
}

TEST(SingleNames, AreFoundAsAllOthers) {
  for (const std::string path :
       {"one", "last", "many", "one/@id", "f/one", "one/text()", "none", "one[. = '3']", "last[1]",
        "many[2]", "*/one", "p:one", "one/.."}) {
    for (const std::string context :
         {"for $e in //e return $e/#", "//e/#", "count(//e/#)", "for $e in //e return count($e/#)",
          "//e[#]/one/@id", "for $e in //e where $e/# = '3' return $e/one/@id",
          "for $e in //e order by string($e/#[1]) return $e/last", "//one[../#]"}) {
      std::string query = context;
      query.replace(query.find('#'), 1, path);
      sameBothWays("declare namespace p = 'urn:p'; " + query, entries());
    }
  }
}

// What is built around them while they are looked for may have any number.
TEST(SingleNames, AreForgottenInWhatAQueryBuilds) {
  for (const char* query :
       {"let $e := <e>{//e[position() < 90], <one/>, <one/>}</e> return (count($e/one), $e/e/one)",
        "let $d := document { (//e, //e) } return (count($d/e/one), count($d/e), $d/e[2]/one/@id)",
        "for $e in <r>{//r/node(), <e><one/>{//one[1]}</e>}</r>/e return count($e/one)"}) {
    EXPECT_FALSE(sameBothWays(query, entries()).lines.empty()) << query;
  }
}

TEST(SingleNames, EndTheWalkForThem) {
  std::string wide = "<r><first/>";
  for (int i = 0; i < 2000; ++i) wide += "<other/>";
  wide += "<last/></r>";
  std::string xml = "<s>";
  for (int i = 0; i < 100; ++i) xml += wide;
  const Value rows = document(xml + "</s>");
  for (const std::string path : {"$r/#/@id", "$r/#[not(@id)]"}) {
    const auto secondsFor = [&](const std::string& name) {
      std::string text = "for $r in /s/r return count(" + path + ")";
      text.replace(text.find('#'), 1, name);
      const auto query = compiled(text, XQueryWay::Planned);
      const auto context = XQueryContext::xqueryContext();
      return processorSecondsOf([&] { EXPECT_TRUE(context->evaluateXQuery(*query, {}, rows)); });
    };
    static_cast<void>(secondsFor("last"));
    EXPECT_LT(secondsFor("first"), secondsFor("last") / 2) << path;
  }
}

}  // namespace
}  // namespace xquery
