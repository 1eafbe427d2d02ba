// What is answered quickly against what the operators answer, over generated operands.
#include "Expr/Evaluated.h"
#include "Expr/Operators/OperatorTestSupport.h"
#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryRange.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Operators/XQueryQuickArithmetic.h"
#include "Plan/Operators/XQueryQuickComparison.h"
#include "Plan/PlanTesting.h"
#include "Types/XQueryAtomization.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <random>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace operatortest;

class Generator {
 public:
  explicit Generator(uint32_t seed) : _random(seed) {}

  size_t below(size_t bound) { return _random() % bound; }

  // An item; most are of the kinds that have a shortcut.
  Value item() {
    switch (below(14)) {
      case 0:
      case 1:
        return integer(static_cast<int64_t>(below(21)) - 10);
      case 2:
        return integer(wideInteger());
      case 3:
        return typed(XQueryTypeInteger,
                     std::to_string(wideInteger()) + std::to_string(below(1000)));
      case 4:
        return number(wideDouble());
      case 5:
        return number(static_cast<double>(below(41)) / 4 - 5);
      case 6:
        return special();
      case 7:
        return decimal(decimalText());
      case 8:
        return untyped(text());
      case 9:
        return node();
      case 10:
        return string(text());
      case 11:
        return typed(numericType(), std::to_string(1 + below(100)));
      case 12:
        return other();
      default:
        return single(decimalText());
    }
  }

  // One item, several or none.
  Value operand() {
    switch (below(6)) {
      case 0:
        return sequence(items(below(4)));
      case 1:
        return empty();
      default:
        return item();
    }
  }

  // Several items, of one kind as often as not.
  std::vector<Value> items(size_t count) {
    std::vector<Value> result;
    const size_t kind = below(8);
    for (size_t index = 0; index < count; ++index) result.push_back(itemOfKind(kind));
    return result;
  }

 private:
  Value itemOfKind(size_t kind) {
    switch (kind) {
      case 0:
        return untyped(text());
      case 1:
        return integer(static_cast<int64_t>(below(50)));
      case 2:
        return number(static_cast<double>(below(50)) / 2);
      case 3:
        return untyped(decimalText());
      case 4:
        return string(std::to_string(below(30)));
      case 5:
        return below(2) ? decimal(decimalText()) : integer(static_cast<int64_t>(below(50)));
      default:
        return item();
    }
  }

  int64_t wideInteger() {
    static const int64_t edges[] = {std::numeric_limits<int64_t>::max(),
                                    std::numeric_limits<int64_t>::min(),
                                    int64_t{1} << 53,
                                    (int64_t{1} << 53) + 1,
                                    -(int64_t{1} << 53) - 1,
                                    int64_t{1} << 62};
    if (below(2)) return edges[below(std::size(edges))];
    return static_cast<int64_t>(_random64());
  }

  double wideDouble() {
    static const double edges[] = {
        0.0, -0.0, 0.1, 1e17, -1e17, 1e300, -1e300, 5e-324, 1.5e308, 9007199254740993.0, 1.0 / 3};
    if (below(2)) return edges[below(std::size(edges))];
    return static_cast<double>(_random64()) / static_cast<double>(1 + below(1000));
  }

  Value special() {
    switch (below(5)) {
      case 0:
        return nan();
      case 1:
        return infinity();
      case 2:
        return minusInfinity();
      case 3:
        return XQueryNumber::zero();
      default:
        return XQueryNumber::one();
    }
  }

  std::string decimalText() {
    std::string digits = below(2) ? "-" : "";
    digits += std::to_string(below(1000));
    if (below(2)) digits += "." + std::to_string(below(1000));
    if (below(8) == 0) digits += "000000000000000000000001";
    return digits;
  }

  std::string text() {
    static const char* const texts[] = {"",    "x",        "NaN",   "INF",  "-INF", " 7",  "7x",
                                        "+5",  "1e3",      "1e400", "true", "en",   "P1Y", ".5",
                                        "a b", "\xC3\xA9", "0",     "-0",   "--1"};
    return below(2) ? decimalText() : texts[below(std::size(texts))];
  }

  Value node() {
    switch (below(5)) {
      case 0:
        return elementFrom("<a>" + text() + "</a>");
      case 1:
        return elementFrom("<a>1<b>" + decimalText() + "</b></a>");
      case 2:
        return elementFrom("<a><b><c>" + text() + "</c></b></a>");
      case 3:
        return elementFrom("<a><!--5--></a>");
      default:
        return NSXMLNode::attributeWithName(NSStringView::ascii("n"), untypedView(text()));
    }
  }

  NSStringView untypedView(const std::string& utf8) {
    _kept = NSString::stringWithUTF8(utf8);
    return _kept->view();
  }

  int numericType() {
    static const int types[] = {43, 44, 47, 48, 49, 50, 51, 52, 53, 54};
    return types[below(std::size(types))];
  }

  Value other() {
    switch (below(6)) {
      case 0:
        return boolean(true);
      case 1:
        return boolean(false);
      case 2:
        return months(static_cast<int64_t>(below(20)));
      case 3:
        return seconds(static_cast<double>(below(20)));
      case 4:
        return typed(XQueryTypeToken, "en");
      default:
        return typed(XQueryTypeAnyURI, "http://a/");
    }
  }

  uint64_t _random64() { return (uint64_t{_random()} << 32) | _random(); }

  std::mt19937 _random;
  Ref<NSString> _kept;
};

using Operator = Value (*)(int, const Value&, const Value&, XQueryContext&);

// Whether `quickly` knew the operands; then it has to answer, or to fail, as the operator does.
bool answersAlike(Operator quickly, Operator plainly, int code, const Value& a, const Value& b) {
  bool isKnown = false;
  const std::string quick = outcome([&](XQueryContext& context) {
    Value answer = quickly(code, a, b, context);
    isKnown = answer != nullptr;
    return answer;
  });
  if (!isKnown && quick == "null") return false;
  const std::string plain =
      outcome([&](XQueryContext& context) { return plainly(code, a, b, context); });
  EXPECT_EQ(quick, plain) << show(a) << " op " << code << " " << show(b);
  return true;
}

TEST(QuickAnswer, OfArithmeticIsThatOfTheOperator) {
  Generator generate(1);
  int known = 0;
  for (int round = 0; round < 60'000 && !testing::Test::HasFailure(); ++round) {
    const int code = XQueryOperatorPlus + static_cast<int>(generate.below(6));
    const Value a = generate.operand();
    known += answersAlike(XQueryQuickArithmetic, XQueryOperatorExpr::arithmeticOperatorEvaluate,
                          code, a, generate.operand());
  }
  EXPECT_GT(known, 8'000);
}

// Specials are objects that are shared: which of two NaNs it is can be told.
TEST(QuickAnswer, OfArithmeticIsASharedNumberWhereTheOperatorAnswersOne) {
  Generator generate(7);
  for (int round = 0; round < 60'000; ++round) {
    const int code = XQueryOperatorPlus + static_cast<int>(generate.below(6));
    const Value a = generate.operand();
    const Value b = generate.operand();
    Value quick;
    const std::string shown = outcome(
        [&](XQueryContext& context) { return quick = XQueryQuickArithmetic(code, a, b, context); });
    if (!quick) continue;
    ASSERT_EQ(XQueryNumber::isSpecial(quick.get()),
              shown == "double NaN" || shown == "double INF" || shown == "double -INF");
  }
}

TEST(QuickAnswer, OfASignIsThatOfTheOperator) {
  Generator generate(2);
  int known = 0;
  for (int round = 0; round < 10'000 && !testing::Test::HasFailure(); ++round) {
    const int code = XQueryOperatorPlus + static_cast<int>(generate.below(2));
    const auto plainly = [](int type, const Value&, const Value& operand, XQueryContext& context) {
      return XQueryUnarySign(type, operand, context);
    };
    known += answersAlike(XQueryQuickSign, plainly, code, Value(), generate.operand());
  }
  EXPECT_GT(known, 4'000);
}

TEST(QuickAnswer, OfAValueComparisonIsThatOfTheOperator) {
  Generator generate(3);
  int known = 0;
  for (int round = 0; round < 60'000 && !testing::Test::HasFailure(); ++round) {
    const int code = XQueryOperatorEq + static_cast<int>(generate.below(6));
    const Value a = generate.operand();
    known += answersAlike(XQueryQuickValueComparison,
                          XQueryOperatorExpr::valueComparisonOperatorEvaluate, code, a,
                          generate.operand());
  }
  EXPECT_GT(known, 2'500);
}

bool comparesAlike(int code, const Value& a, const Value& b) {
  return answersAlike(XQueryQuickGeneralComparison,
                      XQueryOperatorExpr::generalComparisonOperatorEvaluate, code, a, b);
}

TEST(QuickAnswer, OfAGeneralComparisonIsThatOfTheOperator) {
  Generator generate(4);
  int known = 0;
  for (int round = 0; round < 60'000 && !testing::Test::HasFailure(); ++round) {
    const int code = XQueryOperatorEqual + static_cast<int>(generate.below(6));
    const Value a = generate.operand();
    known += comparesAlike(code, a, generate.operand());
  }
  EXPECT_GT(known, 10'000);
}

TEST(QuickAnswer, OfAGeneralComparisonOfManyItemsIsThatOfTheOperator) {
  Generator generate(5);
  for (int round = 0; round < 4'000 && !testing::Test::HasFailure(); ++round) {
    const int code = XQueryOperatorEqual + static_cast<int>(generate.below(6));
    const Value a = sequence(generate.items(1 + generate.below(30)));
    comparesAlike(code, a, sequence(generate.items(1 + generate.below(30))));
  }
}

TEST(QuickAnswer, IsForArithmeticAndComparisonsOfValues) {
  const auto chosen = [](std::string_view text) {
    return plantest::choicesIn(text, [](std::string_view rule) { return rule == "operands"; });
  };
  EXPECT_EQ(chosen("//a/@x * 2 + 1"), 2U);
  EXPECT_EQ(chosen("-(//a/@x)"), 1U);
  EXPECT_EQ(chosen("(//a/@x eq 'u', sum(//a) < 2)"), 2U);
  EXPECT_EQ(chosen("(//a is //b, //a union //b, //a and //b, 1 to count(//a))"), 0U);
}

// The bounds of a range against its integers.
TEST(ComparisonWithRange, AnswersWhatItsIntegersAnswer) {
  Generator generate(6);
  const int64_t bound = int64_t{1} << 53;
  int known = 0;
  for (int round = 0; round < 40'000; ++round) {
    const int code = XQueryOperatorEqual + static_cast<int>(generate.below(6));
    const Value left = generate.operand();
    int64_t first = static_cast<int64_t>(generate.below(40)) - 20;
    if (generate.below(10) == 0) first += generate.below(2) ? bound - 10 : -bound;
    const int64_t last = first + static_cast<int64_t>(generate.below(20));
    const Value answer = XQueryGeneralComparisonWithRange(code, left, first, last);
    if (!answer) continue;
    ++known;
    ASSERT_EQ(show(answer), outcome([&](XQueryContext& context) {
                return XQueryOperatorExpr::generalComparisonOperatorEvaluate(
                    code, left,
                    XQueryOperatorExpr::rangeOperatorEvaluate(XQueryOperatorTo, integer(first),
                                                              integer(last), context),
                    context);
              }))
        << show(left) << " op " << code << " " << first << " to " << last;
  }
  EXPECT_GT(known, 10'000);
}

}  // namespace
}  // namespace xquery
