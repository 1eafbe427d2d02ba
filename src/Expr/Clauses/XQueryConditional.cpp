#include "Expr/Clauses/XQueryConditional.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryBinding.h"
#include "Expr/XQueryParts.h"
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

void XQueryConditionalExpr::visitParts(XQueryPartVisitor& visitor) {
  visitor.part(_test, XQueryRole::Test);
  visitor.part(_then, XQueryRole::Branch);
  visitor.part(_else, XQueryRole::Branch);
}

Value XQueryConditionalExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  const auto test = testIn(context);
  if (!test) return _internal(context).isFailing() ? Value() : failConversion(context);
  Value value = XQueryEvaluateOrEmpty(*test ? _then.get() : _else.get(), context);
  if (value || _internal(context).isFailing()) return value;
  return failConversion(context);
}

// Nothing after an error, and for a test that is neither.
inline std::optional<bool> XQueryConditionalExpr::testIn(XQueryContext& context) const {
  if (_teller) {
    if (const auto truth = _teller->truth(context)) return truth;
  }
  const Value test = XQueryEvaluateOrEmpty(_test.get(), context);
  if (XQueryHasFailed(test, context)) return std::nullopt;
  const Value truth = XQueryEffectiveBooleanValue(test, context);
  if (truth == NSNumber::trueValue()) return true;
  if (truth == NSNumber::falseValue()) return false;
  return std::nullopt;
}

// Out of line: what it needs of the stack is no part of a recursion's frames.
Value XQueryConditionalExpr::failConversion(XQueryContext& context) const {
  return _internal(context).fail(XQueryErrors::invalidConversion.errorAtLine(exprLine()),
                                 exprPlace());
}

}  // namespace xquery
