#include "Functions/Aggregate.h"
#include "Functions/FunctionsTesting.h"

#include <random>

namespace xquery {
namespace {

using namespace functiontest;

TEST(Sum, OfNothingIsTheDoubleZero) {
  EXPECT_EQ(call(fn_sum, {empty()}), "double 0");
  EXPECT_EQ(call(fn_sum, {sequence({})}), "double 0");
}

TEST(Sum, OfNothingIsTheSecondArgumentWhenGiven) {
  EXPECT_EQ(call(fn_sum, {empty(), integer(0)}), "integer 0");
  EXPECT_EQ(call(fn_sum, {empty(), string("none")}), "string none");
  EXPECT_EQ(call(fn_sum, {empty(), empty()}), "()");
}

TEST(Sum, OfSomethingDoesNotLookAtTheSecondArgument) {
  EXPECT_EQ(call(fn_sum, {integer(1), string("none")}), "integer 1");
}

TEST(Sum, AddsInTheTypesOfItsItems) {
  EXPECT_EQ(call(fn_sum, {sequence({integer(1), integer(2), integer(3)})}), "integer 6");
  EXPECT_EQ(call(fn_sum, {sequence({integer(1), decimal("0.5")})}), "decimal 1.5");
  EXPECT_EQ(call(fn_sum, {sequence({integer(1), number(0.5)})}), "double 1.5");
  EXPECT_EQ(call(fn_sum, {sequence({single("1.5"), single("1.5")})}), "float 3");
}

TEST(Sum, OfOneItemIsTheItem) {
  const Value item = typed(XQueryTypeByte, "7");
  EXPECT_EQ(call(fn_sum, {item}), "byte 7");
}

TEST(Sum, UntypedItemsAndNodesAreDoubles) {
  EXPECT_EQ(call(fn_sum, {untyped("1.5")}), "double 1.5");
  EXPECT_EQ(call(fn_sum, {sequence({elementFrom("<a>1</a>"), integer(2)})}), "double 3");
  EXPECT_EQ(call(fn_sum, {sequence({integer(1), untyped("x")})}),
            "error 6 value does not match a required type");
}

TEST(Sum, ANaNIsTheAnswerAtOnce) {
  EXPECT_EQ(call(fn_sum, {sequence({integer(1), nan(), string("x")})}), "double NaN");
  EXPECT_EQ(call(fn_sum, {sequence({integer(1), untyped("NaN"), integer(2)})}), "double NaN");
  EXPECT_EQ(call(fn_sum, {sequence({nan(), integer(2)})}), "double NaN");
}

TEST(Sum, DurationsCountAsNumbers) {
  EXPECT_EQ(call(fn_sum, {months(14)}), "yearMonthDuration P1Y2M");
  EXPECT_EQ(call(fn_sum, {seconds(61)}), "dayTimeDuration PT1M1S");
  EXPECT_EQ(call(fn_sum, {sequence({months(1), months(13)})}), "yearMonthDuration P1Y2M");
  EXPECT_EQ(call(fn_sum, {sequence({seconds(60), seconds(1)})}), "dayTimeDuration PT1M1S");
}

TEST(Sum, ADateMayComeFirst) {
  const Value date = typed(XQueryTypeDate, "2004-10-29");
  EXPECT_EQ(call(fn_sum, {date}), "date 2004-10-29");
  EXPECT_EQ(call(fn_sum, {sequence({date, seconds(86400)})}), "date 2004-10-30");
  EXPECT_EQ(call(fn_sum, {sequence({date, date})}), "error 6 invalid type for operator");
}

TEST(Sum, AGeneralDurationIsRefused) {
  EXPECT_EQ(call(fn_sum, {typed(XQueryTypeDuration, "P1Y")}), "null");
}

TEST(Sum, AFirstItemThatCannotBeSummedIsRefused) {
  EXPECT_EQ(call(fn_sum, {string("1")}), "null");
  EXPECT_EQ(call(fn_sum, {boolean(true)}), "null");
  EXPECT_EQ(call(fn_sum, {sequence({string("a"), integer(1)})}), "null");
  EXPECT_EQ(answer("sum('a')"), "error 17 line 1 invalid arguments to function - sum");
}

TEST(Sum, ALaterItemThatCannotBeAddedIsAnErrorOfTheAddition) {
  EXPECT_EQ(call(fn_sum, {sequence({integer(1), string("a")})}),
            "error 6 invalid type for operator");
  EXPECT_EQ(call(fn_sum, {sequence({months(1), seconds(1)})}), "error 6 invalid type for operator");
}

TEST(Sum, TakesOneOrTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_sum, integer(1)), "0 3 4 5");
}

// --- avg -----------------------------------------------------------------------------------------

TEST(Avg, IsTheSumDividedByTheCount) {
  EXPECT_EQ(call(fn_avg, {sequence({integer(3), integer(4), integer(5)})}), "decimal 4");
  EXPECT_EQ(call(fn_avg, {sequence({integer(1), integer(2)})}), "decimal 1.5");
  EXPECT_EQ(call(fn_avg, {sequence({decimal("1.5"), integer(2)})}), "decimal 1.75");
  EXPECT_EQ(call(fn_avg, {sequence({number(1), integer(2)})}), "double 1.5");
  EXPECT_EQ(call(fn_avg, {sequence({untyped("1"), elementFrom("<a>4</a>")})}), "double 2.5");
}

TEST(Avg, OfFloatsIsADoubleAsTheDivisionByAnIntegerIs) {
  EXPECT_EQ(call(fn_avg, {sequence({single("1"), single("2")})}), "double 1.5");
}

TEST(Avg, OfNothingIsEmpty) {
  EXPECT_EQ(call(fn_avg, {empty()}), "()");
}

TEST(Avg, OfOneItemIsTheItem) {
  EXPECT_EQ(call(fn_avg, {integer(3)}), "integer 3");
  EXPECT_EQ(call(fn_avg, {typed(XQueryTypeByte, "3")}), "byte 3");
  EXPECT_EQ(call(fn_avg, {untyped("3")}), "double 3");
  EXPECT_EQ(call(fn_avg, {typed(XQueryTypeDate, "2004-01-01")}), "date 2004-01-01");
}

TEST(Avg, ANaNSumIsTheAnswer) {
  EXPECT_EQ(call(fn_avg, {sequence({integer(1), nan(), string("x")})}), "double NaN");
  EXPECT_EQ(call(fn_avg, {sequence({infinity(), minusInfinity()})}), "double NaN");
}

TEST(Avg, OfDurationsIsADuration) {
  EXPECT_EQ(call(fn_avg, {sequence({months(20), months(14)})}), "yearMonthDuration P1Y5M");
  EXPECT_EQ(call(fn_avg, {sequence({seconds(60), seconds(120)})}), "dayTimeDuration PT1M30S");
}

TEST(Avg, FailsAsTheSumAndTheDivisionDo) {
  const Value date = typed(XQueryTypeDate, "2004-10-29");
  EXPECT_EQ(call(fn_avg, {string("a")}), "null");
  EXPECT_EQ(call(fn_avg, {sequence({integer(1), string("a")})}),
            "error 6 invalid type for operator");
  EXPECT_EQ(call(fn_avg, {sequence({date, seconds(86400)})}), "error 6 invalid type for operator");
  EXPECT_EQ(refusedCounts(fn_avg, integer(1)), "0 2 3 4 5");
}

// --- max, min ------------------------------------------------------------------------------------

std::string maxOf(std::vector<Value> items) {
  return call(fn_max, {sequence(std::move(items))});
}
std::string minOf(std::vector<Value> items) {
  return call(fn_min, {sequence(std::move(items))});
}

TEST(MaxAndMin, AreTheGreatestAndTheLeastItem) {
  EXPECT_EQ(maxOf({integer(3), integer(4), integer(2)}), "integer 4");
  EXPECT_EQ(minOf({integer(3), integer(4), integer(2)}), "integer 2");
  EXPECT_EQ(maxOf({integer(1), decimal("1.5"), number(1.25)}), "decimal 1.5");
  EXPECT_EQ(minOf({integer(1), single("-1.5"), number(1.25)}), "float -1.5");
}

TEST(MaxAndMin, TheItemKeepsItsType) {
  EXPECT_EQ(maxOf({number(1), integer(2)}), "integer 2");
  EXPECT_EQ(minOf({number(1), typed(XQueryTypeByte, "0")}), "byte 0");
}

TEST(MaxAndMin, OfEqualItemsAreTheFirst) {
  EXPECT_EQ(maxOf({integer(1), number(1), decimal("1.0")}), "integer 1");
  EXPECT_EQ(minOf({number(1), integer(1)}), "double 1");
}

TEST(MaxAndMin, OfNothingAreEmpty) {
  EXPECT_EQ(call(fn_max, {empty()}), "()");
  EXPECT_EQ(call(fn_min, {empty()}), "()");
  EXPECT_EQ(call(fn_min, {empty(), string("urn:any")}), "()");
}

TEST(MaxAndMin, OfOneItemAreTheItem) {
  EXPECT_EQ(call(fn_max, {typed(XQueryTypeByte, "3")}), "byte 3");
  EXPECT_EQ(call(fn_min, {untyped("3")}), "double 3");
  EXPECT_EQ(call(fn_max, {typed(XQueryTypeGYear, "2004")}), "gYear 2004");
}

TEST(MaxAndMin, ANaNIsTheAnswerAtOnce) {
  EXPECT_EQ(maxOf({integer(1), nan(), integer(3)}), "double NaN");
  EXPECT_EQ(minOf({integer(1), nan(), integer(3)}), "double NaN");
  EXPECT_EQ(maxOf({integer(1), untyped("NaN"), string("x")}), "double NaN");
  EXPECT_EQ(maxOf({nan(), string("x")}), "double NaN");
}

TEST(MaxAndMin, UntypedItemsAreDoubles) {
  EXPECT_EQ(maxOf({untyped("9"), untyped("10")}), "double 10");
  EXPECT_EQ(minOf({elementFrom("<a>9</a>"), integer(10)}), "double 9");
  EXPECT_EQ(maxOf({untyped("a"), untyped("b")}), "error 6 value does not match a required type");
}

TEST(MaxAndMin, OrderStringsBooleansDatesAndDurations) {
  EXPECT_EQ(maxOf({string("a"), string("c"), string("b")}), "string c");
  EXPECT_EQ(minOf({string("b"), typed(XQueryTypeNCName, "a")}), "NCName a");
  EXPECT_EQ(maxOf({boolean(false), boolean(true)}), "true");
  EXPECT_EQ(minOf({boolean(true), boolean(false)}), "false");
  EXPECT_EQ(maxOf({months(3), months(14)}), "yearMonthDuration P1Y2M");
  EXPECT_EQ(minOf({seconds(3), seconds(1)}), "dayTimeDuration PT1S");
  EXPECT_EQ(minOf({typed(XQueryTypeDate, "2004-10-29Z"), typed(XQueryTypeDate, "2003-10-29Z")}),
            "date 2003-10-29Z");
}

TEST(MaxAndMin, AFirstItemWithoutOrderIsRefused) {
  for (const Value& item : {typed(XQueryTypeAnyURI, "urn:a"), typed(XQueryTypeHexBinary, "AB"),
                            typed(XQueryTypeDuration, "P1Y"), typed(XQueryTypeQName, "a")}) {
    EXPECT_EQ(call(fn_max, {item}), "null");
    EXPECT_EQ(call(fn_min, {sequence({item, integer(1)})}), "null");
  }
}

TEST(MaxAndMin, MixedTypesFailAsTheirComparisonDoes) {
  constexpr std::string_view failure = "error 6 invalid type for operator";
  EXPECT_EQ(maxOf({string("a"), integer(1)}), failure);
  EXPECT_EQ(maxOf({integer(1), string("a")}), "error 6 not a string type - 1");
  EXPECT_EQ(minOf({months(1), seconds(1)}), failure);
  EXPECT_EQ(minOf({typed(XQueryTypeGYear, "2004"), typed(XQueryTypeGYear, "2003")}), failure);
  // The new item decides how the two are compared, and a boolean is above nothing but false.
  EXPECT_EQ(maxOf({integer(1), boolean(true)}), "integer 1");
}

TEST(MaxAndMin, TheCollationMustBeAStringAndChangesNothing) {
  const Value items = sequence({string("a"), string("B")});
  EXPECT_EQ(call(fn_max, {items, string("urn:any")}), "string a");
  EXPECT_EQ(call(fn_min, {items, string("urn:any")}), "string B");
  EXPECT_EQ(call(fn_max, {items, integer(1)}), "error 6 not a string type - 1");
  EXPECT_EQ(call(fn_min, {empty(), integer(1)}), "error 6 not a string type - 1");
}

TEST(MaxAndMin, TakeOneOrTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_max, string("a")), "0 3 4 5");
  EXPECT_EQ(refusedCounts(fn_min, string("a")), "0 3 4 5");
}

// --- shortcuts -----------------------------------------------------------------------------------

class Generator {
 public:
  explicit Generator(uint32_t seed) : _random(seed) {}

  size_t below(size_t bound) { return _random() % bound; }

  // Most sequences hold a few kinds of item only, as those in queries do.
  Value items() {
    const size_t count = 1 + below(below(10) == 0 ? 40 : 6);
    const size_t first = below(kinds);
    const size_t second = below(kinds);
    std::vector<Value> items;
    for (size_t index = 0; index < count; ++index) items.push_back(item(below(2) ? first : second));
    return items.size() == 1 ? items.front() : sequence(std::move(items));
  }

 private:
  static constexpr size_t kinds = 14;

  Value item(size_t kind) {
    const auto small = [this] { return static_cast<int64_t>(below(21)) - 10; };
    switch (kind) {
      case 0:
      case 1:
        return integer(small());
      case 2:
        return integer(static_cast<int64_t>((uint64_t{_random()} << 32) | _random()));
      case 3:
        return typed(XQueryTypeInteger, "12345678901234567890123" + std::to_string(below(100)));
      case 4:
        return decimal(std::to_string(small()) + "." + std::to_string(below(1000)));
      case 5:
        return number(static_cast<double>(small()) / 8);
      case 6:
        return number(below(2) ? 1e300 : -0.0);
      case 7:
        return untyped(std::to_string(small()) + "." + std::to_string(below(10)));
      case 8:
        return elementFrom("<a>" + std::to_string(small()) + "</a>");
      case 9:
        return below(3) ? infinity() : below(2) ? minusInfinity() : nan();
      case 10:
        return below(2) ? Value(XQueryNumber::zero()) : Value(XQueryNumber::one());
      case 11:
        return single("0." + std::to_string(below(100)));
      case 12:
        return typed(XQueryTypeShort, std::to_string(small()));
      default:
        return below(2) ? string("a") : untyped(below(2) ? "x" : "INF");
    }
  }

  std::mt19937 _random;
};

TEST(AggregateProperty, ShortcutsAnswerWhatTheDefinitionsDo) {
  Generator generate(2004);
  size_t taken = 0;
  for (int round = 0; round < 20000; ++round) {
    const Value items = generate.items();
    if (const Value sum = XQuerySumShortcut(items)) {
      ++taken;
      ASSERT_EQ(show(sum),
                outcome([&](XQueryContext& context) { return XQuerySumPlainly(items, context); }))
          << show(items);
    }
    for (const int comparison : {XQueryOperatorGt, XQueryOperatorLt}) {
      const Value extreme = XQueryExtremeShortcut(items, comparison);
      if (!extreme) continue;
      ++taken;
      ASSERT_EQ(show(extreme), outcome([&](XQueryContext& context) {
                  return XQueryExtremePlainly(items, comparison, context);
                }))
          << show(items);
    }
  }
  EXPECT_GT(taken, 10000U);
}

TEST(AggregateShortcut, EachAdditionOfWideNumbersCanBeEnded) {
  const std::string zeros(1000, '0');
  const Value wide = decimal("1" + zeros);
  const Value fine = decimal("0." + zeros + "1");
  std::vector<Value> items;
  for (int pair = 0; pair < 50; ++pair) items.insert(items.end(), {wide, fine});
  const Value numbers = sequence(std::move(items));
  const WorkEnder ender(90);
  EXPECT_THROW(XQuerySumShortcut(numbers), WorkEnded);
}

TEST(AggregateShortcut, LeavesWhatItDoesNotKnow) {
  EXPECT_FALSE(XQuerySumShortcut(sequence({integer(1), string("1")})));
  EXPECT_FALSE(XQuerySumShortcut(sequence({integer(1), nan()})));
  EXPECT_FALSE(XQuerySumShortcut(integer(1)));
  EXPECT_FALSE(XQuerySumShortcut(empty()));
  EXPECT_FALSE(XQueryExtremeShortcut(sequence({integer(1), untyped("NaN")}), XQueryOperatorGt));
  EXPECT_FALSE(XQueryExtremeShortcut(empty(), XQueryOperatorGt));
}

}  // namespace
}  // namespace xquery
