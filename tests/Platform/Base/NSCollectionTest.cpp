#include "Platform/Base/Counting.h"
#include "xquery/Collection.h"
#include "xquery/Data.h"
#include "xquery/Number.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

TEST(Collection, ArrayAnswersNullPastItsEnd) {
  const Ref<NSArray> array =
      NSArray::arrayWithObjects({NSNumber::trueValue(), NSNumber::falseValue()});
  EXPECT_EQ(array->count(), 2U);
  EXPECT_EQ(array->objectAtIndex(0), NSNumber::trueValue());
  EXPECT_EQ(array->objectAtIndex(1), NSNumber::falseValue());
  EXPECT_EQ(array->objectAtIndex(2), nullptr);
  EXPECT_EQ(array->objectAtIndex(SIZE_MAX), nullptr);
}

TEST(Collection, NewArrayIsEmpty) {
  EXPECT_EQ(NSArray::array()->count(), 0U);
}

TEST(Collection, ArrayKeepsItsElementsAlive) {
  Ref<NSNumber> number = NSNumber::numberWithLongLong(5);
  Ref<NSArray> array = NSArray::arrayWithObjects({number});
  EXPECT_FALSE(NSCounting::hasOneReference(*number));
  array = nullptr;
  EXPECT_TRUE(NSCounting::hasOneReference(*number));
}

TEST(Collection, PartsOfDataEndWhereTheDataDoes) {
  const Ref<NSData> data = NSData::dataWithBytes("abc");
  EXPECT_EQ(data->subdataWithRange(1, 1)->bytes(), "b");
  EXPECT_EQ(data->subdataWithRange(1, SIZE_MAX)->bytes(), "bc");
  EXPECT_EQ(data->subdataWithRange(3, 1)->length(), 0U);
  EXPECT_EQ(data->subdataWithRange(4, 1)->length(), 0U);
  EXPECT_EQ(data->subdataWithRange(SIZE_MAX, SIZE_MAX)->length(), 0U);
}

TEST(Collection, NullIsOneObject) {
  EXPECT_EQ(NSNull::null(), NSNull::null());
  EXPECT_EQ(NSNull::null()->kind(), Kind::Null);
}

}  // namespace
}  // namespace xquery
