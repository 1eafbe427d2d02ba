#include "Functions/Duration.h"
#include "Functions/FunctionsTesting.h"

namespace xquery {
namespace {

using namespace functiontest;

constexpr XQueryProcedure accessors[] = {fn_years_from_duration,   fn_months_from_duration,
                                         fn_days_from_duration,    fn_hours_from_duration,
                                         fn_minutes_from_duration, fn_seconds_from_duration};

// What all six accessors answer, without their types.
std::string fields(const Value& duration) {
  std::string text;
  for (const XQueryProcedure accessor : accessors) {
    const std::string answer = call(accessor, {duration});
    text += (text.empty() ? "" : " ") + answer.substr(answer.find(' ') + 1);
  }
  return text;
}

TEST(YearsAndMonthsFromDuration, AreTheQuotientAndTheRemainder) {
  EXPECT_EQ(call(fn_years_from_duration, {months(18)}), "integer 1");
  EXPECT_EQ(call(fn_months_from_duration, {months(18)}), "integer 6");
  EXPECT_EQ(call(fn_years_from_duration, {months(240)}), "integer 20");
  EXPECT_EQ(call(fn_months_from_duration, {months(240)}), "integer 0");
}

TEST(YearsAndMonthsFromDuration, AreTruncatedTowardZero) {
  EXPECT_EQ(call(fn_years_from_duration, {typed(XQueryTypeYearMonthDuration, "-P1Y6M")}),
            "integer -1");
  EXPECT_EQ(call(fn_months_from_duration, {typed(XQueryTypeYearMonthDuration, "-P1Y6M")}),
            "integer -6");
  EXPECT_EQ(call(fn_years_from_duration, {months(-11)}), "integer 0");
}

TEST(DayTimeComponents, AreThoseOfTheCountOfSeconds) {
  const Value duration = typed(XQueryTypeDayTimeDuration, "P3DT25H61M61.5S");
  EXPECT_EQ(call(fn_days_from_duration, {duration}), "integer 4");
  EXPECT_EQ(call(fn_hours_from_duration, {duration}), "integer 2");
  EXPECT_EQ(call(fn_minutes_from_duration, {duration}), "integer 2");
  EXPECT_EQ(call(fn_seconds_from_duration, {duration}), "decimal 1.5");
}

TEST(DayTimeComponents, HaveTheSignOfTheDuration) {
  const Value duration = typed(XQueryTypeDayTimeDuration, "-P1DT2H3M4.5S");
  EXPECT_EQ(call(fn_days_from_duration, {duration}), "integer -1");
  EXPECT_EQ(call(fn_hours_from_duration, {duration}), "integer -2");
  EXPECT_EQ(call(fn_minutes_from_duration, {duration}), "integer -3");
  EXPECT_EQ(call(fn_seconds_from_duration, {duration}), "decimal -4.5");
}

TEST(DayTimeComponents, SecondsKeepTheirDigits) {
  EXPECT_EQ(call(fn_seconds_from_duration, {seconds(61.1)}), "decimal 1.1");
  EXPECT_EQ(call(fn_seconds_from_duration, {seconds(0.000001)}), "decimal 0.000001");
  EXPECT_EQ(call(fn_seconds_from_duration, {seconds(0)}), "decimal 0");
}

TEST(DayTimeComponents, OfAVeryLongDuration) {
  EXPECT_EQ(call(fn_days_from_duration, {seconds(8.64e24)}), "integer 100000000000000000000");
  EXPECT_EQ(call(fn_hours_from_duration, {seconds(8.64e24)}), "integer 0");
}

TEST(DurationComponents, TheArgumentIsCast) {
  EXPECT_EQ(call(fn_years_from_duration, {untyped("P2Y")}), "integer 2");
  EXPECT_EQ(call(fn_hours_from_duration, {string("PT3H")}), "integer 3");
  EXPECT_EQ(call(fn_minutes_from_duration, {elementFrom("<a>PT7M</a>")}), "integer 7");
  EXPECT_EQ(call(fn_days_from_duration, {untyped("x")}),
            "error 6 value does not match a required type");
  EXPECT_EQ(call(fn_days_from_duration, {integer(1)}),
            "error 6 value does not match a required type");
  EXPECT_EQ(call(fn_years_from_duration, {seconds(1)}),
            "error 6 value does not match a required type");
  EXPECT_EQ(call(fn_days_from_duration, {months(1)}),
            "error 6 value does not match a required type");
}

TEST(DurationComponents, OfAGeneralDurationAreItsOwn) {
  EXPECT_EQ(fields(typed(XQueryTypeDuration, "P1Y2M3DT4H5M6.5S")), "1 2 3 4 5 6.5");
  EXPECT_EQ(fields(typed(XQueryTypeDuration, "-P1Y2M3DT4H5M6.5S")), "-1 -2 -3 -4 -5 -6.5");
}

TEST(DurationComponents, OfTheEmptySequenceAreEmpty) {
  for (const XQueryProcedure accessor : accessors) EXPECT_EQ(call(accessor, {empty()}), "()");
}

TEST(DurationComponents, OfSeveralItemsAreAnError) {
  for (const XQueryProcedure accessor : accessors) {
    EXPECT_EQ(call(accessor, {sequence({months(1), months(1)})}),
              "error 6 invalid type for automization");
  }
}

TEST(DurationComponents, TheFailedCastOfAURITravelsOn) {
  const Value uri = typed(XQueryTypeAnyURI, "urn:a");
  for (const XQueryProcedure accessor : accessors) {
    EXPECT_EQ(call(accessor, {uri}), "record 6 value does not match a required type");
  }
}

TEST(DurationComponents, TakeOneArgument) {
  for (const XQueryProcedure accessor : accessors) {
    EXPECT_EQ(refusedCounts(accessor, empty()), "0 2 3 4 5");
  }
}

}  // namespace
}  // namespace xquery
