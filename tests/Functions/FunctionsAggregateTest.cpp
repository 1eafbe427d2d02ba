#include "Functions/FunctionsAggregate.h"
#include "Functions/FunctionsTesting.h"

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

}  // namespace
}  // namespace xquery
