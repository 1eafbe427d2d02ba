// The value of an expression, to be looked at and not kept.
//
// A literal, a local variable and the context item have their value already, and whoever only looks
// at it needs no reference of his own, which would cost two counts of it. It is there until another
// expression is evaluated, which may set the variable or the focus.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryLeaves.h"

namespace xquery {

class XQueryBorrowedValue {
 public:
  XQueryBorrowedValue(const XQueryExpr& expr, XQueryContext& context)
      : _value(valueIn(expr, context)) {
    if (_value && *_value) return;
    _own = expr.evaluateWithContext(context);
    _value = &_own;
  }
  XQueryBorrowedValue(const XQueryBorrowedValue&) = delete;
  XQueryBorrowedValue& operator=(const XQueryBorrowedValue&) = delete;

  const Value& operator*() const { return *_value; }

  // Whether evaluating the expression leaves a borrowed value where it is.
  static bool outlives(const XQueryExpr& expr) {
    return expr.kind() == Kind::Literal || expr.kind() == Kind::Variable ||
           expr.kind() == Kind::ContextItemExpr;
  }

 private:
  static const Value* valueIn(const XQueryExpr& expr, XQueryContext& context) {
    switch (expr.kind()) {
      case Kind::Literal:
        return &cast<XQueryLiteral>(&expr)->literalValue();
      case Kind::Variable:
        return _internal(context).variableSlotForID(cast<XQueryVariable>(&expr)->varID());
      case Kind::ContextItemExpr:
        return &_internal(context).contextItem();
      default:
        return nullptr;
    }
  }

  Value _own;
  const Value* _value;
};

}  // namespace xquery
