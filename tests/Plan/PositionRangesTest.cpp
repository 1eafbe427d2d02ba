// The items from one position to another.
#include "Plan/RulesTesting.h"

#include <iterator>
#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Groups of nine, five and no items.
const Value& groups() {
  static const Value parsed = [] {
    std::string text = "<r>";
    for (const int count : {9, 5, 0, 1}) {
      text += "<g n='" + std::to_string(count) + "'>";
      for (int i = 1; i <= count; ++i) text += "<i k='" + std::to_string(i) + "'>t</i><j/>";
      text += "</g>";
    }
    return document(text + "</r>");
  }();
  return parsed;
}

// Numbers of every kind, nothing, several, what is no number, and what fails.
constexpr const char* bounds[] = {"$n",
                                  "$n + 1",
                                  "count($g/j)",
                                  "0",
                                  "1",
                                  "-2",
                                  "2.5",
                                  "3e0",
                                  "()",
                                  "xs:decimal('2.0')",
                                  "2.999999999999999999999999",
                                  "1e300",
                                  "number('u')",
                                  "1 div 0e0",
                                  "-1 div 0e0",
                                  "($n, 2)",
                                  "$g/@n",
                                  "'2'",
                                  "xs:integer('u')",
                                  "$g",
                                  "123456789012345678901234567890",
                                  "(1 to 10000000000)",
                                  "1 idiv 0",
                                  "true()",
                                  "last()",
                                  "last() - 1",
                                  "(2 to last())",
                                  "(1 to last() - 1)",
                                  "($n to last())",
                                  "(last() to 2)",
                                  "(2 to 'u')",
                                  "(2e0 to 3)",
                                  "position()",
                                  "string-length($g/@n)",
                                  "($n to $n + 2)",
                                  "(-2 to $n)",
                                  "(-5 to -1)",
                                  "(2, 4)",
                                  "(2, 1)",
                                  "(1, 2, 'u')",
                                  "(2.0, 3.0)",
                                  "(1e0, 2e0)",
                                  "(1, xs:int(2), 3)",
                                  "(4294967297, 4294967298)",
                                  "(18446744073709551617, 18446744073709551618)",
                                  "(3, 3 + xs:integer('x'))"};
constexpr const char* orders[] = {"<",  "<=", ">", ">=", "lt", "le",
                                  "gt", "ge", "=", "eq", "!=", "ne"};
constexpr const char* paths[] = {"$g/i[C]",
                                 "$g/i[C]/@k",
                                 "$g/i[@k > 2][C]",
                                 "$g/*[C]",
                                 "$g/j[3]/preceding-sibling::*[C]",
                                 "$l[C]/@k",
                                 "($g/i, 4, 'x')[C]",
                                 "$g/i[C][1]",
                                 "$g/i[C][last()]",
                                 "($g/i)[C][C]",
                                 "$g/i[C]/(position(), last())",
                                 "//i[C]/@k",
                                 "count($g/i[C])"};

std::string filled(std::string path, const std::string& condition) {
  for (size_t at = 0; (at = path.find('C', at)) != std::string::npos; at += condition.size()) {
    path.replace(at, 1, condition);
  }
  return path;
}

std::string loopOver(const std::string& path) {
  return "for $g in //g let $l := $g/i for $n in (1, 3) return (" + path + ")";
}

TEST(PositionRanges, AreWhatIsAskedForOneByOne) {
  size_t turn = 0;
  for (const char* path : paths) {
    for (const char* bound : bounds) {
      // Each order comes up with each bound, though not with each path.
      const std::string order = orders[++turn % std::size(orders)];
      resultOf(loopOver(filled(path, "position() " + order + " " + bound)), groups());
      resultOf(loopOver(filled(path, std::string(bound) + " " + order + " position()")), groups());
      resultOf(loopOver(filled(path, "position() > 1 and position() < " + std::string(bound))),
               groups());
    }
  }
}

TEST(PositionRanges, AreTakenAtOnce) {
  const std::string loop = "for $g in //g let $l := $g/i for $n in 1 to 3 return ";
  for (const char* path :
       {"$g/i[position() <= $n]", "$l[position() < $n]", "$l[$n lt position()]",
        "$g/i[@k][position() >= $n]", "$g/i[position() > $n and position() < 2 * $n]",
        "$g/i[(position() > 1) and (position() < 5 and $n >= position())]",
        "($g/i)[position() <= count($g/j)]", "$g/i[position() <= 2]/@k", "$g/i[position() = $n]",
        "$l[$n eq position()]", "$l[position() = ($n to $n + 2)]", "$g/i[position() != $n]",
        "$g/i[position() <= last()]", "$l[position() = 2 to last()]",
        "$l[1 to last() - 1 = position()]", "$l[position() ne last()]"}) {
    EXPECT_EQ(choicesOf("ranges", loop + path), 1U) << path;
  }
  for (const char* path :
       {"$g/i[position() != @k]", "$g/i[position() <= last() + @k]", "$g/i[position() <= @k]",
        "$g/i[position() <= trace($n, 'n')]", "$g/i[@k <= $n]", "$g/i[position() <= $n or @k]",
        "$g/i[position() <= $n and @k]", "$g/i[position() <= 'u']"}) {
    EXPECT_EQ(choicesOf("ranges", loop + path), 0U) << path;
  }
}

// How much is walked shows in how often other predicates are asked.
TEST(PositionRanges, EndTheWalk) {
  EXPECT_LT(stepsOf("let $n := 3 return count(/r/a[position() <= $n][string(b) = ''])"),
            stepsOf("let $n := 150 return count(/r/a[position() <= $n][string(b) = ''])"));
  EXPECT_LT(stepsOf("let $n := 150 return count(/r/a[position() <= $n])"),
            stepsOf("let $n := 150 return count(/r/a[position() <= $n and @x])"));
}

}  // namespace
}  // namespace xquery
