#include "Functions/Codepoints.h"
#include "Functions/StringTesting.h"
#include "xquery/Data.h"

namespace xquery {
namespace {

using namespace functiontest;

// --- codepoints-to-string ------------------------------------------------------------------------

TEST(CodepointsToString, MakesACharacterOfEachCodePoint) {
  EXPECT_EQ(call(fn_codepoints_to_string, {sequence({integer(97), integer(98)})}), "string ab");
  EXPECT_EQ(call(fn_codepoints_to_string, {integer(233)}), "string \xC3\xA9");
  EXPECT_EQ(call(fn_codepoints_to_string, {sequence({integer(97), integer(0x1F600)})}),
            "string a\xF0\x9F\x98\x80");
  EXPECT_EQ(call(fn_codepoints_to_string, {integer(0x10FFFF)}), "string \xF4\x8F\xBF\xBF");
}

TEST(CodepointsToString, OfTheEmptySequenceIsTheEmptyString) {
  EXPECT_EQ(call(fn_codepoints_to_string, {empty()}), "string ");
}

TEST(CodepointsToString, NumbersAndUntypedValuesAreCastToIntegers) {
  EXPECT_EQ(call(fn_codepoints_to_string,
                 {sequence({number(97.9), single("98.5"), decimal("99.9"), untyped("100"),
                            elementFrom("<n>101</n>"), typed(XQueryTypeUnsignedByte, "102")})}),
            "string abcdef");
}

TEST(CodepointsToString, UntypedTextThatIsNoNumberRaises) {
  EXPECT_EQ(call(fn_codepoints_to_string, {untyped("x")}),
            "error 6 value does not match a required type");
}

TEST(CodepointsToString, AValueOfAnotherTypeIsRefused) {
  for (const Value& item : {string("97"), boolean(true), months(97), typed(XQueryTypeAnyURI, "97"),
                            typed(XQueryTypeGYear, "2004")}) {
    EXPECT_EQ(call(fn_codepoints_to_string, {item}), "null") << show(item);
    EXPECT_EQ(call(fn_codepoints_to_string, {sequence({integer(97), item})}), "null");
  }
}

TEST(CodepointsToString, ANumberThatIsNoCodePointIsRefused) {
  for (const Value& item :
       {integer(1114112), integer(0xD800), integer(0xDFFF), integer(-1), integer(4294967393),
        integer(INT64_MAX), integer(INT64_MIN), number(1e30), decimal("99999999999999999999")}) {
    EXPECT_EQ(call(fn_codepoints_to_string, {item}), "null") << show(item);
    EXPECT_EQ(call(fn_codepoints_to_string, {sequence({integer(97), item})}), "null");
  }
}

TEST(CodepointsToString, WhatDoesNotCastToAnIntegerRaises) {
  for (const Value& item : {nan(), infinity(), minusInfinity()}) {
    EXPECT_EQ(call(fn_codepoints_to_string, {item}), operatortest::invalidCast) << show(item);
  }
}

TEST(CodepointsToString, TwoSurrogatesMakeNoCharacter) {
  EXPECT_EQ(call(fn_codepoints_to_string, {sequence({integer(0xD83D), integer(0xDE00)})}), "null");
}

TEST(CodepointsToString, TakesOneArgument) {
  EXPECT_EQ(refusedCounts(fn_codepoints_to_string, integer(97)), "0 2 3 4 5");
}

// --- string-to-codepoints ------------------------------------------------------------------------

TEST(StringToCodepoints, GivesOneIntegerForEachCodePoint) {
  EXPECT_EQ(call(fn_string_to_codepoints, {string("ab")}), "(integer 97, integer 98)");
  EXPECT_EQ(call(fn_string_to_codepoints, {string("a\xC3\xA9\xF0\x9F\x98\x80")}),
            "(integer 97, integer 233, integer 128512)");
  EXPECT_EQ(call(fn_string_to_codepoints, {string("\xF0\x9F\x98\x80")}), "integer 128512");
}

TEST(StringToCodepoints, OfTheEmptyStringIsEmpty) {
  EXPECT_EQ(call(fn_string_to_codepoints, {string("")}), "()");
  EXPECT_EQ(call(fn_string_to_codepoints, {empty()}), "()");
}

TEST(StringToCodepoints, OfOneUnitIsThatUnitALoneSurrogateTooIncluded) {
  EXPECT_EQ(call(fn_string_to_codepoints, {string("a")}), "integer 97");
  EXPECT_EQ(call(fn_string_to_codepoints, {typedText(u"\xD83D")}), "integer 55357");
  EXPECT_EQ(call(fn_string_to_codepoints, {typedText(u"\xDE00")}), "integer 56832");
}

TEST(StringToCodepoints, ALoneSurrogateInALongerStringIsRefused) {
  EXPECT_EQ(call(fn_string_to_codepoints, {typedText(u"a\xD83D")}), "null");
  EXPECT_EQ(call(fn_string_to_codepoints, {typedText(u"\xDE00\xD83D")}), "null");
}

TEST(StringToCodepoints, TakesTheTextOfNodesAndNoNumbers) {
  EXPECT_EQ(call(fn_string_to_codepoints, {elementFrom("<a>x</a>")}), "integer 120");
  EXPECT_EQ(call(fn_string_to_codepoints, {integer(1)}), "error 6 not a string type - 1");
}

TEST(StringToCodepoints, TakesOneArgument) {
  EXPECT_EQ(refusedCounts(fn_string_to_codepoints, string("a")), "0 2 3 4 5");
}

TEST(StringToCodepoints, IsUndoneByCodepointsToString) {
  Texts texts(1);
  std::mt19937& random = texts.random();
  for (int round = 0; round < 3000; ++round) {
    const bool wide = random() % 2 != 0;
    std::vector<Value> points;
    NSMutableString text;
    for (size_t count = random() % 12; points.size() < count;) {
      const char32_t point = random() % (wide ? 0x110000 : 0x80);
      if (point >= 0xD800 && point < 0xE000) continue;
      text.appendCodePoint(point);
      points.push_back(integer(point));
    }
    const Value answer = answerOf(fn_string_to_codepoints, {text.string()});
    ASSERT_EQ(show(answer), show(normalised(sequence(points))));
    ASSERT_EQ(unitsOf(answerOf(fn_codepoints_to_string, {answer})), text.view().utf16());
  }
}

}  // namespace
}  // namespace xquery
