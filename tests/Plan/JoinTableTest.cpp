#include "Functions/FunctionsTesting.h"
#include "Plan/Joins/XQueryJoinTable.h"

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace xquery {
namespace {

using functiontest::boolean;
using functiontest::decimal;
using functiontest::empty;
using functiontest::integer;
using functiontest::nan;
using functiontest::number;
using functiontest::sequence;
using functiontest::string;
using functiontest::untyped;

XQueryJoinRelation condition(XQueryRelation::Test test, bool negated = false,
                             bool isValueComparison = false) {
  XQueryJoinRelation made;
  made.relation = {test, negated};
  made.isValueComparison = isValueComparison;
  return made;
}

// A null key stands for one that cannot be read.
XQueryJoinTable tableOf(const XQueryJoinRelation& by, const std::vector<Value>& keys) {
  return XQueryJoinTable(by, std::make_shared<std::vector<Value>>(keys),
                         [&keys](size_t position) { return keys[position]; });
}

bool select(XQueryJoinTable& table, const Value& probe, XQueryJoinTable::Selection& selection,
            bool wantsFirst = false) {
  const auto question = table.questionOf(probe);
  if (question) table.select(*question, selection, wantsFirst);
  return question.has_value();
}

// The positions that a table of the keys selects, those that have to be asked with a "?"; "plain"
// for the plain way. Each item, asked for by itself, has to answer the same, and their number, if
// it is told, has to be theirs.
std::string selected(const XQueryJoinRelation& by, const std::vector<Value>& keys,
                     const Value& probe) {
  XQueryJoinTable table = tableOf(by, keys);
  XQueryJoinTable::Selection selection;
  const auto question = table.questionOf(probe);
  if (!question) return "plain";
  table.select(*question, selection);
  std::string text;
  std::vector<std::optional<bool>> answers(keys.size(), false);
  for (const auto& match : selection) {
    text += (text.empty() ? "" : " ") + std::to_string(match.position) + (match.isSure ? "" : "?");
    answers[match.position] = match.isSure ? std::optional(true) : std::nullopt;
  }
  const auto number = table.numberFor(*question);
  EXPECT_EQ(number.value_or(selection.size()), selection.size()) << text;
  EXPECT_FALSE(number && text.find('?') != std::string::npos) << text;
  for (uint32_t position = 0; position < keys.size(); ++position) {
    EXPECT_EQ(table.isMetBy(*question, position), answers[position]) << position << " of " << text;
  }
  return text;
}

constexpr auto equal = XQueryRelation::Equal;
constexpr auto less = XQueryRelation::Less;

TEST(JoinTable, TextsMeetEqualTexts) {
  const std::vector<Value> keys = {untyped("a"), string("b"), untyped("b"), untyped("")};
  EXPECT_EQ(selected(condition(equal), keys, untyped("b")), "1 2");
  EXPECT_EQ(selected(condition(equal), keys, sequence({string("a"), string("b")})), "0 1 2");
  EXPECT_EQ(selected(condition(equal), keys, string("c")), "");
}

TEST(JoinTable, AnItemOfManyKeysIsSelectedOnce) {
  const std::vector<Value> keys = {sequence({untyped("a"), untyped("b")}), untyped("b")};
  EXPECT_EQ(selected(condition(equal), keys, sequence({untyped("b"), untyped("a")})), "0 1");
}

// Sorted keys, once there have been enough probes, select what looking at each key does.
TEST(JoinTable, ManyProbesFindTheSameByTheOrderOfTheKeys) {
  std::vector<Value> texts;
  std::vector<Value> numbers;
  std::vector<Value> decimals;
  for (int i = 0; i < 200; ++i) {
    const int value = i * 37 % 100;
    texts.push_back(untyped(std::to_string(value)));
    numbers.push_back(i % 9 == 4 ? nan() : number(value));
    decimals.push_back(decimal(std::to_string(value) + (i % 3 ? ".1" : "")));
  }
  for (const auto test : {less, XQueryRelation::Greater}) {
    for (const bool negated : {false, true}) {
      for (const auto* keys : {&texts, &numbers, &decimals}) {
        XQueryJoinTable table = tableOf(condition(test, negated), *keys);
        for (int each = -1; each <= 100; ++each) {
          const Value probe =
              keys == &decimals ? decimal(std::to_string(each) + ".1") : number(each);
          XQueryJoinTable::Selection selection;
          XQueryJoinTable::Selection fresh;
          XQueryJoinTable other = tableOf(condition(test, negated), *keys);
          ASSERT_TRUE(select(table, probe, selection));
          ASSERT_TRUE(select(other, probe, fresh));
          EXPECT_EQ(selection, fresh) << test << negated << each;
          EXPECT_EQ(table.numberFor(*table.questionOf(probe)), fresh.size());
          EXPECT_EQ(table.meets(probe), !fresh.empty());
        }
      }
    }
  }
}

TEST(JoinTable, CountsItemsThatNeedNotBeAsked) {
  const auto numberOf = [](const XQueryJoinRelation& by, const std::vector<Value>& keys,
                           const Value& probe) {
    XQueryJoinTable table = tableOf(by, keys);
    return table.numberFor(*table.questionOf(probe));
  };
  const std::vector<Value> texts = {untyped("a"), string("b"), untyped("b"), empty()};
  EXPECT_EQ(numberOf(condition(equal), texts, string("b")), 2U);
  EXPECT_EQ(numberOf(condition(equal), texts, sequence({string("a"), string("b")})), 3U);
  EXPECT_EQ(numberOf(condition(less), texts, string("b")), 1U);
  EXPECT_EQ(numberOf(condition(less), texts, empty()), 0U);
  // Two keys of one item may both be met.
  const std::vector<Value> two = {sequence({untyped("a"), untyped("b")}), untyped("b")};
  EXPECT_EQ(numberOf(condition(equal), two, string("b")), std::nullopt);
  EXPECT_EQ(numberOf(condition(equal), {untyped("1"), untyped("x")}, number(1)), std::nullopt);
  EXPECT_EQ(numberOf(condition(equal), {number(1), boolean(true)}, number(1)), std::nullopt);
  EXPECT_EQ(numberOf(condition(less), {integer(9007199254740993)}, integer(9007199254740992)), 0U);
  EXPECT_EQ(
      numberOf(condition(less), {integer(9007199254740993), number(1)}, integer(9007199254740992)),
      std::nullopt);
}

// As pairs they would fill gigabytes.
TEST(JoinTable, AKeyMeetsEqualProbesOnce) {
  constexpr size_t many = 30000;
  const std::vector<Value> keys(many, string("a"));
  XQueryJoinTable table = tableOf(condition(equal), keys);
  XQueryJoinTable::Selection selection;
  ASSERT_TRUE(select(table, sequence(keys), selection));
  EXPECT_EQ(selection.size(), many);
  EXPECT_EQ(selected(condition(equal), {number(0), number(1)},
                     sequence({number(1), number(-0.0), number(0), number(1), nan()})),
            "0 1");
}

TEST(JoinTable, ItemsOfThousandsOfKeysMakeNone) {
  const auto isComplete = [](size_t items, size_t keysOfEach) {
    const Value keys = sequence(std::vector<Value>(keysOfEach, string("a")));
    return XQueryJoinTable(condition(equal),
                           std::make_shared<std::vector<Value>>(items, string("i")),
                           [&](size_t) { return keys; })
        .isComplete();
  };
  constexpr size_t most = XQueryJoinTable::keysOfAnyItems;
  EXPECT_TRUE(isComplete(1, most));
  EXPECT_FALSE(isComplete(1, most + 1));
  constexpr size_t items = most / XQueryJoinTable::mostKeysPerItem + 1;
  EXPECT_TRUE(isComplete(items, XQueryJoinTable::mostKeysPerItem));
  EXPECT_FALSE(isComplete(items, XQueryJoinTable::mostKeysPerItem + 1));
}

TEST(JoinTable, UntypedKeysMeetNumbersAsNumbersAndOthersAreAsked) {
  const std::vector<Value> keys = {untyped("1"), untyped("01"), untyped("x"), string("1")};
  EXPECT_EQ(selected(condition(equal), keys, integer(1)), "0 1 2? 3?");
  EXPECT_EQ(selected(condition(less), {untyped("5"), untyped("50")}, integer(10)), "0");
}

TEST(JoinTable, NaNMeetsNothing) {
  EXPECT_EQ(selected(condition(less, true), {number(1), nan()}, number(1)), "0");
  EXPECT_EQ(selected(condition(equal), {number(1), nan()}, nan()), "");
}

// Decimals that are one double may differ.
TEST(JoinTable, DecimalsAreToldApartByTheirDigits) {
  const std::vector<Value> keys = {integer(9007199254740993), integer(1), decimal("0.1"),
                                   decimal("0.10000000000000000001"), integer(9007199254740992)};
  EXPECT_EQ(selected(condition(equal), keys, integer(1)), "1");
  EXPECT_EQ(selected(condition(equal), keys, number(1)), "1");
  EXPECT_EQ(selected(condition(equal), keys, number(0.1)), "2 3");
  EXPECT_EQ(selected(condition(equal), keys, decimal("0.10")), "2");
  EXPECT_EQ(selected(condition(equal), keys, integer(9007199254740993)), "0");
  EXPECT_EQ(selected(condition(less), keys, integer(9007199254740993)), "1 2 3 4");
  EXPECT_EQ(selected(condition(less), keys, decimal("0.10000000000000000001")), "2");
  EXPECT_EQ(selected(condition(less, true), keys, integer(9007199254740993)), "0");
  EXPECT_EQ(selected(condition(less), keys, sequence({decimal("0.1"), integer(2)})), "1 2 3");
  EXPECT_EQ(selected(condition(equal), {integer(1)}, integer(9007199254740993)), "");
  XQueryJoinTable table = tableOf(condition(equal), keys);
  EXPECT_EQ(table.meets(integer(9007199254740992)), true);
  EXPECT_EQ(table.meets(integer(9007199254740991)), false);
}

TEST(JoinTable, DecimalsAmongDoublesAreAskedWhereTheDoublesAreEqual) {
  const std::vector<Value> keys = {integer(9007199254740993), integer(1), number(5)};
  EXPECT_EQ(selected(condition(equal), keys, integer(1)), "1?");
  EXPECT_EQ(selected(condition(equal), keys, number(1)), "1");
  EXPECT_EQ(selected(condition(less), keys, integer(9007199254740992)), "0? 1 2");
  EXPECT_EQ(selected(condition(less), keys, integer(9007199254740999)), "0 1 2");
  EXPECT_EQ(selected(condition(less, true), keys, integer(9007199254740992)), "0?");
  EXPECT_EQ(selected(condition(less), {decimal("0.1"), integer(1)},
                     sequence({decimal("0.5"), untyped("0.1")})),
            "0");
  XQueryJoinTable table = tableOf(condition(equal), keys);
  EXPECT_EQ(table.meets(integer(9007199254740992)), std::nullopt);
  EXPECT_EQ(table.meets(integer(7)), false);
}

TEST(JoinTable, TheFirstSureItemIsEnoughWhereThatIsAskedFor) {
  const std::vector<Value> keys = {number(9), boolean(true), number(2), number(1), number(1)};
  XQueryJoinTable table = tableOf(condition(less), keys);
  XQueryJoinTable::Selection selection;
  EXPECT_TRUE(select(table, number(3), selection, true));
  EXPECT_EQ(selection, (XQueryJoinTable::Selection{{1, false}, {2, true}}));
}

TEST(JoinTable, TextsBeginWithAProbe) {
  auto prefix = condition(less, false, true);
  prefix.isPrefix = true;
  std::vector<Value> keys = {
      untyped("ab"), string("a"),  untyped("b"), integer(1),
      empty(),       untyped("é"), untyped(""),  sequence({string("a"), string("ab")})};
  EXPECT_EQ(selected(prefix, keys, string("a")), "0 1 3? 4? 7?");
  EXPECT_EQ(selected(prefix, keys, untyped("é")), "3? 4? 5 7?");
  EXPECT_EQ(selected(prefix, keys, string("")), "0 1 2 3? 4? 5 6 7?");
  EXPECT_EQ(selected(prefix, keys, integer(1)), "plain");
  EXPECT_EQ(selected(prefix, keys, empty()), "plain");
  EXPECT_EQ(selected(prefix, keys, sequence({string("a"), string("b")})), "plain");
  for (int i = 0; i < 100; ++i) keys.push_back(untyped(std::to_string(i * 37 % 100)));
  XQueryJoinTable table = tableOf(prefix, keys);
  for (int round = 0; round < 30; ++round) {
    for (const char* probe : {"", "a", "3", "37", "99", "z"}) {
      XQueryJoinTable::Selection selection;
      ASSERT_TRUE(select(table, string(probe), selection));
      std::string text;
      for (const auto& pick : selection) {
        text +=
            (text.empty() ? "" : " ") + std::to_string(pick.position) + (pick.isSure ? "" : "?");
      }
      EXPECT_EQ(text, selected(prefix, keys, string(probe))) << probe << " in round " << round;
    }
  }
}

TEST(JoinTable, EstimatesNoFewerThanItFinds) {
  std::vector<Value> keys;
  for (int i = 0; i < 100; ++i) keys.push_back(untyped(std::to_string(i % 10)));
  XQueryJoinTable same = tableOf(condition(equal), keys);
  EXPECT_GE(same.estimateFor(*same.questionOf(string("3"))), 10U);
  EXPECT_LT(same.estimateFor(*same.questionOf(string("3"))), 100U);
  EXPECT_EQ(same.estimateFor(*same.questionOf(empty())), 0U);
}

TEST(JoinTable, KeysThatCannotBeReadOrMixKindsAreAsked) {
  const std::vector<Value> keys = {untyped("1"), Value(), integer(1), boolean(true), empty()};
  EXPECT_EQ(selected(condition(equal), keys, untyped("1")), "0 1? 2? 3?");
  EXPECT_EQ(selected(condition(equal), keys, empty()), "1? 2? 3?");
}

TEST(JoinTable, OtherProbesAreComparedThePlainWay) {
  EXPECT_EQ(selected(condition(equal), {untyped("true")}, boolean(true)), "plain");
  EXPECT_EQ(selected(condition(equal), {untyped("1")}, sequence({untyped("1"), integer(1)})),
            "plain");
  EXPECT_EQ(selected(condition(equal), {untyped("1")}, Value()), "plain");
}

TEST(JoinTable, AValueComparisonTakesOneKeyAndOneProbe) {
  const auto eq = condition(equal, false, true);
  EXPECT_EQ(selected(eq, {sequence({untyped("a"), untyped("b")}), untyped("a")}, string("a")),
            "0? 1");
  EXPECT_EQ(selected(eq, {untyped("a")}, sequence({string("a"), string("b")})), "plain");
  EXPECT_EQ(selected(eq, {untyped("1")}, integer(1)), "plain");
  auto ofEach = eq;
  ofEach.keysAreOfEach = true;
  EXPECT_EQ(selected(ofEach, {sequence({untyped("a"), untyped("b")}), untyped("a")}, string("a")),
            "0 1");
  EXPECT_EQ(selected(ofEach, {untyped("a")}, sequence({string("a"), string("b")})), "plain");
  ofEach.probesAreOfEach = true;
  EXPECT_EQ(selected(ofEach, {untyped("a")}, sequence({string("a"), string("b")})), "0");
}

}  // namespace
}  // namespace xquery
