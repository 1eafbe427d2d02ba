#include "Platform/Reading/RawText.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

RawText rawOf(std::string_view bytes, bool isPlain, uint64_t wide = 0) {
  return {bytes.data(), bytes.data() + bytes.size(), wide, isPlain};
}

TEST(RawText, StandsForItselfWhereItIsPlain) {
  const std::string_view text = "a&b\r\n";
  RawTexts texts;
  for (const ReadText& known : {texts.content(rawOf(text, true)), texts.value(rawOf(text, true)),
                                texts.lines(rawOf(text, true))}) {
    EXPECT_EQ(known.bytes.data(), text.data());
    EXPECT_EQ(known.bytes.size(), text.size());
    EXPECT_TRUE(known.isASCII);
  }
}

TEST(RawText, StandsForWhatIsReplacedWhereItIsNot) {
  const std::string_view text = "a\t&#xE9;\r\nb\rc";
  RawTexts texts;
  EXPECT_EQ(texts.content(rawOf(text, false)).bytes, "a\t\xC3\xA9\nb\nc");
  EXPECT_EQ(texts.value(rawOf(text, false)).bytes, "a \xC3\xA9 b c");
  EXPECT_EQ(texts.lines(rawOf(text, false)).bytes, "a\t&#xE9;\nb\nc");
  EXPECT_FALSE(texts.content(rawOf(text, false)).isASCII);
  EXPECT_THROW(texts.content(rawOf("&x;", false)), NotTaken);
}

TEST(RawText, BeginsWithAWholeCharacter) {
  const RawTexts texts;
  EXPECT_EQ(texts.written("\xC3\xA9", 1).bytes, "\xC3\xA9");
  EXPECT_EQ(texts.written("", 0).bytes, "");
  for (const std::string_view cut : {"\x80", "\xBFx", "\xA9\xC3\xA9"}) {
    EXPECT_THROW(static_cast<void>(texts.written(cut, 1)), NotTaken);
  }
}

TEST(RawText, IsASCIIWhereThatIsDeclared) {
  RawTexts texts;
  EXPECT_FALSE(texts.expectsASCII());
  texts.expectASCII();
  EXPECT_EQ(texts.written("x", 0).bytes, "x");
  EXPECT_THROW(static_cast<void>(texts.written("\xC3\xA9", 1)), NotTaken);
}

TEST(RawText, IsSurelyRightIfNothingInItIsToBeLookedAt) {
  EXPECT_TRUE(rawOf("x", true).isSurelyRight());
  EXPECT_FALSE(rawOf("x", false).isSurelyRight());
  EXPECT_FALSE(rawOf("x", true, 1).isSurelyRight());
}

}  // namespace
}  // namespace xquery
