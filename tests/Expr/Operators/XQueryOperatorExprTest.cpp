#include "Expr/Evaluated.h"
#include "Expr/Operators/OperatorTestSupport.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "xquery/Exception.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace operatortest;

// Evaluates to a given value and counts how often it is evaluated and bound.
class Probe : public XQueryExpr {
 public:
  static Ref<Probe> probe(Value value, std::vector<std::string>* log = nullptr,
                          std::string name = {}) {
    return make<Probe>(std::move(value), log, std::move(name));
  }
  void bindInfoForProlog(XQueryProlog&) override {
    if (_log) _log->push_back("bind " + _name);
  }
  void visitParts(XQueryPartVisitor&) override {}
  Value computeValue(XQueryContext&) const override {
    ++evaluations;
    if (_log) _log->push_back(_name);
    return _value;
  }
  mutable int evaluations = 0;

  Probe(Value value, std::vector<std::string>* log, std::string name)
      : XQueryExpr(Kind::OtherExpr), _value(std::move(value)), _log(log), _name(std::move(name)) {}

 private:
  Value _value;
  std::vector<std::string>* _log;
  std::string _name;
};

Ref<XQueryOperatorExpr> binary(int code, Ref<XQueryExpr> left, Ref<XQueryExpr> right) {
  Ref<XQueryOperatorExpr> expr = XQueryOperatorExpr::operatorExpr(code, std::move(right));
  expr->setLeftExpr(std::move(left));
  return expr;
}

Ref<XQueryProlog> emptyProlog() {
  return XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
}

Ref<XQueryExpr> literal(Value value) {
  return XQueryLiteral::literalWithValue(std::move(value));
}

std::string evaluateExpr(const XQueryExpr& expr) {
  return outcome([&](XQueryContext& context) { return evaluatedOrThrown(expr, context); });
}

TEST(OperatorClassification, EveryCodeHasItsClass) {
  const std::vector<int> classes = {1, 1, 2, 2, 2, 2, 2, 2, 4, 4, 4, 3, 6, 6,
                                    6, 6, 6, 6, 5, 5, 5, 5, 5, 5, 7, 7, 7};
  for (int code = 1; code <= 27; ++code) {
    EXPECT_EQ(XQueryOperatorExpr::operatorClassification(code), classes[code - 1]) << code;
  }
}

TEST(OperatorClassification, OtherCodesHaveClassZero) {
  for (const int code : {-1, 0, 28, 1000}) {
    EXPECT_EQ(XQueryOperatorExpr::operatorClassification(code), 0) << code;
  }
}

TEST(OperatorClassification, GeneralCodePlusSixIsTheValueCode) {
  EXPECT_EQ(XQueryOperatorEqual + 6, XQueryOperatorEq);
  EXPECT_EQ(XQueryOperatorNotEqual + 6, XQueryOperatorNe);
  EXPECT_EQ(XQueryOperatorLess + 6, XQueryOperatorLt);
  EXPECT_EQ(XQueryOperatorLessEqual + 6, XQueryOperatorLe);
  EXPECT_EQ(XQueryOperatorGreater + 6, XQueryOperatorGt);
  EXPECT_EQ(XQueryOperatorGreaterEqual + 6, XQueryOperatorGe);
}

TEST(OperatorDispatch, AnUnknownCodeIsAnInvalidOperator) {
  EXPECT_EQ(evaluate(0, integer(1), integer(1)), invalidOperands);
  EXPECT_EQ(evaluate(28, integer(1), integer(1)), invalidOperands);
}

TEST(OperatorDispatch, EachClassReachesItsMethod) {
  EXPECT_EQ(evaluate(XQueryOperatorOr, boolean(false), boolean(true)), "true");
  EXPECT_EQ(evaluate(XQueryOperatorPlus, integer(1), integer(2)), "integer 3");
  EXPECT_EQ(evaluate(XQueryOperatorTo, integer(1), integer(2)), "(integer 1, integer 2)");
  EXPECT_EQ(evaluate(XQueryOperatorUnion, empty(), empty()), "()");
  EXPECT_EQ(evaluate(XQueryOperatorEq, integer(1), integer(1)), "true");
  EXPECT_EQ(evaluate(XQueryOperatorLess, integer(1), integer(2)), "true");
  EXPECT_EQ(evaluate(XQueryOperatorIs, empty(), empty()), "()");
}

TEST(OperatorDispatch, AnErrorRecordIsRaised) {
  EXPECT_EQ(evaluate(XQueryOperatorDiv, integer(1), integer(0)), divisionByZero);
}

TEST(OperatorDispatch, ErrorsOfTheClassMethodsHaveNoLine) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  EXPECT_THROW((void)XQueryOperatorExpr::evaluateOperator(XQueryOperatorPlus, string("a"),
                                                          integer(1), *context),
               NSException);
  EXPECT_EQ(_internal(*context).error()->line(), 0);
}

TEST(OperatorExpr, KeepsItsOperands) {
  const Ref<XQueryExpr> left = literal(integer(1));
  const Ref<XQueryExpr> right = literal(integer(2));
  const Ref<XQueryOperatorExpr> expr = XQueryOperatorExpr::operatorExpr(XQueryOperatorTo, right);
  EXPECT_EQ(expr->left(), nullptr);
  expr->setLeftExpr(left);
  EXPECT_EQ(expr->left(), left.get());
  EXPECT_EQ(expr->right(), right.get());
  EXPECT_EQ(expr->operatorType(), XQueryOperatorTo);
}

TEST(OperatorExpr, BindsLeftThenRight) {
  std::vector<std::string> log;
  const auto expr = binary(XQueryOperatorPlus,
                           binary(XQueryOperatorMinus, Probe::probe(integer(1), &log, "a"),
                                  Probe::probe(integer(2), &log, "b")),
                           Probe::probe(integer(3), &log, "c"));
  const Ref<XQueryProlog> prolog = emptyProlog();
  expr->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (std::vector<std::string>{"bind a", "bind b", "bind c"}));
}

TEST(OperatorExpr, EvaluatesLeftThenRight) {
  std::vector<std::string> log;
  const auto expr = binary(XQueryOperatorPlus,
                           binary(XQueryOperatorMinus, Probe::probe(integer(10), &log, "a"),
                                  Probe::probe(integer(2), &log, "b")),
                           Probe::probe(integer(3), &log, "c"));
  EXPECT_EQ(evaluateExpr(*expr), "integer 11");
  EXPECT_EQ(log, (std::vector<std::string>{"a", "b", "c"}));
}

TEST(OperatorExpr, InvalidOperandsAreReportedAtTheLineOfTheOperator) {
  const auto expr = binary(XQueryOperatorPlus, literal(string("a")), literal(integer(1)));
  expr->setExprLine(4);
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  EXPECT_THROW((void)evaluatedOrThrown(*expr, *context), NSException);
  const Ref<XQueryError>& error = _internal(*context).error();
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 6);
  EXPECT_EQ(error->msg()->utf8(), "invalid type for operator");
  EXPECT_EQ(error->line(), 5);
}

TEST(OperatorExpr, AnErrorRecordIsReportedAtTheLineOfTheOperator) {
  const auto expr = binary(XQueryOperatorDiv, literal(integer(1)), literal(integer(0)));
  expr->setExprLine(2);
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  EXPECT_THROW((void)evaluatedOrThrown(*expr, *context), NSException);
  EXPECT_EQ(_internal(*context).error()->msg()->utf8(), "Division by zero");
  EXPECT_EQ(_internal(*context).error()->line(), 3);
}

TEST(OperatorExpr, AMissingOperandValueIsInvalid) {
  const auto expr = binary(XQueryOperatorPlus, Probe::probe(Value()), literal(integer(1)));
  EXPECT_EQ(evaluateExpr(*expr), invalidOperands);
}

// --- and, or -------------------------------------------------------------------------------------

struct LogicalCase {
  int code;
  bool left, right, answer;
  int rightEvaluations;
};

TEST(Logical, TruthTableAndShortCircuit) {
  const std::vector<LogicalCase> cases = {
      {XQueryOperatorOr, false, false, false, 1},  {XQueryOperatorOr, false, true, true, 1},
      {XQueryOperatorOr, true, false, true, 0},    {XQueryOperatorOr, true, true, true, 0},
      {XQueryOperatorAnd, false, false, false, 0}, {XQueryOperatorAnd, false, true, false, 0},
      {XQueryOperatorAnd, true, false, false, 1},  {XQueryOperatorAnd, true, true, true, 1},
  };
  for (const LogicalCase& test : cases) {
    const Ref<Probe> right = Probe::probe(boolean(test.right));
    const auto expr = binary(test.code, literal(boolean(test.left)), right);
    EXPECT_EQ(evaluateExpr(*expr), test.answer ? "true" : "false");
    EXPECT_EQ(right->evaluations, test.rightEvaluations);
    EXPECT_EQ(evaluate(test.code, boolean(test.left), boolean(test.right)),
              test.answer ? "true" : "false");
  }
}

TEST(Logical, OperandsAreTakenByTheirEffectiveBooleanValue) {
  const auto both = [](Value left, Value right) {
    return evaluateExpr(*binary(XQueryOperatorAnd, literal(left), literal(right)));
  };
  EXPECT_EQ(both(string("x"), integer(1)), "true");
  EXPECT_EQ(both(string(""), integer(1)), "false");
  EXPECT_EQ(both(integer(1), empty()), "false");
  EXPECT_EQ(both(integer(1), nan()), "false");
  EXPECT_EQ(both(sequence({boolean(false), boolean(false)}), integer(2)), "true");
}

TEST(Logical, AnEmptyComparisonCountsAsFalse) {
  const auto comparison = binary(XQueryOperatorEqual, literal(empty()), literal(integer(1)));
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorOr, comparison, literal(boolean(false)))), "false");
}

TEST(Logical, AFailingRightOperandIsNotReachedWhenTheLeftDecides) {
  const auto failing = [] {
    return binary(XQueryOperatorPlus, literal(string("a")), literal(integer(1)));
  };
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorOr, literal(boolean(true)), failing())), "true");
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorAnd, literal(boolean(false)), failing())), "false");
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorOr, literal(boolean(false)), failing())),
            invalidOperands);
}

TEST(Logical, AChainStopsEvaluatingAtTheDecidingOperand) {
  const Ref<Probe> second = Probe::probe(boolean(true));
  const Ref<Probe> third = Probe::probe(boolean(true));
  const auto chain =
      binary(XQueryOperatorAnd, binary(XQueryOperatorAnd, literal(boolean(false)), second), third);
  EXPECT_EQ(evaluateExpr(*chain), "false");
  EXPECT_EQ(second->evaluations + third->evaluations, 0);
}

// --- comparing with a range ----------------------------------------------------------------------

Ref<XQueryOperatorExpr> range(Value first, Value last) {
  return binary(XQueryOperatorTo, literal(std::move(first)), literal(std::move(last)));
}

TEST(ComparisonWithRange, MakesNoIntegers) {
  // As a sequence it would be refused for its length.
  const auto all = [] { return range(integer(-4'000'000'000'000), integer(4'000'000'000'000)); };
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorEqual, literal(integer(5)), all())), "true");
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorEqual, literal(number(5.5)), all())), "false");
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorEqual, literal(untyped("5")), all())), "true");
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorEqual, literal(decimal("5")), all())),
            "error 0 limit: range of too many items");
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorEqual, literal(empty()), all())), "()");
  auto parentheses = XQueryExprList::exprList();
  parentheses->addObject(all());
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorLess, literal(integer(5)), parentheses)), "true");
}

TEST(ComparisonWithRange, EvaluatesLeftThenTheBounds) {
  std::vector<std::string> log;
  const auto bounds = binary(XQueryOperatorTo, Probe::probe(integer(1), &log, "b"),
                             Probe::probe(integer(3), &log, "c"));
  const auto expr = binary(XQueryOperatorEqual, Probe::probe(integer(2), &log, "a"), bounds);
  EXPECT_EQ(evaluateExpr(*expr), "true");
  EXPECT_EQ(log, (std::vector<std::string>{"a", "b", "c"}));
}

TEST(ComparisonWithRange, AnEmptyRangeGivesTheEmptySequence) {
  EXPECT_EQ(evaluateExpr(
                *binary(XQueryOperatorEqual, literal(integer(5)), range(integer(5), integer(3)))),
            "()");
  EXPECT_EQ(
      evaluateExpr(*binary(XQueryOperatorEqual, literal(integer(5)), range(empty(), integer(3)))),
      "()");
  EXPECT_EQ(
      evaluateExpr(*binary(XQueryOperatorEqual, literal(empty()), range(integer(1), integer(3)))),
      "()");
}

TEST(ComparisonWithRange, BadBoundsFailAtTheLineOfTheRange) {
  const auto bounds = range(Value(), integer(3));
  bounds->setExprLine(7);
  const auto expr = binary(XQueryOperatorEqual, literal(integer(5)), bounds);
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  EXPECT_THROW((void)evaluatedOrThrown(*expr, *context), NSException);
  EXPECT_EQ(_internal(*context).error()->msg()->utf8(), "invalid type for operator");
  EXPECT_EQ(_internal(*context).error()->line(), 8);
}

TEST(ComparisonWithRange, AnItemThatCannotBeAtomizedFailsBeforeAnyPairAnswers) {
  const Value items = sequence({integer(2), XQueryError::error(6, "made up")});
  EXPECT_EQ(
      evaluateExpr(*binary(XQueryOperatorEqual, literal(items), range(integer(1), integer(3)))),
      "error 6 invalid type");
}

TEST(OperatorDispatch, ACodeOfAnotherClassIsNoGeneralComparison) {
  for (const int code : {-5, 0, 12, 19, 25, 1000}) {
    EXPECT_EQ(outcome([&](XQueryContext& context) {
                return XQueryOperatorExpr::generalComparisonOperatorEvaluate(code, integer(1),
                                                                             integer(1), context);
              }),
              "null")
        << code;
  }
}

// --- signs and absent operands -------------------------------------------------------------------

TEST(Sign, PlusAndMinusWithoutALeftOperandAreSigns) {
  EXPECT_EQ(
      evaluateExpr(*XQueryOperatorExpr::operatorExpr(XQueryOperatorMinus, literal(integer(5)))),
      "integer -5");
  EXPECT_EQ(
      evaluateExpr(*XQueryOperatorExpr::operatorExpr(XQueryOperatorPlus, literal(untyped("5")))),
      "double 5");
}

TEST(Sign, ASignMayHeadAChain) {
  const auto minusFive = XQueryOperatorExpr::operatorExpr(XQueryOperatorMinus, literal(integer(5)));
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorPlus, minusFive, literal(integer(2)))),
            "integer -3");
}

TEST(AbsentOperand, CountsAsTheEmptySequence) {
  // A left operand set to nothing is a binary operator's, not a sign's.
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorMinus, nullptr, literal(integer(5)))), "()");
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorPlus, literal(integer(5)), nullptr)), "()");
  EXPECT_EQ(evaluateExpr(*XQueryOperatorExpr::operatorExpr(XQueryOperatorMinus, nullptr)), "()");
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorEqual, nullptr, nullptr)), "()");
  EXPECT_EQ(evaluateExpr(*binary(XQueryOperatorOr, nullptr, literal(boolean(true)))), "true");
}

TEST(AbsentOperand, AnOperatorWhoseLeftWasNeverSetReadsItAsEmpty) {
  const auto expr = XQueryOperatorExpr::operatorExpr(XQueryOperatorMultiply, literal(integer(5)));
  EXPECT_EQ(evaluateExpr(*expr), "()");
}

// --- depth ---------------------------------------------------------------------------------------

TEST(Depth, AChainOfAMillionOperatorsIsEvaluatedAndBound) {
  Ref<XQueryExpr> expr = literal(integer(0));
  const Ref<XQueryExpr> one = literal(integer(1));
  for (int count = 0; count < 1'000'000; ++count) expr = binary(XQueryOperatorPlus, expr, one);
  const Ref<XQueryProlog> prolog = emptyProlog();
  expr->bindInfoForProlog(*prolog);
  EXPECT_TRUE(prolog->errors().empty());
  EXPECT_EQ(evaluateExpr(*expr), "integer 1000000");
}

TEST(Depth, AMillionNestedRightOperandsEndInAnError) {
  Ref<XQueryExpr> expr = literal(integer(0));
  const Ref<XQueryExpr> one = literal(integer(1));
  for (int count = 0; count < 1'000'000; ++count) expr = binary(XQueryOperatorPlus, one, expr);
  const Ref<XQueryProlog> prolog = emptyProlog();
  expr->bindInfoForProlog(*prolog);
  EXPECT_EQ(prolog->errors().size(), 1U);
  EXPECT_EQ(evaluateExpr(*expr), "error 0 limit: expression nested too deeply");
}

TEST(Depth, AThousandNestedRightOperandsAreEvaluated) {
  Ref<XQueryExpr> expr = literal(integer(0));
  const Ref<XQueryExpr> one = literal(integer(1));
  for (int count = 0; count < 1'000; ++count) expr = binary(XQueryOperatorPlus, one, expr);
  EXPECT_EQ(evaluateExpr(*expr), "integer 1000");
}

}  // namespace
}  // namespace xquery
