// Paths that are asked for nodes of a set, in place of being walked.
#include "Plan/RulesTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

// In which some elements are last children of last children.
const Value& nested() {
  static const Value parsed = [] {
    std::string xml = "<r a='0'>";
    for (int i = 0; i < 25; ++i) {
      xml += "<a x='" + std::to_string(i % 3) + "'><b><c y='1'>t</c></b></a><b x='1'><a/></b>";
    }
    return document(xml + "<?a b?><!--c--></r>");
  }();
  return parsed;
}

constexpr const char* paths[] = {
    "//a", "/r/a", "/r/a[@x = '1']", "//a[b]/b", "/r//c", "/r//@x", "//@*", "/descendant::b",
    "/r/*", "//node()", "//text()", "/r/(a | b)", "//*[self::a or self::c]", "/node()",
    "/r/b[a][not(@y)]", "//b[count(a) = 1]", "/r[@a]//a[xs:integer(@x) = 1]",
    "//processing-instruction()", "/none//a", "//a[some $v in @x satisfies $v = '2']",
    // These are walked.
    "//a//c", "/r/a//c", "//a[2]", "//b/..", "//a/following-sibling::b", "//a/string(@x)"};

TEST(FilterByPaths, FindsWhatTheOperatorFinds) {
  size_t turn = 0;
  for (const char* one : paths) {
    for (const char* other : paths) {
      if (++turn % 3 != 0) continue;  // pairs enough
      const std::string both = std::string("(") + one + "," + other + ")";
      for (const char* type : {" intersect ", " except "}) {
        const std::string set = std::string(one) + type + other;
        sameBothWays("count(" + set + ")", nested());
        sameBothWays(set + ", " + both + type + other, names());
      }
    }
  }
}

TEST(FilterByPaths, TakesAnySet) {
  for (const char* set : {"(//b, //a, //b)", "reverse(//a)", "(<a/>, //a)", "<a x='1'/>",
                          "document { /r }//a", "()", "(1, //a)", "/", "//a/@x", "(//a)[3]", "$v",
                          ".", "error()", "//a/xs:integer(@x)", "(//b, 'u')", "root(<a/>)"}) {
    for (const char* path : {"//a", "/r/a[@x]", "/r//@x", "//*", "//a[b]"}) {
      for (const std::string start :
           {"", "let $v := //b/a return ", "for $v in (//a)[position() < 3] return $v/",
            "for $turn in (1, 2) return (1, 2)[$turn]/", "<r><a/></r>/"}) {
        sameBothWays(start + "(" + set + " except " + path + ")", nested());
        sameBothWays(start + "(" + set + " intersect " + path + ")", names());
        sameBothWays(start + "(" + path + " intersect " + set + ")", names());
      }
    }
  }
}

TEST(FilterByPaths, StaysInOneTree) {
  sameBothWays("(//a, document { /r }//a) intersect //a", nested());
  sameBothWays(
      "let $d := document { <r><a x='1'/><b/></r> } return "
      "($d//a except //a, $d/(//a intersect $d/r/a), $d/r/a/(. intersect /r/a))",
      nested());
  sameBothWays("let $e := <e><a/></e> return ($e/a except //a, <f>{$e}</f>//a except //a)",
               names());
}

TEST(FilterByPaths, EvaluatesWhatAnIndexAnswers) {
  sameBothWays("for $t in 1 to 8 return count(//a except //a[@x = '1'])", nested());
  sameBothWays("for $t in 1 to 8 return count(//a[@x = '1'] intersect //a[@x = ('1', '2')])",
               nested());
  sameBothWays("for $t in 1 to 8 return count(/r/*[@x = '1'] except /r/(b | c))", nested());
}

TEST(FilterByPaths, IsSeenInThePlan) {
  for (const char* text :
       {"/r/*[@x = '1'] except /r/b", "//a intersect //b[a]", "$v except //@x", "//a intersect $v",
        "(($v)) except (/r//c)", "$v except //a except //b"}) {
    EXPECT_EQ(choicesOf("set filters", std::string("let $v := /r/* return (") + text + ")"), 1U)
        << text;
  }
  for (const char* text : {"//a | //b", "//a except $v", "$v except //a//c", "$v except a",
                           "$v except //a[2]", "$v intersect //a/..", "//a/b intersect <a/>"}) {
    EXPECT_EQ(choicesOf("set filters", std::string("let $v := /r/* return (") + text + ")"), 0U)
        << text;
  }
}

TEST(FilterByPaths, AsksNoOtherNode) {
  EXPECT_LT(stepsOf("(//c)[1] except //a[b]/c"), stepsOf("//a[b]/c"));
}

// A chain is as long as it likes.
TEST(FilterByPaths, GoesThroughLongChains) {
  std::string text = "//a";
  for (int i = 0; i < 3000; ++i) text += i % 2 ? " except //c" : " intersect //*";
  sameBothWays("count(" + text + ")", names());
}

}  // namespace
}  // namespace xquery
