// What is read by way of parents, and is the same for siblings.
#include "Plan/PlanTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Groups of people and sales, some of them empty, on two levels.
const Value& groups() {
  static const Value parsed = [] {
    std::string text = "<r>";
    for (int group = 0; group < 6; ++group) {
      const std::string number = std::to_string(group);
      text += "<g n='" + number + "'><ps>";
      for (int i = 0; i < 3 * group; ++i) {
        text += "<p id='p" + std::to_string(i * 7 % 10) + "'><a>" + std::to_string(i * i % 13) +
                "</a></p>";
      }
      text += "</ps><ss>";
      for (int i = 0; i < 14 - 3 * group; ++i) {
        text += "<s><b>p" + std::to_string(i * i % 11) + "</b><v>" +
                (i % 9 == 8 ? "x" : std::to_string(i % 5)) + "</v></s>";
      }
      text += "</ss></g>";
    }
    return document(text + "</r>");
  }();
  return parsed;
}

size_t keptIn(const std::string& text) {
  return choicesOf("invariants", text);
}

TEST(ReadsAbove, IsKeptForSiblings) {
  for (const char* text :
       {"//p[@id = ../../ss/s/b]", "//p[../../ss/s/b = @id]", "//p[a = max(../p/a)]",
        "//p[a > avg(../p/a)]", "for $p in //p return max($p/../../ss/s[v != 'x']/v)",
        "for $p in //p where $p/@id = $p/../../ss/s/b return $p",
        "//p[not(@id = ./../../ss/s[v > 2]/b)]", "//p[a = parent::ps/p[position() > 1]/a]",
        "//p/a[. = max(../../p/a)]", "//p[a = ../../../g[@n = 3]/ps/p/a]",
        "for $p in //p, $q in ($p)/../p[a > 3][1] return concat($p/@id, $q/@id)",
        "//p[@id = ..[p/a > 5]/../ss/s/b]", "//p[deep-equal((../../ss/s)[1]/v, ../p[1]/a)]"}) {
    EXPECT_GE(keptIn(text), 1U) << text;
    sameBothWays(text, groups());
    sameBothWays("declare ordering unordered; " + std::string(text), groups());
  }
}

TEST(ReadsAbove, IsNotKeptWhereTheItemOrTheListMatters) {
  for (const char* text :
       {"for $p in //p return sum($p/../../ss/s/v[. != 'x'])",
        "for $p in //p return sum($p/../../ss/s/v)", "for $p in //s return $p/../s/v/..",
        "for $p in //p[a > 1] return (let $b := $p/../../ss/s/b return index-of($b, $p/@id))",
        "for $p in //s return string-join($p/../s/v, ' ')", "//p[a = (., ../p)/a]",
        "//p[. = ../p[1]/a/..]", "for $p in //p return max(($p, $p/..)/a)",
        "//p[a = ./p/../../p/a]", "for $p in //p return count($p[a > 3]/../p[1])",
        "//p[a = ../p[@id = $x]/a]", "//p[max(../p[position() > last() - 1]/a) = string()]"}) {
    const std::string query = std::string(text).find("$x") == std::string::npos
                                  ? std::string(text)
                                  : "for $x in //s/b return " + std::string(text);
    sameBothWays(query, groups());
  }
  EXPECT_EQ(keptIn("//p[max((., ../p)/a) = 1]"), 0U);
  EXPECT_EQ(keptIn("for $p in //p return max($p[a]/../p/a)"), 0U);
}

TEST(ReadsAbove, IsFoundAgainWhereTreesGrow) {
  for (const char* text :
       {"let $r := <r>{for $i in 1 to 9 return <p><a>{$i}</a></p>}</r> "
        "return $r/p[a = max(../p/a)]",
        "for $p in (<r>{//p}</r>, <r>{//p[a > 3]}</r>)/p return max($p/../p/a)",
        "let $p := for $i in 1 to 5 return <p><a>{$i}</a></p> return ("
        "for $x in $p return max($x/../p/a), <r>{$p}</r>, for $x in $p return max($x/../p/a))",
        "for $p in //p, $n in 1 to 2 return <w>{$p}</w>/p[a = max(../p/a)]/@id/string(.)"}) {
    sameBothWays(text, groups());
  }
}

TEST(ReadsAbove, FailsWhereItFails) {
  for (const char* text :
       {"for $p in //p return max($p/../../ss/s/xs:integer(v))",
        "for $p in (1, 2) return max($p/../p/a)", "for $p in (//p, 1) return max($p/../p/a)",
        "//p/@id[. = ../../p/xs:integer(@id)]",
        "for $p in (//p, //g, /r, /) return max($p/../../ss/s[v > 3]/v)",
        "for $s in //s return sum(\n$s/../s/v\n)"}) {
    sameBothWays(text, groups());
  }
}

}  // namespace
}  // namespace xquery
