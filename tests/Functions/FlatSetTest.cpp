#include "Functions/FlatSet.h"
#include "Functions/FunctionsTesting.h"

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

TEST(FlatSet, VisitingCanBeEnded) {
  Numbers<UINT64_MAX> set;
  for (uint64_t key = 0; key < 10000; ++key) set.insert(key);
  size_t visited = 0;
  const functiontest::WorkEnder ender(3);
  EXPECT_THROW(set.forEach([&](uint64_t) { ++visited; }), functiontest::WorkEnded);
  EXPECT_LT(visited, 4 * WorkPacer::turnsPerStep);
}

TEST(FlatSet, GrowingCanBeEnded) {
  Numbers<UINT64_MAX> set;
  uint64_t key = 0;
  for (; key < 30000; ++key) set.insert(key);
  // Only a doubling looks: that of 65,536 slots 256 times.
  const functiontest::WorkEnder ender(100);
  EXPECT_THROW(while (key < 60000) set.insert(key++), functiontest::WorkEnded);
  EXPECT_GT(key, 32000U);
  EXPECT_LT(key, 35000U);
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
