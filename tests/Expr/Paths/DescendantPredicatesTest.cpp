// "//a[...]" walks the descendants in place of the children of each of them where its predicates
// cannot tell. Here it is compared with the same path whose predicates could, over generated trees.
#include "Expr/RandomChoices.h"
#include "Functions/FunctionsTesting.h"
#include "Platform/Base/SanitizedSizes.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace xquery {
namespace {

using functiontest::answer;

class Generator : public RandomChoices {
 public:
  using RandomChoices::RandomChoices;

  std::string element(size_t depth) {
    const std::string name = oneOf({"a", "b", "c"});
    std::string text = "<" + name;
    if (below(2)) text += " k='" + oneOf({"1", "2", "x", "", "3.5"}) + "'";
    text += ">";
    for (size_t i = below(4); i > 0; --i) {
      if (depth == 0 || below(4) == 0) {
        text += oneOf({"1", "2", "x", "<!--1-->", "<?p 1?>"});
      } else {
        text += element(depth - 1);
      }
    }
    return text + "</" + name + ">";
  }

  std::string test() { return oneOf({"a", "b", "*", "node()", "text()", "element()"}); }

  std::string predicate() {
    return oneOf({"@k", "@k = 1", "@k = '1'", "@k > 1", "a", "b/@k", "not(@k)", "exists(b)",
                  "contains(., '1')", ". = '1'", "a and b", "@k or b", "(@k)", "((a/b))",
                  "@k eq 'x'", "xs:integer(@k) = 1", "@k + 1 = 2", "$v = @k", ". is $n", ".. = '1'",
                  "../a", "preceding-sibling::a", "//b", "boolean(@k)", "deep-equal(a, b)",
                  // These see where an item stands, or may.
                  "1", "2", "last()", "position() = 2", "position() < 3 and @k", "last() = 1", "$v",
                  "@k * 1", "number(@k)", "count(*)", "string(@k)", "(1, 2)", "()", "-1",
                  "some $x in * satisfies $x = '1'", "(a, b)", "(@k, 1)[1]", "*/(1)", "*/count(a)",
                  "if (@k) then 1 else 2", "error()", "@k = 1 to 3"});
  }
};

TEST(DescendantPredicates, AnswerAsPredicatesThatSeePositionsDo) {
  for (unsigned seed = 1; seed <= 4000 / largeInputDivisor; ++seed) {
    Generator generate(seed);
    const std::string text = "<r>" + generate.element(4) + generate.element(3) + "</r>";
    const Value document = NSXMLDocument::documentWithData(text, NSXMLNodePreserveWhitespace);
    const std::string start = generate.oneOf({"", "//a", "//*", "(//a, //b)", "$n", "//a/b"});
    const std::string test = generate.test();
    std::string predicates = "[" + generate.predicate() + "]";
    if (generate.below(3) == 0) predicates += "[" + generate.predicate() + "]";
    const std::string rest =
        generate.oneOf({"", "", "/a", "/@k", "/..", "//b", "//b[@k]", "/following::a", "/text()"});
    const std::string mode = generate.oneOf({"(", "(", "unordered {"});
    const std::string end = mode == "(" ? ")" : "}";
    const std::string variables =
        "let $v := " + generate.oneOf({"1", "'1'", "//@k", "2e0"}) + " let $n := (//b)[1] return ";
    const std::string path = variables + mode + start + "//" + test + predicates;
    // true() takes no argument, and what takes none may take the focus.
    EXPECT_EQ(answer(path + rest + end, document), answer(path + "[true()]" + rest + end, document))
        << "seed " << seed << ": " << path << rest << end << "\n"
        << text;
  }
}

TEST(DescendantPredicates, ANestedStartIsWalkedOnce) {
  std::string text;
  for (int i = 0; i < 20000; ++i) text += "<a k='1'>";
  for (int i = 0; i < 20000; ++i) text += "</a>";
  const Value document = NSXMLDocument::documentWithData(text, NSXMLNodePreserveWhitespace);
  EXPECT_EQ(answer("count(//a//a[@k = 1])", document), answer("19999"));
  EXPECT_EQ(answer("count(//a[@k]//a[@k]//a[@k])", document), answer("19998"));
}

}  // namespace
}  // namespace xquery
