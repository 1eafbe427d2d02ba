// The promotions of XQueryTypeTable.h.
#include "Types/XQueryQName.h"
#include "Types/XQueryTypeTable.h"
#include "TypesTestSupport.h"
#include "xquery/URL.h"

namespace xquery {
namespace {

using testing::decimal;
using testing::integer;
using testing::printed;
using testing::raised;
using testing::sequence;
using testing::text;
using testing::view;
using testing::xsString;

class Promotion : public ::testing::Test {
 protected:
  Ref<XQueryContext> context = XQueryContext::xqueryContext();

  using Promote = Value (*)(const Value&, XQueryContext&);
  std::string error(Promote promote, const Value& value) {
    return raised(*context, [&] { (void)promote(value, *context); });
  }
  void expect(Promote promote, const Value& value, XQueryTypeID type, const char* string) {
    const Value result = promote(value, *context);
    EXPECT_EQ(XQueryObjectTypeID(result.get()), type) << string;
    EXPECT_EQ(printed(result), string);
  }
  void expectUnchanged(Promote promote, const Value& value) {
    EXPECT_EQ(promote(value, *context), value);
  }
};

TEST_F(Promotion, StringsAndTheirDerivedTypesStayAsTheyAre) {
  expectUnchanged(XQueryPromoteToString, xsString("a"));
  expectUnchanged(XQueryPromoteToString, XQueryString::normalizedStringWithString(*text("a")));
  expectUnchanged(XQueryPromoteToString, XQueryString::tokenWithString(*text("a")));
  expectUnchanged(XQueryPromoteToString, XQueryString::languageWithString(*text("a")));
  expectUnchanged(XQueryPromoteToString, XQueryString::nameWithString(*text("a")));
  expectUnchanged(XQueryPromoteToString, XQueryString::ncNameWithString(*text("a")));
  expectUnchanged(XQueryPromoteToString, XQueryString::idWithString(*text("a")));
  expectUnchanged(XQueryPromoteToString, XQueryString::idRefWithString(*text("a")));
  expectUnchanged(XQueryPromoteToString, XQueryString::entityWithString(*text("a")));
  expectUnchanged(XQueryPromoteToString, XQueryString::nmTokenWithString(*text("a")));
}

TEST_F(Promotion, UntypedValuesURIsAndNodesBecomeStrings) {
  expect(XQueryPromoteToString, text("a"), 9, "a");
  expect(XQueryPromoteToString, NSURL::URLWithString(text("http://a/")), 9, "http://a/");
  expect(XQueryPromoteToString, NSXMLNode::textWithStringValue(view("t")), 9, "t");
  expect(XQueryPromoteToString, sequence({text("a")}), 9, "a");
}

TEST_F(Promotion, TheEmptySequenceIsTheEmptyString) {
  expect(XQueryPromoteToString, NSNull::null(), 9, "");
  expect(XQueryPromoteToString, NSArray::array(), 9, "");
}

TEST_F(Promotion, OtherValuesAreNoStrings) {
  EXPECT_EQ(error(XQueryPromoteToString, integer(5)), "6 not a string type - 5");
  EXPECT_EQ(error(XQueryPromoteToString, NSNumber::trueValue()), "6 not a string type - true");
  EXPECT_EQ(error(XQueryPromoteToString, XQueryQName::qname(text("p:a"), text("u"))),
            "6 not a string type - p:a");
  EXPECT_EQ(error(XQueryPromoteToString, sequence({integer(1), integer(2)})),
            "6 not a string type - (1, 2)");
  EXPECT_EQ(error(XQueryPromoteToString, NSData::dataWithBytes("a")), "6 invalid type");
}

TEST_F(Promotion, NumbersAndTheEmptySequenceStayAsTheyAre) {
  for (const auto promote : {XQueryPromoteToNumeric, XQueryPromoteToInteger}) {
    expectUnchanged(promote, integer(1));
    expectUnchanged(promote, XQueryNumber::byteWithNumber(*integer(1)));
    expectUnchanged(promote, NSNull::null());
  }
  expectUnchanged(XQueryPromoteToNumeric, decimal("1.5"));
  expectUnchanged(XQueryPromoteToNumeric, XQueryNumber::numberWithDouble(1.5));
  expectUnchanged(XQueryPromoteToNumeric, NSNumber::numberWithDouble(1.5));
  expectUnchanged(XQueryPromoteToNumeric,
                  XQueryNumber::floatWithNumber(*NSNumber::numberWithFloat(1.5F)));
}

TEST_F(Promotion, UntypedValuesBecomeDoubles) {
  expect(XQueryPromoteToNumeric, text("1.5"), 11, "1.5");
  expect(XQueryPromoteToNumeric, NSXMLNode::textWithStringValue(view("3")), 11, "3");
  EXPECT_EQ(error(XQueryPromoteToNumeric, text("x")), "6 value does not match a required type");
}

TEST_F(Promotion, OtherValuesAreNoNumbers) {
  EXPECT_EQ(error(XQueryPromoteToNumeric, xsString("5")), "6 not a numeric type - 5");
  EXPECT_EQ(error(XQueryPromoteToNumeric, NSNumber::falseValue()), "6 not a numeric type - false");
  EXPECT_EQ(error(XQueryPromoteToNumeric, XQueryNumber::yearMonthDurationWithMonths(14)),
            "6 not a numeric type - P1Y2M");
  EXPECT_EQ(error(XQueryPromoteToNumeric, sequence({integer(1), integer(2)})),
            "6 not a numeric type - (1, 2)");
}

TEST_F(Promotion, UntypedDoubleFloatAndDecimalAreTruncatedToIntegers) {
  expect(XQueryPromoteToInteger, decimal("2.7"), 42, "2");
  expect(XQueryPromoteToInteger, decimal("-2.7"), 42, "-2");
  expect(XQueryPromoteToInteger, XQueryNumber::numberWithDouble(2.7), 42, "2");
  expect(XQueryPromoteToInteger, XQueryNumber::floatWithNumber(*NSNumber::numberWithFloat(2.5F)),
         42, "2");
  expect(XQueryPromoteToInteger, text("7"), 42, "7");
  expect(XQueryPromoteToInteger, text("7.9"), 42, "7");
}

TEST_F(Promotion, OtherValuesAreNoIntegers) {
  EXPECT_EQ(error(XQueryPromoteToInteger, xsString("5")), "6 not a integer type - 5");
  EXPECT_EQ(error(XQueryPromoteToInteger, NSNumber::trueValue()), "6 not a integer type - true");
  EXPECT_EQ(error(XQueryPromoteToInteger, sequence({integer(1), text("a")})),
            "6 not a integer type - (1, a)");
  EXPECT_EQ(error(XQueryPromoteToInteger, XQueryNumber::nan()),
            "6 value does not match a required type");
}

}  // namespace
}  // namespace xquery
