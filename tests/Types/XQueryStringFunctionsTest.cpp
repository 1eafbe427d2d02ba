#include "Types/XQueryStringFunctions.h"
#include "TypesTestSupport.h"

namespace xquery {
namespace {

using testing::text;
using testing::utf8;

TEST(TrimWS, AnswersTheStringItselfWhenItsEndsAreNoWhiteSpace) {
  for (const char* plain : {"a b", "a", ""}) {
    const Ref<NSString> string = text(plain);
    EXPECT_EQ(XQueryStringTrimWS(string), string) << plain;
  }
}

TEST(TrimWS, DropsTheFourWhiteSpaceCharactersAtBothEnds) {
  EXPECT_EQ(utf8(XQueryStringTrimWS(text(" \t\r\na b\n\r\t "))), "a b");
  EXPECT_EQ(utf8(XQueryStringTrimWS(text("a "))), "a");
  EXPECT_EQ(utf8(XQueryStringTrimWS(text(" a"))), "a");
  EXPECT_EQ(utf8(XQueryStringTrimWS(text(" \n "))), "");
  EXPECT_EQ(utf8(XQueryStringTrimWS(text(" \xE2\x82\xAC "))), "\xE2\x82\xAC");
}

TEST(TrimLeadingWS, DropsLeadingWhiteSpaceOnly) {
  EXPECT_EQ(utf8(XQueryStringTrimLeadingWS(text("\n a b "))), "a b ");
  EXPECT_EQ(utf8(XQueryStringTrimLeadingWS(text("a "))), "a ");
  EXPECT_EQ(utf8(XQueryStringTrimLeadingWS(text(" \t\r\n"))), "");
}

TEST(NormalizeString, AnswersTheReceiverWhenItHoldsNoWhiteSpace) {
  for (const char* plain : {"ab", "", "a-b"}) {
    const Ref<NSString> string = text(plain);
    EXPECT_EQ(XQueryNormalizeString(string), string) << plain;
  }
}

TEST(NormalizeString, CollapsesRunsAndDropsTheEnds) {
  EXPECT_EQ(utf8(XQueryNormalizeString(text(" a \t\n b  c\r"))), "a b c");
  EXPECT_EQ(utf8(XQueryNormalizeString(text("a\tb"))), "a b");
  EXPECT_EQ(utf8(XQueryNormalizeString(text("a "))), "a");
  EXPECT_EQ(utf8(XQueryNormalizeString(text(" \n"))), "");
  EXPECT_EQ(utf8(XQueryNormalizeString(text("\xC3\xA9  \xC3\xA8"))), "\xC3\xA9 \xC3\xA8");
}

TEST(NormalizeString, NoBreakSpaceIsNoWhiteSpace) {
  const Ref<NSString> string = text("a\xC2\xA0 b");
  EXPECT_EQ(utf8(XQueryNormalizeString(string)), "a\xC2\xA0 b");
}

std::string normalizedAttribute(std::string_view utf8) {
  NSMutableString string;
  string.append(text(utf8)->view());
  XQueryNormalizeAttributeString(string);
  return string.string()->utf8();
}

TEST(NormalizeAttributeString, EveryWhiteSpaceCharacterBecomesOneSpace) {
  EXPECT_EQ(normalizedAttribute("a\tb\n\rc  d"), "a b  c  d");
  EXPECT_EQ(normalizedAttribute("\n"), " ");
  EXPECT_EQ(normalizedAttribute("a b"), "a b");
  EXPECT_EQ(normalizedAttribute(""), "");
  EXPECT_EQ(normalizedAttribute("\xE2\x82\xAC\t\xE2\x82\xAC"), "\xE2\x82\xAC \xE2\x82\xAC");
}

}  // namespace
}  // namespace xquery
