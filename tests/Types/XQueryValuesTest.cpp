#include "Types/XQueryBinary.h"
#include "Types/XQueryNotation.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryValues.h"
#include "TypesTestSupport.h"
#include "xquery/URL.h"

namespace xquery {
namespace {

using testing::decimal;
using testing::integer;
using testing::parse;
using testing::printed;
using testing::sequence;
using testing::text;
using testing::view;
using testing::xsString;

TEST(StringValue, OfEachAtomicClass) {
  const Ref<NSData> data = NSData::dataWithBytes("f\xFF");
  const std::pair<Value, const char*> rows[] = {
      {text("a"), "a"},
      {xsString("a"), "a"},
      {NSNumber::trueValue(), "true"},
      {NSNumber::falseValue(), "false"},
      {NSNumber::numberWithDouble(1.5), "1.5"},
      {integer(-12), "-12"},
      {decimal("1.50"), "1.5"},
      {XQueryNumber::posInf(), "INF"},
      {XQueryNumber::negInf(), "-INF"},
      {XQueryNumber::nan(), "NaN"},
      {XQueryNumber::yearMonthDurationWithMonths(14), "P1Y2M"},
      {XQueryNumber::dayTimeDurationWithSeconds(3600), "PT1H"},
      {NSURL::URLWithString(text("a/b?c#d")), "a/b?c#d"},
      {XQueryQName::qname(text("p:a"), text("u")), "p:a"},
      {XQueryNotation::notationWithString(text("p:a")), "p:a"},
      {XQueryHexBinary::binaryWithData(data), "66FF"},
      {XQueryBase64Binary::binaryWithData(data), "Zv8="},
  };
  for (const auto& [value, string] : rows) EXPECT_EQ(printed(value), string);
}

TEST(StringValue, ObjectsThatAreNoAtomicValuesHaveNone) {
  const Value others[] = {NSNull::null(), NSArray::array(), NSData::dataWithBytes("a"),
                          NSXMLNode::textWithStringValue(view("a")), XQueryError::error(1, "a")};
  for (const Value& value : others) EXPECT_FALSE(XQueryStringValue(*value));
}

TEST(Description, PrintsValuesSequencesAndMissingObjects) {
  const auto shown = [](const Value& value) { return XQueryDescription(value.get())->utf8(); };
  EXPECT_EQ(shown(nullptr), "(null)");
  EXPECT_EQ(shown(integer(5)), "5");
  EXPECT_EQ(shown(xsString("a b")), "a b");
  EXPECT_EQ(shown(sequence({integer(1), text("x")})), "(1, x)");
  EXPECT_EQ(shown(NSArray::array()), "()");
  EXPECT_EQ(shown(NSNull::null()), "()");
  EXPECT_EQ(shown(parse("<a>x<b>y</b></a>")), "xy");
  EXPECT_EQ(shown(XQueryQName::qname(text("p:a"), text("u"))), "p:a");
  EXPECT_EQ(shown(NSData::dataWithBytes("\x0A")), "0A");
}

TEST(Description, ArraysWithinArraysAreBounded) {
  Value nested = NSArray::array();
  for (int depth = 0; depth < 1000; ++depth) nested = sequence({nested});
  const std::string shown = XQueryDescription(nested.get())->utf8();
  EXPECT_EQ(shown, std::string(17, '(') + "..." + std::string(17, ')'));
}

TEST(ObjectsEqual, WithinAFamilyOfClassesByValue) {
  const std::pair<Value, Value> equal[] = {
      {text("a"), text("a")},
      {text("a"), xsString("a")},
      {integer(1), NSNumber::numberWithDouble(1)},
      {integer(1), decimal("1.0")},
      {NSNumber::trueValue(), integer(1)},
      {XQueryNumber::nan(), NSNumber::numberWithDouble(__builtin_nan(""))},
      {NSURL::URLWithString(text("a")), NSURL::URLWithString(text("a"))},
      {XQueryQName::qname(text("p:a"), text("u")), XQueryQName::qname(text("a"), text("u"))},
      {XQueryNotation::notationWithString(text("a")),
       XQueryNotation::notationWithString(text("a"))},
      {XQueryHexBinary::binaryWithString(view("0a")),
       XQueryHexBinary::binaryWithString(view("0A"))},
      {XQueryBase64Binary::binaryWithString(view("QQ==")),
       XQueryBase64Binary::binaryWithString(view("Q Q=="))},
      {NSData::dataWithBytes("a"), NSData::dataWithBytes("a")},
      {NSNull::null(), NSNull::null()},
  };
  for (const auto& [a, b] : equal) {
    EXPECT_TRUE(XQueryObjectsEqual(*a, *b)) << XQueryDescription(a.get())->utf8();
    EXPECT_TRUE(XQueryObjectsEqual(*b, *a)) << XQueryDescription(a.get())->utf8();
    EXPECT_EQ(XQueryObjectHash(*a), XQueryObjectHash(*b)) << XQueryDescription(a.get())->utf8();
  }
}

TEST(ObjectsEqual, DifferentValuesAndFamiliesDiffer) {
  const Ref<NSData> data = NSData::dataWithBytes("a");
  const std::pair<Value, Value> different[] = {
      {text("a"), text("b")},
      {text("1"), integer(1)},
      {text("a"), NSURL::URLWithString(text("a"))},
      {integer(1), integer(2)},
      {XQueryQName::qname(text("a"), text("u")), XQueryQName::qname(text("a"), text("v"))},
      {XQueryHexBinary::binaryWithData(data), XQueryBase64Binary::binaryWithData(data)},
      {NSXMLNode::textWithStringValue(view("a")), NSXMLNode::textWithStringValue(view("a"))},
      {NSNull::null(), text("")},
  };
  for (const auto& [a, b] : different) {
    EXPECT_FALSE(XQueryObjectsEqual(*a, *b)) << XQueryDescription(a.get())->utf8();
    EXPECT_FALSE(XQueryObjectsEqual(*b, *a)) << XQueryDescription(a.get())->utf8();
  }
}

TEST(ObjectsEqual, ANodeIsEqualToItself) {
  const Value node = NSXMLNode::textWithStringValue(view("a"));
  EXPECT_TRUE(XQueryObjectsEqual(*node, *node));
}

}  // namespace
}  // namespace xquery
