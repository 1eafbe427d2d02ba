// The base of the planner's operators.
//
// An operator is an expression that stands in the place of another one and answers what that one
// would answer. It keeps the expression it stands for: to take the plain way where its own is not
// open, and to be shown.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Expr/XQueryParts.h"

#include <utility>

namespace xquery {

class XQueryItemYielder;
class XQueryNodeQuestion;
class XQueryScalarBody;
class XQueryWalkedPath;

class XQueryPlannedExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::PlannedExpr; }

  const XQueryExpr& plain() const { return *_plain; }
  // Itself, where it is one.
  virtual const XQueryWalkedPath* walkedPath() const { return nullptr; }
  // What it is as a condition on its context item; null where that takes evaluating it.
  virtual const XQueryNodeQuestion* nodeQuestion() const { return nullptr; }
  // Itself, where it can be added to a fold without being made; null for most.
  virtual const XQueryItemYielder* itemYielder() const { return nullptr; }
  // Itself, where it is the body of a function that machine numbers can be passed to.
  virtual const XQueryScalarBody* scalarBody() const { return nullptr; }
  // What it stands for has been bound.
  void bindInfoForProlog(XQueryProlog&) override {}
  void visitParts(XQueryPartVisitor& visitor) override {
    visitor.ownPart(_plain.get(), XQueryRole::Element);
  }

 protected:
  explicit XQueryPlannedExpr(Ref<XQueryExpr> plain)
      : XQueryExpr(Kind::PlannedExpr, plain->exprLine(), plain->exprPlace()),
        _plain(std::move(plain)) {}

 private:
  Ref<XQueryExpr> _plain;
};

}  // namespace xquery
