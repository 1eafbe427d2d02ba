#include "Types/XQueryAtomization.h"
#include "TypesTestSupport.h"
#include "xquery/URL.h"

namespace xquery {
namespace {

using testing::decimal;
using testing::integer;
using testing::parse;
using testing::printed;
using testing::raised;
using testing::sequence;
using testing::text;
using testing::view;
using testing::xsString;

class Atomization : public ::testing::Test {
 protected:
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  Value node(std::string_view string) { return NSXMLNode::textWithStringValue(view(string)); }
  Value atomized(const Value& value, int code) {
    return XQueryAtomizationCheckingOccurrence(value, code, *context);
  }
  std::string error(const Value& value, int code) {
    return raised(*context, [&] { (void)atomized(value, code); });
  }
};

constexpr const char* wrongCount = "6 invalid type for automization";

TEST_F(Atomization, AnAtomicItemIsItsOwnTypedValue) {
  for (const Value& value : {Value(text("a")), Value(integer(1)), Value(NSNumber::trueValue())}) {
    EXPECT_EQ(XQueryTypedValue(value, *context), value);
    EXPECT_EQ(XQueryAtomization(value, *context), value);
  }
}

TEST_F(Atomization, ANodesTypedValueIsItsTextUntyped) {
  const Ref<NSXMLDocument> document = parse("<a>x<b>y</b></a>");
  const Value value = XQueryTypedValue(document, *context);
  EXPECT_EQ(XQueryObjectTypeID(value.get()), 8);
  EXPECT_EQ(printed(value), "xy");
}

TEST_F(Atomization, AnythingElseHasNoTypedValue) {
  const Value others[] = {nullptr, NSNull::null(), NSArray::array(), NSData::dataWithBytes("a"),
                          XQueryError::error(3, "a")};
  for (const Value& value : others) {
    EXPECT_EQ(raised(*context, [&] { (void)XQueryTypedValue(value, *context); }), "6 invalid type");
  }
}

TEST_F(Atomization, TheEmptySequenceNeedsACodeThatAllowsIt) {
  for (const Value& empty : {Value(NSNull::null()), Value(NSArray::array())}) {
    EXPECT_EQ(atomized(empty, 0).get(), NSNull::null());
    EXPECT_EQ(atomized(empty, 1).get(), NSNull::null());
    EXPECT_EQ(error(empty, 2), wrongCount);
    EXPECT_EQ(error(empty, 3), wrongCount);
    EXPECT_EQ(error(empty, 7), wrongCount);
  }
}

TEST_F(Atomization, ASequenceOfOneIsItsItem) {
  const Value item = integer(1);
  for (const int code : {0, 1, 2, 3}) {
    EXPECT_EQ(atomized(item, code), item);
    EXPECT_EQ(atomized(sequence({item}), code), item);
    EXPECT_EQ(printed(atomized(sequence({node("t")}), code)), "t");
  }
  EXPECT_EQ(error(sequence({NSNull::null()}), 0), "6 invalid type");
}

TEST_F(Atomization, TwoItemsFailOnlyWhereExactlyOneIsDemanded) {
  const Value items = sequence({integer(1), integer(2)});
  EXPECT_EQ(error(items, 2), wrongCount);
  EXPECT_EQ(error(sequence({node("a"), NSNull::null()}), 2), wrongCount);
  for (const int code : {0, 1, 3}) EXPECT_EQ(atomized(items, code), items);
}

TEST_F(Atomization, ASequenceWithNodesBecomesANewOneOfTypedValues) {
  const Value items = sequence({integer(1), node("t"), NSNull::null(), text("u")});
  const Value values = atomized(items, 1);
  EXPECT_NE(values, items);
  ASSERT_TRUE(isa<NSArray>(values));
  EXPECT_EQ(XQueryDescription(values.get())->utf8(), "(1, t, u)");
  EXPECT_EQ(XQueryObjectTypeID(cast<NSArray>(values)->objectAtIndex(1)), 8);
}

TEST_F(Atomization, NullsAloneAtomizeToTheEmptySequence) {
  EXPECT_EQ(atomized(sequence({NSNull::null(), NSNull::null()}), 0).get(), NSNull::null());
}

TEST_F(Atomization, AnItemWithoutATypedValueFailsWithinASequence) {
  EXPECT_EQ(error(sequence({integer(1), NSData::dataWithBytes("a")}), 0), "6 invalid type");
}

class EffectiveBooleanValue : public Atomization {
 protected:
  Value ebv(const Value& value) { return XQueryEffectiveBooleanValue(value, *context); }
};

TEST_F(EffectiveBooleanValue, FalseForEmptyZeroNaNAndFalse) {
  const Value falses[] = {NSNull::null(),
                          NSArray::array(),
                          NSNumber::falseValue(),
                          text(""),
                          xsString(""),
                          integer(0),
                          decimal("0.0"),
                          XQueryNumber::zero(),
                          XQueryNumber::nan(),
                          NSNumber::numberWithDouble(-0.0),
                          NSNumber::numberWithLongLong(0),
                          XQueryNumber::byteWithNumber(*integer(0)),
                          XQueryNumber::floatWithNumber(*NSNumber::numberWithFloat(0)),
                          XQueryNumber::yearMonthDurationWithMonths(0),
                          XQueryNumber::dayTimeDurationWithSeconds(0),
                          sequence({integer(0)}),
                          sequence({text("")})};
  for (const Value& value : falses) {
    EXPECT_EQ(ebv(value).get(), NSNumber::falseValue()) << XQueryDescription(value.get())->utf8();
  }
}

TEST_F(EffectiveBooleanValue, ADoubleMadeOfABooleanCountsAsItsNumber) {
  EXPECT_FALSE(XQueryIsTrue(ebv(XQueryNumber::doubleWithNumber(*NSNumber::falseValue()))));
  EXPECT_TRUE(XQueryIsTrue(ebv(XQueryNumber::doubleWithNumber(*NSNumber::trueValue()))));
}

TEST_F(EffectiveBooleanValue, TrueForEverythingElse) {
  const Value trues[] = {NSNumber::trueValue(),
                         text("0"),
                         text("false"),
                         xsString(" "),
                         integer(-1),
                         decimal("0.0000000000000000000000000000001"),
                         XQueryNumber::posInf(),
                         XQueryNumber::longWithNumber(*integer(-5)),
                         XQueryNumber::yearMonthDurationWithMonths(1),
                         NSURL::URLWithString(text("")),
                         node(""),
                         parse("<a/>"),
                         NSData::dataWithBytes(""),
                         sequence({integer(1), integer(2)}),
                         sequence({integer(0), integer(0)}),
                         sequence({node("")})};
  for (const Value& value : trues) {
    EXPECT_EQ(ebv(value).get(), NSNumber::trueValue()) << XQueryDescription(value.get())->utf8();
  }
}

TEST_F(EffectiveBooleanValue, AnErrorRecordIsAnsweredUnchanged) {
  const Value error = XQueryError::error(3, "a");
  EXPECT_EQ(ebv(error), error);
  EXPECT_EQ(ebv(sequence({error})), error);
  EXPECT_TRUE(XQueryIsTrue(ebv(sequence({error, error}))));
}

}  // namespace
}  // namespace xquery
