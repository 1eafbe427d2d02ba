#include "Types/NameCharacters.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

struct Extent {
  int ranges = 0;
  int units = 0;
};

Extent extentOf(const XQueryCharSet& set) {
  Extent extent;
  bool inside = false;
  for (uint32_t unit = 0; unit <= 0xFFFF; ++unit) {
    const bool member = set.contains(static_cast<char16_t>(unit));
    extent.units += member;
    extent.ranges += member && !inside;
    inside = member;
  }
  return extent;
}

TEST(NameCharacters, TheNCNameFirstSetHas205Ranges) {
  EXPECT_EQ(extentOf(XQueryNCNameFirstCharSet).ranges, 205);
  EXPECT_EQ(extentOf(XQueryNCNameFirstCharSet).units, 34515);
}

TEST(NameCharacters, TheNCNameSetHas287Ranges) {
  EXPECT_EQ(extentOf(XQueryNCNameCharSet).ranges, 287);
  EXPECT_EQ(extentOf(XQueryNCNameCharSet).units, 35121);
}

TEST(NameCharacters, TheColonIsAllThatSeparatesNamesFromNCNames) {
  for (uint32_t index = 0; index <= 0xFFFF; ++index) {
    const auto unit = static_cast<char16_t>(index);
    const bool colon = unit == u':';
    ASSERT_EQ(XQueryNameFirstCharSet.contains(unit),
              colon || XQueryNCNameFirstCharSet.contains(unit))
        << index;
    ASSERT_EQ(XQueryNameCharSet.contains(unit), colon || XQueryNCNameCharSet.contains(unit))
        << index;
  }
  EXPECT_FALSE(XQueryNCNameFirstCharSet.contains(u':'));
  EXPECT_FALSE(XQueryNCNameCharSet.contains(u':'));
}

TEST(NameCharacters, EveryFirstCharacterMayFollow) {
  for (uint32_t index = 0; index <= 0xFFFF; ++index) {
    const auto unit = static_cast<char16_t>(index);
    if (XQueryNCNameFirstCharSet.contains(unit)) {
      ASSERT_TRUE(XQueryNCNameCharSet.contains(unit)) << index;
    }
  }
}

TEST(NameCharacters, ASCIIMembersAreLettersDigitsAndThreeSigns) {
  for (char16_t unit = 0; unit < 128; ++unit) {
    const bool letter = (unit >= u'a' && unit <= u'z') || (unit >= u'A' && unit <= u'Z');
    const bool digit = unit >= u'0' && unit <= u'9';
    EXPECT_EQ(XQueryNCNameFirstCharSet.contains(unit), letter || unit == u'_')
        << static_cast<int>(unit);
    EXPECT_EQ(XQueryNCNameCharSet.contains(unit),
              letter || digit || unit == u'_' || unit == u'-' || unit == u'.')
        << static_cast<int>(unit);
  }
}

TEST(NameCharacters, LettersAreThoseOfTheFirstEdition) {
  const char16_t letters[] = {0xC0,   0xD8,   0xFF,   0x131,  0x386,  0x3E2,  0x5D0,
                              0xE30,  0x10A0, 0x1100, 0x11F9, 0x1FFC, 0x2126, 0x2182,
                              0x3007, 0x3021, 0x4E00, 0x9FA5, 0xAC00, 0xD7A3};
  for (const char16_t unit : letters)
    EXPECT_TRUE(XQueryNCNameFirstCharSet.contains(unit)) << static_cast<int>(unit);
  const char16_t others[] = {0xD7,   0xF7,   0x132,  0x1F6,  0x221,  0x3DB, 0x1101, 0x200C,
                             0x3006, 0x9FA6, 0xD7A4, 0xFB00, 0xFF21, 0xB7,  0x300,  0x660};
  for (const char16_t unit : others)
    EXPECT_FALSE(XQueryNCNameFirstCharSet.contains(unit)) << static_cast<int>(unit);
}

TEST(NameCharacters, DigitsCombiningCharactersAndExtendersMayOnlyFollow) {
  const char16_t followers[] = {0x660, 0xF20, 0xF29,  0x300,  0x345,  0x903, 0x20E1,
                                0xB7,  0x2D0, 0x3005, 0x3031, 0x30FE, 0x302F};
  for (const char16_t unit : followers) {
    EXPECT_TRUE(XQueryNCNameCharSet.contains(unit)) << static_cast<int>(unit);
    EXPECT_FALSE(XQueryNCNameFirstCharSet.contains(unit)) << static_cast<int>(unit);
  }
}

TEST(NameCharacters, SurrogatesAreNeverMembers) {
  for (uint32_t unit = 0xD800; unit <= 0xDFFF; ++unit) {
    ASSERT_FALSE(XQueryNameCharSet.contains(static_cast<char16_t>(unit))) << static_cast<int>(unit);
  }
}

TEST(NameCharacters, WhiteSpaceIsFourCharacters) {
  int members = 0;
  for (uint32_t unit = 0; unit <= 0xFFFF; ++unit) {
    members += XQueryWhiteSpaceCharSet.contains(static_cast<char16_t>(unit));
  }
  EXPECT_EQ(members, 4);
  for (const char16_t unit : {u' ', u'\t', u'\n', u'\r'}) {
    EXPECT_TRUE(XQueryWhiteSpaceCharSet.contains(unit));
  }
}

bool isNodeName(std::u16string_view text) {
  return XQueryIsNodeName(NSString::stringWithUTF16(text)->view());
}

TEST(NameCharacters, NodeNamesAreQualifiedNames) {
  for (const auto* name : {u"a", u"_", u"A-b.c9", u"p:a", u"\u00E9", u"a\u00B7", u"\u0370",
                           u"\U00010000", u"\U000EFFFFx", u"a\u0300:\u4E00"}) {
    EXPECT_TRUE(isNodeName(name));
  }
  for (const auto* text : {u"", u":", u"a:", u":a", u"a:b:c", u"a b", u"1a", u"-a", u".", u"a:1",
                           u"a\u00D7", u"\u0300", u"a\u2028", u"\u00B7", u"a/b", u" a", u"a\n"}) {
    EXPECT_FALSE(isNodeName(text));
  }
}

TEST(NameCharacters, HalfAPairIsNoNameCharacter) {
  EXPECT_FALSE(isNodeName(std::u16string(1, char16_t{0xD800})));
  EXPECT_FALSE(isNodeName(std::u16string{u'a', char16_t{0xDC00}}));
  EXPECT_FALSE(isNodeName(std::u16string{u'a', char16_t{0xD800}, u'a'}));
  EXPECT_FALSE(isNodeName(u"\U000F0000"));
}

// The sets of the first edition lie within: what a query can write may be built.
TEST(NameCharacters, WhatTheSetsHoldMayNameNodes) {
  for (uint32_t index = 0; index <= 0xFFFF; ++index) {
    const auto unit = static_cast<char16_t>(index);
    if (XQueryNCNameFirstCharSet.contains(unit)) {
      ASSERT_TRUE(isNodeName(std::u16string(1, unit))) << index;
    }
    if (XQueryNCNameCharSet.contains(unit)) {
      ASSERT_TRUE(isNodeName(std::u16string{u'a', unit})) << index;
    }
  }
}

}  // namespace
}  // namespace xquery
