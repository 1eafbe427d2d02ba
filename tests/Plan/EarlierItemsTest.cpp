// What is equal before a position.
#include "Plan/PlanTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Fifty items, some without a place, some with two.
const Value& items() {
  static const Value parsed = [] {
    std::string text = "<l>";
    for (int i = 0; i < 50; ++i) {
      text += "<i n='" + std::to_string(i) + "' k='" + std::to_string(i * i % 11) + "'>";
      if (i % 7 != 2) text += "<p>" + std::to_string(i % 9) + "</p>";
      if (i % 5 == 4) text += "<p>" + std::to_string(i % 4) + "</p>";
      text += "</i>";
    }
    return document(text + "</l>");
  }();
  return parsed;
}

size_t lookUpsIn(const std::string& text) {
  return choicesOf("earlier items", text);
}

TEST(EarlierItems, AreLookedUp) {
  for (const char* comparison :
       {"$i/p = $l[position() < $n]/p", "$l[position() < $n]/p = $i/p",
        "$i/@k = $l[$n >= position()]/@k", "$i/p = ($l)[position() le $n - 1]/p/text()",
        "string($i/@k) = $l[position() lt $n]/@k", "3 = $l[position() < $n]/p",
        "'x' = $l[position() < $n]/p", "($i/p, 'x') = $l[position() < $n]/p",
        "$i = $l[position() < $n]", "$i/z = $l[position() < $n]/p", "$i/p = $l[position() < $n]/z",
        "$i/p = $l[position() < $n + 0.5]/p"}) {
    for (const char* list : {"//i", "(//i, //i)", "//i/p", "reverse(//i)", "//i[@n > 38]"}) {
      const std::string text = std::string("let $l := ") + list + " for $i at $n in $l return (" +
                               comparison + ", not(" + comparison + "))";
      // Arithmetic may fail.
      EXPECT_EQ(lookUpsIn(text), text.find("$n +") + 1 || text.find("$n -") + 1 ? 0U : 2U) << text;
      sameBothWays(text, items());
    }
  }
}

TEST(EarlierItems, AreComparedAsTheyAreWhereThatMayBeAnError) {
  for (const char* list :
       {"(//i, 1)", "(1, //i)", "(//i/@k, 1, 'x', 2.5)", "(1 to 40)", "for $x in //i return 1e0",
        "(//i/@n, xs:date('2004-10-29'))", "for $x in //i return <i><p>{$x/@k/string()}</p></i>",
        "()", "(//i)[1]"}) {
    for (const char* comparison :
         {"$i = $l[position() < $n]", "$l[position() < $n]/p = $i", "1 = $l[position() <= $n]/@k",
          "$i = $l[position() <= $n]", "xs:date('2004-10-29') = $l[position() <= $n]"}) {
      sameBothWays(std::string("let $l := ") + list + " for $i at $n in ($l, $l) return (" +
                       comparison + ")",
                   items());
    }
  }
  for (const char* bound :
       {"'3'", "//i[1]/@n", "()", "(1, 2)", "0", "-1", "2.5", "1e300", "0e0 div 0",
        "2.00000000000000000001", "9007199254740993", "xs:float(3)"}) {
    sameBothWays(std::string("let $l := //i, $n := ") + bound +
                     " for $i in $l return ($i/p = $l[position() < $n]/p, "
                     "$l[position() <= $n]/p = $i/p)",
                 items());
  }
}

TEST(EarlierItems, AreNoneOfOtherConditions) {
  for (const char* comparison :
       {"$i/p != $l[position() < $n]/p", "$i/p = $l[position() > $n]/p",
        "$i/p = $l[position() < last()]/p", "$i/p = $l[position() < $n][p]/p",
        "$i/p = $l[position() < $n]/p[1]", "$i/p = $l[position() < number(@n)]/p",
        "$l[position() lt $n]/@k = string($i/@k)", "$l[position() lt $n]/p = exactly-one($i/p)",
        "exactly-one($i/p) != $l[position() < $n]/p", "<p/> = $l[position() < $n]/p"}) {
    const std::string text =
        std::string("let $l := //i for $i at $n in $l return (") + comparison + ")";
    EXPECT_EQ(lookUpsIn(text), 0U) << text;
    sameBothWays(text, items());
  }
}

}  // namespace
}  // namespace xquery
