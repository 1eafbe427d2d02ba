#include "Expr/Operators/OperatorTestSupport.h"
#include "Expr/Operators/XQueryArithmetic.h"

#include <gtest/gtest.h>

#include <charconv>
#include <cmath>
#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace operatortest;

// --- every pair of numeric types under every operator --------------------------------------------

constexpr int numericTypes[] = {11, 12, 13, 42, 43, 44, 45, 46, 47, 48, 49, 50, 51, 52, 53, 54};
constexpr int typeCount = 16;

// The least common numeric type; the table is symmetric and holds its upper triangle.
constexpr int commonTypes[typeCount][typeCount] = {
    // 11  12  13  42  43  44  45  46  47  48  49  50  51  52  53  54
    {11, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11},  // double
    {0, 12, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11, 11},   // float
    {0, 0, 13, 13, 13, 13, 13, 13, 13, 13, 13, 13, 13, 13, 13, 13},    // decimal
    {0, 0, 0, 42, 42, 42, 42, 42, 42, 42, 42, 42, 42, 42, 42, 42},     // integer
    {0, 0, 0, 0, 43, 43, 43, 43, 43, 43, 43, 43, 43, 43, 43, 43},      // nonNegativeInteger
    {0, 0, 0, 0, 0, 44, 42, 42, 42, 42, 42, 42, 43, 43, 43, 43},       // positiveInteger
    {0, 0, 0, 0, 0, 0, 45, 45, 45, 45, 45, 45, 45, 45, 45, 45},        // nonPositiveInteger
    {0, 0, 0, 0, 0, 0, 0, 46, 46, 46, 46, 46, 46, 46, 46, 46},         // negativeInteger
    {0, 0, 0, 0, 0, 0, 0, 0, 47, 47, 47, 47, 47, 47, 47, 47},          // long
    {0, 0, 0, 0, 0, 0, 0, 0, 0, 48, 48, 48, 48, 48, 48, 48},           // int
    {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 49, 49, 49, 49, 49, 49},            // short
    {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 50, 50, 50, 50, 50},             // byte
    {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 51, 42, 42, 42},              // unsignedLong
    {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 52, 52, 52},               // unsignedInt
    {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 53, 53},                // unsignedShort
    {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 54},                 // unsignedByte
};

const char* typeName(int type) {
  static const char* const low[] = {"double", "float", "decimal"};
  static const char* const high[] = {"integer",
                                     "nonNegativeInteger",
                                     "positiveInteger",
                                     "nonPositiveInteger",
                                     "negativeInteger",
                                     "long",
                                     "int",
                                     "short",
                                     "byte",
                                     "unsignedLong",
                                     "unsignedInt",
                                     "unsignedShort",
                                     "unsignedByte"};
  return type <= 13 ? low[type - 11] : high[type - 42];
}

// Whether a small whole number is in the value space as casting checks it.
bool fits(int type, int64_t value) {
  switch (type) {
    case 43:
    case 51:
    case 52:
      return value >= 0;
    case 44:
      return value > 0;
    case 45:
      return value <= 0;
    case 46:
      return value < 0;
    case 49:
      return value >= -32768 && value <= 32767;
    case 50:
      return value >= -128 && value <= 127;
    case 53:
      return value >= 0 && value <= 65535;
    case 54:
      return value >= 0 && value <= 255;
    default:
      return true;
  }
}

std::string answer(int type, double value) {
  char text[40];
  const auto end = std::to_chars(text, text + sizeof text, value).ptr;
  return std::string(typeName(type)) + " " + std::string(text, end);
}

double inFloatingPoint(int code, double a, double b) {
  return code == Plus ? a + b : code == Minus ? a - b : code == Times ? a * b : std::fmod(a, b);
}

// What `a code b` answers, from the rules alone. Casting an operand to the common type never fails:
// a type that counts as a kind of another is taken over as it is.
std::string expected(int code, int leftIndex, int64_t a, int rightIndex, int64_t b) {
  int common = leftIndex <= rightIndex ? commonTypes[leftIndex][rightIndex]
                                       : commonTypes[rightIndex][leftIndex];
  const bool floating = common < 13;
  if (b == 0 && code == IDiv) return std::string(divideByZero);
  if (b == 0 && code == Mod) return floating ? "double NaN" : std::string(divideByZero);
  if (code == Div || code == IDiv) {
    if (common >= 42) common = 13;
    if (b == 0 && !floating) return std::string(divisionByZero);
    if (b == 0) return a == 0 ? "double NaN" : a < 0 ? "double -INF" : "double INF";
    if (code == IDiv) return answer(42, static_cast<double>(a / b));
    return answer(common, static_cast<double>(a) / static_cast<double>(b));
  }
  if (floating) {
    return answer(common, inFloatingPoint(code, static_cast<double>(a), static_cast<double>(b)));
  }
  const int64_t value = code == Plus    ? a + b
                        : code == Minus ? a - b
                        : code == Times ? a * b
                                        : a % b;
  return fits(common, value) ? answer(common, static_cast<double>(value))
                             : std::string(invalidCast);
}

TEST(NumericTypes, EveryPairUnderEveryOperator) {
  // Quotients of these end, and are the same in every precision.
  const std::vector<std::pair<int64_t, int64_t>> operands = {{12, 4},  {12, 5},    {-7, 2}, {7, -2},
                                                             {-7, -2}, {100, 100}, {0, 4},  {5, 0},
                                                             {-5, 0},  {0, 0},     {250, 8}};
  int checked = 0;
  for (int i = 0; i < typeCount; ++i) {
    for (int j = 0; j < typeCount; ++j) {
      for (const auto& [a, b] : operands) {
        const int left = numericTypes[i];
        const int right = numericTypes[j];
        if (!fits(left, a) || !fits(right, b)) continue;
        const Value x = typed(left, std::to_string(a));
        const Value y = typed(right, std::to_string(b));
        for (int code = Plus; code <= Mod; ++code) {
          ++checked;
          ASSERT_EQ(evaluate(code, x, y), expected(code, i, a, j, b))
              << typeName(left) << " " << a << " op " << code << " " << typeName(right) << " " << b;
        }
      }
    }
  }
  EXPECT_GT(checked, 8000);
}

// --- operands ------------------------------------------------------------------------------------

TEST(ArithmeticOperand, EmptyGivesEmpty) {
  for (int code = Plus; code <= Mod; ++code) {
    EXPECT_EQ(evaluate(code, empty(), integer(1)), "()");
    EXPECT_EQ(evaluate(code, integer(1), empty()), "()");
    EXPECT_EQ(evaluate(code, sequence({}), integer(1)), "()");
    // Even where the other operand would be refused.
    EXPECT_EQ(evaluate(code, empty(), sequence({integer(1), integer(2)})), "()");
    EXPECT_EQ(evaluate(code, empty(), string("a")), "()");
  }
}

TEST(ArithmeticOperand, AOneElementArrayIsItsElement) {
  EXPECT_EQ(evaluate(Plus, sequence({integer(1)}), sequence({integer(2)})), "integer 3");
  EXPECT_EQ(evaluate(Times, sequence({untyped("2")}), integer(2)), "double 4");
}

TEST(ArithmeticOperand, AnArrayOfMoreIsRefused) {
  EXPECT_EQ(evaluate(Plus, sequence({integer(1), integer(2)}), integer(1)), invalidOperands);
  EXPECT_EQ(evaluate(Plus, integer(1), sequence({integer(1), integer(2)})), invalidOperands);
}

TEST(ArithmeticOperand, UntypedIsADouble) {
  EXPECT_EQ(evaluate(Plus, untyped("1.5"), integer(1)), "double 2.5");
  EXPECT_EQ(evaluate(Minus, integer(1), untyped("0.5")), "double 0.5");
  EXPECT_EQ(evaluate(Times, untyped("3"), untyped("4")), "double 12");
  EXPECT_EQ(evaluate(Div, untyped("1"), integer(0)), "double INF");
  EXPECT_EQ(evaluate(Mod, untyped("7"), integer(4)), "double 3");
  EXPECT_EQ(evaluate(Plus, untyped("INF"), integer(1)), "double INF");
  EXPECT_EQ(evaluate(Plus, untyped("NaN"), integer(1)), "double NaN");
}

TEST(ArithmeticOperand, UntypedTextIsReadAsCastsReadIt) {
  EXPECT_EQ(evaluate(Plus, untyped(" 12abc"), integer(1)), "double 13");
  EXPECT_EQ(evaluate(Plus, untyped("1e400"), integer(1)), "double INF");
  EXPECT_EQ(evaluate(Plus, untyped("abc"), integer(1)), invalidCast);
  EXPECT_EQ(evaluate(Plus, untyped(""), integer(1)), invalidCast);
}

TEST(ArithmeticOperand, UntypedIsAnIntegerForIntegerDivision) {
  EXPECT_EQ(evaluate(IDiv, untyped("7.9"), integer(2)), "integer 3");
  EXPECT_EQ(evaluate(IDiv, integer(7), untyped("2.9")), "integer 3");
  EXPECT_EQ(evaluate(IDiv, integer(7), untyped("0.9")), divideByZero);
  EXPECT_EQ(evaluate(IDiv, untyped("x"), integer(2)), invalidCast);
}

TEST(ArithmeticOperand, ANodeIsAtomized) {
  EXPECT_EQ(evaluate(Plus, elementFrom("<a>4</a>"), integer(1)), "double 5");
  EXPECT_EQ(evaluate(Plus, elementFrom("<a>4<b>2</b></a>"), integer(1)), "double 43");
  EXPECT_EQ(evaluate(Plus, sequence({elementFrom("<a>4</a>")}), integer(1)), "double 5");
  EXPECT_EQ(evaluate(IDiv, elementFrom("<a>9.5</a>"), integer(2)), "integer 4");
  EXPECT_EQ(evaluate(Plus, elementFrom("<a/>"), integer(1)), invalidCast);
  EXPECT_EQ(evaluate(Plus, elementFrom("<a><!--4--></a>"), integer(1)), invalidCast);
}

TEST(ArithmeticOperand, OtherTypesAreInvalid) {
  const std::vector<Value> others = {string("1"), boolean(true), typed(14, "http://a/"),
                                     typed(32, "en")};
  for (int code = Plus; code <= Mod; ++code) {
    for (const Value& other : others) {
      EXPECT_EQ(evaluate(code, other, integer(1)), invalidOperands) << show(other);
      EXPECT_EQ(evaluate(code, integer(1), other), invalidOperands) << show(other);
      EXPECT_EQ(evaluate(code, other, integer(0)), invalidOperands) << show(other);
    }
    EXPECT_EQ(evaluate(code, Value(), integer(1)), invalidOperands);
  }
}

// --- addition, subtraction, multiplication -------------------------------------------------------

TEST(Addition, IntegersHaveNoMachineLimit) {
  const int64_t greatest = std::numeric_limits<int64_t>::max();
  EXPECT_EQ(evaluate(Plus, integer(greatest), integer(1)), "integer 9223372036854775808");
  EXPECT_EQ(evaluate(Minus, integer(-greatest), integer(2)), "integer -9223372036854775809");
  EXPECT_EQ(evaluate(Times, integer(greatest), integer(greatest)),
            "integer 85070591730234615847396907784232501249");
}

TEST(Addition, DecimalsAreExact) {
  EXPECT_EQ(evaluate(Plus, decimal("0.1"), decimal("0.2")), "decimal 0.3");
  EXPECT_EQ(evaluate(Minus, decimal("1"), decimal("0.9")), "decimal 0.1");
  EXPECT_EQ(evaluate(Plus, integer(1), decimal("0.50")), "decimal 1.5");
  EXPECT_EQ(evaluate(Times, decimal("1.5"), integer(2)), "decimal 3");
}

TEST(Addition, DoublesFollowIEEE) {
  EXPECT_EQ(evaluate(Plus, number(0.1), number(0.2)), "double 0.30000000000000004");
  EXPECT_EQ(evaluate(Plus, infinity(), minusInfinity()), "double NaN");
  EXPECT_EQ(evaluate(Minus, infinity(), infinity()), "double NaN");
  EXPECT_EQ(evaluate(Plus, infinity(), number(1)), "double INF");
  EXPECT_EQ(evaluate(Plus, nan(), number(1)), "double NaN");
}

TEST(Addition, FloatsStayInSinglePrecision) {
  EXPECT_EQ(evaluate(Plus, single("0.1"), single("0.2")), "float 0.3");
  EXPECT_EQ(evaluate(Times, single("16777216"), single("1")), "float 16777216");
  EXPECT_EQ(evaluate(Plus, single("16777216"), single("1")), "float 16777216");
  EXPECT_EQ(evaluate(Times, single("3e38"), single("10")), "double INF");
}

TEST(Addition, AFloatWithAnythingElseIsADouble) {
  EXPECT_EQ(evaluate(Plus, single("1.5"), integer(1)), "double 2.5");
  EXPECT_EQ(evaluate(Plus, single("1.5"), decimal("1")), "double 2.5");
  // It is converted through what it prints.
  EXPECT_EQ(evaluate(Plus, single("0.1"), number(0)), "double 0.1");
}

TEST(Addition, SpecialResultsAreTheSharedObjects) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const auto add = [&](const Value& a, const Value& b) { return op_numeric_add(a, b, *context); };
  EXPECT_EQ(add(number(1e308), number(1e308)).get(), XQueryNumber::posInf());
  EXPECT_EQ(add(number(-1e308), number(-1e308)).get(), XQueryNumber::negInf());
  EXPECT_EQ(add(infinity(), minusInfinity()).get(), XQueryNumber::nan());
}

TEST(DerivedInteger, AResultOutsideTheTypeFailsLikeACast) {
  EXPECT_EQ(evaluate(Plus, typed(50, "127"), typed(50, "1")), invalidCast);
  EXPECT_EQ(evaluate(Plus, typed(50, "126"), typed(50, "1")), "byte 127");
  EXPECT_EQ(evaluate(Minus, typed(43, "3"), typed(43, "4")), invalidCast);
  EXPECT_EQ(evaluate(Minus, typed(43, "4"), typed(43, "3")), "nonNegativeInteger 1");
  EXPECT_EQ(evaluate(Minus, typed(44, "4"), typed(44, "4")), invalidCast);
  EXPECT_EQ(evaluate(Times, typed(46, "-4"), typed(46, "-4")), invalidCast);
  EXPECT_EQ(evaluate(Plus, typed(46, "-4"), typed(46, "-4")), "negativeInteger -8");
  EXPECT_EQ(evaluate(Times, typed(49, "200"), typed(49, "200")), invalidCast);
  EXPECT_EQ(evaluate(Times, typed(48, "200"), typed(49, "200")), "int 40000");
}

TEST(DerivedInteger, OnlyTheResultMustFitTheCommonType) {
  // negativeInteger counts as a kind of nonNegativeInteger, so its values are taken over unchecked.
  EXPECT_EQ(evaluate(Plus, typed(43, "5"), typed(46, "-1")), "nonNegativeInteger 4");
  EXPECT_EQ(evaluate(Plus, typed(43, "5"), typed(46, "-6")), invalidCast);
  EXPECT_EQ(evaluate(Plus, typed(44, "5"), typed(46, "-6")), "integer -1");
}

TEST(Multiplication, EverySpecialProduct) {
  const std::vector<Value> operands = {nan(),     minusInfinity(), number(-2),
                                       number(0), number(2),       infinity()};
  const char* const products[6][6] = {
      {"NaN", "NaN", "NaN", "NaN", "NaN", "NaN"}, {"NaN", "INF", "INF", "NaN", "-INF", "-INF"},
      {"NaN", "INF", "4", "-0", "-4", "-INF"},    {"NaN", "NaN", "-0", "0", "0", "NaN"},
      {"NaN", "-INF", "-4", "0", "4", "INF"},     {"NaN", "-INF", "-INF", "NaN", "INF", "INF"}};
  for (size_t i = 0; i < 6; ++i) {
    for (size_t j = 0; j < 6; ++j) {
      const std::string product = std::string("double ") + products[i][j];
      EXPECT_EQ(evaluate(Times, operands[i], operands[j]), product);
      EXPECT_EQ(outcome([&](XQueryContext& context) {
                  return op_numeric_multiply(operands[i], operands[j], context);
                }),
                product);
    }
  }
}

TEST(Multiplication, ASpecialProductIsTheSharedObject) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const auto times = [&](const Value& a, const Value& b) {
    return op_numeric_multiply(a, b, *context);
  };
  EXPECT_EQ(times(infinity(), number(0)).get(), XQueryNumber::nan());
  EXPECT_EQ(times(infinity(), integer(-1)).get(), XQueryNumber::negInf());
  EXPECT_EQ(times(number(1e200), number(1e200)).get(), XQueryNumber::posInf());
}

TEST(NumericHelpers, OperandsWithoutACommonTypeHaveNoAnswer) {
  const auto helpers = {op_numeric_add,    op_numeric_subtract,       op_numeric_multiply,
                        op_numeric_divide, op_numeric_integer_divide, op_numeric_mod};
  for (const auto helper : helpers) {
    EXPECT_EQ(
        outcome([&](XQueryContext& context) { return helper(integer(1), string("1"), context); }),
        "null");
  }
}

// --- division ------------------------------------------------------------------------------------

TEST(Division, OfIntegersIsADecimal) {
  EXPECT_EQ(evaluate(Div, integer(7), integer(2)), "decimal 3.5");
  EXPECT_EQ(evaluate(Div, integer(6), integer(2)), "decimal 3");
  EXPECT_EQ(evaluate(Div, typed(48, "7"), typed(48, "2")), "decimal 3.5");
  EXPECT_EQ(evaluate(Div, typed(43, "7"), typed(46, "-2")), "decimal -3.5");
}

TEST(Division, ADecimalQuotientThatDoesNotEndHas38Digits) {
  EXPECT_EQ(evaluate(Div, integer(1), integer(3)),
            "decimal 0.33333333333333333333333333333333333333");
  EXPECT_EQ(evaluate(Div, integer(2), integer(3)),
            "decimal 0.66666666666666666666666666666666666667");
}

TEST(Division, ByADecimalZeroIsAnError) {
  EXPECT_EQ(evaluate(Div, integer(1), integer(0)), divisionByZero);
  EXPECT_EQ(evaluate(Div, decimal("1.5"), decimal("0.0")), divisionByZero);
  EXPECT_EQ(evaluate(Div, typed(50, "1"), typed(43, "0")), divisionByZero);
  EXPECT_EQ(outcome([](XQueryContext& context) {
              return op_numeric_divide(integer(1), integer(0), context);
            }),
            "record 6 Division by zero");
}

TEST(Division, ByAFloatingZeroGivesASpecialNumberByTheDividendAlone) {
  for (const Value& zero : {number(0.0), number(-0.0), single("0")}) {
    EXPECT_EQ(evaluate(Div, number(3), zero), "double INF");
    EXPECT_EQ(evaluate(Div, number(-3), zero), "double -INF");
    EXPECT_EQ(evaluate(Div, number(0), zero), "double NaN");
    EXPECT_EQ(evaluate(Div, nan(), zero), "double NaN");
  }
  EXPECT_EQ(evaluate(Div, integer(3), number(0)), "double INF");
  EXPECT_EQ(evaluate(Div, number(3), integer(0)), "double INF");
}

TEST(Division, OfFloatsIsAFloat) {
  EXPECT_EQ(evaluate(Div, single("1"), single("3")), "float 0.33333334");
  EXPECT_EQ(evaluate(Div, number(1), number(3)), "double 0.3333333333333333");
}

TEST(Division, WithInfinities) {
  EXPECT_EQ(evaluate(Div, infinity(), infinity()), "double NaN");
  EXPECT_EQ(evaluate(Div, number(1), infinity()), "double 0");
  EXPECT_EQ(evaluate(Div, infinity(), number(-2)), "double -INF");
}

TEST(IntegerDivision, TruncatesTowardZeroAndGivesAnInteger) {
  EXPECT_EQ(evaluate(IDiv, integer(7), integer(2)), "integer 3");
  EXPECT_EQ(evaluate(IDiv, integer(-7), integer(2)), "integer -3");
  EXPECT_EQ(evaluate(IDiv, integer(7), integer(-2)), "integer -3");
  EXPECT_EQ(evaluate(IDiv, decimal("7.5"), decimal("2.5")), "integer 3");
  EXPECT_EQ(evaluate(IDiv, decimal("-7.6"), decimal("2.5")), "integer -3");
  EXPECT_EQ(evaluate(IDiv, number(7.5), number(2)), "integer 3");
  EXPECT_EQ(evaluate(IDiv, number(-0.5), number(1)), "integer 0");
  EXPECT_EQ(evaluate(IDiv, single("9"), single("2")), "integer 4");
  EXPECT_EQ(evaluate(IDiv, typed(50, "9"), typed(50, "2")), "integer 4");
  EXPECT_EQ(evaluate(IDiv, number(1e17), number(1)), "integer 100000000000000000");
  EXPECT_EQ(evaluate(IDiv, integer(std::numeric_limits<int64_t>::min()), integer(-1)),
            "integer 9223372036854775808");
}

TEST(IntegerDivision, ByZeroIsAnErrorInEveryType) {
  EXPECT_EQ(evaluate(IDiv, integer(1), integer(0)), divideByZero);
  EXPECT_EQ(evaluate(IDiv, decimal("1"), decimal("0")), divideByZero);
  EXPECT_EQ(evaluate(IDiv, number(1), number(0)), divideByZero);
  EXPECT_EQ(evaluate(IDiv, number(1), number(-0.0)), divideByZero);
  EXPECT_EQ(evaluate(IDiv, nan(), integer(0)), divideByZero);
}

TEST(IntegerDivision, ASpecialQuotientIsNoInteger) {
  EXPECT_EQ(evaluate(IDiv, infinity(), integer(2)), invalidCast);
  EXPECT_EQ(evaluate(IDiv, nan(), integer(2)), invalidCast);
  EXPECT_EQ(evaluate(IDiv, number(2), nan()), invalidCast);
  EXPECT_EQ(evaluate(IDiv, number(2), infinity()), "integer 0");
}

TEST(Modulus, HasTheSignOfTheDividend) {
  EXPECT_EQ(evaluate(Mod, integer(10), integer(3)), "integer 1");
  EXPECT_EQ(evaluate(Mod, integer(-10), integer(3)), "integer -1");
  EXPECT_EQ(evaluate(Mod, integer(10), integer(-3)), "integer 1");
  EXPECT_EQ(evaluate(Mod, integer(-10), integer(-3)), "integer -1");
  EXPECT_EQ(evaluate(Mod, integer(-10), integer(-1)), "integer 0");
  EXPECT_EQ(evaluate(Mod, decimal("4.5"), decimal("1.2")), "decimal 0.9");
  EXPECT_EQ(evaluate(Mod, decimal("-4.5"), decimal("1.2")), "decimal -0.9");
  EXPECT_EQ(evaluate(Mod, number(-4.5), number(2)), "double -0.5");
  EXPECT_EQ(evaluate(Mod, single("4.5"), single("2")), "float 0.5");
}

TEST(Modulus, KeepsTheCommonType) {
  EXPECT_EQ(evaluate(Mod, typed(50, "9"), typed(50, "4")), "byte 1");
  EXPECT_EQ(evaluate(Mod, typed(44, "8"), typed(44, "4")), invalidCast);
}

TEST(Modulus, ByZero) {
  EXPECT_EQ(evaluate(Mod, integer(1), integer(0)), divideByZero);
  EXPECT_EQ(evaluate(Mod, decimal("1.5"), integer(0)), divideByZero);
  EXPECT_EQ(evaluate(Mod, number(1), number(0)), "double NaN");
  EXPECT_EQ(evaluate(Mod, number(1), integer(0)), "double NaN");
}

TEST(Modulus, SpecialNumbersFollowIEEE) {
  EXPECT_EQ(evaluate(Mod, infinity(), number(2)), "double NaN");
  EXPECT_EQ(evaluate(Mod, number(5), infinity()), "double 5");
  EXPECT_EQ(evaluate(Mod, nan(), number(2)), "double NaN");
}

TEST(DivisionHelpers, GuardTheirZeroDivisor) {
  EXPECT_EQ(outcome([](XQueryContext& context) {
              return op_numeric_integer_divide(integer(1), integer(0), context);
            }),
            "record 6 Division by zero");
  EXPECT_EQ(outcome([](XQueryContext& context) {
              return op_numeric_mod(integer(1), integer(0), context);
            }),
            "record 6 Division by zero");
}

// --- signs ---------------------------------------------------------------------------------------

std::string sign(int code, const Value& operand) {
  return outcome([&](XQueryContext& context) { return XQueryUnarySign(code, operand, context); });
}

TEST(UnarySign, KeepsTheTypeOfTheOperand) {
  EXPECT_EQ(sign(Minus, integer(5)), "integer -5");
  EXPECT_EQ(sign(Plus, integer(5)), "integer 5");
  EXPECT_EQ(sign(Minus, decimal("1.5")), "decimal -1.5");
  EXPECT_EQ(sign(Minus, number(1.5)), "double -1.5");
  EXPECT_EQ(sign(Minus, single("1.5")), "float -1.5");
  EXPECT_EQ(sign(Minus, typed(50, "5")), "byte -5");
  EXPECT_EQ(sign(Plus, typed(44, "5")), "positiveInteger 5");
}

TEST(UnarySign, AResultOutsideTheTypeFails) {
  EXPECT_EQ(sign(Minus, typed(44, "5")), invalidCast);
  EXPECT_EQ(sign(Minus, typed(43, "0")), "nonNegativeInteger 0");
  EXPECT_EQ(sign(Minus, typed(50, "-128")), invalidCast);
}

TEST(UnarySign, IsComputedFromZero) {
  EXPECT_EQ(sign(Minus, number(0.0)), "double 0");
  EXPECT_EQ(sign(Plus, number(-0.0)), "double 0");
  EXPECT_EQ(sign(Minus, nan()), "double NaN");
  EXPECT_EQ(sign(Minus, infinity()), "double -INF");
}

TEST(UnarySign, OfUntypedNodeAndEmpty) {
  EXPECT_EQ(sign(Minus, untyped("5")), "double -5");
  EXPECT_EQ(sign(Minus, elementFrom("<a>5</a>")), "double -5");
  EXPECT_EQ(sign(Minus, empty()), "()");
  EXPECT_EQ(sign(Minus, sequence({})), "()");
  EXPECT_EQ(sign(Minus, sequence({integer(5)})), "integer -5");
}

TEST(UnarySign, OfAnythingElseHasNoAnswer) {
  EXPECT_EQ(sign(Minus, string("5")), "null");
  EXPECT_EQ(sign(Minus, boolean(true)), "null");
  EXPECT_EQ(sign(Minus, months(5)), "null");
  EXPECT_EQ(sign(Minus, sequence({integer(1), integer(2)})), "null");
  EXPECT_EQ(sign(Minus, untyped("x")), invalidCast);
}

// --- comparing numbers ---------------------------------------------------------------------------

TEST(NumericComparison, NothingHoldsForNaN) {
  const NSNumber& notANumber = *XQueryNumber::nan();
  const NSNumber& one = *XQueryNumber::one();
  for (const auto test : {op_numeric_equal, op_numeric_less_than, op_numeric_greater_than}) {
    EXPECT_FALSE(test(notANumber, notANumber));
    EXPECT_FALSE(test(notANumber, one));
    EXPECT_FALSE(test(one, notANumber));
  }
}

TEST(NumericComparison, FollowsTheOrderOfTheValues) {
  const Value one = integer(1);
  const Value two = number(2);
  const NSNumber& low = *cast<NSNumber>(one);
  const NSNumber& high = *cast<NSNumber>(two);
  EXPECT_TRUE(op_numeric_less_than(low, high));
  EXPECT_FALSE(op_numeric_less_than(high, low));
  EXPECT_TRUE(op_numeric_greater_than(high, low));
  EXPECT_FALSE(op_numeric_greater_than(low, high));
  EXPECT_TRUE(op_numeric_equal(low, low));
  EXPECT_FALSE(op_numeric_equal(low, high));
}

}  // namespace
}  // namespace xquery
