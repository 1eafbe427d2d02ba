#include "Functions/String.h"
#include "Functions/StringTesting.h"

namespace xquery {
namespace {

using namespace functiontest;
using namespace std::string_literals;

constexpr auto notAString = "error 6 not a string type - ";

// --- compare -------------------------------------------------------------------------------------

TEST(Compare, IsMinusOneZeroOrOneAsAnInteger) {
  EXPECT_EQ(call(fn_compare, {string("a"), string("b")}), "integer -1");
  EXPECT_EQ(call(fn_compare, {string("abc"), string("abc")}), "integer 0");
  EXPECT_EQ(call(fn_compare, {string("b"), string("abc")}), "integer 1");
  EXPECT_EQ(call(fn_compare, {string("a"), string("ab")}), "integer -1");
}

TEST(Compare, OrdersByCodePoint) {
  EXPECT_EQ(call(fn_compare, {string("Z"), string("a")}), "integer -1");
  EXPECT_EQ(call(fn_compare, {string("z"), string("\xC3\xA9")}), "integer -1");
  EXPECT_EQ(call(fn_compare, {typedText(u"\xD83D\xDE00"), typedText(u"\xFFFD")}), "integer 1");
}

TEST(Compare, WithTheEmptySequenceIsEmpty) {
  EXPECT_EQ(call(fn_compare, {string("a"), empty()}), "()");
  EXPECT_EQ(call(fn_compare, {empty(), string("a")}), "()");
  EXPECT_EQ(call(fn_compare, {empty(), empty()}), "()");
  EXPECT_EQ(call(fn_compare, {string(""), string("")}), "integer 0");
}

TEST(Compare, ACollationChangesNothingButMustBeAString) {
  EXPECT_EQ(call(fn_compare, {string("a"), string("B"), string("urn:x")}), "integer 1");
  EXPECT_EQ(call(fn_compare, {string("a"), string("B"), empty()}), "integer 1");
  EXPECT_EQ(call(fn_compare, {string("a"), empty(), string("urn:x")}), "()");
  EXPECT_EQ(call(fn_compare, {string("a"), string("B"), integer(1)}), notAString + "1"s);
}

TEST(Compare, TakesTextAndNothingElse) {
  EXPECT_EQ(call(fn_compare, {elementFrom("<a>x</a>"), untyped("x")}), "integer 0");
  EXPECT_EQ(call(fn_compare, {typed(XQueryTypeAnyURI, "urn:x"), string("urn:x")}), "integer 0");
  EXPECT_EQ(call(fn_compare, {integer(1), string("a")}), notAString + "1"s);
  EXPECT_EQ(call(fn_compare, {string("a"), boolean(true)}), notAString + "true"s);
}

TEST(Compare, TakesTwoOrThreeArguments) {
  EXPECT_EQ(refusedCounts(fn_compare, string("a")), "0 1 4 5");
}

// --- concat --------------------------------------------------------------------------------------

TEST(Concat, JoinsTheStringsOfItsArguments) {
  EXPECT_EQ(call(fn_concat, {string("a"), integer(1)}), "untypedAtomic a1");
  EXPECT_EQ(call(fn_concat, {number(1.5), boolean(true), untyped("u"), months(14)}),
            "untypedAtomic 1.5trueuP1Y2M");
}

TEST(Concat, GivesAnUntypedValue) {
  EXPECT_EQ(call(fn_concat, {string("a"), string("b")}), "untypedAtomic ab");
}

TEST(Concat, TakesTheTextOfNodes) {
  EXPECT_EQ(call(fn_concat, {elementFrom("<a>x<b>y</b></a>"), string("z")}), "untypedAtomic xyz");
}

TEST(Concat, TheEmptySequenceContributesNothing) {
  EXPECT_EQ(call(fn_concat, {string("a"), empty(), string("b")}), "untypedAtomic ab");
  EXPECT_EQ(call(fn_concat, {empty(), empty()}), "untypedAtomic ");
}

TEST(Concat, KeepsTextOutsideASCII) {
  EXPECT_EQ(call(fn_concat, {string("a"), string("\xC3\xA9"), string("\xF0\x9F\x98\x80")}),
            "untypedAtomic a\xC3\xA9\xF0\x9F\x98\x80");
}

// Whatever length the pieces have, and wherever the first wide one stands.
TEST(Concat, PutsShortAndLongPiecesTogether) {
  for (const size_t length : {0, 1, 127, 128, 255, 256, 257, 300, 5000}) {
    const std::string piece(length, 'x');
    const std::string wide = piece + "\xC3\xA9";
    for (const std::string& first : {piece, wide}) {
      for (const std::string& second : {piece, wide}) {
        const auto tree = elementFrom("<a>" + second + "</a>");
        EXPECT_EQ(call(fn_concat, {string(first), tree, integer(7), untyped(first)}),
                  "untypedAtomic " + first + second + "7" + first);
      }
    }
  }
}

TEST(Concat, AnArgumentOfSeveralItemsIsAnError) {
  EXPECT_EQ(call(fn_concat, {sequence({integer(1), integer(2)}), string("a")}),
            "error 6 invalid type for automization");
}

TEST(Concat, TakesTwoArgumentsOrMore) {
  EXPECT_EQ(refusedCounts(fn_concat, string("a"), 12), "0 1");
  EXPECT_EQ(call(fn_concat, std::vector<Value>(12, string("a"))), "untypedAtomic aaaaaaaaaaaa");
}

// --- string-join ---------------------------------------------------------------------------------

TEST(StringJoin, PutsTheSeparatorBetweenTheItems) {
  const Value items = sequence({string("a"), untyped("b"), elementFrom("<x>c<y>d</y></x>")});
  EXPECT_EQ(call(fn_string_join, {items, string(", ")}), "string a, b, cd");
  EXPECT_EQ(call(fn_string_join, {items, string("")}), "string abcd");
  EXPECT_EQ(call(fn_string_join, {items, empty()}), "string abcd");
}

TEST(StringJoin, OfASingleItemIsItsString) {
  EXPECT_EQ(call(fn_string_join, {string("a"), string("-")}), "string a");
  EXPECT_EQ(call(fn_string_join, {elementFrom("<x>c</x>"), string("-")}), "string c");
}

TEST(StringJoin, OfTheEmptySequenceIsTheEmptyString) {
  EXPECT_EQ(call(fn_string_join, {empty(), string("-")}), "string ");
}

TEST(StringJoin, TheSameItemTwiceIsJoinedTwice) {
  const Value item = string("a");
  EXPECT_EQ(call(fn_string_join, {sequence({item, item, item}), string("-")}), "string a-a-a");
}

TEST(StringJoin, AnItemOrSeparatorThatIsNoTextIsAnError) {
  EXPECT_EQ(call(fn_string_join, {sequence({string("a"), integer(1)}), string("-")}),
            notAString + "1"s);
  EXPECT_EQ(call(fn_string_join, {integer(7), string("-")}), notAString + "7"s);
  EXPECT_EQ(call(fn_string_join, {string("a"), integer(1)}), notAString + "1"s);
}

TEST(StringJoin, TakesTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_string_join, string("a")), "0 1 3 4 5");
}

TEST(StringJoin, JoinsTextsOfBothWidthsAsPlainAppendingDoes) {
  Texts texts(11);
  for (int round = 0; round < 2000; ++round) {
    const std::u16string separator = texts.next(3);
    std::vector<Value> items;
    std::u16string expected;
    for (size_t count = 2 + texts.random()() % 5; items.size() < count;) {
      const std::u16string text = texts.next(9);
      if (!items.empty()) expected += separator;
      expected += text;
      items.push_back(texts.value(text));
    }
    const Value answer = answerOf(fn_string_join, {sequence(items), texts.value(separator)});
    ASSERT_EQ(unitsOf(answer), expected);
  }
}

// --- string-length -------------------------------------------------------------------------------

TEST(StringLength, CountsUTF16Units) {
  EXPECT_EQ(call(fn_string_length, {string("abc")}), "integer 3");
  EXPECT_EQ(call(fn_string_length, {string("\xC3\xA9")}), "integer 1");
  EXPECT_EQ(call(fn_string_length, {string("\xF0\x9F\x98\x80")}), "integer 2");
  EXPECT_EQ(call(fn_string_length, {string("")}), "integer 0");
  EXPECT_EQ(call(fn_string_length, {empty()}), "integer 0");
}

TEST(StringLength, WithoutArgumentsIsOfTheContextItem) {
  EXPECT_EQ(call(fn_string_length, {}, elementFrom("<a>x<b>yz</b></a>")), "integer 3");
  EXPECT_EQ(call(fn_string_length, {}), "null");
  EXPECT_EQ(call(fn_string_length, {}, integer(12)), notAString + "12"s);
}

TEST(StringLength, OfWhatIsNoTextIsAnError) {
  EXPECT_EQ(call(fn_string_length, {integer(12)}), notAString + "12"s);
  EXPECT_EQ(call(fn_string_length, {sequence({string("a"), string("b")})}), notAString + "(a, b)"s);
}

TEST(StringLength, TakesUpToOneArgument) {
  EXPECT_EQ(refusedCounts(fn_string_length, string("a"), 5, string("a")), "2 3 4 5");
}

}  // namespace
}  // namespace xquery
