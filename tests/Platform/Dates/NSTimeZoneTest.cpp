#include "Platform/Dates/GregorianCalendar.h"
#include "Platform/Dates/ZoneTestSupport.h"
#include "xquery/Date.h"

#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

constexpr int hour = 3600;

int64_t seconds(int64_t year, int month, int day, int hours = 0, int minutes = 0, int rest = 0) {
  return dayNumber(year, month, day) * secondsPerDay + hours * hour + minutes * 60 + rest;
}

NSInstant at(int64_t year, int month, int day, int hours = 0, int minutes = 0, int rest = 0) {
  return {seconds(year, month, day, hours, minutes, rest), 0};
}

// 2001-01-01 was a Monday.
int64_t lastSunday(int64_t year, int month) {
  const int64_t last = dayNumber(year, month, daysInMonth(year, month));
  return last - floorRemainder(last + 1, 7);
}

int64_t sundayOfMonth(int64_t year, int month, int which) {
  const int64_t first = dayNumber(year, month, 1);
  return first + floorRemainder(6 - floorRemainder(first, 7), 7) + 7 * (which - 1);
}

TEST(NSTimeZone, AFixedZoneHasOneOffset) {
  const auto zone = NSTimeZone::timeZoneForSecondsFromGMT(-12345);
  EXPECT_TRUE(zone->isFixed());
  for (const int year : {-2000000000, 0, 2024, 2000000000}) {
    EXPECT_EQ(zone->secondsFromGMT(at(year, 7, 1)), -12345);
    EXPECT_EQ(zone->secondsFromGMTForClock(seconds(year, 7, 1)), -12345);
    EXPECT_FALSE(zone->isDaylightSavingTime(at(year, 7, 1)));
  }
}

TEST(NSTimeZone, GMTIsShared) {
  EXPECT_EQ(NSTimeZone::timeZoneForSecondsFromGMT(0).get(), NSTimeZone::GMT());
  EXPECT_EQ(NSTimeZone::GMT()->secondsFromGMT({}), 0);
  EXPECT_EQ(NSTimeZone::localTimeZone(), NSTimeZone::localTimeZone());
}

TEST(NSTimeZone, UnknownNamesAreNoZones) {
  EXPECT_FALSE(NSTimeZone::timeZoneWithName("Europe/Nowhere"));
  EXPECT_FALSE(NSTimeZone::timeZoneWithName(""));
}

TEST(NSTimeZone, AZoneThatNeverChangesIsFixed) {
  EXPECT_TRUE(NSTimeZone::timeZoneWithName("UTC")->isFixed());
  EXPECT_TRUE(NSTimeZone::timeZoneWithName("Etc/GMT+5")->isFixed());
  EXPECT_EQ(NSTimeZone::timeZoneWithName("Etc/GMT+5")->secondsFromGMT({}), -5 * hour);
  EXPECT_FALSE(NSTimeZone::timeZoneWithName("Europe/Berlin")->isFixed());
}

class Berlin : public ::testing::Test {
 protected:
  Ref<NSTimeZone> zone = NSTimeZone::timeZoneWithName("Europe/Berlin");
};

TEST_F(Berlin, SavesDaylightFromTheLastSundayOfMarchToThatOfOctober) {
  for (int64_t year = 1996; year <= 2600; ++year) {
    const int64_t start = lastSunday(year, 3) * secondsPerDay + hour;
    const int64_t end = lastSunday(year, 10) * secondsPerDay + hour;
    ASSERT_EQ(zone->secondsFromGMT({start - 1, 0}), hour) << year;
    ASSERT_EQ(zone->secondsFromGMT({start, 0}), 2 * hour) << year;
    ASSERT_FALSE(zone->isDaylightSavingTime({start - 1, 999999999})) << year;
    ASSERT_TRUE(zone->isDaylightSavingTime({start, 0})) << year;
    ASSERT_EQ(zone->secondsFromGMT({end - 1, 0}), 2 * hour) << year;
    ASSERT_EQ(zone->secondsFromGMT({end, 0}), hour) << year;
  }
}

TEST_F(Berlin, KeepsItsRulesInFarYears) {
  for (const int64_t year : {4000LL, 123456LL, 99999999LL, 2147483646LL}) {
    const int64_t start = lastSunday(year, 3) * secondsPerDay + hour;
    EXPECT_EQ(zone->secondsFromGMT({start - 1, 0}), hour) << year;
    EXPECT_EQ(zone->secondsFromGMT({start, 0}), 2 * hour) << year;
    EXPECT_EQ(zone->secondsFromGMTForClock(start + hour - 1), hour) << year;
    EXPECT_EQ(zone->secondsFromGMTForClock(start + 2 * hour), 2 * hour) << year;
  }
}

TEST_F(Berlin, HasItsStandardTimeBeforeThereWereZones) {
  for (const int64_t year : {1899LL, 1800LL, 1LL, 0LL, -1LL, -2147483648LL}) {
    EXPECT_EQ(zone->secondsFromGMT(at(year, 7, 1)), hour) << year;
    EXPECT_EQ(zone->secondsFromGMTForClock(seconds(year, 7, 1)), hour) << year;
    EXPECT_FALSE(zone->isDaylightSavingTime(at(year, 7, 1))) << year;
  }
  EXPECT_TRUE(zone->isDaylightSavingTime(at(1917, 7, 1)));
  EXPECT_EQ(zone->secondsFromGMT(at(1947, 6, 1)), 3 * hour);
}

TEST_F(Berlin, AClockTimeThatIsSkippedHasTheOffsetBefore) {
  EXPECT_EQ(zone->secondsFromGMTForClock(seconds(2024, 3, 31, 1, 59, 59)), hour);
  EXPECT_EQ(zone->secondsFromGMTForClock(seconds(2024, 3, 31, 2, 30)), hour);
  EXPECT_EQ(zone->secondsFromGMTForClock(seconds(2024, 3, 31, 3, 0)), 2 * hour);
}

TEST_F(Berlin, AClockTimeThatComesTwiceIsTheFirst) {
  EXPECT_EQ(zone->secondsFromGMTForClock(seconds(2024, 10, 27, 1, 59, 59)), 2 * hour);
  EXPECT_EQ(zone->secondsFromGMTForClock(seconds(2024, 10, 27, 2, 30)), 2 * hour);
  EXPECT_EQ(zone->secondsFromGMTForClock(seconds(2024, 10, 27, 3, 0)), hour);
}

TEST(NSTimeZone, NewYorkSavesDaylightFromTheSecondSundayOfMarchToTheFirstOfNovember) {
  const Ref<NSTimeZone> zone = NSTimeZone::timeZoneWithName("America/New_York");
  for (int64_t year = 2007; year <= 2600; ++year) {
    const int64_t start = sundayOfMonth(year, 3, 2) * secondsPerDay + 7 * hour;
    const int64_t end = sundayOfMonth(year, 11, 1) * secondsPerDay + 6 * hour;
    ASSERT_EQ(zone->secondsFromGMT({start - 1, 0}), -5 * hour) << year;
    ASSERT_EQ(zone->secondsFromGMT({start, 0}), -4 * hour) << year;
    ASSERT_EQ(zone->secondsFromGMT({end - 1, 0}), -4 * hour) << year;
    ASSERT_EQ(zone->secondsFromGMT({end, 0}), -5 * hour) << year;
  }
  EXPECT_EQ(zone->secondsFromGMTForClock(seconds(2024, 3, 10, 2, 30)), -5 * hour);
  EXPECT_EQ(zone->secondsFromGMTForClock(seconds(2024, 11, 3, 1, 30)), -4 * hour);
}

TEST(NSTimeZone, ClockTimesReadBackInEveryHourOfAYear) {
  for (const char* name : {"Europe/Berlin", "America/New_York", "Australia/Lord_Howe",
                           "America/Sao_Paulo", "Asia/Kathmandu"}) {
    const Ref<NSTimeZone> zone = NSTimeZone::timeZoneWithName(name);
    for (int64_t clock = seconds(2017, 1, 1); clock < seconds(2018, 1, 1); clock += 1800) {
      const int32_t offset = zone->secondsFromGMTForClock(clock);
      const NSInstant instant{clock - offset, 0};
      // What a change skips reads back moved by the change.
      const int64_t back = instant.seconds + zone->secondsFromGMT(instant);
      ASSERT_TRUE(back == clock || (back > clock && back - clock <= hour)) << name << " " << clock;
      if (back != clock) {
        ASSERT_NE(zone->secondsFromGMT({instant.seconds - 2 * hour, 0}),
                  zone->secondsFromGMT({instant.seconds + 2 * hour, 0}));
      }
    }
  }
}

TEST(NSTimeZone, SeveralThreadsMayAskAtOnce) {
  const Ref<NSTimeZone> zone = NSTimeZone::timeZoneWithName("America/New_York");
  std::vector<std::thread> threads;
  std::vector<int> sums(4);
  for (int& sum : sums) {
    threads.emplace_back([&zone, &sum] {
      for (int year = 1990; year < 2090; ++year) sum += zone->secondsFromGMT(at(year, 7, 1)) / hour;
    });
  }
  for (std::thread& thread : threads) thread.join();
  for (const int sum : sums) EXPECT_EQ(sum, -400);
}

class LocalTimeZone : public InZoneDeathTest {};

// The offsets in winter and summer, in minutes.
std::string localOffsets() {
  const NSTimeZone& zone = *NSTimeZone::localTimeZone();
  return std::to_string(zone.secondsFromGMT(at(2024, 1, 15)) / 60) + " " +
         std::to_string(zone.secondsFromGMT(at(2024, 7, 15)) / 60);
}

TEST_F(LocalTimeZone, IsTheOneThatTheEnvironmentNames) {
  EXPECT_IN_ZONE("Europe/Berlin", localOffsets(), "60 120");
  EXPECT_IN_ZONE("America/New_York", localOffsets(), "-300 -240");
  EXPECT_IN_ZONE(":Asia/Kathmandu", localOffsets(), "345 345");
  EXPECT_IN_ZONE("/usr/share/zoneinfo/Australia/Sydney", localOffsets(), "660 600");
  EXPECT_IN_ZONE("UTC", localOffsets(), "0 0");
  EXPECT_IN_ZONE("", localOffsets(), "0 0");
  EXPECT_IN_ZONE("Nowhere/At_All", localOffsets(), "0 0");
}

TEST_F(LocalTimeZone, MayBeGivenAsARule) {
  EXPECT_IN_ZONE("XYZ-5:30", localOffsets(), "330 330");
  EXPECT_IN_ZONE("<+03>-3", localOffsets(), "180 180");
  EXPECT_IN_ZONE("CET-1CEST,M3.5.0,M10.5.0/3", localOffsets(), "60 120");
  EXPECT_IN_ZONE("AAA5BBB", localOffsets(), "-300 -240");
  EXPECT_IN_ZONE("AEST-10AEDT,M10.1.0,M4.1.0/3", localOffsets(), "660 600");
  EXPECT_IN_ZONE("LHST-10:30LHDT-11,M10.1.0,M4.1.0", localOffsets(), "660 630");
  EXPECT_IN_ZONE("AAA5BBB,J60,J300", localOffsets(), "-300 -300");
  EXPECT_IN_ZONE("AAA", localOffsets(), "0 0");
  EXPECT_IN_ZONE("AAA99999999999", localOffsets(), "0 0");
  // No further from Greenwich than a day.
  EXPECT_IN_ZONE("AAA24", localOffsets(), "-1440 -1440");
  EXPECT_IN_ZONE("AAA24:00:01", localOffsets(), "0 0");
  EXPECT_IN_ZONE("AAA597", localOffsets(), "0 0");
  EXPECT_IN_ZONE("AAA1BBB999", localOffsets(), "0 0");
}

std::string minutesAround(int64_t change) {
  const NSTimeZone& zone = *NSTimeZone::localTimeZone();
  return std::to_string(zone.secondsFromGMT({change - 1, 0}) / 60) + " " +
         std::to_string(zone.secondsFromGMT({change, 0}) / 60);
}

TEST_F(LocalTimeZone, ARuleChangesWhereItSays) {
  const int64_t start = lastSunday(2031, 3) * secondsPerDay + hour;
  const int64_t end = lastSunday(2031, 10) * secondsPerDay + hour;
  EXPECT_IN_ZONE("CET-1CEST,M3.5.0,M10.5.0/3", minutesAround(start), "60 120");
  EXPECT_IN_ZONE("CET-1CEST,M3.5.0,M10.5.0/3", minutesAround(end), "120 60");
}

TEST_F(LocalTimeZone, IsLookedUpOnce) {
  const auto work = [] {
    const std::string before = localOffsets();
    ::setenv("TZ", "America/New_York", 1);
    return before + " " + localOffsets();
  };
  EXPECT_IN_ZONE("Europe/Berlin", work(), "60 120 60 120");
}

}  // namespace
}  // namespace xquery
