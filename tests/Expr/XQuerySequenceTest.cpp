#include "Expr/XQuerySequence.h"
#include "xquery/String.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

Value text(std::string_view ascii) {
  return NSString::stringWithASCII(ascii);
}

std::string joined(const NSArray& array) {
  std::string all;
  for (const Value& item : array.objects()) all += cast<NSString>(item)->utf8();
  return all;
}

TEST(XQuerySequence, AddingNothingAddsNothing) {
  auto sequence = XQuerySequence::sequence();
  sequence->addObject(Value());
  sequence->addObject(NSNull::null());
  sequence->addObject(NSArray::array());
  EXPECT_EQ(sequence->count(), 0U);
  EXPECT_EQ(sequence->objectAtIndex(0), nullptr);
}

TEST(XQuerySequence, AddingAnArrayFlattensItRecursively) {
  auto inner = NSArray::arrayWithObjects({text("b"), NSNull::null(), text("c")});
  auto outer = NSArray::arrayWithObjects({text("a"), inner, NSArray::array(), text("d")});
  auto sequence = XQuerySequence::sequenceWithItem(outer);
  EXPECT_EQ(joined(*sequence), "abcd");
}

TEST(XQuerySequence, FlatteningIsNotBoundedByTheStack) {
  Value nested = text("x");
  for (int depth = 0; depth < 300000; ++depth) nested = NSArray::arrayWithObjects({nested});
  auto sequence = XQuerySequence::sequenceWithItem(nested);
  EXPECT_EQ(joined(*sequence), "x");
}

TEST(XQuerySequence, AddingAListThatNobodyElseHoldsTakesItsItems) {
  for (const bool isLonger : {false, true}) {
    auto sequence = XQuerySequence::sequenceWithItem(text("a"));
    if (!isLonger) sequence->addObject(text("b"));
    std::vector<Value> items = {text("c"), text("d")};
    if (!isLonger) items.pop_back();
    const NSObject* const first = items.front().get();
    sequence->addObject(Value(NSArray::arrayWithObjects(std::move(items))));
    EXPECT_EQ(joined(*sequence), isLonger ? "acd" : "abc");
    EXPECT_EQ(sequence->objectAtIndex(isLonger ? 1 : 2), first);
  }
}

TEST(XQuerySequence, AddingAListThatOthersHoldLeavesItAsItIs) {
  const Value list = NSArray::arrayWithObjects({text("b"), text("c")});
  const Value flat = XQuerySequence::sequenceWithItem(list);
  for (const Value& held : {list, flat}) {
    auto sequence = XQuerySequence::sequenceWithItem(text("a"));
    sequence->addObject(Value(held));
    EXPECT_EQ(joined(*sequence), "abc");
    EXPECT_EQ(joined(*cast<NSArray>(held)), "bc");
  }
}

TEST(XQuerySequence, AddingAnArrayThatNobodyElseHoldsFlattensIt) {
  auto sequence = XQuerySequence::sequenceWithItem(text("a"));
  sequence->addObject(Value(NSArray::arrayWithObjects(
      {NSArray::arrayWithObjects({text("b"), text("c")}), NSNull::null(), text("d")})));
  EXPECT_EQ(joined(*sequence), "abcd");
}

TEST(XQuerySequence, InsertingDoesNotFlatten) {
  auto sequence = XQuerySequence::sequenceWithItem(text("a"));
  auto array = NSArray::arrayWithObjects({text("b"), text("c")});
  sequence->insertObject(array, 0);
  ASSERT_EQ(sequence->count(), 2U);
  EXPECT_EQ(sequence->objectAtIndex(0), array.get());
}

TEST(XQuerySequence, InsertingIntoAnEmptySequenceIgnoresTheIndex) {
  auto sequence = XQuerySequence::sequence();
  sequence->insertObject(text("a"), 7);
  EXPECT_EQ(joined(*sequence), "a");
}

TEST(XQuerySequence, InsertingNothingIsIgnored) {
  auto sequence = XQuerySequence::sequence();
  sequence->insertObject(NSNull::null(), 0);
  sequence->insertObject(Value(), 0);
  EXPECT_EQ(sequence->count(), 0U);
}

TEST(XQuerySequence, ObjectPastTheEndIsNull) {
  auto sequence = XQuerySequence::sequenceWithItem(text("a"));
  EXPECT_EQ(sequence->objectAtIndex(1), nullptr);
}

TEST(XQuerySequence, RemovesAndReplaces) {
  auto sequence = XQuerySequence::sequenceWithItem(
      NSArray::arrayWithObjects({text("a"), text("b"), text("c"), text("d")}));
  sequence->removeLastObject();
  sequence->removeObjectAtIndex(0);
  sequence->replaceObjectAtIndex(1, text("z"));
  EXPECT_EQ(joined(*sequence), "bz");
}

TEST(Normalised, OneElementArrayBecomesItsElement) {
  const Value item = text("a");
  EXPECT_EQ(normalised(NSArray::arrayWithObjects({item})).get(), item.get());
}

TEST(Normalised, EmptyArrayBecomesNull) {
  EXPECT_TRUE(isNull(normalised(NSArray::array())));
}

TEST(Normalised, LongerArrayAndItemStay) {
  const Value two = NSArray::arrayWithObjects({text("a"), text("b")});
  EXPECT_EQ(normalised(two).get(), two.get());
  const Value item = text("a");
  EXPECT_EQ(normalised(item).get(), item.get());
}

TEST(ItemList, NullNothingAndEmptyArrayHaveNoItems) {
  EXPECT_EQ(XQueryItemList(nullptr).count(), 0U);
  EXPECT_EQ(XQueryItemList(NSNull::null()).count(), 0U);
  const Value empty = NSArray::array();
  EXPECT_EQ(XQueryItemList(empty.get()).count(), 0U);
}

TEST(ItemList, AnythingElseIsOneItem) {
  const Value item = text("a");
  XQueryItemList list(item.get());
  ASSERT_EQ(list.count(), 1U);
  EXPECT_EQ(list[0], item.get());
}

TEST(ItemList, ArrayGivesItsElementsInOrder) {
  const Value array = NSArray::arrayWithObjects({text("a"), text("b")});
  XQueryItemList list(array.get());
  ASSERT_EQ(list.count(), 2U);
  EXPECT_EQ(cast<NSString>(list[1])->utf8(), "b");
}

}  // namespace
}  // namespace xquery
