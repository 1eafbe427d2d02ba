#include "Platform/Numbers/BigInteger.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

TEST(BigInteger, DigitsAreCountedExactly) {
  for (uint32_t exponent = 0; exponent < 400; ++exponent) {
    BigInteger power = BigInteger::powerOfTen(exponent);
    EXPECT_EQ(power.digits(), exponent + 1);
    EXPECT_GE(power.digitsAtMost(), power.digits());
    EXPECT_LE(power.digitsAtMost(), power.digits() + 1);
    power.subtract(BigInteger(int64_t{1}));
    if (exponent > 0) {
      EXPECT_EQ(power.digits(), exponent);
    }
  }
}

TEST(BigInteger, DivisionTruncatesAndAnswersTheRemainder) {
  BigInteger value(int64_t{-7});
  const BigInteger remainder = value.divide(BigInteger(int64_t{2}));
  EXPECT_EQ(value.toString(), "-3");
  EXPECT_EQ(remainder.toString(), "-1");
}

TEST(BigInteger, FactorsAreRemovedAsOftenAsTheyDivide) {
  BigInteger value = BigInteger::fromDigits("12300000");
  EXPECT_EQ(value.removeFactor(10), 5U);
  EXPECT_EQ(value.toString(), "123");
  EXPECT_EQ(value.removeFactor(10), 0U);
}

TEST(BigInteger, CopiesAreIndependent) {
  const BigInteger original = BigInteger::fromDigits("123456789012345678901234567890");
  BigInteger copy = original;
  copy.multiplyByPowerOfTen(2);
  EXPECT_EQ(original.toString(), "123456789012345678901234567890");
  EXPECT_EQ(copy.toString(), "12345678901234567890123456789000");
  const BigInteger moved = std::move(copy);
  EXPECT_EQ(moved.toString(), "12345678901234567890123456789000");
}

TEST(BigInteger, KnowsWhatFits64Bits) {
  EXPECT_TRUE(BigInteger(INT64_MIN).fitsInt64());
  EXPECT_TRUE(BigInteger(INT64_MAX).fitsInt64());
  EXPECT_FALSE(BigInteger::fromUnsigned(uint64_t{1} << 63).fitsInt64());
  EXPECT_TRUE(BigInteger::fromUnsigned(UINT64_MAX).fitsUInt64());
  EXPECT_FALSE(BigInteger::fromDigits("18446744073709551616").fitsUInt64());
}

}  // namespace
}  // namespace xquery
