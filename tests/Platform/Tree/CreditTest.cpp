#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Credit.h"
#include "Platform/Tree/Names.h"
#include "xquery/Collection.h"

#include <gtest/gtest.h>

#include <optional>
#include <semaphore>
#include <string_view>
#include <thread>
#include <vector>

namespace xquery {
namespace {

// With a second thread: only then is there anything to be gained.
class Credit : public ::testing::Test {
 protected:
  ~Credit() override {
    _end.release();
    _thread.join();
  }

 private:
  std::binary_semaphore _end{0};
  std::thread _thread{[this] { _end.acquire(); }};
};

Ref<NSXMLElement> element(std::string_view name) {
  return NSXMLElement::elementWithName(NSStringView::ascii(name));
}

uint32_t counterOf(const Ref<NSXMLElement>& node) {
  return NSXMLTree::of(node.get())->references;
}

TEST_F(Credit, TheCounterOfATreeIsNotTouchedForSingleReferences) {
  const auto tree = element("a");
  ASSERT_EQ(counterOf(tree), 1U);
  {
    const NSXMLCredit credit;
    NSXMLCredit::take(tree.get());
    const uint32_t before = counterOf(tree);
    EXPECT_GT(before, 1000U);
    std::vector<Value> held(1000, Value(tree));
    EXPECT_EQ(counterOf(tree), before);
    held.clear();
    EXPECT_EQ(counterOf(tree), before);
  }
  EXPECT_EQ(counterOf(tree), 1U);
}

TEST_F(Credit, ReferencesOutliveTheTimeInWhichTheyWereTaken) {
  const auto tree = element("a");
  std::vector<Value> held;
  {
    const NSXMLCredit credit;
    NSXMLCredit::take(tree.get());
    held.assign(100000, Value(tree));
  }
  EXPECT_EQ(counterOf(tree), 100001U);
  {
    const NSXMLCredit credit;
    NSXMLCredit::take(tree.get());
    held.resize(3);
  }
  EXPECT_EQ(counterOf(tree), 4U);
}

TEST_F(Credit, ATreeIsFreedAtTheEndOfTheTimeAtTheLatest) {
  const int64_t before = workMeter.valueBytes;
  {
    const NSXMLCredit credit;
    auto tree = element("a");
    NSXMLCredit::take(tree.get());
    const Value other = tree;
    tree = nullptr;
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST_F(Credit, NothingIsTakenOutsideOfATime) {
  const auto tree = element("a");
  NSXMLCredit::take(tree.get());
  EXPECT_EQ(counterOf(tree), 1U);
}

TEST_F(Credit, TimesNest) {
  const auto outer = element("a");
  std::vector<Ref<NSXMLElement>> inner;
  for (int i = 0; i < 30; ++i) inner.push_back(element("b"));
  {
    const NSXMLCredit credit;
    NSXMLCredit::take(outer.get());
    {
      const NSXMLCredit nested;
      NSXMLCredit::take(outer.get());
      // More than there is room for.
      for (const auto& tree : inner) NSXMLCredit::take(tree.get());
      const std::vector<Ref<NSXMLElement>> again = inner;
    }
    for (const auto& tree : inner) EXPECT_EQ(counterOf(tree), 1U);
    EXPECT_GT(counterOf(outer), 1000U);
  }
  EXPECT_EQ(counterOf(outer), 1U);
}

TEST_F(Credit, AnyTwoTreesHaveRoomSideBySide) {
  std::vector<Ref<NSXMLElement>> trees;
  for (int i = 0; i < 40; ++i) trees.push_back(element("a"));
  for (const auto& first : trees) {
    for (const auto& second : trees) {
      const NSXMLCredit credit;
      NSXMLCredit::take(first.get());
      NSXMLCredit::take(second.get());
      ASSERT_GT(counterOf(first), 1000U);
      ASSERT_GT(counterOf(second), 1000U);
    }
  }
  for (const auto& tree : trees) EXPECT_EQ(counterOf(tree), 1U);
}

TEST_F(Credit, TreesWithCreditBecomeOne) {
  const auto parent = element("p");
  const auto child = element("c");
  for (int i = 0; i < 5; ++i) child->addChild(element("d"));
  const auto small = element("s");
  {
    const NSXMLCredit credit;
    for (const auto& tree : {parent, child, small}) NSXMLCredit::take(tree.get());
    const std::vector<Value> held = {child, child, small, parent};
    EXPECT_TRUE(parent->addChild(child));
    EXPECT_TRUE(parent->addChild(small));
    const std::vector<Value> more = {child, small, parent};
  }
  EXPECT_EQ(counterOf(parent), 3U);
  EXPECT_EQ(NSXMLTree::of(child.get()), NSXMLTree::of(small.get()));
}

TEST_F(Credit, AnotherThreadGivesBackWhatThisOneTook) {
  const auto tree = element("a");
  const NSXMLCredit credit;
  NSXMLCredit::take(tree.get());
  std::vector<Value> held(50000, Value(tree));
  std::thread([&held] {
    const NSXMLCredit own;
    NSXMLCredit::take(cast<NSXMLNode>(held.front().get()));
    held.resize(10);
  }).join();
  std::thread([&held] { held.clear(); }).join();
  std::optional<NSXMLCredit> again(std::in_place);
  again.reset();
  const Value last = tree;
  EXPECT_EQ(tree->childCount(), 0U);
}

TEST_F(Credit, TheNodesOfAnArrayAreGivenUp) {
  const auto first = element("a");
  const auto second = element("b");
  std::vector<Value> nodes;
  for (int i = 0; i < 1000; ++i) nodes.emplace_back(i % 300 < 200 ? first : second);
  nodes.emplace_back(NSNull::null());
  nodes.emplace_back();
  auto array = NSArray::arrayWithObjects(std::move(nodes));
  EXPECT_EQ(counterOf(first) + counterOf(second), 1002U);
  array = nullptr;
  EXPECT_EQ(counterOf(first), 1U);
  EXPECT_EQ(counterOf(second), 1U);
}

// --- names ---------------------------------------------------------------------------------------

TEST_F(Credit, TheCounterOfANameIsNotTouchedForSingleTrees) {
  const size_t before = NSXMLInternedNameCount();
  {
    const NSXMLNameRef name(NSStringView::ascii("credit-name"), NSStringView());
    const uint32_t alone = name->references;
    {
      const NSXMLCredit credit;
      { const NSXMLNameRef first(name); }
      const uint32_t counter = name->references;
      EXPECT_GT(counter, alone + 100);
      for (int i = 0; i < 100; ++i) {
        const std::vector<NSXMLNameRef> held(50, name);
        EXPECT_EQ(name->references, counter);
      }
    }
    EXPECT_EQ(name->references, alone);
  }
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

TEST_F(Credit, AnyTwoNamesHaveRoomSideBySide) {
  std::vector<NSXMLNameRef> names;
  for (int i = 0; i < 40; ++i) {
    names.emplace_back(NSStringView::ascii("side" + std::to_string(i)), NSStringView());
  }
  for (const auto& first : names) {
    for (const auto& second : names) {
      const NSXMLCredit credit;
      const std::vector<NSXMLNameRef> both = {first, second};
      const uint32_t counters[] = {first->references, second->references};
      for (int i = 0; i < 3; ++i) const std::vector<NSXMLNameRef> again = both;
      ASSERT_EQ(first->references, counters[0]);
      ASSERT_EQ(second->references, counters[1]);
    }
  }
  for (const auto& name : names) EXPECT_EQ(name->references, 1U);
}

TEST_F(Credit, NamesGiveWayToOtherNames) {
  const size_t before = NSXMLInternedNameCount();
  {
    const NSXMLCredit credit;
    for (int round = 0; round < 3; ++round) {
      std::vector<NSXMLNameRef> names;
      for (int i = 0; i < 200; ++i) {
        names.emplace_back(NSStringView::ascii("n" + std::to_string(i)), NSStringView());
      }
      const std::vector<NSXMLNameRef> copies = names;
      const std::vector<NSXMLNameRef> more = copies;
    }
  }
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

TEST_F(Credit, ManyReferencesToANameOutliveTheTime) {
  const size_t before = NSXMLInternedNameCount();
  {
    std::vector<NSXMLNameRef> held;
    {
      const NSXMLCredit credit;
      held.assign(100000, NSXMLNameRef(NSStringView::ascii("many"), NSStringView()));
    }
    EXPECT_EQ(held.front()->references, 100000U);
  }
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

}  // namespace
}  // namespace xquery
