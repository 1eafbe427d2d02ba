#include "Platform/Reading/NotTaken.h"
#include "Platform/Reading/References.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

using Appending = void (*)(std::string_view, ValueText<char>&);

std::string read(Appending append, std::string_view bytes) {
  ValueText<char> text = "<";
  append(bytes, text);
  return std::string(std::string_view(text).substr(1));
}

TEST(References, CharactersAndPredefinedEntitiesAreKnown) {
  struct Row {
    const char* bytes;
    const char* text;
  };
  const Row rows[] = {
      {"&lt;&gt;&amp;&quot;&apos;", "<>&\"'"},
      {"a&#65;b&#x41;c&#x0041;", "aAbAcA"},
      {"&#9;&#10;&#13;&#32;", "\t\n\r "},
      {"&#x7F;&#x80;&#x7FF;&#x800;", "\x7F\xC2\x80\xDF\xBF\xE0\xA0\x80"},
      {"&#xFFFD;&#x10000;&#x10FFFF;", "\xEF\xBF\xBD\xF0\x90\x80\x80\xF4\x8F\xBF\xBF"},
      {"&#xe9;&#xE9;", "\xC3\xA9\xC3\xA9"},
      {"&amp;lt;", "&lt;"},
  };
  for (const Row& row : rows) {
    EXPECT_EQ(read(appendTextOf, row.bytes), row.text);
    EXPECT_EQ(read(appendValueOf, row.bytes), row.text);
  }
}

TEST(References, OthersAreNotTaken) {
  for (const char* bytes : {"&",        "&;",         "&lt",
                            "&LT;",     "&lt ;",      "& lt;",
                            "&nbsp;",   "&amp",       "&ampere;",
                            "&#;",      "&#x;",       "&#X41;",
                            "&# 65;",   "&#6 5;",     "&#-1;",
                            "&#xG;",    "&#1A;",      "&#0;",
                            "&#8;",     "&#xB;",      "&#x1F;",
                            "&#xD800;", "&#xDFFF;",   "&#xFFFE;",
                            "&#xFFFF;", "&#x110000;", "&#99999999999999999999;",
                            "&l&lt;t;"}) {
    EXPECT_THROW(read(appendTextOf, bytes), NotTaken) << bytes;
    EXPECT_THROW(read(appendValueOf, bytes), NotTaken) << bytes;
  }
}

TEST(References, LineEndsAreLineFeeds) {
  EXPECT_EQ(read(appendTextOf, "a\r\nb\rc\r\r\nd\n\re\t\r"), "a\nb\nc\n\nd\n\ne\t\n");
  EXPECT_EQ(read(appendLinesOf, "a\r\nb\rc\r\r\nd\n\re\t\r"), "a\nb\nc\n\nd\n\ne\t\n");
  EXPECT_EQ(read(appendLinesOf, "&lt;&"), "&lt;&");
}

TEST(References, WhiteSpaceInValuesIsSpace) {
  EXPECT_EQ(read(appendValueOf, "a\r\nb\rc\nd\te\r\r\n"), "a b c d e  ");
  EXPECT_EQ(read(appendValueOf, "&#13;&#10;&#9;"), "\r\n\t");
}

}  // namespace
}  // namespace xquery
