// What every expression that binds a variable has: the clauses of FLWOR and quantified expressions
// and the cases of a typeswitch.
#pragma once

#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryExpr.h"
#include "Expr/XQueryItemGiver.h"
#include "Expr/XQueryPicker.h"
#include "xquery/Collection.h"
#include "xquery/String.h"

#include <memory>
#include <utility>
#include <vector>

namespace xquery {

// Hands out the next local variable ID for the name; 0 for no name and for one that does not
// resolve.
int64_t XQueryDeclareLocalVariable(const Ref<NSString>& name, XQueryProlog& prolog);

// Evaluates an expression that may be absent; an absent one is the empty sequence.
[[gnu::always_inline]] inline Value XQueryEvaluateOrEmpty(const XQueryExpr* expr,
                                                          XQueryContext& context) {
  return expr ? expr->evaluateWithContext(context) : Value(NSNull::null());
}

class XQueryBindingExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::ForExpr || object.kind() == Kind::LetExpr ||
           object.kind() == Kind::QuantifiedItem || object.kind() == Kind::CaseClause;
  }

  // As written, without the dollar sign; null or empty for a case without a variable.
  const Ref<NSString>& varName() const { return _varName; }
  // Null when the clause declares no type.
  XQueryTypeDeclaration* type() const { return _type.get(); }
  XQueryExpr* expr() const { return _expr.get(); }
  // The local variable that takes the value; 0 until bound, and when there is none.
  int64_t varID() const { return _varID; }

  // Of a clause that walks items: who picks those that the condition behind it can hold for. Null
  // where each is asked.
  const XQueryPicker* picker() const { return _picker.get(); }
  void setPicker(std::unique_ptr<const XQueryPicker> picker) { _picker = std::move(picker); }
  // The same for who gives them one after another where not all may be asked for; null where they
  // are listed.
  const XQueryItemGiver* giver() const { return _giver.get(); }
  void setGiver(std::unique_ptr<const XQueryItemGiver> giver) { _giver = std::move(giver); }

  // Of a clause of a FLWOR: what must hold for its variable, or the clauses behind it are not
  // evaluated.
  const std::vector<Ref<XQueryExpr>>& conditions() const { return _conditions; }
  void addCondition(Ref<XQueryExpr> condition) { _conditions.push_back(std::move(condition)); }

  // The value that the variable takes, or what a case answers.
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  // `type` and `expr` may be null; `varName` may be null or empty.
  XQueryBindingExpr(Kind kind, Ref<NSString> varName, Ref<XQueryTypeDeclaration> type,
                    Ref<XQueryExpr> expr)
      : XQueryExpr(kind),
        _varName(std::move(varName)),
        _type(std::move(type)),
        _expr(std::move(expr)) {}
  void bindType(XQueryProlog& prolog);
  void bindExpr(XQueryProlog& prolog);
  void declareVariable(XQueryProlog& prolog) {
    _varID = XQueryDeclareLocalVariable(_varName, prolog);
  }

  Ref<NSString> _varName;
  Ref<XQueryTypeDeclaration> _type;
  Ref<XQueryExpr> _expr;
  int64_t _varID = 0;

 private:
  std::unique_ptr<const XQueryPicker> _picker;
  std::unique_ptr<const XQueryItemGiver> _giver;
  std::vector<Ref<XQueryExpr>> _conditions;
};

}  // namespace xquery
