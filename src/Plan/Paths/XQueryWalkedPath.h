// A path, walked with shortcuts (XQueryPathWalk.h). Rules put one in the place of every path, and
// tell it what they find out about its steps; other operators count with it, or take its first
// nodes.
#pragma once

#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryItemGiver.h"
#include "Expr/XQueryPicker.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Paths/XQueryPathWalk.h"
#include "Plan/Paths/XQueryWalkedStep.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {

class XQueryWalkedPath : public XQueryPlannedExpr {
 public:
  // `path` is the plain expression, or part of it.
  [[nodiscard]] static Ref<XQueryWalkedPath> exprWithPlain(Ref<XQueryExpr> plain,
                                                           Ref<XQueryPathExpr> path) {
    return make<XQueryWalkedPath>(std::move(plain), std::move(path));
  }

  const XQueryPathExpr& path() const { return *_path; }
  // The step that is evaluated before the walk begins; null where the path begins at the context
  // item.
  const XQueryStep* start() const { return _start; }
  // The steps that are walked.
  const std::vector<XQueryWalkedStep>& steps() const { return _steps; }
  // The one that was written so; null for the start and steps of other paths.
  const XQueryWalkedStep* walked(const XQueryStep& asWritten) const;

  Value computeValue(XQueryContext& context) const override;
  const XQueryWalkedPath* walkedPath() const override { return this; }

  // Whether the path answers nodes and, once its start is evaluated to nodes, nobody can tell how
  // far it was walked: what is left does nothing and cannot fail.
  bool countsNodes() const { return _countsNodes; }
  // Whether it also finds them in the order of its value when it starts from one.
  bool findsInOrder() const { return _findsInOrder; }
  // How many nodes the path finds, or `most` where there are more, having looked no further than
  // that takes. None after an error. For a path that countsNodes.
  std::optional<uint64_t> countNodes(uint64_t most, XQueryContext& context) const;
  // The same for any path, whose items may be no nodes: it is evaluated as a whole, unless it
  // countsNodes, or is a filter whose items are picked. None as well where it has no value.
  std::optional<uint64_t> countItems(uint64_t most, XQueryContext& context) const;
  // Its value, of which only the first so many items are wanted: there may be more of them. Null
  // after an error. For a path that findsInOrder.
  Value firstItems(uint64_t most, XQueryContext& context) const;

  // On which ways of the index all that it finds from the document lies, and nothing else; none
  // where that cannot be told. For a path from the document that countsNodes.
  std::optional<NSXMLNameIndex::Ways> waysFrom(const NSXMLNameIndex& elements,
                                               XQueryContext& context) const;

  // Hands on one node after another as the walk finds them, until the taker wants no more of them;
  // the items of the value where they do not come in its order. False after an error, that of the
  // taker as well. For a path that findsInOrder.
  bool giveItems(XQueryContext& context, XQueryItemGiver::Taker& taker) const;

  // Who picks the items of one of the steps that its predicates may keep: items of the start, or
  // nodes of an axis step, before which there are but the start and axis steps whose tests raise
  // nothing. The predicates are repeatable, and cannot tell where an item stands.
  const XQueryPicker* picker() const { return _picker.get(); }
  void setPicker(std::unique_ptr<const XQueryPicker> picker, const XQueryStep* ofStep) {
    _picker = std::move(picker);
    _pickedStep = ofStep;
  }
  // Whether the step behind the start, or the first one, leads to siblings: of that the nodes are
  // picked, or kept, for all children of a parent together.
  bool beginsWithSiblings() const;
  // To be kept are those of which the predicates are asked once, which read nothing but the node.
  void keepSiblings() { _keepsSiblings = true; }
  // The node that such a path starts from, where it is worth looking up what that finds from there,
  // and it may be done; else null.
  NSXMLNode* nodeAmongMany(const Value& start, const XQueryContext& context) const;
  bool looksUpSiblings(NSXMLNode* start, const XQueryContext& context) const {
    return _keepsSiblings && nodeAmongMany(Value(start), context);
  }
  // Lists the nodes that the predicates of the start, or of such an axis step, are asked for; false
  // when that fails, and for items that are no nodes.
  bool listNodesBefore(const XQueryStep& step, XQueryContext& context,
                       std::vector<Value>& nodes) const;

  // For rules.
  struct Findings {
    size_t trailCount = 0;
    bool countsNodes = false;
    bool findsInOrder = false;
  };
  std::vector<XQueryWalkedStep>& changeableSteps() { return _steps; }
  // Puts the steps of another path, which this one begins with, before its own. The other one is
  // evaluated as it is written from then on.
  void takeSteps(XQueryWalkedPath& of);
  // What is told about the predicates of the start, or of an axis step; null for other steps.
  XQueryStepPositions* positionsOf(const XQueryStep& step);
  // Whether it is no more than an expression of whose items a range of positions is kept.
  bool keepsRangeAlone() const;
  // The items of the start are nodes in document order, and of one tree.
  void noteStartInOrder() { _isStartInOrder = true; }
  void setFindings(const Findings& findings) {
    _trailCount = findings.trailCount;
    _countsNodes = findings.countsNodes;
    _findsInOrder = findings.findsInOrder;
  }

 protected:
  XQueryWalkedPath(Ref<XQueryExpr> plain, Ref<XQueryPathExpr> path);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  enum class Answer : uint8_t { Failed, Items, Results };
  Answer evaluate(XQueryContext& context, Value& items, XQueryPathResults& results) const;
  Answer walk(XQueryContext& context, Value& items, XQueryPathResults& results) const;
  Value evaluateStart(XQueryContext& context, std::optional<uint64_t>* number = nullptr) const;
  size_t keepStart(size_t index, Value& items, XQueryContext& context) const;
  bool mayEndEarly(const Value& items, const XQueryPathWalk& walk) const;
  bool listStart(XQueryContext& context, std::vector<Value>& nodes) const;
  bool listNodes(const Value& start, const XQueryWalkedStep& step, XQueryPathWalk& walk,
                 std::vector<Value>& listed) const;
  bool pickItems(Value& items, XQueryContext& context, std::optional<uint64_t>* number) const;
  bool pickNodes(const Value& start, XQueryPathWalk& walk) const;
  class Siblings;
  void listSiblings(const NSXMLNode* parent, XQueryPathWalk& walk,
                    std::vector<Value>& listed) const;
  bool leaveOnOneSide(const NSXMLNode* node, XQueryPicks& picks) const;
  std::shared_ptr<const Siblings> siblingsBelow(NSXMLNode* parent, XQueryPathWalk& walk) const;
  bool takeSiblings(const Value& start, XQueryPathWalk& walk) const;
  bool looksUpAll(const Value& start, const XQueryPathWalk& walk) const;
  bool showsErrors(const XQueryContext& context) const;

  const Ref<XQueryPathExpr> _path;
  const XQueryStep* _start = nullptr;
  XQueryStepPositions _startPositions;
  bool _isStartInOrder = false;
  std::vector<XQueryWalkedStep> _steps;
  bool _areStepsTaken = false;
  bool _hasPredicates = false;
  std::unique_ptr<const XQueryPicker> _picker;
  const XQueryStep* _pickedStep = nullptr;
  bool _keepsSiblings = false;
  size_t _trailCount = 0;
  bool _countsNodes = false;
  bool _findsInOrder = false;
};

// The path that an expression is, as it was written; null for anything else.
inline const XQueryPathExpr* XQueryPathIn(const XQueryExpr* expr) {
  const auto* planned = dyn_cast<XQueryPlannedExpr>(expr);
  if (!planned) return dyn_cast<XQueryPathExpr>(expr);
  return planned->walkedPath() ? &planned->walkedPath()->path() : nullptr;
}

}  // namespace xquery
