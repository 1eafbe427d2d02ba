#include "Types/SafeNSArrayAdd.h"
#include "TypesTestSupport.h"

namespace xquery {
namespace {

using testing::text;

TEST(SafeNSArrayAdd, IndexZeroStoresNothing) {
  std::vector<Value> array;
  SafeNSArrayAdd(array, text("a"), 0);
  EXPECT_TRUE(array.empty());
}

TEST(SafeNSArrayAdd, TheArrayIsPaddedWithNullUpToTheIndex) {
  std::vector<Value> array;
  const Value object = text("a");
  SafeNSArrayAdd(array, object, 3);
  ASSERT_EQ(array.size(), 4U);
  for (size_t index = 0; index < 3; ++index) EXPECT_EQ(array[index].get(), NSNull::null());
  EXPECT_EQ(array[3], object);
}

TEST(SafeNSArrayAdd, AnElementAtTheIndexIsReplaced) {
  std::vector<Value> array;
  const Value first = text("a");
  const Value second = text("b");
  SafeNSArrayAdd(array, first, 2);
  SafeNSArrayAdd(array, first, 1);
  SafeNSArrayAdd(array, second, 1);
  ASSERT_EQ(array.size(), 3U);
  EXPECT_EQ(array[1], second);
  EXPECT_EQ(array[2], first);
}

}  // namespace
}  // namespace xquery
