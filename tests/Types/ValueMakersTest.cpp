#include "TypesTestSupport.h"
#include "ValuesTesting.h"

#include <cmath>
#include <limits>

namespace xquery {
namespace {

using testing::sequence;
using testing::shown;
using Type = XQueryItemType;
using namespace std::chrono_literals;

std::string shownValue(const Value& value) {
  return XQueryItemTypeName(*value) + " " + XQueryItemStringValue(*value);
}

TEST(ValueMakers, Integers) {
  EXPECT_EQ(shownValue(XQueryMakeInteger(20)), "xs:integer 20");
  EXPECT_EQ(shownValue(XQueryMakeInteger(int8_t{-1})), "xs:integer -1");
  EXPECT_EQ(shownValue(XQueryMakeInteger(std::numeric_limits<int64_t>::min())),
            "xs:integer -9223372036854775808");
  EXPECT_EQ(shownValue(XQueryMakeInteger(std::numeric_limits<uint64_t>::max())),
            "xs:integer 18446744073709551615");
}

TEST(ValueMakers, DecimalsOfTheirDigits) {
  EXPECT_EQ(shown(XQueryMakeDecimal("-12.50")), "xs:decimal -12.5");
  EXPECT_EQ(shown(XQueryMakeDecimal("1e3")), "error \"1e3\" is not of the form of xs:decimal");
}

TEST(ValueMakers, DoublesAndFloats) {
  EXPECT_EQ(shownValue(XQueryMakeDouble(0.1)), "xs:double 0.1");
  EXPECT_EQ(shownValue(XQueryMakeFloat(0.1F)), "xs:float 0.1");
  EXPECT_EQ(shownValue(XQueryMakeDouble(-INFINITY)), "xs:double -INF");
  EXPECT_EQ(shownValue(XQueryMakeFloat(INFINITY)), "xs:double INF");
  EXPECT_EQ(XQueryMakeFloat(NAN), XQueryMakeDouble(NAN));
}

TEST(ValueMakers, Booleans) {
  EXPECT_EQ(XQueryMakeBoolean(true).get(), NSNumber::trueValue());
  EXPECT_EQ(XQueryMakeBoolean(false).get(), NSNumber::falseValue());
}

TEST(ValueMakers, Text) {
  EXPECT_EQ(shown(XQueryMakeString("ä\t\U0001F600")), "xs:string ä\t\U0001F600");
  EXPECT_EQ(shown(XQueryMakeString("")), "xs:string ");
  EXPECT_EQ(shown(XQueryMakeUntypedAtomic("12")), "xdt:untypedAtomic 12");
  EXPECT_EQ(shown(XQueryMakeAnyURI("a/b")), "xs:anyURI a/b");
}

TEST(ValueMakers, TextThatIsNotUTF8) {
  for (const char* text : {"\xFF", "a\xC3", "\xC0\x80", "\xED\xA0\x80", "\xF4\x90\x80\x80"}) {
    const std::string error = "error the text is not well-formed UTF-8";
    EXPECT_EQ(shown(XQueryMakeString(text)), error);
    EXPECT_EQ(shown(XQueryMakeUntypedAtomic(text)), error);
    EXPECT_EQ(shown(XQueryMakeAnyURI(text)), error);
    EXPECT_EQ(shown(XQueryMakeQName({text, "a", ""})), error);
    EXPECT_EQ(shown(XQueryMakeQName({"", text, ""})), error);
  }
}

// XML 1.0, production 2.
TEST(ValueMakers, CharactersThatXMLDoesNotHave) {
  const auto refused = [](std::string_view text, const char* character) {
    const auto made = XQueryMakeString(text);
    EXPECT_EQ(shown(made), std::string("error the text holds the character U+") + character +
                               ", which XML does not have");
  };
  refused(std::string_view("a\0b", 3), "0000");
  refused("\x08", "0008");
  refused("\x1F", "001F");
  refused("\xEF\xBF\xBE", "FFFE");
  refused("\xEF\xBF\xBF", "FFFF");
  for (const char* text : {"\t\n\r", "\x7F", "\xEF\xBF\xBD", "\xF4\x8F\xBF\xBF"}) {
    EXPECT_TRUE(XQueryMakeString(text)) << text;
  }
}

TEST(ValueMakers, Names) {
  const XQueryQNameParts name{"urn:a", "b", "p"};
  const auto made = XQueryMakeQName(name);
  EXPECT_EQ(shown(made), "xs:QName p:b");
  EXPECT_EQ(*XQueryReadQName(*made), name);
  EXPECT_EQ(shown(XQueryMakeQName({"", "ä", ""})), "xs:QName ä");
  EXPECT_EQ(shown(XQueryMakeQName({"", "", ""})), "error \"\" is not of the form of xs:NCName");
  EXPECT_EQ(shown(XQueryMakeQName({"", "a:b", ""})),
            "error \"a:b\" is not of the form of xs:NCName");
  EXPECT_EQ(shown(XQueryMakeQName({"", "a", "1"})), "error \"1\" is not of the form of xs:NCName");
}

TEST(ValueMakers, Binaries) {
  const std::string_view bytes("\0\xFF\x10", 3);
  EXPECT_EQ(shownValue(XQueryMakeHexBinary(bytes)), "xs:hexBinary 00FF10");
  EXPECT_EQ(shownValue(XQueryMakeBase64Binary(bytes)), "xs:base64Binary AP8Q");
}

TEST(ValueMakers, Dates) {
  using namespace std::chrono;
  EXPECT_EQ(shown(XQueryMakeDate(2026y / 11 / 23)), "xs:date 2026-11-23");
  EXPECT_EQ(shown(XQueryMakeDate(-44y / 3 / 15, 60min)), "xs:date -0044-03-15+01:00");
  EXPECT_EQ(shown(XQueryMakeDate(2026y / 2 / 29)), "error day 29 of xs:date is out of range");
  EXPECT_EQ(shown(XQueryMakeDate(2026y / 2 / 1, 15h)),
            "error zone of minutes 900 of xs:date is out of range");
}

TEST(ValueMakers, TimesOfTheDateFamily) {
  EXPECT_EQ(shown(XQueryMakeTime(9h + 5min)), "xs:time 09:05:00");
  EXPECT_EQ(shown(XQueryMakeTime(24h - 1ms, -5h)), "xs:time 23:59:59.999000-05:00");
  EXPECT_EQ(shown(XQueryMakeTime(24h)),
            "error nanosecond 86400000000000 of xs:time is out of range");
  EXPECT_EQ(shown(XQueryMakeTime(-1ns)), "error nanosecond -1 of xs:time is out of range");
}

TEST(ValueMakers, DateTimesOfInstants) {
  using namespace std::chrono;
  EXPECT_EQ(shown(XQueryMakeDateTime(sys_days(2026y / 11 / 23) + 9h)),
            "xs:dateTime 2026-11-23T09:00:00Z");
  EXPECT_EQ(shown(XQueryMakeDateTime(sys_days(1969y / 12 / 31) + 24h - 500ms, -90min)),
            "xs:dateTime 1969-12-31T22:29:59.500000-01:30");
  EXPECT_EQ(shown(XQueryMakeDateTime(sys_seconds(67767976233532799s))),
            "xs:dateTime 2147483647-12-31T23:59:59Z");
  EXPECT_EQ(shown(XQueryMakeDateTime(sys_seconds(67767976233532800s))),
            "error 67767976233532800 seconds is out of the range of xs:dateTime");
  EXPECT_EQ(shown(XQueryMakeDateTime(sys_seconds(seconds::min()))),
            "error -9223372036854775808 seconds is out of the range of xs:dateTime");
  EXPECT_EQ(shown(XQueryMakeDateTime(sys_seconds(0s), minutes::min())).substr(0, 21),
            "error zone of minutes");
  EXPECT_EQ(shown(XQueryMakeDateTime(sys_seconds(-67768100567971200s))),
            "xs:dateTime -2147483648-01-01T00:00:00Z");
  EXPECT_EQ(shown(XQueryMakeDateTime(sys_seconds(-67768100567971201s))),
            "error -67768100567971201 seconds is out of the range of xs:dateTime");
  EXPECT_EQ(shown(XQueryMakeDateTime(sys_seconds(67767976233532799s), 1min)),
            "error 67767976233532799 seconds is out of the range of xs:dateTime");
  EXPECT_EQ(shown(XQueryMakeDateTimeOf(sys_seconds(0s), 1s, 0min)),
            "error nanosecond 1000000000 of xs:dateTime is out of range");
  EXPECT_EQ(shown(XQueryMakeDateTimeOf(sys_seconds(0s), -1ns, 0min)),
            "error nanosecond -1 of xs:dateTime is out of range");
  EXPECT_EQ(shown(XQueryMakeDateTimeOf(sys_seconds(0s), 5s, 0min)),
            "error nanosecond 5000000000 of xs:dateTime is out of range");
}

TEST(ValueMakers, DatePartsOfNoDateType) {
  EXPECT_EQ(shown(XQueryMakeDateOfType(Type::String, {})),
            "error xs:string is no type of dates and times");
  EXPECT_EQ(shown(XQueryMakeDateOfType(Type::Duration, {})),
            "error xs:duration is no type of dates and times");
}

TEST(ValueMakers, DatePartsThatATypeDoesNotHaveAreNotLookedAt) {
  XQueryDateTimeParts parts;
  parts.year = 2004;
  parts.month = 99;
  parts.day = -1;
  parts.hour = 77;
  EXPECT_EQ(shown(XQueryMakeDateOfType(Type::GYear, parts)), "xs:gYear 2004");
  EXPECT_EQ(shown(XQueryMakeDateOfType(Type::GYearMonth, parts)),
            "error month 99 of xs:gYearMonth is out of range");
}

TEST(ValueMakers, Durations) {
  EXPECT_EQ(shown(XQueryMakeDuration({false, 1, 2, 3, 4, 5, 6.25})),
            "xs:duration P1Y2M3DT4H5M6.25S");
  EXPECT_EQ(shownValue(XQueryMakeYearMonthDuration(std::chrono::years(-2))),
            "xdt:yearMonthDuration -P2Y");
  EXPECT_EQ(shown(XQueryMakeDayTimeDuration(36h + 500ms)), "xdt:dayTimeDuration P1DT12H0.5S");
  EXPECT_EQ(shown(XQueryMakeDuration({false, -1, 0, 0, 0, 0, 0})),
            "error years -1 of xs:duration is out of range");
  EXPECT_EQ(shown(XQueryMakeDuration({false, 0, 0, 0, 0, 0, -0.5})),
            "error seconds -0.5 of xs:duration is out of range");
  EXPECT_EQ(shown(XQueryMakeDuration({false, 0, 0, 0, 0, 0, NAN})),
            "error seconds NaN of xs:duration is out of range");
  EXPECT_EQ(shown(XQueryMakeDayTimeDuration(std::chrono::duration<double>(INFINITY))),
            "error seconds INF of xdt:dayTimeDuration is out of range");
}

TEST(ValueMakers, SequencesDoNotNest) {
  const Value one = XQueryMakeInteger(1);
  const Value two = XQueryMakeInteger(2);
  const auto made =
      XQueryMakeSequence({one, NSNull::null(), sequence({two, one}), NSArray::array()});
  ASSERT_TRUE(made);
  const XQueryItemRange items(*made);
  ASSERT_EQ(items.count(), 3u);
  EXPECT_EQ(items[0], one);
  EXPECT_EQ(items[1], two);
  EXPECT_EQ(*XQueryMakeSequence({}), Value(NSNull::null()));
  EXPECT_EQ(*XQueryMakeSequence({sequence({two})}), two);
  const auto refused = XQueryMakeSequence({one, nullptr});
  ASSERT_FALSE(refused);
  EXPECT_EQ(refused.error()->msg()->utf8(), "there is no value");
}

}  // namespace
}  // namespace xquery
