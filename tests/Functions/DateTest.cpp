#include "Functions/Date.h"
#include "Functions/FunctionsTesting.h"
#include "Platform/Dates/ZoneTestSupport.h"
#include "Types/XQueryDate.h"

namespace xquery {
namespace {

using namespace functiontest;

constexpr XQueryProcedure dateTimeAccessors[] = {fn_year_from_dateTime,    fn_month_from_dateTime,
                                                 fn_day_from_dateTime,     fn_hours_from_dateTime,
                                                 fn_minutes_from_dateTime, fn_seconds_from_dateTime,
                                                 fn_timezone_from_dateTime};
constexpr XQueryProcedure dateAccessors[] = {fn_year_from_date, fn_month_from_date,
                                             fn_day_from_date, fn_timezone_from_date};
constexpr XQueryProcedure timeAccessors[] = {fn_hours_from_time, fn_minutes_from_time,
                                             fn_seconds_from_time, fn_timezone_from_time};

Value dateTime(std::string_view text) {
  return typed(XQueryTypeDateTime, text);
}
Value date(std::string_view text) {
  return typed(XQueryTypeDate, text);
}
Value time(std::string_view text) {
  return typed(XQueryTypeTime, text);
}

// --- components ----------------------------------------------------------------------------------

TEST(DateTimeComponents, AreTheFieldsInTheValuesOwnZone) {
  const Value value = dateTime("2004-02-29T23:30:05.25-05:00");
  EXPECT_EQ(call(fn_year_from_dateTime, {value}), "integer 2004");
  EXPECT_EQ(call(fn_month_from_dateTime, {value}), "integer 2");
  EXPECT_EQ(call(fn_day_from_dateTime, {value}), "integer 29");
  EXPECT_EQ(call(fn_hours_from_dateTime, {value}), "integer 23");
  EXPECT_EQ(call(fn_minutes_from_dateTime, {value}), "integer 30");
  EXPECT_EQ(call(fn_seconds_from_dateTime, {value}), "decimal 5.25");
  EXPECT_EQ(call(fn_timezone_from_dateTime, {value}), "dayTimeDuration -PT5H");
}

TEST(DateTimeComponents, OfAValueWithoutZoneAreAsWritten) {
  const Value value = dateTime("-0044-03-15T07:08:09");
  EXPECT_EQ(call(fn_year_from_dateTime, {value}), "integer -44");
  EXPECT_EQ(call(fn_hours_from_dateTime, {value}), "integer 7");
  EXPECT_EQ(call(fn_timezone_from_dateTime, {value}), "()");
}

TEST(DateTimeComponents, SecondsKeepTheirDigits) {
  EXPECT_EQ(call(fn_seconds_from_dateTime, {dateTime("2004-01-01T00:00:59.123456789Z")}),
            "decimal 59.123456789");
  EXPECT_EQ(call(fn_seconds_from_time, {time("12:00:00.1")}), "decimal 0.1");
}

TEST(DateComponents, AreYearMonthDayAndZone) {
  const Value value = date("2004-12-31+05:30");
  EXPECT_EQ(call(fn_year_from_date, {value}), "integer 2004");
  EXPECT_EQ(call(fn_month_from_date, {value}), "integer 12");
  EXPECT_EQ(call(fn_day_from_date, {value}), "integer 31");
  EXPECT_EQ(call(fn_timezone_from_date, {value}), "dayTimeDuration PT5H30M");
  EXPECT_EQ(call(fn_timezone_from_date, {date("2004-12-31")}), "()");
  EXPECT_EQ(call(fn_timezone_from_date, {date("2004-12-31Z")}), "dayTimeDuration PT0S");
}

TEST(TimeComponents, AreHoursMinutesSecondsAndZone) {
  const Value value = time("23:59:58.5-12:00");
  EXPECT_EQ(call(fn_hours_from_time, {value}), "integer 23");
  EXPECT_EQ(call(fn_minutes_from_time, {value}), "integer 59");
  EXPECT_EQ(call(fn_seconds_from_time, {value}), "decimal 58.5");
  EXPECT_EQ(call(fn_timezone_from_time, {value}), "dayTimeDuration -PT12H");
  EXPECT_EQ(call(fn_timezone_from_time, {time("12:00:00")}), "()");
}

TEST(Components, TheArgumentIsCast) {
  EXPECT_EQ(call(fn_hours_from_dateTime, {date("2004-01-02")}), "integer 0");
  EXPECT_EQ(call(fn_day_from_date, {dateTime("2004-01-02T23:00:00-05:00")}), "integer 2");
  EXPECT_EQ(call(fn_hours_from_time, {dateTime("2004-01-02T23:00:00-05:00")}), "integer 23");
  EXPECT_EQ(call(fn_timezone_from_time, {dateTime("2004-01-02T23:00:00-05:00")}),
            "dayTimeDuration -PT5H");
  EXPECT_EQ(call(fn_year_from_date, {untyped("2004-01-02")}), "integer 2004");
  EXPECT_EQ(call(fn_minutes_from_time, {elementFrom("<a>12:34:56</a>")}), "integer 34");
  constexpr std::string_view failure = "error 6 value does not match a required type";
  EXPECT_EQ(call(fn_year_from_date, {time("12:00:00")}), failure);
  EXPECT_EQ(call(fn_hours_from_time, {date("2004-01-02")}), failure);
  EXPECT_EQ(call(fn_year_from_dateTime, {integer(2004)}), failure);
  EXPECT_EQ(call(fn_year_from_dateTime, {untyped("2004")}), failure);
}

TEST(Components, OfEmptySeveralOrRefusedArguments) {
  const auto check = [](XQueryProcedure accessor, const Value& value) {
    EXPECT_EQ(call(accessor, {empty()}), "()");
    EXPECT_EQ(call(accessor, {sequence({value, value})}), "error 6 invalid type for automization");
    EXPECT_EQ(call(accessor, {typed(XQueryTypeAnyURI, "urn:a")}),
              "record 6 value does not match a required type");
    EXPECT_EQ(refusedCounts(accessor, value), "0 2 3 4 5");
  };
  for (const XQueryProcedure accessor : dateTimeAccessors) {
    check(accessor, dateTime("2004-01-01T00:00:00Z"));
  }
  for (const XQueryProcedure accessor : dateAccessors) check(accessor, date("2004-01-01Z"));
  for (const XQueryProcedure accessor : timeAccessors) check(accessor, time("00:00:00Z"));
}

// --- zones ---------------------------------------------------------------------------------------

TEST(AdjustToTimezone, EachFunctionCastsToItsType) {
  const Value value = dateTime("2002-03-07T10:00:00-07:00");
  const Value zone = seconds(-36000);
  EXPECT_EQ(call(fn_adjust_dateTime_to_timezone, {value, zone}),
            "dateTime 2002-03-07T07:00:00-10:00");
  EXPECT_EQ(call(fn_adjust_date_to_timezone, {value, zone}), "date 2002-03-06-10:00");
  EXPECT_EQ(call(fn_adjust_time_to_timezone, {value, zone}), "time 07:00:00-10:00");
}

TEST(AdjustToTimezone, AValueWithoutZoneKeepsItsFieldsAndAnEmptyZoneTakesItAway) {
  EXPECT_EQ(call(fn_adjust_date_to_timezone, {date("2002-03-07"), seconds(3600)}),
            "date 2002-03-07+01:00");
  EXPECT_EQ(call(fn_adjust_time_to_timezone, {time("10:00:00-07:00"), empty()}), "time 10:00:00");
  EXPECT_EQ(call(fn_adjust_dateTime_to_timezone, {empty(), seconds(0)}), "()");
}

TEST(AdjustToTimezone, TakesOneOrTwoArguments) {
  for (const XQueryProcedure procedure :
       {fn_adjust_dateTime_to_timezone, fn_adjust_date_to_timezone, fn_adjust_time_to_timezone}) {
    EXPECT_EQ(refusedCounts(procedure, empty()), "0 3 4 5");
  }
}

// --- differences ---------------------------------------------------------------------------------

TEST(Subtract, IsTheFirstInstantMinusTheSecond) {
  EXPECT_EQ(call(fn_subtract_dateTimes_yielding_dayTimeDuration,
                 {dateTime("2000-10-30T06:12:00-05:00"), dateTime("1999-11-28T09:00:00Z")}),
            "dayTimeDuration P337DT2H12M");
  EXPECT_EQ(
      call(fn_subtract_dates_yielding_dayTimeDuration, {date("2000-10-30Z"), date("1999-11-28Z")}),
      "dayTimeDuration P337D");
  EXPECT_EQ(call(fn_subtract_dates_yielding_dayTimeDuration,
                 {date("2000-10-15-05:00"), date("2000-10-10+02:00")}),
            "dayTimeDuration P5DT7H");
  EXPECT_EQ(call(fn_subtract_times, {time("11:00:00Z"), time("21:30:00Z")}),
            "dayTimeDuration -PT10H30M");
  EXPECT_EQ(call(fn_subtract_times, {time("08:00:00.5Z"), time("08:00:00Z")}),
            "dayTimeDuration PT0.5S");
}

TEST(Subtract, BothArgumentsAreCast) {
  EXPECT_EQ(call(fn_subtract_dates_yielding_dayTimeDuration,
                 {dateTime("2004-01-02T23:00:00Z"), untyped("2004-01-01Z")}),
            "dayTimeDuration P1D");
  EXPECT_EQ(call(fn_subtract_times, {time("11:00:00Z"), date("2004-01-01Z")}),
            "error 6 value does not match a required type");
  EXPECT_EQ(call(fn_subtract_times, {time("11:00:00Z"), empty()}),
            "error 6 invalid type for automization");
  EXPECT_EQ(call(fn_subtract_times, {empty(), time("11:00:00Z")}),
            "error 6 invalid type for automization");
  const Value uri = typed(XQueryTypeAnyURI, "urn:a");
  EXPECT_EQ(call(fn_subtract_times, {uri, time("11:00:00Z")}),
            "record 6 value does not match a required type");
  EXPECT_EQ(call(fn_subtract_times, {time("11:00:00Z"), uri}),
            "record 6 value does not match a required type");
}

TEST(Subtract, TakesTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_subtract_dateTimes_yielding_dayTimeDuration,
                          dateTime("2004-01-01T00:00:00Z")),
            "0 1 3 4 5");
  EXPECT_EQ(refusedCounts(fn_subtract_dates_yielding_dayTimeDuration, date("2004-01-01Z")),
            "0 1 3 4 5");
  EXPECT_EQ(refusedCounts(fn_subtract_times, time("00:00:00Z")), "0 1 3 4 5");
}

// --- the present ---------------------------------------------------------------------------------

TEST(Current, AllCallsOfOneContextAgree) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const NSInstant& present = _internal(*context).currentDateTime()->instant();
  const struct {
    XQueryProcedure procedure;
    XQueryTypeID type;
  } rows[] = {{fn_current_dateTime, XQueryTypeDateTime},
              {fn_current_date, XQueryTypeDate},
              {fn_current_time, XQueryTypeTime}};
  for (const auto& row : rows) {
    const Value first = row.procedure(nullptr, 0, *context);
    const Value second = row.procedure(nullptr, 0, *context);
    ASSERT_TRUE(isa<XQueryDate>(first));
    EXPECT_EQ(cast<XQueryDate>(first)->typeID(), row.type);
    EXPECT_EQ(cast<XQueryDate>(first)->instant(), present);
    EXPECT_EQ(cast<XQueryDate>(second)->instant(), present);
    EXPECT_FALSE(first == second);
    EXPECT_EQ(cast<XQueryDate>(first)->timeZone(), NSTimeZone::localTimeZone());
    EXPECT_EQ(refusedCounts(row.procedure, empty()), "1 2 3 4 5");
  }
}

TEST(Current, DateAndTimeKeepTheWholeInstant) {
  EXPECT_EQ(answer("hours-from-dateTime(current-dateTime()) eq hours-from-time(current-time()), "
                   "year-from-dateTime(current-dateTime()) eq year-from-date(current-date()), "
                   "current-date() < current-dateTime(), current-date() > current-dateTime()"),
            "true, true, false, false");
}

class CurrentInZoneDeathTest : public InZoneDeathTest {};

TEST_F(CurrentInZoneDeathTest, IsInTheLocalZone) {
  EXPECT_IN_ZONE("Asia/Kathmandu",
                 answer("timezone-from-date(current-date()), timezone-from-time(current-time())"),
                 "dayTimeDuration PT5H45M, dayTimeDuration PT5H45M");
}

// --- dateTime ------------------------------------------------------------------------------------

TEST(DateTime, JoinsTheFieldsOfADateAndATime) {
  EXPECT_EQ(call(fn_dateTime, {date("2004-02-29"), time("12:30:45.5")}),
            "dateTime 2004-02-29T12:30:45.500000");
  EXPECT_EQ(call(fn_dateTime, {date("-0001-01-01"), time("00:00:00")}),
            "dateTime -0001-01-01T00:00:00");
}

TEST(DateTime, IsInTheZoneOfEither) {
  EXPECT_EQ(call(fn_dateTime, {date("2004-02-29+02:00"), time("12:30:45")}),
            "dateTime 2004-02-29T12:30:45+02:00");
  EXPECT_EQ(call(fn_dateTime, {date("2004-02-29"), time("12:30:45+02:00")}),
            "dateTime 2004-02-29T12:30:45+02:00");
  EXPECT_EQ(call(fn_dateTime, {date("2004-02-29+02:00"), time("12:30:45+02:00")}),
            "dateTime 2004-02-29T12:30:45+02:00");
}

TEST(DateTime, RefusesTwoZonesThatDiffer) {
  EXPECT_EQ(call(fn_dateTime, {date("2004-02-29Z"), time("12:30:45+02:00")}), "null");
  EXPECT_EQ(answer("dateTime(xs:date('2004-02-29Z'), xs:time('12:30:45+02:00'))"),
            "error 17 line 1 invalid arguments to function - dateTime");
}

TEST(DateTime, OfTheTwoPartsOfAValueIsTheValue) {
  const Value value = dateTime("2004-02-29T23:59:59.25-05:00");
  EXPECT_EQ(call(fn_dateTime, {value, value}), "dateTime 2004-02-29T23:59:59.250000-05:00");
  EXPECT_EQ(answer("dateTime(current-date(), current-time()) eq current-dateTime()"), "true");
}

TEST_F(CurrentInZoneDeathTest, ThePartsOfAValueInANamedZoneJoinToo) {
  EXPECT_IN_ZONE("Europe/Berlin",
                 answer("dateTime(current-date(), current-time()) eq current-dateTime(), "
                        "dateTime(xs:date(current-dateTime()), xs:time(current-dateTime())) "
                        "eq current-dateTime()"),
                 "true, true");
}

TEST(DateTime, CastsItsArguments) {
  EXPECT_EQ(call(fn_dateTime, {untyped("2004-02-29"), string("12:00:00")}),
            "dateTime 2004-02-29T12:00:00");
  EXPECT_EQ(call(fn_dateTime, {time("12:00:00"), date("2004-02-29")}),
            "error 6 value does not match a required type");
  EXPECT_EQ(call(fn_dateTime, {empty(), time("12:00:00")}),
            "error 6 invalid type for automization");
  EXPECT_EQ(call(fn_dateTime, {date("2004-02-29"), empty()}),
            "error 6 invalid type for automization");
  EXPECT_EQ(call(fn_dateTime, {typed(XQueryTypeAnyURI, "urn:a"), time("12:00:00")}),
            "record 6 value does not match a required type");
}

TEST(DateTime, TakesTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_dateTime, dateTime("2004-01-01T00:00:00Z")), "0 1 3 4 5");
}

}  // namespace
}  // namespace xquery
