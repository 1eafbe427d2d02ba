#include "Platform/Text/Blocks.h"

#include <gtest/gtest.h>

#include <new>
#include <string>

namespace xquery {
namespace {

using namespace std::string_view_literals;

std::string pieceLengths(size_t length) {
  std::string lengths;
  const std::string text(length, 'a');
  inBlocks(std::string_view(text), [&](std::string_view piece) {
    lengths += (lengths.empty() ? "" : " ") + std::to_string(piece.size());
  });
  return lengths;
}

TEST(TextBlocks, ATextIsGoneThroughInPiecesWithoutAnEmptyLastOne) {
  EXPECT_EQ(pieceLengths(0), "0");
  EXPECT_EQ(pieceLengths(8192), "8192");
  EXPECT_EQ(pieceLengths(8193), "8192 1");
  EXPECT_EQ(pieceLengths(20000), "8192 8192 3616");
}

TEST(TextBlocks, EveryPieceButTheLastIsAStepOfWork) {
  const int64_t before = workMeter.stepsLeft;
  pieceLengths(20000);
  EXPECT_EQ(before - workMeter.stepsLeft, 2);
}

TEST(TextBlocks, OnlyLongTextsAreWorkOfTheirOwn) {
  const int64_t before = workMeter.stepsLeft;
  checkUnits(8191);
  EXPECT_EQ(before - workMeter.stepsLeft, 0);
  checkUnits(3 * 8192);
  EXPECT_EQ(before - workMeter.stepsLeft, 3);
}

TEST(TextBlocks, ATextTooLongForAStringIsNotCutShort) {
  EXPECT_EQ(viewOf("ab"sv).length(), 2U);
  EXPECT_EQ(viewOf(u"\u00E9"sv).length(), 1U);
  // Nobody looks at the units.
  EXPECT_THROW((void)viewOf(std::string_view("", size_t{1} << 32)), std::bad_alloc);
  EXPECT_THROW((void)viewOf(std::u16string_view(u"", size_t{1} << 32)), std::bad_alloc);
}

}  // namespace
}  // namespace xquery
