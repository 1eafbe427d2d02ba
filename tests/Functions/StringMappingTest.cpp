#include "Functions/StringMapping.h"
#include "Functions/StringTesting.h"

#include <clocale>

namespace xquery {
namespace {

using namespace functiontest;

// --- normalize-space -----------------------------------------------------------------------------

TEST(NormalizeSpace, TrimsAndCollapses) {
  EXPECT_EQ(call(fn_normalize_space, {string(" a\t b\r\n\nc ")}), "string a b c");
  EXPECT_EQ(call(fn_normalize_space, {string("abc")}), "string abc");
  EXPECT_EQ(call(fn_normalize_space, {string(" \t\r\n")}), "string ");
  EXPECT_EQ(call(fn_normalize_space, {string("")}), "string ");
  EXPECT_EQ(call(fn_normalize_space, {string("\xC2\xA0 \xC3\xA9  x")}),
            "string \xC2\xA0 \xC3\xA9 x");
}

TEST(NormalizeSpace, GivesAString) {
  EXPECT_EQ(call(fn_normalize_space, {typed(XQueryTypeNCName, "abc")}), "string abc");
  EXPECT_EQ(call(fn_normalize_space, {untyped(" a ")}), "string a");
  EXPECT_EQ(call(fn_normalize_space, {empty()}), "string ");
}

TEST(NormalizeSpace, WithoutArgumentsIsOfTheContextItem) {
  EXPECT_EQ(call(fn_normalize_space, {}, elementFrom("<a> x <b> y</b></a>")), "string x y");
  EXPECT_EQ(call(fn_normalize_space, {}), "null");
}

TEST(NormalizeSpace, OfWhatIsNoTextIsAnError) {
  EXPECT_EQ(call(fn_normalize_space, {integer(1)}), "error 6 not a string type - 1");
}

TEST(NormalizeSpace, TakesUpToOneArgument) {
  EXPECT_EQ(refusedCounts(fn_normalize_space, string("a"), 5, string("a")), "2 3 4 5");
}

TEST(NormalizeSpace, DropsTheSpacesThatAPlainPassDrops) {
  Texts texts(2);
  for (int round = 0; round < 5000; ++round) {
    const std::u16string text = texts.next(20);
    std::u16string expected;
    for (const char16_t unit : text) {
      if (unit != u' ' && unit != u'\n') {
        expected += unit;
      } else if (!expected.empty() && expected.back() != u' ') {
        expected += u' ';
      }
    }
    if (!expected.empty() && expected.back() == u' ') expected.pop_back();
    ASSERT_EQ(unitsOf(answerOf(fn_normalize_space, {texts.value(text)})), expected);
  }
}

// --- normalize-unicode ---------------------------------------------------------------------------

// The ligature fi, e and an acute accent, and the composed e with one.
constexpr std::u16string_view mixed = u"\uFB01e\u0301\u00E9";

std::u16string inForm(std::string_view form) {
  return unitsOf(answerOf(fn_normalize_unicode, {typedText(mixed), string(form)}));
}

TEST(NormalizeUnicode, KnowsFourForms) {
  EXPECT_EQ(inForm("NFC"), u"\uFB01\u00E9\u00E9");
  EXPECT_EQ(inForm("NFD"), u"\uFB01e\u0301e\u0301");
  EXPECT_EQ(inForm("NFKC"), u"fi\u00E9\u00E9");
  EXPECT_EQ(inForm("NFKD"), u"fie\u0301e\u0301");
}

TEST(NormalizeUnicode, WithoutAFormIsNFC) {
  EXPECT_EQ(unitsOf(answerOf(fn_normalize_unicode, {typedText(mixed)})), inForm("NFC"));
}

TEST(NormalizeUnicode, AnEmptyFormLeavesTheStringAsItIs) {
  const Value input = typedText(mixed);
  EXPECT_EQ(answerOf(fn_normalize_unicode, {input, string("")}), input);
  EXPECT_EQ(answerOf(fn_normalize_unicode, {input, empty()}), input);
}

TEST(NormalizeUnicode, AnyOtherFormIsAnErrorThatIsAnsweredNotRaised) {
  for (const char* form :
       {"nfc", " NFC", "NFC ", "NFKX", "fully-normalized", "FULLY-NORMALIZED", "NF", "NFCC"}) {
    const Value answer = answerOf(fn_normalize_unicode, {string("a"), string(form)});
    EXPECT_EQ(show(answer), "record 0 err:FOCH0003 - unsupported normalization form") << form;
  }
  EXPECT_EQ(answer("normalize-unicode('a', 'nfc')"),
            "error 0 line 0 err:FOCH0003 - unsupported normalization form");
}

TEST(NormalizeUnicode, LeavesPlainTextAlone) {
  for (const char* form : {"NFC", "NFD", "NFKC", "NFKD"}) {
    EXPECT_EQ(call(fn_normalize_unicode, {string("a b"), string(form)}), "string a b");
  }
  EXPECT_EQ(call(fn_normalize_unicode, {typed(XQueryTypeNCName, "ab")}), "string ab");
  EXPECT_EQ(call(fn_normalize_unicode, {empty(), string("NFD")}), "string ");
}

TEST(NormalizeUnicode, TakesTextAndNothingElse) {
  EXPECT_EQ(call(fn_normalize_unicode, {integer(1)}), "error 6 not a string type - 1");
  EXPECT_EQ(call(fn_normalize_unicode, {string("a"), integer(1)}), "error 6 not a string type - 1");
  EXPECT_EQ(refusedCounts(fn_normalize_unicode, string("")), "0 3 4 5");
}

// --- upper-case and lower-case -------------------------------------------------------------------

TEST(CaseMapping, MapsPlainText) {
  EXPECT_EQ(call(fn_upper_case, {string("aZ@[`{z0\x7F")}), "string AZ@[`{Z0\x7F");
  EXPECT_EQ(call(fn_lower_case, {string("aZ@[`{A0\x7F")}), "string az@[`{a0\x7F");
  EXPECT_EQ(call(fn_upper_case, {string("")}), "string ");
  EXPECT_EQ(call(fn_lower_case, {empty()}), "string ");
}

TEST(CaseMapping, MapsTheStringAsAWhole) {
  EXPECT_EQ(unitsOf(answerOf(fn_upper_case, {typedText(u"stra\u00DFe \u00E9\uFB01")})),
            u"STRASSE \u00C9FI");
  EXPECT_EQ(unitsOf(answerOf(fn_lower_case, {typedText(u"\u039F\u03A3 \u00C9")})),
            u"\u03BF\u03C2 \u00E9");
  EXPECT_EQ(unitsOf(answerOf(fn_upper_case, {typedText(u"\xD801\xDC28")})), u"\xD801\xDC00");
  EXPECT_EQ(unitsOf(answerOf(fn_upper_case, {typedText(u"a\xD801")})), u"A\xD801");
}

TEST(CaseMapping, NoLocaleOfTheProcessTakesPart) {
  setenv("LC_ALL", "tr_TR.UTF-8", 1);
  std::setlocale(LC_ALL, "");
  EXPECT_EQ(unitsOf(answerOf(fn_upper_case, {typedText(u"i\u00E9")})), u"I\u00C9");
  EXPECT_EQ(unitsOf(answerOf(fn_lower_case, {typedText(u"I\u00C9")})), u"i\u00E9");
  EXPECT_EQ(call(fn_upper_case, {string("i")}), "string I");
  unsetenv("LC_ALL");
  std::setlocale(LC_ALL, "C");
}

TEST(CaseMapping, TakesTheTextOfNodesAndNoNumbers) {
  EXPECT_EQ(call(fn_upper_case, {elementFrom("<a>x<b>y</b></a>")}), "string XY");
  EXPECT_EQ(call(fn_upper_case, {typed(XQueryTypeNCName, "ab")}), "string AB");
  EXPECT_EQ(call(fn_lower_case, {integer(1)}), "error 6 not a string type - 1");
}

TEST(CaseMapping, TakesOneArgument) {
  EXPECT_EQ(refusedCounts(fn_upper_case, string("a")), "0 2 3 4 5");
  EXPECT_EQ(refusedCounts(fn_lower_case, string("a")), "0 2 3 4 5");
}

// A letter outside ASCII before and after makes the text wide; the letters between map the same.
TEST(CaseMapping, TextOfBothWidthsMapsAlike) {
  for (char16_t unit = 0; unit < 0x80; ++unit) {
    const std::u16string narrow(1, unit);
    const std::u16string wide = u"\u4E2D" + narrow + u"\u4E2D";
    for (const auto procedure : {fn_upper_case, fn_lower_case}) {
      const std::u16string mapped = unitsOf(answerOf(procedure, {typedText(wide)}));
      ASSERT_EQ(mapped.substr(1, 1), unitsOf(answerOf(procedure, {typedText(narrow)})))
          << int{unit};
    }
  }
}

// --- translate -----------------------------------------------------------------------------------

std::string translated(std::string_view text, std::string_view map, std::string_view translation) {
  return call(fn_translate, {string(text), string(map), string(translation)});
}

TEST(Translate, ReplacesDropsAndKeepsCharacters) {
  EXPECT_EQ(translated("abcdabc", "abc", "AB"), "string ABdAB");
  EXPECT_EQ(translated("bar", "abc", "ABC"), "string BAr");
  EXPECT_EQ(translated("--aaa--", "abc-", "ABC"), "string AAA");
  EXPECT_EQ(translated("abc", "", "xyz"), "string abc");
  EXPECT_EQ(translated("abc", "abc", ""), "string ");
  EXPECT_EQ(translated("", "abc", "xyz"), "string ");
}

TEST(Translate, TheFirstOccurrenceInTheMapHolds) {
  EXPECT_EQ(translated("aba", "aab", "xyz"), "string xzx");
  EXPECT_EQ(translated("\xC3\xA9", "\xC3\xA9\xC3\xA9", "xy"), "string x");
  EXPECT_EQ(translated("a", "xa", "y"), "string ");
  EXPECT_EQ(translated("aa", "aba", "\xC3\xA9"), "string \xC3\xA9\xC3\xA9");
}

TEST(Translate, MapsTheHalvesOfASurrogatePairOnTheirOwn) {
  const auto of = [](std::u16string_view text, std::u16string_view map,
                     std::u16string_view translation) {
    return unitsOf(
        answerOf(fn_translate, {typedText(text), typedText(map), typedText(translation)}));
  };
  EXPECT_EQ(of(u"\xD83D\xDE00", u"\xD83D\xDE00", u"ab"), u"ab");
  EXPECT_EQ(of(u"\xD83D\xDE01", u"\xD83D\xDE00", u"ab"), u"a\xDE01");
  EXPECT_EQ(of(u"xy", u"xy", u"\xD83D\xDE00"), u"\xD83D\xDE00");
}

TEST(Translate, TheEmptySequenceIsTheEmptyString) {
  EXPECT_EQ(call(fn_translate, {empty(), string("a"), string("b")}), "string ");
  EXPECT_EQ(call(fn_translate, {string("a"), empty(), string("b")}), "string a");
  EXPECT_EQ(call(fn_translate, {string("a"), string("a"), empty()}), "string ");
}

TEST(Translate, TakesThreeTexts) {
  EXPECT_EQ(refusedCounts(fn_translate, string("a")), "0 1 2 4 5");
  EXPECT_EQ(call(fn_translate, {integer(1), string("a"), string("b")}),
            "error 6 not a string type - 1");
  EXPECT_EQ(call(fn_translate, {string("a"), integer(2), string("b")}),
            "error 6 not a string type - 2");
  EXPECT_EQ(call(fn_translate, {string("a"), string("b"), integer(3)}),
            "error 6 not a string type - 3");
}

TEST(Translate, AnswersWhatASearchForEachUnitAnswers) {
  Texts texts(4);
  for (int round = 0; round < 20000; ++round) {
    const std::u16string text = texts.next(20);
    const std::u16string map = texts.next(6);
    const std::u16string translation = texts.next(6);
    std::u16string expected;
    for (const char16_t unit : text) {
      const size_t index = map.find(unit);
      if (index == map.npos) {
        expected += unit;
      } else if (index < translation.size()) {
        expected += translation[index];
      }
    }
    const Value answer =
        answerOf(fn_translate, {texts.value(text), texts.value(map), texts.value(translation)});
    ASSERT_EQ(unitsOf(answer), expected);
  }
}

// --- escape-uri ----------------------------------------------------------------------------------

std::string escaped(std::string_view text, bool escapeReserved) {
  return call(fn_escape_uri, {string(text), boolean(escapeReserved)});
}

TEST(EscapeURI, NeverEscapesLettersDigitsMarksAndPercentSigns) {
  const std::string kept = "AZaz09-_.!~*'()%";
  EXPECT_EQ(escaped(kept, true), "string " + kept);
  EXPECT_EQ(escaped(kept, false), "string " + kept);
}

TEST(EscapeURI, EscapesReservedCharactersWhenAsked) {
  EXPECT_EQ(escaped(";/?:@&=+$,#[]", true), "string %3B%2F%3F%3A%40%26%3D%2B%24%2C%23%5B%5D");
  EXPECT_EQ(escaped(";/?:@&=+$,#[]", false), "string ;/?:@&=+$,#[]");
  EXPECT_EQ(escaped("http://a/b c#d", true), "string http%3A%2F%2Fa%2Fb%20c%23d");
  EXPECT_EQ(escaped("http://a/b c#d", false), "string http://a/b%20c#d");
}

TEST(EscapeURI, AlwaysEscapesWhatNoURIHolds) {
  for (const bool escapeReserved : {true, false}) {
    EXPECT_EQ(escaped(" \"<>\\^`{|}\t\n\x01\x7F", escapeReserved),
              "string %20%22%3C%3E%5C%5E%60%7B%7C%7D%09%0A%01%7F");
    EXPECT_EQ(escaped("\xC3\xA9\xF0\x9F\x98\x80z", escapeReserved), "string %C3%A9%F0%9F%98%80z");
  }
}

TEST(EscapeURI, TheEffectiveBooleanValueDecides) {
  EXPECT_EQ(call(fn_escape_uri, {string("/"), string("x")}), "string %2F");
  EXPECT_EQ(call(fn_escape_uri, {string("/"), string("")}), "string /");
  EXPECT_EQ(call(fn_escape_uri, {string("/"), empty()}), "string /");
  EXPECT_EQ(call(fn_escape_uri, {string("/"), integer(0)}), "string /");
  EXPECT_EQ(call(fn_escape_uri, {string("/"), elementFrom("<a/>")}), "string %2F");
  EXPECT_EQ(call(fn_escape_uri, {string("/"), sequence({integer(0), integer(0)})}), "string %2F");
}

TEST(EscapeURI, WithoutAnEffectiveBooleanValueIsRefused) {
  const Value record = XQueryError::error(6, NSString::stringWithASCII("failed"));
  EXPECT_EQ(call(fn_escape_uri, {string("/"), record}), "null");
}

TEST(EscapeURI, ALoneSurrogateIsRefused) {
  for (const auto text : {u"\xD83D", u"\xDE00", u"a\xD83Dz", u"\xDE00\xD83D", u"\xD83D\xD83D"}) {
    EXPECT_EQ(call(fn_escape_uri, {typedText(text), boolean(true)}), "null");
  }
}

TEST(EscapeURI, TheEmptySequenceIsTheEmptyString) {
  EXPECT_EQ(call(fn_escape_uri, {empty(), boolean(true)}), "string ");
}

TEST(EscapeURI, TakesATextAndOneMore) {
  EXPECT_EQ(call(fn_escape_uri, {integer(1), boolean(true)}), "error 6 not a string type - 1");
  EXPECT_EQ(refusedCounts(fn_escape_uri, string("a")), "0 1 3 4 5");
}

// --- long texts ----------------------------------------------------------------------------------

// Long texts are gone through in pieces, which must not show where they meet.
TEST(StringMapping, LongTextsOfBothWidthsAreMappedAsShortOnesAre) {
  for (const std::u16string_view piece : {u"aB \n/%#", u"a\u00E9 \n/%#"}) {
    std::u16string text;
    while (text.size() < 40000) text += piece;
    const auto repeated = [&](XQueryProcedure procedure, std::vector<Value> arguments) {
      const std::u16string once = unitsOf(answerOf(procedure, arguments));
      std::u16string all;
      while (all.size() < text.size() / piece.size() * once.size()) all += once;
      arguments[0] = typedText(text);
      EXPECT_EQ(unitsOf(answerOf(procedure, arguments)), all);
    };
    repeated(fn_upper_case, {typedText(piece)});
    repeated(fn_lower_case, {typedText(piece)});
    repeated(fn_translate, {typedText(piece), string("aB/"), string("xy")});
    repeated(fn_escape_uri, {typedText(piece), boolean(true)});
    std::u16string spaced;
    for (std::u16string_view rest = text; !rest.empty(); rest.remove_prefix(piece.size())) {
      spaced += std::u16string(piece.substr(0, 2)) + u" /%#";
    }
    EXPECT_EQ(unitsOf(answerOf(fn_normalize_space, {typedText(text)})), spaced);
    EXPECT_EQ(unitsOf(answerOf(fn_normalize_space, {typedText(std::u16string(40000, u'x'))})),
              std::u16string(40000, u'x'));
    EXPECT_EQ(unitsOf(answerOf(fn_normalize_space, {typedText(std::u16string(40000, u' '))})), u"");
  }
}

}  // namespace
}  // namespace xquery
