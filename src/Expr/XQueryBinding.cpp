#include "Expr/XQueryBinding.h"

#include "Expr/XQueryParts.h"
#include "Prolog/XQueryProlog.h"
#include "xquery/Collection.h"

namespace xquery {

int64_t XQueryDeclareLocalVariable(const Ref<NSString>& name, XQueryProlog& prolog) {
  if (!name || name->length() == 0) return 0;
  const auto qName = prolog.variableQNameFromString(name);
  return qName ? prolog.newLocalVariableIDForQName(qName) : 0;
}

Value XQueryBindingExpr::computeValue(XQueryContext& context) const {
  return XQueryEvaluateOrEmpty(_expr.get(), context);
}

void XQueryBindingExpr::visitParts(XQueryPartVisitor& visitor) {
  visitor.ownPart(_type.get(), XQueryRole::Type);
  visitor.part(_expr, XQueryRole::Bound);
}

void XQueryBindingExpr::bindType(XQueryProlog& prolog) {
  if (_type) _type->bindInfoForProlog(prolog);
}

void XQueryBindingExpr::bindExpr(XQueryProlog& prolog) {
  if (_expr) _expr->bindInfoForProlog(prolog);
}

}  // namespace xquery
