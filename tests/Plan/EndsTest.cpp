// Conditions in front of positions.
#include "Plan/RulesTesting.h"

#include <chrono>
#include <iterator>
#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Groups of nine, five, one and no items, of kinds that come again.
const Value& groups() {
  static const Value parsed = [] {
    std::string text = "<r>";
    for (const int count : {9, 5, 0, 1}) {
      text += "<g n='" + std::to_string(count) + "'>";
      for (int i = 1; i <= count; ++i) {
        text += "<i k='" + std::to_string(i) + "' m='" + std::to_string(i % 3) + "'>" +
                (i % 4 == 0 ? "u" : std::to_string(i)) + "</i><j/>";
      }
      text += "</g>";
    }
    return document(text + "</r>");
  }();
  return parsed;
}

// What holds for some, for all and for none, what fails for some or for all, numbers, and what asks
// for its place.
constexpr const char* conditions[] = {"[@m = '1']",
                                      "[@m = $n]",
                                      "[@k > 2]",
                                      "[@k]",
                                      "[@x]",
                                      "[xs:integer(.) > 2]",
                                      "[xs:integer('u') = 1]",
                                      "[@k > 1][@m != '0']",
                                      "[position() > 1][@m = '1']",
                                      "[@m = '1'][position() > 1]",
                                      "[position() mod 2 = 0]",
                                      "[@m = '1' and position() > 2]",
                                      "[position() < $n and @m != '2'][@k]",
                                      "[@m = '1'][position() mod 2 = 0]",
                                      "[$n]",
                                      "[@k > 1][$n]",
                                      "[count(@m)]",
                                      "[@k > 1][count(@m)]",
                                      "[number(@m)]",
                                      "[last() > 4][@k]",
                                      "[@k][last() > 4]",
                                      "[last()]",
                                      "[some $y in ('1', '2') satisfies @m = $y]",
                                      "[some $n in (1, 2) satisfies @m = $n]",
                                      "[../@n > 4]",
                                      "[. >> $g/i[2]]",
                                      "[not(@m = preceding-sibling::i/@m)]",
                                      "['1', '2']",
                                      "[()]",
                                      "[<a/>]",
                                      "[2]",
                                      "[@k][2][@m]"};
constexpr const char* positions[] = {"[1]",
                                     "[2]",
                                     "[0]",
                                     "[9999999999]",
                                     "[-1]",
                                     "[1.5]",
                                     "[$n]",
                                     "[$n + 1]",
                                     "[count($g/i)]",
                                     "[position() <= 2]",
                                     "[position() < $n]",
                                     "[position() > 1 and position() < 4]",
                                     "[position() != 1]",
                                     "[position() = (1, 2)]",
                                     "[position() = 2 to last()]",
                                     "[position() <= xs:integer('u')]",
                                     "[position() <= $g]",
                                     "[xs:integer('u')]",
                                     "[1 div 0e0]",
                                     "[$n, 1]",
                                     "[$n = 1]",
                                     "[last()]",
                                     "[last() - 1]",
                                     "[position() = last()]",
                                     "[1][@k]",
                                     "[2][1]",
                                     "[position() <= 3][last()]",
                                     "[@m][1]"};
constexpr const char* paths[] = {"$g/iC",
                                 "$g/iC/@k",
                                 "$g/*C",
                                 "//iC/@k",
                                 "$g/i[7]/preceding-sibling::iC",
                                 "$g/i[1]/following::*C",
                                 "$g/i[3]/ancestor-or-self::*C",
                                 "$g/descendant-or-self::*C",
                                 "$lC",
                                 "$lC/@k",
                                 "($g/i)C",
                                 "($g/i, 4, 'x', $g/j)C",
                                 "(4, 'x', 7e0, $n)C",
                                 "$g[@n]/iC/(position(), last())",
                                 "(position(), $l/self::iC, last())",
                                 "count($g/iC)",
                                 "exists($lC)",
                                 "($lC)[1]"};

std::string filled(std::string path, const std::string& predicates) {
  path.replace(path.find('C'), 1, predicates);
  return path;
}

std::string loopOver(const std::string& path) {
  return "for $g in //g let $l := $g/i for $n in (1, 3) return (" + path + ")";
}

TEST(Ends, AreWhereAskingAllWouldEnd) {
  size_t turn = 0;
  for (const char* condition : conditions) {
    for (const char* position : positions) {
      // Each pair comes up with a third of the paths.
      for (size_t i = 0; i < std::size(paths) / 3; ++i) {
        const char* path = paths[turn++ % std::size(paths)];
        resultOf(loopOver(filled(path, std::string(condition) + position)), groups());
      }
    }
  }
}

TEST(Ends, AreFound) {
  const std::string loop = "for $g in //g let $l := $g/i for $n in 1 to 3 return ";
  for (const char* path :
       {"$g/i[@m = '1'][1]", "$g/i[@m][@k > 2][$n]", "$l[@m = $n][1]", "$l[@m = $n][last()]",
        "$l[position() < $n and @k > 1][last()]", "$g/i[@m = '1'][position() <= $n]/@k",
        "$g/i[position() > 1][@m][1]", "($g/i, $g/j)[@m][2]", "$g/i[@m][last() - 1]"}) {
    EXPECT_EQ(choicesOf("ends", loop + path), 1U) << path;
  }
  for (const char* path : {"$g/i[1]", "$g/i[2][1]", "$g/i[last() > 2][1]", "$g/i[@m][@k]",
                           "$g/i[<a/>][1]", "$g/i[@m][position() = 2 to last()]"}) {
    EXPECT_EQ(choicesOf("ends", loop + path), 0U) << path;
  }
}

// Ten thousand items, whose first one always does: asking all of them would take minutes.
TEST(Ends, AreNotPassed) {
  std::string text = "<r>";
  for (int i = 0; i < 10'000; ++i) text += "<i m='1'/>";
  const Value wide = document(text + "</r>");
  for (const char* query : {"count(for $i in //i return $i/following-sibling::i[@m = '1'][1])",
                            "count(for $i in //i return $i/../i[starts-with(@m, '1')][1])",
                            "count(let $l := //i for $i in $l return $l[@m = $i/@m][1])",
                            "count(let $l := //i for $i in $l return $l[@m = $i/@m][last()])"}) {
    const auto before = std::chrono::steady_clock::now();
    EXPECT_FALSE(outcomeOf(*compiled(query, XQueryWay::Planned), wide).lines.empty()) << query;
    EXPECT_LT(std::chrono::steady_clock::now() - before, std::chrono::seconds(20)) << query;
  }
}

}  // namespace
}  // namespace xquery
