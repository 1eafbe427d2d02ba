#include "Expr/TypeTests/XQueryTypeExprs.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryBinding.h"
#include "Expr/XQuerySequence.h"
#include "Types/XQueryErrors.h"
#include "xquery/Number.h"

namespace xquery {

void XQueryTypedExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  _type->bindInfoForProlog(prolog);
  if (_expr) _expr->bindInfoForProlog(prolog);
}

Value XQueryTypedExpr::operand(XQueryContext& context) const {
  XQueryCheckStack(context);
  return XQueryEvaluateOrEmpty(_expr.get(), context);
}

Ref<XQueryInstanceOfExpr> XQueryInstanceOfExpr::instanceOfExpr(Ref<XQueryExpr> expr,
                                                               Ref<XQueryTypeDeclaration> forType) {
  return make<XQueryInstanceOfExpr>(std::move(expr), std::move(forType));
}

Value XQueryInstanceOfExpr::object(const Value& object, const XQueryTypeDeclaration& instanceOf,
                                   XQueryContext* forContext) {
  return NSNumber::numberWithBool(XQueryInstanceOf(object.get(), instanceOf, forContext));
}

Value XQueryInstanceOfExpr::evaluateWithContext(XQueryContext& context) const {
  return object(operand(context), *_type, &context);
}

Ref<XQueryTreatExpr> XQueryTreatExpr::treatExpr(Ref<XQueryExpr> expr,
                                                Ref<XQueryTypeDeclaration> asType) {
  return make<XQueryTreatExpr>(std::move(expr), std::move(asType));
}

Value XQueryTreatExpr::evaluateWithContext(XQueryContext& context) const {
  return object(operand(context), *_type, context);
}

Ref<XQueryCastExpr> XQueryCastExpr::castExpr(Ref<XQueryExpr> expr,
                                             Ref<XQueryTypeDeclaration> asType) {
  return make<XQueryCastExpr>(std::move(expr), std::move(asType));
}

Value XQueryCastExpr::evaluateWithContext(XQueryContext& context) const {
  const Value value = operand(context);
  Value result;
  if (_type->type() == XQueryTypeDeclaration::Atomic) {
    const bool allowEmpty = _type->occuranceType() == XQueryTypeDeclaration::ZeroOrOne;
    result = castObject(value, _type->typeID(), context, allowEmpty);
  }
  if (!result) context._internal().raise(XQueryErrors::invalidConversion.errorAtLine(exprLine()));
  return result;
}

Ref<XQueryCastableExpr> XQueryCastableExpr::castableExpr(Ref<XQueryExpr> expr,
                                                         Ref<XQueryTypeDeclaration> asType) {
  return make<XQueryCastableExpr>(std::move(expr), std::move(asType));
}

Value XQueryCastableExpr::evaluateWithContext(XQueryContext& context) const {
  auto& dynamic = context._internal();
  const Value value = normalised(operand(context));
  // Several items are an error here, not merely not castable.
  if (_type->type() != XQueryTypeDeclaration::Atomic || isa<NSArray>(value)) {
    dynamic.raise(XQueryErrors::invalidConversion.errorAtLine(exprLine()));
  }
  try {
    const Value cast = XQueryCastExpr::castObject(value, _type->typeID(), context, true);
    return XQueryInstanceOfExpr::object(cast, *_type, &context);
  } catch (const NSException&) {
    if (XQueryIsLimit(dynamic.error().get())) throw;
    dynamic.setError(nullptr, false);
    return NSNumber::falseValue();
  }
}

}  // namespace xquery
