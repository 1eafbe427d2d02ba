#include "Platform/Base/LastingObjects.h"
#include "xquery/Number.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <fstream>
#include <optional>
#include <set>
#include <thread>
#include <unistd.h>
#include <vector>

namespace xquery {
namespace {

Ref<NSNumber> number(bool lasting) {
  std::optional<LastingObjects> time;
  if (lasting) time.emplace();
  return NSNumber::numberWithLongLong(1);
}

#ifndef XQUERY_SANITIZED

// More than any thread and the process keep ready.
constexpr int manyNumbers = 100000;
constexpr uintptr_t lineBytes = 64;

TEST(LastingObjects, NoneSharesALineWithWhatComesAndGoes) {
  std::vector<Ref<NSNumber>> ready, kept;
  for (int i = 0; i < 2 * manyNumbers; ++i) ready.push_back(number(i % 2 == 0));
  std::set<uintptr_t> lines[2];
  for (int i = 0; i < 1000; ++i) {
    kept.push_back(number(i % 2 == 0));
    lines[i % 2].insert(reinterpret_cast<uintptr_t>(kept.back().get()) / lineBytes);
  }
  for (const uintptr_t line : lines[0]) EXPECT_FALSE(lines[1].contains(line));
}

size_t residentBytes() {
  std::ifstream file("/proc/self/statm");
  size_t all = 0, resident = 0;
  file >> all >> resident;
  return resident * static_cast<size_t>(::sysconf(_SC_PAGESIZE));
}

// In either direction, and by the same thread or another.
TEST(LastingObjects, WhatIsMadeForOneUseAndFreedForTheOtherIsUsedAgain) {
  std::vector<Ref<NSNumber>> numbers;
  const auto makeAndFree = [&numbers](bool lasting) {
    for (int i = 0; i < 10000; ++i) numbers.push_back(number(lasting));
    std::optional<LastingObjects> time;
    if (!lasting) time.emplace();
    numbers.clear();
  };
  for (const bool lasting : {false, true}) {
    makeAndFree(lasting);
    const size_t before = residentBytes();
    for (int round = 0; round < 50; ++round) makeAndFree(lasting);
    EXPECT_LT(residentBytes(), before + 50 * 10000 * sizeof(NSNumber) / 4);
  }
}

#endif

TEST(LastingObjects, TimesNestAndBelongToAThread) {
  std::vector<Ref<NSNumber>> numbers;
  {
    const LastingObjects outer;
    numbers.push_back(number(true));
    std::thread([&numbers] {
      numbers.push_back(number(false));
      const LastingObjects own;
      numbers.push_back(number(true));
    }).join();
    numbers.push_back(number(true));
  }
  for (const auto& made : numbers) EXPECT_EQ(made->longLongValue(), 1);
}

}  // namespace
}  // namespace xquery
