#include "Platform/Base/Stack.h"
#include "Platform/Base/StackTestSupport.h"
#include "Platform/Base/WorkMeter.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <thread>

namespace xquery {
namespace {

constexpr size_t wanted = size_t{1} << 20;

TEST(Stack, WhatIsLeftIsLessThanTheWholeAndShrinks) {
  onStack(wanted, [] {
    const size_t left = stackLeft();
    EXPECT_LT(left, wanted);
    EXPECT_GT(left, wanted / 2);
    volatile char used[wanted / 4];
    used[0] = 0;
    const auto deeper = [&]() __attribute__((noinline)) {
      return stackLeft() + used[0];
    };
    EXPECT_LE(deeper(), left);
  });
}

TEST(Stack, AFunctionRunsWhereEnoughIsLeft) {
  for (const size_t size : {wanted / 8, wanted * 8}) {
    onStack(size, [&] {
      const auto here = std::this_thread::get_id();
      size_t left = 0;
      auto there = here;
      withStack(wanted, [&] {
        left = stackLeft();
        there = std::this_thread::get_id();
      });
      EXPECT_GE(left, wanted);
      EXPECT_EQ(there == here, size > wanted);
    });
  }
}

TEST(Stack, WhatAFunctionCountsAndThrowsIsItsCallers) {
  onStack(wanted / 8, [] {
    const WorkMeter before = workMeter;
    workMeter.stepsLeft = 1000;
    EXPECT_THROW(withStack(wanted,
                           [] {
                             chargeWork(10);
                             countValueBytes(100);
                             throw std::runtime_error("thrown");
                           }),
                 std::runtime_error);
    EXPECT_EQ(workMeter.stepsLeft, 990);
    EXPECT_EQ(workMeter.valueBytes, before.valueBytes + 100);
    EXPECT_EQ(workMeter.stackLimit, before.stackLimit);
    workMeter = before;
  });
}

}  // namespace
}  // namespace xquery
