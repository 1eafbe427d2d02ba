// The grammars by themselves, and that no text makes a value from which its own text does not make
// it again. What each type takes is in ValueFromTextTest.cpp.
#include "Types/LexicalForms.h"
#include "ValuesTesting.h"

#include <random>

namespace xquery {
namespace {

TEST(LexicalForms, TrimTheWhiteSpaceOfXMLAlone) {
  EXPECT_EQ(XQueryTrimmedForm(" \t\r\na b\n"), "a b");
  EXPECT_EQ(XQueryTrimmedForm(" \n "), "");
  EXPECT_EQ(XQueryTrimmedForm("\v1\xC2\xA0"), "\v1\xC2\xA0");
}

TEST(LexicalForms, Numbers) {
  EXPECT_TRUE(XQueryIsIntegerForm("-0"));
  EXPECT_FALSE(XQueryIsIntegerForm("+-1"));
  EXPECT_TRUE(XQueryIsDecimalForm("-.0"));
  EXPECT_FALSE(XQueryIsDecimalForm("-."));
  EXPECT_TRUE(XQueryIsDoubleForm("1.E+05"));
  EXPECT_FALSE(XQueryIsDoubleForm("1E+"));
}

TEST(LexicalForms, AMonthAloneMayEndAsItOnceDid) {
  XQueryDateTimeParts parts;
  EXPECT_EQ(XQueryReadDateForm(XQueryItemType::GMonth, "--05--+01:00", parts),
            XQueryFormOutcome::Good);
  EXPECT_EQ(parts.month, 5);
  EXPECT_EQ(parts.zone, std::chrono::minutes(60));
}

TEST(LexicalForms, AnyTextOfTheLettersOfFormsIsRefusedOrComesBack) {
  constexpr std::string_view letters = "0123456789--::..++TTZPYMDHSeE aQ=";
  std::mt19937 random(7);
  int made = 0;
  for (int round = 0; round < 40'000; ++round) {
    std::string text;
    const size_t length = random() % 12;
    if (round % 4 == 0) text = "P";
    if (round % 4 == 1) text = "2004-0";
    while (text.size() < length) text += letters[random() % letters.size()];
    const auto type = static_cast<XQueryItemType>(8 + random() % 47);
    const auto value = XQueryMakeFromText(type, text);
    if (!value) continue;
    ++made;
    const std::string printed = XQueryItemStringValue(**value);
    const auto again = XQueryMakeFromText(XQueryTypeOfItem(**value), printed);
    const bool hasExponent =
        type == XQueryItemType::Duration || type == XQueryItemType::DayTimeDuration;
    if (!again && hasExponent && printed.find('e') != printed.npos) continue;
    ASSERT_TRUE(again) << text << " gave " << printed;
    EXPECT_EQ(XQueryItemStringValue(**again), printed) << text;
  }
  EXPECT_GT(made, 200);
}

}  // namespace
}  // namespace xquery
