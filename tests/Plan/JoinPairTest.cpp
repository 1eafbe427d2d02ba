// Items that meet two comparisons, found by both at once: the same that either table alone tells.
#include "Functions/FunctionsTesting.h"
#include "Plan/Joins/XQueryJoinPair.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using functiontest::empty;
using functiontest::integer;
using functiontest::nan;
using functiontest::number;
using functiontest::sequence;
using functiontest::string;
using functiontest::untyped;

using Relation = XQueryRelation;

XQueryJoinTable tableOf(Relation relation, const std::vector<Value>& keys) {
  XQueryJoinRelation by;
  by.relation = relation;
  return XQueryJoinTable(by, std::make_shared<std::vector<Value>>(keys),
                         [&keys](size_t position) { return keys[position]; });
}

constexpr Relation equal{Relation::Equal, false};
constexpr Relation less{Relation::Less, false};
constexpr Relation notLess{Relation::Less, true};
constexpr Relation greater{Relation::Greater, false};

class JoinPair : public testing::Test {
 protected:
  // Two hundred items of a few currencies, some without a price, or with one that is no number.
  JoinPair() {
    for (int i = 0; i < 200; ++i) {
      currencies.push_back(i % 11 == 3 ? empty() : untyped(std::string(1, "EUG"[i * 5 % 3])));
      prices.push_back(i % 13 == 5 ? empty() : i % 7 == 2 ? nan() : number(i * 37 % 100));
    }
  }

  std::vector<Value> currencies;
  std::vector<Value> prices;
};

// What both tables, asked for every item, select.
XQueryJoinTable::Selection expected(XQueryJoinTable& first,
                                    const XQueryJoinTable::Question& askedOfFirst,
                                    XQueryJoinTable& second,
                                    const XQueryJoinTable::Question& askedOfSecond, size_t count) {
  XQueryJoinTable::Selection selection;
  for (uint32_t position = 0; position < count; ++position) {
    const bool isMet = first.isMetBy(askedOfFirst, position) == true &&
                       second.isMetBy(askedOfSecond, position) == true;
    if (isMet) selection.push_back({position, true});
  }
  return selection;
}

TEST_F(JoinPair, FindsWhatBothTablesFind) {
  XQueryJoinTable rows = tableOf(equal, currencies);
  for (const Relation relation : {equal, less, notLess, greater}) {
    XQueryJoinTable others = tableOf(relation, prices);
    const auto one = rows.questionOf(untyped("E"));
    const auto pair = XQueryJoinPair::of(rows, *one, others, *others.questionOf(number(50)));
    ASSERT_TRUE(pair);
    for (const Value& currency :
         {untyped("E"), untyped("x"), sequence({string("U"), untyped("G"), untyped("U")})}) {
      for (const Value& price : {number(-1), number(0), number(37), number(99), number(100),
                                 Value(sequence({number(3), number(60), number(3)}))}) {
        const auto asked = rows.questionOf(currency);
        const auto other = others.questionOf(price);
        ASSERT_TRUE(pair->answersFor(*asked, *other));
        const auto all = expected(rows, *asked, others, *other, prices.size());
        XQueryJoinTable::Selection selection;
        pair->select(*asked, *other, true, false, selection);
        EXPECT_EQ(selection, all);
        EXPECT_EQ(pair->numberFor(*asked, *other), all.size());
        XQueryJoinTable::Selection first;
        pair->select(*asked, *other, true, true, first);
        EXPECT_EQ(first.size(), all.empty() ? 0U : 1U);
        if (!all.empty()) {
          EXPECT_EQ(first.front(), all.front());
        }
      }
    }
  }
}

TEST_F(JoinPair, FindsStretchesOfTheSameKeys) {
  for (const auto& [keys, probes] :
       {std::pair(prices, std::vector{number(-1), number(0), number(37), number(99.5), nan()}),
        std::pair(currencies, std::vector{untyped("A"), untyped("E"), string("G"), string("x")})}) {
    for (const Relation one : {less, notLess, greater}) {
      for (const Relation other : {less, notLess, greater}) {
        XQueryJoinTable first = tableOf(one, keys);
        XQueryJoinTable second = tableOf(other, keys);
        const auto pair = XQueryJoinPair::of(first, *first.questionOf(probes[1]), second,
                                             *second.questionOf(probes[2]));
        ASSERT_TRUE(pair);
        for (const Value& low : probes) {
          for (const Value& high : probes) {
            const auto asked = first.questionOf(low);
            const auto askedToo = second.questionOf(high);
            if (!pair->answersFor(*asked, *askedToo)) continue;
            const auto all = expected(first, *asked, second, *askedToo, keys.size());
            XQueryJoinTable::Selection selection;
            pair->select(*asked, *askedToo, true, false, selection);
            EXPECT_EQ(selection, all);
            EXPECT_EQ(pair->numberFor(*asked, *askedToo), all.size());
          }
        }
      }
    }
  }
}

TEST_F(JoinPair, IsMadeOfAnEqualityAndOfItemsThatNeedNotBeAsked) {
  const auto isMade = [](Relation one, const std::vector<Value>& ofOne, const Value& askedOfOne,
                         Relation other, const std::vector<Value>& ofOther,
                         const Value& askedOfOther) {
    XQueryJoinTable first = tableOf(one, ofOne);
    XQueryJoinTable second = tableOf(other, ofOther);
    return XQueryJoinPair::of(first, *first.questionOf(askedOfOne), second,
                              *second.questionOf(askedOfOther)) != nullptr;
  };
  EXPECT_TRUE(isMade(equal, currencies, untyped("E"), less, prices, number(1)));
  EXPECT_TRUE(isMade(equal, currencies, untyped("E"), equal, currencies, untyped("U")));
  EXPECT_TRUE(isMade(less, prices, number(1), greater, prices, number(1)));
  EXPECT_TRUE(isMade(notLess, currencies, untyped("E"), less, currencies, untyped("U")));
  EXPECT_FALSE(isMade(less, prices, number(1), equal, prices, number(1)));
  std::vector<Value> others = prices;
  others[7] = number(7.5);
  EXPECT_FALSE(isMade(less, prices, number(1), greater, others, number(1)));
  std::rotate(others.begin(), others.begin() + 1, others.end());
  EXPECT_FALSE(isMade(less, prices, number(1), greater, others, number(1)));
  // Two keys of one item, a key that cannot be read, a text that is no number.
  prices[0] = sequence({number(1), number(2)});
  EXPECT_FALSE(isMade(equal, currencies, untyped("E"), less, prices, number(1)));
  prices[0] = Value();
  EXPECT_FALSE(isMade(equal, currencies, untyped("E"), less, prices, number(1)));
  EXPECT_FALSE(isMade(equal, currencies, untyped("E"), less, currencies, integer(1)));
}

TEST_F(JoinPair, AnswersForProbesOfTheKindsThatItWasMadeFor) {
  std::vector<Value> texts;
  for (size_t i = 0; i < currencies.size(); ++i) texts.push_back(untyped(std::to_string(i % 9)));
  XQueryJoinTable rows = tableOf(equal, currencies);
  XQueryJoinTable others = tableOf(less, texts);
  const auto asked = rows.questionOf(untyped("E"));
  const auto pair = XQueryJoinPair::of(rows, *asked, others, *others.questionOf(untyped("5")));
  ASSERT_TRUE(pair);
  EXPECT_TRUE(pair->answersFor(*asked, *others.questionOf(string("7"))));
  EXPECT_FALSE(pair->answersFor(*asked, *others.questionOf(number(7))));
  EXPECT_FALSE(pair->answersFor(*rows.questionOf(empty()), *others.questionOf(string("7"))));
}

}  // namespace
}  // namespace xquery
