#include "Platform/Dates/GregorianCalendar.h"
#include "xquery/Date.h"

#include <gtest/gtest.h>

#include <cmath>
#include <ctime>
#include <limits>
#include <random>

namespace xquery {
namespace {

NSGregorianDate fields(int32_t year, int month, int day, int hour = 0, int minute = 0,
                       double second = 0) {
  return {year,
          static_cast<int8_t>(month),
          static_cast<int8_t>(day),
          static_cast<int8_t>(hour),
          static_cast<int8_t>(minute),
          second};
}

bool same(const NSGregorianDate& a, const NSGregorianDate& b) {
  return a.year == b.year && a.month == b.month && a.day == b.day && a.hour == b.hour &&
         a.minute == b.minute && a.second == b.second;
}

TEST(NSInstant, SplitsAnIntervalIntoSecondsAndNanoseconds) {
  EXPECT_EQ(NSInstant::fromTimeInterval(1.5), (NSInstant{1, 500000000}));
  EXPECT_EQ(NSInstant::fromTimeInterval(-1.5), (NSInstant{-2, 500000000}));
  EXPECT_EQ(NSInstant::fromTimeInterval(-0.0), (NSInstant{0, 0}));
  EXPECT_EQ(NSInstant::fromTimeInterval(0.9999999999), (NSInstant{1, 0}));
  EXPECT_EQ(NSInstant::fromTimeInterval(94694405.1), (NSInstant{94694405, 99999994}));
}

TEST(NSInstant, AnIntervalBeyondTheYearsIsTheirEnd) {
  const double infinity = std::numeric_limits<double>::infinity();
  const NSTimeZone& gmt = *NSTimeZone::GMT();
  for (const double far : {1e17, 1e300, infinity}) {
    const NSInstant end = NSInstant::fromTimeInterval(far);
    EXPECT_TRUE(same(NSGregorianDateForInstant(end, gmt), fields(2147483647, 12, 31, 23, 59, 59)));
    const NSInstant start = NSInstant::fromTimeInterval(-far);
    EXPECT_TRUE(same(NSGregorianDateForInstant(start, gmt), fields(-2147483647 - 1, 1, 1)));
  }
  EXPECT_EQ(NSInstant::fromTimeInterval(std::nan("")), (NSInstant{0, 0}));
}

TEST(NSInstant, AddsSecondsAsLongAsTheYearsReach) {
  const NSInstant start{10, 900000000};
  EXPECT_EQ(start.adding(0.2), (NSInstant{11, 100000000}));
  EXPECT_EQ(start.adding(-11), (NSInstant{-1, 900000000}));
  EXPECT_FALSE(start.adding(1e17));
  EXPECT_FALSE(start.adding(-1e17));
  EXPECT_FALSE(start.adding(1e300));
  EXPECT_FALSE(start.adding(std::numeric_limits<double>::infinity()));
  EXPECT_FALSE(start.adding(std::nan("")));
  const NSInstant end = NSInstant::fromTimeInterval(1e300);
  EXPECT_TRUE(end.adding(0));
  EXPECT_FALSE(end.adding(1));
  const NSInstant first = NSInstant::fromTimeInterval(-1e300);
  EXPECT_FALSE(first.adding(-0.5));
  EXPECT_EQ(first.adding(static_cast<double>(end.seconds - first.seconds + 1)), std::nullopt);
}

TEST(NSInstant, ADistanceKeepsItsFraction) {
  const NSInstant a{1000000000, 100000000};
  const NSInstant b{1000000000, 0};
  EXPECT_EQ(a.secondsSince(b), 0.1);
  EXPECT_EQ(b.secondsSince(a), -0.1);
  EXPECT_EQ((NSInstant{5, 0}.secondsSince({2, 500000000})), 2.5);
}

TEST(NSInstant, NowIsTheSystemsTime) {
  // Not std::time, whose clock lags behind by some milliseconds.
  timespec before = {};
  timespec after = {};
  ::clock_gettime(CLOCK_REALTIME, &before);
  const NSInstant now = NSInstant::now();
  ::clock_gettime(CLOCK_REALTIME, &after);
  EXPECT_GE(now.seconds + 978307200, before.tv_sec);
  EXPECT_LE(now.seconds + 978307200, after.tv_sec);
  EXPECT_EQ(now.nanoseconds % 1000, 0);
}

TEST(NSInstant, OrdersByTime) {
  EXPECT_LT((NSInstant{1, 999999999}), (NSInstant{2, 0}));
  EXPECT_LT((NSInstant{-2, 0}), (NSInstant{-2, 1}));
}

TEST(GregorianFields, OfAnInstantAreThoseOfTheZonesClock) {
  const NSInstant instant =
      NSInstantForGregorianDate(fields(2004, 2, 29, 12, 30, 45.5), *NSTimeZone::GMT());
  EXPECT_EQ(instant, (NSInstant{dayNumber(2004, 2, 29) * 86400 + 45045, 500000000}));
  const auto east = NSTimeZone::timeZoneForSecondsFromGMT(14 * 3600);
  EXPECT_TRUE(same(NSGregorianDateForInstant(instant, *east), fields(2004, 3, 1, 2, 30, 45.5)));
  const auto west = NSTimeZone::timeZoneForSecondsFromGMT(-13 * 3600);
  EXPECT_TRUE(same(NSGregorianDateForInstant(instant, *west), fields(2004, 2, 28, 23, 30, 45.5)));
}

TEST(GregorianFields, ReadBackAsTheyWereInAnyYearAndZone) {
  std::mt19937_64 random(11);
  const auto below = [&random](int64_t bound) {
    return static_cast<int>(random() % static_cast<uint64_t>(bound));
  };
  for (int round = 0; round < 20000; ++round) {
    const auto year = static_cast<int32_t>(random()) / (round % 2 ? 1 : 1 << 20);
    const int month = below(12) + 1;
    const NSGregorianDate date = fields(year, month, below(daysInMonth(year, month)) + 1, below(24),
                                        below(60), below(60000) / 1000.0);
    const auto zone = NSTimeZone::timeZoneForSecondsFromGMT(below(200000) - 100000);
    const NSInstant instant = NSInstantForGregorianDate(date, *zone);
    ASSERT_TRUE(same(NSGregorianDateForInstant(instant, *zone), date)) << year << "-" << month;
  }
}

TEST(GregorianFields, SecondsAreCarriedOver) {
  const NSTimeZone& gmt = *NSTimeZone::GMT();
  const NSInstant midnight = NSInstantForGregorianDate(fields(2004, 12, 31, 23, 59, 60), gmt);
  EXPECT_TRUE(same(NSGregorianDateForInstant(midnight, gmt), fields(2005, 1, 1)));
}

TEST(GregorianFields, TheSecondIsTheDoubleNearestToItsDigits) {
  const NSTimeZone& gmt = *NSTimeZone::GMT();
  for (const double second : {5.1, 0.1, 59.999999, 12.345678, 1e-9}) {
    const NSInstant instant = NSInstantForGregorianDate(fields(2024, 7, 1, 0, 0, second), gmt);
    EXPECT_EQ(NSGregorianDateForInstant(instant, gmt).second, second);
  }
}

TEST(NSDate, IsAnInstant) {
  const Ref<NSDate> date = NSDate::dateWithTimeIntervalSinceReferenceDate(-0.25);
  EXPECT_TRUE(isa<NSDate>(date.get()));
  EXPECT_EQ(date->timeIntervalSinceReferenceDate(), -0.25);
  EXPECT_TRUE(date->isEqualToDate(*NSDate::dateWithTimeIntervalSinceReferenceDate(-0.25)));
  EXPECT_EQ(date->hash(), NSDate::dateWithTimeIntervalSinceReferenceDate(-0.25)->hash());
  EXPECT_FALSE(date->isEqualToDate(*NSDate::dateWithTimeIntervalSinceReferenceDate(0.25)));
  EXPECT_NEAR(NSDate::date()->timeIntervalSinceReferenceDate(), NSInstant::now().timeInterval(),
              60);
}

}  // namespace
}  // namespace xquery
