// One walk along the steps of a path.
//
// Steps are taken node by node, as the path itself takes them, with these shortcuts. They rest on
// steps that can be repeated: axis steps whose tests cannot raise an error and whose predicates
// answer the same for the same focus and do nothing else (an error in a predicate only drops its
// item). What a chain of such steps yields from a node is always the same, nobody can tell when or
// how often it is asked, and a result holds every node once. A rule finds where this holds
// (Rules/WalkPaths.cpp); while an error may arise from the items that the path starts from, which
// would leave the focus of the step it met, none of them is taken.
//
//   trail         A step at the head of such a chain whose predicates cannot tell does not walk
//                 nodes again that it has walked from an earlier context item (XQueryAxisTrail).
//                 Trails hold nodes of the path's items only, which live as long as the evaluation:
//                 steps behind an expression keep none.
//   absorbsNext   "//" and the child step after it visit, for a node whose descendant axis ends
//                 with its subtree, exactly the node's descendants, each once, as the child of its
//                 parent. The descendant axis visits the same nodes without touching every node
//                 twice, or finds them in the index. The order differs (the two steps go parent by
//                 parent), so the child step takes the descendant axis only when no predicate can
//                 tell, both are repeatable with all steps after them, and the results will be
//                 sorted. "//@a" is the same.
//   arrivesByParents
//                 Where an expression stands behind, as in "//a/string()", the order in which nodes
//                 arrive, and how often, is that of the items of the path. So what the descendant
//                 axis finds in place of "//" and a child step is gathered, filtered, put into the
//                 order of its parents, and handed on parent by parent.
//   countsBelow   "//a[2]" is the same where it begins the path and starts from one node: the
//                 descendants named a are counted by their parents, which come in document order.
//   lookup        Where a predicate asks for a value that the index of the tree has, the step takes
//                 the nodes with that value in place of walking (XQueryValueLookup).
//   onlyCounts    Where nothing but the number of all nodes below a node is wanted that a step
//                 finds, none is kept. Of some names it is that of stretches of the index, whose
//                 nodes are not looked at.
//   alongWays     Steps down from the document by names alone, "/site/people/person", find what the
//                 index of the tree knows of its ways: their number, and the nodes where these are
//                 all of their name. What comes behind such steps goes on from there. Predicates
//                 that look up by names alone (asksForWays) are asked once for each way.
//   filtersEach   Where only some of the nodes are wanted, or their number, a step filters each
//                 node as it finds it and hands it on, so that the walk ends as soon as the answer
//                 is certain.
//
// An axis step makes each of its context items the focus. Nobody can see that focus, except where
// an error leaves it behind, so it is left out unless an error may arise.
//
// A walk sees the tree as it was when it began: a step before one that may give nodes a parent
// (gathersFirst) finds all its nodes first and hands them on afterwards.
#pragma once

#include "Expr/Paths/XQueryPathRun.h"
#include "Plan/Paths/XQueryAxisTrail.h"
#include "Plan/Paths/XQueryWalkedStep.h"
#include "Platform/Tree/NameIndex.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>

namespace xquery {

class XQueryNodeQuestion;

// What a predicate is as a condition on a node; null where it has to be evaluated.
const XQueryNodeQuestion* XQueryNodeQuestionIn(const XQueryExpr* predicate);

class XQueryPathWalk : public XQueryPathRun {
 public:
  // `trailCount` of the steps keep trails.
  XQueryPathWalk(std::span<const XQueryWalkedStep> steps, size_t trailCount,
                 XQueryPathResults& toResults, XQueryContext& forContext)
      : XQueryPathRun(toResults, forContext), _steps(steps), _trailCount(trailCount) {}

  // Whether an error may arise from the items that the path starts from.
  bool setsEveryFocus = true;
  // It starts from one node.
  bool startsFromOne = false;
  // The results will be sorted, so the order in which nodes arrive is free.
  bool orderIsFree = false;
  // A step with predicates that only lists what it would filter, and where; null otherwise.
  const XQueryWalkedStep* listingStep = nullptr;
  std::vector<Value>* listed = nullptr;

  // Whether the steps have nothing more to hand on.
  bool isOver() const { return hasFailed || results.isComplete(); }
  // Whether the first step is joined with the one after it where it starts from the node.
  bool absorbsNext(const XQueryWalkedStep& step, const NSXMLNode* node) const;

  // The whole path from one node, where that is a document whose index knows what the first steps
  // find; false for: walk.
  bool takeAlongWays(const Value& start);
  // On which ways all that it finds from the document lies, and nothing else; none where the index
  // does not tell.
  std::optional<NSXMLNameIndex::Ways> waysFrom(const NSXMLNameIndex& elements);
  // Afterwards, so that the index is made when that has been asked often enough.
  void noteMet() const;

  // From step `index` on, for a value of any shape, for one node, and for the nodes that a step
  // with predicates kept. Behind the last step they are the results.
  void takeValue(size_t index, const Value& items, bool validate);
  void takeNode(size_t index, NSXMLNode* node);
  void takeNodes(size_t index, std::span<NSXMLNode* const> nodes);

 private:
  void takeItem(size_t index, NSObject* item, int64_t position, bool validate);
  void take(size_t index, int axis, NSXMLNode* node);
  void takeCountedBelow(size_t index, NSXMLNode* node);
  template <class Act>
  void visitCountedBelow(size_t index, NSXMLNode* node, Act act);
  void takeByParents(size_t index, int axis, NSXMLNode* node);
  bool gatherBelow(size_t index, int axis, NSXMLNode* node, std::vector<NSXMLNode*>& nodes);
  void handOnByParents(size_t index, std::span<NSXMLNode* const> nodes);
  bool lookUp(const XQueryWalkedStep& step, int axis, NSXMLNode* node,
              std::vector<NSXMLNode*>& nodes);
  bool takeLookedUp(size_t index, int axis, NSXMLNode* node);
  void takeEachKept(size_t index, std::span<NSXMLNode* const> nodes);
  void stream(size_t index, int axis, NSXMLNode* node);
  template <class VisitOf>
  void streamMatching(size_t index, int axis, NSXMLNode* node, VisitOf visitOf);
  void filter(size_t index, int axis, NSXMLNode* node);
  size_t collect(const XQueryWalkedStep& step, int axis, NSXMLNode* node,
                 std::vector<NSXMLNode*>& nodes);
  void collectComputed(const XQueryWalkedStep& step, int axis, NSXMLNode* node,
                       std::vector<NSXMLNode*>& nodes);
  bool collectRange(const XQueryWalkedStep& step, int axis, NSXMLNode* node,
                    std::vector<NSXMLNode*>& nodes);
  size_t collectKept(const XQueryWalkedStep& step, int axis, NSXMLNode* node,
                     std::vector<NSXMLNode*>& nodes);
  template <class Act>
  void walkFor(const XQueryWalkedStep& step, int axis, NSXMLNode* node, Act act);
  void collectFromBack(const XQueryWalkedStep& step, const NSXMLNode* node,
                       std::vector<NSXMLNode*>& nodes);
  bool onlyCounts(size_t index, int axis, const NSXMLNode* node) const;
  void count(const XQueryWalkedStep& step, int axis, NSXMLNode* node);
  bool filtersEach(const XQueryWalkedStep& step) const;
  bool keepsAlone(const XQueryWalkedStep& step, size_t firstPredicate, NSXMLNode* node);
  bool filterNodes(const XQueryWalkedStep& step, size_t fromIndex, std::vector<NSXMLNode*>& nodes);
  bool keepAtOnce(const XQueryExpr& predicate, std::vector<NSXMLNode*>& nodes);
  bool keepRange(const XQueryPositionRange& range, std::vector<NSXMLNode*>& nodes);
  size_t keepUpToPosition(const XQueryWalkedStep& step, std::vector<NSXMLNode*>& nodes);
  bool keepNodes(const XQueryExpr& predicate, const XQueryNodeQuestion& question,
                 std::vector<NSXMLNode*>& nodes);

  class Ways;
  void takeIndexed(NSXMLNodeSpan nodes, size_t steps);

  // A trail begins anew where a tree has changed since it was last asked for: what a predicate of
  // an earlier step constructs may give the nodes a parent.
  XQueryAxisTrail& trail(size_t index);

  class ChildCounts;
  struct Trail {
    XQueryAxisTrail trail;
    uint64_t changeCount = 0;  // NSXMLTree::changeCount at its last use
  };

  const std::span<const XQueryWalkedStep> _steps;
  const size_t _trailCount;
  std::vector<Trail> _trails;
  uint64_t _met = 0;                       // nodes that steps have taken
  const NSXMLNode* _notesMetOf = nullptr;  // a document; null for none
};

}  // namespace xquery
