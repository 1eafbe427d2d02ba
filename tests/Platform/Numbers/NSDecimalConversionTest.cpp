#include "Platform/Numbers/DecimalTesting.h"
#include "Platform/Numbers/NumberText.h"

#include <gtest/gtest.h>

#include <limits>
#include <random>
#include <string>

namespace xquery {
namespace {

using namespace decimaltest;

double readAsDouble(const std::string& text) {
  double value = 0;
  EXPECT_TRUE(scanDouble(NSStringView::ascii(text), value));
  return value;
}

TEST(Decimal, ScansAndPrintsPlainly) {
  struct Row {
    const char* text;
    const char* printed;
  };
  constexpr Row rows[] = {
      {"0", "0"},
      {"-0", "0"},
      {"0.000", "0"},
      {"00012", "12"},
      {"1.50", "1.5"},
      {"-1.50", "-1.5"},
      {"+7", "7"},
      {".5", "0.5"},
      {"5.", "5"},
      {"100", "100"},
      {"1e2", "100"},
      {"1.5E+1", "15"},
      {"15e-1", "1.5"},
      {"1e-3", "0.001"},
      {"-12e-5", "-0.00012"},
      {"9223372036854775807", "9223372036854775807"},
      {"9223372036854775808", "9223372036854775808"},
      {"-9223372036854775808", "-9223372036854775808"},
      {"-9223372036854775809", "-9223372036854775809"},
      {"123456789012345678901234567890.123", "123456789012345678901234567890.123"},
      {"0.00000000000000000000000001", "0.00000000000000000000000001"},
      {"0e999999999", "0"},
      {"1e30", "1000000000000000000000000000000"},
  };
  for (const Row& row : rows) EXPECT_EQ(decimal(row.text).toString(), row.printed) << row.text;
}

TEST(Decimal, ScanTakesTheLongestPrefixAfterWhiteSpace) {
  EXPECT_EQ(decimal(" \t\r\n12abc").toString(), "12");
  EXPECT_EQ(decimal("1.5.3").toString(), "1.5");
  EXPECT_EQ(decimal("1e").toString(), "1");
  EXPECT_EQ(decimal("1e+").toString(), "1");
  EXPECT_EQ(decimal("1e5e").toString(), "100000");
  EXPECT_EQ(decimal("0x10").toString(), "0");
  EXPECT_EQ(decimal("1-2").toString(), "1");
}

TEST(Decimal, ScanFindsNoNumberWhereThereIsNone) {
  for (const char* text : {"", " ", "-", "+", ".", "-.", "e5", "abc", "inf", "INF", "nan", "NaN",
                           "--1", "+-1", "- 1", "\v1"}) {
    NSDecimal value(42);
    EXPECT_FALSE(NSDecimal::scan(NSStringView::ascii(text), value)) << text;
    EXPECT_EQ(value.toString(), "42");
  }
}

TEST(Decimal, ScanReadsWideTextAlike) {
  const std::u16string text = u"  -12.5e1\u00E9";
  NSDecimal value;
  ASSERT_TRUE(NSDecimal::scan({text.data(), static_cast<uint32_t>(text.size())}, value));
  EXPECT_EQ(value.toString(), "-125");
}

TEST(Decimal, ANumberOfTooManyDigitsIsNoNumber) {
  NSDecimal value;
  const auto limit = std::to_string(NSDecimal::maximumDigits);
  const auto inside = std::to_string(NSDecimal::maximumDigits - 1);
  EXPECT_TRUE(NSDecimal::scan(NSStringView::ascii("1e" + inside), value));
  EXPECT_FALSE(NSDecimal::scan(NSStringView::ascii("1e" + limit), value));
  EXPECT_TRUE(NSDecimal::scan(NSStringView::ascii("1e-" + limit), value));
  EXPECT_FALSE(NSDecimal::scan(NSStringView::ascii("0.1e-" + limit), value));
  for (const char* text : {"1e999999999", "1e-999999999", "1e99999999999999999999999",
                           "-1e-99999999999999999999999"}) {
    EXPECT_FALSE(NSDecimal::scan(NSStringView::ascii(text), value)) << text;
  }
  const std::string digits(static_cast<size_t>(NSDecimal::maximumDigits), '9');
  EXPECT_EQ(decimal(digits).toString(), digits);
  EXPECT_FALSE(NSDecimal::scan(NSStringView::ascii(digits + "9"), value));
}

TEST(Decimal, ConversionsToMachineIntegersTruncateAndSaturate) {
  EXPECT_EQ(decimal("2.9").int64Value(), 2);
  EXPECT_EQ(decimal("-2.9").int64Value(), -2);
  EXPECT_EQ(decimal("1e30").int64Value(), INT64_MAX);
  EXPECT_EQ(decimal("-1e30").int64Value(), INT64_MIN);
  EXPECT_EQ(decimal("9223372036854775807.9").int64Value(), INT64_MAX);
  EXPECT_EQ(decimal("-2.9").uint64Value(), 0U);
  EXPECT_EQ(decimal("18446744073709551615.5").uint64Value(), UINT64_MAX);
  EXPECT_EQ(decimal("18446744073709551614").uint64Value(), UINT64_MAX - 1);
  EXPECT_EQ(decimal("1e30").uint64Value(), UINT64_MAX);
  EXPECT_EQ(NSDecimal::fromUnsigned(UINT64_MAX).toString(), "18446744073709551615");
  EXPECT_EQ(NSDecimal::fromUnsigned(5).toString(), "5");
}

TEST(Decimal, FromADoubleTakesItsShortestDigits) {
  EXPECT_EQ(NSDecimal::fromDouble(0.1).toString(), "0.1");
  EXPECT_EQ(NSDecimal::fromDouble(-1.5).toString(), "-1.5");
  EXPECT_EQ(NSDecimal::fromDouble(1e22).toString(), "10000000000000000000000");
  EXPECT_EQ(NSDecimal::fromDouble(123456789012345680000.0).toString(), "123456789012345680000");
  EXPECT_EQ(NSDecimal::fromDouble(9007199254740993.0).toString(), "9007199254740992");
  EXPECT_EQ(NSDecimal::fromDouble(1e-7).toString(), "0.0000001");
  EXPECT_EQ(NSDecimal::fromDouble(-0.0).toString(), "0");
  EXPECT_EQ(NSDecimal::fromDouble(std::numeric_limits<double>::infinity()).toString(), "0");
  EXPECT_EQ(NSDecimal::fromDouble(std::numeric_limits<double>::quiet_NaN()).toString(), "0");
}

TEST(Decimal, DoubleThereAndBackIsTheSameDouble) {
  std::mt19937_64 random(5);
  for (int round = 0; round < 20000; ++round) {
    const uint64_t bits = random();
    double value = 0;
    std::memcpy(&value, &bits, sizeof value);
    if (!std::isfinite(value)) continue;
    ASSERT_EQ(NSDecimal::fromDouble(value).doubleValue(), value);
  }
  for (const double value : {std::numeric_limits<double>::max(), 5e-324, 2.2250738585072014e-308,
                             0.1, 1.0 / 3, 1e22, 1e23, 123456.789}) {
    EXPECT_EQ(NSDecimal::fromDouble(value).doubleValue(), value);
  }
}

TEST(Decimal, DoubleValueIsTheNearest) {
  EXPECT_EQ(decimal("0.1").doubleValue(), 0.1);
  EXPECT_EQ(decimal("9007199254740993").doubleValue(), 9007199254740992.0);
  EXPECT_EQ(decimal("9007199254740993.1").doubleValue(), 9007199254740994.0);
  EXPECT_EQ(decimal("1e400").doubleValue(), std::numeric_limits<double>::infinity());
  EXPECT_EQ(decimal("-1e400").doubleValue(), -std::numeric_limits<double>::infinity());
  EXPECT_EQ(decimal("1e-400").doubleValue(), 0.0);
}

TEST(Decimal, ALargeOneHasTheDoubleThatItsTextHas) {
  std::mt19937_64 random(5);
  for (int round = 0; round < 500; ++round) {
    std::string text = round % 2 ? "-" : "";
    text += randomDigits(random, 1 + random() % 400) + "." + randomDigits(random, random() % 400);
    EXPECT_EQ(decimal(text).doubleValue(), readAsDouble(text)) << text;
  }
  // At and next to the point halfway between two doubles, where the first digits do not tell.
  const std::string zeros(600, '0');
  EXPECT_EQ(decimal("9007199254740993").doubleValue(), 9007199254740992.0);
  EXPECT_EQ(decimal("9007199254740993." + zeros + "1").doubleValue(), 9007199254740994.0);
  EXPECT_EQ(decimal("9007199254740992." + std::string(600, '9')).doubleValue(), 9007199254740992.0);
  EXPECT_EQ(decimal("-9007199254740993." + zeros + "1").doubleValue(), -9007199254740994.0);
  EXPECT_EQ(decimal("1" + zeros).doubleValue(), std::numeric_limits<double>::infinity());
  EXPECT_EQ(decimal("0." + zeros + "1").doubleValue(), 0);
}

}  // namespace
}  // namespace xquery
