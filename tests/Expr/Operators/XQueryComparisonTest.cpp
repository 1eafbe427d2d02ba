#include "Expr/Operators/OperatorTestSupport.h"
#include "Expr/Operators/XQueryComparison.h"
#include "Platform/Base/SanitizedSizes.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace operatortest;

constexpr int generalCodes[] = {13, 14, 15, 16, 17, 18};
constexpr int valueCodes[] = {19, 20, 21, 22, 23, 24};

// The answers of all six comparisons in the order =, !=, <, <=, >, >= (or eq to ge): "T", "F", "-"
// for the empty sequence, "!" for invalid operands, "c" for a cast that fails, "?" for the rest.
std::string six(const int (&codes)[6], const Value& a, const Value& b) {
  std::string answers;
  for (const int code : codes) {
    const std::string answer = evaluate(code, a, b);
    answers += answer == "true"            ? 'T'
               : answer == "false"         ? 'F'
               : answer == "()"            ? '-'
               : answer == invalidOperands ? '!'
               : answer == invalidCast     ? 'c'
                                           : '?';
  }
  return answers;
}

constexpr const char* equal = "TFFTFT";
constexpr const char* less = "FTTTFF";
constexpr const char* greater = "FTFFTT";
constexpr const char* never = "FFFFFF";
constexpr const char* invalid = "!!!!!!";
constexpr const char* nothing = "------";

std::string value(const Value& a, const Value& b) {
  return six(valueCodes, a, b);
}
std::string general(const Value& a, const Value& b) {
  return six(generalCodes, a, b);
}

// The comparison of two single atomic values, without atomizing and converting.
std::string atomic(int code, const Value& a, const Value& b) {
  return outcome([&](XQueryContext& context) {
    return XQueryOperatorExpr::compareValue(a, b, code, context);
  });
}

// --- single values -------------------------------------------------------------------------------

TEST(ValueComparison, Numbers) {
  EXPECT_EQ(value(integer(1), integer(1)), equal);
  EXPECT_EQ(value(integer(1), integer(2)), less);
  EXPECT_EQ(value(integer(2), integer(1)), greater);
  EXPECT_EQ(value(integer(1), decimal("1.0")), equal);
  EXPECT_EQ(value(integer(1), number(1)), equal);
  EXPECT_EQ(value(number(1.5), integer(1)), greater);
  EXPECT_EQ(value(single("0.1"), single("0.1")), equal);
  EXPECT_EQ(value(typed(50, "5"), typed(43, "6")), less);
  EXPECT_EQ(value(minusInfinity(), infinity()), less);
  EXPECT_EQ(value(infinity(), infinity()), equal);
  EXPECT_EQ(value(number(0.0), number(-0.0)), equal);
}

TEST(ValueComparison, BigIntegersAreComparedExactly) {
  EXPECT_EQ(value(decimal("9007199254740993"), decimal("9007199254740992")), greater);
  EXPECT_EQ(value(typed(42, "100000000000000000000"), typed(42, "100000000000000000001")), less);
}

TEST(ValueComparison, NoRelationHoldsForNaN) {
  EXPECT_EQ(value(nan(), nan()), never);
  EXPECT_EQ(value(nan(), integer(1)), never);
  EXPECT_EQ(value(integer(1), nan()), never);
  EXPECT_EQ(value(nan(), infinity()), never);
  EXPECT_EQ(value(number(1), nan()), never);
  EXPECT_EQ(value(decimal("1.5"), nan()), never);
}

TEST(ValueComparison, StringsByCodePoint) {
  EXPECT_EQ(value(string("a"), string("a")), equal);
  EXPECT_EQ(value(string("a"), string("b")), less);
  EXPECT_EQ(value(string("ab"), string("a")), greater);
  EXPECT_EQ(value(string("Z"), string("a")), less);
  EXPECT_EQ(value(string("\xEF\xBF\xBD"), string("\xF0\x9F\x98\x80")), less);  // U+FFFD, U+1F600
  EXPECT_EQ(value(typed(33, "a"), string("a")), equal);
  EXPECT_EQ(value(typed(31, "a"), typed(34, "b")), less);
}

TEST(ValueComparison, UntypedIsAString) {
  EXPECT_EQ(value(untyped("10"), untyped("9")), less);
  EXPECT_EQ(value(untyped("a"), string("a")), equal);
  EXPECT_EQ(value(elementFrom("<a>x</a>"), string("x")), equal);
  EXPECT_EQ(value(elementFrom("<a>x<b>y</b></a>"), string("xy")), equal);
  EXPECT_EQ(evaluate(XQueryOperatorEq, untyped("1"), integer(1)), invalidOperands);
}

TEST(ValueComparison, Booleans) {
  EXPECT_EQ(value(boolean(false), boolean(false)), equal);
  EXPECT_EQ(value(boolean(true), boolean(true)), equal);
  EXPECT_EQ(value(boolean(false), boolean(true)), less);
  EXPECT_EQ(value(boolean(true), boolean(false)), greater);
}

TEST(ValueComparison, OrderedDurations) {
  EXPECT_EQ(value(months(12), months(12)), equal);
  EXPECT_EQ(value(months(11), months(12)), less);
  EXPECT_EQ(value(seconds(1.5), seconds(1)), greater);
  EXPECT_EQ(value(seconds(60), seconds(60)), equal);
  EXPECT_EQ(value(months(1), seconds(1)), invalid);
  EXPECT_EQ(value(seconds(1), months(1)), invalid);
}

TEST(ValueComparison, TypesWithEqualityOnly) {
  const std::vector<std::pair<int, std::pair<const char*, const char*>>> cases = {
      {14, {"http://a/", "http://b/"}},
      {25, {"YQ==", "Yg=="}},
      {26, {"61", "62"}},
      {27, {"a", "b"}},
  };
  for (const auto& [type, texts] : cases) {
    EXPECT_EQ(value(typed(type, texts.first), typed(type, texts.first)), "TF!!!!") << type;
    EXPECT_EQ(value(typed(type, texts.first), typed(type, texts.second)), "FT!!!!") << type;
  }
  const Value name = XQueryQName::qname(NSString::stringWithASCII("a"), nullptr);
  const Value other = XQueryQName::qname(NSString::stringWithASCII("b"), nullptr);
  EXPECT_EQ(value(name, name), "TF!!!!");
  EXPECT_EQ(value(name, other), "FT!!!!");
}

TEST(ValueComparison, EqualityOfDifferentTypesIsInvalid) {
  const std::vector<Value> values = {
      string("1"),     integer(1),        boolean(true), typed(14, "http://a"),
      typed(26, "61"), typed(25, "YQ=="), months(1),     typed(27, "a")};
  for (size_t i = 0; i < values.size(); ++i) {
    for (size_t j = 0; j < values.size(); ++j) {
      if (i == j) continue;
      EXPECT_EQ(evaluate(XQueryOperatorEq, values[i], values[j]), invalidOperands) << i << " " << j;
      EXPECT_EQ(evaluate(XQueryOperatorNe, values[i], values[j]), invalidOperands) << i << " " << j;
    }
  }
}

TEST(ValueComparison, TheLeftTypeDecidesHowAnOrderIsTaken) {
  EXPECT_EQ(evaluate(XQueryOperatorLt, string("a"), integer(1)), "error 6 not a string type - 1");
  EXPECT_EQ(evaluate(XQueryOperatorLt, string("a"), typed(14, "http://b")), "true");
  EXPECT_EQ(evaluate(XQueryOperatorLt, boolean(false), integer(1)), "false");
  EXPECT_EQ(evaluate(XQueryOperatorGe, boolean(false), integer(1)), "true");
  EXPECT_EQ(evaluate(XQueryOperatorLt, integer(0), boolean(true)), "true");
  EXPECT_EQ(evaluate(XQueryOperatorLt, integer(5), months(6)), "true");
  EXPECT_EQ(evaluate(XQueryOperatorLt, integer(1), string("2")), invalidOperands);
}

TEST(ValueComparison, EmptyGivesEmpty) {
  EXPECT_EQ(value(empty(), integer(1)), nothing);
  EXPECT_EQ(value(integer(1), empty()), nothing);
  EXPECT_EQ(value(sequence({}), string("a")), nothing);
}

TEST(ValueComparison, AOneElementArrayIsItsElement) {
  EXPECT_EQ(value(sequence({integer(1)}), integer(2)), less);
  EXPECT_EQ(value(string("b"), sequence({untyped("a")})), greater);
}

TEST(ValueComparison, SeveralItemsAreInvalid) {
  EXPECT_EQ(value(sequence({integer(1), integer(2)}), integer(1)), invalid);
  EXPECT_EQ(value(sequence({integer(1), integer(2)}), sequence({integer(1), integer(2)})), invalid);
}

TEST(CompareValue, CodesOutsideTheValueComparisonsHaveNoAnswer) {
  EXPECT_EQ(atomic(25, integer(1), integer(1)), "null");
  EXPECT_EQ(atomic(18, integer(1), integer(1)), "null");
  EXPECT_EQ(atomic(19, integer(1), integer(1)), "true");
  EXPECT_EQ(atomic(24, integer(1), integer(1)), "true");
}

TEST(CompareValue, EmptyComesBeforeTheCode) {
  EXPECT_EQ(atomic(19, empty(), integer(1)), "()");
  EXPECT_EQ(atomic(25, integer(1), empty()), "()");
}

TEST(CompareValue, UntypedAndMissingValuesHaveNoAnswer) {
  EXPECT_EQ(atomic(19, untyped("a"), untyped("a")), "null");
  EXPECT_EQ(atomic(21, untyped("a"), untyped("b")), "null");
  EXPECT_EQ(atomic(19, Value(), integer(1)), "null");
  EXPECT_EQ(atomic(19, integer(1), Value()), "null");
}

// --- general comparisons -------------------------------------------------------------------------

TEST(GeneralComparison, AnEmptyOperandGivesTheEmptySequence) {
  EXPECT_EQ(general(empty(), integer(1)), nothing);
  EXPECT_EQ(general(integer(1), empty()), nothing);
  EXPECT_EQ(general(sequence({}), sequence({})), nothing);
}

TEST(GeneralComparison, AnyPairDecides) {
  const Value oneTwo = sequence({integer(1), integer(2)});
  const Value twoThree = sequence({integer(2), integer(3)});
  EXPECT_EQ(evaluate(XQueryOperatorEqual, oneTwo, twoThree), "true");
  EXPECT_EQ(evaluate(XQueryOperatorNotEqual, oneTwo, oneTwo), "true");
  EXPECT_EQ(evaluate(XQueryOperatorGreater, oneTwo, twoThree), "false");
  EXPECT_EQ(evaluate(XQueryOperatorGreaterEqual, oneTwo, twoThree), "true");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, oneTwo, integer(3)), "false");
}

TEST(GeneralComparison, UntypedAgainstANumberIsADouble) {
  EXPECT_EQ(general(untyped("10"), integer(10)), equal);
  EXPECT_EQ(general(untyped("10.0"), integer(10)), equal);
  EXPECT_EQ(general(integer(9), untyped("10")), less);
  EXPECT_EQ(general(untyped("1e1"), decimal("9.5")), greater);
  EXPECT_EQ(general(untyped("0.5"), single("0.5")), equal);
  EXPECT_EQ(general(untyped("NaN"), integer(1)), never);
  EXPECT_EQ(general(untyped("INF"), integer(1)), greater);
  EXPECT_EQ(general(untyped("x"), integer(1)), "cccccc");
  EXPECT_EQ(general(integer(1), untyped("")), "cccccc");
}

TEST(GeneralComparison, UntypedAgainstUntypedIsAString) {
  EXPECT_EQ(general(untyped("10"), untyped("9")), less);
  EXPECT_EQ(general(untyped("a"), untyped("a")), equal);
  EXPECT_EQ(general(elementFrom("<a>10</a>"), elementFrom("<a>9</a>")), less);
}

TEST(GeneralComparison, UntypedAgainstAnotherTypeTakesThatVeryType) {
  EXPECT_EQ(general(untyped("a"), string("a")), equal);
  EXPECT_EQ(general(untyped("true"), boolean(true)), equal);
  EXPECT_EQ(general(boolean(false), untyped("1")), less);
  EXPECT_EQ(general(untyped("P1Y"), months(12)), equal);
  EXPECT_EQ(general(untyped("en"), typed(32, "en")), equal);
  EXPECT_EQ(general(untyped("no name"), typed(34, "name")), "cccccc");
  EXPECT_EQ(general(untyped("maybe"), boolean(true)), "cccccc");
  // The other's derived type is taken, and is numeric through its primitive type: double.
  EXPECT_EQ(general(untyped("5.5"), typed(50, "5")), greater);
}

TEST(GeneralComparison, TypedItemsAreNotConverted) {
  EXPECT_EQ(general(string("1"), integer(1)).substr(0, 2), "!!");
  EXPECT_EQ(general(integer(1), string("1")), invalid);
  EXPECT_EQ(general(months(1), integer(1)), invalid);
}

TEST(GeneralComparison, NodesAreAtomized) {
  const Value items = sequence({elementFrom("<a>1</a>"), elementFrom("<a>3</a>")});
  EXPECT_EQ(evaluate(XQueryOperatorGreater, items, integer(2)), "true");
  EXPECT_EQ(evaluate(XQueryOperatorGreater, items, integer(3)), "false");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, items, string("3")), "true");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, elementFrom("<a/>"), string("")), "true");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, elementFrom("<a><?p x?></a>"), string("")), "true");
}

TEST(GeneralComparison, TheFirstPairThatDoesNotAnswerFalseEndsTheSearch) {
  const Value mixed = sequence({integer(1), string("x")});
  EXPECT_EQ(evaluate(XQueryOperatorEqual, mixed, integer(1)), "true");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, mixed, integer(2)), invalidOperands);
  const Value untypedMixed = sequence({untyped("x"), untyped("1")});
  EXPECT_EQ(evaluate(XQueryOperatorEqual, untypedMixed, integer(1)), invalidCast);
  EXPECT_EQ(evaluate(XQueryOperatorEqual, sequence({untyped("1"), untyped("x")}), integer(1)),
            "true");
}

TEST(GeneralComparison, PairsAreTakenLeftByRight) {
  // The first left item meets every right item before the second one is looked at.
  const Value left = sequence({integer(1), string("x")});
  EXPECT_EQ(evaluate(XQueryOperatorEqual, left, sequence({integer(5), integer(1)})), "true");
}

TEST(GeneralComparison, AnItemThatCannotBeAtomizedFails) {
  const Value record = XQueryError::error(6, "made up");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, record, integer(1)), "error 6 invalid type");
  EXPECT_EQ(evaluate(XQueryOperatorEqual, Value(), integer(1)), "error 6 invalid type");
}

TEST(GeneralComparison, ManyStringsAgainstMany) {
  std::vector<Value> left;
  std::vector<Value> right;
  constexpr int count = 2000 / largeInputDivisor;
  for (int i = 0; i < count; ++i) {
    left.push_back(untyped("l" + std::to_string(i)));
    right.push_back(untyped("r" + std::to_string(i)));
  }
  EXPECT_EQ(evaluate(XQueryOperatorEqual, sequence(left), sequence(right)), "false");
  right.push_back(untyped("l" + std::to_string(count - 1)));
  EXPECT_EQ(evaluate(XQueryOperatorEqual, sequence(left), sequence(right)), "true");
  EXPECT_EQ(evaluate(XQueryOperatorGreater, sequence(left), sequence({right.front()})), "false");
  EXPECT_EQ(evaluate(XQueryOperatorLess, sequence(left), sequence({right.front()})), "true");
}

// --- node comparisons ----------------------------------------------------------------------------

class NodeComparison : public testing::Test {
 protected:
  Value root = elementFrom("<r><a/><b/></r>");
  Value first = cast<NSXMLNode>(root)->firstChild();
  Value second = cast<NSXMLNode>(root)->lastChild();
};

TEST_F(NodeComparison, IsTestsIdentity) {
  EXPECT_EQ(evaluate(XQueryOperatorIs, first, first), "true");
  EXPECT_EQ(evaluate(XQueryOperatorIs, first, second), "false");
  EXPECT_EQ(evaluate(XQueryOperatorIs, elementFrom("<a/>"), elementFrom("<a/>")), "false");
}

TEST_F(NodeComparison, BeforeAndAfterFollowDocumentOrder) {
  EXPECT_EQ(evaluate(XQueryOperatorBefore, first, second), "true");
  EXPECT_EQ(evaluate(XQueryOperatorBefore, second, first), "false");
  EXPECT_EQ(evaluate(XQueryOperatorAfter, second, first), "true");
  EXPECT_EQ(evaluate(XQueryOperatorAfter, first, first), "false");
  EXPECT_EQ(evaluate(XQueryOperatorBefore, root, first), "true");
}

TEST_F(NodeComparison, AnEmptyOperandGivesEmpty) {
  for (const int code : {XQueryOperatorIs, XQueryOperatorBefore, XQueryOperatorAfter}) {
    EXPECT_EQ(evaluate(code, empty(), first), "()");
    EXPECT_EQ(evaluate(code, first, empty()), "()");
    EXPECT_EQ(evaluate(code, empty(), empty()), "()");
    EXPECT_EQ(evaluate(code, sequence({}), first), "()");
  }
}

TEST_F(NodeComparison, AnythingButSingleNodesIsInvalid) {
  for (const int code : {XQueryOperatorIs, XQueryOperatorBefore, XQueryOperatorAfter}) {
    EXPECT_EQ(evaluate(code, first, integer(1)), invalidOperands);
    EXPECT_EQ(evaluate(code, integer(1), first), invalidOperands);
    EXPECT_EQ(evaluate(code, empty(), integer(1)), invalidOperands);
    EXPECT_EQ(evaluate(code, first, sequence({first, second})), invalidOperands);
    EXPECT_EQ(evaluate(code, Value(), first), invalidOperands);
  }
}

TEST_F(NodeComparison, AOneElementArrayIsItsNode) {
  EXPECT_EQ(evaluate(XQueryOperatorIs, sequence({first}), first), "true");
}

}  // namespace
}  // namespace xquery
