// The line that an error of a parse quotes, and the place in it.
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery {
namespace {

// Line, column and quoted line of each error: "1:3 1 ]".
std::string places(std::string_view source) {
  const auto errors = XQuery::xqueryWithSource(source)->parseErrors();
  std::string all;
  if (!errors) return all;
  for (const Value& value : errors->objects()) {
    const auto* error = cast<XQueryError>(value);
    all += (all.empty() ? "" : "|") + std::to_string(error->line()) + ":" +
           std::to_string(error->column());
    if (error->sourceLine()) all += " " + error->sourceLine()->utf8();
  }
  return all;
}

TEST(ErrorPlace, IsTheTokenThatDoesNotFit) {
  EXPECT_EQ(places("1 ]"), "1:3 1 ]");
  EXPECT_EQ(places("]"), "1:1 ]");
  EXPECT_EQ(places("1,\n  2 ]\n, 3"), "2:5   2 ]");
}

TEST(ErrorPlace, IsTheEndWhereSomethingIsMissing) {
  EXPECT_EQ(places("1 +"), "1:4 1 +");
  EXPECT_EQ(places("1 +\n"), "2:1 ");
}

TEST(ErrorPlace, CountsCharacters) {
  EXPECT_EQ(places("'é😀' ]"), "1:6 'é😀' ]");
}

TEST(ErrorPlace, IsTheSameWhateverEndsALine) {
  EXPECT_EQ(places("1,\r\n2,\r 3 ]"), "3:4  3 ]");
  EXPECT_EQ(places("\xEF\xBB\xBF 1 ]"), "1:4  1 ]");
}

TEST(ErrorPlace, OfALiteralIsItsEnd) {
  EXPECT_EQ(places("1 'a\nb'"), "2:2 b'");
}

TEST(ErrorPlace, OfWordsOnSeveralLinesIsTheStartOfTheLastLine) {
  EXPECT_EQ(places("1 order\nby 2"), "2:1 by 2");
}

TEST(ErrorPlace, OfWhatIsNotTerminatedIsItsStart) {
  EXPECT_EQ(places("1, 'a\nb"), "1:4 1, 'a");
  EXPECT_EQ(places("1, (: a\nb"), "1:4 1, (: a");
}

TEST(ErrorPlace, OfACharacterThatIsNoTokenIsTheCharacter) {
  EXPECT_EQ(places("1, 'a&b'"), "1:6 1, 'a&b'");
}

TEST(ErrorPlace, IsNotKnownOfOtherErrors) {
  EXPECT_EQ(places("declare ordering ordered;\ndeclare ordering ordered; 1"), "2:0");
}

TEST(ErrorPlace, LeavesTheDescriptionWhole) {
  const std::string line(10000, ' ');
  const auto errors = XQuery::xqueryWithSource(line + "]")->parseErrors();
  ASSERT_TRUE(errors);
  const auto* error = cast<XQueryError>(errors->objects().front());
  EXPECT_EQ(error->description()->utf8(),
            "XQueryError:3 - \"parse error invalid token (])- " + line + "]\" at line:1");
  EXPECT_EQ(error->column(), 10001);
}

}  // namespace
}  // namespace xquery
