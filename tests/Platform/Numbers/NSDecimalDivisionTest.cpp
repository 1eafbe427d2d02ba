#include "Platform/Base/ProcessorTime.h"
#include "Platform/Numbers/DecimalTesting.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <stdexcept>
#include <string>

namespace xquery {
namespace {

using namespace decimaltest;

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

}  // namespace
}  // namespace xquery
