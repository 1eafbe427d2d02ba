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

Value XQueryConditionalExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  const XQueryExpr* branch = nullptr;
  if (!chooseBranch(branch, context)) return {};
  Value value = XQueryEvaluateOrEmpty(branch, context);
  if (!value && !context._internal().isFailing()) failConversion(context);
  return value;
}

// False for a test that has failed. What it needs of the stack is no part of a recursion's frames.
bool XQueryConditionalExpr::chooseBranch(const XQueryExpr*& branch, XQueryContext& context) const {
  const Value test = XQueryEvaluateOrEmpty(_test.get(), context);
  if (XQueryHasFailed(test, context)) return false;
  const Value truth = XQueryEffectiveBooleanValue(test, context);
  if (truth == NSNumber::trueValue()) {
    branch = _then.get();
  } else if (truth == NSNumber::falseValue()) {
    branch = _else.get();
  } else {
    failConversion(context);
    return false;
  }
  return true;
}

void XQueryConditionalExpr::failConversion(XQueryContext& context) const {
  context._internal().fail(XQueryErrors::invalidConversion.errorAtLine(exprLine()));
}

}  // namespace xquery
