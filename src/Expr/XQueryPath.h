// Path expressions: a chain of steps hung from one expression.
#pragma once

#include <vector>

#include "Expr/XQueryExpr.h"
#include "Expr/XQueryTypeDeclaration.h"
#include "xquery/XMLNode.h"

namespace xquery {

class XQueryPathResults;

enum XQueryAxis : int {
  XQueryAxisChild = 1,
  XQueryAxisDescendant = 2,
  XQueryAxisDescendantOrSelf = 3,
  XQueryAxisAttribute = 4,
  XQueryAxisSelf = 5,
  XQueryAxisFollowingSibling = 6,
  XQueryAxisFollowing = 7,
  XQueryAxisAncestor = 8,
  XQueryAxisParent = 9,
  XQueryAxisPreceding = 10,
  XQueryAxisPrecedingSibling = 11,
  XQueryAxisAncestorOrSelf = 12,
};

class XQueryStep : public NSCounted {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() >= Kind::PathStepFirst && object.kind() <= Kind::PathStepLast;
  }

  // The node test of an axis step, the primary expression of a filter step. May be null.
  XQueryExpr* expr() const { return _expr.get(); }
  XQueryStep* next() const { return _next.get(); }
  void setNext(Ref<XQueryStep> next);
  // Appends at the end of the chain, in constant time when called on the head.
  void setLast(Ref<XQueryStep> last);
  const std::vector<Ref<XQueryExpr>>& predicates() const { return _predicates; }
  void setPredicates(std::vector<Ref<XQueryExpr>> predicates);

  virtual void bindInfoForProlog(XQueryProlog& prolog);
  // Applies predicate `index` and those after it. The misspelling belongs to the name.
  Value handlePreicatesFromIndex(size_t index, Value items, XQueryContext& context) const;
  // Does nothing here.
  virtual void processItems(const Value& items, XQueryPathResults& toResults,
                            XQueryContext& forContext, bool validate) const;

 protected:
  XQueryStep(Kind kind, Ref<XQueryExpr> initWithExpr)
      : NSCounted(kind), _expr(std::move(initWithExpr)) {}

  Ref<XQueryExpr> _expr;
  Ref<XQueryStep> _next;
  XQueryStep* _tail = nullptr;  // a step at or after this one, near the end of the chain
  std::vector<Ref<XQueryExpr>> _predicates;
};

class XQueryAxisStep : public XQueryStep {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::AxisStep; }

  [[nodiscard]] static Ref<XQueryAxisStep> axisStepWithAxis(int axis, Ref<XQueryExpr> nodeTest);

  int axis() const { return _axis; }
  bool isReverse() const { return _axis >= XQueryAxisAncestor && _axis <= XQueryAxisAncestorOrSelf; }
  static bool isValid(const NSXMLNode* node, const XQueryExpr* expr, XQueryContext& context);

  void bindInfoForProlog(XQueryProlog& prolog) override;
  void processItems(const Value& items, XQueryPathResults& toResults, XQueryContext& forContext,
                    bool validate) const override;

 protected:
  XQueryAxisStep(int axis, Ref<XQueryExpr> nodeTest)
      : XQueryStep(Kind::AxisStep, std::move(nodeTest)), _axis(axis) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  int _axis;
};

class XQueryFilterStep : public XQueryStep {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::FilterStep || object.kind() == Kind::RootStep;
  }
  // `expr` may be null (an absent operand): the empty sequence.
  [[nodiscard]] static Ref<XQueryFilterStep> filterStepWithExpr(Ref<XQueryExpr> expr);
  void processItems(const Value& items, XQueryPathResults& toResults, XQueryContext& forContext,
                    bool validate) const override;

 protected:
  explicit XQueryFilterStep(Ref<XQueryExpr> expr, Kind kind = Kind::FilterStep)
      : XQueryStep(kind, std::move(expr)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

// The step that heads an absolute path.
class XQueryRootStep : public XQueryFilterStep {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::RootStep; }
  [[nodiscard]] static Ref<XQueryRootStep> rootStep();

 protected:
  XQueryRootStep();
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

class XQueryRootStepExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::RootStepExpr; }
  [[nodiscard]] static Ref<XQueryRootStepExpr> expr();
  void bindInfoForProlog(XQueryProlog&) override {}
  // The document node above the context item.
  Value evaluateWithContext(XQueryContext& context) const override;

 protected:
  XQueryRootStepExpr();
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<XQueryTypeDeclaration> _type;
};

class XQueryPathExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::PathExpr; }
  [[nodiscard]] static Ref<XQueryPathExpr> pathExprWithStep(Ref<XQueryStep> step);
  XQueryStep* step() const { return _step.get(); }
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value evaluateWithContext(XQueryContext& context) const override;

 protected:
  explicit XQueryPathExpr(Ref<XQueryStep> step)
      : XQueryExpr(Kind::PathExpr), _step(std::move(step)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<XQueryStep> _step;
};

}  // namespace xquery
