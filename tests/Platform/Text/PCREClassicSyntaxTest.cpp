#include "Platform/Text/PCREClassicSyntax.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery {
namespace {

// The rewritten pattern; "same" when there is nothing to rewrite.
std::string rewritten(std::string_view pattern, bool extended = false) {
  return PCREClassicSyntax(pattern, extended).value_or("same");
}

TEST(PCREClassicSyntax, LettersWithoutMeaningLoseTheirBackslash) {
  EXPECT_EQ(rewritten("\\F\\I\\J\\M\\O\\T\\Y\\i\\j\\m\\q\\y"), "FIJMOTYijmqy");
  EXPECT_EQ(rewritten("[\\F\\I\\J\\M\\O\\T\\Y\\i\\j\\m\\q\\y]"), "[FIJMOTYijmqy]");
}

TEST(PCREClassicSyntax, OtherEscapesStay) {
  EXPECT_EQ(rewritten("\\a\\b\\B\\A\\c\\y"), "same");  // of a control character
  EXPECT_EQ(rewritten("\\C\\d\\e\\E\\f\\g1\\G\\h\\k<n>\\K\\n\\N\\o{1}"), "same");
  EXPECT_EQ(rewritten("\\p{L}\\r\\R\\s\\t\\u\\U\\l\\L\\v\\w\\x41\\X\\z\\Z\\1\\.\\\\i"), "same");
}

TEST(PCREClassicSyntax, QuotedTextIsNotTouched) {
  EXPECT_EQ(rewritten("\\Q\\i\\E\\i"), "\\Q\\i\\Ei");
  EXPECT_EQ(rewritten("[\\Q\\i\\E\\i]"), "[\\Q\\i\\Ei]");
  EXPECT_EQ(rewritten("\\Q\\i"), "same");
}

TEST(PCREClassicSyntax, InAClassMoreLettersHaveNoMeaning) {
  EXPECT_EQ(rewritten("[\\A\\B\\C\\G\\K\\R\\X\\Z\\g\\k\\z]"), "[ABCGKRXZgkz]");
  EXPECT_EQ(rewritten("[\\b\\d\\N\\n\\x41]"), "same");
}

TEST(PCREClassicSyntax, HyphensBesideManyCharactersAreHyphens) {
  EXPECT_EQ(rewritten("[\\w-z]"), "[\\w\\-z]");
  EXPECT_EQ(rewritten("[\\p{L}-z]"), "[\\p{L}\\-z]");
  EXPECT_EQ(rewritten("[\\pL-z]"), "[\\pL\\-z]");
  EXPECT_EQ(rewritten("[[:alpha:]-z]"), "[[:alpha:]\\-z]");
  EXPECT_EQ(rewritten("[a-\\d]"), "[a\\-\\d]");
  EXPECT_EQ(rewritten("[a-[:^digit:]]"), "[a\\-[:^digit:]]");
  EXPECT_EQ(rewritten("[\\w-[\\d]]"), "[\\w\\-[\\d]]");
}

TEST(PCREClassicSyntax, OtherHyphensStay) {
  EXPECT_EQ(rewritten("[a-z]"), "same");
  EXPECT_EQ(rewritten("[a-z-9]"), "same");
  EXPECT_EQ(rewritten("[-\\d]"), "same");
  EXPECT_EQ(rewritten("[\\d-]"), "same");
  EXPECT_EQ(rewritten("[^-\\d]"), "same");
  EXPECT_EQ(rewritten("[a-z-[aeiou]]"), "same");
  EXPECT_EQ(rewritten("\\d-z"), "same");
}

TEST(PCREClassicSyntax, AClassEndsAtItsFirstBracketThatIsNotFirst) {
  EXPECT_EQ(rewritten("[]\\B]\\B"), "[]B]\\B");
  EXPECT_EQ(rewritten("[^]\\B]\\B"), "[^]B]\\B");
  EXPECT_EQ(rewritten("[\\E]\\B]\\B"), "[\\E]B]\\B");
  EXPECT_EQ(rewritten("[a]\\B"), "same");
  EXPECT_EQ(rewritten("[\\]\\B]"), "[\\]B]");
}

TEST(PCREClassicSyntax, CommentsAreNotTouched) {
  EXPECT_EQ(rewritten("(?#[)\\B\\y"), "(?#[)\\By");
  EXPECT_EQ(rewritten("#[\n\\B\\y", true), "#[\n\\By");
  EXPECT_EQ(rewritten("#[\\B]", false), "#[B]");
}

TEST(PCREClassicSyntax, WhatIsCutShortStaysAsItIs) {
  for (const char* pattern : {"\\", "[", "[^", "[a-", "[\\", "[[:alpha", "(?#", "[]", "\\c", "\\p{",
                              "[\\p{", "\\pL", "[a-\\", "[\\Q", ""}) {
    EXPECT_EQ(rewritten(pattern), "same") << pattern;
  }
}

}  // namespace
}  // namespace xquery
