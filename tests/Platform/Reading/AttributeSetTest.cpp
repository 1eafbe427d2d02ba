#include "Platform/Reading/AttributeSet.h"

#include <gtest/gtest.h>

#include <cstdint>

namespace xquery {
namespace {

// Names are compared by their addresses only.
const void* name(size_t index) {
  return reinterpret_cast<const void*>(0x1000 + index * 64);
}

TEST(AttributeSet, HoldsEachNameOnce) {
  AttributeSet set;
  for (const size_t count : {1, 2, 15, 16, 17, 18, 100, 5000, 3}) {
    set.start(count);
    for (size_t index = 0; index < count; ++index) {
      EXPECT_TRUE(set.insert(name(index))) << index << " of " << count;
    }
    set.start(count + 2);
    for (size_t index = 0; index < count; ++index) EXPECT_TRUE(set.insert(name(index)));
    EXPECT_FALSE(set.insert(name(0))) << count;
    EXPECT_FALSE(set.insert(name(count - 1))) << count;
  }
}

}  // namespace
}  // namespace xquery
