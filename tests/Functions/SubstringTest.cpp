#include "Functions/StringTesting.h"
#include "Functions/Substring.h"
#include "Platform/Base/ProcessorTime.h"
#include "Types/XQueryAtomization.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace xquery {
namespace {

using namespace functiontest;

struct TwoTextFunction {
  const char* name;
  XQueryProcedure procedure;
};

constexpr TwoTextFunction twoTextFunctions[] = {
    {"contains", fn_contains},
    {"starts-with", fn_starts_with},
    {"ends-with", fn_ends_with},
    {"substring-before", fn_substring_before},
    {"substring-after", fn_substring_after},
};

TEST(TwoTexts, ACollationChangesNothingButMustBeAString) {
  for (const auto& [name, procedure] : twoTextFunctions) {
    const std::string plain = call(procedure, {string("Abcab"), string("b")});
    EXPECT_EQ(call(procedure, {string("Abcab"), string("b"), string("urn:x")}), plain) << name;
    EXPECT_EQ(call(procedure, {string("Abcab"), string("b"), empty()}), plain) << name;
    EXPECT_EQ(call(procedure, {string("Abcab"), string("b"), integer(1)}),
              "error 6 not a string type - 1")
        << name;
  }
}

TEST(TwoTexts, AnArgumentThatIsNoTextIsAnError) {
  for (const auto& [name, procedure] : twoTextFunctions) {
    EXPECT_EQ(call(procedure, {integer(1), string("b")}), "error 6 not a string type - 1") << name;
    EXPECT_EQ(call(procedure, {string("b"), integer(2)}), "error 6 not a string type - 2") << name;
    EXPECT_EQ(call(procedure, {sequence({string("a"), string("b")}), string("a")}),
              "error 6 not a string type - (a, b)")
        << name;
  }
}

TEST(TwoTexts, TwoOrThreeArgumentsAreTaken) {
  for (const auto& [name, procedure] : twoTextFunctions) {
    EXPECT_EQ(refusedCounts(procedure, string("a")), "0 1 4 5") << name;
  }
}

// --- contains, starts-with, ends-with ------------------------------------------------------------

TEST(Contains, FindsAPartAnywhere) {
  EXPECT_EQ(call(fn_contains, {string("tattoo"), string("tat")}), "true");
  EXPECT_EQ(call(fn_contains, {string("tattoo"), string("too")}), "true");
  EXPECT_EQ(call(fn_contains, {string("tattoo"), string("tot")}), "false");
  EXPECT_EQ(call(fn_contains, {elementFrom("<a>x<b>y</b></a>"), untyped("xy")}), "true");
}

TEST(StartsWith, AsksForThePartAtTheStart) {
  EXPECT_EQ(call(fn_starts_with, {string("tattoo"), string("tat")}), "true");
  EXPECT_EQ(call(fn_starts_with, {string("tattoo"), string("att")}), "false");
  EXPECT_EQ(call(fn_starts_with, {string("ta"), string("tat")}), "false");
}

TEST(EndsWith, AsksForThePartAtTheEnd) {
  EXPECT_EQ(call(fn_ends_with, {string("tattoo"), string("too")}), "true");
  EXPECT_EQ(call(fn_ends_with, {string("tattoo"), string("to")}), "false");
  EXPECT_EQ(call(fn_ends_with, {string("oo"), string("too")}), "false");
}

TEST(Contains, TheEmptyStringIsPartOfEveryStringAndHasNoOther) {
  for (const auto procedure : {fn_contains, fn_starts_with, fn_ends_with}) {
    EXPECT_EQ(call(procedure, {string("a"), string("")}), "true");
    EXPECT_EQ(call(procedure, {string("a"), empty()}), "true");
    EXPECT_EQ(call(procedure, {string(""), string("")}), "true");
    EXPECT_EQ(call(procedure, {empty(), empty()}), "true");
    EXPECT_EQ(call(procedure, {string(""), string("a")}), "false");
    EXPECT_EQ(call(procedure, {empty(), string("a")}), "false");
  }
}

TEST(Contains, LooksAtUnitsNotAtCharacters) {
  EXPECT_EQ(call(fn_contains, {typedText(u"a\xD83D\xDE00"), typedText(u"\xDE00")}), "true");
  EXPECT_EQ(call(fn_ends_with, {typedText(u"a\xD83D\xDE00"), typedText(u"\xDE00")}), "true");
  EXPECT_EQ(call(fn_starts_with, {typedText(u"\xD83D\xDE00"), typedText(u"\xD83D")}), "true");
}

TEST(Contains, AnswersWhatAPlainSearchAnswers) {
  Texts texts(5);
  for (int round = 0; round < 20000; ++round) {
    const std::u16string text = texts.next(40);
    const std::u16string part = texts.next(round % 3 ? 3 : 20);
    const std::vector<Value> arguments = {texts.value(text), texts.value(part)};
    const size_t found = text.find(part);
    const bool atEnd = text.size() >= part.size() &&
                       text.compare(text.size() - part.size(), part.size(), part) == 0;
    ASSERT_EQ(XQueryIsTrue(answerOf(fn_contains, arguments)), found != text.npos);
    ASSERT_EQ(XQueryIsTrue(answerOf(fn_starts_with, arguments)), found == 0);
    ASSERT_EQ(XQueryIsTrue(answerOf(fn_ends_with, arguments)), atEnd);
    const std::u16string before = found == text.npos ? u"" : text.substr(0, found);
    const std::u16string after = found == text.npos ? u"" : text.substr(found + part.size());
    ASSERT_EQ(unitsOf(answerOf(fn_substring_before, arguments)), before);
    ASSERT_EQ(unitsOf(answerOf(fn_substring_after, arguments)), after);
  }
}

// A search that starts over at every place would take 10^11 steps here.
TEST(Contains, AHostilePatternTakesTimeInProportionToTheText) {
  for (const char16_t unit : {u'a', u'\u00E9'}) {
    const std::u16string half(500000, unit);
    const Value text = typedText(half + half);
    const Value part = typedText(half + u'b' + half.substr(1));
    const double start = processorSeconds();
    EXPECT_EQ(call(fn_contains, {text, part}), "false");
    EXPECT_LT(processorSeconds() - start, 5);
  }
}

// --- substring-before and substring-after --------------------------------------------------------

TEST(SubstringBefore, IsThePartBeforeTheFirstOccurrence) {
  EXPECT_EQ(call(fn_substring_before, {string("a=b=c"), string("=")}), "string a");
  EXPECT_EQ(call(fn_substring_before, {string("tattoo"), string("attoo")}), "string t");
}

TEST(SubstringBefore, IsEmptyForAnEmptyPartOneNotFoundAndOneAtTheStart) {
  EXPECT_EQ(call(fn_substring_before, {string("abc"), string("")}), "string ");
  EXPECT_EQ(call(fn_substring_before, {string("abc"), empty()}), "string ");
  EXPECT_EQ(call(fn_substring_before, {string("abc"), string("x")}), "string ");
  EXPECT_EQ(call(fn_substring_before, {string("abc"), string("a")}), "string ");
  EXPECT_EQ(call(fn_substring_before, {empty(), string("a")}), "string ");
}

TEST(SubstringAfter, IsThePartAfterTheFirstOccurrence) {
  EXPECT_EQ(call(fn_substring_after, {string("a=b=c"), string("=")}), "string b=c");
  EXPECT_EQ(call(fn_substring_after, {string("tattoo"), string("tat")}), "string too");
}

TEST(SubstringAfter, OfAnEmptyPartIsTheStringItself) {
  EXPECT_EQ(call(fn_substring_after, {string("abc"), string("")}), "string abc");
  EXPECT_EQ(call(fn_substring_after, {untyped("abc"), empty()}), "string abc");
  EXPECT_EQ(call(fn_substring_after, {typed(XQueryTypeNCName, "abc"), empty()}), "NCName abc");
}

TEST(SubstringAfter, IsEmptyWhereNothingIsFoundOrNothingFollows) {
  EXPECT_EQ(call(fn_substring_after, {string("abc"), string("x")}), "string ");
  EXPECT_EQ(call(fn_substring_after, {string("abc"), string("c")}), "string ");
  EXPECT_EQ(call(fn_substring_after, {empty(), string("c")}), "string ");
}

// --- substring -----------------------------------------------------------------------------------

std::string part(const Value& start) {
  return call(fn_substring, {string("12345"), start});
}
std::string part(const Value& start, const Value& length) {
  return call(fn_substring, {string("12345"), start, length});
}

TEST(Substring, CountsFromOneAndRoundsHalvesUp) {
  EXPECT_EQ(part(integer(2)), "string 2345");
  EXPECT_EQ(part(number(1.5)), "string 2345");
  EXPECT_EQ(part(decimal("1.5")), "string 2345");
  EXPECT_EQ(part(single("1.5")), "string 2345");
  EXPECT_EQ(part(decimal("1.49")), "string 12345");
  EXPECT_EQ(part(number(0.49999999999999994)), "string 12345");
  EXPECT_EQ(part(number(-1.5), integer(4)), "string 12");
  EXPECT_EQ(part(decimal("-1.5"), integer(4)), "string 12");
  EXPECT_EQ(part(integer(2), number(2.5)), "string 234");
}

TEST(Substring, WithoutALengthGoesToTheEnd) {
  EXPECT_EQ(part(integer(5)), "string 5");
  EXPECT_EQ(part(integer(6)), "string ");
  EXPECT_EQ(part(integer(1)), "string 12345");
  EXPECT_EQ(part(integer(0)), "string 12345");
  EXPECT_EQ(part(integer(-7)), "string 12345");
}

TEST(Substring, ALengthCountsFromAStartBeforeTheText) {
  EXPECT_EQ(part(integer(0), integer(3)), "string 12");
  EXPECT_EQ(part(integer(0), integer(1)), "string ");
  EXPECT_EQ(part(integer(-2), integer(3)), "string ");
  EXPECT_EQ(part(integer(-2), integer(4)), "string 1");
  EXPECT_EQ(part(integer(-2), integer(100)), "string 12345");
}

TEST(Substring, ALengthIsCutAtTheEnd) {
  EXPECT_EQ(part(integer(2), integer(3)), "string 234");
  EXPECT_EQ(part(integer(4), integer(2)), "string 45");
  EXPECT_EQ(part(integer(4), integer(3)), "string 45");
  EXPECT_EQ(part(integer(5), integer(1)), "string 5");
  EXPECT_EQ(part(integer(6), integer(1)), "string ");
}

TEST(Substring, ALengthOfZeroOrLessGivesNothing) {
  EXPECT_EQ(part(integer(2), integer(0)), "string ");
  EXPECT_EQ(part(integer(2), integer(-1)), "string ");
  EXPECT_EQ(part(integer(2), number(0.4)), "string ");
  EXPECT_EQ(part(integer(2), minusInfinity()), "string ");
}

TEST(Substring, NaNAndMinusInfinityGiveNothing) {
  EXPECT_EQ(part(nan()), "string ");
  EXPECT_EQ(part(minusInfinity()), "string ");
  EXPECT_EQ(part(minusInfinity(), infinity()), "string ");
  EXPECT_EQ(part(nan(), integer(2)), "string ");
  EXPECT_EQ(part(integer(2), nan()), "string ");
  EXPECT_EQ(part(infinity()), "string ");
}

TEST(Substring, AnInfiniteLengthIsAsNone) {
  EXPECT_EQ(part(integer(2), infinity()), "string 2345");
  EXPECT_EQ(part(integer(-4), infinity()), "string 12345");
}

TEST(Substring, FarAwayNumbersAreSafe) {
  const Value least = integer(std::numeric_limits<int64_t>::min());
  const Value most = integer(std::numeric_limits<int64_t>::max());
  EXPECT_EQ(part(least), "string 12345");
  EXPECT_EQ(part(most), "string ");
  EXPECT_EQ(part(least, most), "string ");
  EXPECT_EQ(part(integer(1), most), "string 12345");
  EXPECT_EQ(part(number(-1e300)), "string 12345");
  EXPECT_EQ(part(number(-1e300), number(1e300)), "string ");
  EXPECT_EQ(part(decimal("99999999999999999999")), "string ");
  EXPECT_EQ(part(integer(3), decimal("99999999999999999999")), "string 345");
}

TEST(Substring, ADecimalBeyondDoublesIsNoInfinity) {
  const std::string digits(400, '9');
  EXPECT_EQ(part(decimal("-" + digits)), "string 12345");
  EXPECT_EQ(part(decimal("-" + digits), infinity()), "string 12345");
  EXPECT_EQ(part(integer(3), decimal(digits)), "string 345");
}

TEST(Substring, OnlyTheWholeSourceToItsEndKeepsItsType) {
  const auto tokenPart = [](std::vector<Value> bounds) {
    bounds.insert(bounds.begin(), typed(XQueryTypeToken, "12345"));
    return call(fn_substring, bounds);
  };
  EXPECT_EQ(tokenPart({integer(1)}), "token 12345");
  EXPECT_EQ(tokenPart({integer(0), infinity()}), "token 12345");
  EXPECT_EQ(tokenPart({integer(2)}), "string 2345");
  EXPECT_EQ(tokenPart({integer(1), integer(4)}), "string 1234");
  EXPECT_EQ(tokenPart({integer(1), integer(5)}), "string 12345");
}

// Its first position is behind its end, so that nothing is left of it from there; before it there
// is the whole of it.
TEST(Substring, OfAnEmptyTokenFromItsStartIsTheEmptyString) {
  const Value token = typed(XQueryTypeToken, "");
  EXPECT_EQ(call(fn_substring, {token, integer(1)}), "string ");
  EXPECT_EQ(call(fn_substring, {token, integer(1), infinity()}), "string ");
  EXPECT_EQ(call(fn_substring, {token, integer(0)}), "token ");
}

TEST(Substring, AnEmptyStartOrLengthGivesNothing) {
  EXPECT_EQ(part(empty()), "string ");
  EXPECT_EQ(part(empty(), integer(1)), "string ");
  EXPECT_EQ(part(integer(1), empty()), "string ");
  EXPECT_EQ(call(fn_substring, {empty(), integer(1)}), "string ");
}

TEST(Substring, AnUntypedNumberIsADouble) {
  EXPECT_EQ(part(untyped("1.5"), elementFrom("<n>2</n>")), "string 23");
}

TEST(Substring, WhatIsNoNumberIsAnError) {
  EXPECT_EQ(part(string("1")), "error 6 not a numeric type - 1");
  EXPECT_EQ(part(nan(), string("1")), "error 6 not a numeric type - 1");
  EXPECT_EQ(part(boolean(true)), "error 6 not a numeric type - true");
  EXPECT_EQ(call(fn_substring, {integer(12), integer(1)}), "error 6 not a string type - 12");
}

TEST(Substring, TheWholeSourceIsTheSourceItself) {
  const Value source = typed(XQueryTypeNCName, "abc");
  EXPECT_EQ(answerOf(fn_substring, {source, integer(0)}), source);
  EXPECT_EQ(call(fn_substring, {source, integer(2)}), "string bc");
}

TEST(Substring, CountsUnits) {
  EXPECT_EQ(unitsOf(answerOf(fn_substring, {typedText(u"a\xD83D\xDE00z"), integer(3)})),
            u"\xDE00z");
}

TEST(Substring, TakesTwoOrThreeArguments) {
  EXPECT_EQ(refusedCounts(fn_substring, untyped("1")), "0 1 4 5");
}

// Every unit at position p with round(start) <= p < round(start) + round(length) is in the part.
TEST(Substring, HoldsTheUnitsWhosePositionsAreInTheRange) {
  Texts texts(3);
  for (int round = 0; round < 20000; ++round) {
    const std::u16string text = texts.next(8);
    const double start = static_cast<double>(texts.random()() % 101) / 4 - 10;
    const double length = static_cast<double>(texts.random()() % 101) / 4 - 5;
    const double from = std::floor(start + 0.5);
    std::u16string rest;
    std::u16string expected;
    for (size_t index = 0; index < text.size(); ++index) {
      const auto position = static_cast<double>(index + 1);
      if (position >= from) rest += text[index];
      if (position >= from && position < from + std::floor(length + 0.5)) expected += text[index];
    }
    const Value source = texts.value(text);
    ASSERT_EQ(unitsOf(answerOf(fn_substring, {source, number(start)})), rest);
    ASSERT_EQ(unitsOf(answerOf(fn_substring, {source, number(start), number(length)})), expected)
        << units(text) << " " << start << " " << length;
  }
}

}  // namespace
}  // namespace xquery
