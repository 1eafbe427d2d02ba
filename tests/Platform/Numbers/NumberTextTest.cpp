#include "Platform/Numbers/NumberText.h"
#include "xquery/Number.h"

#include <gtest/gtest.h>

#include <clocale>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <random>
#include <string>

namespace xquery {
namespace {

constexpr double infinity = std::numeric_limits<double>::infinity();

TEST(NumberText, DoublesPrintPlainlyForExponentsFromMinus4To16) {
  struct Row {
    double value;
    const char* text;
  };
  const Row rows[] = {
      {0, "0"},
      {-0.0, "-0"},
      {1, "1"},
      {-1, "-1"},
      {100, "100"},
      {0.5, "0.5"},
      {0.1, "0.1"},
      {1.0 / 3, "0.3333333333333333"},
      {123456.789, "123456.789"},
      {0.0001, "0.0001"},
      {0.00012, "0.00012"},
      {0.00001, "1e-05"},
      {0.000012, "1.2e-05"},
      {-0.000012, "-1.2e-05"},
      {1e15, "1000000000000000"},
      {1e16, "10000000000000000"},
      {9e16, "90000000000000000"},
      {90000000000000016.0, "90000000000000020"},  // its shortest digits
      {1e17, "1e+17"},
      {1.5e17, "1.5e+17"},
      {1e100, "1e+100"},
      {1e-100, "1e-100"},
      {1.7976931348623157e308, "1.7976931348623157e+308"},
      {5e-324, "5e-324"},
      {12345678901234567.0, "12345678901234568"},
      {-1234.5, "-1234.5"},
  };
  for (const Row& row : rows) EXPECT_EQ(formatDouble(row.value), row.text);
}

TEST(NumberText, FloatsPrintInSinglePrecision) {
  EXPECT_EQ(formatFloat(0.1F), "0.1");
  EXPECT_EQ(formatFloat(16777216.0F), "16777216");
  EXPECT_EQ(formatFloat(1.0F / 3), "0.33333334");
  EXPECT_EQ(formatFloat(3.4028235e38F), "3.4028235e+38");
  EXPECT_EQ(formatFloat(1e-5F), "1e-05");
  EXPECT_EQ(formatFloat(1e17F), "1e+17");
}

TEST(NumberText, PrintedDoublesReadBackToTheSameValue) {
  std::mt19937_64 random(1);
  for (int round = 0; round < 50000; ++round) {
    const uint64_t bits = random();
    double value = 0;
    std::memcpy(&value, &bits, sizeof value);
    if (!std::isfinite(value)) continue;
    double read = 0;
    ASSERT_TRUE(scanDouble(NSStringView::ascii(formatDouble(value)), read));
    ASSERT_EQ(read, value);
    const double modest = static_cast<double>(static_cast<int64_t>(bits >> 20)) / 1024;
    ASSERT_TRUE(scanDouble(NSStringView::ascii(formatDouble(modest)), read));
    ASSERT_EQ(read, modest);
  }
}

TEST(NumberText, ScanTakesTheLongestPrefix) {
  struct Row {
    const char* text;
    double value;
  };
  constexpr Row rows[] = {
      {"12abc", 12},  {" \t\n\r-3.5", -3.5},
      {"+4", 4},      {".5", 0.5},
      {"5.", 5},      {"-.25", -0.25},
      {"1e3", 1000},  {"1E3", 1000},
      {"1e+3", 1000}, {"1e-3", 0.001},
      {"1e", 1},      {"1e+", 1},
      {"1e-x", 1},    {"1.e2", 100},
      {"0x1F", 0},    {"1 2", 1},
      {"1_000", 1},   {"1,5", 1},
      {"1.2.3", 1.2}, {"12e2.5", 1200},
      {"007", 7},     {"1e0000000003", 1000},
      {"0.1", 0.1},
  };
  for (const Row& row : rows) {
    double value = -99;
    EXPECT_TRUE(scanDouble(NSStringView::ascii(row.text), value)) << row.text;
    EXPECT_EQ(value, row.value) << row.text;
  }
}

TEST(NumberText, WhatIsNoNumberLeavesTheOutputAlone) {
  for (const char* text : {"", "  ", "inf", "-inf", "INF", "infinity", "nan", "NaN", "-", "+", ".",
                           "e1", ".e1", "x1", "--1", "- 1"}) {
    double value = 42;
    EXPECT_FALSE(scanDouble(NSStringView::ascii(text), value)) << text;
    EXPECT_EQ(value, 42);
  }
}

TEST(NumberText, OverflowIsInfinityAndUnderflowZero) {
  const auto scanned = [](const std::string& text) {
    double value = 42;
    EXPECT_TRUE(scanDouble(NSStringView::ascii(text), value));
    return value;
  };
  EXPECT_EQ(scanned("1e309"), infinity);
  EXPECT_EQ(scanned("-1e309"), -infinity);
  EXPECT_EQ(scanned("1e99999999999999999999"), infinity);
  EXPECT_EQ(scanned("1e-99999999999999999999"), 0);
  EXPECT_TRUE(std::signbit(scanned("-1e-400")));
  EXPECT_EQ(scanned("0e99999999999999999999"), 0);
  EXPECT_EQ(scanned(std::string(400, '9')), infinity);
  EXPECT_EQ(scanned("0." + std::string(400, '0') + "1"), 0);
  EXPECT_EQ(scanned("0." + std::string(400, '0') + "1e401"), 1);
  EXPECT_EQ(scanned(std::string(400, '9') + "e-400"), 1);
  EXPECT_EQ(scanned("1" + std::string(400, '0') + "e-400"), 1);
  EXPECT_EQ(scanned("4.9e-324"), 5e-324);
  EXPECT_EQ(scanned("1.7976931348623157e308"), std::numeric_limits<double>::max());
}

TEST(NumberText, ScanReadsWideTextAlike) {
  const std::u16string text = u" -1.5e2\u20AC";
  double value = 0;
  ASSERT_TRUE(scanDouble({text.data(), static_cast<uint32_t>(text.size())}, value));
  EXPECT_EQ(value, -150);
  const std::u16string digit = u"\u0661";  // a digit of another script is none here
  EXPECT_FALSE(scanDouble({digit.data(), 1}, value));
}

TEST(NumberText, ExtentNamesTheParts) {
  NumberExtent extent;
  ASSERT_TRUE(findNumber(NSStringView::ascii("  -12.50e-3x"), extent));
  EXPECT_TRUE(extent.negative);
  EXPECT_EQ(extent.digits, 3U);
  EXPECT_EQ(extent.point, 5U);
  EXPECT_EQ(extent.mantissaEnd, 8U);
  EXPECT_EQ(extent.end, 11U);
  EXPECT_EQ(extent.exponent, -3);
}

TEST(NumberText, LocaleOfTheProcessChangesNothing) {
  const char* comma = std::setlocale(LC_ALL, "de_DE.UTF-8");
  double value = 0;
  EXPECT_TRUE(scanDouble(NSStringView::ascii("1.5"), value));
  EXPECT_EQ(value, 1.5);
  EXPECT_EQ(formatDouble(1.5), "1.5");
  if (comma) std::setlocale(LC_ALL, "C");
}

TEST(NumberText, ALongNumberIsTheDoubleNearestToAllItsDigits) {
  const auto read = [](const std::string& text) {
    double value = -1;
    EXPECT_TRUE(scanDouble(NSStringView::ascii(text), value));
    return value;
  };
  const std::string zeros(2000, '0');
  EXPECT_EQ(read("9007199254740993." + zeros), 9007199254740992.0);
  EXPECT_EQ(read("9007199254740993." + zeros + "1"), 9007199254740994.0);
  EXPECT_EQ(read("9007199254740993" + zeros + "1e-2001"), 9007199254740994.0);
  EXPECT_EQ(read("0." + zeros + "15e2000"), 0.15);
  EXPECT_EQ(read(zeros + "1.5"), 1.5);
  EXPECT_EQ(read("-" + zeros), 0);
  EXPECT_TRUE(std::signbit(read("-" + zeros)));
  EXPECT_EQ(read("1" + zeros), std::numeric_limits<double>::infinity());
  EXPECT_EQ(read("-1" + zeros + "e99999999999999999999"), -std::numeric_limits<double>::infinity());
  EXPECT_EQ(read("1" + zeros + "e-2000"), 1);
  EXPECT_EQ(read("1e-99999999999999999999"), 0);
  EXPECT_EQ(read("." + zeros + "5"), 0);
  EXPECT_EQ(read("5." + zeros + "e1"), 50);
  EXPECT_EQ(read("4.9e-324" + zeros), 0);
  EXPECT_EQ(read("4.9406564584124654e-324"), 4.9406564584124654e-324);
  EXPECT_EQ(read(std::string(310, '1') + "e-305"), 11111.111111111111111111111);
}

}  // namespace
}  // namespace xquery
