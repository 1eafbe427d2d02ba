// The operators over dates, times and durations: every pair of operand types under every operator.
#include "Expr/Operators/OperatorTestSupport.h"
#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryComparison.h"

#include <gtest/gtest.h>

#include <map>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace operatortest;

// One value of each type that matters here; arithmetic tells the numeric types apart by nothing but
// being numeric.
struct Operand {
  const char* name;
  int type;
  const char* text;
};

const Operand operands[] = {
    {"dateTime", 21, "2004-02-28T12:00:00Z"},
    {"date", 22, "2004-02-28Z"},
    {"time", 23, "12:00:00Z"},
    {"gYearMonth", 16, "2004-02Z"},
    {"gYear", 17, "2004Z"},
    {"gMonthDay", 18, "--02-28Z"},
    {"gDay", 19, "---28Z"},
    {"gMonth", 20, "--02--Z"},
    {"duration", 24, "P1Y"},
    {"months", 28, "P1Y"},
    {"seconds", 29, "P2D"},
    {"integer", 42, "2"},
    {"decimal", 13, "0.5"},
    {"float", 12, "2"},
    {"double", 11, "0.5"},
    {"byte", 50, "2"},
    {"boolean", 10, "true"},
    {"string", 9, "P1Y"},
    {"anyURI", 14, "a"},
    {"hexBinary", 26, "00"},
};

bool isNumeric(const Operand& operand) {
  return (operand.type >= 11 && operand.type <= 13) || operand.type >= 42;
}

// By operator and the operands' names; the numbers are "number".
using Answers = std::map<std::string, std::map<std::string, std::string>>;

const std::map<int, Answers> answers = {
    {Plus,
     {{"dateTime",
       {{"seconds", "dateTime 2004-03-01T12:00:00Z"}, {"months", "dateTime 2005-02-28T12:00:00Z"}}},
      {"date", {{"seconds", "date 2004-03-01Z"}, {"months", "date 2005-02-28Z"}}},
      {"time", {{"seconds", "time 12:00:00Z"}}},
      {"seconds",
       {{"dateTime", "dateTime 2004-03-01T12:00:00Z"},
        {"date", "date 2004-03-01Z"},
        {"time", "time 12:00:00Z"},
        {"seconds", "dayTimeDuration P4D"}}},
      {"months",
       {{"dateTime", "dateTime 2005-02-28T12:00:00Z"},
        {"date", "date 2005-02-28Z"},
        {"months", "yearMonthDuration P2Y"}}}}},
    {Minus,
     {{"dateTime",
       {{"seconds", "dateTime 2004-02-26T12:00:00Z"},
        {"months", "dateTime 2003-02-28T12:00:00Z"},
        {"dateTime", "dayTimeDuration PT0S"}}},
      {"date",
       {{"seconds", "date 2004-02-26Z"},
        {"months", "date 2003-02-28Z"},
        {"date", "dayTimeDuration PT0S"}}},
      {"time", {{"seconds", "time 12:00:00Z"}, {"time", "dayTimeDuration PT0S"}}},
      {"seconds", {{"seconds", "dayTimeDuration PT0S"}}},
      {"months", {{"months", "yearMonthDuration P0M"}}}}},
    {Times,
     {{"seconds",
       {{"integer", "dayTimeDuration P4D"},
        {"float", "dayTimeDuration P4D"},
        {"byte", "dayTimeDuration P4D"},
        {"decimal", "dayTimeDuration P1D"},
        {"double", "dayTimeDuration P1D"}}},
      {"months",
       {{"integer", "yearMonthDuration P2Y"},
        {"float", "yearMonthDuration P2Y"},
        {"byte", "yearMonthDuration P2Y"},
        {"decimal", "yearMonthDuration P6M"},
        {"double", "yearMonthDuration P6M"}}}}},
    {Div,
     {{"seconds",
       {{"integer", "dayTimeDuration P1D"},
        {"float", "dayTimeDuration P1D"},
        {"byte", "dayTimeDuration P1D"},
        {"decimal", "dayTimeDuration P4D"},
        {"double", "dayTimeDuration P4D"},
        {"seconds", "decimal 1"}}},
      {"months",
       {{"integer", "yearMonthDuration P6M"},
        {"float", "yearMonthDuration P6M"},
        {"byte", "yearMonthDuration P6M"},
        {"decimal", "yearMonthDuration P2Y"},
        {"double", "yearMonthDuration P2Y"},
        {"months", "decimal 1"}}}}},
    {IDiv, {}},
    {Mod, {}},
};

std::string expected(int code, const Operand& left, const Operand& right) {
  const Answers& rows = answers.at(code);
  const auto lookUp = [&rows](const char* a, const char* b) -> std::string {
    const auto row = rows.find(a);
    if (row == rows.end()) return "";
    const auto cell = row->second.find(b);
    return cell == row->second.end() ? "" : cell->second;
  };
  std::string found = lookUp(left.name, right.name);
  // A number may stand on either side of "*".
  if (found.empty() && code == Times && isNumeric(left)) found = lookUp(right.name, left.name);
  return found.empty() ? std::string(invalidOperands) : found;
}

TEST(DateArithmeticOperators, EveryPairOfTypesEndsAsTheTableSays) {
  for (const auto& [code, rows] : answers) {
    for (const Operand& left : operands) {
      for (const Operand& right : operands) {
        if (isNumeric(left) && isNumeric(right)) continue;
        EXPECT_EQ(evaluate(code, typed(left.type, left.text), typed(right.type, right.text)),
                  expected(code, left, right))
            << left.name << " " << code << " " << right.name;
      }
    }
  }
}

TEST(DateArithmeticOperators, AnEmptyOperandGivesTheEmptySequence) {
  for (const Operand& operand : operands) {
    for (int code = Plus; code <= Mod; ++code) {
      EXPECT_EQ(evaluate(code, typed(operand.type, operand.text), empty()), "()");
      EXPECT_EQ(evaluate(code, empty(), typed(operand.type, operand.text)), "()");
    }
  }
}

TEST(DateArithmeticOperators, ASequenceOfOneIsItsItem) {
  EXPECT_EQ(evaluate(Plus, sequence({typed(22, "2004-02-28")}), sequence({months(1)})),
            "date 2004-03-28");
  EXPECT_EQ(evaluate(Plus, sequence({typed(22, "2004-02-28"), typed(22, "2004-02-28")}), months(1)),
            invalidOperands);
}

TEST(DateArithmeticOperators, AnUntypedOperandIsANumber) {
  EXPECT_EQ(evaluate(Times, untyped("2"), months(6)), "yearMonthDuration P1Y");
  EXPECT_EQ(evaluate(Div, seconds(3), elementFrom("<a>2</a>")), "dayTimeDuration PT1.5S");
  EXPECT_EQ(evaluate(Plus, typed(22, "2004-02-28"), untyped("P1D")), invalidCast);
  EXPECT_EQ(evaluate(Plus, typed(22, "2004-02-28"), untyped("1")), invalidOperands);
}

TEST(DateArithmeticOperators, ADurationHasNoZerothPart) {
  for (const Value& duration : {months(12), seconds(60)}) {
    for (const Value& zero : {integer(0), decimal("0.0"), number(0), number(-0.0), single("0")}) {
      EXPECT_EQ(evaluate(Div, duration, zero), divideByZero);
    }
    EXPECT_EQ(evaluate(Div, duration, untyped("0")), divideByZero);
  }
  EXPECT_EQ(evaluate(Div, months(1), months(0)), divideByZero);
  EXPECT_EQ(evaluate(Div, seconds(1), seconds(0)), divideByZero);
  // Of another kind nothing would come of it anyway.
  EXPECT_EQ(evaluate(Div, months(1), seconds(0)), invalidOperands);
  EXPECT_EQ(evaluate(Div, typed(22, "2004-02-28"), integer(0)), invalidOperands);
  EXPECT_EQ(evaluate(IDiv, months(1), integer(0)), invalidOperands);
}

TEST(DateArithmeticOperators, ADurationIsNotScaledByASpecialNumber) {
  for (const Value& special : {nan(), infinity(), minusInfinity()}) {
    for (const Value& duration : {months(12), seconds(60), months(0), seconds(0)}) {
      EXPECT_EQ(evaluate(Times, duration, special), invalidOperands);
      EXPECT_EQ(evaluate(Times, special, duration), invalidOperands);
      EXPECT_EQ(evaluate(Div, duration, special), invalidOperands);
    }
  }
}

TEST(DateArithmeticOperators, WhatLiesBeyondTheYearsIsAnError) {
  EXPECT_EQ(evaluate(Plus, typed(22, "2004-02-28Z"), seconds(1e300)), invalidOperands);
  EXPECT_EQ(evaluate(Minus, typed(21, "2004-02-28T00:00:00Z"), months(INT64_MIN)), invalidOperands);
  EXPECT_EQ(evaluate(Times, months(INT64_MAX), integer(2)), invalidOperands);
}

TEST(DateArithmeticOperators, DifferencesAreTakenWithinOneType) {
  EXPECT_EQ(evaluate(Minus, typed(21, "2004-03-01T00:00:00Z"), typed(21, "2004-02-28T06:00:00Z")),
            "dayTimeDuration P1DT18H");
  EXPECT_EQ(evaluate(Minus, typed(22, "2004-02-28Z"), typed(22, "2004-03-01Z")),
            "dayTimeDuration -P2D");
  EXPECT_EQ(evaluate(Minus, typed(23, "11:12:00Z"), typed(23, "04:00:00+01:00")),
            "dayTimeDuration PT8H12M");
}

TEST(DateArithmeticOperators, SignsAreForNumbers) {
  for (const int sign : {Plus, Minus}) {
    EXPECT_EQ(outcome([sign](XQueryContext& context) {
                return XQueryUnarySign(sign, months(1), context);
              }),
              "null");
    EXPECT_EQ(outcome([sign](XQueryContext& context) {
                return XQueryUnarySign(sign, typed(22, "2004-02-28"), context);
              }),
              "null");
  }
}

// --- comparisons ---------------------------------------------------------------------------------

// The answers of eq, ne, lt, le, gt, ge: T, F, or ! for invalid operands.
std::string value(const Value& a, const Value& b) {
  std::string text;
  for (int code = XQueryOperatorEq; code <= XQueryOperatorGe; ++code) {
    const std::string answer = evaluate(code, a, b);
    text += answer == "true"            ? "T"
            : answer == "false"         ? "F"
            : answer == invalidOperands ? "!"
                                        : "?";
  }
  return text;
}

constexpr const char* equal = "TFFTFT";
constexpr const char* less = "FTTTFF";
constexpr const char* greater = "FTFFTT";
constexpr const char* invalid = "!!!!!!";

struct Pair {
  int type;
  const char* a;
  const char* b;
  const char* answer;
};

TEST(DateComparison, InstantsAreCompared) {
  const Pair rows[] = {
      {21, "2004-02-28T12:00:00Z", "2004-02-28T12:00:00Z", equal},
      {21, "2004-02-28T12:00:00Z", "2004-02-28T13:00:00+01:00", equal},
      {21, "2004-02-28T12:00:00Z", "2004-02-28T12:00:00+01:00", greater},
      {21, "2004-02-28T12:00:00Z", "2004-02-28T12:00:00.000001Z", less},
      {21, "2004-02-28T12:00:00", "2004-02-28T12:00:01", less},
      {21, "-0001-12-31T23:59:60Z", "0000-01-01T00:00:00Z", equal},
      {21, "2147483647-01-01T00:00:01Z", "2147483647-01-01T00:00:00Z", greater},
      {22, "2004-02-28Z", "2004-02-28Z", equal},
      {22, "2004-02-28Z", "2004-02-28+01:00", greater},
      {22, "2004-02-28", "2004-02-29", less},
      {22, "-0004-02-28", "-0003-02-28", less},
      {23, "12:00:00Z", "11:00:00-01:00", equal},
      {23, "12:00:00", "11:59:59.5", greater},
      {23, "00:00:00Z", "23:59:59Z", less},
  };
  for (const Pair& row : rows) {
    EXPECT_EQ(value(typed(row.type, row.a), typed(row.type, row.b)), row.answer)
        << row.a << " " << row.b;
  }
}

TEST(DateComparison, FragmentsHaveEqualityOnly) {
  const Pair rows[] = {
      {16, "2004-02Z", "2004-02+00:00", "TF!!!!"},
      {16, "2004-02", "2004-03", "FT!!!!"},
      {17, "2004", "2004", "TF!!!!"},
      {17, "2004Z", "2004+01:00", "FT!!!!"},
      {18, "--02-29", "--02-29", "TF!!!!"},
      {18, "--02-29", "--03-01", "FT!!!!"},
      {19, "---05Z", "---05-00:00", "TF!!!!"},
      {19, "---05", "---06", "FT!!!!"},
      {20, "--05--", "--05--", "TF!!!!"},
      {20, "--05--", "--06--", "FT!!!!"},
  };
  for (const Pair& row : rows) {
    EXPECT_EQ(value(typed(row.type, row.a), typed(row.type, row.b)), row.answer)
        << row.a << " " << row.b;
  }
}

TEST(DateComparison, AGeneralDurationIsNotComparedAtAll) {
  EXPECT_EQ(value(typed(24, "P1Y"), typed(24, "P1Y")), invalid);
  EXPECT_EQ(value(typed(24, "P1Y"), months(12)), invalid);
  EXPECT_EQ(value(months(12), typed(24, "P1Y")), invalid);
  EXPECT_EQ(value(months(12), seconds(12)), invalid);
  EXPECT_EQ(value(months(12), months(12)), equal);
  EXPECT_EQ(value(seconds(-1), seconds(0.5)), less);
}

// Equality wants one type; for an order the left one decides, and dates are ordered as instants.
TEST(DateComparison, AcrossTypesDatesAreOrderedButNotEqual) {
  for (const Operand& left : operands) {
    for (const Operand& right : operands) {
      if (left.type == right.type) continue;
      const bool isOrdered = left.type >= 21 && left.type <= 23;
      const bool isDate = right.type >= 16 && right.type <= 23;
      if (!isOrdered && !(left.type >= 16 && left.type <= 20)) continue;
      const std::string answer = value(typed(left.type, left.text), typed(right.type, right.text));
      EXPECT_EQ(answer.substr(0, 2), "!!") << left.name << " " << right.name;
      if (!isOrdered || !isDate) {
        EXPECT_EQ(answer, invalid) << left.name << " " << right.name;
      } else {
        EXPECT_TRUE(answer == "!!TTFF" || answer == "!!FFTT") << left.name << " " << right.name;
      }
    }
  }
  EXPECT_EQ(value(typed(21, "2004-02-28T12:00:00Z"), typed(22, "2004-02-28Z")), "!!FFTT");
  EXPECT_EQ(value(typed(22, "2004-02-28Z"), typed(21, "2004-02-28T12:00:00Z")), "!!TTFF");
  EXPECT_EQ(value(typed(22, "2004-01-01Z"), typed(17, "2004Z")), "!!FTFT");
  EXPECT_EQ(value(typed(17, "2004Z"), typed(22, "2004-01-01Z")), invalid);
}

TEST(DateComparison, NothingElseIsComparedToADate) {
  for (const Operand& left : operands) {
    if (left.type >= 16 && left.type <= 23) continue;
    if (left.type == 9) continue;  // a string asks the other for a string
    const Value date = typed(22, "2004-02-28");
    // Of two booleans the order is asked; what is none is below nothing.
    EXPECT_EQ(value(typed(left.type, left.text), date), left.type == 10 ? "!!FTFT" : invalid)
        << left.name;
  }
  EXPECT_EQ(evaluate(XQueryOperatorLt, string("a"), typed(22, "2004-02-28")),
            "error 6 not a string type - 2004-02-28");
}

TEST(DateComparison, ANodeIsAStringToValueComparisons) {
  EXPECT_EQ(evaluate(XQueryOperatorEq, elementFrom("<a>2004-02-28</a>"), typed(22, "2004-02-28")),
            invalidOperands);
}

TEST(DateComparison, AnUntypedItemIsCastToTheOthersTypeByGeneralComparisons) {
  const Value date = typed(22, "2004-02-28");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, untyped("2004-02-28"), date), "true");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, date, elementFrom("<a>2004-02-28</a>")), "true");
  EXPECT_EQ(evaluate(XQueryOperatorLess, date, untyped("2004-02-29")), "true");
  EXPECT_EQ(evaluate(XQueryOperatorGreater, date, untyped("2004-02-29")), "false");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, untyped("x"), date), invalidCast);
  EXPECT_EQ(evaluate(XQueryOperatorEqual, untyped("---05"), typed(19, "---05")), "true");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, untyped("P12M"), months(12)), "true");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, sequence({typed(22, "2004-01-01"), date}), date), "true");
  EXPECT_EQ(evaluate(XQueryOperatorNotEqual, date, sequence({date, date})), "false");
}

}  // namespace
}  // namespace xquery
