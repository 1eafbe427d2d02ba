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
