#include "Platform/Base/ProcessorTime.h"
#include "Platform/Dates/ZoneTestSupport.h"
#include "Types/XQueryDate.h"
#include "TypesTestSupport.h"

#include <clocale>
#include <optional>
#include <string>
#include <vector>

namespace xquery {
namespace {

using testing::view;

constexpr XQueryTypeID dateTypes[] = {16, 17, 18, 19, 20, 21, 22, 23};

Ref<XQueryDate> parse(XQueryTypeID type, std::string_view text) {
  switch (type) {
    case 16:
      return XQueryDate::xqueryGMonthYearFromString(view(text));
    case 17:
      return XQueryDate::xqueryGYearFromString(view(text));
    case 18:
      return XQueryDate::xqueryGMonthDayFromString(view(text));
    case 19:
      return XQueryDate::xqueryGDayFromString(view(text));
    case 20:
      return XQueryDate::xqueryGMonthFromString(view(text));
    case 21:
      return XQueryDate::xqueryDateTimeFromString(view(text));
    case 22:
      return XQueryDate::xqueryDateFromString(view(text));
    default:
      return XQueryDate::xqueryTimeFromString(view(text));
  }
}

std::string print(const Ref<XQueryDate>& date) {
  return date ? date->XQueryStringValue()->utf8() : "(null)";
}

std::string read(XQueryTypeID type, std::string_view text) {
  return print(parse(type, text));
}

// Year-month-day hour:minute:second.
std::string show(const NSGregorianDate& date) {
  std::string second = std::to_string(date.second);
  return std::to_string(date.year) + "-" + std::to_string(date.month) + "-" +
         std::to_string(date.day) + " " + std::to_string(date.hour) + ":" +
         std::to_string(date.minute) + ":" + second;
}

struct Row {
  XQueryTypeID type;
  const char* text;
  const char* printed;  // null when it is the text
};

const Row accepted[] = {
    {16, "2004-05", nullptr},
    {16, "2004-05Z", nullptr},
    {16, "2004-05-05:00", nullptr},
    {16, "-0044-03", nullptr},
    {16, "12004-12", nullptr},
    {17, "2004", nullptr},
    {17, "2004+01:00", nullptr},
    {17, "2004-01:00", nullptr},
    {17, "0000", nullptr},
    {17, "-0000", "0000"},
    {17, "-0001", nullptr},
    {17, "02004", "2004"},
    {17, "000002004", "2004"},
    {17, "123456", nullptr},
    {17, "2147483647", nullptr},
    {17, "-2147483647", nullptr},
    {17, "2147483647+00:01", nullptr},
    {17, "2147483647-23:59", nullptr},
    {18, "--02-29", nullptr},
    {18, "--12-31Z", nullptr},
    {18, "--05-01-05:00", nullptr},
    {19, "---01", nullptr},
    {19, "---31", nullptr},
    {19, "---05+14:00", nullptr},
    {20, "--05--", nullptr},
    {20, "--05--Z", nullptr},
    {20, "--05---05:00", nullptr},
    {20, "--12--+05:00", nullptr},
    {21, "2004-02-29T12:30:45", nullptr},
    {21, "2004-02-29T12:30:45Z", nullptr},
    {21, "2004-02-29T12:30:45-08:30", nullptr},
    {21, "2004-02-29T00:00:00+00:00", "2004-02-29T00:00:00Z"},
    {21, "2004-02-29T00:00:00-00:00", "2004-02-29T00:00:00Z"},
    {21, "2004-01-01T00:00:5.5", "2004-01-01T00:00:05.500000"},
    {21, "2004-01-01T00:00:12.5", "2004-01-01T00:00:12.500000"},
    {21, "2004-01-01T00:00:05.0", "2004-01-01T00:00:05"},
    {21, "2004-01-01T00:00:5.", "2004-01-01T00:00:05"},
    {21, "2004-01-01T00:00:.25", "2004-01-01T00:00:00.250000"},
    {21, "2004-01-01T00:00:0", "2004-01-01T00:00:00"},
    {21, "2004-01-01T00:00:0000005", "2004-01-01T00:00:05"},
    {21, "2004-01-01T00:00:05.123456", nullptr},
    {21, "9999-01-01T00:00:05.1234564", "9999-01-01T00:00:05.123456"},
    {21, "2004-12-31T23:59:60", "2005-01-01T00:00:00"},
    {21, "2004-12-31T23:59:60.0Z", "2005-01-01T00:00:00Z"},
    {21, "-0044-03-15T12:00:00", nullptr},
    {21, "0000-02-29T12:00:00", nullptr},
    {21, "-0004-02-29T12:00:00", nullptr},
    {22, "2004-02-29", nullptr},
    {22, "2000-02-29", nullptr},
    {22, "2004-05-06Z", nullptr},
    {22, "2004-05-06-01:00", nullptr},
    {22, "-2004-05-06+01:00", nullptr},
    {22, "1000000-01-01", nullptr},
    {23, "12:30:45", nullptr},
    {23, "00:00:00Z", nullptr},
    {23, "23:59:59.999999-01:15", nullptr},
    {23, "23:59:60", "00:00:00"},
    {23, "12:00:00+14:30", nullptr},
    {23, "12:00:00+99:99", "12:00:00+100:39"},
    {23, "12:00:00-99:99", "12:00:00-100:39"},
    {23, "12:00:9.5", "12:00:09.500000"},
    // The format of a second below ten puts a zero before what rounding makes a ten.
    {23, "12:00:9.9999999", "12:00:010.000000"},
    {23, "12:00:59.9999999", "12:00:60.000000"},
};

TEST(XQueryDate, ReadsAndPrintsItsForms) {
  for (const Row& row : accepted) {
    const Ref<XQueryDate> date = parse(row.type, row.text);
    ASSERT_TRUE(date) << row.type << " " << row.text;
    EXPECT_EQ(date->typeID(), row.type);
    EXPECT_EQ(print(date), row.printed ? row.printed : row.text) << row.type;
  }
}

const Row rejected[] = {
    {16, "2004", nullptr},
    {16, "2004-5", nullptr},
    {16, "2004-13", nullptr},
    {16, "2004-00", nullptr},
    {16, "2004-005", nullptr},
    {16, "2004-05-01", nullptr},
    {16, "2004 -05", nullptr},
    {16, "+2004-05", nullptr},
    {17, "", nullptr},
    {17, "204", nullptr},
    {17, "-204", nullptr},
    {17, "--2004", nullptr},
    {17, "+2004", nullptr},
    {17, " 2004", nullptr},
    {17, "2004 ", nullptr},
    {17, "2004-05", nullptr},
    {17, "2147483648", nullptr},
    {17, "-2147483648", nullptr},
    {17, "99999999999999999999999", nullptr},
    {17, "2004z", nullptr},
    {18, "--02-30", nullptr},
    {18, "--04-31", nullptr},
    {18, "-02-03", nullptr},
    {18, "02-03", nullptr},
    {18, "--2-03", nullptr},
    {18, "--02-3", nullptr},
    {18, "--0203", nullptr},
    {18, "--13-01", nullptr},
    {18, "--01-00", nullptr},
    {19, "---32", nullptr},
    {19, "---00", nullptr},
    {19, "---5", nullptr},
    {19, "--05", nullptr},
    {19, "05", nullptr},
    {19, "----05", nullptr},
    {19, "---005", nullptr},
    {20, "--05", nullptr},
    {20, "--05Z", nullptr},
    {20, "--05-", nullptr},
    {20, "--5--", nullptr},
    {20, "--13--", nullptr},
    {20, "--00--", nullptr},
    {20, "05--", nullptr},
    {21, "2004-02-29", nullptr},
    {21, "2004-02-29T", nullptr},
    {21, "2004-02-29T12:30", nullptr},
    {21, "2004-02-29T12:30:", nullptr},
    {21, "2004-02-29 12:30:45", nullptr},
    {21, "2004-02-29t12:30:45", nullptr},
    {21, "2004-02-30T12:30:45", nullptr},
    {21, "2004-02-29T24:00:00", nullptr},
    {21, "2004-02-29T12:60:00", nullptr},
    {21, "2004-02-29T12:30:61", nullptr},
    {21, "2004-02-29T12:30:60.5", nullptr},
    {21, "2004-02-29T12:30:45.5.5", nullptr},
    {21, "2004-02-29T12:30:45,5", nullptr},
    {21, "2004-02-29T12:30:1e1", nullptr},
    {21, "2004-02-29T12:30:+5", nullptr},
    {21, "2004-02-29T12:30:-0", nullptr},
    {21, "2004-02-29T12:30: 5", nullptr},
    {21, "2004-02-29T12:30:.", nullptr},
    {21, "2004-02-29T-1:30:05", nullptr},
    {21, "2004-02-29T1:30:05", nullptr},
    {21, "2004-02-29T12:3:05", nullptr},
    {22, "2004-2-01", nullptr},
    {22, "2004-02-30", nullptr},
    {22, "2003-02-29", nullptr},
    {22, "1900-02-29", nullptr},
    {22, "2004-04-31", nullptr},
    {22, "2004-02-1", nullptr},
    {22, "2004-02-001", nullptr},
    {22, "2004-02-", nullptr},
    {22, "2004-0-201", nullptr},
    {22, "20040229", nullptr},
    {22, "2004-02-29T12:00:00", nullptr},
    {23, "24:00:00", nullptr},
    {23, "12:60:00", nullptr},
    {23, "12:00", nullptr},
    {23, "T12:00:00", nullptr},
    {23, "1:00:00", nullptr},
    {23, "012:00:00", nullptr},
    {23, "12:00:00 Z", nullptr},
    {23, "12:00:00Zx", nullptr},
    {23, "12:00:00z", nullptr},
    {23, "12:00:00+1:00", nullptr},
    {23, "12:00:00+01:0", nullptr},
    {23, "12:00:00+01", nullptr},
    {23, "12:00:00+0100", nullptr},
    {23, "12:00:00+001:00", nullptr},
    {23, "12:00:00+-1:00", nullptr},
    {23, "12:00:00GMT", nullptr},
    {23, "12:00:00+01:00Z", nullptr},
};

TEST(XQueryDate, RejectsEveryDeviation) {
  for (const Row& row : rejected) EXPECT_FALSE(parse(row.type, row.text)) << row.text;
}

TEST(XQueryDate, RejectsTextThatIsNotASCII) {
  const Ref<NSString> digits = testing::text("\xD9\xA2\xD9\xA0\xD9\xA0\xD9\xA4");
  EXPECT_FALSE(XQueryDate::xqueryGYearFromString(digits->view()));
  EXPECT_FALSE(XQueryDate::xqueryGYearFromString(testing::text("2004\xC3\xA9")->view()));
}

TEST(XQueryDate, APrefixIsCompleteOnlyAmongTheSeconds) {
  const std::string text = "2004-02-29T12:30:45.5+01:30";
  const std::string zoneless = "2004-02-29T12:30:4";
  for (size_t length = 0; length < text.size(); ++length) {
    // From the first digit of the seconds on a prefix is complete unless it breaks off the zone.
    const bool complete = length >= zoneless.size() && length <= 21;
    EXPECT_EQ(static_cast<bool>(parse(21, text.substr(0, length))), complete) << length;
  }
}

TEST(XQueryDate, TheFieldsThatATypeDoesNotHaveRestAtTheStartOfYearZero) {
  EXPECT_EQ(show(parse(16, "2004-05Z")->gregorianDate()), "2004-5-1 0:0:0.000000");
  EXPECT_EQ(show(parse(17, "2004Z")->gregorianDate()), "2004-1-1 0:0:0.000000");
  EXPECT_EQ(show(parse(18, "--02-29Z")->gregorianDate()), "0-2-29 0:0:0.000000");
  EXPECT_EQ(show(parse(19, "---31Z")->gregorianDate()), "0-1-31 0:0:0.000000");
  EXPECT_EQ(show(parse(20, "--05--Z")->gregorianDate()), "0-5-1 0:0:0.000000");
  EXPECT_EQ(show(parse(22, "2004-05-06Z")->gregorianDate()), "2004-5-6 0:0:0.000000");
  // Day 0 of month 0 is 30 November of the year before.
  EXPECT_EQ(show(parse(23, "12:30:45.5Z")->gregorianDate()), "-1-11-30 12:30:45.500000");
}

TEST(XQueryDate, AZoneMovesTheInstantButNotTheFields) {
  const Ref<XQueryDate> date = parse(21, "2004-02-29T23:30:00-02:00");
  EXPECT_EQ(show(date->gregorianDate()), "2004-2-29 23:30:0.000000");
  EXPECT_EQ(show(date->gregorianDateGMT()), "2004-3-1 1:30:0.000000");
  EXPECT_EQ(date->timeZone()->secondsFromGMT({}), -7200);
  EXPECT_EQ(parse(21, "2004-03-01T01:30:00Z")->instant(), date->instant());
}

TEST(XQueryDate, WithoutASuffixThereIsNoZone) {
  const char* const texts[] = {"2004-05",    "2004",    "--05-06",
                               "---06",      "--05--",  "2004-05-06T01:02:03",
                               "2004-05-06", "01:02:03"};
  for (const XQueryTypeID type : dateTypes) {
    const std::string text = texts[type - 16];
    EXPECT_FALSE(parse(type, text)->timeZone()) << text;
    EXPECT_EQ(parse(type, text + "Z")->timeZone().get(), XQueryDate::timeZoneGMT()) << text;
    EXPECT_EQ(parse(type, text + "+01:30")->timeZone()->secondsFromGMT({}), 5400) << text;
    EXPECT_EQ(parse(type, text + "-99:99")->timeZone()->secondsFromGMT({}), -362340) << text;
  }
}

TEST(XQueryDate, TheReferenceInstantIsTheStartOf2001) {
  EXPECT_EQ(parse(21, "2001-01-01T00:00:00Z")->timeIntervalSinceReferenceDate(), 0);
  EXPECT_EQ(parse(21, "2001-01-01T00:00:01.5Z")->timeIntervalSinceReferenceDate(), 1.5);
  EXPECT_EQ(parse(22, "2000-12-31Z")->timeIntervalSinceReferenceDate(), -86400);
  EXPECT_EQ(parse(21, "2001-01-01T01:00:00+01:00")->timeIntervalSinceReferenceDate(), 0);
  EXPECT_EQ(parse(17, "1970Z")->timeIntervalSinceReferenceDate(), -978307200);
}

TEST(XQueryDate, PrintsTheFieldsOfItsOwnZoneWithTheSuffixAskedFor) {
  const Ref<XQueryDate> date = parse(21, "2004-02-29T23:30:00-02:00");
  const auto printed = [&](const NSTimeZone* zone) {
    return date->localizedStringForTimeZone(zone)->utf8();
  };
  EXPECT_EQ(printed(nullptr), "2004-02-29T23:30:00");
  EXPECT_EQ(printed(NSTimeZone::GMT()), "2004-02-29T23:30:00Z");
  EXPECT_EQ(printed(NSTimeZone::timeZoneForSecondsFromGMT(20700).get()),
            "2004-02-29T23:30:00+05:45");
}

TEST(XQueryDate, ASuffixHasWholeHoursAndTheRemainingMinutes) {
  EXPECT_EQ(XQueryDate::suffixForSecondsFromGMT(0), "Z");
  EXPECT_EQ(XQueryDate::suffixForSecondsFromGMT(3600), "+01:00");
  EXPECT_EQ(XQueryDate::suffixForSecondsFromGMT(-12600), "-03:30");
  EXPECT_EQ(XQueryDate::suffixForSecondsFromGMT(3659), "+01:00");
  EXPECT_EQ(XQueryDate::suffixForSecondsFromGMT(-59), "-00:00");
  EXPECT_EQ(XQueryDate::suffixForSecondsFromGMT(INT32_MIN), "-596523:14");
}

TEST(XQueryDate, GMTIsMadeOnce) {
  EXPECT_EQ(XQueryDate::timeZoneGMT(), XQueryDate::timeZoneGMT());
  EXPECT_EQ(parse(17, "2004Z")->timeZone().get(), XQueryDate::timeZoneGMT());
}

TEST(XQueryDate, IsMadeFromAnIntervalInTheLocalZone) {
  const Ref<XQueryDate> date =
      XQueryDate::xqueryDateWithTimeIntervalSinceReferenceDate(86400.5, 22);
  EXPECT_EQ(date->typeID(), 22);
  EXPECT_EQ(date->timeIntervalSinceReferenceDate(), 86400.5);
  EXPECT_EQ(date->timeZone().get(), NSTimeZone::localTimeZone());
}

TEST(XQueryDate, IsMadeFromFieldsInAZone) {
  const NSGregorianDate fields = {2004, 2, 29, 12, 30, 45.5};
  const auto zone = NSTimeZone::timeZoneForSecondsFromGMT(3600);
  const Ref<XQueryDate> date = XQueryDate::xqueryDateWithGregorianDate(fields, zone, 21);
  EXPECT_EQ(print(date), "2004-02-29T12:30:45.500000+01:00");
  EXPECT_EQ(date->timeZone(), zone);
  EXPECT_FALSE(XQueryDate::xqueryDateWithGregorianDate(fields, nullptr, 21)->timeZone());
}

TEST(XQueryDate, ThePresentIsInTheLocalZone) {
  const NSInstant before = NSInstant::now();
  const Ref<XQueryDate> dates[] = {XQueryDate::currentDateTime(), XQueryDate::currentDate(),
                                   XQueryDate::currentTime()};
  const NSInstant after = NSInstant::now();
  XQueryTypeID type = 21;
  for (const Ref<XQueryDate>& date : dates) {
    EXPECT_EQ(date->typeID(), type++);
    EXPECT_EQ(date->timeZone().get(), NSTimeZone::localTimeZone());
    EXPECT_LE(before, date->instant());
    EXPECT_LE(date->instant(), after);
  }
}

TEST(XQueryDate, TheContextKeepsItsFirstPresent) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Ref<XQueryDate> first = _internal(*context).currentDateTime();
  EXPECT_EQ(first->typeID(), 21);
  EXPECT_EQ(_internal(*context).currentDateTime(), first);
  EXPECT_NE(_internal(*XQueryContext::xqueryContext()).currentDateTime(), first);
}

TEST(XQueryDate, EqualityIsThatOfTheInstants) {
  const Value values[] = {parse(21, "2004-02-29T00:00:00Z"), parse(21, "2004-02-29T05:00:00+05:00"),
                          parse(22, "2004-02-29Z"),
                          NSDate::dateWithTimeIntervalSinceReferenceDate(
                              parse(22, "2004-02-29Z")->timeIntervalSinceReferenceDate())};
  for (const Value& a : values) {
    for (const Value& b : values) {
      EXPECT_TRUE(XQueryObjectsEqual(*a, *b));
      EXPECT_EQ(XQueryObjectHash(*a), XQueryObjectHash(*b));
    }
    EXPECT_FALSE(XQueryObjectsEqual(*a, *parse(21, "2004-02-29T00:00:00.000001Z")));
    EXPECT_FALSE(XQueryObjectsEqual(*a, *testing::integer(1)));
    EXPECT_FALSE(XQueryObjectsEqual(*testing::integer(1), *a));
  }
}

TEST(XQueryDate, APlainPlatformDateHasNoAtomicType) {
  const Ref<NSDate> date = NSDate::date();
  EXPECT_EQ(XQueryObjectTypeID(date.get()), 0);
  EXPECT_FALSE(XQueryIsAtomicType(date.get()));
  EXPECT_EQ(XQueryItemTypeName(*date), "item()");
}

TEST(XQueryDate, ItsTypeIsNamedAndItsTextPublished) {
  const char* const names[] = {"xs:gYearMonth", "xs:gYear",    "xs:gMonthDay", "xs:gDay",
                               "xs:gMonth",     "xs:dateTime", "xs:date",      "xs:time"};
  const char* const texts[] = {"2004-05",    "2004",    "--05-06",
                               "---06",      "--05--",  "2004-05-06T01:02:03",
                               "2004-05-06", "01:02:03"};
  for (const XQueryTypeID type : dateTypes) {
    const Ref<XQueryDate> date = parse(type, texts[type - 16]);
    EXPECT_EQ(XQueryObjectTypeID(date.get()), type);
    EXPECT_TRUE(XQueryIsAtomicType(date.get()));
    EXPECT_EQ(XQueryItemTypeName(*date), names[type - 16]);
    EXPECT_EQ(XQueryItemStringValue(*date), texts[type - 16]);
    EXPECT_EQ(testing::utf8(XQueryDescription(date.get())), texts[type - 16]);
  }
}

// --- casts within the family ---------------------------------------------------------------------

TEST(XQueryDateCast, ClearsTheFieldsThatTheTargetDoesNotHave) {
  const Ref<XQueryDate> date = parse(21, "2004-02-29T12:30:45.5+02:00");
  const std::pair<XQueryTypeID, const char*> rows[] = {
      {16, "2004-2-1 0:0:0.000000"},   {17, "2004-1-1 0:0:0.000000"},
      {18, "0-2-29 0:0:0.000000"},     {19, "0-1-29 0:0:0.000000"},
      {20, "0-2-1 0:0:0.000000"},      {22, "2004-2-29 0:0:0.000000"},
      {23, "-1-11-30 12:30:45.500000"}};
  for (const auto& [type, fields] : rows) {
    const Ref<XQueryDate> cast = date->castToType(type);
    ASSERT_TRUE(cast) << type;
    EXPECT_EQ(show(cast->gregorianDate()), fields) << type;
    EXPECT_EQ(cast->timeZone(), date->timeZone()) << type;
    EXPECT_EQ(cast->typeID(), type);
  }
}

TEST(XQueryDateCast, IsTheValueThatItsTextReads) {
  for (const char* text : {"2004-02-29T12:30:45.5+02:00", "-0044-03-15T00:00:00Z",
                           "2004-12-31T23:59:59-14:00", "2004-07-01T12:00:00"}) {
    const Ref<XQueryDate> date = parse(21, text);
    for (const XQueryTypeID type : {16, 17, 18, 19, 20, 22, 23}) {
      const Ref<XQueryDate> cast = date->castToType(type);
      EXPECT_EQ(cast->instant(), parse(type, print(cast))->instant()) << text << " to " << type;
    }
  }
}

TEST(XQueryDateCast, OnlyWhatHasTheFieldsCanBeCast) {
  const char* const texts[] = {"2004-05",    "2004",    "--05-06",
                               "---06",      "--05--",  "2004-05-06T01:02:03",
                               "2004-05-06", "01:02:03"};
  for (const XQueryTypeID from : dateTypes) {
    for (XQueryTypeID to = 0; to < 60; ++to) {
      const bool toFragment = to >= 16 && to <= 20 && (from == 21 || from == 22);
      const bool between = (from == 22 && to == 21) || (from == 21 && (to == 22 || to == 23));
      EXPECT_EQ(static_cast<bool>(parse(from, texts[from - 16])->castToType(to)),
                toFragment || between)
          << from << " to " << to;
    }
  }
}

// In a zone with daylight saving time.
class InBerlin : public ::testing::Test {
 protected:
  Ref<NSTimeZone> zone = NSTimeZone::timeZoneWithName("Europe/Berlin");
  Ref<XQueryDate> at(const NSGregorianDate& fields, XQueryTypeID type = 21) {
    return XQueryDate::xqueryDateWithGregorianDate(fields, zone, type);
  }
};

TEST_F(InBerlin, TheSuffixIsTheOffsetOfTheInstant) {
  EXPECT_EQ(print(at({2024, 1, 15, 12, 0, 0})), "2024-01-15T12:00:00+01:00");
  EXPECT_EQ(print(at({2024, 7, 15, 12, 0, 0})), "2024-07-15T12:00:00+02:00");
  EXPECT_EQ(print(at({2024, 7, 15, 0, 0, 0}, 22)), "2024-07-15+02:00");
}

TEST_F(InBerlin, ATimeThatDaylightSavingSkipsIsMovedBehindTheGap) {
  EXPECT_EQ(print(at({2024, 3, 31, 2, 30, 0})), "2024-03-31T03:30:00+02:00");
}

TEST_F(InBerlin, ATimeThatComesTwiceIsTheFirst) {
  EXPECT_EQ(print(at({2024, 10, 27, 2, 30, 0})), "2024-10-27T02:30:00+02:00");
}

TEST_F(InBerlin, ACastKeepsTheOffsetThatTheValueShows) {
  const Ref<XQueryDate> summer = at({2024, 7, 15, 14, 30, 0});
  EXPECT_EQ(print(summer->castToType(23)), "14:30:00+02:00");
  EXPECT_EQ(print(summer->castToType(19)), "---15+02:00");
  EXPECT_EQ(print(summer->castToType(17)), "2024+02:00");
  EXPECT_EQ(print(summer->castToType(16)), "2024-07+02:00");
  EXPECT_EQ(summer->castToType(16)->timeZone(), zone);
  EXPECT_EQ(print(at({2024, 3, 31, 14, 0, 0})->castToType(22)), "2024-03-31+02:00");
  EXPECT_EQ(print(at({2024, 1, 15, 14, 30, 0})->castToType(23)), "14:30:00+01:00");
}

class LocalDates : public InZoneDeathTest {};

std::string comparedInGMT(XQueryTypeID type, std::string_view text) {
  return show(parse(type, text)->gregorianDateGMT()) + " " + read(type, text);
}

TEST_F(LocalDates, WithoutAZoneTheLocalClockShowsTheFields) {
  EXPECT_IN_ZONE("Europe/Berlin", comparedInGMT(21, "2024-01-15T12:00:00"),
                 "2024-1-15 11:0:0.000000 2024-01-15T12:00:00");
  EXPECT_IN_ZONE("Europe/Berlin", comparedInGMT(21, "2024-07-15T12:00:00"),
                 "2024-7-15 10:0:0.000000 2024-07-15T12:00:00");
  EXPECT_IN_ZONE("America/New_York", comparedInGMT(21, "2024-07-15T12:00:00"),
                 "2024-7-15 16:0:0.000000 2024-07-15T12:00:00");
  EXPECT_IN_ZONE("America/New_York", comparedInGMT(21, "1850-07-15T12:00:00"),
                 "1850-7-15 17:0:0.000000 1850-07-15T12:00:00");
  EXPECT_IN_ZONE("America/New_York", comparedInGMT(22, "2024-07-15"),
                 "2024-7-15 4:0:0.000000 2024-07-15");
  EXPECT_IN_ZONE("Asia/Kathmandu", comparedInGMT(23, "12:00:00"),
                 "-1-11-30 6:15:0.000000 12:00:00");
  EXPECT_IN_ZONE("America/New_York", comparedInGMT(17, "2024"), "2024-1-1 5:0:0.000000 2024");
}

TEST_F(LocalDates, ThePresentShowsTheLocalOffset) {
  const auto suffix = [] {
    const std::string text = print(XQueryDate::currentDateTime());
    return text.substr(text.size() - 6);
  };
  EXPECT_IN_ZONE("Asia/Kathmandu", suffix(), "+05:45");
  EXPECT_IN_ZONE("America/Bogota", suffix(), "-05:00");
}

TEST_F(LocalDates, NoLocaleChangesAText) {
  const auto printed = [] {
    // Where none of them is installed there is nothing to change.
    for (const char* locale : {"de_DE.UTF-8", "de_DE.utf8", "fr_FR.UTF-8"}) {
      if (std::setlocale(LC_ALL, locale)) break;
    }
    return read(21, "2004-01-01T00:00:05.5Z");
  };
  EXPECT_IN_ZONE("UTC", printed(), "2004-01-01T00:00:05.500000Z");
}

TEST(XQueryDate, TextsOfMillionsOfDigitsAreReadInTimeInProportion) {
  const auto measure = [](size_t length) {
    const std::string zeros(length, '0');
    const std::string year = zeros + "2004-01-01";
    const std::string seconds = "12:00:00." + zeros + "5";
    return processorSecondsOf([&] {
      EXPECT_TRUE(XQueryDate::xqueryDateFromString(view(year)));
      EXPECT_TRUE(XQueryDate::xqueryTimeFromString(view(seconds)));
      EXPECT_FALSE(XQueryDate::xqueryGYearFromString(view(zeros + "x")));
      EXPECT_FALSE(XQueryDate::xqueryGYearFromString(view("1" + zeros)));
      EXPECT_FALSE(XQueryDate::xqueryGMonthFromString(view("--" + zeros)));
    });
  };
  EXPECT_TRUE(growsInProportion(measure, 400000));
}

}  // namespace
}  // namespace xquery
