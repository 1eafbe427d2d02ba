#include "Eval/StackGuard.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

constexpr uintptr_t base = 0x10000000;
constexpr size_t kibibyte = 1024;
constexpr size_t gibibyte = size_t{1} << 30;

size_t usedOf(size_t size) {
  return base + size - XQueryLowestStackAddress(base, size);
}

TEST(StackGuard, LeavesThePartBelowTheDeepestFrameFree) {
  const size_t kept = XQueryLowestStackAddress(base, 8192 * kibibyte) - base;
  EXPECT_GE(kept, 256 * kibibyte);
  EXPECT_EQ(XQueryLowestStackAddress(base, gibibyte) - base, kept);
  EXPECT_EQ(XQueryLowestStackAddress(base, 60 * gibibyte) - base, kept);
}

TEST(StackGuard, OfASmallStackHalfIsUsed) {
  EXPECT_EQ(usedOf(128 * kibibyte), 64 * kibibyte);
  EXPECT_EQ(usedOf(0), 0U);
}

TEST(StackGuard, OfAStackWithoutALimitAGibibyteIsUsed) {
  EXPECT_EQ(usedOf(64 * gibibyte), gibibyte);
  EXPECT_EQ(usedOf(100000 * gibibyte), gibibyte);
}

}  // namespace
}  // namespace xquery
