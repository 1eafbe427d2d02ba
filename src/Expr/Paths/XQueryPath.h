// Path expressions: a chain of steps hung from one expression.
//
// Steps are evaluated item by item and node by node. A step without predicates hands each node it
// finds straight to the next step as a raw pointer; a step with predicates first gathers its nodes
// for one context item. Only the last step stores nodes, and only stored nodes are referenced: the
// tree is kept alive by the item the path started from.
#pragma once

#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryExpr.h"
#include "xquery/XMLNode.h"

#include <optional>
#include <vector>

namespace xquery {

class XQueryPathResults;
class XQueryPathRun;

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
  // The position that predicate `index` asks for where it is a numeric literal, which is never
  // evaluated.
  const std::optional<uint64_t>& literalPosition(size_t index) const {
    return _literalPositions[index];
  }
  // Which position a predicate selects that answers the same whatever the focus: 0 for none, also
  // where it fails; nothing where it keeps them all.
  static std::optional<uint64_t> positionIn(const XQueryExpr& predicate, XQueryContext& context);
  bool asksForPosition(size_t index) const { return literalPosition(index).has_value(); }
  static std::optional<uint64_t> literalPositionOf(const XQueryExpr* predicate);
  // Whether evaluating its expressions may give a node a parent. Known once it is bound.
  bool mayAdopt() const { return _mayAdopt; }

  virtual void bindInfoForProlog(XQueryProlog& prolog);
  // The parts of the path that are this step's. `isFirst`: the path begins with it.
  void visitParts(XQueryPartVisitor& visitor, bool isFirst);
  // Applies predicate `index` and those after it; null when a limit was reached. The misspelling
  // belongs to the name.
  Value handlePreicatesFromIndex(size_t index, Value items, XQueryContext& context) const;
  // The same over a list of nodes, in place. False when a limit was reached.
  bool filterNodes(std::vector<NSXMLNode*>& nodes, size_t fromIndex, XQueryContext& context) const;
  // Whether the predicate keeps the item. An error that it meets is passed over, but for a limit:
  // then the context is failing.
  static bool keeps(const XQueryExpr& predicate, NSObject* item, int64_t position,
                    XQueryContext& context);
  // Does nothing here.
  virtual void processItems(const Value& items, XQueryPathResults& toResults,
                            XQueryContext& forContext, bool validate) const;

 protected:
  XQueryStep(Kind kind, Ref<XQueryExpr> initWithExpr)
      : NSCounted(kind), _expr(std::move(initWithExpr)) {}

  Ref<XQueryExpr> _expr;
  Ref<XQueryStep> _next;
  Ref<XQueryStep> _tail;   // where the last setLast ended: the chain's end, or near it
  bool _isCutOff = false;  // a link before this step was replaced: no tail any more
  std::vector<Ref<XQueryExpr>> _predicates;

 private:
  void notePositions();
  // processItems within one evaluation of a path: for a value of any shape, for one node, and for
  // the nodes that a step with predicates kept. All of them end the run (hasFailed) at an error.
  virtual void processValue(const Value& items, XQueryPathRun& run, bool validate) const;
  virtual void processNode(NSXMLNode* node, XQueryPathRun& run) const;
  virtual void processNodes(const std::vector<NSXMLNode*>& nodes, XQueryPathRun& run) const;
  friend class XQueryAxisStep;
  friend class XQueryFilterStep;
  friend class XQueryPathExpr;

  std::vector<std::optional<uint64_t>> _literalPositions;  // one per predicate
  bool _mayAdopt = false;
};

class XQueryAxisStep : public XQueryStep {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::AxisStep; }

  [[nodiscard]] static Ref<XQueryAxisStep> axisStepWithAxis(int axis, Ref<XQueryExpr> nodeTest);

  int axis() const { return _axis; }
  bool isReverse() const {
    return _axis >= XQueryAxisAncestor && _axis <= XQueryAxisAncestorOrSelf;
  }
  static bool isValid(const NSXMLNode* node, const XQueryExpr* expr, XQueryContext& context);
  // Whether asking the node test of a node may be an error.
  bool testMayRaise() const;

  void bindInfoForProlog(XQueryProlog& prolog) override;
  void processItems(const Value& items, XQueryPathResults& toResults, XQueryContext& forContext,
                    bool validate) const override;

 protected:
  XQueryAxisStep(int axis, Ref<XQueryExpr> nodeTest)
      : XQueryStep(Kind::AxisStep, std::move(nodeTest)), _axis(axis) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  void processValue(const Value& items, XQueryPathRun& run, bool validate) const override;
  void processNode(NSXMLNode* node, XQueryPathRun& run) const override;
  void processNodes(const std::vector<NSXMLNode*>& nodes, XQueryPathRun& run) const override;

  void stream(NSXMLNode* node, XQueryPathRun& run) const;
  void filter(NSXMLNode* node, XQueryPathRun& run) const;
  void gather(NSXMLNode* node, std::vector<NSXMLNode*>& nodes, XQueryPathRun& run) const;
  template <class Act>
  void walk(NSXMLNode* node, XQueryPathRun& run, Act act) const;
  friend class XQueryPathExpr;

  int _axis;
  bool _gathersFirst = false;  // set by binding, see XQueryPath.cpp
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
  // What the step answers with the item for a focus; null after an error. Where further steps
  // follow, the item and what it answers are nodes.
  Value valueFor(NSObject* item, int64_t position, XQueryContext& context) const;

 protected:
  explicit XQueryFilterStep(Ref<XQueryExpr> expr, Kind kind = Kind::FilterStep)
      : XQueryStep(kind, std::move(expr)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  void processValue(const Value& items, XQueryPathRun& run, bool validate) const override;
  void processNode(NSXMLNode* node, XQueryPathRun& run) const override;
  void processNodes(const std::vector<NSXMLNode*>& nodes, XQueryPathRun& run) const override;
  void processItem(NSObject* item, int64_t position, XQueryPathRun& run, bool validate) const;
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
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor&) override {}

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
  // The chain of steps does not change afterwards.
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;
  // For planning: a literal has been put in the place of a predicate.
  void notePositions();

 protected:
  explicit XQueryPathExpr(Ref<XQueryStep> step)
      : XQueryExpr(Kind::PathExpr), _step(std::move(step)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Value walkSteps(XQueryContext& context) const;
  void findGatheringSteps();

  Ref<XQueryStep> _step;
};

}  // namespace xquery
