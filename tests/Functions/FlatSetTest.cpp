#include "Functions/FlatSet.h"

#include <gtest/gtest.h>

#include <functional>
#include <random>
#include <set>
#include <vector>

namespace xquery {
namespace {

// Keys whose hashes meet as often as `mask` has zeros.
template <uint64_t mask>
struct Masked {
  uint64_t operator()(uint64_t key) const { return key & mask; }
};

template <uint64_t mask>
using Numbers = FlatSet<uint64_t, Masked<mask>, std::equal_to<>, std::less<>>;

template <uint64_t mask>
void expectTheAnswersOfAnOrderedSet(unsigned seed, size_t count, uint64_t range) {
  std::mt19937_64 random(seed);
  Numbers<mask> set;
  std::set<uint64_t> plain;
  for (size_t index = 0; index < count; ++index) {
    // Multiples of a power of two share their lower bits.
    const uint64_t asked = (random() % range) << (random() % 2 ? 0 : 40);
    ASSERT_EQ(set.contains(asked), plain.contains(asked));
    const uint64_t key = (random() % range) << (random() % 2 ? 0 : 40);
    ASSERT_EQ(set.insert(key), plain.insert(key).second) << index;
    ASSERT_FALSE(set.empty());
  }
  std::set<uint64_t> visited;
  set.forEach([&](uint64_t key) { visited.insert(key); });
  EXPECT_EQ(visited, plain);
}

TEST(FlatSet, AnswersWhatAnOrderedSetAnswers) {
  expectTheAnswersOfAnOrderedSet<UINT64_MAX>(1, 20000, 30000);
  expectTheAnswersOfAnOrderedSet<UINT64_MAX>(2, 2000, 10);
}

TEST(FlatSet, KeysWhoseHashesMeetAreToldApart) {
  expectTheAnswersOfAnOrderedSet<0>(3, 3000, 5000);
  expectTheAnswersOfAnOrderedSet<7>(4, 5000, 9000);
  expectTheAnswersOfAnOrderedSet<0x3F>(5, 20000, 30000);
}

TEST(FlatSet, IsEmptyAtFirst) {
  const Numbers<UINT64_MAX> set;
  EXPECT_TRUE(set.empty());
  EXPECT_FALSE(set.contains(0));
}

TEST(FlatSet, KeepsTheOrderOfInsertion) {
  Numbers<UINT64_MAX> set;
  for (const uint64_t key : {5, 3, 9, 3, 1}) set.insert(key);
  std::vector<uint64_t> keys;
  set.forEach([&](uint64_t key) { keys.push_back(key); });
  EXPECT_EQ(keys, (std::vector<uint64_t>{5, 3, 9, 1}));
}

// Counts how often two keys are looked at together.
struct Looks {
  static inline size_t count = 0;
};
struct CountedEqual : Looks {
  bool operator()(uint64_t a, uint64_t b) const { return ++count, a == b; }
};
struct CountedLess : Looks {
  bool operator()(uint64_t a, uint64_t b) const { return ++count, a < b; }
};

TEST(FlatSet, KeysOfOneHashCostALogarithm) {
  constexpr uint64_t keys = 20000;
  FlatSet<uint64_t, Masked<0>, CountedEqual, CountedLess> set;
  Looks::count = 0;
  for (uint64_t key = 0; key < keys; ++key) EXPECT_TRUE(set.insert(key));
  for (uint64_t key = 0; key < keys; ++key) EXPECT_FALSE(set.insert(key));
  // 128 along the slots and some 15 for each way down the order; all pairs are 15,000 for a key.
  EXPECT_LT(Looks::count / (2 * keys), 200U);
}

}  // namespace
}  // namespace xquery
