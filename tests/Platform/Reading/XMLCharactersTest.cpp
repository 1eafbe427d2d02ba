#include "Platform/Reading/XMLCharacters.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace std::string_view_literals;

TEST(XMLCharacters, TheEndsOfTheirRanges) {
  for (const char32_t point :
       {0x9, 0xA, 0xD, 0x20, 0x7F, 0x9F, 0xD7FF, 0xE000, 0xFFFD, 0x10000, 0x1FFFE, 0x10FFFF}) {
    EXPECT_TRUE(isXMLCharacter(point)) << static_cast<uint32_t>(point);
  }
  for (const char32_t point :
       {0x0, 0x8, 0xB, 0xC, 0xE, 0x1F, 0xD800, 0xDFFF, 0xFFFE, 0xFFFF, 0x110000}) {
    EXPECT_FALSE(isXMLCharacter(point)) << static_cast<uint32_t>(point);
  }
}

TEST(XMLCharacters, TheEndsOfTheRangesThatBeginNames) {
  struct Row {
    char32_t first;
    char32_t last;
  };
  const Row rows[] = {
      {'A', 'Z'},       {'_', '_'},       {'a', 'z'},       {0xC0, 0xD6},     {0xD8, 0xF6},
      {0xF8, 0x2FF},    {0x370, 0x37D},   {0x37F, 0x1FFF},  {0x200C, 0x200D}, {0x2070, 0x218F},
      {0x2C00, 0x2FEF}, {0x3001, 0xD7FF}, {0xF900, 0xFDCF}, {0xFDF0, 0xFFFD}, {0x10000, 0xEFFFF},
  };
  for (const Row& row : rows) {
    EXPECT_FALSE(isXMLNameStart(row.first - 1)) << static_cast<uint32_t>(row.first);
    EXPECT_TRUE(isXMLNameStart(row.first)) << static_cast<uint32_t>(row.first);
    EXPECT_TRUE(isXMLNameStart(row.last)) << static_cast<uint32_t>(row.last);
    EXPECT_FALSE(isXMLNameStart(row.last + 1)) << static_cast<uint32_t>(row.last);
    EXPECT_TRUE(isXMLNameCharacter(row.first));
    EXPECT_TRUE(isXMLNameCharacter(row.last));
  }
  EXPECT_FALSE(isXMLNameStart(':'));
}

TEST(XMLCharacters, SomeMayOnlyFollowInNames) {
  for (const char32_t point :
       {U'-', U'.', U'0', U'9', U'\u00B7', U'\u0300', U'\u036F', U'\u203F', U'\u2040'}) {
    EXPECT_FALSE(isXMLNameStart(point)) << static_cast<uint32_t>(point);
    EXPECT_TRUE(isXMLNameCharacter(point)) << static_cast<uint32_t>(point);
  }
  for (const int point : {0x20, ',' + 0, '/' + 0, ';' + 0, '@' + 0, '[' + 0, '`' + 0, '{' + 0, 0xB6,
                          0xB8, 0x37E, 0x203E, 0x2041, 0xF0000, 0x10FFFF}) {
    EXPECT_FALSE(isXMLNameCharacter(static_cast<char32_t>(point))) << point;
  }
}

TEST(XMLCharacters, ANameHasAtMostOneColonBetweenNames) {
  struct Row {
    std::string_view name;
    bool isName;
    size_t colon;
  };
  const Row rows[] = {
      {"a", true, 0},         {"a:b", true, 1},
      {"_a-1.b:c", true, 6},  {"\xC3\xA9:\xD0\xB1", true, 2},
      {"", false, 0},         {":", false, 0},
      {":a", false, 0},       {"a:", false, 0},
      {"a:b:c", false, 0},    {"a::b", false, 0},
      {"-a", false, 0},       {"a:-b", false, 0},
      {"a:1", false, 0},      {"1a", false, 0},
      {"a b", false, 0},      {"a\"", false, 0},
      {"a\0b"sv, false, 0},   {"\xC3", false, 0},
      {"a\xFF", false, 0},    {"\xEF\xBF\xBE", false, 0},
      {"\xC3\x97", false, 0},
  };
  for (const Row& row : rows) {
    const XMLNameShape shape = shapeOfXMLName(row.name);
    EXPECT_EQ(shape.isName, row.isName) << row.name;
    if (row.isName) {
      EXPECT_EQ(shape.colon, row.colon) << row.name;
    }
  }
}

std::u16string widened(std::string_view bytes) {
  std::u16string units(bytes.size(), u'\0');
  const char16_t* const end = widenXML(bytes, units.data());
  if (!end) return u"none";
  units.resize(static_cast<size_t>(end - units.data()));
  EXPECT_EQ(countXMLUnits(bytes), units.size());
  return units;
}

TEST(XMLCharacters, TextIsWidened) {
  EXPECT_EQ(widened(""), u"");
  EXPECT_EQ(widened("abc"), u"abc");
  EXPECT_EQ(widened("\xC2\x80\xDF\xBF\xE0\xA0\x80\xEF\xBF\xBD"), u"\u0080\u07FF\u0800\uFFFD");
  EXPECT_EQ(widened("\xF0\x90\x80\x80\xF4\x8F\xBF\xBF"), u"\U00010000\U0010FFFF");
  EXPECT_EQ(widened("a\xE2\x82\xAC"
                    "b"),
            u"a\u20ACb");
}

TEST(XMLCharacters, WhatIsNoTextIsNotWidened) {
  const std::string_view rows[] = {
      "\x80",
      "\xBF",
      "\xC0\x80",
      "\xC1\xBF",
      "\xC3",
      "\xC3(",
      "\xE0\x80\x80",
      "\xE0\x9F\xBF",
      "\xE2\x82",
      "\xE2(\xA1",
      "\xED\xA0\x80",
      "\xED\xBF\xBF",
      "\xEF\xBF\xBE",
      "\xEF\xBF\xBF",
      "\xF0\x80\x80\x80",
      "\xF0\x8F\xBF\xBF",
      "\xF0\x9F\x98",
      "\xF4\x90\x80\x80",
      "\xF5\x80\x80\x80",
      "\xF8\x88\x80\x80\x80",
      "\xFE",
      "\xFF",
  };
  for (const std::string_view row : rows) {
    for (const std::string& text : {std::string(row), "ab" + std::string(row) + "cd"}) {
      EXPECT_EQ(widened(text), u"none") << text;
    }
  }
}

}  // namespace
}  // namespace xquery
