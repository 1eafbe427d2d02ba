#include "Platform/Base/Counting.h"
#include "Platform/Numbers/NSDecimal.h"
#include "xquery/Number.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>
#include <vector>

namespace xquery {
namespace {

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();

Ref<NSNumber> decimal(std::string_view text) {
  return NSDecimalNumber::decimalNumberWithString(NSStringView::ascii(text));
}

// Numbers of every storage, in ascending order; equal ones stand in one row.
std::vector<std::vector<Ref<NSNumber>>> ascendingNumbers() {
  return {
      {NSNumber::numberWithDouble(nan), NSNumber::numberWithFloat(static_cast<float>(nan)),
       decimal("none")},
      {NSNumber::numberWithDouble(-infinity)},
      {NSNumber::numberWithDouble(-1e300)},
      {NSNumber::numberWithLongLong(INT64_MIN), decimal("-9223372036854775808"),
       NSNumber::numberWithDouble(-9223372036854775808.0)},
      {NSNumber::numberWithLongLong(-2), NSNumber::numberWithDouble(-2),
       NSNumber::numberWithFloat(-2), decimal("-2.0")},
      {NSNumber::numberWithLongLong(0), NSNumber::numberWithUnsignedLongLong(0),
       NSNumber::numberWithDouble(0), NSNumber::numberWithDouble(-0.0),
       NSNumber::numberWithFloat(-0.0F), decimal("0"), NSNumber::falseValue()},
      {NSNumber::numberWithDouble(0.1), decimal("0.1")},
      {NSNumber::numberWithFloat(0.1F)},
      {NSNumber::numberWithDouble(0.5), NSNumber::numberWithFloat(0.5F), decimal("0.50")},
      {NSNumber::numberWithLongLong(1), NSNumber::numberWithUnsignedLongLong(1),
       NSNumber::numberWithDouble(1), NSNumber::numberWithFloat(1), decimal("1.000"),
       NSNumber::trueValue()},
      {NSNumber::numberWithDouble(1e300)},
      {NSNumber::numberWithDouble(infinity),
       NSNumber::numberWithFloat(std::numeric_limits<float>::infinity())},
  };
}

TEST(Number, ComparesAcrossStoragesAndEqualNumbersHashAlike) {
  const auto rows = ascendingNumbers();
  for (size_t i = 0; i < rows.size(); ++i) {
    for (size_t j = 0; j < rows.size(); ++j) {
      const int expected = i < j ? -1 : i > j ? 1 : 0;
      for (const Ref<NSNumber>& a : rows[i]) {
        for (const Ref<NSNumber>& b : rows[j]) {
          EXPECT_EQ(a->compare(*b), expected) << a->stringValue() << " / " << b->stringValue();
          EXPECT_EQ(a->isEqualToNumber(*b), expected == 0);
          if (expected == 0) {
            EXPECT_EQ(a->hash(), b->hash()) << a->stringValue() << " / " << b->stringValue();
          }
        }
      }
    }
  }
}

TEST(Number, ComparisonOfIntegersAndDecimalsIsExact) {
  const auto large = NSNumber::numberWithLongLong(9007199254740993);
  EXPECT_EQ(large->compare(*decimal("9007199254740992.9")), 1);
  EXPECT_EQ(large->compare(*decimal("9007199254740993")), 0);
  EXPECT_EQ(large->compare(*NSNumber::numberWithUnsignedLongLong(9007199254740992)), 1);
  EXPECT_EQ(NSNumber::numberWithUnsignedLongLong(UINT64_MAX)
                ->compare(*NSNumber::numberWithLongLong(INT64_MAX)),
            1);
  EXPECT_EQ(
      NSNumber::numberWithLongLong(-1)->compare(*NSNumber::numberWithUnsignedLongLong(UINT64_MAX)),
      -1);
  EXPECT_EQ(
      NSNumber::numberWithUnsignedLongLong(UINT64_MAX)->compare(*decimal("18446744073709551615")),
      0);
  EXPECT_EQ(decimal("0.1000000000000000000000001")->compare(*decimal("0.1")), 1);
}

TEST(Number, ComparisonWithADoubleIsByDouble) {
  EXPECT_EQ(NSNumber::numberWithLongLong(9007199254740993)
                ->compare(*NSNumber::numberWithDouble(9007199254740992.0)),
            0);
  EXPECT_EQ(NSNumber::numberWithLongLong(9007199254740993)->hash(),
            NSNumber::numberWithDouble(9007199254740992.0)->hash());
}

TEST(Number, BooleansAreTwoSharedObjects) {
  EXPECT_EQ(NSNumber::numberWithBool(true).get(), NSNumber::trueValue());
  EXPECT_EQ(NSNumber::numberWithBool(false).get(), NSNumber::falseValue());
  EXPECT_NE(NSNumber::trueValue(), NSNumber::falseValue());
  EXPECT_TRUE(NSCounting::isImmortal(*NSNumber::trueValue()));
  EXPECT_TRUE(NSNumber::trueValue()->isBoolean());
  EXPECT_FALSE(NSNumber::numberWithLongLong(1)->isBoolean());
  EXPECT_EQ(NSNumber::trueValue()->stringValue(), "true");
  EXPECT_EQ(NSNumber::falseValue()->stringValue(), "false");
}

TEST(Number, PrintsByItsStorage) {
  EXPECT_EQ(NSNumber::numberWithLongLong(INT64_MIN)->stringValue(), "-9223372036854775808");
  EXPECT_EQ(NSNumber::numberWithUnsignedLongLong(UINT64_MAX)->stringValue(),
            "18446744073709551615");
  EXPECT_EQ(NSNumber::numberWithDouble(1e17)->stringValue(), "1e+17");
  EXPECT_EQ(NSNumber::numberWithDouble(2.5)->stringValue(), "2.5");
  EXPECT_EQ(NSNumber::numberWithFloat(0.1F)->stringValue(), "0.1");
  EXPECT_EQ(NSNumber::numberWithDouble(nan)->stringValue(), "NaN");
  EXPECT_EQ(NSNumber::numberWithDouble(infinity)->stringValue(), "INF");
  EXPECT_EQ(NSNumber::numberWithDouble(-infinity)->stringValue(), "-INF");
  EXPECT_EQ(decimal("100000000000000000000.10")->stringValue(), "100000000000000000000.1");
}

TEST(Number, ConversionsTruncateAndSaturate) {
  EXPECT_EQ(NSNumber::numberWithDouble(2.9)->longLongValue(), 2);
  EXPECT_EQ(NSNumber::numberWithDouble(-2.9)->longLongValue(), -2);
  EXPECT_EQ(NSNumber::numberWithDouble(1e30)->longLongValue(), INT64_MAX);
  EXPECT_EQ(NSNumber::numberWithDouble(-1e30)->longLongValue(), INT64_MIN);
  EXPECT_EQ(NSNumber::numberWithDouble(infinity)->longLongValue(), INT64_MAX);
  EXPECT_EQ(NSNumber::numberWithDouble(nan)->longLongValue(), 0);
  EXPECT_EQ(NSNumber::numberWithDouble(9223372036854775808.0)->longLongValue(), INT64_MAX);
  EXPECT_EQ(NSNumber::numberWithDouble(-9223372036854775808.0)->longLongValue(), INT64_MIN);
  EXPECT_EQ(NSNumber::numberWithUnsignedLongLong(UINT64_MAX)->longLongValue(), INT64_MAX);
  EXPECT_EQ(NSNumber::numberWithLongLong(-5)->unsignedLongLongValue(), 0U);
  EXPECT_EQ(NSNumber::numberWithDouble(-5)->unsignedLongLongValue(), 0U);
  EXPECT_EQ(NSNumber::numberWithDouble(1e30)->unsignedLongLongValue(), UINT64_MAX);
  EXPECT_EQ(NSNumber::numberWithDouble(18446744073709551616.0)->unsignedLongLongValue(),
            UINT64_MAX);
  EXPECT_EQ(NSNumber::numberWithDouble(1e19)->unsignedLongLongValue(), 10000000000000000000U);
  EXPECT_EQ(decimal("18446744073709551615.9")->unsignedLongLongValue(), UINT64_MAX);
  EXPECT_EQ(NSNumber::trueValue()->longLongValue(), 1);
  EXPECT_EQ(NSNumber::falseValue()->unsignedLongLongValue(), 0U);
  EXPECT_EQ(NSNumber::numberWithFloat(2.5F)->longLongValue(), 2);
}

TEST(Number, ANegativeIndexOrNaNIsHuge) {
  EXPECT_EQ(NSNumber::numberWithLongLong(-1)->unsignedIntegerValue(), UINT64_MAX);
  EXPECT_EQ(NSNumber::numberWithDouble(-0.5)->unsignedIntegerValue(), UINT64_MAX);
  EXPECT_EQ(NSNumber::numberWithDouble(nan)->unsignedIntegerValue(), UINT64_MAX);
  EXPECT_EQ(decimal("-3")->unsignedIntegerValue(), UINT64_MAX);
  EXPECT_EQ(NSNumber::numberWithDouble(3.7)->unsignedIntegerValue(), 3U);
  EXPECT_EQ(NSNumber::numberWithLongLong(0)->unsignedIntegerValue(), 0U);
}

TEST(Number, DecimalValueIsExact) {
  EXPECT_EQ(NSNumber::numberWithLongLong(INT64_MAX)->decimalValue().toString(),
            "9223372036854775807");
  EXPECT_EQ(NSNumber::numberWithUnsignedLongLong(UINT64_MAX)->decimalValue().toString(),
            "18446744073709551615");
  EXPECT_EQ(NSNumber::numberWithDouble(0.1)->decimalValue().toString(), "0.1");
  EXPECT_EQ(NSNumber::numberWithFloat(0.1F)->decimalValue().toString(), "0.1");
  EXPECT_EQ(NSNumber::trueValue()->decimalValue().toString(), "1");
  EXPECT_TRUE(NSNumber::numberWithDouble(nan)->decimalValue().isNaN());
  EXPECT_TRUE(NSNumber::numberWithFloat(static_cast<float>(nan))->decimalValue().isNaN());
  EXPECT_EQ(decimal("1e-30")->decimalValue().toString(), "0." + std::string(29, '0') + "1");
}

TEST(Number, BoolValueIsFalseForZeroAndNaN) {
  EXPECT_FALSE(NSNumber::numberWithLongLong(0)->boolValue());
  EXPECT_FALSE(NSNumber::numberWithDouble(-0.0)->boolValue());
  EXPECT_FALSE(NSNumber::numberWithDouble(nan)->boolValue());
  EXPECT_FALSE(decimal("0.0")->boolValue());
  EXPECT_FALSE(decimal("none")->boolValue());
  EXPECT_TRUE(NSNumber::numberWithDouble(0.1)->boolValue());
  EXPECT_TRUE(decimal("1e-1000")->boolValue());
  EXPECT_TRUE(NSNumber::trueValue()->boolValue());
}

TEST(Number, FloatValueIsSinglePrecision) {
  EXPECT_EQ(NSNumber::numberWithDouble(0.1)->floatValue(), 0.1F);
  EXPECT_EQ(NSNumber::numberWithFloat(0.1F)->doubleValue(), static_cast<double>(0.1F));
  EXPECT_EQ(NSNumber::numberWithDouble(1e300)->floatValue(),
            std::numeric_limits<float>::infinity());
}

TEST(DecimalNumber, IsReadFromTheLongestPrefix) {
  EXPECT_EQ(decimal("12abc")->stringValue(), "12");
  EXPECT_EQ(decimal("abc")->stringValue(), "NaN");
  EXPECT_TRUE(isa<NSDecimalNumber>(static_cast<NSObject*>(decimal("1").get())));
  EXPECT_EQ(NSDecimalNumber::decimalNumberWithDecimal(NSDecimal(4))->stringValue(), "4");
}

}  // namespace
}  // namespace xquery
