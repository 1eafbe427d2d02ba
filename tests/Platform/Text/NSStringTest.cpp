#include "Platform/Base/Counting.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

std::u16string unitsOf(const Ref<NSString>& text) {
  return text->view().utf16();
}

TEST(String, TextBelow0x80IsStoredIn8Bits) {
  EXPECT_FALSE(NSString::stringWithUTF8("plain \x7F text")->view().isWide());
  EXPECT_FALSE(NSString::stringWithUTF16(u"plain text")->view().isWide());
  const std::u16string longText(1000, u'x');
  EXPECT_FALSE(NSString::stringWithUTF16(longText)->view().isWide());
  EXPECT_EQ(unitsOf(NSString::stringWithUTF16(longText)), longText);
  EXPECT_TRUE(NSString::stringWithUTF16(u"plain\u0080")->view().isWide());
}

TEST(String, EveryLengthAroundTheInlineLimitIsKept) {
  for (size_t length = 0; length <= 60; ++length) {
    const std::string narrow(length, 'n');
    const std::u16string wide(length, u'\u00FC');
    const Ref<NSString> narrowText = NSString::stringWithUTF8(narrow);
    const Ref<NSString> wideText = NSString::stringWithUTF16(wide);
    EXPECT_EQ(narrowText->utf8(), narrow);
    EXPECT_EQ(unitsOf(wideText), wide);
    EXPECT_EQ(narrowText->length(), length);
    EXPECT_EQ(wideText->length(), length);
  }
}

TEST(String, LengthCountsUTF16Units) {
  const Ref<NSString> text = NSString::stringWithUTF8("a\xC3\xA9\xE2\x82\xAC\xF0\x9D\x84\x9E");
  EXPECT_EQ(text->length(), 5U);
  EXPECT_EQ(text->characterAtIndex(1), 0xE9);
  EXPECT_EQ(text->characterAtIndex(2), 0x20AC);
  EXPECT_EQ(text->characterAtIndex(3), 0xD834);
  EXPECT_EQ(text->characterAtIndex(4), 0xDD1E);
  EXPECT_EQ(text->utf8(), "a\xC3\xA9\xE2\x82\xAC\xF0\x9D\x84\x9E");
}

TEST(String, EveryCodePointSurvivesUTF8) {
  for (char32_t point = 1; point <= 0x10FFFF; ++point) {
    if (point >= 0xD800 && point < 0xE000) continue;
    NSMutableString builder;
    builder.appendCodePoint(point);
    const std::string bytes = builder.view().utf8();
    const Ref<NSString> text = NSString::stringWithUTF8(bytes);
    ASSERT_TRUE(text) << static_cast<uint32_t>(point);
    ASSERT_TRUE(text->view() == builder.view()) << static_cast<uint32_t>(point);
    ASSERT_EQ(text->length(), point < 0x10000 ? 1U : 2U);
  }
}

TEST(String, IllFormedUTF8IsRejected) {
  const char* illFormed[] = {
      "\x80",              // continuation byte alone
      "\xBF",              //
      "\xC0\x80",          // overlong, two bytes
      "\xC1\xBF",          //
      "\xC3",              // cut off
      "\xC3(",             // no continuation
      "\xE0\x80\x80",      // overlong, three bytes
      "\xE0\x9F\xBF",      //
      "\xE2\x82",          // cut off
      "\xED\xA0\x80",      // U+D800
      "\xED\xBF\xBF",      // U+DFFF
      "\xF0\x80\x80\x80",  // overlong, four bytes
      "\xF0\x8F\xBF\xBF",  //
      "\xF0\x9D\x84",      // cut off
      "\xF4\x90\x80\x80",  // U+110000
      "\xF5\x80\x80\x80",  //
      "\xF8\x88\x80\x80\x80",
      "\xFC\x84\x80\x80\x80\x80",
      "\xFE",
      "\xFF",
  };
  for (const char* bytes : illFormed) {
    EXPECT_FALSE(NSString::stringWithUTF8(bytes)) << testing::PrintToString(std::string(bytes));
    EXPECT_FALSE(NSString::stringWithUTF8("long enough to be kept outside " + std::string(bytes)));
  }
}

TEST(String, ReplacingDecoderPutsTheReplacementCharacterForEachBadByte) {
  EXPECT_EQ(NSString::stringWithUTF8Replacing("a\xFF\xC3z")->utf8(), "a\xEF\xBF\xBD\xEF\xBF\xBDz");
  EXPECT_EQ(NSString::stringWithUTF8Replacing("\xC3\xA9")->utf8(), "\xC3\xA9");
  EXPECT_EQ(NSString::stringWithUTF8Replacing("plain")->utf8(), "plain");
}

TEST(String, NulIsACharacterLikeAnyOther) {
  const Ref<NSString> text = NSString::stringWithUTF8(std::string_view("a\0b", 3));
  EXPECT_EQ(text->length(), 3U);
  EXPECT_EQ(text->characterAtIndex(1), 0);
  EXPECT_EQ(text->utf8(), std::string("a\0b", 3));
}

TEST(String, LoneSurrogatesAreKeptAndWrittenAsReplacementCharacters) {
  const char16_t units[] = {0xD800, u'a', 0xDC00, 0xD834, 0xDD1E, 0xD83D};
  const Ref<NSString> text = NSString::stringWithUTF16({units, 6});
  EXPECT_EQ(unitsOf(text), std::u16string(units, 6));
  EXPECT_EQ(text->utf8(),
            "\xEF\xBF\xBD"
            "a\xEF\xBF\xBD\xF0\x9D\x84\x9E\xEF\xBF\xBD");
}

TEST(String, EmptyStringIsSharedAndNeverFreed) {
  EXPECT_EQ(NSString::empty().get(), NSString::empty().get());
  EXPECT_TRUE(NSCounting::isImmortal(*NSString::empty()));
  EXPECT_EQ(NSString::empty()->length(), 0U);
  EXPECT_EQ(NSString::stringWithUTF8("")->length(), 0U);
}

TEST(String, CopiesTheTextItIsMadeFrom) {
  std::string buffer(100, 'a');
  const Ref<NSString> text = NSString::stringWithUTF8(buffer);
  buffer.assign(100, 'b');
  EXPECT_EQ(text->utf8(), std::string(100, 'a'));
}

// Strings of a kind of their own, as the engine's typed strings are.
class KindString : public NSString {
 public:
  KindString(uint16_t aux, const NSString& text) : NSString(Kind::TypedString, aux, text) {}
  uint16_t aux() const { return _aux; }
};

TEST(String, TextOfANodeOutlivesTheLastReferenceToTheNode) {
  const std::string narrow(200, 'n');
  const std::u16string wide(200, u'\u20AC');
  Ref<NSXMLNode> narrowNode = NSXMLNode::textWithStringValue(NSStringView::ascii(narrow));
  Ref<NSXMLNode> wideNode = NSXMLNode::textWithStringValue({wide.data(), 200});
  const Ref<NSString> narrowText = narrowNode->stringValue();
  const Ref<NSString> wideText = wideNode->stringValue();
  const Ref<KindString> shared = make<KindString>(uint16_t{9}, *narrowText);
  narrowNode = nullptr;
  wideNode = nullptr;
  EXPECT_EQ(narrowText->utf8(), narrow);
  EXPECT_EQ(unitsOf(wideText), wide);
  EXPECT_EQ(shared->utf8(), narrow);
}

TEST(String, SharedTextOutlivesTheStringItCameFrom) {
  for (const size_t length : {0, 5, 24, 25, 500}) {
    const std::string expected(length, 's');
    Ref<NSString> original = NSString::stringWithUTF8(expected);
    Ref<KindString> first = make<KindString>(uint16_t{9}, *original);
    const Ref<KindString> second = make<KindString>(uint16_t{31}, *first);
    original = nullptr;
    first = nullptr;
    EXPECT_EQ(second->utf8(), expected);
    EXPECT_EQ(second->aux(), 31);
    EXPECT_EQ(second->kind(), Kind::TypedString);
  }
}

TEST(String, WideTextOfATreeThatFits8BitsIsStoredSo) {
  const Ref<NSXMLNode> node = NSXMLNode::textWithStringValue(NSStringView::ascii("owner"));
  const std::u16string wide(100, u'w');
  EXPECT_FALSE(NSString::stringInTreeOf(node.get(), {wide.data(), 100})->view().isWide());
}

TEST(MutableString, StaysNarrowUntilAWideUnitComes) {
  NSMutableString text;
  text.appendASCII("abc");
  text.append(NSStringView(u"def", 3));  // wide form, narrow content
  text.append(u'g');
  EXPECT_FALSE(text.view().isWide());
  text.append(u'\u00E9');
  EXPECT_TRUE(text.view().isWide());
  text.appendASCII("h");
  text.append(NSStringView::ascii("ij"));
  EXPECT_EQ(text.view().utf16(), u"abcdefg\u00E9hij");
  EXPECT_EQ(text.length(), 11U);
}

TEST(MutableString, PointsAboveTheBasicPlaneBecomePairs) {
  NSMutableString text;
  text.appendCodePoint(0xFFFF);
  text.appendCodePoint(0x10000);
  text.appendCodePoint(0x10FFFF);
  text.appendCodePoint('z');
  const char16_t expected[] = {0xFFFF, 0xD800, 0xDC00, 0xDBFF, 0xDFFF, u'z'};
  EXPECT_EQ(text.view().utf16(), std::u16string(expected, 6));
}

TEST(MutableString, ClearStartsAnew) {
  NSMutableString text;
  text.append(u'\u20AC');
  text.clear();
  EXPECT_EQ(text.length(), 0U);
  text.appendASCII("x");
  EXPECT_FALSE(text.view().isWide());
  EXPECT_EQ(text.string()->utf8(), "x");
}

}  // namespace
}  // namespace xquery
