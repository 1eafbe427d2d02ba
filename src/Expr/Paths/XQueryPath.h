// Path expressions: a chain of steps hung from one expression.
//
// Steps are evaluated item by item and node by node. A step without predicates hands each node it
// finds straight to the next step as a raw pointer; a step with predicates first gathers its nodes
// for one context item. Only the last step stores nodes, and only stored nodes are referenced: the
// tree is kept alive by the item the path started from.
#pragma once

#include "Expr/Paths/XQueryNameChoice.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryExpr.h"
#include "Expr/XQueryPicker.h"
#include "xquery/XMLNode.h"

#include <memory>
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
  // No axis of a query: the attributes of a node and of all below it, as "//@a" finds them.
  XQueryAxisAttributesBelow = 1000,
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
  // How many of the first predicates are part of the test (XQueryAxisStep::setChoice) and evaluated
  // no more.
  size_t predicatesInTest() const { return _predicatesInTest; }
  // Whether the predicate is a numeric literal, which is never evaluated: it asks for a position.
  bool asksForPosition(size_t index) const { return literalPosition(index).has_value(); }

  virtual void bindInfoForProlog(XQueryProlog& prolog);
  // The parts of the path that are this step's. `isFirst`: the path begins with it.
  void visitParts(XQueryPartVisitor& visitor, bool isFirst);
  // Applies predicate `index` and those after it; null when a limit was reached. The misspelling
  // belongs to the name.
  Value handlePreicatesFromIndex(size_t index, Value items, XQueryContext& context) const;
  // Whether the predicate keeps the item. An error that it meets is passed over, but for a limit:
  // then the context is failing.
  static bool keeps(const XQueryExpr& predicate, NSObject* item, int64_t position,
                    XQueryContext& context);
  // Whether every predicate keeps it.
  bool keepsByAll(NSObject* item, int64_t position, XQueryContext& context) const;
  // Does nothing here.
  virtual void processItems(const Value& items, XQueryPathResults& toResults,
                            XQueryContext& forContext, bool validate) const;

 protected:
  XQueryStep(Kind kind, Ref<XQueryExpr> initWithExpr)
      : NSCounted(kind), _expr(std::move(initWithExpr)) {}

  // The same as handlePreicatesFromIndex over a list of nodes, in place. False when a limit was
  // reached.
  bool filterNodes(std::vector<NSXMLNode*>& nodes, size_t fromIndex, XQueryContext& context) const;
  // Whether every predicate may be evaluated again (XQueryIsRepeatable).
  bool hasRepeatablePredicates(bool variablesMayChange) const;
  bool loadsDocuments() const;
  // Whether predicates are left that are no part of the test.
  bool hasPredicates() const { return _predicatesInTest < _predicates.size(); }
  auto firstPredicate() const {
    return _predicates.begin() + static_cast<std::ptrdiff_t>(_predicatesInTest);
  }
  // Whether every predicate keeps an item for what it finds true of it, wherever the item stands,
  // and without loading documents. The predicates are repeatable: none of them can ask for a
  // position, so one that never answers a number cannot tell it.
  bool hasPredicatesOfTruth() const;
  // The position that predicate `index` asks for when it is a numeric literal.
  const std::optional<uint64_t>& literalPosition(size_t index) const {
    return _literalPositions[index];
  }

  Ref<XQueryExpr> _expr;
  Ref<XQueryStep> _next;
  Ref<XQueryStep> _tail;   // where the last setLast ended: the chain's end, or near it
  bool _isCutOff = false;  // a link before this step was replaced: no tail any more
  std::vector<Ref<XQueryExpr>> _predicates;
  size_t _predicatesInTest = 0;

 private:
  void notePredicates();
  static std::optional<uint64_t> literalPositionOf(const XQueryExpr* predicate);
  // processItems within one evaluation of a path: for a value of any shape, for one node, and for
  // the nodes that a step with predicates kept. All of them end the run (hasFailed) at an error.
  virtual void processValue(const Value& items, XQueryPathRun& run, bool validate) const;
  virtual void processNode(NSXMLNode* node, XQueryPathRun& run) const;
  virtual void processNodes(const std::vector<NSXMLNode*>& nodes, XQueryPathRun& run) const;
  friend class XQueryAxisStep;
  friend class XQueryFilterStep;
  friend class XQueryPathExpr;

  std::vector<std::optional<uint64_t>> _literalPositions;  // one per predicate
  bool _mayAdopt = false;  // its expressions may give a node a parent; set by binding
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
  // Has the step take, of the nodes that its test accepts, those of one of the names alone, which
  // is what so many of its first predicates ask for. The path is told (XQueryPathExpr).
  void setChoice(std::unique_ptr<const XQueryNameChoice> names, size_t predicatesInTest);
  const XQueryNameChoice* choice() const { return _choice.get(); }
  // Whether asking the node test of a node may be an error.
  bool testMayRaise() const;
  // Whether this is the step that "//" stands for.
  bool isDescendantShorthand() const;

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

  void enter(NSXMLNode* node, XQueryPathRun& run) const;
  void stream(int axis, NSXMLNode* node, XQueryPathRun& run) const;
  template <class VisitOf>
  void streamMatching(int axis, NSXMLNode* node, XQueryPathRun& run, VisitOf visitOf) const;
  void filter(int axis, NSXMLNode* node, XQueryPathRun& run) const;
  bool filtersEachFor(const XQueryPathRun& run) const;
  bool keepsAlone(NSXMLNode* node, XQueryPathRun& run) const;
  size_t collect(int axis, NSXMLNode* node, std::vector<NSXMLNode*>& nodes,
                 XQueryPathRun& run) const;
  bool mayTakeDescendants() const;
  void take(int axis, NSXMLNode* node, XQueryPathRun& run) const;
  bool mayWalkTwice(const XQueryAxisStep* previous) const;
  void forgetShortcuts() {
    _absorbsNext = false;
    _filtersEach = false;
    _trail = noTrail;
  }
  bool absorbsNextFor(const NSXMLNode* node, const XQueryPathRun& run) const;
  friend class XQueryPathExpr;

  static constexpr size_t noTrail = SIZE_MAX;

  int _axis;
  std::unique_ptr<const XQueryNameChoice> _choice;  // set by planning; null for none
  // Set by binding, see XQueryPath.cpp.
  bool _absorbsNext = false;
  bool _filtersEach = false;
  bool _gathersFirst = false;
  size_t _trail = noTrail;
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
  // Who picks the items of one of the steps that its predicates may keep: items of the first step,
  // or nodes of an axis step, before which there are but the first step and axis steps whose tests
  // raise nothing. The predicates are repeatable, and cannot tell where an item stands.
  const XQueryPicker* picker() const { return _picker.get(); }
  void setPicker(std::unique_ptr<const XQueryPicker> picker, const XQueryStep* ofStep) {
    _picker = std::move(picker);
    _pickedStep = ofStep;
  }
  // Lists the nodes that the predicates of such an axis step are asked for; false when that fails,
  // and for items that are no nodes.
  bool listNodesBefore(const XQueryStep& step, XQueryContext& context,
                       std::vector<Value>& nodes) const;
  // The chain of steps changes afterwards only where the path is told.
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  // How many nodes the path finds, or `most` where there are more, having looked no further than
  // that takes. None after an error. For a path that countsNodes.
  std::optional<uint64_t> countNodes(uint64_t most, XQueryContext& context) const;
  // Its value, of which only the first so many items are wanted: there may be more of them. Null
  // after an error. For a path that findsInOrder.
  Value firstItems(uint64_t most, XQueryContext& context) const;
  // Whether the path countsNodes and finds them in the order of its value when it starts from one.
  bool findsInOrder() const { return _findsInOrder; }
  // Whether the path answers nodes and, once its first step is evaluated to nodes, nobody can tell
  // how far it was walked: what is left does nothing and cannot fail.
  bool countsNodes() const { return _countsNodes; }
  void visitParts(XQueryPartVisitor& visitor) override;

  // For planning, before operators have been put in the places of predicates: a step was changed,
  // or another one takes over from the one behind `previous`, its predicates and what follows. The
  // answer is the step that has gone.
  void noteChange();
  [[nodiscard]] Ref<XQueryStep> replaceStepBehind(XQueryStep& previous, const Ref<XQueryStep>& by);

 protected:
  explicit XQueryPathExpr(Ref<XQueryStep> step)
      : XQueryExpr(Kind::PathExpr), _step(std::move(step)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  enum class Answer : uint8_t { Failed, Items, Results };
  Answer evaluateSteps(XQueryContext& context, Value& items, XQueryPathResults& results) const;
  Answer walkSteps(XQueryContext& context, Value& items, XQueryPathResults& results) const;
  Value evaluateFirstStep(const XQueryStep& step, XQueryContext& context) const;
  bool listNodes(const Value& start, const XQueryStep& firstStep, const XQueryStep& step,
                 XQueryPathRun& run, std::vector<Value>& listed) const;
  bool pickItems(Value& items, XQueryContext& context) const;
  bool pickNodes(const Value& start, const XQueryStep& firstStep, XQueryPathRun& run) const;
  void findShortcuts();
  bool arrivesInOrder() const;
  bool mayEndEarly(const XQueryStep& step, const Value& items, const XQueryPathRun& run) const;
  void findGatheringSteps();

  Ref<XQueryStep> _step;
  size_t _trailCount = 0;
  std::unique_ptr<const XQueryPicker> _picker;
  const XQueryStep* _pickedStep = nullptr;
  bool _countsNodes = false;
  bool _findsInOrder = false;
};

}  // namespace xquery
