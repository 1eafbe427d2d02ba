#include "Platform/Dates/GregorianCalendar.h"
#include "Platform/Dates/ZoneTestSupport.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryDateArithmetic.h"
#include "TypesTestSupport.h"
#include "xquery/Collection.h"
#include "xquery/Error.h"
#include "xquery/URL.h"

#include <cmath>
#include <random>
#include <string>
#include <vector>

namespace xquery {
namespace {

using testing::decimal;
using testing::integer;
using testing::printed;
using testing::raised;
using testing::view;
using testing::xsString;

class DateArithmetic : public ::testing::Test {
 protected:
  using Work = Value (*)(const Value&, const Value&, XQueryContext&);
  Ref<XQueryContext> context = XQueryContext::xqueryContext();

  Value dateTime(std::string_view text) { return XQueryDate::xqueryDateTimeFromString(view(text)); }
  Value date(std::string_view text) { return XQueryDate::xqueryDateFromString(view(text)); }
  Value time(std::string_view text) { return XQueryDate::xqueryTimeFromString(view(text)); }
  Value months(std::string_view text) {
    return XQueryNumber::yearMonthDurationWithString(view(text));
  }
  Value seconds(std::string_view text) {
    return XQueryNumber::dayTimeDurationWithString(view(text));
  }
  // "type text"; "null"; or the error.
  std::string outcome(Work work, const Value& a, const Value& b) {
    std::string result;
    const std::string error = raised(*context, [&] { result = show(work(a, b, *context)); });
    return error == "no error" ? result : error;
  }
  static std::string show(const Value& value) {
    if (!value) return "null";
    return std::to_string(XQueryObjectTypeID(value.get())) + " " + printed(value);
  }
};

// --- months --------------------------------------------------------------------------------------

struct Row {
  const char* date;
  const char* duration;
  const char* sum;
};

const Row monthRows[] = {
    {"2004-01-31", "P1M", "2004-02-29"},
    {"2003-01-31", "P1M", "2003-02-28"},
    {"2004-01-31", "P3M", "2004-04-30"},
    {"2004-01-30", "P1M", "2004-02-29"},
    {"2004-01-29", "P1M", "2004-02-29"},
    {"2003-01-29", "P1M", "2003-02-28"},
    {"2004-01-28", "P1M", "2004-02-28"},
    {"2004-02-29", "P1Y", "2005-02-28"},
    {"2004-02-29", "P4Y", "2008-02-29"},
    {"2004-02-29", "P100Y", "2104-02-29"},
    {"2000-02-29", "-P100Y", "1900-02-28"},
    {"2004-12-15", "P1M", "2005-01-15"},
    {"2004-11-15", "P1M", "2004-12-15"},
    {"2004-01-15", "-P1M", "2003-12-15"},
    {"2004-02-15", "-P1M", "2004-01-15"},
    {"2004-06-15", "P6M", "2004-12-15"},
    {"2004-06-15", "P7M", "2005-01-15"},
    {"2004-06-15", "-P6M", "2003-12-15"},
    {"2004-06-15", "-P5M", "2004-01-15"},
    {"2004-06-15", "-P18M", "2002-12-15"},
    {"2004-06-15", "P25M", "2006-07-15"},
    {"2004-06-15", "P0M", "2004-06-15"},
    {"0001-01-31", "-P2M", "0000-11-30"},
    {"0000-01-31", "-P1M", "-0001-12-31"},
    {"-0001-12-31", "P2M", "0000-02-29"},
    {"2004-05-31+14:00", "P1M", "2004-06-30+14:00"},
    {"2004-05-31-14:00", "P1M", "2004-06-30-14:00"},
    {"2004-05-31Z", "P1M", "2004-06-30Z"},
};

TEST_F(DateArithmetic, MonthsMoveTheMonthAndKeepTheDayIfTheyCan) {
  for (const Row& row : monthRows) {
    EXPECT_EQ(outcome(op_add_yearMonthDuration_to_date, date(row.date), months(row.duration)),
              std::string("22 ") + row.sum)
        << row.date << " " << row.duration;
  }
}

TEST_F(DateArithmetic, SubtractingMonthsIsAddingTheirCounterpart) {
  for (const Row& row : monthRows) {
    const std::string duration = row.duration;
    const std::string counterpart = duration.starts_with('-') ? duration.substr(1) : "-" + duration;
    EXPECT_EQ(outcome(op_subtract_yearMonthDuration_from_date, date(row.date), months(counterpart)),
              std::string("22 ") + row.sum)
        << row.date << " " << counterpart;
  }
}

TEST_F(DateArithmetic, MonthsKeepTheTimeOfADateTime) {
  for (const Row& row : monthRows) {
    const auto withTime = [](const std::string& text) {
      return text.substr(0, text.find('-', 1) + 6) + "T23:59:58.5" +
             text.substr(text.find('-', 1) + 6);
    };
    const auto printedTime = [&](const char* text) { return printed(dateTime(withTime(text))); };
    EXPECT_EQ(outcome(op_add_yearMonthDuration_to_dateTime, dateTime(withTime(row.date)),
                      months(row.duration)),
              "21 " + printedTime(row.sum));
    const Value sum = op_add_yearMonthDuration_to_dateTime(dateTime(withTime(row.date)),
                                                           months(row.duration), *context);
    EXPECT_TRUE(XQueryObjectsEqual(*sum, *dateTime(withTime(row.sum))));
  }
  EXPECT_EQ(outcome(op_subtract_yearMonthDuration_from_dateTime, dateTime("2004-03-31T12:00:00Z"),
                    months("P1M")),
            "21 2004-02-29T12:00:00Z");
}

TEST_F(DateArithmetic, MonthsAgreeWithCountingThem) {
  std::mt19937_64 random(3);
  for (int round = 0; round < 5000; ++round) {
    const auto year = static_cast<int64_t>(random() % 8000) - 3000;
    const int month = static_cast<int>(random() % 12) + 1;
    const int day =
        static_cast<int>(random() % static_cast<uint64_t>(daysInMonth(year, month))) + 1;
    const auto count = static_cast<int64_t>(random() % 40000) - 20000;
    const NSGregorianDate fields = {
        static_cast<int32_t>(year), static_cast<int8_t>(month), static_cast<int8_t>(day), 0, 0, 0};
    const Value from = XQueryDate::xqueryDateWithGregorianDate(fields, NSTimeZone::GMT(), 22);
    const Value sum = op_add_yearMonthDuration_to_date(
        from, XQueryNumber::yearMonthDurationWithMonths(count), *context);
    const int64_t total = year * 12 + month - 1 + count;
    const int64_t expectedYear = floorDivide(total, 12);
    const int expectedMonth = static_cast<int>(floorRemainder(total, 12)) + 1;
    const int expectedDay = std::min(day, daysInMonth(expectedYear, expectedMonth));
    ASSERT_EQ(cast<XQueryDate>(sum)->instant().seconds,
              dayNumber(expectedYear, expectedMonth, expectedDay) * 86400)
        << printed(from) << " " << count;
  }
}

TEST_F(DateArithmetic, AYearBeyond32BitsHasNoValue) {
  const Value many = XQueryNumber::yearMonthDurationWithMonths(INT64_MAX);
  const Value fewest = XQueryNumber::yearMonthDurationWithMonths(INT64_MIN);
  for (const Value& count : {many, fewest}) {
    EXPECT_EQ(outcome(op_add_yearMonthDuration_to_date, date("2004-01-01Z"), count), "null");
    EXPECT_EQ(outcome(op_subtract_yearMonthDuration_from_date, date("2004-01-01Z"), count), "null");
    EXPECT_EQ(outcome(op_add_yearMonthDuration_to_dateTime, dateTime("2004-01-01T00:00:00"), count),
              "null");
  }
  EXPECT_EQ(outcome(op_add_yearMonthDuration_to_date, date("2147483647-01-31Z"), months("P11M")),
            "22 2147483647-12-31Z");
  EXPECT_EQ(outcome(op_add_yearMonthDuration_to_date, date("2147483647-01-31Z"), months("P12M")),
            "null");
  EXPECT_EQ(
      outcome(op_subtract_yearMonthDuration_from_date, date("-2147483647-01-31Z"), months("P1Y1M")),
      "null");
}

// --- seconds -------------------------------------------------------------------------------------

TEST_F(DateArithmetic, SecondsMoveADateTimeAlongTheClock) {
  const Row rows[] = {
      {"2004-02-28T12:00:00Z", "P1D", "2004-02-29T12:00:00Z"},
      {"2003-02-28T12:00:00Z", "P1D", "2003-03-01T12:00:00Z"},
      {"2004-12-31T23:59:59Z", "PT1S", "2005-01-01T00:00:00Z"},
      {"2005-01-01T00:00:00Z", "-PT1S", "2004-12-31T23:59:59Z"},
      {"2004-01-01T00:00:00", "PT0.1S", "2004-01-01T00:00:00.100000"},
      {"2004-01-01T00:00:59.9", "PT0.1S", "2004-01-01T00:01:00"},
      {"2004-01-01T00:00:00+05:30", "P1DT1H1M1S", "2004-01-02T01:01:01+05:30"},
      {"0000-01-01T00:00:00Z", "-PT1S", "-0001-12-31T23:59:59Z"},
      {"2004-01-01T00:00:00Z", "PT0S", "2004-01-01T00:00:00Z"},
      {"2004-01-01T00:00:00Z", "P146097D", "2404-01-01T00:00:00Z"},
  };
  for (const Row& row : rows) {
    EXPECT_EQ(
        outcome(op_add_dayTimeDuration_to_dateTime, dateTime(row.date), seconds(row.duration)),
        std::string("21 ") + row.sum);
    EXPECT_EQ(outcome(op_subtract_dayTimeDuration_from_dateTime, dateTime(row.sum),
                      seconds(row.duration)),
              show(dateTime(row.date)));
  }
}

TEST_F(DateArithmetic, SecondsMoveADateByWholeDaysOfItsCalendar) {
  const Row rows[] = {
      {"2004-02-28", "P1D", "2004-02-29"},
      {"2004-02-28", "PT23H59M59S", "2004-02-28"},
      {"2004-02-28", "PT24H", "2004-02-29"},
      {"2004-02-28", "-PT1S", "2004-02-27"},
      {"2004-02-28", "PT36H", "2004-02-29"},
      {"2004-02-28Z", "P2D", "2004-03-01Z"},
      {"2004-02-28+14:00", "P1D", "2004-02-29+14:00"},
      {"2004-02-28-14:00", "PT23H", "2004-02-28-14:00"},
      {"0000-01-01Z", "-P1D", "-0001-12-31Z"},
  };
  for (const Row& row : rows) {
    EXPECT_EQ(outcome(op_add_dayTimeDuration_to_date, date(row.date), seconds(row.duration)),
              std::string("22 ") + row.sum)
        << row.date << " " << row.duration;
    const Value sum =
        op_add_dayTimeDuration_to_date(date(row.date), seconds(row.duration), *context);
    EXPECT_TRUE(XQueryObjectsEqual(*sum, *date(row.sum))) << row.sum;
  }
  EXPECT_EQ(outcome(op_subtract_dayTimeDuration_from_date, date("2004-03-01"), seconds("P1D")),
            "22 2004-02-29");
  EXPECT_EQ(outcome(op_subtract_dayTimeDuration_from_date, date("2004-03-01"), seconds("PT1S")),
            "22 2004-02-29");
}

TEST_F(DateArithmetic, SecondsMoveATimeAroundMidnight) {
  const Row rows[] = {
      {"23:30:00Z", "PT1H", "00:30:00Z"},
      {"00:30:00Z", "-PT1H", "23:30:00Z"},
      {"12:00:00Z", "P3DT1H", "13:00:00Z"},
      {"12:00:00Z", "PT12H", "00:00:00Z"},
      {"23:59:59.5-08:00", "PT0.5S", "00:00:00-08:00"},
      {"12:00:00Z", "-P1D", "12:00:00Z"},
      {"01:00:00+14:00", "-PT2H", "23:00:00+14:00"},
  };
  for (const Row& row : rows) {
    EXPECT_EQ(outcome(op_add_dayTimeDuration_to_time, time(row.date), seconds(row.duration)),
              std::string("23 ") + row.sum)
        << row.date;
    // The sum is the time that its text says, on no other day.
    const Value sum =
        op_add_dayTimeDuration_to_time(time(row.date), seconds(row.duration), *context);
    EXPECT_TRUE(XQueryObjectsEqual(*sum, *time(row.sum))) << row.sum;
  }
  EXPECT_EQ(outcome(op_subtract_dayTimeDuration_from_time, time("00:30:00Z"), seconds("PT1H")),
            "23 23:30:00Z");
}

TEST_F(DateArithmetic, SecondsBeyondTheYearsHaveNoValue) {
  const Value far[] = {XQueryNumber::dayTimeDurationWithSeconds(1e300),
                       XQueryNumber::dayTimeDurationWithSeconds(-1e300),
                       XQueryNumber::dayTimeDurationWithSeconds(1e17),
                       XQueryNumber::dayTimeDurationWithSeconds(INFINITY),
                       XQueryNumber::dayTimeDurationWithSeconds(NAN)};
  for (const Value& duration : far) {
    EXPECT_EQ(
        outcome(op_add_dayTimeDuration_to_dateTime, dateTime("2004-01-01T00:00:00Z"), duration),
        "null");
    EXPECT_EQ(outcome(op_subtract_dayTimeDuration_from_date, date("2004-01-01Z"), duration),
              "null");
    EXPECT_EQ(outcome(op_add_dayTimeDuration_to_time, time("00:00:00Z"), duration), "null");
  }
}

// --- daylight saving time ------------------------------------------------------------------------

class DaylightSaving : public DateArithmetic {
 protected:
  Ref<NSTimeZone> berlin = NSTimeZone::timeZoneWithName("Europe/Berlin");
  Ref<NSTimeZone> newYork = NSTimeZone::timeZoneWithName("America/New_York");

  Value in(const Ref<NSTimeZone>& zone, const NSGregorianDate& fields, XQueryTypeID type = 21) {
    return XQueryDate::xqueryDateWithGregorianDate(fields, zone, type);
  }
  std::string plus(const Value& value, const char* duration) {
    return outcome(op_add_dayTimeDuration_to_dateTime, value, seconds(duration)).substr(3);
  }
};

TEST_F(DaylightSaving, TheDistanceOnTheClockIsKept) {
  EXPECT_EQ(plus(in(berlin, {2024, 3, 30, 12, 0, 0}), "P1D"), "2024-03-31T12:00:00+02:00");
  EXPECT_EQ(plus(in(berlin, {2024, 3, 31, 12, 0, 0}), "-P1D"), "2024-03-30T12:00:00+01:00");
  EXPECT_EQ(plus(in(berlin, {2024, 10, 26, 12, 0, 0}), "P1D"), "2024-10-27T12:00:00+01:00");
  EXPECT_EQ(plus(in(berlin, {2024, 10, 27, 12, 0, 0}), "-P1D"), "2024-10-26T12:00:00+02:00");
  EXPECT_EQ(plus(in(berlin, {2024, 7, 1, 12, 0, 0}), "P365D"), "2025-07-01T12:00:00+02:00");
  EXPECT_EQ(plus(in(berlin, {2024, 7, 1, 12, 0, 0}), "P182D"), "2024-12-30T12:00:00+01:00");
  EXPECT_EQ(plus(in(newYork, {2024, 3, 9, 12, 0, 0}), "P1D"), "2024-03-10T12:00:00-04:00");
  EXPECT_EQ(plus(in(newYork, {2024, 11, 2, 12, 0, 0}), "P1D"), "2024-11-03T12:00:00-05:00");
}

TEST_F(DaylightSaving, ASumJustBehindTheChangeIsMovedByAnHour) {
  EXPECT_EQ(plus(in(berlin, {2024, 3, 31, 1, 30, 0}), "PT2H"), "2024-03-31T03:30:00+02:00");
  EXPECT_EQ(plus(in(berlin, {2024, 10, 27, 1, 30, 0}), "PT3H"), "2024-10-27T04:30:00+01:00");
}

TEST_F(DaylightSaving, AFixedOffsetKnowsNoDaylightSaving) {
  EXPECT_EQ(plus(dateTime("2024-03-30T12:00:00+01:00"), "P1D"), "2024-03-31T12:00:00+01:00");
}

TEST_F(DaylightSaving, MonthsKeepTheTimeOnTheClock) {
  EXPECT_EQ(outcome(op_add_yearMonthDuration_to_dateTime, in(berlin, {2024, 1, 31, 12, 0, 0}),
                    months("P2M")),
            "21 2024-03-31T12:00:00+02:00");
}

TEST_F(DaylightSaving, ADayOfTheCalendarHas24Hours) {
  const auto dayAfter = [&](const NSGregorianDate& fields, const char* duration) {
    return outcome(op_add_dayTimeDuration_to_date, in(berlin, fields, 22), seconds(duration));
  };
  EXPECT_EQ(dayAfter({2024, 10, 27, 0, 0, 0}, "P1D"), "22 2024-10-28+01:00");
  EXPECT_EQ(dayAfter({2024, 10, 27, 0, 0, 0}, "PT23H59M"), "22 2024-10-27+02:00");
  EXPECT_EQ(dayAfter({2024, 3, 31, 0, 0, 0}, "PT23H30M"), "22 2024-03-31+01:00");
  EXPECT_EQ(dayAfter({2024, 3, 31, 0, 0, 0}, "P1D"), "22 2024-04-01+02:00");
  EXPECT_EQ(dayAfter({2024, 3, 30, 0, 0, 0}, "P2D"), "22 2024-04-01+02:00");
  EXPECT_EQ(dayAfter({2024, 3, 31, 0, 0, 0}, "-P1D"), "22 2024-03-30+01:00");
}

TEST_F(DaylightSaving, ATimeKeepsTheOffsetThatItShows) {
  const Value noon = in(berlin, {2024, 7, 1, 12, 0, 0}, 23);
  EXPECT_EQ(outcome(op_add_dayTimeDuration_to_time, noon, seconds("PT13H")), "23 01:00:00+02:00");
}

class LocalArithmetic : public InZoneDeathTest {
 protected:
  static std::string sum(XQueryTypeID type, const char* date, const char* duration) {
    const Ref<XQueryContext> context = XQueryContext::xqueryContext();
    const Value left = XQueryCastAs(xsString(date), type, *context);
    const Value right = XQueryNumber::dayTimeDurationWithString(view(duration));
    const auto work = type == 21   ? op_add_dayTimeDuration_to_dateTime
                      : type == 22 ? op_add_dayTimeDuration_to_date
                                   : op_add_dayTimeDuration_to_time;
    return printed(work(left, right, *context));
  }
};

TEST_F(LocalArithmetic, WithoutAZoneTheLocalOneDecides) {
  EXPECT_IN_ZONE("Europe/Berlin", sum(21, "2024-03-30T12:00:00", "P1D"), "2024-03-31T12:00:00");
  EXPECT_IN_ZONE("Europe/Berlin", sum(21, "2024-10-26T12:00:00", "P1D"), "2024-10-27T12:00:00");
  EXPECT_IN_ZONE("Europe/Berlin", sum(21, "2024-10-27T01:30:00", "PT3H"), "2024-10-27T04:30:00");
  EXPECT_IN_ZONE("America/New_York", sum(21, "2024-03-10T12:00:00", "-P1D"), "2024-03-09T12:00:00");
  EXPECT_IN_ZONE("Europe/Berlin", sum(22, "2024-10-27", "P1D"), "2024-10-28");
  EXPECT_IN_ZONE("Europe/Berlin", sum(22, "2024-05-10", "P1D"), "2024-05-11");
  EXPECT_IN_ZONE("America/New_York", sum(22, "2024-05-10", "PT23H"), "2024-05-10");
}

// Of a time without a zone the zone of the process does not show.
TEST_F(LocalArithmetic, ASumOfATimeWithoutAZoneIsTheSameInEveryZone) {
  constexpr Row rows[] = {
      {"23:30:00", "PT1H", "00:30:00"},          {"00:30:00", "-PT1H", "23:30:00"},
      {"12:00:00", "P3DT1H", "13:00:00"},        {"02:30:00", "P1D", "02:30:00"},
      {"12:00:00", "PT1.5S", "12:00:01.500000"}, {"01:59:59", "PT1S", "02:00:00"},
  };
  for (const char* zone : {"UTC", "Europe/Berlin", "America/New_York", "Asia/Kathmandu"}) {
    const auto sums = [&] {
      std::string text;
      for (const Row& row : rows) text += sum(23, row.date, row.duration) + " ";
      return text;
    };
    std::string expected;
    for (const Row& row : rows) expected += std::string(row.sum) + " ";
    EXPECT_IN_ZONE(zone, sums(), expected);
  }
}

TEST_F(LocalArithmetic, ASumOfATimeKeepsItsOwnZone) {
  EXPECT_IN_ZONE("Europe/Berlin", sum(23, "23:30:00Z", "PT1H"), "00:30:00Z");
  EXPECT_IN_ZONE("Europe/Berlin", sum(23, "23:30:00+01:00", "PT1H"), "00:30:00+01:00");
  EXPECT_IN_ZONE("America/New_York", sum(23, "00:30:00+14:00", "-PT1H"), "23:30:00+14:00");
}

// --- differences ---------------------------------------------------------------------------------

TEST_F(DateArithmetic, ADifferenceIsThatOfTheInstants) {
  const auto difference = [&](const Value& a, const Value& b) {
    return outcome(op_subtract_dates, a, b);
  };
  EXPECT_EQ(difference(dateTime("2004-03-01T00:00:00Z"), dateTime("2004-02-28T12:30:00Z")),
            "29 P1DT11H30M");
  EXPECT_EQ(difference(dateTime("2004-02-28T12:30:00Z"), dateTime("2004-03-01T00:00:00Z")),
            "29 -P1DT11H30M");
  EXPECT_EQ(difference(dateTime("2004-01-01T00:00:00-05:00"), dateTime("2004-01-01T00:00:00Z")),
            "29 PT5H");
  EXPECT_EQ(difference(dateTime("2004-01-01T00:00:00.3Z"), dateTime("2004-01-01T00:00:00.2Z")),
            "29 PT0.1S");
  EXPECT_EQ(difference(date("2004-03-01Z"), date("2004-02-28Z")), "29 P2D");
  EXPECT_EQ(difference(date("2004-03-01Z"), date("2004-03-01+14:00")), "29 PT14H");
  EXPECT_EQ(difference(date("2004-03-01"), date("2004-03-01")), "29 PT0S");
  EXPECT_EQ(difference(time("11:12:00Z"), time("04:00:00Z")), "29 PT7H12M");
  EXPECT_EQ(difference(time("04:00:00"), time("11:12:00.5")), "29 -PT7H12M0.5S");
  EXPECT_EQ(difference(date("2147483647-12-31Z"), date("-2147483647-01-01Z")),
            "29 P1568704592243D");
}

// --- durations -----------------------------------------------------------------------------------

TEST_F(DateArithmetic, SumsAndDifferencesOfDurationsKeepTheKind) {
  EXPECT_EQ(outcome(op_add_yearMonthDurations, months("P1Y"), months("P2M")), "28 P1Y2M");
  EXPECT_EQ(outcome(op_subtract_yearMonthDurations, months("P1Y"), months("P14M")), "28 -P2M");
  EXPECT_EQ(outcome(op_add_dayTimeDurations, seconds("P1D"), seconds("PT25H")), "29 P2DT1H");
  EXPECT_EQ(outcome(op_subtract_dayTimeDurations, seconds("PT1M"), seconds("PT1.5S")),
            "29 PT58.5S");
}

TEST_F(DateArithmetic, DurationsBeyondTheirRangeHaveNoValue) {
  const Value most = XQueryNumber::yearMonthDurationWithMonths(INT64_MAX);
  const Value least = XQueryNumber::yearMonthDurationWithMonths(INT64_MIN);
  const Value longest = XQueryNumber::dayTimeDurationWithSeconds(1.7e308);
  EXPECT_EQ(outcome(op_add_yearMonthDurations, most, months("P1M")), "null");
  EXPECT_EQ(outcome(op_subtract_yearMonthDurations, least, months("P1M")), "null");
  EXPECT_EQ(outcome(op_multiply_yearMonthDuration, most, integer(2)), "null");
  EXPECT_EQ(outcome(op_add_dayTimeDurations, longest, longest), "null");
  EXPECT_EQ(outcome(op_multiply_dayTimeDuration, longest, integer(2)), "null");
  EXPECT_EQ(outcome(op_divide_dayTimeDuration, longest, decimal("0.001")), "null");
}

TEST_F(DateArithmetic, ProductsOfMonthsAreRoundedHalvesUp) {
  const std::pair<const char*, std::pair<const char*, const char*>> rows[] = {
      {"P1Y", {"2", "28 P2Y"}},      {"P5M", {"0.5", "28 P3M"}},      {"-P5M", {"0.5", "28 -P2M"}},
      {"P3M", {"0.5", "28 P2M"}},    {"P1M", {"0.49", "28 P0M"}},     {"P1M", {"-0.5", "28 P0M"}},
      {"P1M", {"-0.51", "28 -P1M"}}, {"P2Y11M", {"2.3", "28 P6Y9M"}}, {"P1Y", {"0", "28 P0M"}},
      {"P1Y", {"-1", "28 -P1Y"}},
  };
  for (const auto& [duration, row] : rows) {
    EXPECT_EQ(outcome(op_multiply_yearMonthDuration, months(duration), decimal(row.first)),
              row.second)
        << duration << " * " << row.first;
  }
  EXPECT_EQ(
      outcome(op_multiply_yearMonthDuration, months("P5M"), XQueryNumber::numberWithDouble(0.5)),
      "28 P3M");
}

TEST_F(DateArithmetic, ProductsOfSeconds) {
  EXPECT_EQ(outcome(op_multiply_dayTimeDuration, seconds("PT2H10M"), decimal("2.1")), "29 PT4H33M");
  EXPECT_EQ(outcome(op_multiply_dayTimeDuration, seconds("PT1S"), decimal("0.5")), "29 PT0.5S");
  EXPECT_EQ(outcome(op_multiply_dayTimeDuration, seconds("P1D"), integer(-1)), "29 -P1D");
  EXPECT_EQ(outcome(op_multiply_dayTimeDuration, seconds("P1D"), integer(0)), "29 PT0S");
  EXPECT_EQ(outcome(op_multiply_dayTimeDuration, XQueryNumber::dayTimeDurationWithSeconds(INFINITY),
                    integer(0)),
            "29 PT0S");
}

TEST_F(DateArithmetic, QuotientsWithANumberScaleLikeProducts) {
  EXPECT_EQ(outcome(op_divide_yearMonthDuration, months("P2Y11M"), decimal("1.5")), "28 P1Y11M");
  EXPECT_EQ(outcome(op_divide_yearMonthDuration, months("P5M"), integer(2)), "28 P3M");
  EXPECT_EQ(outcome(op_divide_yearMonthDuration, months("-P5M"), integer(2)), "28 -P2M");
  EXPECT_EQ(outcome(op_divide_yearMonthDuration, months("P1Y"), integer(7)), "28 P2M");
  EXPECT_EQ(outcome(op_divide_dayTimeDuration, seconds("P1DT2H30M10.5S"), decimal("1.5")),
            "29 PT17H40M7S");
  EXPECT_EQ(outcome(op_divide_dayTimeDuration, seconds("PT1S"), integer(-4)), "29 -PT0.25S");
}

TEST_F(DateArithmetic, NeitherNaNNorAnInfinityScalesADuration) {
  const Value specials[] = {XQueryNumber::nan(), XQueryNumber::posInf(), XQueryNumber::negInf(),
                            NSNumber::numberWithDouble(NAN), NSNumber::numberWithDouble(INFINITY)};
  for (const Value& number : specials) {
    for (const Work work : {op_multiply_yearMonthDuration, op_divide_yearMonthDuration}) {
      EXPECT_EQ(outcome(work, months("P1Y"), number), "6 invalid type for operator");
    }
    for (const Work work : {op_multiply_dayTimeDuration, op_divide_dayTimeDuration}) {
      EXPECT_EQ(outcome(work, seconds("P1D"), number), "6 invalid type for operator");
    }
  }
}

TEST_F(DateArithmetic, DurationsOfOneKindDivideToADecimal) {
  EXPECT_EQ(outcome(op_divide_durations, months("P3Y4M"), months("-P1Y4M")), "13 -2.5");
  EXPECT_EQ(outcome(op_divide_durations, months("P1Y"), months("P7M")),
            "13 1.7142857142857142857142857142857142857");
  EXPECT_EQ(outcome(op_divide_durations, seconds("P2DT53M11S"), seconds("P1DT10H")),
            "13 1.4378349673202614379084967320261437908");
  EXPECT_EQ(outcome(op_divide_durations, seconds("PT0.3S"), seconds("PT0.1S")), "13 3");
}

// --- adjusting to a zone -------------------------------------------------------------------------

class AdjustToZone : public DateArithmetic {
 protected:
  std::string adjusted(XQueryTypeID type, std::vector<Value> arguments) {
    std::string result;
    const std::string error = raised(*context, [&] {
      result =
          show(adjust_dateTime_to_timezone(arguments.data(), arguments.size(), *context, type));
    });
    return error == "no error" ? result : error;
  }
};

TEST_F(AdjustToZone, AValueWithAZoneStaysTheSameInstant) {
  EXPECT_EQ(adjusted(21, {dateTime("2002-03-07T10:00:00-07:00"), seconds("-PT10H")}),
            "21 2002-03-07T07:00:00-10:00");
  EXPECT_EQ(adjusted(21, {dateTime("2002-03-07T00:00:00+01:00"), seconds("-PT8H")}),
            "21 2002-03-06T15:00:00-08:00");
  EXPECT_EQ(adjusted(22, {date("2002-03-07-07:00"), seconds("-PT10H")}), "22 2002-03-06-10:00");
  EXPECT_EQ(adjusted(23, {time("10:00:00-07:00"), seconds("PT10H")}), "23 03:00:00+10:00");
  EXPECT_EQ(adjusted(23, {time("10:00:00-07:00"), seconds("PT0S")}), "23 17:00:00Z");
}

TEST_F(AdjustToZone, AValueWithoutOneKeepsItsFields) {
  EXPECT_EQ(adjusted(21, {dateTime("2002-03-07T10:00:00.5"), seconds("-PT10H")}),
            "21 2002-03-07T10:00:00.500000-10:00");
  EXPECT_EQ(adjusted(22, {date("2002-03-07"), seconds("PT5H30M")}), "22 2002-03-07+05:30");
  EXPECT_EQ(adjusted(23, {time("10:00:00"), seconds("PT0S")}), "23 10:00:00Z");
}

TEST_F(AdjustToZone, AnEmptyZoneTakesTheZoneAway) {
  const Value none = NSNull::null();
  EXPECT_EQ(adjusted(21, {dateTime("2002-03-07T10:00:00-07:00"), none}), "21 2002-03-07T10:00:00");
  EXPECT_EQ(adjusted(22, {date("2002-03-07-07:00"), none}), "22 2002-03-07");
  EXPECT_EQ(adjusted(23, {time("10:00:00"), NSArray::array()}), "23 10:00:00");
}

TEST_F(AdjustToZone, TheArgumentIsNotChanged) {
  const Value value = time("10:00:00-07:00");
  EXPECT_EQ(adjusted(23, {value, seconds("PT10H")}), "23 03:00:00+10:00");
  EXPECT_EQ(show(value), "23 10:00:00-07:00");
}

TEST_F(AdjustToZone, ArgumentsAreCast) {
  EXPECT_EQ(adjusted(22, {dateTime("2002-03-07T10:00:00"), testing::text("PT1H")}),
            "22 2002-03-07+01:00");
  EXPECT_EQ(adjusted(21, {testing::text("x")}), "6 value does not match a required type");
  EXPECT_EQ(adjusted(21, {dateTime("2002-03-07T10:00:00"), integer(1)}),
            "6 value does not match a required type");
}

TEST_F(AdjustToZone, SeveralValuesAreNotOne) {
  const Value value = dateTime("2002-03-07T10:00:00");
  const Value two = NSArray::arrayWithObjects({value, value});
  EXPECT_EQ(adjusted(21, {two}), "6 invalid type for automization");
  EXPECT_EQ(adjusted(21, {value, two}), "6 invalid type for automization");
}

// The error of a cast from a URI is not raised but travels on as the answer.
TEST_F(AdjustToZone, TheFailedCastOfAURIIsTheAnswer) {
  const Value uri = NSURL::URLWithString(NSString::stringWithASCII("urn:a"));
  const auto answer = [&](std::vector<Value> arguments) {
    return adjust_dateTime_to_timezone(arguments.data(), arguments.size(), *context, 21);
  };
  EXPECT_TRUE(isa<XQueryError>(answer({uri})));
  EXPECT_TRUE(isa<XQueryError>(answer({dateTime("2002-03-07T10:00:00"), uri})));
}

TEST_F(AdjustToZone, TheOffsetIsNotChecked) {
  EXPECT_EQ(adjusted(23, {time("10:00:00Z"), seconds("PT15H")}), "23 01:00:00+15:00");
  EXPECT_EQ(adjusted(23, {time("10:00:00Z"), seconds("P5D")}), "23 10:00:00+120:00");
  EXPECT_EQ(adjusted(23, {time("10:00:00"), seconds("PT15H")}), "23 10:00:00+15:00");
  // The fields are read again with the suffix, which has two digits for the hours.
  EXPECT_EQ(adjusted(23, {time("10:00:00"), seconds("P5D")}),
            "6 value does not match a required type");
  EXPECT_EQ(adjusted(23, {time("10:00:00Z"), seconds("P99999999D")}), "null");
}

TEST_F(AdjustToZone, AnEmptyValueStaysEmptyAndOtherCountsHaveNoAnswer) {
  EXPECT_EQ(
      adjust_dateTime_to_timezone(std::vector<Value>{NSNull::null()}.data(), 1, *context, 21).get(),
      NSNull::null());
  EXPECT_EQ(adjusted(21, {}), "null");
  const Value value = dateTime("2002-03-07T10:00:00");
  EXPECT_EQ(adjusted(21, {value, seconds("PT1H"), value}), "null");
}

class AdjustToLocalZone : public InZoneDeathTest {
 protected:
  static std::string adjusted(const char* text) {
    const Ref<XQueryContext> context = XQueryContext::xqueryContext();
    const Value value = XQueryDate::xqueryDateTimeFromString(view(text));
    return printed(adjust_dateTime_to_timezone(&value, 1, *context, 21));
  }
};

TEST_F(AdjustToLocalZone, IsTheDefault) {
  EXPECT_IN_ZONE("Asia/Kathmandu", adjusted("2002-03-07T10:00:00Z"), "2002-03-07T15:45:00+05:45");
  EXPECT_IN_ZONE("Asia/Kathmandu", adjusted("2002-03-07T10:00:00"), "2002-03-07T10:00:00+05:45");
}

}  // namespace
}  // namespace xquery
