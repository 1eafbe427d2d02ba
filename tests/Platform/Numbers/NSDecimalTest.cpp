#include "Platform/Base/ProcessorTime.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Numbers/BigInteger.h"
#include "Platform/Numbers/DecimalTesting.h"
#include "Platform/Numbers/NSDecimal.h"
#include "Platform/Numbers/NumberText.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>
#include <stdexcept>
#include <string>

namespace xquery {
namespace {

using namespace decimaltest;

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

// A number of up to so many digits, and what it is in digits and a scale.
struct LongSample {
  std::string digits;
  int scale = 0;

  explicit LongSample(std::mt19937_64& random) {
    digits = randomDigits(random, random() % 44 + 1);
    if (random() % 4 == 0) digits += std::string(random() % 20, '0');
    if (random() % 2) digits.insert(digits.begin(), '-');
    scale = static_cast<int>(random() % 42);
  }
  BigInteger coefficient(int atScale) const {
    BigInteger result = BigInteger::fromDigits(digits);
    result.multiplyByPowerOfTen(static_cast<uint32_t>(atScale - scale));
    return result;
  }
  NSDecimal value() const { return decimal(digits + "e-" + std::to_string(scale)); }
};

std::string textOf(const BigInteger& coefficient, int scale) {
  return decimal(coefficient.toString() + "e-" + std::to_string(scale)).toString();
}

// Around the bounds of 64 and of 128 bits.
TEST(Decimal, LongSumsDifferencesAndProductsAgreeWithIntegers) {
  std::mt19937_64 random(2);
  for (int round = 0; round < 4000; ++round) {
    const LongSample a(random);
    const LongSample b(random);
    const int scale = std::max(a.scale, b.scale);
    BigInteger sum = a.coefficient(scale);
    sum.add(b.coefficient(scale));
    BigInteger difference = a.coefficient(scale);
    difference.subtract(b.coefficient(scale));
    BigInteger product = a.coefficient(a.scale);
    product.multiply(b.coefficient(b.scale));
    const NSDecimal x = a.value();
    const NSDecimal y = b.value();
    ASSERT_EQ(x.add(y).toString(), textOf(sum, scale));
    ASSERT_EQ(x.subtract(y).toString(), textOf(difference, scale));
    ASSERT_EQ(x.multiply(y).toString(), textOf(product, a.scale + b.scale));
    // The canonical form is the same, whatever the way.
    ASSERT_EQ(hashDigits(x.add(y)), hashDigits(decimal(textOf(sum, scale))));
    ASSERT_EQ(x.add(y).compare(decimal(textOf(sum, scale))), 0);
    ASSERT_EQ(x.subtract(x).toString(), "0");
    ASSERT_EQ(x.add(y).subtract(y).toString(), x.toString());
  }
}

TEST(Decimal, ExtremesOf128Bits) {
  const NSDecimal greatest = decimal("170141183460469231731687303715884105727");
  const NSDecimal one(1);
  EXPECT_EQ(greatest.add(one).toString(), "170141183460469231731687303715884105728");
  const NSDecimal least = greatest.negate().subtract(one);
  EXPECT_EQ(least.toString(), "-170141183460469231731687303715884105728");
  EXPECT_EQ(least.subtract(one).toString(), "-170141183460469231731687303715884105729");
  EXPECT_EQ(least.add(greatest).toString(), "-1");
  EXPECT_EQ(decimal("-85070591730234615865843651857942052864").multiply(NSDecimal(2)).toString(),
            "-170141183460469231731687303715884105728");
  EXPECT_EQ(
      decimal("13611294676837538538534984297270728458.24").multiply(decimal("12.5")).toString(),
      "170141183460469231731687303715884105728");
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
