// Sets of texts that grow as far as they are asked, and comparisons with them.
#include "Functions/FunctionsTesting.h"
#include "Plan/Joins/XQueryGrowingTexts.h"
#include "Plan/PlanTesting.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace plantest;
using functiontest::integer;
using functiontest::sequence;
using functiontest::string;
using functiontest::untyped;

NSStringView A(std::string_view text) {
  return NSStringView::ascii(text);
}

TEST(GrowingTexts, ReadNoMoreThanTheyAreAsked) {
  const auto set = XQueryGrowingTexts::of(
      sequence({untyped("a"), string("b"), untyped("a"), untyped("c"), untyped("d")}));
  ASSERT_TRUE(set);
  EXPECT_EQ(set->readCount(), 0U);
  EXPECT_EQ(set->contains(A("b")), true);
  EXPECT_EQ(set->readCount(), 2U);
  EXPECT_EQ(set->contains(A("a")), true);
  EXPECT_EQ(set->readCount(), 2U);
  EXPECT_EQ(set->contains(A("c")), true);
  EXPECT_EQ(set->readCount(), 4U);
  EXPECT_EQ(set->contains(A("no")), false);
  EXPECT_EQ(set->readCount(), 5U);
  EXPECT_EQ(set->contains(A("")), false);
  EXPECT_EQ(set->contains(A("d")), true);
}

TEST(GrowingTexts, AreOfItemsWhoseTextIsAllThatCounts) {
  EXPECT_TRUE(XQueryGrowingTexts::of(string("a")));
  EXPECT_TRUE(XQueryGrowingTexts::of(NSNull::null()));
  EXPECT_FALSE(XQueryGrowingTexts::of(sequence({untyped("a"), integer(1)})));
  EXPECT_FALSE(XQueryGrowingTexts::of(sequence({untyped("a"), NSNull::null()})));
  EXPECT_FALSE(XQueryGrowingTexts::of(
      sequence({untyped("a"), Value(sequence({untyped("b"), untyped("c")}))})));
}

TEST(GrowingTexts, HaveWhatAListHas) {
  for (uint32_t seed = 0; seed < 40; ++seed) {
    std::mt19937 random(seed);
    std::vector<std::string> texts;
    std::vector<Value> items;
    for (uint32_t count = random() % 300; count > 0; --count) {
      texts.push_back(std::to_string(random() % (1 + seed * 5)));
      items.push_back(random() % 2 ? untyped(texts.back()) : string(texts.back()));
    }
    const auto set = XQueryGrowingTexts::of(NSArray::arrayWithObjects(items));
    ASSERT_TRUE(set);
    for (int turn = 0; turn < 200; ++turn) {
      const std::string asked = std::to_string(random() % (1 + seed * 6));
      EXPECT_EQ(set->contains(A(asked)),
                std::find(texts.begin(), texts.end(), asked) != texts.end());
    }
  }
}

TEST(GrowingTexts, EndWhereTheyWouldTakeMuchOfWhatIsLeft) {
  std::vector<Value> items;
  for (int i = 0; i < 5000; ++i) items.push_back(untyped(std::to_string(i)));
  const Value list = NSArray::arrayWithObjects(items);
  const int64_t before = workMeter.valueBytes;
  {
    const auto set = XQueryGrowingTexts::of(list);
    const int64_t outer = workMeter.mostValueBytes;
    workMeter.mostValueBytes = workMeter.valueBytes + 100'000;
    EXPECT_EQ(set->contains(A("17")), true);
    EXPECT_EQ(set->contains(A("no")), std::nullopt);
    EXPECT_LT(workMeter.valueBytes - before, 100'000);
    workMeter.mostValueBytes = outer;
    EXPECT_EQ(set->contains(A("no")), false);
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

// --- comparisons ---------------------------------------------------------------------------------

// Parts of a hundred values and more, of which some occur once, near the end, or not at all.
const Value& parts() {
  static const Value parsed = [] {
    std::string text = "<r>";
    for (int part = 0; part < 6; ++part) {
      text += "<p>";
      for (int k = 0; k < 5; ++k) text += "<k>v" + std::to_string(k * 3 + part) + "</k>";
      text += "<n>3</n><n>17.0</n><n>x</n>";
      for (int i = 0; i < 120; ++i) {
        text +=
            "<s><v>v" + std::to_string(i % (2 + part)) + "</v><m>" + std::to_string(i) + "</m></s>";
      }
      text += "<s><v>v<i>1</i>2</v><v>v14</v></s></p>";
    }
    return document(text + "</r>");
  }();
  return parsed;
}

TEST(GrowingTexts, AnswerComparisonsAsTheyAreWritten) {
  for (const std::string query : {
           "for $p in //p for $k in $p/k where not($p//v = $k) return string($k)",
           "for $p in //p for $k in $p/k where $k = $p//v return string($k)",
           "for $p in //p for $k in ('v12', 'v', '') where $p//v = $k return concat($k, '!')",
           "for $p in //p return for $k in $p/k return $p//v = ($k, $k/following-sibling::k)",
           "for $p in //p for $n in (3, 17, 200, 3.5e0) return $p//m = $n",
           "for $p in //p for $n in ($p/n, 5, 'v1') return $p//m = $n",
           "for $p in //p let $all := ($p//v, 'v13', 1) for $k in $p/k return $all = $k",
           "for $p in //p let $all := ($p//v, 1) for $k in ($p/k, 1, 2) return $k = $all",
           "for $p in //p let $all := ($p//v, xs:date('2001-01-01')) for $k in $p/k "
           "return $all = $k",
           "for $p in //p for $k in ($p/k, xs:token('v1'), true()) return $p//v = $k",
           "for $p in //p for $k in $p/k return ($p//v != $k, $p//v < $k, $p//v >= $k)",
           "let $v := //p[1]//v return for $e in (<e>v1</e>, <e>none</e>, <e/>) return $v = $e",
           "for $p in //p return ($p//v = (), () = $p//v, $p//none = $p//v)",
       }) {
    SCOPED_TRACE(query);
    EXPECT_FALSE(sameBothWays(query, parts()).lines.empty());
  }
}

}  // namespace
}  // namespace xquery
