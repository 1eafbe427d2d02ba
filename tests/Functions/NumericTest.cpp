#include "Functions/FunctionsTesting.h"
#include "Functions/Numeric.h"

namespace xquery {
namespace {

using namespace functiontest;

std::string toEven(const Value& value, int64_t precision) {
  return call(fn_round_half_to_even, {value, integer(precision)});
}

// --- abs, floor, ceiling -------------------------------------------------------------------------

TEST(Abs, KeepsTheTypeOfItsArgument) {
  EXPECT_EQ(call(fn_abs, {integer(-3)}), "integer 3");
  EXPECT_EQ(call(fn_abs, {integer(3)}), "integer 3");
  EXPECT_EQ(call(fn_abs, {decimal("-3.5")}), "decimal 3.5");
  EXPECT_EQ(call(fn_abs, {number(-3.5)}), "double 3.5");
  EXPECT_EQ(call(fn_abs, {single("-3.5")}), "float 3.5");
  EXPECT_EQ(call(fn_abs, {typed(XQueryTypeByte, "-7")}), "byte 7");
  EXPECT_EQ(call(fn_abs, {typed(XQueryTypeNonPositiveInteger, "0")}), "nonPositiveInteger 0");
}

TEST(Abs, OfAWideIntegerIsExact) {
  EXPECT_EQ(call(fn_abs, {typed(XQueryTypeInteger, "-123456789012345678901234567890")}),
            "integer 123456789012345678901234567890");
  EXPECT_EQ(call(fn_abs, {integer(INT64_MIN)}), "integer 9223372036854775808");
}

TEST(Abs, ThatTheTypeCannotHoldFailsAsACast) {
  constexpr std::string_view failure = "error 6 value does not match a required type";
  EXPECT_EQ(call(fn_abs, {typed(XQueryTypeNegativeInteger, "-1")}), failure);
  EXPECT_EQ(call(fn_abs, {typed(XQueryTypeNonPositiveInteger, "-1")}), failure);
  EXPECT_EQ(call(fn_abs, {typed(XQueryTypeByte, "-128")}), failure);
}

TEST(Abs, OfSpecialNumbers) {
  EXPECT_EQ(call(fn_abs, {nan()}), "double NaN");
  EXPECT_EQ(call(fn_abs, {infinity()}), "double INF");
  EXPECT_EQ(call(fn_abs, {minusInfinity()}), "double INF");
}

TEST(Floor, IsTheWholeNumberBelow) {
  EXPECT_EQ(call(fn_floor, {decimal("10.5")}), "decimal 10");
  EXPECT_EQ(call(fn_floor, {decimal("-10.5")}), "decimal -11");
  EXPECT_EQ(call(fn_floor, {number(10.5)}), "double 10");
  EXPECT_EQ(call(fn_floor, {number(-10.5)}), "double -11");
  EXPECT_EQ(call(fn_floor, {single("-0.25")}), "float -1");
  EXPECT_EQ(call(fn_floor, {integer(-7)}), "integer -7");
  EXPECT_EQ(call(fn_floor, {typed(XQueryTypeUnsignedByte, "255")}), "unsignedByte 255");
}

TEST(Ceiling, IsTheWholeNumberAbove) {
  EXPECT_EQ(call(fn_ceiling, {decimal("10.5")}), "decimal 11");
  EXPECT_EQ(call(fn_ceiling, {decimal("-10.5")}), "decimal -10");
  EXPECT_EQ(call(fn_ceiling, {number(10.5)}), "double 11");
  EXPECT_EQ(call(fn_ceiling, {number(-10.5)}), "double -10");
  EXPECT_EQ(call(fn_ceiling, {single("0.25")}), "float 1");
  EXPECT_EQ(call(fn_ceiling, {integer(7)}), "integer 7");
}

TEST(FloorAndCeiling, OfDecimalsAreExactAtAnySize) {
  const Value wide = decimal("99999999999999999999999999999.000000000000000000000000001");
  EXPECT_EQ(call(fn_floor, {wide}), "decimal 99999999999999999999999999999");
  EXPECT_EQ(call(fn_ceiling, {wide}), "decimal 100000000000000000000000000000");
}

TEST(FloorAndCeiling, OfSpecialNumbersAreThese) {
  for (const XQueryProcedure procedure : {fn_floor, fn_ceiling, fn_round, fn_round_half_to_even}) {
    EXPECT_EQ(call(procedure, {nan()}), "double NaN");
    EXPECT_EQ(call(procedure, {infinity()}), "double INF");
    EXPECT_EQ(call(procedure, {minusInfinity()}), "double -INF");
  }
}

// --- round ---------------------------------------------------------------------------------------

TEST(Round, HalvesGoTowardPositiveInfinity) {
  const struct {
    const char* text;
    const char* rounded;
  } rows[] = {{"2.5", "3"},       {"2.4999", "2"}, {"-2.5", "-2"}, {"-2.5001", "-3"},
              {"1.5", "2"},       {"-1.5", "-1"},  {"0.5", "1"},   {"-0.5", "0"},
              {"0.4999999", "0"}, {"7", "7"},      {"-3.7", "-4"}};
  for (const auto& row : rows) {
    EXPECT_EQ(call(fn_round, {decimal(row.text)}), std::string("decimal ") + row.rounded);
    EXPECT_EQ(call(fn_round, {typed(XQueryTypeDouble, row.text)}),
              std::string("double ") + row.rounded)
        << row.text;
    EXPECT_EQ(call(fn_round, {single(row.text)}), std::string("float ") + row.rounded) << row.text;
  }
}

TEST(Round, OfADoubleNextToAHalf) {
  EXPECT_EQ(call(fn_round, {number(0.49999999999999994)}), "double 0");
  EXPECT_EQ(call(fn_round, {number(-0.50000000000000011)}), "double -1");
  EXPECT_EQ(call(fn_round, {number(-1e-300)}), "double 0");
  EXPECT_EQ(call(fn_round, {number(4503599627370497.5)}), "double 4503599627370498");
  EXPECT_EQ(call(fn_round, {number(9007199254740993)}), "double 9007199254740992");
  EXPECT_EQ(call(fn_round, {number(1e300)}), "double 1e+300");
}

TEST(Round, OfAnIntegerIsTheInteger) {
  EXPECT_EQ(call(fn_round, {integer(3)}), "integer 3");
  EXPECT_EQ(call(fn_round, {typed(XQueryTypeShort, "-3")}), "short -3");
}

// --- round-half-to-even --------------------------------------------------------------------------

TEST(RoundHalfToEven, HalvesGoToTheEvenNeighbour) {
  const struct {
    const char* text;
    const char* rounded;
  } rows[] = {{"0.5", "0"},  {"1.5", "2"},   {"2.5", "2"},   {"3.5", "4"},
              {"-0.5", "0"}, {"-1.5", "-2"}, {"-2.5", "-2"}, {"2.5000001", "3"}};
  for (const auto& row : rows) {
    EXPECT_EQ(call(fn_round_half_to_even, {decimal(row.text)}),
              std::string("decimal ") + row.rounded);
    EXPECT_EQ(call(fn_round_half_to_even, {typed(XQueryTypeDouble, row.text)}),
              std::string("double ") + row.rounded)
        << row.text;
  }
}

TEST(RoundHalfToEven, KeepsAsManyDecimalsAsAsked) {
  EXPECT_EQ(toEven(decimal("3567.812"), 2), "decimal 3567.81");
  EXPECT_EQ(toEven(decimal("3567.815"), 2), "decimal 3567.82");
  EXPECT_EQ(toEven(decimal("3567.825"), 2), "decimal 3567.82");
  EXPECT_EQ(toEven(number(3567.812), 2), "double 3567.81");
  EXPECT_EQ(toEven(number(0.0047564), 2), "double 0");
  EXPECT_EQ(toEven(number(1.125), 2), "double 1.12");
  EXPECT_EQ(toEven(single("2.25"), 1), "float 2.2");
  EXPECT_EQ(toEven(decimal("1.5"), 3), "decimal 1.5");
}

TEST(RoundHalfToEven, FloatingPointHalvesAreThoseOfThePrintedDigits) {
  EXPECT_EQ(toEven(number(2.675), 2), "double 2.68");
  EXPECT_EQ(toEven(number(2.665), 2), "double 2.66");
  EXPECT_EQ(toEven(single("0.15"), 1), "float 0.2");
}

TEST(RoundHalfToEven, ANegativePrecisionRoundsBeforeThePoint) {
  EXPECT_EQ(toEven(decimal("35612.25"), -2), "decimal 35600");
  EXPECT_EQ(toEven(integer(35650), -2), "integer 35600");
  EXPECT_EQ(toEven(integer(35750), -2), "integer 35800");
  EXPECT_EQ(toEven(integer(-35650), -2), "integer -35600");
  EXPECT_EQ(toEven(integer(5), -1), "integer 0");
  EXPECT_EQ(toEven(integer(15), -1), "integer 20");
  EXPECT_EQ(toEven(integer(51), -2), "integer 100");
  EXPECT_EQ(toEven(integer(49), -3), "integer 0");
  EXPECT_EQ(toEven(number(1250), -2), "double 1200");
  EXPECT_EQ(toEven(single("1350"), -2), "float 1400");
  EXPECT_EQ(toEven(decimal("50000000000000000000000000000.1"), -29),
            "decimal 100000000000000000000000000000");
  EXPECT_EQ(toEven(decimal("50000000000000000000000000000"), -29), "decimal 0");
}

TEST(RoundHalfToEven, AnyPrecisionIsTaken) {
  EXPECT_EQ(toEven(decimal("1.25"), INT64_MAX), "decimal 1.25");
  EXPECT_EQ(toEven(decimal("1.25"), INT64_MIN), "decimal 0");
  EXPECT_EQ(toEven(number(1.5e300), 400), "double 1.5e+300");
  EXPECT_EQ(toEven(number(1.5e300), -400), "double 0");
  EXPECT_EQ(toEven(number(1.7e308), -308), "double INF");
  EXPECT_EQ(toEven(infinity(), 2), "double INF");
  EXPECT_EQ(toEven(nan(), -2), "double NaN");
}

TEST(RoundHalfToEven, AResultThatTheTypeCannotHoldFailsAsACast) {
  EXPECT_EQ(toEven(typed(XQueryTypeByte, "126"), -1),
            "error 6 value does not match a required type");
  EXPECT_EQ(toEven(typed(XQueryTypePositiveInteger, "3"), -1),
            "error 6 value does not match a required type");
  EXPECT_EQ(toEven(typed(XQueryTypeByte, "124"), -1), "byte 120");
}

TEST(RoundHalfToEven, ThePrecisionIsPromotedToAnInteger) {
  EXPECT_EQ(call(fn_round_half_to_even, {decimal("1.27"), decimal("1.9")}), "decimal 1.3");
  EXPECT_EQ(call(fn_round_half_to_even, {decimal("1.27"), untyped("1")}), "decimal 1.3");
  EXPECT_EQ(call(fn_round_half_to_even, {decimal("1.27"), string("1")}),
            "error 6 not a integer type - 1");
  EXPECT_EQ(call(fn_round_half_to_even, {decimal("1.27"), empty()}), "null");
}

// --- xqround -------------------------------------------------------------------------------------

TEST(XQRound, RoundsHalvesUpOrToTheEvenNeighbourAtAnyPrecision) {
  const auto rounded = [](const Value& value, int64_t precision, bool halfToEven) {
    return outcome(
        [&](XQueryContext& context) { return xqround(value, precision, halfToEven, context); });
  };
  EXPECT_EQ(rounded(decimal("0.125"), 2, false), "decimal 0.13");
  EXPECT_EQ(rounded(decimal("0.125"), 2, true), "decimal 0.12");
  EXPECT_EQ(rounded(decimal("-0.125"), 2, false), "decimal -0.12");
  EXPECT_EQ(rounded(number(-0.125), 2, false), "double -0.12");
  EXPECT_EQ(rounded(integer(-150), -2, false), "integer -100");
  EXPECT_EQ(rounded(integer(150), -2, false), "integer 200");
  EXPECT_EQ(rounded(integer(-150), -2, true), "integer -200");
  EXPECT_EQ(rounded(empty(), 2, true), "()");
}

// --- all of them ---------------------------------------------------------------------------------

constexpr XQueryProcedure procedures[] = {fn_abs, fn_floor, fn_ceiling, fn_round,
                                          fn_round_half_to_even};

TEST(NumericFunctions, OfTheEmptySequenceAreEmpty) {
  for (const XQueryProcedure procedure : procedures) EXPECT_EQ(call(procedure, {empty()}), "()");
}

TEST(NumericFunctions, UntypedValuesAndNodesAreDoubles) {
  EXPECT_EQ(call(fn_abs, {untyped("-1.5")}), "double 1.5");
  EXPECT_EQ(call(fn_floor, {elementFrom("<a>1.5</a>")}), "double 1");
  EXPECT_EQ(call(fn_ceiling, {untyped("1.5")}), "double 2");
  EXPECT_EQ(call(fn_round, {untyped("1.5")}), "double 2");
  EXPECT_EQ(call(fn_round_half_to_even, {untyped("2.5")}), "double 2");
  EXPECT_EQ(call(fn_round, {untyped("x")}), "error 6 value does not match a required type");
}

TEST(NumericFunctions, RefuseWhatIsNoNumber) {
  for (const XQueryProcedure procedure : procedures) {
    EXPECT_EQ(call(procedure, {string("1")}), "error 6 not a numeric type - 1");
    EXPECT_EQ(call(procedure, {boolean(true)}), "error 6 not a numeric type - true");
    EXPECT_EQ(call(procedure, {months(1)}), "error 6 not a numeric type - P1M");
    EXPECT_EQ(call(procedure, {sequence({integer(1), integer(2)})}),
              "error 6 not a numeric type - (1, 2)");
  }
}

TEST(NumericFunctions, TakeOneArgumentAndRoundHalfToEvenTwoAtMost) {
  for (const XQueryProcedure procedure : {fn_abs, fn_floor, fn_ceiling, fn_round}) {
    EXPECT_EQ(refusedCounts(procedure, integer(1)), "0 2 3 4 5");
  }
  EXPECT_EQ(refusedCounts(fn_round_half_to_even, integer(1)), "0 3 4 5");
}

TEST(NumericFunctions, APlainNumberOfTheHostIsADouble) {
  EXPECT_EQ(call(fn_round, {Value(NSNumber::numberWithDouble(2.5))}), "double 3");
  EXPECT_EQ(call(fn_abs, {Value(NSNumber::numberWithLongLong(-2))}), "double 2");
}

}  // namespace
}  // namespace xquery
