#include "Platform/Text/UTF16.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

NSStringView view(const std::u16string& text) {
  return {text.data(), static_cast<uint32_t>(text.size())};
}

TEST(UTF16, APairIsOneCodePointAndALoneSurrogateItself) {
  const std::u16string text = u"a\xD83D\xDE00\xDE00\xD83D";
  EXPECT_EQ(codePointAt(view(text), 0), U'a');
  EXPECT_EQ(codePointAt(view(text), 1), 0x1F600U);
  EXPECT_EQ(codePointAt(view(text), 2), 0xDE00U);
  EXPECT_EQ(codePointAt(view(text), 4), 0xD83DU);
}

TEST(UTF16, EveryCodePointIsReadAsItWasAppended) {
  for (char32_t point = 0; point <= 0x10FFFF; ++point) {
    std::u16string text;
    appendUTF16(text, point);
    ASSERT_EQ(text.size(), point < 0x10000 ? 1U : 2U);
    ASSERT_EQ(codePointAt(view(text), 0), point);
  }
}

TEST(UTF16, ASurrogateIsLoneUnlessAHighOneComesBeforeALowOne) {
  for (const char16_t* text : {u"", u"a", u"\xD800\xDC00", u"a\xDBFF\xDFFFz\xD7FF\xE000"}) {
    EXPECT_FALSE(hasLoneSurrogate(view(text)));
  }
  for (const char16_t* text : {u"\xD800", u"\xDC00", u"\xDC00\xD800", u"\xD800z",
                               u"\xD800\xD800\xDC00", u"\xD800\xDC00\xDFFF"}) {
    EXPECT_TRUE(hasLoneSurrogate(view(text)));
  }
  EXPECT_FALSE(hasLoneSurrogate(NSStringView::ascii("abc")));
}

}  // namespace
}  // namespace xquery
