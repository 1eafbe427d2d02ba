#include "xquery/Result.h"
#include "xquery/String.h"

#include <gtest/gtest.h>

#include <memory>

namespace xquery {
namespace {

Ref<XQueryError> failure() {
  return XQueryError::error(6, "no");
}

TEST(XQueryResult, HoldsAValueOrAnError) {
  const XQueryResult<int> good = 7;
  ASSERT_TRUE(good);
  EXPECT_EQ(*good, 7);
  EXPECT_EQ(good.valueOr(1), 7);
  EXPECT_FALSE(good.error());
  const XQueryResult<int> bad = failure();
  EXPECT_FALSE(bad);
  EXPECT_EQ(bad.valueOr(1), 1);
  EXPECT_EQ(bad.error()->msg()->utf8(), "no");
}

TEST(XQueryResult, OfAnObjectTakesAnyOfItsClassesAndTellsErrorsApart) {
  const XQueryResult<Value> good = NSString::stringWithASCII("a");
  ASSERT_TRUE(good);
  EXPECT_TRUE(isa<NSString>(*good));
  const XQueryResult<Value> bad = failure();
  EXPECT_FALSE(bad);
}

TEST(XQueryResult, GivesItsValueAway) {
  XQueryResult<std::unique_ptr<int>> result = std::make_unique<int>(7);
  EXPECT_EQ(**result, 7);
  const std::unique_ptr<int> taken = *std::move(result);
  EXPECT_EQ(*taken, 7);
}

TEST(XQueryResult, OfNothingIsDoneOrNot) {
  EXPECT_TRUE(XQueryResult<void>());
  const XQueryResult<void> bad = failure();
  EXPECT_FALSE(bad);
  EXPECT_TRUE(bad.error());
}

TEST(XQueryResultDeathTest, AFailureAskedForItsValueEndsTheProgram) {
  const XQueryResult<int> bad = failure();
  EXPECT_DEATH({ [[maybe_unused]] const int value = *bad; }, "");
}

}  // namespace
}  // namespace xquery
