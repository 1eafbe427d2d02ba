#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "Types/XQueryBinary.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNotation.h"
#include "Types/XQueryQName.h"
#include "TypesTestSupport.h"
#include "xquery/URL.h"

#include <bit>
#include <cmath>
#include <functional>
#include <random>
#include <set>

namespace xquery {
namespace {

using testing::decimal;
using testing::integer;
using testing::printed;
using testing::raised;
using testing::sequence;
using testing::text;
using testing::utf8;
using testing::view;
using testing::xsString;

constexpr const char* mismatch = "6 value does not match a required type";
constexpr const char* notCastable = "6 invalid type conversion";

class Casting : public ::testing::Test {
 protected:
  Ref<XQueryContext> context = XQueryContext::xqueryContext();

  Value castAs(const Value& value, XQueryTypeID type) {
    return XQueryCastAs(value, type, *context);
  }
  // "type text" of the cast value, or the error.
  std::string outcome(const Value& value, XQueryTypeID type) {
    std::string result;
    const std::string error = raised(*context, [&] {
      const Value cast = castAs(value, type);
      const XQueryTypeID castType = XQueryObjectTypeID(cast.get());
      result =
          castType == XQueryTypeError ? "record" : std::to_string(castType) + " " + printed(cast);
    });
    if (error == mismatch) return "mismatch";
    return error == "no error" ? result : error;
  }
  Ref<XQueryNumber> typed(int64_t value, XQueryTypeID type) {
    return cast<XQueryNumber>(castAs(integer(value), type));
  }
};

struct StringRow {
  const char* from;
  XQueryTypeID to;
  const char* outcome;
};

const StringRow stringRows[] = {
    {" a", 8, "8  a"},
    {" a", 9, "9  a"},
    {" a ", 30, "30  a "},
    {"a\n", 30, "mismatch"},
    {"a b", 31, "31 a b"},
    {"a  b", 31, "mismatch"},
    {"en us", 32, "32 en us"},
    {" en", 32, "mismatch"},
    {"p:a", 33, "33 p:a"},
    {"1a", 33, "mismatch"},
    {"a", 34, "34 a"},
    {"p:a", 34, "mismatch"},
    {"a", 35, "35 a"},
    {"p:a", 35, "mismatch"},
    {"a", 36, "36 a"},
    {"", 36, "mismatch"},
    {"a", 38, "38 a"},
    {"a b", 38, "mismatch"},
    {"-1", 40, "40 -1"},
    {"a:b", 40, "mismatch"},
    {"a", 37, "mismatch"},
    {"a", 39, "mismatch"},
    {"a", 41, "mismatch"},
    {"true", 10, "10 true"},
    {"1", 10, "10 true"},
    {"false", 10, "10 false"},
    {"0", 10, "10 false"},
    {" true", 10, "mismatch"},
    {"TRUE", 10, "mismatch"},
    {"1.0", 10, "mismatch"},
    {"", 10, "mismatch"},
    {"NaN", 11, "11 NaN"},
    {"INF", 11, "11 INF"},
    {"-INF", 11, "11 -INF"},
    {"inf", 11, "mismatch"},
    {"nan", 11, "mismatch"},
    {" INF", 11, "mismatch"},
    {"12abc", 11, "11 12"},
    {" \n1.5e2", 11, "11 150"},
    {"-0.25", 11, "11 -0.25"},
    {"abc", 11, "mismatch"},
    {"", 11, "mismatch"},
    {"1e999", 11, "11 INF"},
    {"-1e999", 11, "11 -INF"},
    {"0.1", 12, "12 0.1"},
    {"NaN", 12, "11 NaN"},
    {"INF", 12, "11 INF"},
    {"-INF", 12, "11 -INF"},
    {"1e39", 12, "11 INF"},
    {"-1e39", 12, "11 -INF"},
    {"16777217", 12, "12 16777216"},
    {"x", 12, "mismatch"},
    {"1.50", 13, "13 1.5"},
    {"  -7", 13, "13 -7"},
    {"12abc", 13, "13 12"},
    {"INF", 13, "mismatch"},
    {"", 13, "mismatch"},
    {"123456789012345678901234567890.5", 13, "13 123456789012345678901234567890.5"},
    {"2.7", 42, "42 2"},
    {"-2.7", 42, "42 -2"},
    {"12", 42, "42 12"},
    {"123456789012345678901234567890", 42, "42 123456789012345678901234567890"},
    {"x", 42, "mismatch"},
    {"-1", 43, "mismatch"},
    {"0", 43, "43 0"},
    {"0", 44, "mismatch"},
    {"0.3", 44, "44 0"},
    {"1", 45, "mismatch"},
    {"0", 45, "45 0"},
    {"0", 46, "mismatch"},
    {"-3", 46, "46 -3"},
    {"9223372036854775807", 47, "47 9223372036854775807"},
    {"9223372036854777856", 47, "mismatch"},
    {"5000000000", 48, "48 5000000000"},
    {"32767.9", 49, "49 32767"},
    {"32768", 49, "mismatch"},
    {"-32768.5", 49, "49 -32768"},
    {"12.9", 50, "50 12"},
    {"128", 50, "mismatch"},
    {"-128.9", 50, "50 -128"},
    {"-129", 50, "mismatch"},
    {"18446744073709551615", 51, "51 18446744073709551615"},
    {"-1", 51, "mismatch"},
    {"5000000000", 52, "52 5000000000"},
    {"65536", 53, "mismatch"},
    {"255.5", 54, "54 255"},
    {"-0.5", 54, "54 0"},
    {"http://a/b?c#d", 14, "14 http://a/b?c#d"},
    {"", 14, "14 "},
    {"a b", 14, "mismatch"},
    {"P1Y2M", 28, "28 P1Y2M"},
    {"P1D", 28, "mismatch"},
    {"P1DT2H", 29, "29 P1DT2H"},
    {"P1Y", 29, "mismatch"},
    {"QUI=", 25, "25 QUI="},
    {"QUI", 25, "mismatch"},
    {"0f A0", 26, "26 0FA0"},
    {"0g", 26, "mismatch"},
    {"a", 3, "mismatch"},
    {"a", 4, "mismatch"},
    {"a", 6, "mismatch"},
    {"a", 7, "mismatch"},
    {"a", 0, "mismatch"},
    {"a", 2, "mismatch"},
    {"a", 55, "mismatch"},
    {"a", -1, "mismatch"},
};

TEST_F(Casting, FromUntypedValuesAndStringsByTargetType) {
  for (const StringRow& row : stringRows) {
    EXPECT_EQ(outcome(text(row.from), row.to), row.outcome) << row.from << " to " << row.to;
    EXPECT_EQ(outcome(xsString(row.from), row.to), row.outcome) << row.from << " to " << row.to;
  }
}

TEST_F(Casting, TheWordsForSpecialNumbersGiveTheSharedOnes) {
  for (const XQueryTypeID type : {11, 12}) {
    EXPECT_EQ(castAs(text("NaN"), type).get(), XQueryNumber::nan());
    EXPECT_EQ(castAs(text("INF"), type).get(), XQueryNumber::posInf());
    EXPECT_EQ(castAs(text("-INF"), type).get(), XQueryNumber::negInf());
    EXPECT_EQ(XQueryNumber::posInf()->typeID(), 11);
  }
}

TEST_F(Casting, BooleansAreTheSharedTruthValues) {
  EXPECT_EQ(castAs(text("1"), 10).get(), NSNumber::trueValue());
  EXPECT_EQ(castAs(xsString("false"), 10).get(), NSNumber::falseValue());
}

TEST_F(Casting, ToItsOwnTypeAValueIsItself) {
  const Ref<NSData> data = NSData::dataWithBytes("a");
  const Value values[] = {text("a"),
                          xsString("a"),
                          XQueryString::tokenWithString(*text("a")),
                          NSNumber::trueValue(),
                          NSNumber::numberWithDouble(1.5),
                          integer(1),
                          decimal("1.5"),
                          XQueryNumber::posInf(),
                          XQueryNumber::yearMonthDurationWithMonths(1),
                          XQueryNumber::dayTimeDurationWithSeconds(1),
                          NSURL::URLWithString(text("a")),
                          XQueryQName::qname(text("p:a"), text("u")),
                          XQueryBase64Binary::binaryWithData(data),
                          XQueryHexBinary::binaryWithData(data)};
  for (const Value& value : values) {
    EXPECT_EQ(castAs(value, XQueryObjectTypeID(value.get())), value) << printed(value);
  }
}

TEST_F(Casting, ANotationCastToNotationIsANewOneOfTheSameText) {
  const Value notation = XQueryNotation::notationWithString(text("p:a"));
  const Value copy = castAs(notation, 27);
  EXPECT_NE(copy, notation);
  EXPECT_TRUE(XQueryObjectsEqual(*copy, *notation));
}

TEST_F(Casting, OnlyAPlainXSStringCastsToNotation) {
  EXPECT_EQ(outcome(xsString("a"), 27), "27 a");
  EXPECT_EQ(outcome(xsString("p:"), 27), "mismatch");
  EXPECT_EQ(outcome(text("a"), 27), "mismatch");
  EXPECT_EQ(outcome(XQueryString::tokenWithString(*text("a")), 27), "mismatch");
}

class CastingToQName : public Casting {
 protected:
  void SetUp() override {
    prolog->addPrefix(text("p"), text("urn:p"));
    _internal(*context).setActiveProlog(prolog.get());
  }
  void TearDown() override { _internal(*context).setActiveProlog(nullptr); }
  std::string qName(const char* name) {
    const Value value = castAs(text(name), 15);
    return utf8(cast<XQueryQName>(value)->description());
  }
  Ref<XQueryProlog> prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
};

TEST_F(CastingToQName, APrefixIsLookedUpInTheActiveProlog) {
  EXPECT_EQ(qName("p:a"), "<XQueryQName namespace:urn:p prefix:p localpart:a>");
  EXPECT_EQ(qName("p:a:b"), "<XQueryQName namespace:urn:p prefix:p localpart:a:b>");
  EXPECT_EQ(outcome(text("q:a"), 15), "mismatch");
}

TEST_F(CastingToQName, WithoutAPrefixTheDefaultElementNamespaceHolds) {
  EXPECT_EQ(qName("a"), "<XQueryQName namespace:(null) prefix: localpart:a>");
  EXPECT_EQ(qName(":a"), "<XQueryQName namespace:(null) prefix: localpart::a>");
  prolog->setDefaultElementNamespace(text("urn:d"));
  EXPECT_EQ(qName("a"), "<XQueryQName namespace:urn:d prefix: localpart:a>");
}

struct NumberRow {
  const char* from;  // a decimal, or a double when it holds an "e", or a special value
  XQueryTypeID to;
  const char* outcome;
};

const NumberRow numberRows[] = {
    {"1.5", 8, "8 1.5"},         {"1.5", 9, "9 1.5"},         {"1.5", 31, "31 1.5"},
    {"1.5", 40, "40 1.5"},       {"1.5", 34, "mismatch"},     {"1e17", 9, "9 1e+17"},
    {"1e0", 9, "9 1"},           {"INF", 9, "9 INF"},         {"-INF", 8, "8 -INF"},
    {"NaN", 34, "34 NaN"},       {"1.5", 10, "10 true"},      {"0.0", 10, "10 false"},
    {"-1", 10, "10 true"},       {"0e0", 10, "10 false"},     {"NaN", 10, "10 false"},
    {"INF", 10, "10 true"},      {"1.5", 11, "11 1.5"},       {"1.5", 12, "12 1.5"},
    {"0.1", 11, "11 0.1"},       {"1e-1", 12, "12 0.1"},      {"1e39", 12, "11 INF"},
    {"INF", 12, "11 INF"},       {"NaN", 12, "11 NaN"},       {"2.7", 13, "13 2.7"},
    {"27e-1", 13, "13 2.7"},     {"INF", 13, "mismatch"},     {"NaN", 13, "mismatch"},
    {"-INF", 42, "mismatch"},    {"2.7", 42, "42 2"},         {"-27e-1", 42, "42 -2"},
    {"-1", 43, "mismatch"},      {"0.3", 44, "44 0"},         {"0", 44, "mismatch"},
    {"0", 45, "45 0"},           {"0.5", 45, "mismatch"},     {"-0.5", 46, "46 0"},
    {"0", 46, "mismatch"},       {"1", 47, "47 1"},           {"1e19", 47, "mismatch"},
    {"1", 48, "48 1"},           {"32767.9", 49, "49 32767"}, {"-32768.5", 49, "49 -32768"},
    {"12.9", 50, "50 12"},       {"-128.9", 50, "50 -128"},   {"128", 50, "mismatch"},
    {"-1289e-1", 50, "50 -128"}, {"-129", 50, "mismatch"},    {"1", 51, "51 1"},
    {"-0.9", 51, "51 0"},        {"-1", 52, "mismatch"},      {"65535.9", 53, "53 65535"},
    {"256", 54, "mismatch"},     {"1", 14, "mismatch"},       {"1", 15, "mismatch"},
    {"1", 21, "mismatch"},       {"1", 24, "mismatch"},       {"1", 28, "mismatch"},
    {"1", 25, "mismatch"},       {"1", 26, "mismatch"},       {"1", 27, "mismatch"},
    {"1", 37, "mismatch"},       {"1", 7, "mismatch"},        {"1", 0, "mismatch"},
};

TEST_F(Casting, FromNumbersByTargetType) {
  for (const NumberRow& row : numberRows) {
    const std::string_view from = row.from;
    const bool isDouble = from.find_first_of("eIN") != std::string_view::npos;
    const Value value = isDouble ? castAs(text(from), 11) : Value(decimal(from));
    EXPECT_EQ(outcome(value, row.to), row.outcome) << row.from << " to " << row.to;
  }
}

TEST_F(Casting, ADecimalIsNoInfinityHoweverLargeItIs) {
  const std::string digits = "1" + std::string(400, '0');
  for (const XQueryTypeID type : {13, 42, 43, 44}) {
    EXPECT_EQ(outcome(decimal(digits), type), std::to_string(type) + " " + digits);
    EXPECT_EQ(outcome(text(digits), type), std::to_string(type) + " " + digits);
  }
  EXPECT_EQ(outcome(decimal("-" + digits), 46), "46 -" + digits);
  EXPECT_EQ(outcome(decimal(digits), 51), "mismatch");
  EXPECT_EQ(outcome(decimal(digits), 11), "11 INF");
}

TEST_F(Casting, TextOfTooManyDigitsIsNoDecimal) {
  const std::string digits(1000000, '1');
  EXPECT_EQ(outcome(text(digits), 13), "mismatch");
  EXPECT_EQ(outcome(text(digits), 42), "mismatch");
  EXPECT_EQ(outcome(text(digits), 11), "11 INF");
  EXPECT_EQ(outcome(text("1e-999999999999999999999"), 13), "mismatch");
}

TEST_F(Casting, PlainPlatformNumbersCastAsDoubles) {
  EXPECT_EQ(outcome(NSNumber::numberWithLongLong(5), 42), "42 5");
  EXPECT_EQ(outcome(NSNumber::numberWithLongLong(5), 12), "12 5");
  EXPECT_EQ(outcome(NSNumber::numberWithDouble(INFINITY), 12), "11 INF");
  EXPECT_EQ(outcome(NSNumber::numberWithDouble(NAN), 42), "mismatch");
  EXPECT_EQ(outcome(NSNumber::numberWithDouble(NAN), 10), "10 false");
}

TEST_F(Casting, AnIntegerOfALaterTypeIsTakenOverWithoutACheck) {
  const Value large = typed(200, 54);
  EXPECT_EQ(castAs(large, 50).get() ? printed(castAs(large, 50)) : "", "200");
  EXPECT_EQ(outcome(typed(200, 53), 54), "54 200");
  EXPECT_EQ(outcome(typed(300, 53), 54), "mismatch");
}

TEST_F(Casting, AFloatBecomesADoubleByItsText) {
  EXPECT_EQ(outcome(castAs(text("0.1"), 12), 11), "11 0.1");
}

struct BooleanRow {
  XQueryTypeID to;
  const char* ofTrue;
  const char* ofFalse;
};

const BooleanRow booleanRows[] = {
    {8, "8 true", "8 false"},     {9, "9 true", "9 false"},     {34, "34 true", "34 false"},
    {10, "10 true", "10 false"},  {11, "11 1", "11 0"},         {12, "12 1", "12 0"},
    {13, "13 1", "13 0"},         {42, "42 1", "42 0"},         {44, "44 1", "mismatch"},
    {46, "mismatch", "mismatch"}, {50, "50 1", "50 0"},         {54, "54 1", "54 0"},
    {14, "mismatch", "mismatch"}, {24, "mismatch", "mismatch"}, {26, "mismatch", "mismatch"},
};

TEST_F(Casting, FromBooleansByTargetType) {
  for (const BooleanRow& row : booleanRows) {
    EXPECT_EQ(outcome(NSNumber::trueValue(), row.to), row.ofTrue) << row.to;
    EXPECT_EQ(outcome(NSNumber::falseValue(), row.to), row.ofFalse) << row.to;
  }
  EXPECT_EQ(castAs(NSNumber::trueValue(), 11).get(), XQueryNumber::one());
  EXPECT_EQ(castAs(NSNumber::falseValue(), 11).get(), XQueryNumber::zero());
}

TEST_F(Casting, OrderedDurationsCastToTextOnly) {
  const Value months = XQueryNumber::yearMonthDurationWithMonths(14);
  const Value seconds = XQueryNumber::dayTimeDurationWithSeconds(3600);
  EXPECT_EQ(outcome(months, 8), "8 P1Y2M");
  EXPECT_EQ(outcome(months, 9), "9 P1Y2M");
  EXPECT_EQ(outcome(months, 34), "34 P1Y2M");
  EXPECT_EQ(outcome(months, 29), "mismatch");
  EXPECT_EQ(outcome(seconds, 28), "mismatch");
  EXPECT_EQ(outcome(seconds, 9), "9 PT1H");
  for (const XQueryTypeID type : {10, 11, 12, 13, 14, 42, 50, 21, 26}) {
    EXPECT_EQ(outcome(months, type), "mismatch") << type;
    EXPECT_EQ(outcome(seconds, type), "mismatch") << type;
  }
}

// The targets other than those listed all fail.
void expectTargets(const std::function<std::string(XQueryTypeID)>& outcomeOf,
                   const std::set<XQueryTypeID>& allowed, const std::string& failure) {
  for (XQueryTypeID type = 0; type < 60; ++type) {
    const std::string outcome = outcomeOf(type);
    if (allowed.contains(type)) {
      EXPECT_EQ(outcome.substr(0, outcome.find(' ')), std::to_string(type)) << outcome;
    } else {
      EXPECT_EQ(outcome, failure) << type;
    }
  }
}

constexpr const char* nameText = "YWFh";  // a name, and whole Base64 groups

TEST_F(Casting, AQNameCastsToStringUntypedAndItself) {
  const Value name = XQueryQName::qname(text("a"), text("u"));
  expectTargets([&](XQueryTypeID type) { return outcome(name, type); }, {8, 9, 15}, "mismatch");
  EXPECT_EQ(outcome(XQueryQName::qname(text("p:a"), text("u")), 9), "9 p:a");
}

TEST_F(Casting, ANotationCastsToStringUntypedAndItself) {
  const Value notation = XQueryNotation::notationWithString(text("a"));
  expectTargets([&](XQueryTypeID type) { return outcome(notation, type); }, {8, 9, 27}, "mismatch");
}

TEST_F(Casting, TheBinariesCastToEachOtherAndToText) {
  const std::set<XQueryTypeID> targets = {8, 9, 25, 26, 30, 31, 32, 33, 34, 35, 36, 38, 40};
  const Value base64 = XQueryBase64Binary::binaryWithString(view(nameText));
  const Value hex = XQueryHexBinary::binaryWithString(view("AA"));
  expectTargets([&](XQueryTypeID type) { return outcome(base64, type); }, targets, "mismatch");
  expectTargets([&](XQueryTypeID type) { return outcome(hex, type); }, targets, "mismatch");
  EXPECT_EQ(outcome(base64, 26), "26 616161");
  EXPECT_EQ(outcome(hex, 25), "25 qg==");
  EXPECT_EQ(outcome(hex, 34), "34 AA");
  EXPECT_EQ(outcome(XQueryHexBinary::binaryWithString(view("00")), 34), "mismatch");
}

TEST_F(Casting, AURICastsToTextAndAnswersItsErrorUnraised) {
  const Value URI = NSURL::URLWithString(text(nameText));
  const std::set<XQueryTypeID> targets = {8, 9, 14, 30, 31, 32, 33, 34, 35, 36, 38, 40};
  expectTargets([&](XQueryTypeID type) { return outcome(URI, type); }, targets, "record");
  const Value record = castAs(URI, 11);
  EXPECT_EQ(cast<XQueryError>(record)->err(), 6);
  EXPECT_EQ(utf8(cast<XQueryError>(record)->msg()), "value does not match a required type");
}

TEST_F(Casting, AURIThatIsNoNameRaisesAsItsStringDoes) {
  EXPECT_EQ(outcome(NSURL::URLWithString(text("http://a/")), 34), "mismatch");
}

TEST_F(Casting, TheUntypedFormOfATypedNameIsUntyped) {
  EXPECT_EQ(outcome(XQueryQName::qnameWithLocalPart(xsString("a"), nullptr), 8), "8 a");
  EXPECT_EQ(outcome(castAs(xsString("a"), 14), 8), "8 a");
}

TEST_F(Casting, ObjectsWithoutATypeCannotBeCast) {
  const Value others[] = {nullptr,
                          NSNull::null(),
                          NSData::dataWithBytes("a"),
                          NSXMLNode::textWithStringValue(view("1")),
                          sequence({integer(1), integer(2)}),
                          XQueryError::error(1, "a")};
  for (const Value& value : others) EXPECT_EQ(outcome(value, 9), notCastable);
}

class CastObject : public Casting {
 protected:
  std::string error(const Value& value, bool allowEmpty) {
    return raised(*context, [&] { (void)XQueryCastObject(value, 42, *context, allowEmpty); });
  }
};

TEST_F(CastObject, TheEmptySequencePassesOnlyWhereItIsAllowed) {
  for (const Value& empty : {Value(NSNull::null()), Value(NSArray::array())}) {
    EXPECT_EQ(XQueryCastObject(empty, 42, *context, true).get(), NSNull::null());
    EXPECT_EQ(error(empty, false), "6 invalid type for automization");
  }
  EXPECT_EQ(
      raised(*context, [&] { (void)XQueryCastAsTypeForContext(NSNull::null(), 42, *context); }),
      "6 invalid type for automization");
}

TEST_F(CastObject, NodesAndSequencesOfOneAreAtomizedFirst) {
  const Value node = NSXMLNode::textWithStringValue(view("12"));
  for (const Value& value : {node, sequence({node}), sequence({text("12")})}) {
    EXPECT_EQ(printed(XQueryCastObject(value, 42, *context, true)), "12");
    EXPECT_EQ(printed(XQueryCastAsTypeForContext(value, 42, *context)), "12");
  }
}

TEST_F(CastObject, SeveralItemsCannotBeCast) {
  const Value items = sequence({integer(1), integer(2)});
  EXPECT_EQ(error(items, true), notCastable);
  EXPECT_EQ(error(items, false), "6 invalid type for automization");
}

TEST_F(CastObject, AnObjectWithoutATypeIsRefusedByAtomization) {
  EXPECT_EQ(error(NSData::dataWithBytes("a"), true), "6 invalid type");
}

// Converting a number to double and float takes short cuts around printing and reading it.
TEST_F(Casting, TheShortCutsToDoubleGiveWhatPrintingAndReadingGives) {
  std::mt19937_64 random(7);
  for (int round = 0; round < 20000; ++round) {
    const uint64_t bits = random();
    const double value = std::bit_cast<double>(bits);
    const Value numbers[] = {
        XQueryNumber::numberWithDouble(value),
        integer(static_cast<int64_t>(bits >> (round % 60))),
        XQueryNumber::unsignedLongWithNumber(*NSNumber::numberWithUnsignedLongLong(bits)),
        typed(static_cast<int64_t>(bits) >> (round % 60), 47),
    };
    for (const Value& number : numbers) {
      const Ref<NSString> string = XQueryStringValue(*number);
      for (const XQueryTypeID type : {11, 12}) {
        const Value direct = castAs(number, type);
        const Value read = castAs(string, type);
        ASSERT_EQ(XQueryObjectTypeID(direct.get()), XQueryObjectTypeID(read.get()))
            << string->utf8();
        ASSERT_EQ(printed(direct), printed(read)) << string->utf8();
      }
    }
  }
}

TEST_F(Casting, TheShortCutToIntegerGivesWhatTheDecimalGives) {
  for (const char* digits : {"0", "-0", "7", "-7", "7.0", "7.9", "-7.9", "1e3", "15e-1",
                             "9223372036854775807", "9223372036854775808", "-1e30"}) {
    const Value direct = castAs(text(digits), 42);
    const Value stepwise = castAs(castAs(text(digits), 13), 42);
    EXPECT_EQ(XQueryObjectTypeID(direct.get()), 42) << digits;
    EXPECT_EQ(printed(direct), printed(stepwise)) << digits;
    EXPECT_TRUE(XQueryObjectsEqual(*direct, *stepwise)) << digits;
  }
}

}  // namespace
}  // namespace xquery
