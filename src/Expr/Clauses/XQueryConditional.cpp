#include "Expr/Clauses/XQueryConditional.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryBinding.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryErrors.h"

namespace xquery {

Ref<XQueryConditionalExpr> XQueryConditionalExpr::condionalExpr(Ref<XQueryExpr> test,
                                                                Ref<XQueryExpr> thenExpr,
                                                                Ref<XQueryExpr> elseExpr) {
  return make<XQueryConditionalExpr>(std::move(test), std::move(thenExpr), std::move(elseExpr));
}

void XQueryConditionalExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  for (const auto& expr : {_test, _then, _else}) {
    if (expr) expr->bindInfoForProlog(prolog);
  }
}

Value XQueryConditionalExpr::evaluateWithContext(XQueryContext& context) const {
  XQueryCheckStack(context);
  const Value test =
      XQueryEffectiveBooleanValue(XQueryEvaluateOrEmpty(_test.get(), context), context);
  const XQueryExpr* branch = nullptr;
  if (test == NSNumber::trueValue()) {
    branch = _then.get();
  } else if (test == NSNumber::falseValue()) {
    branch = _else.get();
  } else {
    context._internal().raise(XQueryErrors::invalidConversion.errorAtLine(exprLine()));
  }
  Value value = XQueryEvaluateOrEmpty(branch, context);
  if (!value) context._internal().raise(XQueryErrors::invalidConversion.errorAtLine(exprLine()));
  return value;
}

}  // namespace xquery
