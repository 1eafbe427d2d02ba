// typeswitch (...) case ... default ...
#pragma once

#include "Expr/XQueryBinding.h"
#include "Expr/XQueryExpr.h"

#include <vector>

namespace xquery {

class XQueryCaseClauseExpr : public XQueryBindingExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::CaseClause; }

  // `name` null or empty without a variable; `type` null for the default clause.
  [[nodiscard]] static Ref<XQueryCaseClauseExpr> exprWithName(Ref<NSString> name,
                                                              Ref<XQueryTypeDeclaration> type,
                                                              Ref<XQueryExpr> expr);
  void bindInfoForProlog(XQueryProlog& prolog) override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  using XQueryBindingExpr::XQueryBindingExpr;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

class XQueryTypeswitchExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::TypeswitchExpr; }

  using CaseClauses = std::vector<Ref<XQueryCaseClauseExpr>>;

  // The last clause is the default.
  [[nodiscard]] static Ref<XQueryTypeswitchExpr> expr(Ref<XQueryExpr> expr,
                                                      CaseClauses withCaseClauses);

  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryTypeswitchExpr(Ref<XQueryExpr> expr, CaseClauses caseClauses);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const XQueryCaseClauseExpr* clauseFor(const NSObject* value, XQueryContext& context) const;
  Value evaluateClause(const XQueryCaseClauseExpr& clause, const Value& value,
                       XQueryContext& context) const;

  Ref<XQueryExpr> _expr;
  CaseClauses _caseClauses;
};

}  // namespace xquery
