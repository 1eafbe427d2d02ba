#include "Platform/Base/Abandoned.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Names.h"
#include "xquery/Collection.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <atomic>
#include <string>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace xquery {
namespace {

std::atomic<size_t> freedHere = 0;
std::atomic<size_t> freedElsewhere = 0;
const std::thread::id testThread = std::this_thread::get_id();

// Tells which thread has freed it.
class Witness : public NSCounted {
 public:
  Witness() : NSCounted(Kind::String) {}
  ~Witness() override { ++(std::this_thread::get_id() == testThread ? freedHere : freedElsewhere); }
};

Ref<NSArray> witnesses(size_t count) {
  std::vector<Value> objects;
  for (size_t index = 0; index < count; ++index) objects.push_back(make<Witness>());
  return NSArray::arrayWithObjects(std::move(objects));
}

// As an evaluation that is ended leaves them.
template <class... Lists>
void abandon(Lists... lists) {
  AbandonedValues abandoned;
  abandonedValues = &abandoned;
  (static_cast<void>(lists = nullptr), ...);
  abandonedValues = nullptr;
  EXPECT_EQ(freedElsewhere, 0U);
}

class Abandoned : public testing::Test {
 protected:
  void SetUp() override {
    waitForAbandonedValues();
    settleAbandonedValues();
    freedHere = freedElsewhere = 0;
  }
};

TEST_F(Abandoned, LongListsAreFreedByAnotherThreadAndCountedUntilThen) {
  const int64_t before = workMeter.valueBytes;
  const size_t half = AbandonedValues::manyPartsInAll / 2;
  abandon(witnesses(half), witnesses(half));
  EXPECT_EQ(freedHere, 0U);
  EXPECT_GT(workMeter.valueBytes, before + static_cast<int64_t>(2 * half * sizeof(Witness)) - 1);
  waitForAbandonedValues();
  EXPECT_EQ(freedElsewhere, 2 * half);
  settleAbandonedValues();
  EXPECT_EQ(workMeter.valueBytes, before);
}

// A child has no thread but the one that forked, and may abandon values of its own.
TEST_F(Abandoned, AForkWaitsForWhatIsBeingFreed) {
  const size_t many = AbandonedValues::manyPartsInAll;
  abandon(witnesses(many));
  const pid_t child = ::fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    const bool isFreed = freedElsewhere == many;
    abandonedValues = nullptr;
    {
      AbandonedValues abandoned;
      abandonedValues = &abandoned;
      witnesses(many) = nullptr;
      abandonedValues = nullptr;
    }
    waitForAbandonedValues();
    _exit(isFreed && freedElsewhere == 2 * many ? 0 : 1);
  }
  int status = -1;
  ASSERT_EQ(::waitpid(child, &status, 0), child);
  EXPECT_EQ(status, 0);
  waitForAbandonedValues();
  EXPECT_EQ(freedElsewhere, many);
}

TEST_F(Abandoned, FewValuesAreFreedAtOnce) {
  const int64_t before = workMeter.valueBytes;
  abandon(witnesses(AbandonedValues::manyPartsInAll - 1), witnesses(10));
  EXPECT_EQ(freedHere, AbandonedValues::manyPartsInAll + 9);
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST_F(Abandoned, WhatIsStillHeldStays) {
  const Ref<NSArray> kept = witnesses(AbandonedValues::manyPartsInAll);
  abandon(Ref<NSArray>(kept), NSArray::arrayWithObjects(kept->objects()));
  waitForAbandonedValues();
  EXPECT_EQ(freedHere + freedElsewhere, 0U);
}

TEST_F(Abandoned, ATreeOfManyBlocksGoesWhole) {
  const int64_t before = workMeter.valueBytes;
  auto root = NSXMLElement::elementWithName(NSStringView::ascii("r"));
  for (size_t index = 0; index < AbandonedValues::manyPartsInAll; ++index) {
    root->addChild(NSXMLElement::elementWithName(NSStringView::ascii("e")));
  }
  const int64_t with = workMeter.valueBytes;
  AbandonedValues values;
  abandonedValues = &values;
  root = nullptr;
  abandonedValues = nullptr;
  EXPECT_EQ(workMeter.valueBytes, with);
  AbandonedValues outer;
  values.passTo(outer);
  outer.freeHere();
  EXPECT_EQ(workMeter.valueBytes, before);
}

// The evaluation is over when this was asked so many times.
bool isOverNow(void* turnsLeft) noexcept {
  return --*static_cast<int*>(turnsLeft) <= 0;
}

TEST_F(Abandoned, UntilALimitIsReachedVeryLongListsAreFreedInParts) {
  int turnsLeft = 3;
  {
    AbandonedValues abandoned(isOverNow, &turnsLeft);
    abandonedValues = &abandoned;
    witnesses(AbandonedValues::manyPartsInAll) = nullptr;
    EXPECT_EQ(freedHere, AbandonedValues::manyPartsInAll);
    EXPECT_EQ(turnsLeft, 2);
    witnesses(10 * AbandonedValues::partsPerLook) = nullptr;
    EXPECT_EQ(freedHere, AbandonedValues::manyPartsInAll + 2 * AbandonedValues::partsPerLook);
    EXPECT_EQ(turnsLeft, 0);
    abandonedValues = nullptr;
  }
  waitForAbandonedValues();
  EXPECT_EQ(freedElsewhere, 8 * AbandonedValues::partsPerLook);
}

TEST_F(Abandoned, UntilALimitIsReachedTreesOfVeryManyBlocksAreFreedInParts) {
  const int64_t before = workMeter.valueBytes;
  auto root = NSXMLElement::elementWithName(NSStringView::ascii("r"));
  for (size_t index = 0; index < 3 * AbandonedValues::partsPerLook; ++index) {
    root->addChild(NSXMLElement::elementWithName(NSStringView::ascii("e")));
  }
  const int64_t with = workMeter.valueBytes;
  int turnsLeft = 2;
  AbandonedValues abandoned(isOverNow, &turnsLeft);
  abandonedValues = &abandoned;
  root = nullptr;
  abandonedValues = nullptr;
  EXPECT_EQ(turnsLeft, 0);
  EXPECT_NEAR(static_cast<double>(workMeter.valueBytes - before),
              static_cast<double>(with - before) / 3, static_cast<double>(with - before) / 10);
  abandoned.freeHere();
  EXPECT_EQ(workMeter.valueBytes, before);
}

Ref<NSXMLDocument> documentOfManyNames(size_t count) {
  std::string text = "<r>";
  for (size_t index = 0; index < count; ++index) text += "<e" + std::to_string(index) + "/>";
  return NSXMLDocument::documentWithData(text + "</r>", 0);
}

// Its nodes are in a few large blocks.
TEST_F(Abandoned, ATreeOfManyNamesGoesWhole) {
  const size_t before = NSXMLInternedNameCount();
  auto document = documentOfManyNames(AbandonedValues::manyPartsInAll);
  const size_t with = NSXMLInternedNameCount();
  EXPECT_GE(with, before + AbandonedValues::manyPartsInAll);
  {
    AbandonedValues abandoned;
    abandonedValues = &abandoned;
    document = nullptr;
    abandonedValues = nullptr;
    EXPECT_EQ(NSXMLInternedNameCount(), with);
  }
  waitForAbandonedValues();
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

TEST_F(Abandoned, UntilALimitIsReachedVeryManyNamesAreReleasedInParts) {
  const size_t before = NSXMLInternedNameCount();
  auto document = documentOfManyNames(3 * AbandonedValues::partsPerLook);
  const size_t with = NSXMLInternedNameCount();
  int turnsLeft = 2;
  AbandonedValues abandoned(isOverNow, &turnsLeft);
  abandonedValues = &abandoned;
  document = nullptr;
  abandonedValues = nullptr;
  EXPECT_EQ(turnsLeft, 0);
  EXPECT_NEAR(static_cast<double>(NSXMLInternedNameCount() - before),
              static_cast<double>(with - before) / 3, 10);
  abandoned.freeHere();
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

// The lists hold nodes of a tree that the host goes on changing.
TEST_F(Abandoned, ATreeIsNotMergedWhileListsOfItsNodesAreFreed) {
  for (int round = 0; round < 5; ++round) {
    const auto root = NSXMLElement::elementWithName(NSStringView::ascii("r"));
    const auto child = NSXMLElement::elementWithName(NSStringView::ascii("e"));
    std::vector<Value> nodes(2 * AbandonedValues::manyPartsInAll, Value(child.get()));
    abandon(NSArray::arrayWithObjects(std::move(nodes)));
    root->addChild(child);
    EXPECT_EQ(root->XMLString()->utf8(), "<r><e/></r>");
  }
}

}  // namespace
}  // namespace xquery
