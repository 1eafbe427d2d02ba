#include "Platform/Base/XQueryPlaces.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery {
namespace {

Ref<NSString> text(std::string_view utf8) {
  return NSString::stringWithUTF8(utf8);
}

std::string shown(const XQueryPlaces& places, XQueryPlaceNumber number) {
  const auto place = places.place(number);
  if (!place) return "none";
  return (place->moduleURL ? place->moduleURL->utf8() + " " : "") + std::to_string(place->line) +
         ":" + std::to_string(place->column) + "+" + std::to_string(place->length) + " " +
         place->sourceLine->utf8();
}

TEST(Places, NumberZeroIsNone) {
  const auto places = XQueryPlaces::places();
  places->beginModule(text("abc"), nullptr);
  EXPECT_EQ(shown(*places, 0), "none");
  EXPECT_EQ(shown(*places, 1), "none");
  EXPECT_EQ(places->span(0), XQuerySpan());
}

TEST(Places, AreThoseOfTheModuleThatWasReadLast) {
  const auto places = XQueryPlaces::places();
  places->beginModule(text("abc"), nullptr);
  const auto first = places->add({1, 3});
  places->beginModule(text("nothing here"), text("u:0"));
  places->beginModule(text("x\nyz"), text("u:1"));
  const auto second = places->add({2, 4});
  EXPECT_EQ(shown(*places, first), "1:2+2 abc");
  EXPECT_EQ(shown(*places, second), "u:1 2:1+2 yz");
}

TEST(Places, CountCharactersAndNotUnits) {
  const auto places = XQueryPlaces::places();
  places->beginModule(text("é😀b\r\nc\rd"), nullptr);
  EXPECT_EQ(shown(*places, places->add({2, 3})), "1:3+1 é😀b");
  EXPECT_EQ(shown(*places, places->add({4, 5})), "2:1+1 c");
  EXPECT_EQ(shown(*places, places->add({6, 7})), "3:1+1 d");
}

TEST(Places, AByteOrderMarkIsNoCharacter) {
  const auto places = XQueryPlaces::places();
  places->beginModule(text("\xEF\xBB\xBFxy"), nullptr);
  EXPECT_EQ(shown(*places, places->add({1, 2})), "1:2+1 xy");
}

TEST(Places, BehindTheTextAreAtItsEnd) {
  const auto places = XQueryPlaces::places();
  places->beginModule(text("ab\n"), nullptr);
  EXPECT_EQ(shown(*places, places->add({3, 3})), "2:1+0 ");
  EXPECT_EQ(shown(*places, places->add({9, 9})), "2:1+0 ");
}

TEST(Places, CanBeChanged) {
  const auto places = XQueryPlaces::places();
  places->beginModule(text("abc"), nullptr);
  const auto place = places->add({1, 2});
  places->change(place, {0, 3});
  EXPECT_EQ(shown(*places, place), "1:1+3 abc");
}

}  // namespace
}  // namespace xquery
