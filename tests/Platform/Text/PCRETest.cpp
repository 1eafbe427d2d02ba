#include "Platform/Base/ProcessorTime.h"
#include "Platform/Base/StackTestSupport.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/PCRE.h"
#include "Platform/Text/TextTestSupport.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery {
namespace {

using Outcome = PCRESearch::Outcome;

// "none", "failed", "bad pattern", or the ranges of the groups: "1-3 2-2 -".
std::string search(std::string_view pattern, std::string_view subject, uint32_t options = PCREUTF8,
                   uint32_t matchOptions = 0, size_t from = 0) {
  const auto code = PCREPattern::compile(pattern, options);
  if (!code) return "bad pattern";
  PCRESearch search(*code, subject);
  switch (search.find(from, matchOptions)) {
    case Outcome::NotFound:
      return "none";
    case Outcome::Failed:
      return "failed";
    case Outcome::Found:
      break;
  }
  std::string text;
  for (size_t number = 0; number < search.groupCount(); ++number) {
    const PCRERange group = search.group(number);
    text += number == 0 ? "" : " ";
    text += group.exists() ? std::to_string(group.start) + "-" + std::to_string(group.end) : "-";
  }
  return text;
}

TEST(PCRE, FindsTheFirstMatchAndItsGroups) {
  EXPECT_EQ(search("b(c)(d)?", "abcbc"), "1-3 2-3");
  EXPECT_EQ(search("(x)?b(c)", "abcbc"), "1-3 - 2-3");
  EXPECT_EQ(search("z", "abc"), "none");
  EXPECT_EQ(search("", ""), "0-0");
}

TEST(PCRE, ASmallStackIsEnoughForNestedGroups) {
  const std::string nested = std::string(249, '(') + "b" + std::string(249, ')');
  const std::string longSubject = std::string(100000, 'a') + "b";
  const std::string found = search(nested, "abc");
  const std::string foundInLong = search(nested, longSubject);
  EXPECT_NE(found, "bad pattern");
  onStack((size_t{96} << 10) * sanitizedStackFactor, [&] {
    EXPECT_EQ(search(nested, "abc"), found);
    EXPECT_EQ(search(nested, longSubject), foundInLong) << "translated";
    EXPECT_EQ(search(std::string(300, '(') + std::string(300, ')'), "a"), "bad pattern");
  });
}

TEST(PCRE, OffsetsAreBytes) {
  EXPECT_EQ(search("b", "äöb"), "4-5");
  EXPECT_EQ(search(".", "äöb"), "0-2");
  EXPECT_EQ(search(".", "äöb", 0), "0-1");
}

TEST(PCRE, CompileOptionsHaveTheirClassicBits) {
  EXPECT_EQ(search("B", "abc", 0x1), "1-2");
  EXPECT_EQ(search("^b", "a\nb"), "none");
  EXPECT_EQ(search("^b", "a\nb", 0x2), "2-3");
  EXPECT_EQ(search("a.b", "a\nb"), "none");
  EXPECT_EQ(search("a.b", "a\nb", 0x4), "0-3");
  EXPECT_EQ(search("a b # c", "ab", 0x8), "0-2");
  EXPECT_EQ(search("b", "ab", 0x10), "none");
  EXPECT_EQ(search("a$", "a\n"), "0-1");
  EXPECT_EQ(search("a$", "a\n", 0x20), "none");
  EXPECT_EQ(search("\\y", "y", 0x40), "bad pattern");
  EXPECT_EQ(search("a+", "aaa", 0x200), "0-1");
  EXPECT_EQ(search("ä?b", "b", 0x800), "0-1");
  EXPECT_EQ(search("(a)", "a", 0x1000), "0-1");
  EXPECT_EQ(search("a", "a", 0x2800), "0-1");
}

TEST(PCRE, MatchOptionsHaveTheirClassicBits) {
  EXPECT_EQ(search("b", "ab", PCREUTF8, 0x10), "none");
  EXPECT_EQ(search("^a", "a", PCREUTF8, 0x80), "none");
  EXPECT_EQ(search("a$", "a", PCREUTF8, 0x100), "none");
  EXPECT_EQ(search("a*", "b", PCREUTF8, 0x400), "none");
  EXPECT_EQ(search("a", "a", PCREUTF8, 0x2000), "0-1");
}

TEST(PCRE, ASearchFromAPositionSeesWhatIsBefore) {
  EXPECT_EQ(search("(?<=a)b", "ab", PCREUTF8, 0, 1), "1-2");
  EXPECT_EQ(search("^b", "ab", PCREUTF8, 0, 1), "none");
  EXPECT_EQ(search("", "ab", PCREUTF8, 0, 2), "2-2");
  EXPECT_EQ(search("", "ab", PCREUTF8, 0, 3), "failed");
}

TEST(PCRE, TextThatIsNotUTF8FailsUnlessItIsNotLookedAt) {
  EXPECT_EQ(search("a", "a\xFF"), "failed");
  EXPECT_EQ(search("a", "a\xFF", 0), "0-1");
  EXPECT_EQ(search("\xFF", "a"), "bad pattern");
}

TEST(PCRE, TheReasonOfAFailureIsReported) {
  PCREFailure failure;
  EXPECT_EQ(PCREPattern::compile("ab(c", PCREUTF8, &failure), nullptr);
  EXPECT_EQ(failure.offset, 4U);
  EXPECT_NE(failure.text, "");
}

TEST(PCRE, TenGroupsAreReported) {
  EXPECT_EQ(search("(a)(b)(c)(d)(e)(f)(g)(h)(i)", "abcdefghi"),
            "0-9 0-1 1-2 2-3 3-4 4-5 5-6 6-7 7-8 8-9");
  const auto code = PCREPattern::compile("(a)(b)(c)(d)(e)(f)(g)(h)(i)(j)", PCREUTF8);
  PCRESearch search(*code, "abcdefghij");
  ASSERT_EQ(search.find(0, 0), Outcome::Found);
  EXPECT_EQ(search.groupCount(), 0U);
  EXPECT_EQ(search.group(9).start, 8U);
  EXPECT_FALSE(search.group(10).exists());
}

TEST(PCRE, NULIsACharacter) {
  EXPECT_EQ(search(std::string_view("a\0b", 3), std::string_view("xa\0b", 4)), "1-4");
  EXPECT_EQ(search("\\x{0}", std::string_view("a\0", 2)), "1-2");
}

TEST(PCRE, UnknownEscapesAreTheirLetters) {
  EXPECT_EQ(search("\\i", "hi"), "1-2");
  EXPECT_EQ(search("\\y\\q", "yq"), "0-2");
  EXPECT_EQ(search("[\\i]", "hi"), "1-2");
}

TEST(PCRE, KnownEscapesMustBeWellFormed) {
  EXPECT_EQ(search("\\p{IsBasicLatin}", "p{IsBasicLatin}"), "bad pattern");
  EXPECT_EQ(search("\\i\\p{IsBasicLatin}", "ip{IsBasicLatin}"), "bad pattern");
  EXPECT_EQ(search("\\x{110000}", "x"), "bad pattern");
  EXPECT_EQ(search("\\x{d800}", "x"), "bad pattern");
  EXPECT_EQ(search("\\c", "c"), "bad pattern");
  EXPECT_EQ(search("\\u", "u"), "bad pattern");
}

TEST(PCRE, SingleBytesAreMatchedInASCIIAlone) {
  EXPECT_EQ(search("a\\Cc", "abc"), "0-3");
  EXPECT_EQ(search("\\C", "ä"), "failed");
}

TEST(PCRE, AResetStartMayLieInALookaround) {
  EXPECT_EQ(search("(?=a\\K)", "a"), "1-0");
  EXPECT_EQ(search("ab\\Kc", "abc"), "2-3");
}

// --- limits --------------------------------------------------------------------------------------

// The outcome, and the time where it took long: the bounds are reached in some tenths of a second,
// and a search without them goes on for ages.
std::string quickly(std::string_view pattern, std::string_view subject) {
  std::string outcome;
  const double seconds = processorSecondsOf([&] { outcome = search(pattern, subject); });
  if (seconds > 10) outcome += " in " + std::to_string(seconds) + " s";
  return outcome;
}

TEST(PCRELimits, RunawayPatternsFailSoon) {
  const std::string text = repeated("a", 50) + "b";
  for (const char* pattern : {"(a+)+$", "(a|aa)+$", "(a*)*$", "(?:a+a+)+$", "(?:(a)|(a))+$",
                              "(*NO_JIT)(a+)+$", "(?i)(A+)+$"}) {
    EXPECT_EQ(quickly(pattern, text), "failed") << pattern;
  }
}

TEST(PCRELimits, PatternsThatStartAnywhereFailSoon) {
  const std::string text = repeated("a", 20'000);
  EXPECT_EQ(quickly("a*b?c", text + "!" + std::string(6000, 'x') + "bc"), "failed");
  EXPECT_EQ(quickly("(?:a(?=.*y))?a*z?[xy]", text + std::string(6000, '-')), "failed");
  EXPECT_EQ(quickly("(a*)b?\\1c", text + "bc"), "failed");
}

TEST(PCRELimits, MatchingInTheMachineAndInterpretingFailAlike) {
  const std::string text = repeated("a", 30) + "b";
  const auto code = PCREPattern::compile("(a+)+$", PCREUTF8);
  for (int round = 0; round < 3; ++round) {  // machine code is used from the second on
    EXPECT_EQ(PCRESearch(*code, text).find(0, 0), Outcome::Failed);
  }
}

TEST(PCRELimits, EndlessRecursionFails) {
  for (const char* pattern : {"(?R)", "(?R)+a", "a?(?R)b", "(?<n>(?&n)a)"}) {
    const auto code = PCREPattern::compile(pattern, PCREUTF8);
    ASSERT_TRUE(code) << pattern;
    for (int round = 0; round < 2; ++round) {
      EXPECT_EQ(PCRESearch(*code, "ab").find(0, 0), Outcome::Failed) << pattern;
    }
  }
}

TEST(PCRELimits, WhatGrowsWithTheSubjectIsAllowed) {
  const std::string text = repeated("ab", 500'000);
  EXPECT_EQ(search("^(a|b)*$", text), "0-1000000 999999-1000000");
  EXPECT_EQ(search("^(?:(?:a|b)(?:a|b))*$", text), "0-1000000");
  EXPECT_EQ(search("(\\w)\\1", text), "none");
  EXPECT_EQ(search("[a-z]+!", repeated("abcdefghi ", 100'000)), "none");
}

TEST(PCRELimits, ManyItemsTriedAtEveryPlaceAreAllowed) {
  std::string words = "no such word";
  for (const char* second : {"0", "1", "2", "3"}) {
    for (char first = 'a'; first <= 'z'; ++first) words += std::string("|") + first + second;
  }
  EXPECT_EQ(search(words, repeated("the quick brown fox jumps over the lazy dog ", 20'000)),
            "none");
  EXPECT_EQ(search("(\\w)(\\w)?(\\w)?\\1\\2\\3[!?]", repeated("abcd", 200'000)), "none");
}

TEST(PCRELimits, TheCostOfAllSearchesTogetherIsBounded) {
  // Each search looks through the rest of the text.
  const std::string text = repeated("a", 200'000);
  const auto code = PCREPattern::compile("a(?!.*y)", PCREUTF8);
  PCRESearch search(*code, text);
  size_t at = 0;
  size_t found = 0;
  while (search.find(at, PCRENoUTF8Check) == Outcome::Found) {
    at = search.group(0).end;
    ++found;
  }
  EXPECT_GT(found, 50U);
  EXPECT_LT(found, 100'000U);
}

TEST(PCRELimits, TheNestingOfGroupsIsBounded) {
  for (const char* open : {"(", "(?:", "(?=", "(?<!", "(?>"}) {
    EXPECT_NE(search(repeated(open, 250) + "a" + repeated(")", 250), "b"), "bad pattern") << open;
    EXPECT_EQ(search(repeated(open, 251) + "a" + repeated(")", 251), "b"), "bad pattern") << open;
  }
  EXPECT_EQ(search(repeated("(", 500'000) + repeated(")", 500'000), ""), "bad pattern");
}

TEST(PCRELimits, TheSizeOfPatternsIsBounded) {
  // With callouts the first is too large for the library; it is compiled without.
  EXPECT_EQ(search(repeated("a", 20'000), repeated("a", 20'001)), "0-20000");
  EXPECT_EQ(search(repeated("a", 100'000), "a"), "bad pattern");
  EXPECT_EQ(search(repeated("a", 1'000'000), "a"), "bad pattern");
  EXPECT_EQ(search(repeated("a", 3'000'000), "a"), "bad pattern");
  EXPECT_EQ(search("[" + repeated("a", 1'000'000) + "]", "a"), "0-1");
  EXPECT_EQ(search(repeated("(a)", 70'000), "a"), "bad pattern");
}

TEST(PCRELimits, LargeRepeatCountsAreRefused) {
  EXPECT_EQ(quickly("(?:(?:ab){1,1000}){1,1000}", "a"), "bad pattern");
  EXPECT_EQ(quickly("((((((a{1,60}){1,60}){1,60}){1,60}){1,60}){1,60})", "a"), "bad pattern");
  EXPECT_EQ(quickly("a{65536}", "a"), "bad pattern");
  EXPECT_EQ(quickly("a{65535}", "a"), "none");
}

TEST(PCRELimits, ALargePatternWithoutCalloutsFailsToo) {
  const std::string pattern = "(?:a+)+$|" + repeated("b", 20'000);
  EXPECT_EQ(quickly(pattern, repeated("a", 50) + "!"), "failed");
}

struct Interruption {};

class Interrupter final : public WorkWatcher {
 public:
  Interrupter() {
    workMeter.watcher = this;
    workMeter.stepsLeft = 100;
  }
  ~Interrupter() { workMeter = WorkMeter{}; }
  void lookAtWork() override { throw Interruption(); }
};

TEST(PCRELimits, AMatchCanBeInterrupted) {
  const auto code = PCREPattern::compile("(a+)+$", PCREUTF8);
  const std::string text = repeated("a", 50) + "b";
  for (int round = 0; round < 2; ++round) {
    const Interrupter interrupter;
    PCRESearch search(*code, text);
    EXPECT_THROW(search.find(0, 0), Interruption);
  }
}

}  // namespace
}  // namespace xquery
