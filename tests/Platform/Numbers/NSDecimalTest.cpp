#include "Platform/Base/ProcessorTime.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Numbers/NSDecimal.h"
#include "Platform/Numbers/NumberText.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <limits>
#include <random>
#include <stdexcept>
#include <string>
#include <vector>

namespace xquery {
namespace {

__extension__ using Int128 = __int128;

NSDecimal decimal(std::string_view text) {
  NSDecimal value = NSDecimal::notANumber();
  EXPECT_TRUE(NSDecimal::scan(NSStringView::ascii(text), value)) << text;
  return value;
}

// The reference implementation works on 128-bit integers and knows nothing of the engine's.
std::string textOf(Int128 value, int scale) {
  const bool negative = value < 0;
  std::string digits;
  for (Int128 rest = negative ? -value : value; rest != 0; rest /= 10) {
    digits.insert(digits.begin(), static_cast<char>('0' + static_cast<int>(rest % 10)));
  }
  while (static_cast<int>(digits.size()) <= scale) digits.insert(digits.begin(), '0');
  if (scale > 0) {
    digits.insert(digits.size() - static_cast<size_t>(scale), 1, '.');
    digits.resize(digits.find_last_not_of('0') + 1);
    if (digits.back() == '.') digits.pop_back();
  }
  return negative && digits != "0" ? "-" + digits : digits;
}

Int128 powerOfTen(int exponent) {
  Int128 power = 1;
  while (exponent-- > 0) power *= 10;
  return power;
}

// A coefficient and a scale, small enough for the reference.
struct Sample {
  int64_t coefficient;
  int scale;
  NSDecimal value() const { return decimal(textOf(coefficient, scale)); }
};

Sample randomSample(std::mt19937_64& random) {
  const int bits = static_cast<int>(random() % 63) + 1;
  auto coefficient = static_cast<int64_t>(random() >> (64 - bits));
  if (random() % 2) coefficient = -coefficient;
  return {coefficient, static_cast<int>(random() % 16)};
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

TEST(Decimal, ArithmeticThatOutgrowsTheBoundThrows) {
  const NSDecimal large = decimal("1e200000");
  EXPECT_THROW(large.multiply(large), std::length_error);
  const NSDecimal tiny = decimal("1e-200000");
  EXPECT_THROW(tiny.multiply(tiny), std::length_error);
  EXPECT_EQ(large.multiply(tiny).toString(), "1");
  // A sum may need the digits of both.
  EXPECT_THROW(large.add(tiny), std::length_error);
  EXPECT_EQ(large.compare(tiny), 1);
  EXPECT_EQ(tiny.compare(large), -1);
}

TEST(Decimal, TheLargestNumbersAreHandledQuickly) {
  const std::string digits(static_cast<size_t>(NSDecimal::maximumDigits) / 2, '7');
  const NSDecimal value = decimal(digits);
  const double start = processorSeconds();
  const NSDecimal product = value.multiply(value);
  EXPECT_EQ(product.divide(value).toString(), digits);
  EXPECT_EQ(product.remainder(value).toString(), "0");
  EXPECT_EQ(product.compare(value), 1);
  EXPECT_LT(processorSeconds() - start, 1);
}

// Each is far quicker; the bound leaves room for a sanitizer and a busy machine.
TEST(Decimal, NoQuotientTakesLong) {
  const auto length = static_cast<size_t>(NSDecimal::maximumDigits);
  std::mt19937_64 random(5);
  const auto randomDigits = [&random](size_t count) {
    std::string text;
    while (text.size() < count) text += static_cast<char>('1' + random() % 9);
    return text;
  };
  const std::string places = "e-" + std::to_string(length);
  const NSDecimal operands[] = {
      decimal(randomDigits(length)),
      decimal(randomDigits(length - 1)),
      decimal(randomDigits(length) + places),
      decimal("1" + places),
      decimal("1e" + std::to_string(length - 1)),
      decimal("7"),
  };
  for (const NSDecimal& a : operands) {
    for (const NSDecimal& b : operands) {
      const double start = processorSeconds();
      try {
        const NSDecimal quotient = a.divide(b);
        EXPECT_EQ(quotient.sign(), 1);
      } catch (const std::length_error&) {  // as good an answer here
      }
      EXPECT_LT(processorSeconds() - start, 0.5);
    }
  }
}

TEST(Decimal, QuotientsOfTwosAndFivesEndWhereTheyShould) {
  const auto power = [](int64_t base, int exponent) {
    NSDecimal result(1);
    while (exponent-- > 0) result = result.multiply(NSDecimal(base));
    return result;
  };
  EXPECT_EQ(power(2, 200).divide(power(2, 199)).toString(), "2");
  EXPECT_EQ(power(2, 199).divide(power(2, 200)).toString(), "0.5");
  EXPECT_EQ(power(5, 99).divide(power(5, 100)).toString(), "0.2");
  EXPECT_EQ(power(10, 60).divide(power(2, 60)).compare(power(5, 60)), 0);
  EXPECT_EQ(power(2, 90).divide(power(10, 90)).multiply(power(5, 90)).toString(), "1");
  EXPECT_EQ(power(6, 80).divide(power(3, 80)).compare(power(2, 80)), 0);
  EXPECT_EQ(power(3, 80).divide(power(6, 80)).multiply(power(2, 80)).toString(), "1");
  EXPECT_EQ(power(6, 80).negate().divide(power(15, 80)).multiply(power(5, 80)).toString(),
            "-" + power(2, 80).toString());
  EXPECT_EQ(decimal("1e-30").divide(power(2, 70)).multiply(power(2, 70)).toString(),
            decimal("1e-30").toString());
  EXPECT_EQ(power(7, 50).divide(decimal("-7e-50")).toString(),
            "-" + power(7, 49).toString() + std::string(50, '0'));
  EXPECT_EQ(NSDecimal(0).divide(decimal("1e-100000")).toString(), "0");
}

TEST(Decimal, SumDifferenceAndProductAgreeWithTheReference) {
  std::mt19937_64 random(1);
  for (int round = 0; round < 20000; ++round) {
    const Sample a = randomSample(random);
    const Sample b = randomSample(random);
    const int scale = std::max(a.scale, b.scale);
    const Int128 alignedA = a.coefficient * powerOfTen(scale - a.scale);
    const Int128 alignedB = b.coefficient * powerOfTen(scale - b.scale);
    const NSDecimal x = a.value();
    const NSDecimal y = b.value();
    ASSERT_EQ(x.add(y).toString(), textOf(alignedA + alignedB, scale));
    ASSERT_EQ(x.subtract(y).toString(), textOf(alignedA - alignedB, scale));
    ASSERT_EQ(x.multiply(y).toString(),
              textOf(Int128{a.coefficient} * b.coefficient, a.scale + b.scale));
    ASSERT_EQ(x.compare(y), alignedA < alignedB ? -1 : alignedA > alignedB ? 1 : 0);
  }
}

TEST(Decimal, IntegerDivisionAndRemainderAgreeWithTheReference) {
  std::mt19937_64 random(2);
  for (int round = 0; round < 20000; ++round) {
    const Sample a = randomSample(random);
    Sample b = randomSample(random);
    if (b.coefficient == 0) b.coefficient = 1;
    const int scale = std::max(a.scale, b.scale);
    const Int128 alignedA = a.coefficient * powerOfTen(scale - a.scale);
    const Int128 alignedB = b.coefficient * powerOfTen(scale - b.scale);
    ASSERT_EQ(a.value().integerDivide(b.value()).toString(), textOf(alignedA / alignedB, 0));
    ASSERT_EQ(a.value().remainder(b.value()).toString(), textOf(alignedA % alignedB, scale));
  }
}

TEST(Decimal, ExtremesOf64Bits) {
  const NSDecimal least(INT64_MIN);
  const NSDecimal greatest(INT64_MAX);
  const NSDecimal minusOne(-1);
  EXPECT_EQ(least.integerDivide(minusOne).toString(), "9223372036854775808");
  EXPECT_EQ(least.divide(minusOne).toString(), "9223372036854775808");
  EXPECT_EQ(least.remainder(minusOne).toString(), "0");
  EXPECT_EQ(least.negate().toString(), "9223372036854775808");
  EXPECT_EQ(least.add(least).toString(), "-18446744073709551616");
  EXPECT_EQ(least.subtract(greatest).toString(), "-18446744073709551615");
  EXPECT_EQ(greatest.add(NSDecimal(1)).toString(), "9223372036854775808");
  EXPECT_EQ(greatest.add(NSDecimal(1)).subtract(NSDecimal(1)).toString(), "9223372036854775807");
  EXPECT_TRUE(greatest.add(NSDecimal(1)).subtract(NSDecimal(1)).isSmallInteger());
  EXPECT_EQ(greatest.multiply(greatest).toString(), "85070591730234615847396907784232501249");
  EXPECT_EQ(least.divide(least).toString(), "1");
  EXPECT_EQ(least.roundedPlain(-18).toString(), "-9000000000000000000");
  EXPECT_EQ(least.roundedPlain(-19).toString(), "-10000000000000000000");
  EXPECT_EQ(least.roundedPlain(-20).toString(), "0");
}

TEST(Decimal, QuotientsThatEndAreExact) {
  EXPECT_EQ(NSDecimal(7).divide(NSDecimal(2)).toString(), "3.5");
  EXPECT_EQ(NSDecimal(1).divide(NSDecimal(8)).toString(), "0.125");
  EXPECT_EQ(NSDecimal(-1).divide(NSDecimal(1024)).toString(), "-0.0009765625");
  EXPECT_EQ(NSDecimal(0).divide(NSDecimal(7)).toString(), "0");
  EXPECT_EQ(NSDecimal(6).divide(NSDecimal(-3)).toString(), "-2");
  EXPECT_EQ(decimal("0.3").divide(decimal("0.1")).toString(), "3");
  EXPECT_EQ(decimal("1e40").divide(decimal("1e-40")).toString(), "1" + std::string(80, '0'));
  // More than 38 digits, and yet exact.
  NSDecimal power(1);
  for (int index = 0; index < 200; ++index) power = power.multiply(NSDecimal(2));
  const NSDecimal quotient = NSDecimal(1).divide(power);
  EXPECT_EQ(quotient.multiply(power).toString(), "1");
}

TEST(Decimal, QuotientsThatDoNotEndHave38Digits) {
  EXPECT_EQ(NSDecimal(1).divide(NSDecimal(3)).toString(), "0." + std::string(38, '3'));
  EXPECT_EQ(NSDecimal(2).divide(NSDecimal(3)).toString(), "0." + std::string(37, '6') + "7");
  EXPECT_EQ(NSDecimal(-2).divide(NSDecimal(3)).toString(), "-0." + std::string(37, '6') + "7");
  EXPECT_EQ(NSDecimal(2).divide(NSDecimal(-3)).toString(), "-0." + std::string(37, '6') + "7");
  EXPECT_EQ(NSDecimal(10).divide(NSDecimal(3)).toString(), "3." + std::string(37, '3'));
  EXPECT_EQ(decimal("1e50").divide(NSDecimal(3)).toString(),
            std::string(38, '3') + std::string(12, '0'));
  EXPECT_EQ(NSDecimal(1).divide(NSDecimal(7)).toString(),
            "0.14285714285714285714285714285714285714");
  EXPECT_EQ(NSDecimal(1).divide(decimal("3e30")).toString(),
            "0." + std::string(30, '0') + std::string(38, '3'));
  // All nines round up to a power of ten.
  const NSDecimal nines = decimal("1e60").subtract(NSDecimal(1));
  EXPECT_EQ(nines.divide(decimal("1e60").add(NSDecimal(1))).toString(), "1");
}

TEST(Decimal, AQuotientTimesItsDivisorIsTheDividendWithinHalfAUnit) {
  std::mt19937_64 random(3);
  for (int round = 0; round < 3000; ++round) {
    const Sample a = randomSample(random);
    Sample b = randomSample(random);
    if (b.coefficient == 0 || a.coefficient == 0) continue;
    const NSDecimal x = a.value();
    const NSDecimal y = b.value();
    const NSDecimal quotient = x.divide(y);
    const NSDecimal error = quotient.multiply(y).subtract(x);
    // |error| <= |dividend| * 10^-37 / 2, the half unit of the least significant of 38 digits.
    const NSDecimal bound = x.multiply(decimal("0.5e-37"));
    const NSDecimal magnitude = error.sign() < 0 ? error.negate() : error;
    const NSDecimal limit = bound.sign() < 0 ? bound.negate() : bound;
    ASSERT_LE(magnitude.compare(limit), 0) << x.toString() << " / " << y.toString();
  }
}

TEST(Decimal, LawsHoldForLargeNumbers) {
  std::mt19937_64 random(4);
  const auto randomDecimal = [&random] {
    std::string text = random() % 2 ? "-" : "";
    const size_t digits = 1 + random() % 60;
    for (size_t index = 0; index < digits; ++index) {
      text += static_cast<char>('0' + random() % 10);
    }
    if (random() % 2) text += "e-" + std::to_string(random() % 50);
    return decimal(text);
  };
  for (int round = 0; round < 3000; ++round) {
    const NSDecimal a = randomDecimal();
    const NSDecimal b = randomDecimal();
    const NSDecimal c = randomDecimal();
    ASSERT_EQ(a.add(b).subtract(b).compare(a), 0);
    ASSERT_EQ(a.add(b).compare(b.add(a)), 0);
    ASSERT_EQ(a.add(b).add(c).compare(a.add(b.add(c))), 0);
    ASSERT_EQ(a.multiply(b.add(c)).compare(a.multiply(b).add(a.multiply(c))), 0);
    ASSERT_EQ(a.compare(b), -b.compare(a));
    ASSERT_EQ(a.subtract(b).sign(), a.compare(b));
    ASSERT_EQ(decimal(a.toString()).compare(a), 0);
    if (b.isZero()) continue;
    const NSDecimal quotient = a.integerDivide(b);
    ASSERT_TRUE(quotient.isInteger());
    ASSERT_EQ(quotient.multiply(b).add(a.remainder(b)).compare(a), 0);
    ASSERT_EQ(a.multiply(b).divide(b).compare(a), 0);
  }
}

TEST(Decimal, RoundsInEveryMode) {
  struct Row {
    const char* value;
    // TowardZero, Floor, Ceiling, HalfAwayFromZero, HalfUp, HalfEven
    std::array<const char*, 6> expected;
  };
  constexpr Row rows[] = {
      {"2.5", {"2", "2", "3", "3", "3", "2"}},
      {"-2.5", {"-2", "-3", "-2", "-3", "-2", "-2"}},
      {"3.5", {"3", "3", "4", "4", "4", "4"}},
      {"-3.5", {"-3", "-4", "-3", "-4", "-3", "-4"}},
      {"2.4999", {"2", "2", "3", "2", "2", "2"}},
      {"-2.4999", {"-2", "-3", "-2", "-2", "-2", "-2"}},
      {"2.5001", {"2", "2", "3", "3", "3", "3"}},
      {"-2.5001", {"-2", "-3", "-2", "-3", "-3", "-3"}},
      {"0.5", {"0", "0", "1", "1", "1", "0"}},
      {"-0.5", {"0", "-1", "0", "-1", "0", "0"}},
      {"7", {"7", "7", "7", "7", "7", "7"}},
      {"0.0000000000000000000000001", {"0", "0", "1", "0", "0", "0"}},
      {"-0.0000000000000000000000001", {"0", "-1", "0", "0", "0", "0"}},
      {"100000000000000000000.5",
       {"100000000000000000000", "100000000000000000000", "100000000000000000001",
        "100000000000000000001", "100000000000000000001", "100000000000000000000"}},
      {"-100000000000000000000.5",
       {"-100000000000000000000", "-100000000000000000001", "-100000000000000000000",
        "-100000000000000000001", "-100000000000000000000", "-100000000000000000000"}},
  };
  constexpr NSRoundingMode modes[] = {NSRoundingMode::TowardZero, NSRoundingMode::Floor,
                                      NSRoundingMode::Ceiling,    NSRoundingMode::HalfAwayFromZero,
                                      NSRoundingMode::HalfUp,     NSRoundingMode::HalfEven};
  for (const Row& row : rows) {
    for (size_t mode = 0; mode < 6; ++mode) {
      EXPECT_EQ(decimal(row.value).rounded(0, modes[mode]).toString(), row.expected[mode])
          << row.value << " mode " << mode;
    }
  }
}

TEST(Decimal, RoundsAtAnyPlace) {
  EXPECT_EQ(decimal("1.2345").roundedPlain(2).toString(), "1.23");
  EXPECT_EQ(decimal("1.235").roundedPlain(2).toString(), "1.24");
  EXPECT_EQ(decimal("1.2").roundedPlain(5).toString(), "1.2");
  EXPECT_EQ(decimal("1250").roundedPlain(-2).toString(), "1300");
  EXPECT_EQ(decimal("49").roundedPlain(-2).toString(), "0");
  EXPECT_EQ(decimal("50").roundedPlain(-2).toString(), "100");
  EXPECT_EQ(decimal("-50").roundedPlain(-2).toString(), "-100");
  EXPECT_EQ(decimal("12345678901234567890123").roundedPlain(-20).toString(),
            "12300000000000000000000");
  EXPECT_EQ(decimal("12345678901234567890123").roundedPlain(-23).toString(), "0");
  EXPECT_EQ(decimal("5").roundedPlain(INT32_MIN).toString(), "0");
  EXPECT_EQ(decimal("5").roundedPlain(INT32_MAX).toString(), "5");
  EXPECT_EQ(decimal("0.000000000000000000005").roundedPlain(20).toString(),
            "0.00000000000000000001");
}

TEST(Decimal, TruncatedFloorAndCeiling) {
  EXPECT_EQ(decimal("-2.7").truncated().toString(), "-2");
  EXPECT_EQ(decimal("-2.7").floor().toString(), "-3");
  EXPECT_EQ(decimal("-2.7").ceiling().toString(), "-2");
  EXPECT_EQ(decimal("2.7").truncated().toString(), "2");
  EXPECT_EQ(decimal("2.7").floor().toString(), "2");
  EXPECT_EQ(decimal("2.7").ceiling().toString(), "3");
}

TEST(Decimal, NotANumberSpreadsAndIsBelowEverything) {
  const NSDecimal nan = NSDecimal::notANumber();
  const NSDecimal one(1);
  EXPECT_TRUE(nan.add(one).isNaN());
  EXPECT_TRUE(one.subtract(nan).isNaN());
  EXPECT_TRUE(nan.multiply(NSDecimal(0)).isNaN());
  EXPECT_TRUE(one.divide(nan).isNaN());
  EXPECT_TRUE(nan.integerDivide(one).isNaN());
  EXPECT_TRUE(nan.remainder(one).isNaN());
  EXPECT_TRUE(nan.roundedPlain(0).isNaN());
  EXPECT_TRUE(nan.negate().isNaN());
  EXPECT_EQ(nan.compare(nan), 0);
  EXPECT_EQ(nan.compare(decimal("-1e100")), -1);
  EXPECT_EQ(decimal("-1e100").compare(nan), 1);
  EXPECT_EQ(nan.toString(), "NaN");
  EXPECT_TRUE(std::isnan(nan.doubleValue()));
  EXPECT_EQ(nan.int64Value(), 0);
  EXPECT_EQ(nan.uint64Value(), 0U);
  EXPECT_FALSE(nan.isInteger());
  EXPECT_FALSE(nan.isZero());
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

TEST(Decimal, CopiesAndMovesKeepTheValue) {
  const NSDecimal large = decimal("123456789012345678901234567890");
  NSDecimal copy = large;
  NSDecimal moved = std::move(copy);
  EXPECT_EQ(moved.toString(), large.toString());
  EXPECT_TRUE(copy.isZero());  // NOLINT: what is left behind is zero
  copy = moved;
  moved = NSDecimal(3);
  EXPECT_EQ(copy.compare(large), 0);
  EXPECT_EQ(moved.toString(), "3");
  const NSDecimal& itself = copy;
  copy = itself;
  EXPECT_EQ(copy.compare(large), 0);
}

TEST(Decimal, OneRepresentationPerValue) {
  const NSDecimal a = decimal("2.50").multiply(NSDecimal(2));
  EXPECT_TRUE(a.isSmallInteger());
  EXPECT_EQ(a.smallInteger(), 5);
  EXPECT_TRUE(decimal("1e18").isSmallInteger());
  EXPECT_FALSE(decimal("1e19").isSmallInteger());
  EXPECT_TRUE(decimal("1e19").isInteger());
  EXPECT_TRUE(decimal("1e19").divide(decimal("1e19")).isSmallInteger());
  EXPECT_FALSE(decimal("1.5").isInteger());
}

// --- many digits ---------------------------------------------------------------------------------

std::string randomDigits(std::mt19937_64& random, size_t count) {
  std::string digits;
  for (size_t index = 0; index < count; ++index) {
    digits += static_cast<char>('0' + static_cast<int>(random() % 10));
  }
  return digits;
}

double readAsDouble(const std::string& text) {
  double value = 0;
  EXPECT_TRUE(scanDouble(NSStringView::ascii(text), value));
  return value;
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

TEST(Decimal, TheOrderOfLargeOnesIsThatOfTheirDifference) {
  std::mt19937_64 random(6);
  // Nearly the same: of another last digit, another length or another place of the point.
  const auto variant = [&](std::string text) {
    if (random() % 2) text.back() = static_cast<char>('1' + static_cast<int>(random() % 9));
    if (random() % 2) text += randomDigits(random, random() % 30);
    const size_t point = 30 + (random() % 4 == 0 ? random() % 2 : 0);
    return (random() % 8 == 0 ? "-" : "") + text.substr(0, point) + "." + text.substr(point);
  };
  for (int round = 0; round < 2000; ++round) {
    std::string digits = randomDigits(random, 35 + random() % 20);
    if (random() % 4 == 0) digits = std::string(40, random() % 2 ? '9' : '0') + digits;
    const NSDecimal a = decimal(variant("1" + digits));
    const NSDecimal b = decimal(variant(random() % 4 ? "1" + digits : digits));
    EXPECT_EQ(a.compare(b), a.subtract(b).sign()) << a.toString() << " " << b.toString();
    EXPECT_EQ(b.compare(a), -a.compare(b));
    EXPECT_EQ(hashDigits(a) == hashDigits(b), a.compare(b) == 0);
  }
}

TEST(Decimal, ComparingAndConvertingLargeOnesTakesNoTimeForTheirDigits) {
  const auto measure = [](size_t length) {
    const NSDecimal a = decimal(std::string(length, '7') + "." + std::string(length, '3'));
    const NSDecimal b = decimal(std::string(length, '7') + "." + std::string(length + 1, '3'));
    const NSDecimal c = decimal(std::string(length, '8') + ".1");
    return processorSecondsOf([&] {
      for (int times = 0; times < 200; ++times) {
        EXPECT_NE(a.doubleValue(), 0);
        EXPECT_EQ(a.compare(c), -1);
        EXPECT_EQ(c.compare(b), 1);
        EXPECT_NE(hashDigits(a), hashDigits(b));
      }
    });
  };
  EXPECT_TRUE(growsInProportion(measure, 80000));
}

TEST(Decimal, WorkOnManyDigitsIsCharged) {
  const NSDecimal large = decimal(std::string(100000, '7') + ".3");
  const NSDecimal near = decimal(std::string(100000, '7') + ".33");
  const auto stepsOf = [](auto work) {
    const int64_t before = workMeter.stepsLeft;
    work();
    return before - workMeter.stepsLeft;
  };
  constexpr int64_t most = 100000;
  for (const int64_t steps : {stepsOf([&] { EXPECT_EQ(large.compare(near), -1); }),
                              stepsOf([&] { static_cast<void>(large.toString()); }),
                              stepsOf([&] { static_cast<void>(large.integerDivide(near)); }),
                              stepsOf([&] { static_cast<void>(near.remainder(near)); }),
                              stepsOf([&] { static_cast<void>(large.divide(large)); }),
                              stepsOf([&] { static_cast<void>(large.subtract(large)); })}) {
    EXPECT_GT(steps, 1);
    EXPECT_LT(steps, most);
  }
}

}  // namespace
}  // namespace xquery
