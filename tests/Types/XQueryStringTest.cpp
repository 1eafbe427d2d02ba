#include "Types/XQueryString.h"
#include "TypesTestSupport.h"

namespace xquery {
namespace {

using testing::text;
using testing::view;

TEST(XQueryString, ANormalizedStringHoldsNoLineFeedCarriageReturnOrTab) {
  EXPECT_TRUE(XQueryString::isNormalizedString(view("")));
  EXPECT_TRUE(XQueryString::isNormalizedString(view("  a  b ")));
  EXPECT_FALSE(XQueryString::isNormalizedString(view("a\nb")));
  EXPECT_FALSE(XQueryString::isNormalizedString(view("a\r")));
  EXPECT_FALSE(XQueryString::isNormalizedString(view("\tb")));
}

TEST(XQueryString, ATokenHasNoSpacesAtItsEndsAndNoTwoInARow) {
  for (const auto validator : {XQueryString::isToken, XQueryString::isLanguage}) {
    EXPECT_TRUE(validator(view("a b")));
    EXPECT_TRUE(validator(view("a b c")));
    EXPECT_TRUE(validator(view("")));
    EXPECT_FALSE(validator(view("a  b")));
    EXPECT_FALSE(validator(view(" a")));
    EXPECT_FALSE(validator(view("a ")));
    EXPECT_FALSE(validator(view(" ")));
    EXPECT_FALSE(validator(view("a\tb")));
  }
}

TEST(XQueryString, ALanguageFollowsNoPattern) {
  EXPECT_TRUE(XQueryString::isLanguage(view("not a language! at all")));
}

TEST(XQueryString, ANameMayHoldColonsAnywhere) {
  EXPECT_TRUE(XQueryString::isName(view("a:b")));
  EXPECT_TRUE(XQueryString::isName(view(":a:")));
  EXPECT_TRUE(XQueryString::isName(view("_a-1.2")));
  EXPECT_FALSE(XQueryString::isName(view("")));
  EXPECT_FALSE(XQueryString::isName(view("1a")));
  EXPECT_FALSE(XQueryString::isName(view("-a")));
  EXPECT_FALSE(XQueryString::isName(view("a b")));
}

TEST(XQueryString, AnNCNameTakesNoColon) {
  for (const auto validator : {XQueryString::isNCName, XQueryString::isID, XQueryString::isIDRef,
                               XQueryString::isEntity}) {
    EXPECT_TRUE(validator(view("a")));
    EXPECT_TRUE(validator(view("_a-1.2")));
    EXPECT_FALSE(validator(view("a:b")));
    EXPECT_FALSE(validator(view(":a")));
    EXPECT_FALSE(validator(view("")));
    EXPECT_FALSE(validator(view("1a")));
    EXPECT_FALSE(validator(view("a ")));
  }
  EXPECT_TRUE(XQueryString::isNCName(text("\xC3\xA9t\xC3\xA9")->view()));
}

TEST(XQueryString, NameTokensTakeNoColonButStartWithAnything) {
  EXPECT_TRUE(XQueryString::isNMToken(view("-1")));
  EXPECT_TRUE(XQueryString::isNMToken(view(".")));
  EXPECT_FALSE(XQueryString::isNMToken(view("a:b")));
  EXPECT_FALSE(XQueryString::isNMToken(view("")));
  EXPECT_FALSE(XQueryString::isNMToken(view("a b")));
}

TEST(XQueryString, CharactersOutsideTheBMPAreInNoName) {
  EXPECT_FALSE(XQueryString::isNCName(text("a\xF0\x90\x80\x80")->view()));
  EXPECT_FALSE(XQueryString::isNMToken(text("\xF0\x90\x80\x80")->view()));
}

struct FactoryRow {
  const char* name;
  Ref<XQueryString> (*factory)(const NSString&);
  XQueryTypeID type;
  const char* accepted;
  const char* refused;  // null when nothing is
};

const FactoryRow factoryRows[] = {
    {"stringWithString", XQueryString::stringWithString, 9, " \n a", nullptr},
    {"normalizedStringWithString", XQueryString::normalizedStringWithString, 30, "  a ", "a\n"},
    {"tokenWithString", XQueryString::tokenWithString, 31, "a b", " a"},
    {"languageWithString", XQueryString::languageWithString, 32, "en", "en "},
    {"nameWithString", XQueryString::nameWithString, 33, "p:a", "1"},
    {"ncNameWithString", XQueryString::ncNameWithString, 34, "a", "p:a"},
    {"idWithString", XQueryString::idWithString, 35, "a", "p:a"},
    {"idRefWithString", XQueryString::idRefWithString, 36, "a", "p:a"},
    {"entityWithString", XQueryString::entityWithString, 38, "a", "p:a"},
    {"nmTokenWithString", XQueryString::nmTokenWithString, 40, "1", "p:a"},
};

TEST(XQueryString, EachFactoryGivesItsTypeAndLeavesTheTextAlone) {
  for (const FactoryRow& row : factoryRows) {
    const Ref<XQueryString> string = row.factory(*text(row.accepted));
    ASSERT_TRUE(string) << row.name;
    EXPECT_EQ(string->typeID(), row.type) << row.name;
    EXPECT_EQ(XQueryObjectTypeID(string.get()), row.type) << row.name;
    EXPECT_EQ(string->utf8(), row.accepted) << row.name;
  }
}

TEST(XQueryString, EachFactoryAnswersNullForTextThatDoesNotFit) {
  for (const FactoryRow& row : factoryRows) {
    if (row.refused) {
      EXPECT_FALSE(row.factory(*text(row.refused))) << row.name;
    }
  }
}

TEST(XQueryString, OfATypeIsWhatItsFactoryMakes) {
  for (const FactoryRow& row : factoryRows) {
    const Ref<XQueryString> string = XQueryString::stringOfType(row.type, *text(row.accepted));
    ASSERT_TRUE(string) << row.name;
    EXPECT_EQ(string->typeID(), row.type) << row.name;
    if (!row.refused) continue;
    EXPECT_FALSE(XQueryString::stringOfType(row.type, *text(row.refused))) << row.name;
  }
  for (const XQueryTypeID type : {XQueryTypeIDREFS, XQueryTypeENTITIES, XQueryTypeNMTOKENS,
                                  XQueryTypeUntypedAtomic, XQueryTypeInteger}) {
    EXPECT_FALSE(XQueryString::stringOfType(type, *text("a"))) << type;
  }
}

TEST(XQueryString, LongAndWideTextSurvivesTyping) {
  const std::string longText(1000, 'x');
  EXPECT_EQ(XQueryString::tokenWithString(*text(longText))->utf8(), longText);
  EXPECT_EQ(XQueryString::stringWithView(text("\xE2\x82\xAC")->view())->utf8(), "\xE2\x82\xAC");
  EXPECT_EQ(XQueryString::stringWithView(view("a"))->typeID(), 9);
}

TEST(XQueryString, ItsStringValueIsTheStringItself) {
  const Ref<XQueryString> string = XQueryString::stringWithString(*text("a"));
  EXPECT_EQ(XQueryStringValue(*string).get(), string.get());
}

}  // namespace
}  // namespace xquery
