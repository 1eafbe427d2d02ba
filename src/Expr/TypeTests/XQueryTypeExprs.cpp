#include "Expr/TypeTests/XQueryTypeExprs.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryBinding.h"
#include "Expr/XQueryParts.h"
#include "Expr/XQuerySequence.h"
#include "Types/XQueryErrors.h"
#include "xquery/Exception.h"
#include "xquery/Number.h"

namespace xquery {

void XQueryTypedExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  _type->bindInfoForProlog(prolog);
  if (_expr) _expr->bindInfoForProlog(prolog);
}

void XQueryTypedExpr::visitParts(XQueryPartVisitor& visitor) {
  visitor.ownPart(_type.get(), XQueryRole::Type);
  visitor.part(_expr, XQueryRole::Operand);
}

Value XQueryTypedExpr::operand(XQueryContext& context) const {
  XQueryCheckStack(context);
  return XQueryEvaluateOrEmpty(_expr.get(), context);
}

Ref<XQueryInstanceOfExpr> XQueryInstanceOfExpr::instanceOfExpr(Ref<XQueryExpr> expr,
                                                               Ref<XQueryTypeDeclaration> forType) {
  return make<XQueryInstanceOfExpr>(Kind::InstanceOfExpr, std::move(expr), std::move(forType));
}

Value XQueryInstanceOfExpr::object(const Value& object, const XQueryTypeDeclaration& instanceOf,
                                   XQueryContext* forContext) {
  return NSNumber::numberWithBool(XQueryInstanceOf(object.get(), instanceOf, forContext));
}

Value XQueryInstanceOfExpr::computeValue(XQueryContext& context) const {
  const Value value = operand(context);
  if (XQueryHasFailed(value, context)) return {};
  return object(value, *_type, &context);
}

Ref<XQueryTreatExpr> XQueryTreatExpr::treatExpr(Ref<XQueryExpr> expr,
                                                Ref<XQueryTypeDeclaration> asType) {
  return make<XQueryTreatExpr>(Kind::TreatExpr, std::move(expr), std::move(asType));
}

void XQueryTreatExpr::visitParts(XQueryPartVisitor& visitor) {
  visitor.ownPart(_type.get(), XQueryRole::Type);
  visitor.part(_expr, XQueryRole::Element);
}

Value XQueryTreatExpr::computeValue(XQueryContext& context) const {
  const Value value = operand(context);
  if (XQueryHasFailed(value, context)) return {};
  return object(value, *_type, context);
}

Ref<XQueryCastExpr> XQueryCastExpr::castExpr(Ref<XQueryExpr> expr,
                                             Ref<XQueryTypeDeclaration> asType) {
  return make<XQueryCastExpr>(Kind::CastExpr, std::move(expr), std::move(asType));
}

Value XQueryCastExpr::computeValue(XQueryContext& context) const {
  const Value value = operand(context);
  if (XQueryHasFailed(value, context)) return {};
  Value result;
  if (_type->type() == XQueryTypeDeclaration::Atomic) {
    const bool allowEmpty = _type->occuranceType() == XQueryTypeDeclaration::ZeroOrOne;
    result = castObject(value, _type->typeID(), context, allowEmpty);
  }
  if (result) return result;
  return _internal(context).fail(XQueryErrors::invalidConversion.errorAtLine(exprLine()),
                                 exprPlace());
}

Ref<XQueryCastableExpr> XQueryCastableExpr::castableExpr(Ref<XQueryExpr> expr,
                                                         Ref<XQueryTypeDeclaration> asType) {
  return make<XQueryCastableExpr>(Kind::CastableExpr, std::move(expr), std::move(asType));
}

Value XQueryCastableExpr::computeValue(XQueryContext& context) const {
  auto& dynamic = _internal(context);
  const Value value = normalised(operand(context));
  if (XQueryHasFailed(value, context)) return {};
  // Several items are an error here, not merely not castable.
  if (_type->type() != XQueryTypeDeclaration::Atomic || isa<NSArray>(value)) {
    return dynamic.fail(XQueryErrors::invalidConversion.errorAtLine(exprLine()), exprPlace());
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
