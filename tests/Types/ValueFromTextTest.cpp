// The lexical forms of XML Schema Part 2 (second edition), section 3, one type after the other.
#include "ValuesTesting.h"

#include <cmath>
#include <limits>

namespace xquery {
namespace {

using testing::shown;
using testing::shownFrom;
using Type = XQueryItemType;

std::string notOfTheForm(std::string_view text, std::string_view type) {
  return "error \"" + std::string(text) + "\" is not of the form of " + std::string(type);
}

// Texts without white space around them.
void expectRefused(Type type, std::initializer_list<const char*> texts) {
  for (const char* text : texts) {
    EXPECT_EQ(shownFrom(type, text), notOfTheForm(text, XQueryNameOfType(type)));
  }
}

TEST(ValueFromText, Booleans) {
  EXPECT_EQ(shownFrom(Type::Boolean, "true"), "xs:boolean true");
  EXPECT_EQ(shownFrom(Type::Boolean, "0"), "xs:boolean false");
  EXPECT_EQ(shownFrom(Type::Boolean, " \t\r\n1 "), "xs:boolean true");
  expectRefused(Type::Boolean, {"", "TRUE", "yes", "2", "true false"});
}

TEST(ValueFromText, Decimals) {
  EXPECT_EQ(shownFrom(Type::Decimal, "-1.23"), "xs:decimal -1.23");
  EXPECT_EQ(shownFrom(Type::Decimal, "+100000.00"), "xs:decimal 100000");
  EXPECT_EQ(shownFrom(Type::Decimal, "210."), "xs:decimal 210");
  EXPECT_EQ(shownFrom(Type::Decimal, ".5"), "xs:decimal 0.5");
  EXPECT_EQ(shownFrom(Type::Decimal, " 12678967.543233 "), "xs:decimal 12678967.543233");
  EXPECT_EQ(shownFrom(Type::Decimal, "-0"), "xs:decimal 0");
  expectRefused(Type::Decimal, {"", ".", "+", "1e3", "1,5", "12abc", "--1", "1 2", "INF", "0x10"});
}

TEST(ValueFromText, DecimalsOfManyDigitsAndOfTooMany) {
  const std::string digits(1000, '7');
  EXPECT_EQ(shownFrom(Type::Integer, digits), "xs:integer " + digits);
  EXPECT_EQ(shown(XQueryMakeDecimal(digits + "." + digits)), "xs:decimal " + digits + "." + digits);
  const std::string most(250'000, '7');
  EXPECT_TRUE(XQueryMakeFromText(Type::Integer, most));
  EXPECT_EQ(shownFrom(Type::Integer, most + "7"),
            "error \"" + std::string(80, '7') + "...\" is out of the range of xs:integer");
}

TEST(ValueFromText, OfALongTextTheBeginningIsShown) {
  const std::string eighty(80, 'x');
  expectRefused(Type::Boolean, {eighty.c_str()});
  const std::string whole = eighty.substr(1);
  EXPECT_EQ(shownFrom(Type::Boolean, whole + "ä"), notOfTheForm(whole + "...", "xs:boolean"));
  EXPECT_EQ(shownFrom(Type::Boolean, eighty + "ä"), notOfTheForm(eighty + "...", "xs:boolean"));
}

TEST(ValueFromText, IntegersOfEachRange) {
  struct Row {
    Type type;
    const char *lowest, *belowIt, *highest, *aboveIt;  // null where there is no border
  };
  const Row rows[] = {
      {Type::NonNegativeInteger, "0", "-1", nullptr, nullptr},
      {Type::PositiveInteger, "1", "0", nullptr, nullptr},
      {Type::NonPositiveInteger, nullptr, nullptr, "0", "1"},
      {Type::NegativeInteger, nullptr, nullptr, "-1", "0"},
      {Type::Long, "-9223372036854775808", "-9223372036854775809", "9223372036854775807",
       "9223372036854775808"},
      {Type::Int, "-2147483648", "-2147483649", "2147483647", "2147483648"},
      {Type::Short, "-32768", "-32769", "32767", "32768"},
      {Type::Byte, "-128", "-129", "127", "128"},
      {Type::UnsignedLong, "0", "-1", "18446744073709551615", "18446744073709551616"},
      {Type::UnsignedInt, "0", "-1", "4294967295", "4294967296"},
      {Type::UnsignedShort, "0", "-1", "65535", "65536"},
      {Type::UnsignedByte, "0", "-1", "255", "256"},
  };
  for (const Row& row : rows) {
    const std::string name = XQueryNameOfType(row.type);
    for (const char* inside : {row.lowest, row.highest}) {
      if (!inside) continue;
      EXPECT_EQ(shownFrom(row.type, inside), name + " " + inside);
    }
    for (const char* outside : {row.belowIt, row.aboveIt}) {
      if (!outside) continue;
      EXPECT_EQ(shownFrom(row.type, outside),
                "error \"" + std::string(outside) + "\" is out of the range of " + name);
    }
  }
  EXPECT_EQ(shownFrom(Type::Integer, "+007"), "xs:integer 7");
  expectRefused(Type::Integer, {"", "-", "1.0", "1.", "2.7", "1e2", "12abc", "٣"});
  expectRefused(Type::Byte, {"x", "12.9"});
}

TEST(ValueFromText, DoublesAndFloats) {
  EXPECT_EQ(shownFrom(Type::Double, "-1E4"), "xs:double -10000");
  EXPECT_EQ(shownFrom(Type::Double, "12.78e-2"), "xs:double 0.1278");
  EXPECT_EQ(shownFrom(Type::Double, " INF"), "xs:double INF");
  EXPECT_EQ(shownFrom(Type::Double, "-INF"), "xs:double -INF");
  EXPECT_EQ(shownFrom(Type::Double, "NaN"), "xs:double NaN");
  EXPECT_EQ(shownFrom(Type::Double, "1e400"), "xs:double INF");
  EXPECT_EQ(shownFrom(Type::Float, "1267.43233E12"), "xs:float 1267432400000000");
  EXPECT_EQ(shownFrom(Type::Float, "-1e39"), "xs:double -INF");
  expectRefused(Type::Double,
                {"", "+INF", "inf", "nan", "1e", "e1", "1e1.5", "1 e1", "0x1p3", "1f"});
  expectRefused(Type::Float, {"", "1.2.3"});
}

// Halfway between two floats but for a digit that a double does not hold.
TEST(ValueFromText, FloatsAreRoundedOnce) {
  const auto made = XQueryMakeFromText(Type::Float, "+1.00000005960464477540");
  ASSERT_TRUE(made);
  EXPECT_EQ(*XQueryReadFloat(*made), 1.00000012F);
}

TEST(ValueFromText, Strings) {
  EXPECT_EQ(shownFrom(Type::String, " a\tb "), "xs:string  a\tb ");
  EXPECT_EQ(shownFrom(Type::UntypedAtomic, " 12 "), "xdt:untypedAtomic  12 ");
  EXPECT_EQ(shownFrom(Type::NormalizedString, " a\t\nb "), "xs:normalizedString  a  b ");
  EXPECT_EQ(shownFrom(Type::Token, " a\t\n b "), "xs:token a b");
  EXPECT_EQ(shownFrom(Type::Language, " en-GB-x1 "), "xs:language en-GB-x1");
  EXPECT_EQ(shownFrom(Type::Name, "a:b"), "xs:Name a:b");
  EXPECT_EQ(shownFrom(Type::NCName, "_ä"), "xs:NCName _ä");
  EXPECT_EQ(shownFrom(Type::ID, "a1"), "xs:ID a1");
  EXPECT_EQ(shownFrom(Type::IDREF, "a1"), "xs:IDREF a1");
  EXPECT_EQ(shownFrom(Type::ENTITY, "a1"), "xs:ENTITY a1");
  EXPECT_EQ(shownFrom(Type::NMTOKEN, "1a"), "xs:NMTOKEN 1a");
  expectRefused(Type::Language, {"", "englishes", "e1", "en-", "-en", "en--x", "en_GB"});
  expectRefused(Type::NCName, {"", "a:b", "1a", "a b"});
  expectRefused(Type::Name, {"", "1a", "a b"});
  expectRefused(Type::NMTOKEN, {"", "a b"});
}

TEST(ValueFromText, URIs) {
  EXPECT_EQ(shownFrom(Type::AnyURI, " http://a.example/b?c#d "),
            "xs:anyURI http://a.example/b?c#d");
  EXPECT_EQ(shownFrom(Type::AnyURI, ""), "xs:anyURI ");
  EXPECT_EQ(shownFrom(Type::AnyURI, "../a%20b"), "xs:anyURI ../a%20b");
  expectRefused(Type::AnyURI, {"a b", "http://[", "%zz", "ä"});
}

TEST(ValueFromText, Binaries) {
  EXPECT_EQ(shownFrom(Type::HexBinary, "0fb7"), "xs:hexBinary 0FB7");
  EXPECT_EQ(shownFrom(Type::HexBinary, ""), "xs:hexBinary ");
  EXPECT_EQ(shownFrom(Type::Base64Binary, "aGVs bG8=\n"), "xs:base64Binary aGVsbG8=");
  EXPECT_EQ(shownFrom(Type::Base64Binary, ""), "xs:base64Binary ");
  expectRefused(Type::HexBinary, {"0", "0g", "0f b7", "0x0f"});
  expectRefused(Type::Base64Binary,
                {"QQ", "QQ=", "Q===", "====", "QQ=*=", "QQ=a", "QQ==QQ==", "QR==", "QUF="});
}

TEST(ValueFromText, Notations) {
  EXPECT_EQ(shownFrom(Type::Notation, " p:gif "), "xs:NOTATION p:gif");
  expectRefused(Type::Notation, {"", ":gif", "p:", "a b", "a:b:c"});
}

TEST(ValueFromText, DatesAndTimesOfEachType) {
  const std::pair<Type, const char*> rows[] = {
      {Type::DateTime, "2002-10-10T12:00:00-05:00"},
      {Type::DateTime, "2002-10-10T17:00:00Z"},
      {Type::DateTime, "-0044-03-15T11:30:01"},
      {Type::DateTime, "12004-04-12T13:20:00+14:00"},
      {Type::Date, "2004-02-29"},
      {Type::Date, "2004-04-12-14:00"},
      {Type::Time, "13:20:00"},
      {Type::Time, "00:00:59Z"},
      {Type::GYearMonth, "2004-04-05:00"},
      {Type::GYear, "-2147483648"},
      {Type::GYear, "2147483647+01:00"},
      {Type::GMonthDay, "--02-29"},
      {Type::GDay, "---31Z"},
      {Type::GMonth, "--05--"},
  };
  for (const auto& [type, text] : rows) {
    EXPECT_EQ(shownFrom(type, std::string("\n ") + text + " "),
              XQueryNameOfType(type) + " " + text);
  }
  EXPECT_EQ(shownFrom(Type::GMonth, "--05"), "xs:gMonth --05--");
  EXPECT_EQ(shownFrom(Type::GMonth, "--05-05:00"), "xs:gMonth --05---05:00");
  EXPECT_EQ(shownFrom(Type::GMonth, "--05---05:00"), "xs:gMonth --05---05:00");
  EXPECT_EQ(shownFrom(Type::Time, "13:20:00-00:00"), "xs:time 13:20:00Z");
  EXPECT_EQ(shownFrom(Type::Date, "0000-02-29"), "xs:date 0000-02-29");
}

TEST(ValueFromText, DatesAndTimesOfOtherForms) {
  expectRefused(Type::DateTime,
                {"", "2002-10-10", "2002-10-10 12:00:00", "2002-10-10T12:00",
                 "2002-10-10t12:00:00Z", "2002-10-10T12:00:00z", "2002-10-10T12:00:00.",
                 "2002-10-10T12:00:00,5", "2002-10-10T1:00:00", "2002-10-10T12:00:00+1:00",
                 "2002-10-10T12:00:00+0100", "2002-10-10T12:00:00+01:60"});
  expectRefused(Type::Date, {"", "02-10-10", "+2002-10-10", "02002-10-10", "-0000-10-10",
                             "2002-1-10", "2002-10-1", "20021010", "2002-10-10T", "2002-10-10 Z"});
  expectRefused(Type::Time, {"", "12", "12:00", "T12:00:00", "12:00:0"});
  expectRefused(Type::GYearMonth, {"2002", "2002-10-10", "2002/10"});
  expectRefused(Type::GYear, {"", "99", "099", "02002", "2002-10"});
  expectRefused(Type::GMonthDay, {"--0229", "-02-29", "02-29"});
  expectRefused(Type::GDay, {"--31", "---1", "31"});
  expectRefused(Type::GMonth, {"-05", "--5", "--05-", "05"});
}

TEST(ValueFromText, DateFieldsOutOfRange) {
  const std::tuple<Type, const char*, const char*> rows[] = {
      {Type::Date, "2004-13-01", "month 13 of xs:date"},
      {Type::Date, "2004-00-01", "month 0 of xs:date"},
      {Type::Date, "2003-02-29", "day 29 of xs:date"},
      {Type::Date, "1900-02-29", "day 29 of xs:date"},
      {Type::Date, "2004-04-31", "day 31 of xs:date"},
      {Type::GMonthDay, "--02-30", "day 30 of xs:gMonthDay"},
      {Type::GDay, "---32", "day 32 of xs:gDay"},
      {Type::Time, "24:00:01", "hour 24 of xs:time"},
      {Type::Time, "25:00:00", "hour 25 of xs:time"},
      {Type::Time, "12:60:00", "minute 60 of xs:time"},
      {Type::Time, "23:59:60", "second 60 of xs:time"},
      {Type::Time, "12:00:00+14:01", "zone of minutes 841 of xs:time"},
      {Type::DateTime, "2004-13-01T24:00:00", "month 13 of xs:dateTime"},
  };
  for (const auto& [type, text, field] : rows) {
    EXPECT_EQ(shownFrom(type, text), std::string("error ") + field + " is out of range") << text;
  }
  EXPECT_EQ(shownFrom(Type::GYear, "2147483648"),
            "error \"2147483648\" is out of the range of xs:gYear");
  EXPECT_EQ(shownFrom(Type::GYear, "-2147483649"),
            "error \"-2147483649\" is out of the range of xs:gYear");
  EXPECT_EQ(shownFrom(Type::GYear, std::string(100'000, '9')),
            "error \"" + std::string(80, '9') + "...\" is out of the range of xs:gYear");
}

TEST(ValueFromText, FractionsOfSecondsOfDates) {
  const auto nanoseconds = [](std::string_view fraction) {
    const auto made =
        XQueryMakeFromText(Type::DateTime, "2026-11-23T09:05:07" + std::string(fraction) + "Z");
    if (!made) return -1;
    const auto parts = XQueryReadDateTimeParts(*made);
    return parts && parts->second == 7 ? parts->nanosecond : -2;
  };
  EXPECT_EQ(nanoseconds(".5"), 500'000'000);
  EXPECT_EQ(nanoseconds(".05"), 50'000'000);
  EXPECT_EQ(nanoseconds(".000000001"), 1);
  EXPECT_EQ(nanoseconds(".999999999"), 999'999'999);
  EXPECT_EQ(nanoseconds(".9999999999"), 999'999'999);
  EXPECT_EQ(nanoseconds(".0"), 0);
}

TEST(ValueFromText, TheEndOfADayIsTheBeginningOfTheNextDate) {
  EXPECT_EQ(shownFrom(Type::DateTime, "2004-02-28T24:00:00Z"), "xs:dateTime 2004-02-29T00:00:00Z");
  EXPECT_EQ(shownFrom(Type::DateTime, "2003-02-28T24:00:00.000"),
            "xs:dateTime 2003-03-01T00:00:00");
  EXPECT_EQ(shownFrom(Type::DateTime, "1999-12-31T24:00:00-05:00"),
            "xs:dateTime 2000-01-01T00:00:00-05:00");
  EXPECT_EQ(shownFrom(Type::DateTime, "-0001-12-31T24:00:00Z"), "xs:dateTime 0000-01-01T00:00:00Z");
  EXPECT_EQ(shownFrom(Type::DateTime, "1900-02-28T24:00:00Z"), "xs:dateTime 1900-03-01T00:00:00Z");
  EXPECT_EQ(shownFrom(Type::Time, "24:00:00Z"), "xs:time 00:00:00Z");
  EXPECT_EQ(shownFrom(Type::DateTime, "2147483647-12-31T24:00:00Z"),
            "error \"2147483647-12-31T24:00:00Z\" is out of the range of xs:dateTime");
}

TEST(ValueFromText, Durations) {
  EXPECT_EQ(shownFrom(Type::Duration, "P1Y2M3DT10H30M5.5S"), "xs:duration P1Y2M3DT10H30M5.5S");
  EXPECT_EQ(shownFrom(Type::Duration, " P0Y "), "xs:duration P0M");
  EXPECT_EQ(shownFrom(Type::YearMonthDuration, "-P1Y14M"), "xdt:yearMonthDuration -P2Y2M");
  EXPECT_EQ(shownFrom(Type::YearMonthDuration, "P20M"), "xdt:yearMonthDuration P1Y8M");
  EXPECT_EQ(shownFrom(Type::DayTimeDuration, "P3DT10H30M"), "xdt:dayTimeDuration P3DT10H30M");
  EXPECT_EQ(shownFrom(Type::DayTimeDuration, "-P60D"), "xdt:dayTimeDuration -P60D");
  EXPECT_EQ(shownFrom(Type::DayTimeDuration, "PT1.05S"), "xdt:dayTimeDuration PT1.05S");
  expectRefused(Type::Duration,
                {"", "P", "-P", "PT", "P1YT", "1Y", "P1", "P-1Y", "+P1Y", "P1Y1Y", "P1M1Y", "PT1D",
                 "P1H", "P1.5Y", "PT1.S", "PT.5S", "P1Y 2M", "p1y"});
  expectRefused(Type::YearMonthDuration, {"P1D", "PT1S", "P1Y1D", "P"});
  expectRefused(Type::DayTimeDuration, {"P1Y", "P1M", "P1YT1H", "P1DT"});
}

TEST(ValueFromText, DurationsBeyondTheirFields) {
  EXPECT_EQ(shownFrom(Type::Duration, "P2147483647Y"), "xs:duration P2147483647Y");
  EXPECT_EQ(shownFrom(Type::Duration, "P2147483648Y"),
            "error \"P2147483648Y\" is out of the range of xs:duration");
  EXPECT_EQ(shownFrom(Type::YearMonthDuration, "P9223372036854775807M"),
            "xdt:yearMonthDuration P768614336404564650Y7M");
  EXPECT_EQ(shownFrom(Type::YearMonthDuration, "P9223372036854775808M"),
            "error \"P9223372036854775808M\" is out of the range of xdt:yearMonthDuration");
  EXPECT_EQ(shownFrom(Type::YearMonthDuration, "P9223372036854775807Y"),
            "error \"P9223372036854775807Y\" is out of the range of xdt:yearMonthDuration");
  const std::string seconds = "PT1" + std::string(400, '0') + "S";
  EXPECT_EQ(
      shownFrom(Type::DayTimeDuration, seconds),
      "error \"" + seconds.substr(0, 80) + "...\" is out of the range of xdt:dayTimeDuration");
}

TEST(ValueFromText, NeitherListsNorNamesNorNodes) {
  EXPECT_EQ(shownFrom(Type::QName, "a"), "error xs:QName is not made from a text alone");
  EXPECT_EQ(shownFrom(Type::IDREFS, "a b"), "error xs:IDREFS is not made from a text alone");
  EXPECT_EQ(shownFrom(Type::Element, "<a/>"), "error element() is not made from a text alone");
  EXPECT_EQ(shownFrom(Type::None, "a"), "error item() is not made from a text alone");
  EXPECT_EQ(shownFrom(static_cast<Type>(5), "a"), "error item() is not made from a text alone");
  EXPECT_EQ(shownFrom(static_cast<Type>(200), "a"), "error item() is not made from a text alone");
}

TEST(ValueFromText, OfNoTypeWhatIsNotUTF8) {
  for (int number = 8; number <= 54; ++number) {
    const auto type = static_cast<Type>(number);
    const std::string made = shownFrom(type, "12\xC3");
    if (made.ends_with("is not made from a text alone")) continue;
    EXPECT_EQ(made, "error the text is not well-formed UTF-8") << number;
  }
}

}  // namespace
}  // namespace xquery
