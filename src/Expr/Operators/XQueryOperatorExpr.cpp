#include "Expr/Operators/XQueryOperatorExpr.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/BorrowedValue.h"
#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryComparison.h"
#include "Expr/Operators/XQueryRange.h"
#include "Expr/XQueryAsking.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Expr/XQueryParts.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryErrors.h"
#include "xquery/Collection.h"

#include <array>
#include <cstddef>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

enum OperatorClass : int {
  NoClass = 0,
  Logical = 1,
  Arithmetic = 2,
  Range = 3,
  Sequence = 4,
  ValueComparison = 5,
  GeneralComparison = 6,
  NodeComparison = 7,
};

constexpr int firstCode = XQueryOperatorOr;
constexpr int lastCode = XQueryOperatorAfter;

// Indexed by operator code.
constexpr std::array<OperatorClass, lastCode + 1> classes = {
    NoClass,
    Logical,            // or
    Logical,            // and
    Arithmetic,         // +
    Arithmetic,         // -
    Arithmetic,         // *
    Arithmetic,         // div
    Arithmetic,         // idiv
    Arithmetic,         // mod
    Sequence,           // union
    Sequence,           // intersect
    Sequence,           // except
    Range,              // to
    GeneralComparison,  // =
    GeneralComparison,  // !=
    GeneralComparison,  // <
    GeneralComparison,  // <=
    GeneralComparison,  // >
    GeneralComparison,  // >=
    ValueComparison,    // eq
    ValueComparison,    // ne
    ValueComparison,    // lt
    ValueComparison,    // le
    ValueComparison,    // gt
    ValueComparison,    // ge
    NodeComparison,     // is
    NodeComparison,     // <<
    NodeComparison,     // >>
};

using Evaluate = Value (*)(int, const Value&, const Value&, XQueryContext&);

// Indexed by operator class.
constexpr std::array<Evaluate, NodeComparison + 1> evaluators = {
    nullptr,
    XQueryOperatorExpr::logicalOperatorEvaluate,
    XQueryOperatorExpr::arithmeticOperatorEvaluate,
    XQueryOperatorExpr::rangeOperatorEvaluate,
    XQueryOperatorExpr::sequenceOperatorEvaluate,
    XQueryOperatorExpr::valueComparisonOperatorEvaluate,
    XQueryOperatorExpr::generalComparisonOperatorEvaluate,
    XQueryOperatorExpr::nodeComparisonOperatorEvaluate,
};

Value dispatch(int type, const Value& left, const Value& right, XQueryContext& context) {
  const Evaluate evaluate = evaluators[XQueryOperatorExpr::operatorClassification(type)];
  return evaluate ? evaluate(type, left, right, context) : Value();
}

// What invalid operands (null) and an error record come to for the expression at `line`; a negative
// line is none.
[[gnu::cold]] Ref<XQueryError> errorFor(const Value& answer, int64_t line) {
  const auto* record = dyn_cast<XQueryError>(answer.get());
  constexpr auto& invalid = XQueryErrors::invalidOperand;
  if (!record) return line < 0 ? invalid.error() : invalid.errorAtLine(line);
  if (line < 0) return XQueryError::error(record->category(), record->err(), record->msg());
  return XQueryError::error(record->category(), record->err(), record->msg(), line);
}

bool isFailure(const Value& answer) {
  return !answer || answer->kind() == Kind::QueryError;
}

// The operators along the left side of a chain such as "1 + 2 + 3", outermost first. Walking them
// in a loop makes the length of a chain a matter of memory, not of stack.
template <class Node>
class LeftSpine {
 public:
  explicit LeftSpine(Node* top) {
    for (Node* node = top; node; node = dyn_cast<XQueryOperatorExpr>(node->left())) push(node);
  }
  size_t count() const { return _count; }
  // 0 is the outermost.
  Node* operator[](size_t index) const {
    return index < inlineCount ? _inline[index] : _rest[index - inlineCount];
  }

 private:
  // Chains longer than this are rare enough to pay for a vector.
  static constexpr size_t inlineCount = 8;

  void push(Node* node) {
    if (_count < inlineCount) {
      _inline[_count] = node;
    } else {
      _rest.push_back(node);
    }
    ++_count;
  }

  std::array<Node*, inlineCount> _inline;
  std::vector<Node*> _rest;
  size_t _count = 0;
};

Ref<XQueryExpr> presentOrEmpty(Ref<XQueryExpr> operand) {
  if (operand) return operand;
  return XQueryLiteral::literalWithValue(NSNull::null());
}

}  // namespace

Ref<XQueryOperatorExpr> XQueryOperatorExpr::operatorExpr(int type, Ref<XQueryExpr> withRightExpr) {
  return make<XQueryOperatorExpr>(type, presentOrEmpty(std::move(withRightExpr)));
}

void XQueryOperatorExpr::setLeftExpr(Ref<XQueryExpr> left) {
  _left = presentOrEmpty(std::move(left));
}

void XQueryOperatorExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  const LeftSpine<XQueryOperatorExpr> spine(this);
  XQueryExpr* innermost = spine[spine.count() - 1]->left();
  if (innermost) innermost->bindInfoForProlog(prolog);
  for (size_t index = spine.count(); index-- > 0;) {
    spine[index]->_right->bindInfoForProlog(prolog);
  }
}

void XQueryOperatorExpr::visitParts(XQueryPartVisitor& visitor) {
  const bool isLogical = operatorClassification(_type) == Logical;
  visitor.part(_left, XQueryRole::Operand);
  visitor.part(_right, isLogical ? XQueryRole::LaterOperand : XQueryRole::Operand);
}

Value XQueryOperatorExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  return isa<XQueryOperatorExpr>(_left.get()) ? evaluateChain(context) : evaluateAlone(context);
}

Value XQueryOperatorExpr::evaluateChain(XQueryContext& context) const {
  const LeftSpine<const XQueryOperatorExpr> spine(this);
  size_t index = spine.count() - 1;
  // What one of them raises has arisen there and not in the last one.
  Value value =
      XQueryAsk(*spine[index], context, [&] { return spine[index]->evaluateAlone(context); });
  while (index-- > 0) {
    if (XQueryHasFailed(value, context)) return {};
    const XQueryOperatorExpr& next = *spine[index];
    value = XQueryAsk(next, context, [&] { return next.evaluateWithLeftValue(value, context); });
  }
  return value;
}

// For a left operand that is no operator.
Value XQueryOperatorExpr::evaluateAlone(XQueryContext& context) const {
  if (!_left) return evaluateWithLeftValue(Value(), context);
  if (_left->kind() == Kind::Literal || XQueryBorrowedValue::outlives(*_right)) {
    const XQueryBorrowedValue left(*_left, context);
    if (XQueryHasFailed(*left, context)) return {};
    return evaluateWithLeftValue(*left, context);
  }
  const Value left = _left->evaluateWithContext(context);
  if (XQueryHasFailed(left, context)) return {};
  return evaluateWithLeftValue(left, context);
}

Value XQueryOperatorExpr::evaluateWithLeftValue(const Value& left, XQueryContext& context) const {
  if (_type == XQueryOperatorOr || _type == XQueryOperatorAnd) {
    const bool isTrue = XQueryIsTrue(XQueryEffectiveBooleanValue(leftOrEmpty(left), context));
    if (isTrue == (_type == XQueryOperatorOr)) return NSNumber::numberWithBool(isTrue);
    const Value right = _right->evaluateWithContext(context);
    if (XQueryHasFailed(right, context)) return {};
    return XQueryEffectiveBooleanValue(right, context);
  }
  if (const XQueryOperatorExpr* range = rangeToCompareWith()) {
    return evaluateWithRange(left, *range, context);
  }
  const XQueryBorrowedValue right(*_right, context);
  if (XQueryHasFailed(*right, context)) return {};
  return answerFor(left, *right, context);
}

Value XQueryOperatorExpr::answerFor(const Value& left, const Value& right,
                                    XQueryContext& context) const {
  if (_quickly) {
    if (Value answer = _quickly(_type, left, right, context)) return answer;
  }
  Value answer = isSign() ? XQueryUnarySign(_type, right, context)
                          : dispatch(_type, leftOrEmpty(left), right, context);
  if (isFailure(answer)) return _internal(context).fail(errorFor(answer, _line), exprPlace());
  return answer;
}

const XQueryOperatorExpr* XQueryOperatorExpr::rangeToCompareWith() const {
  if (operatorClassification(_type) != GeneralComparison) return nullptr;
  return rangeIn(_right.get());
}

const XQueryOperatorExpr* XQueryOperatorExpr::rangeIn(const XQueryExpr* expr) {
  const auto* range = dyn_cast<XQueryOperatorExpr>(XQueryWithoutParentheses(expr));
  return range && range->_type == XQueryOperatorTo ? range : nullptr;
}

XQueryRangeBounds XQueryOperatorExpr::rangeBounds(XQueryContext& context) const {
  return XQueryAsk(*this, context, [&]() -> XQueryRangeBounds {
    XQueryCheckStack(context);
    const Value start = _left ? _left->evaluateWithContext(context) : Value();
    if (XQueryHasFailed(start, context)) return {};
    const Value end = _right->evaluateWithContext(context);
    if (XQueryHasFailed(end, context)) return {};
    XQueryRangeBounds bounds = XQueryRangeBoundsFrom(leftOrEmpty(start), end, context);
    if (!bounds.areIntegers && isFailure(bounds.answer)) {
      bounds.answer = _internal(context).fail(errorFor(bounds.answer, _line), exprPlace());
    }
    return bounds;
  });
}

// Comparing with a range, as in ". = 1 to 1000", asks for its bounds only, where it can.
Value XQueryOperatorExpr::evaluateWithRange(const Value& left, const XQueryOperatorExpr& range,
                                            XQueryContext& context) const {
  const XQueryRangeBounds bounds = range.rangeBounds(context);
  if (!bounds.areIntegers) {
    if (XQueryHasFailed(bounds.answer, context)) return {};
    return answerFor(left, bounds.answer, context);
  }
  Value answer = XQueryGeneralComparisonWithRange(_type, left, bounds.first, bounds.last);
  return answer ? answer : answerFor(left, XQueryRangeIntegers(bounds, context), context);
}

// A left operand that was never set is the empty sequence for every operator but the signs.
const Value& XQueryOperatorExpr::leftOrEmpty(const Value& left) const {
  static const Value empty(NSNull::null());
  return _left ? left : empty;
}

int XQueryOperatorExpr::operatorClassification(int type) {
  return type < firstCode || type > lastCode ? NoClass : classes[static_cast<size_t>(type)];
}

Value XQueryOperatorExpr::evaluateOperator(int type, const Value& withLeft, const Value& right,
                                           XQueryContext& forContext) {
  Value answer = dispatch(type, withLeft, right, forContext);
  if (isFailure(answer)) _internal(forContext).raise(errorFor(answer, -1));
  return answer;
}

Value XQueryOperatorExpr::logicalOperatorEvaluate(int type, const Value& withLeft,
                                                  const Value& right, XQueryContext& forContext) {
  const bool isTrue = XQueryIsTrue(XQueryEffectiveBooleanValue(withLeft, forContext));
  if (isTrue == (type == XQueryOperatorOr)) return NSNumber::numberWithBool(isTrue);
  return XQueryEffectiveBooleanValue(right, forContext);
}

}  // namespace xquery
