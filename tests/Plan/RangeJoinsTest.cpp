// Items whose key lies between two probes.
#include "Plan/PlanTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Forty sales and forty bands, some without a price or an end, and one price that is no number.
Value sales(bool areAllNumbers) {
  std::string text = "<r>";
  for (int i = 0; i < 40; ++i) {
    const std::string price = std::to_string(i * 37 % 23) + (i % 3 ? "" : ".5");
    text += "<s n='" + std::to_string(i) + "'>";
    if (i % 9 != 4) text += "<p>" + (!areAllNumbers && i == 20 ? "x" : price) + "</p>";
    text += "</s><b from='" + std::to_string(i % 17) + "'";
    if (i % 8 != 5) text += " to='" + std::to_string(i % 17 + i % 6) + "'";
    text += "/>";
  }
  return document(text + "</r>");
}

TEST(RangeJoins, FindTheSameAsAskingEach) {
  for (const Value& document : {sales(true), sales(false)}) {
    for (const char* condition :
         {"$s/p >= $b/@from and $s/p < $b/@to", "number($s/p) > $b/@from and number($s/p) <= 9",
          "xs:double($s/p) >= xs:double($b/@from) and xs:double($s/p) <= number($b/@to)",
          "number($b/@from) < number($s/p) and number($b/@to) >= number($s/p)",
          "$s/p > $b/@from - 0.5 and $s/p < $b/@from + 2", "$s/p > $b/@from and $s/p > $b/@to",
          "$s/p >= $b/@from and $s/@n < $b/@to", "$s/p < $b/@from + 1 and $s/p > $b/@from + 5",
          "$s/p[. > $b/@from] and $s/p < $b/@to"}) {
      for (const char* query : {"for $b in //b, $s in //s where # return ($b/@from, $s/@n)",
                                "for $b in //b return count(for $s in //s where # return $s)",
                                "for $b in //b where some $s in //s satisfies # return $b/@from"}) {
        std::string text = query;
        sameBothWays(text.replace(text.find('#'), 1, condition), document);
      }
    }
    sameBothWays("for $b in //b return //s[p >= $b/@from and p < $b/@to]/@n", document);
    sameBothWays("for $b in //b return count(//s[number(p) > $b/@from][number(p) <= $b/@to])",
                 document);
  }
}

}  // namespace
}  // namespace xquery
