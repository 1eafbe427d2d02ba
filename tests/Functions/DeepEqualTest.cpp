#include "Functions/DeepEqual.h"
#include "Functions/FunctionsTesting.h"
#include "xquery/Data.h"

namespace xquery {
namespace {

using namespace functiontest;

std::string equal(const Value& a, const Value& b) {
  const std::string there = call(fn_deep_equal, {a, b});
  EXPECT_EQ(there, call(fn_deep_equal, {b, a})) << show(a) << " and " << show(b);
  return there;
}

TEST(DeepEqual, TwoEmptySequencesAreEqual) {
  EXPECT_EQ(equal(empty(), empty()), "true");
  EXPECT_EQ(equal(empty(), integer(1)), "false");
  EXPECT_EQ(equal(empty(), elementFrom("<a/>")), "false");
  EXPECT_EQ(equal(empty(), sequence({integer(1), integer(2)})), "false");
}

TEST(DeepEqual, SequencesAreComparedPairByPair) {
  const auto list = [](int64_t a, int64_t b) { return sequence({integer(a), integer(b)}); };
  EXPECT_EQ(equal(list(1, 2), list(1, 2)), "true");
  EXPECT_EQ(equal(list(1, 2), list(2, 1)), "false");
  EXPECT_EQ(equal(list(1, 2), sequence({integer(1), integer(2), integer(3)})), "false");
  EXPECT_EQ(equal(list(1, 1), integer(1)), "false");
}

TEST(DeepEqual, TwoArraysOfNothingAreNotEqual) {
  EXPECT_EQ(equal(sequence({}), sequence({})), "false");
}

// As a host may hand them in.
TEST(DeepEqual, EmptyPlacesOfArraysAreLikeEmptySequences) {
  const auto list = [](Value last) { return sequence({integer(1), std::move(last)}); };
  EXPECT_EQ(equal(list(Value()), list(Value())), "true");
  EXPECT_EQ(equal(list(Value()), list(empty())), "true");
  EXPECT_EQ(equal(list(Value()), list(integer(2))), "false");
  EXPECT_EQ(equal(list(Value()), list(elementFrom("<a/>"))), "false");
  EXPECT_EQ(equal(list(Value()), list(sequence({Value(), Value()}))), "false");
}

TEST(DeepEqual, NestedArraysAreComparedMemberByMember) {
  const auto nested = [](int64_t last) {
    return sequence({integer(1), sequence({integer(2), integer(last)})});
  };
  EXPECT_EQ(equal(nested(3), nested(3)), "true");
  EXPECT_EQ(equal(nested(3), nested(4)), "false");
  Value deep = integer(1);
  Value other = integer(1);
  for (int depth = 0; depth < 200000; ++depth) {
    deep = sequence({std::move(deep)});
    other = sequence({std::move(other)});
  }
  EXPECT_EQ(equal(deep, other), "true");
}

TEST(DeepEqual, AtomicValuesAreComparedByValue) {
  EXPECT_EQ(equal(integer(1), decimal("1.0")), "true");
  EXPECT_EQ(equal(integer(1), number(1)), "true");
  EXPECT_EQ(equal(integer(1), integer(2)), "false");
  EXPECT_EQ(equal(string("a"), string("a")), "true");
  EXPECT_EQ(equal(string("a"), string("A")), "false");
  EXPECT_EQ(equal(string("a"), untyped("a")), "true");
  EXPECT_EQ(equal(untyped("a"), untyped("a")), "true");
  EXPECT_EQ(equal(boolean(true), boolean(true)), "true");
  EXPECT_EQ(equal(months(12), months(12)), "true");
  EXPECT_EQ(equal(seconds(1), seconds(2)), "false");
  EXPECT_EQ(equal(typed(XQueryTypeDate, "2004-01-01Z"), typed(XQueryTypeDate, "2004-01-01Z")),
            "true");
  EXPECT_EQ(equal(typed(XQueryTypeDateTime, "2004-01-01T12:00:00Z"),
                  typed(XQueryTypeDateTime, "2004-01-01T13:00:00+01:00")),
            "true");
}

TEST(DeepEqual, NaNEqualsNothing) {
  EXPECT_EQ(equal(nan(), nan()), "false");
  EXPECT_EQ(equal(nan(), integer(1)), "false");
}

TEST(DeepEqual, WhatCannotBeComparedDiffers) {
  EXPECT_EQ(equal(integer(1), string("1")), "false");
  EXPECT_EQ(equal(integer(1), untyped("1")), "false");
  EXPECT_EQ(equal(boolean(true), integer(1)), "false");
  EXPECT_EQ(equal(months(1), seconds(1)), "false");
  EXPECT_EQ(equal(typed(XQueryTypeDuration, "P1Y"), typed(XQueryTypeDuration, "P1Y")), "false");
  EXPECT_EQ(equal(typed(XQueryTypeDate, "2004-01-01"), string("2004-01-01")), "false");
}

TEST(DeepEqual, AnErrorWhileComparingIsFalseAndForgotten) {
  const Value data = NSData::dataWithBytes("ab");
  EXPECT_EQ(equal(data, data), "false");
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Value arguments[] = {integer(1), string("1")};
  EXPECT_EQ(fn_deep_equal(arguments, 2, *context).get(), NSNumber::falseValue());
  EXPECT_FALSE(_internal(*context).error());
}

TEST(DeepEqual, ANodeEqualsNoAtomicValue) {
  EXPECT_EQ(equal(elementFrom("<a>x</a>"), string("x")), "false");
  EXPECT_EQ(equal(elementFrom("<a>x</a>"), untyped("x")), "false");
  EXPECT_EQ(equal(elementFrom("<a>1</a>"), integer(1)), "false");
}

TEST(DeepEqual, NodesAreComparedByTheirTrees) {
  const auto tree = [](std::string_view xml) { return elementFrom(xml); };
  EXPECT_EQ(equal(tree("<a><b x='1'/>t</a>"), tree("<a><b x='1'/>t</a>")), "true");
  EXPECT_EQ(equal(tree("<a><b x='1'/>t</a>"), tree("<a><b x='2'/>t</a>")), "false");
  EXPECT_EQ(equal(tree("<a>t</a>"), tree("<b>t</b>")), "false");
  EXPECT_EQ(equal(tree("<a><!-- c -->t</a>"), tree("<a><?p i?>t</a>")), "true");
  EXPECT_EQ(equal(document("<a>t</a>"), document("<a>t</a>")), "true");
  EXPECT_EQ(equal(document("<a>t</a>"), elementFrom("<a>t</a>")), "false");
}

TEST(DeepEqual, TheOddAttributeCountIsKept) {
  EXPECT_EQ(equal(elementFrom("<a/>"), elementFrom("<a x='1'/>")), "false");
  EXPECT_EQ(call(fn_deep_equal, {elementFrom("<a/>"), elementFrom("<a x='1' y='2'/>")}), "true");
  EXPECT_EQ(call(fn_deep_equal, {elementFrom("<a x='1'/>"), elementFrom("<a x='1' y='2'/>")}),
            "true");
  EXPECT_EQ(call(fn_deep_equal, {elementFrom("<a x='1' y='2'/>"), elementFrom("<a x='1'/>")}),
            "false");
}

TEST(DeepEqual, DeepTreesTakeNoStack) {
  constexpr int depth = 300000;
  std::string xml;
  for (int level = 0; level < depth; ++level) xml += "<a>";
  xml += "x";
  for (int level = 0; level < depth; ++level) xml += "</a>";
  std::string other = xml;
  other[other.find('x')] = 'y';
  EXPECT_EQ(equal(document(xml), document(xml)), "true");
  EXPECT_EQ(equal(document(xml), document(other)), "false");
}

TEST(DeepEqual, TheCollationIsNotLookedAt) {
  EXPECT_EQ(call(fn_deep_equal, {string("a"), string("a"), integer(1)}), "true");
}

TEST(DeepEqual, TakesTwoOrThreeArguments) {
  EXPECT_EQ(refusedCounts(fn_deep_equal, integer(1)), "0 1 4 5");
}

}  // namespace
}  // namespace xquery
