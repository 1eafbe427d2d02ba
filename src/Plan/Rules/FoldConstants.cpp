// What consists of literals alone.
//
// Pattern     an operator (arithmetic, comparison, "and", "or", a sign), "cast as", "castable as",
//             or a constructor function, each over single literals or what has become one
// Facts       the value is not handed on: the same literal each time would be one object, and equal
//             items that are different objects can be told apart
// Operator    a literal
// Why         all of these look at their operands only, and a value of one item is all they answer;
//             what fails is left as it was written, since it may never be reached
// Bound       of what fails each part is tried again. Once that has cost so many times the program,
//             parts of what failed are left as they are
#include "Context/XQueryContextInternal.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/TypeTests/XQueryTypeExprs.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQuerySequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Platform/Base/NSLog.h"
#include "xquery/XQuery.h"

#include <vector>

namespace xquery {
namespace {

bool isSingleAtom(const Value& value) {
  return value && (XQueryKindsOfItem(*value) & XQueryItems::Atomic) != 0;
}

class Folding {
 public:
  explicit Folding(XQueryPlanning& planning)
      : _planning(planning),
        _isConstant(planning.program.placeCount()),
        _sizes(planning.program.placeCount(), 1),
        _hasFailed(planning.program.placeCount()),
        _triesLeft(mostTimes * planning.program.placeCount()) {}

  void run() {
    // Diagnostics show each error as it is made, also one that is left for later.
    if (XQueryLogEnabled()) return;
    for (const XQueryPlaceID place : _planning.program.partsFirst()) {
      _isConstant[place] = isConstant(place);
      const XQueryPlaceID whole = at(place).parent;
      if (whole != XQueryNoPlace) _sizes[whole] += _sizes[place];
    }
    // Whole ones first, so that what lies inside of them is left alone.
    for (XQueryPlaceID place = 0; place < _planning.program.placeCount(); ++place) {
      const XQueryPlaceID whole = at(place).parent;
      const bool isTriedAgain = whole != XQueryNoPlace && _hasFailed[whole];
      _hasFailed[place] = isTriedAgain;
      const Kind kind = _planning.program[place].expr->kind();
      if (!_isConstant[place] || kind == Kind::Literal || kind == Kind::ExprList ||
          kind == Kind::Args) {
        continue;
      }
      if (!_planning.isOpen(place)) continue;
      if (_planning.showsIdentity(place)) {
        _planning.refuse(place, "its value is handed on, and which object it is can be told");
      } else if (isTriedAgain && _sizes[place] > _triesLeft) {
        _planning.refuse(place, "too much of what it is part of has failed");
      } else {
        if (isTriedAgain) _triesLeft -= _sizes[place];
        fold(place);
      }
    }
  }

 private:
  const XQueryPlace& at(XQueryPlaceID place) const { return _planning.program[place]; }

  bool isConstant(XQueryPlaceID place) const {
    const XQueryExpr& expr = *at(place).expr;
    switch (expr.kind()) {
      case Kind::Literal:
        return isSingleAtom(cast<XQueryLiteral>(&expr)->literalValue());
      case Kind::ExprList:
      case Kind::Args:
        return partsAreConstant(place, 1);
      case Kind::OperatorExpr:
        return isFoldable(*cast<XQueryOperatorExpr>(&expr)) && partsAreConstant(place, 2);
      case Kind::CastExpr:
      case Kind::CastableExpr:
        return castIsFoldable(*cast<XQueryTypedExpr>(&expr)) && partsAreConstant(place, 1);
      case Kind::FunctionCall:
        return isConstructor(*cast<XQueryFunctionCall>(&expr)) && partsAreConstant(place, 1);
      default:
        return false;
    }
  }

  // One at least, and `most` at most, that are values.
  bool partsAreConstant(XQueryPlaceID whole, size_t most) const {
    size_t count = 0;
    for (XQueryPlaceID part = _planning.program.firstPart(whole); part != XQueryNoPlace;
         part = _planning.program.nextPart(part)) {
      if (XQueryTraitsOf(at(part).role).isNoValue) continue;
      if (!_isConstant[part] || ++count > most) return false;
    }
    return count > 0;
  }

  static bool isFoldable(const XQueryOperatorExpr& expr) {
    const int operatorClass = XQueryOperatorExpr::operatorClassification(expr.operatorType());
    return operatorClass == 1 || operatorClass == 2 || operatorClass == 5 || operatorClass == 6;
  }
  // A cast to a QName looks for prefixes in what is around it.
  static bool castIsFoldable(const XQueryTypedExpr& expr) {
    return expr.type().typeID() != XQueryTypeQName && expr.type().typeID() != XQueryTypeNone;
  }
  static bool isConstructor(const XQueryFunctionCall& call) {
    const XQueryBuiltInFunction* function = call.builtIn();
    if (!function) return false;
    const auto& row = function->row();
    return (row.namespaceID == XQueryNamespaceXS || row.namespaceID == XQueryNamespaceXDT) &&
           row.readsArgumentsOnly(1);
  }

  void fold(XQueryPlaceID place) {
    if (!_context) _context = XQueryContext::xqueryContext();
    const Value value = normalised(at(place).expr->evaluateWithContext(*_context));
    if (XQueryHasFailed(value, *_context)) {
      _hasFailed[place] = true;
      // What ends the compilation ends it; anything else comes up when it is reached.
      _planning.refuse(place, "it fails, which it may do only when it is reached");
      if (_internal(*_context).isFailingForGood()) _internal(*_context).throwFailure();
      _internal(*_context).passOverFailure(nullptr);
      return;
    }
    if (!isSingleAtom(value)) return;
    auto literal = XQueryLiteral::literalWithValue(value);
    literal->setExprLine(at(place).expr->exprLine());
    literal->setExprPlace(at(place).expr->exprPlace());
    _planning.replace(place, std::move(literal));
  }

  static constexpr size_t mostTimes = 64;

  XQueryPlanning& _planning;
  std::vector<bool> _isConstant;
  std::vector<size_t> _sizes;    // the number of places from each down
  std::vector<bool> _hasFailed;  // each, or something around it
  size_t _triesLeft;             // the sum of the sizes of what may be tried again
  Ref<XQueryContext> _context;   // made for the first one
};

}  // namespace

void XQueryFoldConstants(XQueryPlanning& planning) {
  Folding(planning).run();
}

}  // namespace xquery
