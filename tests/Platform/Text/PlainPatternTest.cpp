// Plain patterns match what the library matches.
#include "Platform/Text/PCRE.h"
#include "Platform/Text/PlainPattern.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

TEST(PlainPattern, IsATextOrASet) {
  for (const char* pattern : {" ",     ", ",      "grün",  "a-b",   "\"",
                              ",",     "\\s",     "\\s+",  "\\S+",  "\\d",
                              "\\D+",  "\\w+",    "\\W+",  "\\n",   "\\t+",
                              "\\.",   "\\|",     "\\\\",  "\\+",   "\\++",
                              "\\$",   "[,;]",    "[ ,]+", "[a-z]", "[A-Za-z0-9_]+",
                              "[^ ]+", "[^a-z]+", "[.]",   "[+*]+", "x+",
                              " +",    "#",       "&",     "/",     "<>"}) {
    EXPECT_TRUE(PlainPattern::of(pattern)) << pattern;
  }
  for (const char* pattern :
       {"",        "a|b",    "a*",   "a?",   "^a",   "a$",    ".",      "a.b",    "(a)",
        "a{2}",    "\\S",    "\\D",  "\\W",  "[^ ]", "\\x41", "\\p{L}", "\\b",    "\\A",
        "\\Qa\\E", "\\1",    "\\_",  "\\e",  "\\R",  "\\h",   "\\C",    "ü+",     "[ü]",
        "[a",      "[]",     "[^]",  "[]a]", "[a-]", "[-a]",  "[z-a]",  "[a\\]",  "[[:alpha:]]+",
        "[\\s,]",  "[,-;]",  "a+b",  "++",   "a++",  "\\s+?", "\\s\\s", "[a][b]", "\\ü",
        "+",       "[a-z-]", "[a^]", "[:a]", "\\s*", "ab+",   "\\\\+",  "]",      "}"}) {
    EXPECT_FALSE(PlainPattern::of(pattern)) << pattern;
  }
}

// A long text is searched piece by piece, also for texts that are longer than a piece.
TEST(PlainPattern, FindsTextsAnywhereInLongOnes) {
  std::string subject(300'000, 'a');
  for (const size_t length :
       {size_t{1}, size_t{2}, size_t{1000}, size_t{70'000}, size_t{140'000}}) {
    for (const size_t at :
         {size_t{0}, size_t{65'530}, size_t{65'536}, size_t{131'071}, subject.size() - length}) {
      if (at + length > subject.size()) continue;
      const std::string wanted = std::string(length - 1, 'a') + "b";
      subject[at + length - 1] = 'b';
      const auto pattern = PlainPattern::of(wanted);
      ASSERT_TRUE(pattern);
      const auto found = pattern->find(subject, at / 2);
      ASSERT_TRUE(found) << length << " " << at;
      EXPECT_EQ(found->start, at);
      EXPECT_EQ(found->end, at + length);
      EXPECT_FALSE(pattern->find(subject, at + 1)) << length << " " << at;
      subject[at + length - 1] = 'a';
    }
  }
}

// What nearly stands everywhere, for which trying each place takes minutes.
TEST(PlainPattern, IsFoundInProportionToTheText) {
  const std::string subject(8'000'000, 'a');
  const auto pattern = PlainPattern::of(std::string(40'000, 'a') + "b");
  ASSERT_TRUE(pattern);
  EXPECT_FALSE(pattern->find(subject, 0));
}

std::vector<std::pair<size_t, size_t>> matchesOf(const std::string& pattern,
                                                 std::string_view subject) {
  const auto code = PCREPattern::compile(pattern, PCREUTF8 | PCRENoUTF8Check);
  EXPECT_TRUE(code) << pattern;
  PCRESearch search(*code, subject);
  std::vector<std::pair<size_t, size_t>> found;
  size_t at = 0;
  while (search.find(at, PCRENoUTF8Check) == PCRESearch::Outcome::Found) {
    EXPECT_EQ(search.groupCount(), 1U) << pattern;
    EXPECT_FALSE(search.group(1).exists()) << pattern;
    found.emplace_back(search.group(0).start, search.group(0).end);
    at = search.group(0).end;
  }
  return found;
}

// In a group a pattern is none of these, and the library matches.
TEST(PlainPattern, MatchesAsTheLibrary) {
  const std::vector<std::string> characters = {" ",
                                               "\t",
                                               "\n",
                                               "\v",
                                               "\f",
                                               "\r",
                                               "a",
                                               "z",
                                               "A",
                                               "Z",
                                               "0",
                                               "9",
                                               "_",
                                               "-",
                                               ",",
                                               ".",
                                               "+",
                                               "\\",
                                               "$",
                                               "|",
                                               "\x1c",
                                               "\x7f",
                                               "\xc2\x85",
                                               "\xc2\xa0",
                                               "ü",
                                               "\xe2\x80\xa8",
                                               "\xf0\x9f\x98\x80"};
  std::mt19937 random(1);
  for (int round = 0; round < 60; ++round) {
    std::string subject;
    for (unsigned length = random() % 40; length > 0; --length) {
      subject += characters[random() % characters.size()];
    }
    for (const char* pattern :
         {" ",    "a",    "ü",    "a ",    "  ",     "az",     "\\s",        "\\s+", "\\S+",
          "\\d+", "\\d",  "\\D+", "\\w",   "\\w+",   "\\W+",   "\\n",        "\\t+", "\\.",
          "\\\\", "\\++", "[, ]", "[, ]+", "[^, ]+", "[a-z]+", "[^a-zA-Z]+", "[+.]", "[_0-5]"}) {
      const std::string plain(pattern);
      EXPECT_EQ(matchesOf(plain, subject), matchesOf("(?:" + plain + ")", subject))
          << plain << " in " << subject;
    }
  }
}

}  // namespace
}  // namespace xquery
