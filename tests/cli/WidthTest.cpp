#include "cli/Width.h"

#include <gtest/gtest.h>

namespace {

using cli::widthOfCharacter;

TEST(Width, IsThatOfATerminal) {
  const struct {
    const char* character;
    size_t columns;
  } cases[] = {{"a", 1},      {"é", 1},      {"ß", 1},      {"漢", 2},     {"カ", 2},
               {"ｶ", 1},      {"Ａ", 2},     {"한", 2},     {"\u1112", 2}, {"\u1161", 0},
               {"\u0301", 0}, {"\u20DD", 0}, {"\u200D", 0}, {"\uFE0F", 0}, {"\u00AD", 1},
               {"😀", 2},      {"𝒳", 1},      {"\u0627", 1}, {"~", 1}};
  for (const auto& each : cases) {
    EXPECT_EQ(widthOfCharacter(each.character), each.columns) << each.character;
  }
}

TEST(Width, OfWhatIsNoCharacterIsThatOfItsBytes) {
  EXPECT_EQ(widthOfCharacter(""), 0u);
  EXPECT_EQ(widthOfCharacter("\xFF"), 1u);
  EXPECT_EQ(widthOfCharacter("\xE6\xBC"), 2u);
}

}  // namespace
