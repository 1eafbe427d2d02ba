#include "Platform/Base/KeyedHash.h"

#include <gtest/gtest.h>

#include <set>

namespace xquery {
namespace {

TEST(KeyedHash, IsTheSameAsLongAsTheProcessLives) {
  EXPECT_EQ(keyedHash(7), keyedHash(7));
  EXPECT_NE(keyedHash(7), keyedHash(8));
}

// Multiplied by a number that everybody knows, these agree in their upper halves.
TEST(KeyedHash, NumbersMadeToMeetInAnUnkeyedHashDoNotMeet) {
  constexpr uint64_t multiplier = 0x9E3779B97F4A7C15U;
  uint64_t inverse = multiplier;  // each step doubles the number of bits that are right
  for (int step = 0; step < 5; ++step) inverse *= 2 - multiplier * inverse;
  ASSERT_EQ(inverse * multiplier, 1U);
  constexpr size_t count = 5000;
  std::set<uint64_t> unkeyed;
  std::set<uint32_t> keyed;
  for (uint64_t low = 0; low < count; ++low) {
    const uint64_t number = inverse * (uint64_t{12345} << 32 | low);
    unkeyed.insert(number * multiplier >> 32);
    keyed.insert(static_cast<uint32_t>(keyedHash(number)));
  }
  EXPECT_EQ(unkeyed.size(), 1U);
  EXPECT_GE(keyed.size(), count - 2);
}

TEST(KeyedHash, DependsOnEveryBit) {
  std::set<uint32_t> hashes = {static_cast<uint32_t>(keyedHash(0))};
  for (int bit = 0; bit < 64; ++bit) {
    hashes.insert(static_cast<uint32_t>(keyedHash(uint64_t{1} << bit)));
  }
  EXPECT_EQ(hashes.size(), 65U);
}

}  // namespace
}  // namespace xquery
