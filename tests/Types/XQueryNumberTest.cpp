#include "Platform/Base/Counting.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Dates/ZoneTestSupport.h"
#include "Types/XQueryNumber.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>

namespace xquery {
namespace {

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double notANumber = std::numeric_limits<double>::quiet_NaN();

Ref<NSNumber> number(double value) {
  return NSNumber::numberWithDouble(value);
}
Ref<NSNumber> number(const char* decimal) {
  return NSDecimalNumber::decimalNumberWithString(NSStringView::ascii(decimal));
}

std::string text(const Ref<XQueryNumber>& value) {
  return value ? value->XQueryStringValue()->utf8() : "(null)";
}

// What the type makes of a number.
template <class Number>
std::string made(XQueryTypeID type, Number value) {
  return text(XQueryNumber::number(*number(value), type));
}

TEST(XQueryNumber, SharedValuesAreDoublesMadeOnce) {
  for (XQueryNumber* shared : {XQueryNumber::posInf(), XQueryNumber::negInf(), XQueryNumber::nan(),
                               XQueryNumber::zero(), XQueryNumber::one()}) {
    EXPECT_EQ(shared->typeID(), XQueryTypeDouble);
    EXPECT_TRUE(NSCounting::isImmortal(*shared));
  }
  EXPECT_EQ(XQueryNumber::nan(), XQueryNumber::nan());
  EXPECT_EQ(XQueryNumber::posInf()->doubleValue(), infinity);
  EXPECT_EQ(XQueryNumber::negInf()->doubleValue(), -infinity);
  EXPECT_TRUE(std::isnan(XQueryNumber::nan()->doubleValue()));
  EXPECT_TRUE(std::isnan(XQueryNumber::nan()->floatValue()));
  EXPECT_EQ(text(XQueryNumber::zero()), "0");
  EXPECT_EQ(text(XQueryNumber::one()), "1");
  EXPECT_EQ(text(XQueryNumber::nan()), "NaN");
  EXPECT_EQ(text(XQueryNumber::posInf()), "INF");
  EXPECT_EQ(text(XQueryNumber::negInf()), "-INF");
}

TEST(XQueryNumber, OnlyTheSharedNaNAndInfinitiesAreSpecial) {
  EXPECT_TRUE(XQueryNumber::isSpecial(XQueryNumber::nan()));
  EXPECT_TRUE(XQueryNumber::isSpecial(XQueryNumber::posInf()));
  EXPECT_TRUE(XQueryNumber::isSpecial(XQueryNumber::negInf()));
  EXPECT_FALSE(XQueryNumber::isSpecial(XQueryNumber::zero()));
  EXPECT_FALSE(XQueryNumber::isSpecial(XQueryNumber::one()));
  EXPECT_FALSE(XQueryNumber::isSpecial(nullptr));
}

TEST(XQueryNumber, PlatformConstructorsAnswerTheSharedSpecials) {
  EXPECT_EQ(XQueryNumber::numberWithDouble(infinity).get(), XQueryNumber::posInf());
  EXPECT_EQ(XQueryNumber::numberWithDouble(-infinity).get(), XQueryNumber::negInf());
  EXPECT_EQ(XQueryNumber::numberWithDouble(notANumber).get(), XQueryNumber::nan());
  EXPECT_EQ(XQueryNumber::numberWithDouble(-notANumber).get(), XQueryNumber::nan());
  EXPECT_EQ(XQueryNumber::numberWithFloat(static_cast<float>(infinity)).get(),
            XQueryNumber::posInf());
  EXPECT_EQ(XQueryNumber::numberWithFloat(static_cast<float>(-infinity)).get(),
            XQueryNumber::negInf());
  EXPECT_EQ(XQueryNumber::numberWithFloat(static_cast<float>(notANumber)).get(),
            XQueryNumber::nan());
}

TEST(XQueryNumber, AFreshDoubleOfAnInfinityIsNotSpecialButPrintsLikeOne) {
  const Ref<XQueryNumber> fresh = XQueryNumber::doubleWithNumber(*number(infinity));
  EXPECT_FALSE(XQueryNumber::isSpecial(fresh.get()));
  EXPECT_EQ(text(fresh), "INF");
  EXPECT_EQ(text(XQueryNumber::doubleWithNumber(*number(-infinity))), "-INF");
  EXPECT_EQ(text(XQueryNumber::doubleWithNumber(*number(notANumber))), "NaN");
}

TEST(XQueryNumber, PlatformConstructorsMakeDoublesOfAnyArgument) {
  const Ref<XQueryNumber> made[] = {
      XQueryNumber::numberWithLongLong(-5), XQueryNumber::numberWithUnsignedLongLong(UINT64_MAX),
      XQueryNumber::numberWithBool(true),   XQueryNumber::numberWithBool(false),
      XQueryNumber::numberWithFloat(0.1F),  XQueryNumber::numberWithDouble(2.5)};
  const char* printed[] = {"-5", "18446744073709551615", "1", "0", "0.1", "2.5"};
  for (size_t index = 0; index < std::size(made); ++index) {
    EXPECT_EQ(made[index]->typeID(), XQueryTypeDouble);
    EXPECT_EQ(text(made[index]), printed[index]);
    EXPECT_FALSE(made[index]->isBoolean());
  }
}

TEST(XQueryNumber, EachFactoryGivesItsType) {
  const Ref<NSNumber> one = number(1.0);
  EXPECT_EQ(XQueryNumber::doubleWithNumber(*one)->typeID(), 11);
  EXPECT_EQ(XQueryNumber::floatWithNumber(*one)->typeID(), 12);
  EXPECT_EQ(XQueryNumber::decimalWithNumber(*one)->typeID(), 13);
  EXPECT_EQ(XQueryNumber::integerWithNumber(*one)->typeID(), 42);
  EXPECT_EQ(XQueryNumber::nonNegativeIntegerWithNumber(*one)->typeID(), 43);
  EXPECT_EQ(XQueryNumber::positiveIntegerWithNumber(*one)->typeID(), 44);
  const Ref<NSNumber> minusOne = number(-1.0);
  EXPECT_EQ(XQueryNumber::nonPositiveIntegerWithNumber(*minusOne)->typeID(), 45);
  EXPECT_EQ(XQueryNumber::negativeIntegerWithNumber(*minusOne)->typeID(), 46);
  EXPECT_EQ(XQueryNumber::longWithNumber(*one)->typeID(), 47);
  EXPECT_EQ(XQueryNumber::intWithNumber(*one)->typeID(), 48);
  EXPECT_EQ(XQueryNumber::shortWithNumber(*one)->typeID(), 49);
  EXPECT_EQ(XQueryNumber::byteWithNumber(*one)->typeID(), 50);
  EXPECT_EQ(XQueryNumber::unsignedLongWithNumber(*one)->typeID(), 51);
  EXPECT_EQ(XQueryNumber::unsignedIntWithNumber(*one)->typeID(), 52);
  EXPECT_EQ(XQueryNumber::unsignedShortWithNumber(*one)->typeID(), 53);
  EXPECT_EQ(XQueryNumber::unsignedByteWithNumber(*one)->typeID(), 54);
}

TEST(XQueryNumber, TypesThatAreNotNumericMakeNothing) {
  for (const XQueryTypeID type : {XQueryTypeString, XQueryTypeBoolean, XQueryTypeAnyURI,
                                  XQueryTypeDate, XQueryTypeDuration, XQueryTypeNMTOKENS}) {
    EXPECT_FALSE(XQueryNumber::number(*number(1.0), type)) << type;
  }
}

TEST(XQueryNumber, DoublesKeepTheNumberAsItIs) {
  EXPECT_EQ(made(XQueryTypeDouble, "12345678901234567890.5"), "12345678901234567890.5");
  EXPECT_EQ(made(XQueryTypeDouble, 1e17), "1e+17");
  EXPECT_EQ(made(XQueryTypeDouble, 1e-5), "1e-05");
}

TEST(XQueryNumber, FloatsAreSinglePrecision) {
  EXPECT_EQ(made(XQueryTypeFloat, 1.0 / 3), "0.33333334");
  EXPECT_EQ(made(XQueryTypeFloat, 16777217.0), "16777216");
  EXPECT_EQ(made(XQueryTypeFloat, "0.1"), "0.1");
  EXPECT_EQ(XQueryNumber::floatWithNumber(*number(1e300)).get(), XQueryNumber::posInf());
  EXPECT_EQ(XQueryNumber::floatWithNumber(*number(-1e300)).get(), XQueryNumber::negInf());
  EXPECT_EQ(XQueryNumber::floatWithNumber(*number("1e400")).get(), XQueryNumber::posInf());
  EXPECT_EQ(XQueryNumber::floatWithNumber(*number("-1e400")).get(), XQueryNumber::negInf());
  EXPECT_EQ(made(XQueryTypeFloat, "none"), "NaN");
}

TEST(XQueryNumber, DecimalsAreNotTruncated) {
  EXPECT_EQ(made(XQueryTypeDecimal, "2.70"), "2.7");
  EXPECT_EQ(made(XQueryTypeDecimal, 0.1), "0.1");
  EXPECT_EQ(made(XQueryTypeDecimal, 1e20), "100000000000000000000");
}

TEST(XQueryNumber, IntegersAreTruncatedTowardZero) {
  EXPECT_EQ(made(XQueryTypeInteger, -2.7), "-2");
  EXPECT_EQ(made(XQueryTypeInteger, 2.7), "2");
  EXPECT_EQ(made(XQueryTypeInteger, -0.5), "0");
  EXPECT_EQ(made(XQueryTypeInteger, "123456789012345678901234567890.9"),
            "123456789012345678901234567890");
}

TEST(XQueryNumber, SignsAreCheckedOnTheUntruncatedValue) {
  struct Row {
    XQueryTypeID type;
    const char *minusOne, *minusHalf, *zero, *half, *one;
  };
  constexpr Row rows[] = {
      {XQueryTypeInteger, "-1", "0", "0", "0", "1"},
      {XQueryTypeNonNegativeInteger, "(null)", "(null)", "0", "0", "1"},
      {XQueryTypePositiveInteger, "(null)", "(null)", "(null)", "0", "1"},
      {XQueryTypeNonPositiveInteger, "-1", "0", "0", "(null)", "(null)"},
      {XQueryTypeNegativeInteger, "-1", "0", "(null)", "(null)", "(null)"},
  };
  for (const Row& row : rows) {
    EXPECT_EQ(made(row.type, -1.0), row.minusOne) << row.type;
    EXPECT_EQ(made(row.type, -0.5), row.minusHalf) << row.type;
    EXPECT_EQ(made(row.type, 0.0), row.zero) << row.type;
    EXPECT_EQ(made(row.type, 0.5), row.half) << row.type;
    EXPECT_EQ(made(row.type, 1.0), row.one) << row.type;
  }
  EXPECT_EQ(made(XQueryTypePositiveInteger, 0.3), "0");
  EXPECT_EQ(made(XQueryTypePositiveInteger, "1e-400"), "0");  // positive, though 0 as a double
  EXPECT_EQ(made(XQueryTypeNonNegativeInteger, "1e30"), "1" + std::string(30, '0'));
}

TEST(XQueryNumber, MachineWidthsCheckTheLowerBoundAsGivenAndTheUpperOneTruncated) {
  struct Row {
    XQueryTypeID type;
    const char* value;
    const char* expected;
  };
  constexpr Row rows[] = {
      {XQueryTypeShort, "32767.9", "32767"},
      {XQueryTypeShort, "32768", "(null)"},
      {XQueryTypeShort, "-32768", "-32768"},
      {XQueryTypeShort, "-32768.5", "(null)"},
      {XQueryTypeShort, "-32769", "(null)"},
      {XQueryTypeByte, "127", "127"},
      {XQueryTypeByte, "127.5", "127"},
      {XQueryTypeByte, "128", "(null)"},
      {XQueryTypeByte, "-128", "-128"},
      {XQueryTypeByte, "-128.1", "(null)"},
      {XQueryTypeUnsignedShort, "65535.9", "65535"},
      {XQueryTypeUnsignedShort, "65536", "(null)"},
      {XQueryTypeUnsignedShort, "0", "0"},
      {XQueryTypeUnsignedShort, "-0.5", "(null)"},
      {XQueryTypeUnsignedByte, "255.5", "255"},
      {XQueryTypeUnsignedByte, "256", "(null)"},
      {XQueryTypeUnsignedByte, "-1", "(null)"},
      {XQueryTypeLong, "9223372036854775807", "9223372036854775807"},
      {XQueryTypeLong, "9223372036854775808", "9223372036854775807"},
      {XQueryTypeLong, "9223372036854778000", "(null)"},
      {XQueryTypeLong, "-9223372036854775808", "-9223372036854775808"},
      {XQueryTypeLong, "-9223372036854778000", "(null)"},
      {XQueryTypeLong, "1e400", "(null)"},
      {XQueryTypeInt, "9223372036854775808", "9223372036854775807"},
      {XQueryTypeInt, "3000000000", "3000000000"},
      {XQueryTypeInt, "-9223372036854775808", "-9223372036854775808"},
      {XQueryTypeInt, "9223372036854778000", "(null)"},
      {XQueryTypeInt, "-9223372036854778000", "(null)"},
      {XQueryTypeUnsignedLong, "18446744073709551615", "18446744073709551615"},
      {XQueryTypeUnsignedLong, "18446744073709551616", "18446744073709551615"},
      {XQueryTypeUnsignedLong, "18446744073709556000", "(null)"},
      {XQueryTypeUnsignedLong, "0", "0"},
      {XQueryTypeUnsignedLong, "-1", "(null)"},
      {XQueryTypeUnsignedInt, "18446744073709551616", "18446744073709551615"},
      {XQueryTypeUnsignedInt, "5000000000", "5000000000"},
      {XQueryTypeUnsignedInt, "18446744073709556000", "(null)"},
      {XQueryTypeUnsignedInt, "-1", "(null)"},
  };
  for (const Row& row : rows) {
    EXPECT_EQ(made(row.type, row.value), row.expected) << row.type << " of " << row.value;
  }
}

TEST(XQueryNumber, MachineWidthsAreStoredAsMachineIntegers) {
  for (XQueryTypeID type = XQueryTypeLong; type <= XQueryTypeByte; ++type) {
    EXPECT_EQ(XQueryNumber::number(*number(7.0), type)->storage(), NSNumber::Storage::Int64);
  }
  for (XQueryTypeID type = XQueryTypeUnsignedLong; type <= XQueryTypeUnsignedByte; ++type) {
    EXPECT_EQ(XQueryNumber::number(*number(7.0), type)->storage(), NSNumber::Storage::UInt64);
  }
  for (XQueryTypeID type = XQueryTypeInteger; type <= XQueryTypeNonNegativeInteger; ++type) {
    EXPECT_EQ(XQueryNumber::number(*number(7.0), type)->storage(), NSNumber::Storage::Decimal);
  }
}

TEST(XQueryNumber, AKindOfTheTypeIsKeptUnchecked) {
  const Ref<XQueryNumber> negative = XQueryNumber::negativeIntegerWithNumber(*number(-5.0));
  const Ref<XQueryNumber> kept = XQueryNumber::nonNegativeIntegerWithNumber(*negative);
  ASSERT_TRUE(kept);
  EXPECT_EQ(kept->typeID(), XQueryTypeNonNegativeInteger);
  EXPECT_EQ(text(kept), "-5");
  EXPECT_EQ(text(XQueryNumber::decimalWithNumber(*negative)), "-5");
  const Ref<XQueryNumber> integer = XQueryNumber::integerWithInt64(300);
  EXPECT_FALSE(XQueryNumber::byteWithNumber(*integer));
}

TEST(XQueryNumber, NotFiniteNumbersAsDecimalsOrIntegersAreTheSharedValues) {
  EXPECT_EQ(XQueryNumber::integerWithNumber(*number(notANumber)).get(), XQueryNumber::nan());
  EXPECT_EQ(XQueryNumber::decimalWithNumber(*number(infinity)).get(), XQueryNumber::posInf());
  EXPECT_EQ(XQueryNumber::integerWithNumber(*number(-infinity)).get(), XQueryNumber::negInf());
  EXPECT_EQ(XQueryNumber::numberWithDecimal(NSDecimal::notANumber()).get(), XQueryNumber::nan());
  EXPECT_EQ(XQueryNumber::integerWithDecimal(NSDecimal::notANumber()).get(), XQueryNumber::nan());
  for (XQueryTypeID type = XQueryTypeNonNegativeInteger; type <= XQueryTypeUnsignedByte; ++type) {
    for (const double value : {notANumber, infinity, -infinity}) {
      EXPECT_EQ(made(type, value), "(null)") << type << " of " << value;
    }
  }
}

TEST(XQueryNumber, DirectConstructorsGiveTheirTypes) {
  EXPECT_EQ(XQueryNumber::numberWithDecimal(NSDecimal(3))->typeID(), XQueryTypeDecimal);
  EXPECT_EQ(XQueryNumber::integerWithInt64(INT64_MIN)->typeID(), XQueryTypeInteger);
  EXPECT_EQ(text(XQueryNumber::integerWithInt64(INT64_MIN)), "-9223372036854775808");
  EXPECT_EQ(XQueryNumber::integerWithDecimal(NSDecimal(3))->typeID(), XQueryTypeInteger);
}

TEST(XQueryNumber, SetTypeOverwritesTheTypeUnchecked) {
  const Ref<XQueryNumber> value = XQueryNumber::numberWithLongLong(14);
  value->setType(XQueryTypeYearMonthDuration);
  EXPECT_EQ(value->typeID(), XQueryTypeYearMonthDuration);
  EXPECT_EQ(text(value), "P1Y2M");
}

TEST(XQueryNumber, YearMonthDurationsPrintCanonically) {
  struct Row {
    int64_t months;
    const char* printed;
  };
  constexpr Row rows[] = {
      {14, "P1Y2M"},   {-12, "-P1Y"}, {5, "P5M"},      {0, "P0M"},
      {-5, "-P5M"},    {11, "P11M"},  {12, "P1Y"},     {13, "P1Y1M"},
      {-14, "-P1Y2M"}, {24, "P2Y"},   {1200, "P100Y"}, {INT64_MIN, "-P768614336404564650Y8M"},
  };
  for (const Row& row : rows) {
    const Ref<XQueryNumber> value = XQueryNumber::yearMonthDurationWithMonths(row.months);
    EXPECT_EQ(value->typeID(), XQueryTypeYearMonthDuration);
    EXPECT_EQ(text(value), row.printed);
  }
}

TEST(XQueryNumber, DayTimeDurationsPrintCanonically) {
  struct Row {
    double seconds;
    const char* printed;
  };
  constexpr Row rows[] = {
      {90061.5, "P1DT1H1M1.5S"},
      {-60, "-PT1M"},
      {0, "PT0S"},
      {3600, "PT1H"},
      {86400, "P1D"},
      {86460, "P1DT1M"},
      {86401, "P1DT1S"},
      {1, "PT1S"},
      {0.25, "PT0.25S"},
      {-0.5, "-PT0.5S"},
      {7325, "PT2H2M5S"},
      {3605, "PT1H5S"},
      {-90061, "-P1DT1H1M1S"},
      {864000, "P10D"},
      {59.5, "PT59.5S"},
  };
  for (const Row& row : rows) {
    const Ref<XQueryNumber> value = XQueryNumber::dayTimeDurationWithSeconds(row.seconds);
    EXPECT_EQ(value->typeID(), XQueryTypeDayTimeDuration);
    EXPECT_EQ(text(value), row.printed);
  }
}

TEST(XQueryNumber, DurationsBeyondEveryCalendarStillPrint) {
  EXPECT_FALSE(text(XQueryNumber::dayTimeDurationWithSeconds(1e300)).empty());
  EXPECT_FALSE(text(XQueryNumber::dayTimeDurationWithSeconds(infinity)).empty());
  EXPECT_FALSE(text(XQueryNumber::dayTimeDurationWithSeconds(notANumber)).empty());
}

TEST(XQueryNumber, YearMonthDurationsParse) {
  struct Row {
    const char* text;
    int64_t months;
  };
  constexpr Row rows[] = {
      {"P1Y", 12},  {"P2M", 2},   {"P1Y2M", 14}, {"-P1Y", -12},
      {"-P3M", -3}, {"P0Y", 0},   {"P0M", 0},    {"P1Y0M", 12},
      {"P0Y5M", 5}, {"P13M", 13}, {"P001Y", 12}, {"P768614336404564650Y7M", INT64_MAX},
  };
  for (const Row& row : rows) {
    const Ref<XQueryNumber> value =
        XQueryNumber::yearMonthDurationWithString(NSStringView::ascii(row.text));
    ASSERT_TRUE(value) << row.text;
    EXPECT_EQ(value->typeID(), XQueryTypeYearMonthDuration);
    EXPECT_EQ(value->longLongValue(), row.months) << row.text;
  }
}

TEST(XQueryNumber, YearMonthDurationsRejectEveryDeviation) {
  for (const char* bad : {"",
                          "P",
                          "-P",
                          "1Y",
                          "-",
                          "P-1Y",
                          "P1Y2",
                          "P1",
                          "PY",
                          "PM",
                          "P1Y-2M",
                          "P1M2Y",
                          "P1Y2M3",
                          "P1Y2M ",
                          " P1Y",
                          "P 1Y",
                          "P+1Y",
                          "+P1Y",
                          "--P1Y",
                          "p1Y",
                          "P1y",
                          "P1D",
                          "PT1M",
                          "P1YT1H",
                          "P1.5Y",
                          "P1YM",
                          "P1Y2Y",
                          "P99999999999999999999Y",
                          "P9223372036854775807Y",
                          "P768614336404564650Y8M"}) {
    EXPECT_FALSE(XQueryNumber::yearMonthDurationWithString(NSStringView::ascii(bad))) << bad;
  }
}

TEST(XQueryNumber, DayTimeDurationsParse) {
  struct Row {
    const char* text;
    double seconds;
  };
  constexpr Row rows[] = {
      {"P1DT2H", 93600},
      {"PT30M", 1800},
      {"P1D", 86400},
      {"-PT0.5S", -0.5},
      {"PT1H", 3600},
      {"PT5S", 5},
      {"PT1H2M3S", 3723},
      {"PT1H3S", 3603},
      {"PT2M3S", 123},
      {"P1DT1H1M1.5S", 90061.5},
      {"P1DT3S", 86403},
      {"P0D", 0},
      {"PT0S", 0},
      {"-P1D", -86400},
      {"PT1.05S", 1.5},  // the fraction is read as an integer
      {"PT1.50S", 1.5},
      {"PT1.0S", 1},
      {"PT1.000S", 1},
      {"PT1.0001S", 1.1},
      {"PT1H1.5S", 3601.5},
      {"PT1M1.5S", 61.5},
      {"PT90M", 5400},
      {"P5T1H", 3600},  // days without their letter are skipped
      {"PT1.123456789012345678901234567890S", 1.1234567890123457},
  };
  for (const Row& row : rows) {
    const Ref<XQueryNumber> value =
        XQueryNumber::dayTimeDurationWithString(NSStringView::ascii(row.text));
    ASSERT_TRUE(value) << row.text;
    EXPECT_EQ(value->typeID(), XQueryTypeDayTimeDuration);
    EXPECT_EQ(value->doubleValue(), row.seconds) << row.text;
  }
}

TEST(XQueryNumber, DayTimeDurationsRejectEveryDeviation) {
  for (const char* bad : {"",       "P",      "PT",       "-PT",     "PT5",
                          "P1",     "P1DT",   "P1D2H",    "P1DT5",   "1D",
                          "PT-5S",  "P-1D",   "PT+5S",    "P+1D",    "+P1D",
                          " P1D",   "P1D ",   "PT 5S",    "PT5s",    "pT5S",
                          "Pt5S",   "P1d",    "PTH",      "PTS",     "PT1H2H",
                          "PT1M1H", "PT1S1M", "PT1S1S",   "PT1.S",   "PT.5S",
                          "PT1.5",  "PT1.5M", "PT1.5S1S", "PT1.-5S", "PT1H30",
                          "P1Y",    "P1M",    "P1Y1D",    "--P1D",   "PT99999999999999999999S",
                          "PT1SX"}) {
    EXPECT_FALSE(XQueryNumber::dayTimeDurationWithString(NSStringView::ascii(bad))) << bad;
  }
}

TEST(XQueryNumber, ReadingMillionsOfDigitsCountsAsWork) {
  constexpr int many = 1000000;
  const std::string sevens(many, '7');
  const std::string zeros(many, '0');
  for (const std::string& text :
       {"P" + sevens + "Y", "P" + sevens + "M", "P" + zeros + "1Y", "P" + sevens + "D",
        "PT" + zeros + "1S", "PT1." + sevens + "S", "PT1." + zeros + "1S"}) {
    const int64_t before = workMeter.stepsLeft;
    static_cast<void>(XQueryNumber::yearMonthDurationWithString(NSStringView::ascii(text)));
    static_cast<void>(XQueryNumber::dayTimeDurationWithString(NSStringView::ascii(text)));
    EXPECT_GE(before - workMeter.stepsLeft, many / WorkPacer::turnsPerStep) << text.substr(0, 9);
  }
}

TEST(XQueryNumber, PrintedDurationsParseToTheSameValue) {
  for (int64_t months = -200; months <= 200; ++months) {
    const Ref<XQueryNumber> value = XQueryNumber::yearMonthDurationWithMonths(months);
    const Ref<XQueryNumber> read =
        XQueryNumber::yearMonthDurationWithString(value->XQueryStringValue()->view());
    ASSERT_TRUE(read);
    EXPECT_EQ(read->longLongValue(), months);
  }
  for (int64_t step = -3000; step <= 3000; ++step) {
    const auto seconds = static_cast<double>(step * 977);
    const Ref<XQueryNumber> value = XQueryNumber::dayTimeDurationWithSeconds(seconds);
    const Ref<XQueryNumber> read =
        XQueryNumber::dayTimeDurationWithString(value->XQueryStringValue()->view());
    ASSERT_TRUE(read);
    EXPECT_EQ(read->doubleValue(), seconds);
  }
}

class ImplicitTimeZone : public InZoneDeathTest {};

TEST_F(ImplicitTimeZone, IsTheLocalOffset) {
  const auto printed = [] {
    const Ref<XQueryNumber> zone = XQueryNumber::implicitTimeZone();
    return std::to_string(zone->typeID()) + " " + zone->XQueryStringValue()->utf8();
  };
  EXPECT_IN_ZONE("XYZ-5:30", printed(), "29 PT5H30M");
  EXPECT_IN_ZONE("America/Bogota", printed(), "29 -PT5H");
  EXPECT_IN_ZONE("UTC", printed(), "29 PT0S");
}

}  // namespace
}  // namespace xquery
