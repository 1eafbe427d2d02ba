#include "Expr/RandomChoices.h"
#include "Expr/XQueryListChanges.h"
#include "Platform/Base/Counting.h"
#include "xquery/String.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

using Items = std::vector<Value>;

Items letters(std::string_view text) {
  Items items;
  for (const char each : text) items.push_back(NSString::stringWithASCII(std::string(1, each)));
  return items;
}

std::string joined(const Items& items) {
  std::string all;
  for (const Value& item : items) all += cast<NSString>(item)->utf8();
  return all;
}

bool isHeldOnce(const Value& item) {
  return NSCounting::hasOneReference(*static_cast<const NSCounted*>(item.get()));
}

TEST(XQueryListChanges, AnArrayIsOwnedByTheOnlyOneWhoHoldsIt) {
  Value array = NSArray::arrayWithObjects(letters("ab"));
  EXPECT_EQ(XQueryOwnArray(array), array.get());
  const Value other = array;
  EXPECT_EQ(XQueryOwnArray(array), nullptr);
  EXPECT_EQ(XQueryOwnArray(letters("a").front()), nullptr);
  EXPECT_EQ(XQueryOwnArray(Value(NSNull::null())), nullptr);
  EXPECT_EQ(XQueryOwnArray(Value()), nullptr);
}

TEST(XQueryListChanges, InsertsAndErasesAnywhere) {
  for (size_t before = 0; before <= 3; ++before) {
    for (const char* inserted : {"", "x", "xyzuvw"}) {
      Items items = letters("abc");
      XQueryInsertItems(items, before, letters(inserted));
      EXPECT_EQ(joined(items), std::string("abc").insert(before, inserted));
    }
  }
  for (size_t first = 0; first <= 4; ++first) {
    for (size_t count = 0; first + count <= 4; ++count) {
      Items items = letters("abcd");
      XQueryEraseItems(items, first, count);
      EXPECT_EQ(joined(items), std::string("abcd").erase(first, count));
    }
  }
}

TEST(XQueryListChanges, AppendsCopies) {
  const Items items = letters("abcd");
  Items to = letters("x");
  XQueryAppendItems(items, 1, 2, to);
  XQueryAppendItems(items, 4, 0, to);
  EXPECT_EQ(joined(to), "xbc");
  EXPECT_EQ(joined(items), "abcd");
  EXPECT_TRUE(isHeldOnce(items[0]));
  EXPECT_FALSE(isHeldOnce(items[1]));
}

TEST(XQueryListChanges, GivesRoomBack) {
  Items items(100'000);
  XQueryEraseItems(items, 10, items.size() - 20);
  EXPECT_EQ(items.size(), 20U);
  EXPECT_LT(items.capacity(), 1000U);
}

// Each item stays held exactly once, by the list.
TEST(XQueryListChanges, LosesNoReferenceInAnyOrderOfChanges) {
  RandomChoices random(7);
  Items items;
  std::string model;
  for (int round = 0; round < 2000; ++round) {
    const size_t at = random.below(items.size() + 1);
    if (random.below(2) == 0) {
      const std::string inserted = random.oneOf({"", "a", "bc", "defghij"});
      XQueryInsertItems(items, at, letters(inserted));
      model.insert(at, inserted);
    } else {
      const size_t count = random.below(items.size() - at + 1);
      XQueryEraseItems(items, at, count);
      model.erase(at, count);
    }
    ASSERT_EQ(joined(items), model);
    for (const Value& item : items) ASSERT_TRUE(isHeldOnce(item));
  }
}

}  // namespace
}  // namespace xquery
