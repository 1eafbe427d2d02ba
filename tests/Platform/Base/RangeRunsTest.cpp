#include "Platform/Base/RangeRuns.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cinttypes>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <map>
#include <new>
#include <random>
#include <string>
#include <sys/mman.h>
#include <thread>
#include <vector>

// There where AddressSanitizer is.
extern "C" int __asan_address_is_poisoned(const volatile void* address) __attribute__((weak));

namespace xquery {
namespace {

constexpr size_t mebibyte = size_t{1} << 20;

struct Taken {
  size_t bytes;
  unsigned char filling;
};

class Blocks {
 public:
  explicit Blocks(size_t mostBytes) : runs(mostBytes) {}

  // Whether there was room.
  bool take(size_t bytes) {
    try {
      fill(runs.take(bytes), bytes);
      return true;
    } catch (const std::bad_alloc&) {
      return false;
    }
  }
  void takeChain(size_t bytes, size_t count) {
    for (RangeRuns::Block* block = runs.takeChain(bytes, count); block;) {
      RangeRuns::Block* const next = block->next;
      fill(block, bytes);
      block = next;
    }
  }
  void give(size_t place) {
    const auto found = std::next(taken.begin(), static_cast<ptrdiff_t>(place % taken.size()));
    expectFilled(*found);
    runs.give(found->first);
    taken.erase(found);
  }
  void giveAll() {
    while (!taken.empty()) give(0);
  }
  void expectApart() {
    const char* end = nullptr;
    for (const auto& [address, block] : taken) {
      ASSERT_LE(end, address);
      ASSERT_EQ(reinterpret_cast<uintptr_t>(address) % 8, 0u);
      ASSERT_GE(RangeRuns::bytesOf(RangeRuns::unitsOf(address)), block.bytes);
      end = address + RangeRuns::bytesOf(RangeRuns::unitsOf(address));
    }
  }

  RangeRuns runs;
  std::map<char*, Taken> taken;

 private:
  void fill(void* memory, size_t bytes) {
    const auto filling = static_cast<unsigned char>(++_count);
    std::memset(memory, filling, bytes);
    ASSERT_TRUE(taken.emplace(static_cast<char*>(memory), Taken{bytes, filling}).second);
  }
  static void expectFilled(const std::pair<char* const, Taken>& block) {
    const auto* const bytes = reinterpret_cast<const unsigned char*>(block.first);
    // All are like the first, and that is like what was put there.
    const bool isFilled =
        block.second.bytes == 0 || (bytes[0] == block.second.filling &&
                                    std::memcmp(bytes, bytes + 1, block.second.bytes - 1) == 0);
    ASSERT_TRUE(isFilled);
  }
  size_t _count = 0;
};

TEST(RangeRuns, BlocksAreApartAndKeepWhatIsInThem) {
  for (uint32_t seed = 0; seed < 12; ++seed) {
    std::mt19937 random(seed);
    Blocks blocks(8 * mebibyte);
    for (int step = 0; step < 1500; ++step) {
      switch (random() % 6) {
        case 0:
          blocks.takeChain(1 + random() % 500, 1 + random() % 40);
          break;
        case 1:
          blocks.take(random() % (200 << 10));
          break;
        case 2:
          blocks.take(random() % 3000);
          break;
        default:
          for (int count = 0; count < 6 && !blocks.taken.empty(); ++count) blocks.give(random());
      }
    }
    ASSERT_NO_FATAL_FAILURE(blocks.expectApart()) << seed;
    blocks.giveAll();
    EXPECT_TRUE(blocks.take(7 * mebibyte)) << "what was given back is one again, seed " << seed;
    blocks.giveAll();
  }
}

TEST(RangeRuns, AFullRangeRefusesUntilSomethingIsGivenBack) {
  for (const size_t bytes : {24u, 100u, 1000u, 70000u}) {
    Blocks blocks(mebibyte);
    while (blocks.take(bytes)) {
    }
    EXPECT_GE(blocks.taken.size() * RangeRuns::unitsFor(bytes) * RangeRuns::unit,
              mebibyte * 9 / 10);
    EXPECT_FALSE(blocks.take(bytes));
    blocks.give(blocks.taken.size() / 2);
    EXPECT_TRUE(blocks.take(bytes)) << bytes;
    blocks.giveAll();
    EXPECT_FALSE(blocks.take(2 * mebibyte));
    EXPECT_TRUE(blocks.take(mebibyte * 9 / 10)) << bytes;
    blocks.giveAll();
  }
}

TEST(RangeRuns, WhatIsLargerThanAnyRangeIsRefused) {
  Blocks blocks(mebibyte);
  for (const size_t bytes : {RangeRuns::windowBytes, RangeRuns::windowBytes - 1, SIZE_MAX - 40}) {
    EXPECT_FALSE(blocks.take(bytes));
  }
}

TEST(RangeRuns, ARangeLiesWithinOneWindow) {
  for (const size_t bytes : {mebibyte, 1000 * mebibyte, RangeRuns::windowBytes}) {
    Blocks blocks(bytes);
    EXPECT_GE(blocks.runs.size(), bytes / 2);
    EXPECT_LE(blocks.runs.size(), bytes);
    blocks.take(100);
    const auto first = reinterpret_cast<uintptr_t>(blocks.taken.begin()->first);
    EXPECT_NE(first % RangeRuns::windowBytes, 0u) << "0 stands for nothing";
    EXPECT_EQ(first / RangeRuns::windowBytes,
              (first + blocks.runs.size() - 100) / RangeRuns::windowBytes);
    blocks.giveAll();
  }
}

bool isInMemory(const char* address) {
  unsigned char answer = 0;
  auto* const page =
      const_cast<char*>(address) - reinterpret_cast<uintptr_t>(address) % size_t{4096};
  EXPECT_EQ(::mincore(page, 4096, &answer), 0);
  return (answer & 1) != 0;
}

// How much of the mapping that the address is in the system may take without asking, as far as it
// has counted: it does so some pages late.
size_t offeredBytesAround(const char* address) {
  std::ifstream maps("/proc/self/smaps");
  const auto wanted = reinterpret_cast<uintptr_t>(address);
  bool isThere = false;
  for (std::string line; std::getline(maps, line);) {
    uintptr_t begin = 0, end = 0;
    size_t kibibytes = 0;
    if (std::sscanf(line.c_str(), "%" SCNxPTR "-%" SCNxPTR " ", &begin, &end) == 2) {
      isThere = begin <= wanted && wanted < end;
    } else if (isThere && std::sscanf(line.c_str(), "LazyFree: %zu kB", &kibibytes) == 1) {
      return kibibytes * 1024;
    }
  }
  return 0;
}

// What the system was told since it was last asked for.
struct Advised {
  const char* begin;
  size_t bytes;
  int advice;
};
std::vector<Advised> advised;

int adviseAndNote(void* begin, size_t bytes, int advice) noexcept {
  advised.push_back({static_cast<const char*>(begin), bytes, advice});
  return ::madvise(begin, bytes, advice);
}
int refuseOffers(void* begin, size_t bytes, int advice) noexcept {
  advised.push_back({static_cast<const char*>(begin), bytes, advice});
  return advice == MADV_FREE ? -1 : ::madvise(begin, bytes, advice);
}

// Of a block, without what shares a large page with something else.
size_t advisedBytes(int advice, const char* begin, size_t bytes) {
  size_t sum = 0;
  for (const Advised& each : advised) {
    const char* const from = std::max(begin, each.begin);
    const char* const to = std::min(begin + bytes, each.begin + each.bytes);
    if (each.advice == advice && from < to) sum += static_cast<size_t>(to - from);
  }
  return sum;
}

void expectOffered(const char* begin, size_t bytes) {
  EXPECT_GT(advisedBytes(MADV_FREE, begin, bytes), bytes - 4 * mebibyte);
  EXPECT_EQ(advisedBytes(MADV_DONTNEED, begin, bytes), 0u) << "they are not given back at once";
}

TEST(RangeRuns, LargeBlocksAreOfferedToTheSystemAndGoBackWithOthersOnRequest) {
  RangeRuns runs(256 * mebibyte, adviseAndNote);
  for (const bool isLarge : {true, false}) {
    const size_t bytes = isLarge ? 60 * mebibyte : 20 * mebibyte;
    auto* const block = static_cast<char*>(runs.take(bytes));
    void* const after = runs.take(100);
    std::memset(block, 1, bytes);
    EXPECT_TRUE(isInMemory(block + bytes / 2));
    EXPECT_EQ(offeredBytesAround(block), 0u);
    advised.clear();
    runs.give(block);
    if (isLarge) {
      expectOffered(block, bytes);
    } else {
      EXPECT_TRUE(advised.empty());
      EXPECT_TRUE(isInMemory(block + bytes / 2));
    }
    runs.giveBackIdle();
    EXPECT_GT(advisedBytes(MADV_DONTNEED, block, bytes), bytes - mebibyte);
    EXPECT_FALSE(isInMemory(block + bytes / 2));
    runs.give(after);
  }
}

// A system that knows no offers.
TEST(RangeRuns, WhatCannotBeOfferedGoesBackAtOnce) {
  RangeRuns runs(256 * mebibyte, refuseOffers);
  constexpr size_t bytes = 60 * mebibyte;
  auto* const block = static_cast<char*>(runs.take(bytes));
  void* const after = runs.take(100);
  std::memset(block, 1, bytes);
  advised.clear();
  runs.give(block);
  EXPECT_GT(advisedBytes(MADV_DONTNEED, block, bytes), bytes - 4 * mebibyte);
  EXPECT_FALSE(isInMemory(block + bytes / 2));
  runs.give(after);
}

// Whoever takes it next finds room that stays its own.
TEST(RangeRuns, WhatWasOfferedIsTakenAgain) {
  RangeRuns runs(256 * mebibyte);
  constexpr size_t bytes = 60 * mebibyte;
  auto* const block = static_cast<char*>(runs.take(bytes));
  void* const after = runs.take(100);
  std::memset(block, 1, bytes);
  runs.give(block);
  auto* const again = static_cast<char*>(runs.take(bytes));
  EXPECT_EQ(again, block);
  std::memset(again, 2, bytes);
  EXPECT_EQ(offeredBytesAround(again), 0u);
  EXPECT_EQ(std::count(again, again + bytes, 2), static_cast<ptrdiff_t>(bytes));
  runs.give(again);
  runs.give(after);
}

// What shares a large page with something that is in use is not offered, so that the page remains
// one.
TEST(RangeRuns, LargePagesAreOfferedAsAWhole) {
  RangeRuns runs(256 * mebibyte, adviseAndNote);
  std::vector<void*> blocks;
  for (int count = 0; count < 100; ++count) {
    blocks.push_back(runs.take(mebibyte));
    std::memset(blocks.back(), 1, mebibyte);
  }
  auto* const used = static_cast<char*>(runs.take(100));
  void* const larger = runs.take(60 * mebibyte);
  advised.clear();
  for (void* const block : blocks) runs.give(block);
  runs.give(larger);  // whose room is that of what is kept
  expectOffered(static_cast<char*>(blocks[0]), 60 * mebibyte);
  constexpr size_t largePage = 2 * mebibyte;
  for (const Advised& each : advised) {
    EXPECT_EQ(reinterpret_cast<uintptr_t>(each.begin) % largePage, 0u);
    EXPECT_EQ(each.bytes % largePage, 0u);
  }
  const char* const page = used - reinterpret_cast<uintptr_t>(used) % largePage;
  EXPECT_EQ(advisedBytes(MADV_FREE, page, largePage), 0u) << "something in it is in use";
  EXPECT_TRUE(isInMemory(page));
}

TEST(RangeRuns, ThreadsMayTakeAndGiveAtOnce) {
  RangeRuns runs(64 * mebibyte);
  const auto work = [&runs](uint32_t seed) {
    std::mt19937 random(seed);
    std::vector<std::pair<uint32_t*, uint32_t>> taken;
    for (uint32_t step = 0; step < 4000; ++step) {
      if (taken.size() < 50 && random() % 2) {
        auto* const block = static_cast<uint32_t*>(runs.take(4 + random() % 2000));
        *block = seed * 10000 + step;
        taken.emplace_back(block, *block);
      } else if (!taken.empty()) {
        const auto [block, value] = taken.back();
        taken.pop_back();
        ASSERT_EQ(*block, value);
        runs.give(block);
      }
    }
    for (const auto& [block, value] : taken) {
      ASSERT_EQ(*block, value);
      runs.give(block);
    }
  };
  std::vector<std::thread> threads;
  for (uint32_t seed = 1; seed <= 4; ++seed) threads.emplace_back(work, seed);
  for (std::thread& thread : threads) thread.join();
  runs.giveBackIdle();
  EXPECT_NO_THROW(runs.give(runs.take(60 * mebibyte))) << "all of it is free again";
}

TEST(RangeRuns, AFreeBlockIsOutOfBoundsWhereThatIsWatched) {
  if (!__asan_address_is_poisoned) GTEST_SKIP() << "without AddressSanitizer";
  RangeRuns runs(mebibyte);
  auto* const block = static_cast<char*>(runs.take(1000));
  EXPECT_FALSE(__asan_address_is_poisoned(block + 100));
  runs.give(block);
  EXPECT_TRUE(__asan_address_is_poisoned(block + 100));
  void* const other = runs.take(1000);
  EXPECT_NE(other, block) << "it is not used again at once";
  EXPECT_TRUE(__asan_address_is_poisoned(block + 100));
  runs.give(other);
}

}  // namespace
}  // namespace xquery
