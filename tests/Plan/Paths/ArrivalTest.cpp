// Nodes behind "//" arrive at an expression in the order, and as often, as the steps hand them on.
#include "Plan/PlanTesting.h"

#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace plantest;

// Parts in parts, whose document order is not that of their parents.
std::string part(int depth, int number) {
  std::string text =
      "<p i='" + std::to_string(number) + "' k='" + std::to_string(number % 3) + "'>";
  for (int i = 1; depth > 0 && i < 3; ++i) text += part(depth - 1, 3 * number + i);
  return text + "<b>" + std::to_string(number % 4) + "</b></p>";
}

const Value& parts() {
  static const Value tree = [] {
    std::string text = "<r><k v='1'/>";
    for (int i = 0; i < 24; ++i) text += part(3, i);
    return document(text + "<k v='2'/></r>");
  }();
  return tree;
}

const Value& few() {
  static const Value tree = document("<r>" + part(2, 1) + "<q>" + part(1, 2) + "</q></r>");
  return tree;
}

// Also when it is asked so often that indexes are made on the way.
void isSame(const std::string& path) {
  for (const Value& tree : {parts(), few()}) {
    sameBothWays(path, tree);
    sameBothWays("for $turn in 1 to 5 return (" + path + ", count(" + path + "))", tree);
  }
}

TEST(Arrival, IsThatOfTheSteps) {
  for (const char* path : {"//p/string(@i)",
                           "//p/@i/string()",
                           "//@i/string(.)",
                           "//p[b = '2']/string(@i)",
                           "//p[@k = '1']/data(@i)",
                           "//p[@k = '1'][b = '3']/@i/string()",
                           "//p[@k = ('0', '1')]/string(@i)",
                           "//p[@k = /r/k/@v]/string(@i)",
                           "//p[@k = '1']/b/string()",
                           "//p//b/string()",
                           "//p//p/string(@i)",
                           "//p[@k = '1']//p[@k = '2']/string(@i)",
                           "/r//p/string(@i)",
                           "/r//p//b/string(..)",
                           "/r/p//b/string(..)",
                           "/r/p[@k = '1']/string(@i)",
                           "//p[2]/string(@i)",
                           "//p[2][@k = '1']/string(@i)",
                           "//p/p[2]/string(@i)",
                           "//p/ancestor::p/string(@i)",
                           "//p[@k = '1']/ancestor::p/string(@i)",
                           "//p/../string(@i)",
                           "//(p | b)/string(@i)",
                           "//*[self::p or self::b]/name()",
                           "//*/name()",
                           "//node()/name(..)",
                           "//p/(if (b = '1') then @i else b)",
                           "//p/(if (b = '1') then @i else b)/string()",
                           "//p/(p, b)/string()",
                           "//p/(for $b in b where $b = '1' return string($b))",
                           "//p[some $b in b satisfies $b = '1']/(for $b in b return string($b))",
                           "descendant::p/string(@i)",
                           "descendant::p[@k = '1']/string(@i)",
                           "unordered { //p/string(@i) }",
                           "(//p)[@k = '1']//b/string()",
                           "(//p, //b)//b/string()",
                           "//p[not(p)]/string(@i)"}) {
    isSame(path);
  }
}

TEST(Arrival, KeepsPositions) {
  for (const char* path :
       {"//p/position()", "//p/last()", "//p[@k = '1']/concat(@i, ' ', position(), ' ', last())",
        "//p[@k = '1']/b/concat(position(), ' ', last())",
        "//p[b]/concat(@i, ' ', position(), ' ', last())",
        "//*[self::p]/concat(@i, ' ', position(), ' ', last())",
        "//p[2]/concat(@i, ' ', position(), ' ', last())",
        "/r/p[@k = '1']/concat(@i, ' ', position(), ' ', last())",
        "//p[position() < 3]/concat(@i, ' ', position(), ' ', last())",
        "//p[@k = '1']/string(@i)[position() = last()]"}) {
    isSame(path);
  }
}

TEST(Arrival, KeepsWhichErrorComesFirst) {
  for (const char* path :
       {"//p/xs:date(@i)", "//p[@k = '1']/xs:date(@i)", "//p[xs:integer(b) = 1]/error(b, @i)",
        "//p[xs:date(b) = 1]/string(@i)", "//p/(string(@i), .)",
        "//p/(if (@i = '7') then . else string(@i))", "//p/string(@i)/b", "//p/(1 div (@k - 1))",
        "//b[(.. is /r/p[1]/p[1])]/error(., ../@i)"}) {
    isSame(path);
  }
}

TEST(Arrival, KeepsWhatExpressionsDo) {
  for (const char* path : {"//p/<c>{b}</c>", "//p[@k = '1']/<c>{.}</c>/b/string()",
                           "//p/trace(@i, 'x')", "//p[trace(@k, 'x') = '1']/trace(@i, 'y')",
                           "let $d := <r>{//p}</r> return $d//p/string(@i)",
                           "let $d := <r>{//p}</r> return $d//p/count(<x>{b}</x>)"}) {
    isSame(path);
  }
}

TEST(Arrival, IsToldOf) {
  for (const char* path : {"//p/string(@i)", "//p[b = '2']/@i/string()", "//p[2]/name()",
                           "//p//b/data(.)", "//p/(if (b) then @i else b)", "//p[b]/position()"}) {
    EXPECT_EQ(choicesOf("walks", path), 1U) << path;
  }
  for (const char* path : {"//p/<c>{b}</c>", "//p/trace(@i, 'x')", "//p[trace(b, 'x')]/string()",
                           "//p[position() < 3]/string()"}) {
    EXPECT_EQ(choicesOf("walks", path), 0U) << path;
  }
  EXPECT_EQ(choicesOf("values", "//p[@k = '1']/string(@i)"), 1U);
}

}  // namespace
}  // namespace xquery
