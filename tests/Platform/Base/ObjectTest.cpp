#include "Platform/Base/Counting.h"
#include "xquery/Collection.h"
#include "xquery/Memory.h"
#include "xquery/Number.h"
#include "xquery/Object.h"

#include <gtest/gtest.h>

#include <array>
#include <atomic>
#include <fstream>
#include <set>
#include <thread>
#include <unistd.h>
#include <vector>

namespace xquery {
namespace {

int livingObjects = 0;

// One more block size than the free lists serve.
template <size_t Bytes>
class Sized : public NSCounted {
 public:
  explicit Sized(unsigned char fill) : NSCounted(Kind::Internal) {
    ++livingObjects;
    _bytes.fill(fill);
  }
  ~Sized() override { --livingObjects; }
  bool holds(unsigned char fill) const {
    for (const unsigned char byte : _bytes) {
      if (byte != fill) return false;
    }
    return true;
  }

 private:
  std::array<unsigned char, Bytes> _bytes;
};

class Link : public NSCounted {
 public:
  explicit Link(Value next) : NSCounted(Kind::Internal), _next(std::move(next)) { ++livingObjects; }
  ~Link() override { --livingObjects; }

 private:
  Value _next;
};

template <size_t Bytes>
void keepManyAndCheck() {
  std::vector<Ref<Sized<Bytes>>> objects;
  for (int round = 0; round < 3; ++round) {
    for (int index = 0; index < 2000; ++index) {
      objects.push_back(make<Sized<Bytes>>(static_cast<unsigned char>(index)));
    }
    for (size_t index = 0; index < objects.size(); ++index) {
      ASSERT_TRUE(objects[index]->holds(static_cast<unsigned char>(index % 2000)));
    }
    EXPECT_EQ(livingObjects, 2000);
    objects.clear();
    EXPECT_EQ(livingObjects, 0);
  }
}

TEST(Object, BlocksOfEverySizeKeepTheirContentsApart) {
  keepManyAndCheck<1>();
  keepManyAndCheck<16>();
  keepManyAndCheck<17>();
  keepManyAndCheck<48>();
  keepManyAndCheck<100>();
  keepManyAndCheck<112>();  // with the header just inside the largest block
  keepManyAndCheck<113>();  // and just outside it
  keepManyAndCheck<500>();
}

TEST(Object, CountFollowsReferences) {
  Ref<Sized<8>> first = make<Sized<8>>(static_cast<unsigned char>(1));
  EXPECT_TRUE(NSCounting::hasOneReference(*first));
  Value second = first;
  EXPECT_FALSE(NSCounting::hasOneReference(*first));
  Value moved = std::move(second);
  EXPECT_FALSE(second);
  moved = nullptr;
  EXPECT_TRUE(NSCounting::hasOneReference(*first));
  EXPECT_EQ(livingObjects, 1);
  first = nullptr;
  EXPECT_EQ(livingObjects, 0);
}

TEST(Object, SelfAssignmentKeepsTheObject) {
  Value value = make<Sized<8>>(static_cast<unsigned char>(1));
  const Value& same = value;
  value = same;
  EXPECT_EQ(livingObjects, 1);
  value = nullptr;
  EXPECT_EQ(livingObjects, 0);
}

TEST(Object, ImmortalObjectsSurviveEveryRelease) {
  NSNull* null = NSNull::null();
  ASSERT_TRUE(NSCounting::isImmortal(*null));
  for (int round = 0; round < 10; ++round) NSCounting::release(*null);
  for (int round = 0; round < 10; ++round) {
    Value reference = null;
    EXPECT_EQ(reference->kind(), Kind::Null);
  }
  EXPECT_TRUE(NSCounting::isImmortal(*null));
  EXPECT_EQ(NSNull::null(), null);
}

TEST(Object, ChainOfAMillionObjectsIsFreedWithoutRecursion) {
  Value chain;
  for (int index = 0; index < 1000000; ++index) chain = make<Link>(std::move(chain));
  EXPECT_EQ(livingObjects, 1000000);
  chain = nullptr;
  EXPECT_EQ(livingObjects, 0);
}

TEST(Object, DeepArraysOfManyObjectsAreFreedCompletely) {
  Value nested;
  for (int depth = 0; depth < 300; ++depth) {
    std::vector<Value> elements;
    for (int index = 0; index < 50; ++index) {
      elements.push_back(make<Sized<8>>(static_cast<unsigned char>(index)));
    }
    elements.push_back(nested);
    nested = NSArray::arrayWithObjects(std::move(elements));
  }
  EXPECT_EQ(livingObjects, 300 * 50);
  nested = nullptr;
  EXPECT_EQ(livingObjects, 0);
}

TEST(Object, ObjectsMadeByOneThreadAreFreedByAnother) {
  for (int round = 0; round < 20; ++round) {
    std::vector<Value> made;
    std::thread maker([&made] {
      for (int64_t index = 0; index < 5000; ++index) {
        made.push_back(NSNumber::numberWithLongLong(index));
      }
    });
    maker.join();
    std::thread breaker([&made] {
      for (size_t index = 0; index < made.size(); ++index) {
        ASSERT_EQ(cast<NSNumber>(made[index])->longLongValue(), static_cast<int64_t>(index));
      }
      made.clear();
    });
    breaker.join();
  }
}

TEST(Object, SharedReferencesAreCountedByAllThreads) {
  const Ref<NSNumber> number = NSNumber::numberWithLongLong(7);
  std::vector<std::thread> threads;
  for (int index = 0; index < 4; ++index) {
    threads.emplace_back([&number] {
      for (int round = 0; round < 20000; ++round) {
        Value copy = number;
        Value another = copy;
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_TRUE(NSCounting::hasOneReference(*number));
}

TEST(Object, KindTestsAcceptNull) {
  const Value none;
  EXPECT_FALSE(isa<NSArray>(none));
  EXPECT_EQ(dyn_cast<NSArray>(none), nullptr);
  const Value array = NSArray::array();
  EXPECT_TRUE(isa<NSArray>(array));
  EXPECT_FALSE(isa<NSNumber>(array));
  EXPECT_EQ(dyn_cast<NSNumber>(array), nullptr);
}

// --- idle memory ---------------------------------------------------------------------------------

#ifndef XQUERY_SANITIZED

size_t residentBytes() {
  std::ifstream file("/proc/self/statm");
  size_t all = 0, resident = 0;
  file >> all >> resident;
  return resident * static_cast<size_t>(::sysconf(_SC_PAGESIZE));
}

// Ends with nothing in use.
void makeMany(int64_t count) {
  std::vector<Value> values;
  values.reserve(static_cast<size_t>(count));
  for (int64_t index = 0; index < count; ++index) {
    values.push_back(NSNumber::numberWithLongLong(index));
  }
}

constexpr int64_t manyNumbers = 1000000;
constexpr size_t mostOfTheirBytes = manyNumbers * sizeof(NSNumber) * 3 / 4;

TEST(Object, IdleMemoryIsGivenBackOnRequest) {
  makeMany(manyNumbers);
  const size_t before = residentBytes();
  XQueryReleaseIdleMemory();
  EXPECT_LT(residentBytes() + mostOfTheirBytes, before);
}

TEST(Object, SoIsWhatAThreadThatEndedLeft) {
  std::thread([] { makeMany(manyNumbers); }).join();
  const size_t before = residentBytes();
  XQueryReleaseIdleMemory();
  EXPECT_LT(residentBytes() + mostOfTheirBytes, before);
}

#endif

TEST(Object, GivingMemoryBackTouchesNothingInUse) {
  std::vector<Ref<Sized<40>>> kept;
  for (int round = 0; round < 5; ++round) {
    std::vector<Ref<Sized<40>>> objects;
    for (int index = 0; index < 20000; ++index) {
      objects.push_back(make<Sized<40>>(static_cast<unsigned char>(index)));
    }
    for (size_t index = 0; index < objects.size(); index += 500) kept.push_back(objects[index]);
    objects.clear();
    XQueryReleaseIdleMemory();
    for (size_t index = 0; index < kept.size(); ++index) {
      ASSERT_TRUE(kept[index]->holds(static_cast<unsigned char>(index % 40 * 500)));
    }
  }
  kept.clear();
  EXPECT_EQ(livingObjects, 0);
}

TEST(Object, MemoryIsGivenBackWhileOthersWork) {
  std::atomic<bool> done = false;
  std::vector<std::thread> workers;
  for (int worker = 0; worker < 2; ++worker) {
    workers.emplace_back([&done] {
      do {
        std::vector<Value> values;
        for (int64_t index = 0; index < 20000; ++index) {
          values.push_back(NSNumber::numberWithLongLong(index));
        }
        for (int64_t index = 0; index < 20000; ++index) {
          const Value& value = values[static_cast<size_t>(index)];
          ASSERT_EQ(cast<NSNumber>(value)->longLongValue(), index);
        }
      } while (!done);
    });
  }
  for (int times = 0; times < 50; ++times) XQueryReleaseIdleMemory();
  done = true;
  for (std::thread& worker : workers) worker.join();
}

}  // namespace
}  // namespace xquery
