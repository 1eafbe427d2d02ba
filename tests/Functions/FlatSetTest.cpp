#include "Functions/FlatSet.h"

#include <gtest/gtest.h>

#include <random>
#include <set>

namespace xquery {
namespace {

struct Identity {
  uint64_t operator()(uint64_t key) const { return key; }
};
struct OneForAll {
  uint64_t operator()(uint64_t) const { return 7; }
};

template <class Hash>
using Numbers = FlatSet<uint64_t, Hash, std::equal_to<>>;

TEST(FlatSet, HoldsNothingAtFirst) {
  Numbers<Identity> set;
  EXPECT_TRUE(set.empty());
  EXPECT_FALSE(set.contains(0));
}

TEST(FlatSet, TakesEachKeyOnce) {
  Numbers<Identity> set;
  EXPECT_TRUE(set.insert(0));
  EXPECT_TRUE(set.insert(1));
  EXPECT_FALSE(set.insert(0));
  EXPECT_TRUE(set.contains(1));
  EXPECT_FALSE(set.contains(2));
}

TEST(FlatSet, KeepsTheOrderOfInsertion) {
  Numbers<Identity> set;
  for (const uint64_t key : {5, 3, 9, 3, 1}) set.insert(key);
  std::vector<uint64_t> keys;
  for (const auto& entry : set) keys.push_back(entry.key);
  EXPECT_EQ(keys, (std::vector<uint64_t>{5, 3, 9, 1}));
}

template <class Hash>
void compareWithPlainSet(uint64_t bound, int count) {
  std::mt19937_64 random(2004);
  Numbers<Hash> set;
  std::set<uint64_t> plain;
  for (int round = 0; round < count; ++round) {
    // Multiples of a power of two share their lower bits.
    const uint64_t key = (random() % bound) << (random() % 2 ? 0 : 40);
    ASSERT_EQ(set.contains(key), plain.contains(key));
    ASSERT_EQ(set.insert(key), plain.insert(key).second);
    ASSERT_TRUE(set.contains(key));
  }
}

TEST(FlatSet, AnswersAsAPlainSetDoes) {
  compareWithPlainSet<Identity>(50000, 100000);
}

TEST(FlatSet, KeysOfOneHashAreToldApart) {
  compareWithPlainSet<OneForAll>(300, 2000);
}

}  // namespace
}  // namespace xquery
