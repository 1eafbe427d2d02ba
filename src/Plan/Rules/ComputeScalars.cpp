// Arithmetic, comparisons and logic over single numbers.
//
// Pattern     an operator of arithmetic, a value or general comparison, "and", "or", not() and
//             calls of functions of numbers over others of these, local variables, ".", position(),
//             last() and numbers; arithmetic of one operator alone gains nothing
// Facts       of a variable and of ".": it may be a number, or untyped in arithmetic; compared, it
//             or what it is compared with is surely one; and no other rule has put something in the
//             place of a part
// Operator    XQueryScalarExpr
// Why         looking at variables and the focus cannot fail and leaves nothing behind, so that the
//             expression can still be evaluated as a whole wherever machine numbers do not tell
#include "Expr/Clauses/XQueryConditional.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/Boolean.h"
#include "Functions/Context.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryScalarBody.h"
#include "Plan/Operators/XQueryScalarExpr.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PlaceInside.h"
#include "Types/XQueryNumericOperand.h"

#include <optional>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using Steps = XQueryScalarSteps;
using StepKind = XQueryScalarSteps::Kind;
using Added = std::optional<Steps::Index>;

// What an operand is for; the other side of a comparison may be known to be a number.
enum class Use : uint8_t { Arithmetic, Comparison, ComparisonWithNumber, Logic, Argument };

// The classes of operators, as XQueryOperatorExpr::operatorClassification numbers them.
constexpr int logicalClass = 1, arithmeticClass = 2, valueClass = 5, generalClass = 6;

class Compiler {
 public:
  explicit Compiler(const XQueryPlanning& planning)
      : _planning(planning), _program(planning.program) {}

  // The steps that the place comes to, where computing them gains something.
  std::optional<Steps> stepsAt(XQueryPlaceID place) {
    if (!addOperation(place, 0)) return std::nullopt;
    const StepKind last = _steps[_steps.count() - 1].kind;
    if (last == StepKind::Arithmetic && _operations < 2) return std::nullopt;
    return std::move(_steps);
  }

 private:
  Added addOperand(XQueryPlaceID place, Use use, int level) {
    place = XQueryPlaceInside(_program, place);
    if (place == XQueryNoPlace || _steps.count() + 1 >= Steps::mostSteps) return std::nullopt;
    const Ref<XQueryExpr> expr = _planning.exprAt(place);
    if (const auto* literal = dyn_cast<XQueryLiteral>(expr.get())) return addLiteral(*literal, use);
    if (expr.get() != _program[place].expr) return std::nullopt;
    if (const Added leaf = addLeaf(place, *expr, use)) return leaf;
    if (const Added call = addCall(place, level)) return call;
    return use != Use::Logic && isTruth(*expr) ? std::nullopt : addOperation(place, level);
  }

  Added addLiteral(const XQueryLiteral& literal, Use use) {
    if (use == Use::Logic || !literal.literalValue()) return std::nullopt;
    Steps::Step step;
    if (use == Use::Argument) {
      // A function may answer an argument, and which object that is can be told.
      step.constant = XQueryScalar::ofObject(literal.literalValue().get());
      _steps.hold(literal.literalValue());
      return _steps.add(step);
    }
    const auto number = XQueryNumericOperand::of(literal.literalValue().get(), false);
    if (number.form == XQueryNumericOperand::Double) {
      step.constant = XQueryScalar::ofDouble(number.number);
    } else if (number.form == XQueryNumericOperand::Exact && number.isInteger &&
               number.exact->isSmallInteger()) {
      step.constant = XQueryScalar::ofInteger(number.exact->smallInteger());
    } else if (number.form == XQueryNumericOperand::Exact) {
      step.constant = XQueryScalar::ofObject(literal.literalValue().get());
      _steps.hold(literal.literalValue());
    } else {
      return std::nullopt;
    }
    return _steps.add(step);
  }

  Added addLeaf(XQueryPlaceID place, const XQueryExpr& expr, Use use) {
    Steps::Step step;
    if (const auto* call = dyn_cast<XQueryFunctionCall>(&expr)) {
      const bool isBare = call->builtIn() && (!call->args() || call->args()->count() == 0);
      if (!isBare || (call->function() != fn_position && call->function() != fn_last)) {
        return std::nullopt;
      }
      step.kind = call->function() == fn_position ? StepKind::Position : StepKind::Last;
      return _steps.add(step);
    }
    const auto* variable = dyn_cast<XQueryVariable>(&expr);
    if (use == Use::Logic || (!variable && !isa<XQueryContextItem>(&expr))) return std::nullopt;
    if (variable && variable->varID() <= 0) return std::nullopt;
    const XQueryFacts& facts = _planning.facts[place];
    if (!fits(facts, use)) return std::nullopt;
    step.kind = variable ? StepKind::Variable : StepKind::ContextItem;
    step.varID = variable ? variable->varID() : 0;
    return _steps.add(step);
  }

  // Of a declared function that is computed so, with operands that may be what it takes. Where it
  // is called by another one of these, that one has not been able to compute with what it was
  // given.
  Added addCall(XQueryPlaceID place, int level) {
    const auto* call = dyn_cast<XQueryFunctionCall>(_program[place].expr);
    if (!call || call->builtIn() || !call->hasBody()) return std::nullopt;
    const XQueryFunctionDecl* caller = _program.bodyOf(place).function;
    if (caller && bodyOf(*caller)) return std::nullopt;
    const XQueryScalarBody* body = bodyOf(*call->functionDecl());
    if (!body) return std::nullopt;
    std::vector<Steps::Index> operands;
    const XQueryPlaceID list = _program.part(place, XQueryRole::Arguments);
    for (XQueryPlaceID each = list == XQueryNoPlace ? list : _program.firstPart(list);
         each != XQueryNoPlace; each = _program.nextPart(each)) {
      const Added added = addOperand(each, Use::Argument, level + 1);
      if (!added) return std::nullopt;
      operands.push_back(*added);
    }
    Steps::Step step;
    step.kind = StepKind::Call;
    step.code = static_cast<uint8_t>(operands.size());
    step.left = _steps.addOperands(operands);
    step.body = body;
    return _steps.add(step);
  }

  const XQueryScalarBody* bodyOf(const XQueryFunctionDecl& function) const {
    const XQueryProgramBody* body = _program.bodyOfFunction(&function);
    if (!body || body->place == XQueryNoPlace) return nullptr;
    const Ref<XQueryExpr> expr = _planning.exprAt(XQueryPlaceInside(_program, body->place));
    const auto* planned = dyn_cast<XQueryPlannedExpr>(expr.get());
    return planned ? planned->scalarBody() : nullptr;
  }

  static bool fits(const XQueryFacts& facts, Use use) {
    constexpr auto numbers = XQueryItems::AnyDecimal | XQueryItems::Double;
    if (use == Use::Comparison) return facts.are(XQueryItems::Numeric) && facts.mayBe(numbers);
    if (use == Use::Argument) return true;
    if (use == Use::ComparisonWithNumber) return facts.mayBe(numbers);
    return facts.mayBe(numbers | XQueryItems::Untyped | XQueryItems::Node);
  }

  // Of a comparison of these two.
  Use useIn(XQueryPlaceID left, XQueryPlaceID right) const {
    const bool isNumber = _planning.facts[left].are(XQueryItems::Numeric) ||
                          _planning.facts[right].are(XQueryItems::Numeric);
    return isNumber ? Use::ComparisonWithNumber : Use::Comparison;
  }

  static bool isTruth(const XQueryExpr& expr) {
    const auto* operation = dyn_cast<XQueryOperatorExpr>(&expr);
    return !operation ||
           XQueryOperatorExpr::operatorClassification(operation->operatorType()) != arithmeticClass;
  }

  Added addOperation(XQueryPlaceID place, int level) {
    constexpr int mostLevels = 16;
    if (level > mostLevels) return std::nullopt;
    const Ref<XQueryExpr> expr = _planning.exprAt(place);
    if (const Added called = addCall(place, level)) return called;
    if (const auto* call = dyn_cast<XQueryFunctionCall>(expr.get())) {
      const bool isNot = call->builtIn() && call->function() == fn_not && call->args() &&
                         call->args()->count() == 1;
      const XQueryPlaceID list = _program.firstPart(place);
      if (!isNot || list == XQueryNoPlace) return std::nullopt;
      return addOf(StepKind::Not, 0, {}, _program.firstPart(list), Use::Logic, level);
    }
    const auto* operation = dyn_cast<XQueryOperatorExpr>(expr.get());
    if (!operation) return std::nullopt;
    const XQueryPlaceID first = _program.firstPart(place);
    if (first == XQueryNoPlace) return std::nullopt;
    const XQueryPlaceID second = _program.nextPart(first);
    const int type = operation->operatorType();
    const auto code = static_cast<uint8_t>(type);
    if (second == XQueryNoPlace && !operation->isSign()) return std::nullopt;
    switch (XQueryOperatorExpr::operatorClassification(type)) {
      case logicalClass: {
        const auto kind = type == XQueryOperatorAnd ? StepKind::And : StepKind::Or;
        return addOf(kind, 0, first, second, Use::Logic, level);
      }
      case arithmeticClass:
        return operation->isSign()
                   ? addSign(code, first, level)
                   : addOf(StepKind::Arithmetic, code, first, second, Use::Arithmetic, level);
      case valueClass:
        return addOf(StepKind::Comparison, code, first, second, useIn(first, second), level);
      case generalClass: {
        constexpr int distance = XQueryOperatorEq - XQueryOperatorEqual;
        return addOf(StepKind::Comparison, static_cast<uint8_t>(type + distance), first, second,
                     useIn(first, second), level);
      }
      default:
        return std::nullopt;
    }
  }

  // A sign adds to nothing, or takes from it.
  Added addSign(uint8_t code, XQueryPlaceID operand, int level) {
    Steps::Step step{StepKind::Arithmetic, code};
    Steps::Step nothing;
    nothing.constant = XQueryScalar::ofInteger(0);
    step.left = _steps.add(nothing);
    return addWith(step, operand, Use::Arithmetic, level);
  }

  Added addOf(StepKind kind, uint8_t code, std::optional<XQueryPlaceID> left, XQueryPlaceID right,
              Use use, int level) {
    Steps::Step step{kind, code};
    if (left) {
      const Added added = addOperand(*left, use, level + 1);
      if (!added) return added;
      step.left = *added;
    }
    return addWith(step, right, use, level);
  }

  Added addWith(Steps::Step step, XQueryPlaceID right, Use use, int level) {
    const Added added = addOperand(right, use, level + 1);
    if (!added) return added;
    step.right = *added;
    ++_operations;
    return _steps.add(step);
  }

  const XQueryPlanning& _planning;
  const XQueryProgram& _program;
  Steps _steps;
  int _operations = 0;
};

// Where it is a condition, nobody asks for the truth value as an object.
void tellTruth(const XQueryProgram& program, XQueryPlaceID place, const XQueryTruthTeller& teller) {
  place = XQueryPlaceAround(program, place);
  const XQueryPlace& here = program[place];
  if (here.role == XQueryRole::Test) {
    if (auto* conditional = dyn_cast<XQueryConditionalExpr>(program[here.parent].expr)) {
      conditional->setTeller(&teller);
    }
  } else if (here.role == XQueryRole::Where) {
    if (auto* flwor = dyn_cast<XQueryFLWORExpr>(program[here.parent].expr)) {
      flwor->setTeller(&teller);
    }
  }
}

}  // namespace

void XQueryComputeScalars(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  // Wholes stand before their parts, which are done with them.
  std::vector<bool> areDone(program.placeCount());
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const XQueryPlaceID whole = program[place].parent;
    areDone[place] = whole != XQueryNoPlace && areDone[whole];
    if (areDone[place] || !planning.isOpen(place)) continue;
    if (planning.exprAt(place).get() != program[place].expr) continue;
    auto steps = Compiler(planning).stepsAt(place);
    if (!steps) continue;
    areDone[place] = true;
    const auto scalar = XQueryScalarExpr::exprWithPlain(planning.exprAt(place), std::move(*steps));
    planning.wrap(place, scalar);
    tellTruth(program, place, *scalar);
  }
}

}  // namespace xquery
