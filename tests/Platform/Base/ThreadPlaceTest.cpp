#include "Platform/Base/ThreadPlace.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <barrier>
#include <bit>
#include <thread>
#include <vector>

namespace xquery {
namespace {

// The places of that many threads which run at the same time.
std::vector<uint32_t> placesOf(uint32_t threadCount) {
  std::vector<uint32_t> places(threadCount);
  std::barrier together(threadCount);
  std::vector<std::thread> threads;
  for (uint32_t& place : places) {
    threads.emplace_back([&together, &place] {
      place = threadPlace();
      together.arrive_and_wait();
    });
  }
  for (auto& thread : threads) thread.join();
  std::sort(places.begin(), places.end());
  return places;
}

TEST(ThreadPlace, ThereIsAPowerOfTwoOfThem) {
  EXPECT_TRUE(std::has_single_bit(threadPlaceCount()));
  EXPECT_GE(threadPlaceCount(), 8U);
  EXPECT_LE(threadPlaceCount(), mostThreadPlaces);
}

TEST(ThreadPlace, AThreadKeepsItsPlace) {
  EXPECT_LT(threadPlace(), threadPlaceCount());
  EXPECT_EQ(threadPlace(), threadPlace());
}

// Again and again, since places are left to others when threads end.
TEST(ThreadPlace, ThreadsShareAPlaceOnlyWhereThereAreMoreThanPlaces) {
  const uint32_t own = threadPlace();
  for (int round = 0; round < 5; ++round) {
    std::vector<uint32_t> few = placesOf(threadPlaceCount() - 1);
    EXPECT_EQ(std::count(few.begin(), few.end(), own), 0);
    EXPECT_EQ(std::unique(few.begin(), few.end()), few.end());
    const std::vector<uint32_t> many = placesOf(threadPlaceCount() * 2 - 1);
    for (uint32_t place = 0; place < threadPlaceCount(); ++place) {
      EXPECT_EQ(std::count(many.begin(), many.end(), place), place == own ? 1 : 2);
    }
  }
}

}  // namespace
}  // namespace xquery
