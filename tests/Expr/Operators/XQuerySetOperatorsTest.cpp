#include "Expr/Operators/OperatorTestSupport.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace operatortest;

// --- ranges --------------------------------------------------------------------------------------

std::string range(const Value& from, const Value& to) {
  return evaluate(XQueryOperatorTo, from, to);
}

TEST(Range, HoldsEveryIntegerInclusive) {
  EXPECT_EQ(range(integer(1), integer(3)), "(integer 1, integer 2, integer 3)");
  EXPECT_EQ(range(integer(-1), integer(1)), "(integer -1, integer 0, integer 1)");
}

TEST(Range, FromFiveToThreeIsEmpty) {
  EXPECT_EQ(range(integer(5), integer(3)), "()");
}

TEST(Range, FromThreeToThreeIsThree) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Value answer =
      XQueryOperatorExpr::rangeOperatorEvaluate(XQueryOperatorTo, integer(3), integer(3), *context);
  EXPECT_EQ(show(normalised(answer)), "integer 3");
}

TEST(Range, IsASequence) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  for (const int64_t last : {0, 1, 5}) {
    const Value answer = XQueryOperatorExpr::rangeOperatorEvaluate(XQueryOperatorTo, integer(1),
                                                                   integer(last), *context);
    ASSERT_TRUE(isa<XQuerySequence>(answer));
    EXPECT_EQ(cast<XQuerySequence>(answer)->count(), static_cast<size_t>(last));
  }
}

TEST(Range, AnEmptyOperandGivesEmpty) {
  EXPECT_EQ(range(empty(), integer(3)), "()");
  EXPECT_EQ(range(integer(3), empty()), "()");
  EXPECT_EQ(range(sequence({}), integer(3)), "()");
}

TEST(Range, OperandsArePromotedToInteger) {
  EXPECT_EQ(range(untyped("1"), untyped("2")), "(integer 1, integer 2)");
  EXPECT_EQ(range(decimal("1.9"), number(2.9)), "(integer 1, integer 2)");
  EXPECT_EQ(range(typed(50, "1"), typed(43, "2")), "(integer 1, integer 2)");
  EXPECT_EQ(range(sequence({integer(1)}), integer(2)), "(integer 1, integer 2)");
  EXPECT_EQ(range(elementFrom("<a>1</a>"), integer(2)), "(integer 1, integer 2)");
}

TEST(Range, AnOperandThatIsNoIntegerFails) {
  EXPECT_EQ(range(string("a"), integer(3)), "error 6 not a integer type - a");
  EXPECT_EQ(range(integer(1), boolean(true)), "error 6 not a integer type - true");
  EXPECT_EQ(range(sequence({integer(1), integer(2)}), integer(3)),
            "error 6 not a integer type - (1, 2)");
  EXPECT_EQ(range(untyped("x"), integer(3)), invalidCast);
  EXPECT_EQ(range(nan(), integer(3)), invalidCast);
  EXPECT_EQ(range(Value(), integer(3)), invalidOperands);
}

TEST(Range, EndsAtTheGreatestWord) {
  const int64_t greatest = std::numeric_limits<int64_t>::max();
  EXPECT_EQ(range(integer(greatest - 1), integer(greatest)),
            "(integer 9223372036854775806, integer 9223372036854775807)");
}

TEST(Range, BeyondTheWordIsReadAsTheWord) {
  EXPECT_EQ(range(typed(42, "9223372036854775807"), typed(42, "9223372036854775999")),
            "(integer 9223372036854775807)");
}

TEST(Range, OfTooManyItemsIsAnError) {
  const int64_t greatest = std::numeric_limits<int64_t>::max();
  const std::string limit = "error 0 limit: range of too many items";
  EXPECT_EQ(range(integer(1), integer(greatest)), limit);
  EXPECT_EQ(range(integer(std::numeric_limits<int64_t>::min()), integer(greatest)), limit);
  EXPECT_EQ(range(integer(0), integer(int64_t{1} << 31)), limit);
}

TEST(Range, OfAMillionItemsIsBuilt) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Value answer = XQueryOperatorExpr::rangeOperatorEvaluate(XQueryOperatorTo, integer(1),
                                                                 integer(1'000'000), *context);
  const auto* items = cast<NSArray>(answer);
  ASSERT_EQ(items->count(), 1'000'000U);
  EXPECT_EQ(show(items->objectAtIndex(999'999)), "integer 1000000");
}

// --- union, intersect, except --------------------------------------------------------------------

class SetOperator : public testing::Test {
 protected:
  Value root = elementFrom("<r><a/><b/><c/><d/></r>");
  Value a = child(0);
  Value b = child(1);
  Value c = child(2);
  Value d = child(3);

  Value child(uint32_t index) { return cast<NSXMLNode>(root)->childAtIndex(index); }
};

TEST_F(SetOperator, UnionHoldsEachNodeOnceInDocumentOrder) {
  EXPECT_EQ(evaluate(XQueryOperatorUnion, sequence({c, a}), sequence({b, a})),
            "(node a, node b, node c)");
  EXPECT_EQ(evaluate(XQueryOperatorUnion, sequence({a, a}), a), "node a");
}

TEST_F(SetOperator, IntersectHoldsTheCommonNodes) {
  EXPECT_EQ(evaluate(XQueryOperatorIntersect, sequence({d, c, a, c}), sequence({a, b, c})),
            "(node a, node c)");
  EXPECT_EQ(evaluate(XQueryOperatorIntersect, sequence({a, a}), a), "node a");
  EXPECT_EQ(evaluate(XQueryOperatorIntersect, a, b), "()");
}

TEST_F(SetOperator, ExceptHoldsTheNodesOfTheLeftOnly) {
  EXPECT_EQ(evaluate(XQueryOperatorExcept, sequence({d, c, a, c}), sequence({a, b})),
            "(node c, node d)");
  EXPECT_EQ(evaluate(XQueryOperatorExcept, sequence({a, b}), b), "node a");
  EXPECT_EQ(evaluate(XQueryOperatorExcept, a, a), "()");
}

TEST_F(SetOperator, AnEmptyOperandHoldsNoNodes) {
  EXPECT_EQ(evaluate(XQueryOperatorUnion, empty(), a), "node a");
  EXPECT_EQ(evaluate(XQueryOperatorUnion, sequence({b, a}), empty()), "(node a, node b)");
  EXPECT_EQ(evaluate(XQueryOperatorUnion, empty(), empty()), "()");
  EXPECT_EQ(evaluate(XQueryOperatorIntersect, a, empty()), "()");
  EXPECT_EQ(evaluate(XQueryOperatorExcept, empty(), a), "()");
  EXPECT_EQ(evaluate(XQueryOperatorExcept, a, sequence({})), "node a");
}

TEST_F(SetOperator, AnItemThatIsNoNodeIsInvalid) {
  for (const int code : {XQueryOperatorUnion, XQueryOperatorIntersect, XQueryOperatorExcept}) {
    EXPECT_EQ(evaluate(code, integer(1), a), invalidOperands);
    EXPECT_EQ(evaluate(code, a, integer(1)), invalidOperands);
    EXPECT_EQ(evaluate(code, sequence({a, string("x")}), b), invalidOperands);
    EXPECT_EQ(evaluate(code, empty(), integer(1)), invalidOperands);
    EXPECT_EQ(evaluate(code, Value(), a), invalidOperands);
  }
}

TEST_F(SetOperator, NodesAreTakenByIdentity) {
  const Value same = elementFrom("<a/>");
  const Value other = elementFrom("<a/>");
  EXPECT_EQ(evaluate(XQueryOperatorIntersect, same, other), "()");
  EXPECT_EQ(evaluate(XQueryOperatorUnion, same, other), "(node a, node a)");
}

TEST_F(SetOperator, NodesOfDifferentDocumentsStandInTheOrderOfTheOperands) {
  const Value other = elementFrom("<s><x/><y/></s>");
  const Value x = cast<NSXMLNode>(other)->firstChild();
  const Value y = cast<NSXMLNode>(other)->lastChild();
  EXPECT_EQ(evaluate(XQueryOperatorUnion, sequence({x, y}), sequence({a, b})),
            "(node x, node y, node a, node b)");
  EXPECT_EQ(evaluate(XQueryOperatorUnion, sequence({b, a}), sequence({y, x})),
            "(node a, node b, node x, node y)");
}

}  // namespace
}  // namespace xquery
