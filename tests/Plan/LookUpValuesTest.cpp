// Elements that are found by a value in the index of the tree, and that nobody can tell.
#include "Expr/RandomChoices.h"
#include "Plan/PlanTesting.h"
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
std::vector<std::string> resultOf(std::string_view text, const XQueryConstants& constants = {}) {
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

TEST(LookUpValues, LeavesOtherStepsAlone) {
  for (const char* text :
       {"/r/e[@id != 'e7']", "/r/e[@id < 'e7']", "/r/e[@id = 7]", "/r/e[1][@id = 'e7']",
        "/r/e[@id = 'e7'][1]", "/r/e[@id = 'e7' or s]", "/r/*[@id = 'e7']", "/r/e[*/@x = 'a']",
        "/r/e[k/text() = 'k1']", "/r/e[../@id = 'e7']", "/r/e[@id = @n]", "/r/e[@id = position()]",
        "/r/e[@id = string(<a>e7</a>)]", "/r/e[@id = 1 to 3]", "/r/e/attribute::e[. = 'e7']",
        "/r/descendant::e[@id = 'e7']"}) {
    EXPECT_EQ(lookupsIn(text), 0U) << text;
    resultOf(text);
  }
}

TEST(LookUpValues, TakesTheLastClauseBeforeAWhere) {
  EXPECT_EQ(lookupsIn("for $e in /r/e where $e/@id = 'e7' return $e"), 1U);
  EXPECT_EQ(lookupsIn("for $e in /r/e[s] where ('e7' = $e/@id) and error() return $e"), 1U);
  for (const char* text : {
           "for $e in /r/e where $e/@id eq 'e7' return $e",
           "for $e at $n in /r/e where $e/@id = 'e7' return $n",
           "for $e as element() in /r/e where $e/@id = 'e7' return $e",
           "for $e in /r/e let $k := $e/k where $e/@id = 'e7' return $k",
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
        "for $i in 1 to 40 return /r/e[@id = concat('e', $i)]/@n"}) {
    resultOf(text);
  }
}

TEST(LookUpValues, LeaveToWalkingWhatIsNoSingleText) {
  for (const char* probe :
       {"'e7'", "7", "7.0", "()", "('e7', 'e8')", "xs:anyURI('e7')", "xs:date('2004-05-06')",
        "true()", "/r/e[8]/@id", "//e[@id = 'e6']/@id", "data(/r/e[8]/@id)", "error()",
        "xs:integer('x')", "exactly-one(//none)", "''", "xs:QName('e7')"}) {
    for (const char* key : {"@id", "@n", "k", "v", "."}) {
      resultOf("/r/e[" + std::string(key) + " = " + probe + "]/@id");
      resultOf("//e[" + std::string(probe) + " eq " + key + "]/@id");
      resultOf("for $e in /r/e where $e/" + std::string(key) + " = " + probe + " return $e/@id");
    }
  }
}

TEST(LookUpValues, TakeProbesFromTheHost) {
  const char* text = "declare variable $id external; (/r/e[@id = $id], //e[k = $id])/@id";
  XQueryConstants constants;
  for (const char* id : {"e7", "k3", "nobody"}) {
    constants["id"] = NSString::stringWithUTF8(id);
    resultOf(text, constants);
    constants["id"] = XQueryUntypedAtomic(id);
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
  const std::vector<std::string> keys = {"@id", "@n", "k", "e/@id", "s/@x", "k/b", "e/k", "."};
  const std::vector<std::string> probes = {"'e3'",       "'3'", "'k3'",       "'a'",  "'k10'", "$p",
                                           "string($p)", "3",   "($p, 'e4')", "'10'", "'k10a'"};
  const std::vector<std::string> others = {"", "[s]", "[not(k)]", "[@n < 20]", "[count(k) > 1]"};
  for (int i = 0; i < 150; ++i) {
    const std::string key = random.oneOf(keys), probe = random.oneOf(probes);
    const std::string ends = random.oneOf({"", "/@id", "/k", "/..", "//k"});
    const std::string path = random.oneOf({"/r/e", "//e", "/r/e/e", "$p/e", "//e/e", "//k"});
    std::string text = "for $p in (/r/e[3], 'e3', 'k3', /r/e[4]/@id) return ";
    if (path.starts_with("$")) text = "for $p in (/r, /r/e[7]) return ";
    if (random.below(3) == 0) {
      text += "for $e in " + path + random.oneOf(others) + " where $e/" + key + " = " + probe +
              (random.below(3) == 0 ? " and $e/s" : "") + " return $e" + ends;
    } else {
      text += path + random.oneOf(others) + "[" + key + random.oneOf({" = ", " eq "}) + probe +
              "]" + random.oneOf(others) + ends;
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
