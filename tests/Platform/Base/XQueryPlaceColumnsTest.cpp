#include "Platform/Base/XQueryPlaceColumns.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace xquery {
namespace {

using testing::ElementsAre;

struct Item {
  int module;
  XQueryPlaceNumber number;
  std::string name;
};

std::vector<std::string> found(const XQueryPlaces& places, std::vector<Item> items) {
  std::vector<std::string> all;
  XQueryFindColumns(places, items, [&](const Item& item, const XQueryPlaceColumn& at) {
    all.push_back(item.name + " " + std::to_string(at.line) + ":" + std::to_string(at.column) +
                  "+" + std::to_string(at.length));
  });
  return all;
}

TEST(PlaceColumns, AreFoundInTheOrderOfTheText) {
  const auto places = XQueryPlaces::places();
  places->beginModule(NSString::stringWithUTF8("ab\ncd"), nullptr);
  const auto last = places->add({4, 5});
  const auto first = places->add({1, 3});
  places->beginModule(NSString::stringWithUTF8("\n\nxyz"), nullptr);
  const auto other = places->add({2, 5});
  EXPECT_THAT(found(*places, {{0, last, "d"}, {1, other, "xyz"}, {0, first, "b"}}),
              ElementsAre("b 1:2+2", "d 2:2+1", "xyz 3:1+3"));
  EXPECT_THAT(found(*places, {{1, other, "xyz"}, {2, last, "d"}}),
              ElementsAre("xyz 3:1+3", "d 2:2+1"));
}

TEST(PlaceColumns, AreNotToldOfWhatHasNoPlace) {
  const auto places = XQueryPlaces::places();
  places->beginModule(NSString::stringWithUTF8("ab"), nullptr);
  const auto place = places->add({0, 2});
  EXPECT_THAT(found(*places, {{0, 0, "none"}, {0, place, "ab"}, {0, 7, "beyond"}}),
              ElementsAre("ab 1:1+2"));
}

TEST(PlaceColumns, KeepTheOrderOfWhatBeginsTogether) {
  const auto places = XQueryPlaces::places();
  places->beginModule(NSString::stringWithUTF8("abc"), nullptr);
  const auto whole = places->add({0, 3}), part = places->add({0, 1});
  EXPECT_THAT(found(*places, {{0, whole, "abc"}, {0, part, "a"}}),
              ElementsAre("abc 1:1+3", "a 1:1+1"));
  EXPECT_THAT(found(*places, {{0, part, "a"}, {0, whole, "abc"}}),
              ElementsAre("a 1:1+1", "abc 1:1+3"));
}

}  // namespace
}  // namespace xquery
