#include "Functions/FunctionsTesting.h"
#include "Functions/XQueryRegEx.h"

#include <gtest/gtest.h>

#include <array>
#include <random>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

using functiontest::show;

Ref<NSString> text(std::string_view utf8) {
  return NSString::stringWithUTF8(utf8);
}
Ref<NSString> text(std::u16string_view units) {
  return NSString::stringWithUTF16(units);
}

Ref<XQueryRegEx> regEx(std::string_view pattern, std::string_view flags = "") {
  return XQueryRegEx::regExp(text(pattern)->view(), text(flags)->view());
}

// "true", "false", "null", or "invalid" for a pattern or flags that are.
std::string has(std::string_view subject, std::string_view pattern, std::string_view flags = "") {
  const auto compiled = regEx(pattern, flags);
  return compiled ? show(compiled->hasMatch(text(subject).get())) : "invalid";
}

// Strings bare, a sequence in brackets with "|" between, "()" and "null".
std::string pieces(const Value& value) {
  if (!value) return "null";
  if (value->kind() == Kind::Null) return "()";
  if (const auto* string = dyn_cast<NSString>(value)) return string->utf8();
  std::string all = "[";
  for (const Value& piece : cast<NSArray>(value)->objects()) {
    all += (all.size() > 1 || &piece != &cast<NSArray>(value)->objects().front() ? "|" : "") +
           cast<NSString>(piece)->utf8();
  }
  return all + "]";
}

std::string found(std::string_view subject, std::string_view pattern, std::string_view flags = "") {
  return pieces(regEx(pattern, flags)->matches(text(subject).get()));
}
std::string replaced(std::string_view subject, std::string_view pattern, std::string_view with,
                     std::string_view flags = "") {
  return pieces(regEx(pattern, flags)->replace(text(subject).get(), text(with)->view()));
}
std::string tokens(std::string_view subject, std::string_view pattern,
                   std::string_view flags = "") {
  return pieces(regEx(pattern, flags)->tokenize(text(subject).get()));
}

// --- the plain functions -------------------------------------------------------------------------

TEST(RegExpFunctions, CompileMasksItsOptions) {
  struct Row {
    uint32_t option;
    const char* pattern;
    const char* subject;
    int without;
    int with;
  };
  for (const Row& row : std::to_array<Row>({
           {0x1, "A", "a", -1, 1},
           {0x2, "^b", "a\nb", -1, 1},
           {0x4, "a.b", "a\nb", -1, 1},
           {0x8, "a b", "ab", -1, 1},
           {0x10, "b", "ab", 1, -1},
           {0x20, "a$", "a\n", 1, -1},
           {0x200, "(a+?)(a*)", "aa", 3, 3},
           {0x1000, "(a)", "a", 2, 1},
           {0x80, "^a", "a", 1, 1},     // not at the beginning of a line: no option of compiling
           {0x100, "a$", "a", 1, 1},    // not at the end of a line
           {0x400, "a*", "b", 1, 1},    // not empty
           {0x4000, "(a)", "a", 2, 2},  // unknown
       })) {
    std::array<int64_t, 30> offsets = {};
    const std::string_view subject = row.subject;
    const RegExpCodeOwner plain(RegExpCompile(row.pattern, 0));
    const RegExpCodeOwner special(RegExpCompile(row.pattern, row.option));
    EXPECT_EQ(RegExpExec(plain.get(), subject.data(), subject.size(), 0, 0, offsets.data(), 30),
              row.without)
        << row.option;
    EXPECT_EQ(RegExpExec(special.get(), subject.data(), subject.size(), 0, 0, offsets.data(), 30),
              row.with)
        << row.option;
  }
}

TEST(RegExpFunctions, TheExtraOptionMakesUnknownEscapesErrors) {
  const RegExpCodeOwner plain(RegExpCompile("\\y", 0));
  const RegExpCodeOwner extra(RegExpCompile("\\y", 0x40));
  EXPECT_TRUE(plain);
  EXPECT_FALSE(extra);
}

TEST(RegExpFunctions, CompileAlwaysReadsUTF8) {
  const RegExpCodeOwner code(RegExpCompile("^.$", 0));
  std::array<int64_t, 30> offsets = {};
  EXPECT_EQ(RegExpExec(code.get(), "ä", 2, 0, 0, offsets.data(), 30), 1);
}

TEST(RegExpFunctions, CompileReportsTheErrorAndItsOffset) {
  std::string error;
  size_t offset = 0;
  EXPECT_EQ(RegExpCompile("a(b", 0, &error, &offset), nullptr);
  EXPECT_NE(error, "");
  EXPECT_EQ(offset, 3U);
}

TEST(RegExpFunctions, ExecMasksItsOptions) {
  struct Row {
    uint32_t option;
    const char* pattern;
    int with;
  };
  for (const Row& row : std::to_array<Row>({
           {0x10, "b", -1},
           {0x80, "^a", -1},
           {0x100, "b$", -1},
           {0x400, "x*", -1},
           {0x2000, "a", 1},
           {0x1, "A", -1},     // caseless: no option of matching
           {0x800, "ab", 1},   // UTF-8
           {0x8000, "ab", 1},  // unknown
       })) {
    const RegExpCodeOwner code(RegExpCompile(row.pattern, 0));
    std::array<int64_t, 30> offsets = {};
    EXPECT_EQ(RegExpExec(code.get(), "ab", 2, 0, row.option, offsets.data(), 30), row.with)
        << row.option;
  }
}

TEST(RegExpFunctions, ExecStoresOffsetsInTheFirstTwoThirds) {
  const RegExpCodeOwner code(RegExpCompile("(x)?(b)(c)", 0));
  std::array<int64_t, 12> offsets = {};
  offsets.fill(77);
  EXPECT_EQ(RegExpExec(code.get(), "abc", 3, 1, 0, offsets.data(), 12), 4);
  EXPECT_EQ(offsets, (std::array<int64_t, 12>{1, 3, -1, -1, 1, 2, 2, 3, 77, 77, 77, 77}));
  EXPECT_EQ(RegExpExec(code.get(), "abc", 3, 1, 0, offsets.data(), 6), 0);
  EXPECT_EQ(RegExpExec(code.get(), "abc", 3, 1, 0, nullptr, 0), 0);
  EXPECT_EQ(RegExpExec(code.get(), "abc", 3, 2, 0, offsets.data(), 12), RegExpNoMatch);
  EXPECT_EQ(RegExpExec(code.get(), "abc", 3, 4, 0, offsets.data(), 12), RegExpFailed);
}

TEST(RegExpFunctions, DisposeAcceptsNone) {
  RegExpDispose(nullptr);
  RegExpDispose(RegExpCompile("a", 0));
}

// --- creation ------------------------------------------------------------------------------------

TEST(RegExCreation, FlagsSetTheirBits) {
  EXPECT_EQ(regEx("a", "")->flags(), 0U);
  EXPECT_EQ(regEx("a", "i")->flags(), 1U);
  EXPECT_EQ(regEx("a", "m")->flags(), 2U);
  EXPECT_EQ(regEx("a", "s")->flags(), 4U);
  EXPECT_EQ(regEx("a", "x")->flags(), 8U);
  EXPECT_EQ(regEx("a", "ix")->flags(), 9U);
  EXPECT_EQ(regEx("a", "xsmixsmi")->flags(), 15U);
}

TEST(RegExCreation, AnyOtherFlagFails) {
  for (const char* flags : {"q", "I", "M", "g", " ", "iq", "i ", "ä", "i,m"}) {
    EXPECT_FALSE(regEx("a", flags)) << flags;
  }
}

TEST(RegExCreation, FlagsChangeTheMatching) {
  EXPECT_EQ(has("abc", "B"), "false");
  EXPECT_EQ(has("abc", "B", "i"), "true");
  EXPECT_EQ(has("Ä", "ä", "i"), "true");
  EXPECT_EQ(has("a\nb", "^b$"), "false");
  EXPECT_EQ(has("a\nb", "^b$", "m"), "true");
  EXPECT_EQ(has("a\nb", "a.b"), "false");
  EXPECT_EQ(has("a\nb", "a.b", "s"), "true");
  EXPECT_EQ(has("ab", "a b"), "false");
  EXPECT_EQ(has("ab", "a b # c", "x"), "true");
}

TEST(RegExCreation, HexadecimalReferencesOfTheNarrowClassAreCharacters) {
  EXPECT_EQ(has("A", "&#x41;"), "true");
  EXPECT_EQ(has("a", "&#x61;"), "true");
  EXPECT_EQ(has("b", "&#x62;"), "true");
  EXPECT_EQ(has("\n", "&#xa;"), "true");
  EXPECT_EQ(has("\xC3\xBF", "&#xff;"), "true");
  EXPECT_EQ(has("\xC3\xAF", "&#xeF;"), "false");
  EXPECT_EQ(has("xAy", "x&#x41;y"), "true");
  EXPECT_EQ(has("AzB", "&#x41;z&#x42;"), "true");
}

TEST(RegExCreation, HexadecimalReferencesWithOtherDigitsStayAsWritten) {
  for (const char* reference : {"&#x4B;", "&#x4b;", "&#xe4;", "&#xD;", "&#xF;"}) {
    EXPECT_EQ(has(reference, reference), "true") << reference;
  }
  EXPECT_EQ(has("K", "&#x4B;"), "false");
}

TEST(RegExCreation, DecimalReferencesAreCharacters) {
  EXPECT_EQ(has("b", "&#98;"), "true");
  EXPECT_EQ(has("&#98;", "^&#98;$"), "false");
  EXPECT_EQ(has("€", "&#8364;"), "true");
  EXPECT_EQ(has("\xF0\x9F\x98\x80", "^&#128512;$"), "true");
  EXPECT_EQ(has("b", "&#0098;"), "true");
  EXPECT_EQ(has("ab.c", "&#97;&#x62;&#46;c"), "true");
  EXPECT_EQ(has("abxc", "&#97;&#x62;&#46;c"), "false");  // an escaped point is no wildcard
}

TEST(RegExCreation, ReferencesToNoCharacterFail) {
  for (const char* pattern : {"&#1114112;", "&#x110000;", "&#55296;", "&#99999999999999999999;",
                              "&#4294967394;", "&#xffffffffff;"}) {
    EXPECT_FALSE(regEx(pattern)) << pattern;
  }
}

TEST(RegExCreation, WhatIsNoReferenceStaysAsWritten) {
  for (const char* pattern : {"&#;", "&#x;", "&#98", "&98;", "& #98;", "&#x 41;", "&#X41;"}) {
    EXPECT_EQ(has(pattern, pattern), "true") << pattern;
  }
}

TEST(RegExCreation, TheLibrarysOwnSyntaxIsNotTranslated) {
  EXPECT_EQ(has("i", "^\\i$"), "true");
  EXPECT_EQ(has("j", "^\\c*$"), "true");  // a control character
  EXPECT_FALSE(regEx("\\p{IsBasicLatin}"));
  EXPECT_EQ(has("b]", "^[a-z-[aeiou]]$"), "true");
  EXPECT_EQ(has("b", "^[a-z-[aeiou]]$"), "false");
}

TEST(RegExCreation, InvalidPatternsFail) {
  for (const char* pattern :
       {"(", ")", "[", "[z-a]", "*", "a**b+*", "a{2,1}", "(?<n", "\\", "\\1", "(?<=a*)b"}) {
    EXPECT_FALSE(regEx(pattern)) << pattern;
  }
  EXPECT_FALSE(XQueryRegEx::regExp(text(u"\xD800")->view(), NSStringView()));
}

TEST(RegExCreation, ManyReferencesAreTranslated) {
  std::string pattern = "[";
  for (int index = 0; index < 200'000; ++index) pattern += "&#97;";
  EXPECT_EQ(has("a", pattern + "]"), "true");
}

// --- hasMatch ------------------------------------------------------------------------------------

TEST(RegExHasMatch, LooksAnywhereInTheString) {
  EXPECT_EQ(has("abc", "b"), "true");
  EXPECT_EQ(has("abc", "^b"), "false");
  EXPECT_EQ(has("abc", "x*"), "true");
  EXPECT_EQ(has("", ""), "true");
  EXPECT_EQ(has("", "a"), "false");
}

TEST(RegExHasMatch, IsFalseForAMissingString) {
  EXPECT_EQ(show(regEx("a")->hasMatch(nullptr)), "false");
}

TEST(RegExHasMatch, IsFalseForLoneSurrogates) {
  for (const auto* units : {u"a\xD800", u"a\xDC00",
                            u"\xDC00\xD800"
                            "a",
                            u"a\xD800z"}) {
    EXPECT_EQ(show(regEx("a")->hasMatch(text(std::u16string_view(units)).get())), "false");
  }
  EXPECT_EQ(show(regEx("^.a$")->hasMatch(text(std::u16string_view(u"\xD83D\xDE00"
                                                                  "a"))
                                             .get())),
            "true");
}

TEST(RegExHasMatch, NULIsACharacter) {
  EXPECT_EQ(show(regEx("b$")->hasMatch(text(std::string_view("a\0b", 3)).get())), "true");
}

TEST(RegExHasMatch, IsFalseWhenTheSearchIsTooExpensive) {
  EXPECT_EQ(has(std::string(50, 'a') + "b", "(a+)+$"), "false");
}

// --- matches -------------------------------------------------------------------------------------

TEST(RegExMatches, AreCollectedFromLeftToRight) {
  EXPECT_EQ(found("a1b22c333", "[0-9]+"), "[1|22|333]");
  EXPECT_EQ(found("aXbX", "(?i)[ax]"), "[a|X|X]");
  EXPECT_EQ(found("äöü", "."), "[ä|ö|ü]");
}

TEST(RegExMatches, OneIsTheStringItself) {
  EXPECT_EQ(found("abc", "b"), "b");
}

TEST(RegExMatches, NoneAreTheEmptySequence) {
  EXPECT_EQ(found("abc", "x"), "()");
}

TEST(RegExMatches, EachSearchStartsWhereTheLastMatchEnded) {
  EXPECT_EQ(found("aaaa", "aa"), "[aa|aa]");
  EXPECT_EQ(found("aba", "(?<=a)b|a"), "[a|b|a]");
}

TEST(RegExMatches, AnEmptyMatchAtThePositionFails) {
  EXPECT_EQ(found("abc", "x*"), "null");
  EXPECT_EQ(found("abc", ""), "null");
  EXPECT_EQ(found("", "x*"), "null");
  EXPECT_EQ(found("abc", "$"), "null");
  EXPECT_EQ(found("ab", "(?!\\G)(?=b)"), "");  // empty, but away from the position
}

TEST(RegExMatches, AMissingOrIllFormedStringFails) {
  EXPECT_EQ(pieces(regEx("a")->matches(nullptr)), "null");
  EXPECT_EQ(pieces(regEx("a")->matches(text(u"a\xD800").get())), "null");
}

// --- replace -------------------------------------------------------------------------------------

TEST(RegExReplace, ReplacesEveryMatch) {
  EXPECT_EQ(replaced("abcabc", "b", "-"), "a-ca-c");
  EXPECT_EQ(replaced("abc", "x", "-"), "abc");
  EXPECT_EQ(replaced("abc", "^", "-"), "null");
  EXPECT_EQ(replaced("", "a", "-"), "");
  EXPECT_EQ(replaced("aaa", "a", ""), "");
  EXPECT_EQ(replaced("aaa", "aa", "b"), "ba");
}

TEST(RegExReplace, TheResultIsAPlainString) {
  EXPECT_EQ(show(regEx("b")->replace(text("abc").get(), text("x")->view())), "untypedAtomic axc");
  const Value typed = functiontest::string("a text that is not matched anywhere");
  EXPECT_EQ(show(regEx("b")->replace(cast<NSString>(typed), text("x")->view())),
            "untypedAtomic a text that is not matched anywhere");
}

TEST(RegExReplace, GroupsAreNamedByOneDigit) {
  EXPECT_EQ(replaced("abc", "b", "$1"), "ac");
  EXPECT_EQ(replaced("abc", "b", "[$0]"), "a[b]c");
  EXPECT_EQ(replaced("abc", "(b)(c)", "$2$1"), "acb");
  EXPECT_EQ(replaced("abc", "(b)", "$12"), "ab2c");
  EXPECT_EQ(replaced("abc", "(x)?(b)", "<$1|$2>"), "a<|b>c");
  EXPECT_EQ(replaced("abcdefghi", "(a)(b)(c)(d)(e)(f)(g)(h)(i)", "$9$8$7$6$5$4$3$2$1$0"),
            "ihgfedcbaabcdefghi");
  EXPECT_EQ(replaced("abcdefghij", "(a)(b)(c)(d)(e)(f)(g)(h)(i)(j)", "$9$10"), "ia0");
  EXPECT_EQ(replaced("abc", "a(?=(bc))", "$1"), "bcbc");
}

TEST(RegExReplace, ABackslashEscapesItselfAndTheDollar) {
  EXPECT_EQ(replaced("abc", "b", "\\$"), "a$c");
  EXPECT_EQ(replaced("abc", "b", "\\\\"), "a\\c");
  EXPECT_EQ(replaced("abc", "b", "\\$1\\\\$0"), "a$1\\bc");
  EXPECT_EQ(replaced("abc", "b", "x\\\\y\\$z"), "ax\\y$zc");
}

TEST(RegExReplace, AnythingElseAfterABackslashOrDollarFails) {
  for (const char* replacement :
       {"\\", "$", "x\\", "x$", "\\n", "\\1", "$a", "$$", "$ ", "$\\", "\\\\\\", "$-1", "$١"}) {
    EXPECT_EQ(replaced("abc", "b", replacement), "null") << replacement;
  }
}

TEST(RegExReplace, TheReplacementIsReadOnlyWhenThereIsAMatch) {
  EXPECT_EQ(replaced("abc", "x", "\\"), "abc");
}

TEST(RegExReplace, AnEmptyMatchAtThePositionFails) {
  EXPECT_EQ(replaced("abc", "x*", "-"), "null");
  EXPECT_EQ(replaced("abc", "(x*)", "-"), "null");
  EXPECT_EQ(replaced("abc", "", "-"), "null");
  EXPECT_EQ(replaced("abc", "$", "-"), "null");
  EXPECT_EQ(replaced("abc", "a|x*", "-"), "null");
}

TEST(RegExReplace, AnEmptyMatchAwayFromThePositionDoesNot) {
  EXPECT_EQ(replaced("ab", "(?!\\G)(?=b)", "-"), "a-b");
}

TEST(RegExReplace, WideTextIsReplacedByCharacters) {
  EXPECT_EQ(replaced("aäbäc", "ä", "ü"), "aübüc");
  EXPECT_EQ(replaced("a\xF0\x9F\x98\x80"
                     "b",
                     "(.)b", "$1$1"),
            "a\xF0\x9F\x98\x80\xF0\x9F\x98\x80");
  EXPECT_EQ(replaced("äb", "ä", "a"), "ab");
  EXPECT_EQ(replaced("ab", "a", "ä"), "äb");
}

TEST(RegExReplace, LoneSurrogatesOfTheReplacementStay) {
  const Value result = regEx("b")->replace(text("ab").get(), text(u"\xD800")->view());
  EXPECT_EQ(cast<NSString>(result)->view().utf16(), u"a\xD800");
}

TEST(RegExReplace, AMissingOrIllFormedStringFails) {
  EXPECT_EQ(pieces(regEx("a")->replace(nullptr, {})), "null");
  EXPECT_EQ(pieces(regEx("a")->replace(text(u"a\xDFFF").get(), {})), "null");
}

TEST(RegExReplace, AStartResetBehindTheEndFails) {
  EXPECT_EQ(replaced("abc", "(?=ab\\K)", "-"), "null");
  EXPECT_EQ(replaced("abc", "a\\Kb", "-"), "a-c");
}

// --- tokenize ------------------------------------------------------------------------------------

TEST(RegExTokenize, GivesThePiecesBetweenTheMatches) {
  EXPECT_EQ(tokens("a,b,c", ","), "[a|b|c]");
  EXPECT_EQ(tokens("a, b ,c", "\\s*,\\s*"), "[a|b|c]");
  EXPECT_EQ(tokens("abc", ","), "abc");
  EXPECT_EQ(tokens("äxöxü", "x"), "[ä|ö|ü]");
}

TEST(RegExTokenize, SeparatorsAtTheEndsGiveEmptyStrings) {
  EXPECT_EQ(tokens(",a,", ","), "[|a|]");
  EXPECT_EQ(tokens(",", ","), "[|]");
  EXPECT_EQ(tokens(",,", ","), "[||]");
  EXPECT_EQ(tokens("", ","), "");
}

TEST(RegExTokenize, AnEmptyMatchAtThePositionFails) {
  EXPECT_EQ(tokens("abc", "x*"), "null");
  EXPECT_EQ(tokens("abc", ""), "null");
  EXPECT_EQ(tokens("abc", "$"), "null");
}

TEST(RegExTokenize, AnEmptyMatchAwayFromThePositionDoesNot) {
  EXPECT_EQ(tokens("ab", "(?!\\G)(?=b)"), "[a|b]");
}

TEST(RegExTokenize, ThePiecesArePlainStrings) {
  EXPECT_EQ(show(regEx(",")->tokenize(text("a,ä").get())), "(untypedAtomic a, untypedAtomic ä)");
}

TEST(RegExTokenize, AMissingOrIllFormedStringFails) {
  EXPECT_EQ(pieces(regEx("a")->tokenize(nullptr)), "null");
  EXPECT_EQ(pieces(regEx("a")->tokenize(text(u"\xDC00"
                                             "a")
                                            .get())),
            "null");
}

TEST(RegExTokenize, RunawayPatternsFail) {
  const std::string runaway = "b," + std::string(50, 'a') + "b";
  EXPECT_EQ(tokens(runaway, ",|(a+)+$"), "null");
  EXPECT_EQ(replaced(runaway, ",|(a+)+$", ""), "null");
  EXPECT_EQ(found(runaway, ",|(a+)+$"), "null");
}

TEST(RegExTokenize, AMillionMatchesAreWalked) {
  std::string narrow;
  std::string wide;
  for (int index = 0; index < 1'000'000; ++index) {
    narrow += "ab,";
    wide += "aä,";
  }
  for (const std::string& subject : {narrow, wide}) {
    const Value all = regEx(",")->tokenize(text(subject).get());
    ASSERT_TRUE(isa<NSArray>(all));
    EXPECT_EQ(cast<NSArray>(all)->count(), 1'000'001U);
    const Value text1 = regEx(",")->replace(text(subject).get(), text(";")->view());
    EXPECT_EQ(cast<NSString>(text1)->length(), 3'000'000U);
  }
}

// --- against plain loops -------------------------------------------------------------------------

// What replacing and tokenizing at a single character mean, without regular expressions.
std::u16string plainReplace(const std::u16string& subject, char16_t what,
                            const std::u16string& with) {
  std::u16string result;
  for (const char16_t unit : subject) {
    if (unit == what) {
      result += with;
    } else {
      result += unit;
    }
  }
  return result;
}

std::vector<std::u16string> plainTokenize(const std::u16string& subject, char16_t what) {
  std::vector<std::u16string> result(1);
  for (const char16_t unit : subject) {
    if (unit == what) {
      result.emplace_back();
    } else {
      result.back() += unit;
    }
  }
  return result;
}

std::vector<std::u16string> unitsOf(const Value& value) {
  std::vector<std::u16string> result;
  if (const auto* string = dyn_cast<NSString>(value)) {
    result.push_back(string->view().utf16());
  } else if (const auto* array = dyn_cast<NSArray>(value)) {
    for (const Value& piece : array->objects()) {
      result.push_back(cast<NSString>(piece)->view().utf16());
    }
  }
  return result;
}

TEST(RegExGenerated, ReplaceAndTokenizeAgreeWithPlainLoops) {
  std::mt19937 random(20);
  const auto alphabet =
      std::to_array<std::u16string_view>({u"a", u"b", u",", u"ä", u"€", u"\n", u"\xD83D\xDE00"});
  const std::u16string separators = u"a,ä€";
  for (int round = 0; round < 3000; ++round) {
    // Every other subject is 8-bit.
    const size_t letters = round % 2 == 0 ? 3 : alphabet.size();
    std::u16string subject;
    for (size_t left = random() % 20; left > 0; --left) subject += alphabet[random() % letters];
    const char16_t separator = separators[random() % separators.size()];
    const auto pattern = text(std::u16string(1, separator));
    const auto compiled = XQueryRegEx::regExp(pattern->view(), NSStringView());
    ASSERT_TRUE(compiled);
    const auto string = text(subject);
    EXPECT_EQ(unitsOf(compiled->tokenize(string.get())), plainTokenize(subject, separator));
    const std::u16string with = round % 3 == 0 ? u"" : u"<ö>";
    EXPECT_EQ(unitsOf(compiled->replace(string.get(), text(with)->view())).front(),
              plainReplace(subject, separator, with));
    const std::u16string around = u"[" + std::u16string(1, separator) + u"]";
    EXPECT_EQ(unitsOf(compiled->replace(string.get(), text("[$0]")->view())).front(),
              plainReplace(subject, separator, around));
    EXPECT_EQ(show(compiled->hasMatch(string.get())),
              subject.find(separator) == std::u16string::npos ? "false" : "true");
    EXPECT_EQ(unitsOf(compiled->matches(string.get())).size() + 1,
              plainTokenize(subject, separator).size());
  }
}

TEST(RegExGenerated, TextThatIsNotMatchedAndMatchesTogetherAreTheSubject) {
  std::mt19937 random(21);
  for (int round = 0; round < 2000; ++round) {
    std::string subject;
    for (size_t left = random() % 30; left > 0; --left) subject += "ab1 -"[random() % 5];
    for (const char* pattern : {"[ab]+", "\\d", "(a|b1)\\s?", "[^a]b", "-+|\\s+"}) {
      const auto compiled = regEx(pattern);
      const auto between = unitsOf(compiled->tokenize(text(subject).get()));
      const auto matched = unitsOf(compiled->matches(text(subject).get()));
      ASSERT_EQ(between.size(), matched.size() + 1);
      std::u16string joined = between[0];
      for (size_t index = 0; index < matched.size(); ++index) {
        joined += matched[index] + between[index + 1];
      }
      EXPECT_EQ(joined, text(subject)->view().utf16()) << pattern;
    }
  }
}

// Patterns put together at random, most of them odd and many of them invalid.
TEST(RegExGenerated, AnyPatternThatCompilesHoldsTheRules) {
  std::mt19937 random(22);
  const auto parts = std::to_array<const char*>(
      {"a",         "b",     "ä",     ".",      "[ab]",    "[^a]",         "(",      ")",
       "(?:",       "|",     "*",     "+",      "?",       "{2}",          "{1,3}",  "^",
       "$",         "\\b",   "\\w",   "\\1",    "\\2",     "(?=",          "(?!",    "(?<=",
       "(?<!",      "\\K",   "\\G",   "(?R)",   "(?1)",    "\\C",          "\\X",    "\\R",
       "(?>",       "(?|",   "*?",    "++",     "\\i",     "[\\w-a]",      "\\p{L}", "(*SKIP)",
       "(*F)",      "(?(1)", "(?i)",  "\\Qa",   "\\E",     "&#97;",        "&#x61;", "(*COMMIT)",
       "(*ACCEPT)", "(?C1)", "(?<n>", "\\k<n>", "\\x{e4}", "[[:alpha:]-z]"});
  const auto letters = std::to_array<const char*>({"a", "b", "A", "ä", "1", " ", "\n", "€"});
  int compiledCount = 0;
  for (int round = 0; round < 20'000; ++round) {
    std::string pattern;
    for (size_t left = 1 + random() % 7; left > 0; --left)
      pattern += parts[random() % parts.size()];
    const auto compiled = regEx(pattern, round % 5 == 0 ? "smi" : "");
    if (!compiled) continue;
    ++compiledCount;
    std::string subject;
    const size_t known = round % 2 == 0 ? 3 : letters.size();
    for (size_t left = random() % 12; left > 0; --left) subject += letters[random() % known];
    const auto string = text(subject);
    const Value matched = compiled->matches(string.get());
    const Value between = compiled->tokenize(string.get());
    const Value same = compiled->replace(string.get(), text("$0")->view());
    ASSERT_EQ(!matched, !between) << pattern << " in " << subject;
    ASSERT_EQ(!matched, !same) << pattern << " in " << subject;
    if (!matched) continue;
    ASSERT_EQ(unitsOf(between).size(), unitsOf(matched).size() + 1) << pattern << " in " << subject;
    ASSERT_EQ(cast<NSString>(same)->utf8(), subject) << pattern;
    ASSERT_EQ(show(compiled->hasMatch(string.get())), unitsOf(matched).empty() ? "false" : "true")
        << pattern << " in " << subject;
  }
  EXPECT_GT(compiledCount, 3000);
}

}  // namespace
}  // namespace xquery
