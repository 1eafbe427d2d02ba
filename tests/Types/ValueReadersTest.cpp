#include "TypesTestSupport.h"
#include "ValuesTesting.h"
#include "xquery/Data.h"

#include <cmath>
#include <limits>

namespace xquery {
namespace {

using testing::refusal;
using testing::sequence;
using Type = XQueryItemType;
using namespace std::chrono_literals;

Value made(const XQueryResult<Value>& result) {
  EXPECT_TRUE(result) << (result ? "" : result.error()->msg()->utf8());
  return result.valueOr(nullptr);
}

Value madeFrom(Type type, std::string_view text) {
  return made(XQueryMakeFromText(type, text));
}

TEST(ValueReaders, IntegersComeBack) {
  for (const int64_t value : {int64_t{0}, int64_t{-1}, std::numeric_limits<int64_t>::min(),
                              std::numeric_limits<int64_t>::max()}) {
    EXPECT_EQ(*XQueryReadInteger(XQueryMakeInteger(value)), value);
  }
  constexpr uint64_t most = std::numeric_limits<uint64_t>::max();
  EXPECT_EQ(*XQueryReadUnsignedInteger(XQueryMakeInteger(most)), most);
  EXPECT_EQ(*XQueryReadInteger(madeFrom(Type::UnsignedByte, "255")), 255);
  EXPECT_EQ(*XQueryReadUnsignedInteger(madeFrom(Type::UnsignedLong, "18446744073709551615")), most);
}

TEST(ValueReaders, IntegersBeyond64BitsAreOutOfRange) {
  const auto read = XQueryReadInteger(madeFrom(Type::Integer, "9223372036854775808"));
  EXPECT_EQ(refusal(read), "9223372036854775808 is out of the range of 64 bits");
  EXPECT_EQ(read.error()->category(), XQueryErrorCategory::Values);
  EXPECT_EQ(refusal(XQueryReadUnsignedInteger(XQueryMakeInteger(-1))),
            "-1 is out of the range of unsigned 64 bits");
  EXPECT_EQ(*XQueryReadDecimal(madeFrom(Type::Integer, "9223372036854775808")),
            "9223372036854775808");
}

TEST(ValueReaders, DecimalsComeBackDigitByDigit) {
  const std::string digits = "-12345678901234567890.123456789012345678901234567890123456789";
  EXPECT_EQ(*XQueryReadDecimal(made(XQueryMakeDecimal(digits))), digits);
  EXPECT_EQ(*XQueryReadDecimal(made(XQueryMakeDecimal("1.50"))), "1.5");
}

TEST(ValueReaders, DoublesAndFloatsComeBack) {
  for (const double value : {0.1, -0.0, 1e300, 5e-324, double{INFINITY}}) {
    EXPECT_EQ(*XQueryReadDouble(XQueryMakeDouble(value)), value);
  }
  EXPECT_TRUE(std::isnan(*XQueryReadDouble(XQueryMakeDouble(NAN))));
  for (const float value : {0.1F, 1e-45F, 3.4e38F, -INFINITY}) {
    EXPECT_EQ(*XQueryReadFloat(XQueryMakeFloat(value)), value);
  }
  EXPECT_TRUE(std::isnan(*XQueryReadFloat(XQueryMakeFloat(NAN))));
  EXPECT_EQ(*XQueryReadDouble(made(XQueryMakeDecimal("0.1"))), 0.1);
  EXPECT_EQ(*XQueryReadDouble(XQueryMakeInteger(7)), 7);
  EXPECT_EQ(refusal(XQueryReadFloat(XQueryMakeDouble(0.5))), "the item is xs:double, not a float");
}

TEST(ValueReaders, BooleansTextsAndURIsComeBack) {
  EXPECT_TRUE(*XQueryReadBoolean(XQueryMakeBoolean(true)));
  EXPECT_FALSE(*XQueryReadBoolean(XQueryMakeBoolean(false)));
  EXPECT_EQ(*XQueryReadString(made(XQueryMakeString("ä\U0001F600"))), "ä\U0001F600");
  EXPECT_EQ(*XQueryReadString(made(XQueryMakeUntypedAtomic("a"))), "a");
  EXPECT_EQ(*XQueryReadString(madeFrom(Type::Token, "a b")), "a b");
  EXPECT_EQ(*XQueryReadString(made(XQueryMakeAnyURI("urn:a"))), "urn:a");
  EXPECT_EQ(*XQueryReadAnyURI(made(XQueryMakeAnyURI("urn:a"))), "urn:a");
}

TEST(ValueReaders, NamesAndBinariesComeBack) {
  for (const XQueryQNameParts& name :
       {XQueryQNameParts{"urn:a", "b", "p"}, {"urn:a", "b", ""}, {"", "b", ""}}) {
    EXPECT_EQ(*XQueryReadQName(made(XQueryMakeQName(name))), name);
  }
  const std::string bytes("\0\xFF", 2);
  EXPECT_EQ(*XQueryReadBinary(XQueryMakeHexBinary(bytes)), bytes);
  EXPECT_EQ(*XQueryReadBinary(XQueryMakeBase64Binary(bytes)), bytes);
  EXPECT_EQ(*XQueryReadBinary(NSData::dataWithBytes(bytes)), bytes);
}

// Whatever the zone of the process: the tests of dates run in several.
TEST(ValueReaders, DatePartsComeBackOfEachType) {
  struct Row {
    Type type;
    bool year, month, day, time;
  };
  const Row rows[] = {
      {Type::GYearMonth, true, true, false, false}, {Type::GYear, true, false, false, false},
      {Type::GMonthDay, false, true, true, false},  {Type::GDay, false, false, true, false},
      {Type::GMonth, false, true, false, false},    {Type::DateTime, true, true, true, true},
      {Type::Date, true, true, true, false},        {Type::Time, false, false, false, true},
  };
  const std::optional<std::chrono::minutes> zones[] = {std::nullopt, 0min, 14h, -14h, 330min};
  for (const Row& row : rows) {
    for (const int32_t year : {INT32_MIN, -1, 0, 1, 1582, 1899, 2000, 2147483647}) {
      for (const auto& zone : zones) {
        XQueryDateTimeParts parts;
        if (row.year) parts.year = year;
        if (row.month) parts.month = 2;
        if (row.day) parts.day = 28;
        if (row.time) {
          parts.hour = 23;
          parts.minute = 59;
          parts.second = 59;
          parts.nanosecond = 999'999'999;
        }
        parts.zone = zone;
        const auto read = XQueryReadDateTimeParts(made(XQueryMakeDateOfType(row.type, parts)));
        ASSERT_TRUE(read);
        EXPECT_EQ(*read, parts) << XQueryNameOfType(row.type) << ' ' << year;
      }
    }
  }
}

TEST(ValueReaders, DaysAndTimesComeBackAsDatesOfChrono) {
  using namespace std::chrono;
  for (const year_month_day day :
       {2026y / 11 / 23, -32767y / 1 / 1, 32767y / 12 / 31, 0y / 2 / 29}) {
    EXPECT_EQ(*XQueryReadDate(made(XQueryMakeDate(day))), day);
    EXPECT_EQ(*XQueryReadDate(made(XQueryMakeDate(day, -14h))), day);
  }
  EXPECT_EQ(refusal(XQueryReadDate(madeFrom(Type::Date, "32768-01-01"))),
            "32768-01-01 is out of the range of std::chrono::year");
  for (const nanoseconds time : {0ns, 1ns, nanoseconds(24h) - 1ns}) {
    EXPECT_EQ(*XQueryReadTime(made(XQueryMakeTime(time))), time);
    EXPECT_EQ(*XQueryReadTime(made(XQueryMakeTime(time, 14h))), time);
  }
}

TEST(ValueReaders, InstantsComeBackFromDateTimes) {
  using namespace std::chrono;
  using Instant = sys_time<nanoseconds>;
  for (const int64_t count :
       {int64_t{0}, int64_t{-1}, int64_t{1'790'000'000'123'456'789},
        std::numeric_limits<int64_t>::min(), std::numeric_limits<int64_t>::max()}) {
    const Instant instant{nanoseconds(count)};
    EXPECT_EQ(*XQueryReadDateTime(made(XQueryMakeDateTime(instant))), instant) << count;
    EXPECT_EQ(*XQueryReadDateTime(made(XQueryMakeDateTime(instant, -90min))), instant) << count;
  }
  const Instant last{nanoseconds::max()};
  const auto beyond = XQueryMakeDateTime(time_point_cast<seconds>(last) + 1s);
  EXPECT_EQ(refusal(XQueryReadDateTime(made(beyond))),
            "2262-04-11T23:47:17Z is out of the range of 64 bits of nanoseconds");
}

TEST(ValueReaders, DurationsComeBack) {
  using namespace std::chrono;
  const XQueryDurationParts parts{true, 1, 20, 300, 40, 500, 60.5};
  EXPECT_EQ(*XQueryReadDuration(made(XQueryMakeDuration(parts))), parts);
  EXPECT_EQ(*XQueryReadYearMonthDuration(XQueryMakeYearMonthDuration(months(-14))), months(-14));
  EXPECT_EQ(*XQueryReadDayTimeDuration(made(XQueryMakeDayTimeDuration(-90.25s))), -90.25s);
}

TEST(ValueReaders, OrderedDurationsHaveTheirParts) {
  const auto monthsOf = XQueryReadDuration(XQueryMakeYearMonthDuration(std::chrono::months(-14)));
  EXPECT_EQ(*monthsOf, (XQueryDurationParts{true, 1, 2, 0, 0, 0, 0}));
  const auto daysOf = XQueryReadDuration(made(XQueryMakeDayTimeDuration(49h + 61min + 1.5s)));
  EXPECT_EQ(*daysOf, (XQueryDurationParts{false, 0, 0, 2, 2, 1, 1.5}));
  const auto widest = std::chrono::months::max();
  EXPECT_EQ(refusal(XQueryReadDuration(XQueryMakeYearMonthDuration(widest))),
            "P768614336404564650Y7M is out of the range of 32 bits");
  const auto least = XQueryReadDuration(XQueryMakeYearMonthDuration(std::chrono::months::min()));
  EXPECT_FALSE(least);
}

TEST(ValueReaders, ItemsOfAnotherType) {
  const Value item = made(XQueryMakeString("1"));
  EXPECT_EQ(refusal(XQueryReadInteger(item)), "the item is xs:string, not an integer");
  EXPECT_EQ(refusal(XQueryReadUnsignedInteger(item)), "the item is xs:string, not an integer");
  EXPECT_EQ(refusal(XQueryReadDecimal(item)), "the item is xs:string, not a decimal");
  EXPECT_EQ(refusal(XQueryReadDouble(item)), "the item is xs:string, not a number");
  EXPECT_EQ(refusal(XQueryReadFloat(item)), "the item is xs:string, not a float");
  EXPECT_EQ(refusal(XQueryReadBoolean(item)), "the item is xs:string, not a boolean");
  EXPECT_EQ(refusal(XQueryReadAnyURI(item)), "the item is xs:string, not a URI");
  EXPECT_EQ(refusal(XQueryReadQName(item)), "the item is xs:string, not a QName");
  EXPECT_EQ(refusal(XQueryReadBinary(item)), "the item is xs:string, not a binary");
  EXPECT_EQ(refusal(XQueryReadDateTimeParts(item)), "the item is xs:string, not a date or time");
  EXPECT_EQ(refusal(XQueryReadDate(item)), "the item is xs:string, not a date");
  EXPECT_EQ(refusal(XQueryReadTime(item)), "the item is xs:string, not a time");
  EXPECT_EQ(refusal(XQueryReadDateTime(item)), "the item is xs:string, not a dateTime");
  EXPECT_EQ(refusal(XQueryReadDuration(item)), "the item is xs:string, not a duration");
  EXPECT_EQ(refusal(XQueryReadYearMonthDuration(item)),
            "the item is xs:string, not a yearMonthDuration");
  EXPECT_EQ(refusal(XQueryReadDayTimeDuration(item)),
            "the item is xs:string, not a dayTimeDuration");
  const auto read = XQueryReadString(NSXMLNode::textWithStringValue({}));
  EXPECT_EQ(refusal(read), "the item is text(), not a string");
  EXPECT_EQ(read.error()->category(), XQueryErrorCategory::Types);
  EXPECT_EQ(refusal(XQueryReadInteger(XQueryMakeBoolean(true))),
            "the item is xs:boolean, not an integer");
  EXPECT_EQ(refusal(XQueryReadDouble(made(XQueryMakeDayTimeDuration(1s)))),
            "the item is xdt:dayTimeDuration, not a number");
  EXPECT_EQ(refusal(XQueryReadString(XQueryError::error(6, "a"))),
            "the item is item(), not a string");
}

TEST(ValueReaders, OneItemOfAnyShapeIsAskedFor) {
  const Value one = XQueryMakeInteger(1);
  EXPECT_EQ(*XQueryReadInteger(sequence({one})), 1);
  EXPECT_EQ(refusal(XQueryReadInteger(sequence({one, one}))), "the sequence has 2 items, not one");
  EXPECT_EQ(refusal(XQueryReadInteger(NSArray::array())),
            "the sequence is empty, where one item is asked for");
  EXPECT_EQ(refusal(XQueryReadInteger(NSNull::null())),
            "the sequence is empty, where one item is asked for");
  EXPECT_EQ(refusal(XQueryReadBinary(sequence({NSNull::null()}))),
            "the sequence is empty, where one item is asked for");
  EXPECT_EQ(refusal(XQueryReadFloat(nullptr)), "there is no value");
  EXPECT_EQ(refusal(XQueryReadBinary(nullptr)), "there is no value");
}

TEST(ValueRanges, OfEachShape) {
  const Value one = XQueryMakeInteger(1);
  const Value two = XQueryMakeInteger(2);
  const auto listed = [](const XQueryItemRange& range) {
    std::string text;
    for (const Value& item : range) text += XQueryItemStringValue(*item) + " ";
    EXPECT_EQ(range.isEmpty(), text.empty());
    EXPECT_EQ(range.at(range.count()), nullptr);
    return text;
  };
  EXPECT_EQ(listed({}), "");
  EXPECT_EQ(listed(Value()), "");
  EXPECT_EQ(listed(Value(NSNull::null())), "");
  EXPECT_EQ(listed(NSArray::array()), "");
  EXPECT_EQ(listed(one), "1 ");
  EXPECT_EQ(listed(sequence({one})), "1 ");
  EXPECT_EQ(listed(NSArray::arrayWithObjects({one, two})), "1 2 ");
}

TEST(ValueRanges, KeepTheirItemsAndCanBeCopied) {
  XQueryItemRange range(XQueryMakeInteger(7));
  const XQueryItemRange copy = range;
  range = XQueryItemRange();
  EXPECT_EQ(range.count(), 0u);
  EXPECT_EQ(*XQueryReadInteger(copy.at(0)), 7);
  EXPECT_EQ(*XQueryReadInteger(*copy.begin()), 7);
  EXPECT_EQ(copy.end() - copy.begin(), 1);
}

// What the language makes of the same forms is the same value.
TEST(ValueReaders, ReadWhatAQueryAnswers) {
  const auto answer = [](const char* text) {
    const auto query = XQuery::xqueryWithSource(text);
    return Value(XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, {}));
  };
  EXPECT_EQ(*XQueryReadInteger(answer("6 * 7")), 42);
  EXPECT_EQ(*XQueryReadDecimal(answer("7.5 div 3")), "2.5");
  EXPECT_EQ(*XQueryReadFloat(answer("xs:float('0.1')")), 0.1F);
  EXPECT_EQ(*XQueryReadString(answer("concat('a', 'b')")), "ab");
  EXPECT_EQ(
      XQueryReadDateTimeParts(answer("xs:dateTime('2004-02-29T01:02:03.5-05:30')"))->nanosecond,
      500'000'000);
  EXPECT_EQ(*XQueryReadDateTime(answer("xs:dateTime('1970-01-01T01:00:00+01:00')")),
            std::chrono::sys_time<std::chrono::nanoseconds>());
  EXPECT_EQ(XQueryReadDuration(answer("xs:duration('-P1Y2M3DT4H')"))->hours, 4);
  EXPECT_EQ(XQueryReadQName(answer("QName('urn:a', 'b')"))->namespaceURI, "urn:a");
  EXPECT_EQ(*XQueryReadBinary(answer("xs:base64Binary('aGk=')")), "hi");
}

}  // namespace
}  // namespace xquery
