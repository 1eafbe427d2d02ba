#include "Platform/Base/Counting.h"
#include "xquery/Collection.h"
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

TEST(Collection, NullIsOneObject) {
  EXPECT_EQ(NSNull::null(), NSNull::null());
  EXPECT_EQ(NSNull::null()->kind(), Kind::Null);
}

}  // namespace
}  // namespace xquery
