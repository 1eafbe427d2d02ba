#include "Expr/TypeTests/XQueryTypeswitch.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryParts.h"
#include "Types/XQueryErrors.h"

namespace xquery {

Ref<XQueryCaseClauseExpr> XQueryCaseClauseExpr::exprWithName(Ref<NSString> name,
                                                             Ref<XQueryTypeDeclaration> type,
                                                             Ref<XQueryExpr> expr) {
  return make<XQueryCaseClauseExpr>(Kind::CaseClause, std::move(name), std::move(type),
                                    std::move(expr));
}

void XQueryCaseClauseExpr::bindInfoForProlog(XQueryProlog& prolog) {
  declareVariable(prolog);
  bindType(prolog);
  bindExpr(prolog);
}

void XQueryCaseClauseExpr::visitParts(XQueryPartVisitor& visitor) {
  visitor.ownPart(_type.get(), XQueryRole::Type);
  visitor.part(_expr, XQueryRole::Case);
}

XQueryTypeswitchExpr::XQueryTypeswitchExpr(Ref<XQueryExpr> expr, CaseClauses caseClauses)
    : XQueryExpr(Kind::TypeswitchExpr),
      _expr(std::move(expr)),
      _caseClauses(std::move(caseClauses)) {}

Ref<XQueryTypeswitchExpr> XQueryTypeswitchExpr::expr(Ref<XQueryExpr> expr,
                                                     CaseClauses withCaseClauses) {
  return make<XQueryTypeswitchExpr>(std::move(expr), std::move(withCaseClauses));
}

// The variables keep their IDs for the rest of the module: the scope is not put back.
void XQueryTypeswitchExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  if (_expr) _expr->bindInfoForProlog(prolog);
  for (const auto& clause : _caseClauses) clause->bindInfoForProlog(prolog);
}

void XQueryTypeswitchExpr::visitParts(XQueryPartVisitor& visitor) {
  visitor.part(_expr, XQueryRole::Switched);
  for (const auto& clause : _caseClauses) visitor.ownPart(clause.get(), XQueryRole::Clause);
}

// Null without clauses.
const XQueryCaseClauseExpr* XQueryTypeswitchExpr::clauseFor(const NSObject* value,
                                                            XQueryContext& context) const {
  for (size_t i = 0; i + 1 < _caseClauses.size(); ++i) {
    const XQueryTypeDeclaration* type = _caseClauses[i]->type();
    if (type && XQueryInstanceOf(value, *type, &context)) return _caseClauses[i].get();
  }
  return _caseClauses.empty() ? nullptr : _caseClauses.back().get();
}

Value XQueryTypeswitchExpr::evaluateClause(const XQueryCaseClauseExpr& clause, const Value& value,
                                           XQueryContext& context) const {
  if (clause.varID() == 0) return clause.evaluateWithContext(context);
  auto& dynamic = _internal(context);
  const Value former = dynamic.variableForID(clause.varID());
  dynamic.setVariable(value, clause.varID());
  Value result = clause.evaluateWithContext(context);
  if (XQueryHasFailed(result, context)) return {};
  // A variable that was empty before stays bound to the operand.
  if (former) dynamic.setVariable(former, clause.varID());
  return result;
}

Value XQueryTypeswitchExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  const Value value = XQueryEvaluateOrEmpty(_expr.get(), context);
  if (XQueryHasFailed(value, context) || isa<XQueryError>(value)) return value;
  const XQueryCaseClauseExpr* clause = clauseFor(value.get(), context);
  Value result = clause ? evaluateClause(*clause, value, context) : Value();
  if (result || _internal(context).isFailing()) return result;
  return _internal(context).fail(XQueryErrors::invalidType.errorAtLine(exprLine()), exprPlace());
}

}  // namespace xquery
