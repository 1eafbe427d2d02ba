// The shortcuts of the operators against their plain algorithms, over generated operands.
#include "Expr/Evaluated.h"
#include "Expr/Operators/OperatorTestSupport.h"
#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryComparison.h"
#include "Expr/XQueryLeaves.h"
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

TEST(Shortcut, ArithmeticAnswersWhatThePlainAlgorithmAnswers) {
  Generator generate(1);
  int taken = 0;
  for (int round = 0; round < 60'000; ++round) {
    const int code = XQueryOperatorPlus + static_cast<int>(generate.below(6));
    const Value a = generate.operand();
    const Value b = generate.operand();
    const Value shortcut = XQueryArithmeticShortcut(code, a.get(), b.get());
    if (!shortcut) continue;
    ++taken;
    const std::string plain = outcome(
        [&](XQueryContext& context) { return XQueryArithmeticPlainly(code, a, b, context); });
    ASSERT_EQ(show(shortcut), plain) << show(a) << " op " << code << " " << show(b);
    ASSERT_EQ(XQueryNumber::isSpecial(shortcut.get()),
              plain == "double NaN" || plain == "double INF" || plain == "double -INF");
  }
  EXPECT_GT(taken, 8'000);
}

TEST(Shortcut, SignsAnswerWhatThePlainAlgorithmAnswers) {
  Generator generate(2);
  for (int round = 0; round < 10'000; ++round) {
    const int code = XQueryOperatorPlus + static_cast<int>(generate.below(2));
    const Value operand = generate.operand();
    const auto sign = [&](auto work) {
      return outcome([&](XQueryContext& context) { return work(code, operand, context); });
    };
    ASSERT_EQ(sign(XQueryUnarySign), sign(XQueryUnarySignPlainly)) << show(operand);
  }
}

TEST(Shortcut, ValueComparisonAnswersWhatThePlainAlgorithmAnswers) {
  Generator generate(3);
  int taken = 0;
  for (int round = 0; round < 60'000; ++round) {
    const int code = XQueryOperatorEq + static_cast<int>(generate.below(6));
    const Value a = generate.operand();
    const Value b = generate.operand();
    const Value shortcut = XQueryValueComparisonShortcut(code, a.get(), b.get());
    if (!shortcut) continue;
    ++taken;
    ASSERT_EQ(show(shortcut), outcome([&](XQueryContext& context) {
                return XQueryValueComparisonPlainly(code, a, b, context);
              }))
        << show(a) << " op " << code << " " << show(b);
  }
  EXPECT_GT(taken, 2'500);
}

// The whole operator, shortcuts included, against the plain algorithm: answers and failures alike.
void expectSameGeneralComparison(int code, const Value& a, const Value& b) {
  const std::string plain = outcome(
      [&](XQueryContext& context) { return XQueryGeneralComparisonPlainly(code, a, b, context); });
  ASSERT_EQ(outcome([&](XQueryContext& context) {
              return XQueryOperatorExpr::generalComparisonOperatorEvaluate(code, a, b, context);
            }),
            plain)
      << show(a) << " op " << code << " " << show(b);
}

TEST(Shortcut, GeneralComparisonAnswersWhatThePlainAlgorithmAnswers) {
  Generator generate(4);
  for (int round = 0; round < 60'000; ++round) {
    const int code = XQueryOperatorEqual + static_cast<int>(generate.below(6));
    expectSameGeneralComparison(code, generate.operand(), generate.operand());
    if (HasFatalFailure()) return;
  }
}

Ref<XQueryOperatorExpr> binary(int code, Value left, Ref<XQueryExpr> right) {
  auto expr = XQueryOperatorExpr::operatorExpr(code, std::move(right));
  expr->setLeftExpr(XQueryLiteral::literalWithValue(std::move(left)));
  return expr;
}

// Comparing with a range written in the query, against comparing with its integers.
TEST(Shortcut, ComparisonWithARangeAnswersWhatItsIntegersAnswer) {
  Generator generate(6);
  const int64_t bound = int64_t{1} << 53;
  int taken = 0;
  for (int round = 0; round < 40'000; ++round) {
    const int code = XQueryOperatorEqual + static_cast<int>(generate.below(6));
    const Value left = generate.operand();
    int64_t first = static_cast<int64_t>(generate.below(40)) - 20;
    if (generate.below(10) == 0) first += generate.below(2) ? bound - 10 : -bound;
    const int64_t last = first + static_cast<int64_t>(generate.below(25)) - 4;
    const auto range =
        binary(XQueryOperatorTo, integer(first), XQueryLiteral::literalWithValue(integer(last)));
    const auto expr = binary(code, left, range);
    const std::string plain = outcome([&](XQueryContext& context) {
      return XQueryGeneralComparisonPlainly(code, left, range->evaluateWithContext(context),
                                            context);
    });
    // Invalid operands become an error only where the operator is evaluated.
    ASSERT_EQ(outcome([&](XQueryContext& context) { return evaluatedOrThrown(*expr, context); }),
              plain == "null" ? invalidOperands : plain)
        << show(left) << " op " << code << " " << first << " to " << last;
    if (first <= last && XQueryGeneralComparisonWithRange(code, left, first, last)) ++taken;
  }
  EXPECT_GT(taken, 10'000);
}

TEST(Shortcut, GeneralComparisonOfManyItemsAnswersWhatThePlainAlgorithmAnswers) {
  Generator generate(5);
  for (int round = 0; round < 4'000; ++round) {
    const int code = XQueryOperatorEqual + static_cast<int>(generate.below(6));
    const Value a = sequence(generate.items(1 + generate.below(30)));
    const Value b = sequence(generate.items(1 + generate.below(30)));
    expectSameGeneralComparison(code, a, b);
    if (HasFatalFailure()) return;
  }
}

}  // namespace
}  // namespace xquery
