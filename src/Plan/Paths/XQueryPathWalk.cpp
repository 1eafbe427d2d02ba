#include "Plan/Paths/XQueryPathWalk.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryPathResults.h"
#include "Expr/XQueryLists.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Paths/XQueryConditionFilter.h"
#include "Plan/Paths/XQueryIndexedWalk.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/TreeHead.h"
#include "Types/XQueryErrors.h"

#include <algorithm>

namespace xquery {
namespace {

// Whether the node's descendant axis ends where its subtree ends.
bool descendantsAreSubtree(const NSXMLNode* node) {
  if (node->kind() != Kind::Element && node->kind() != Kind::Document) return false;
  // Without a node to stop at the walk goes to the end of the document, which is the end of the
  // subtree of the topmost node and of its last child.
  return XQueryDescendantStop(node) || !node->parent() || !node->parent()->parent();
}

// The first predicate to be asked of what is looked up.
size_t firstAsked(const XQueryWalkedStep& step) {
  return step.predicatesInTest + step.lookup->answers();
}

bool isOnlyChild(const NSXMLNode* node) {
  return !node->previousSibling() && !node->nextSibling();
}

// Counts nodes that no other walk finds, so that none has to be kept.
class CountVisit {
 public:
  CountVisit(XQueryStepTest& test, XQueryPathResults& results) : _test(test), _results(results) {}

  bool operator()(NSXMLNode* found) {
    if (_test.matches(found)) _results.addNumber(1);
    return !_results.isComplete();
  }

 protected:
  bool add(std::optional<uint64_t> number) const {
    if (number) _results.addNumber(*number);
    return number.has_value();
  }

  XQueryStepTest& _test;
  XQueryPathResults& _results;
};

// The same for all nodes of some kinds: what a document that was read is known to have.
class CountKindsVisit : public CountVisit {
 public:
  using CountVisit::CountVisit;

  bool visitIndexed(const NSXMLNode* first, const NSXMLNode* stop) const {
    return add(NSXMLCountKinds(_test.kindsAlone(), first, stop));
  }
  bool visitIndexedAttributes(const NSXMLNode* first, const NSXMLNode* stop) const {
    const bool areTaken = (_test.kindsAlone() & XQueryKindBit(Kind::Attribute)) != 0;
    return areTaken && add(NSXMLCountAttributes(first, stop));
  }
};

// The same for nodes of a name: those that the index has, without looking at them.
class CountNamedVisit : public CountVisit {
 public:
  using CountVisit::CountVisit;

  bool visitIndexed(const NSXMLNode* first, const NSXMLNode* stop) const {
    return add(numberOf(NSXMLIndexedElements(_test.onlyName(), first, stop)));
  }
  bool visitIndexedAttributes(const NSXMLNode* first, const NSXMLNode* stop) const {
    return add(numberOf(NSXMLIndexedAttributes(_test.onlyName(), first, stop)));
  }

 private:
  static std::optional<uint64_t> numberOf(const std::optional<NSXMLIndexedNodes>& indexed) {
    return indexed ? std::optional<uint64_t>(indexed->nodes.size()) : std::nullopt;
  }
};

// The same for a test that takes several names.
class CountChoiceVisit : public CountVisit {
 public:
  using CountVisit::CountVisit;

  bool visitIndexed(const NSXMLNode* first, const NSXMLNode* stop) const {
    return add(
        NSXMLCountIndexedElements(*_test.onlyNames(), _test.acceptsInstructions(), first, stop));
  }
};

}  // namespace

const XQueryNodeQuestion* XQueryNodeQuestionIn(const XQueryExpr* predicate) {
  const auto* planned = dyn_cast<XQueryPlannedExpr>(XQueryWithoutParentheses(predicate));
  return planned ? planned->nodeQuestion() : nullptr;
}

XQueryAxisTrail& XQueryPathWalk::trail(size_t index) {
  if (_trails.empty()) _trails.resize(_trailCount);
  Trail& found = _trails[index];
  if (found.changeCount != NSXMLTree::changeCount()) {
    found.trail = XQueryAxisTrail();
    found.changeCount = NSXMLTree::changeCount();
  }
  return found.trail;
}

void XQueryPathWalk::takeValue(size_t index, const Value& items, bool validate) {
  const XQueryItemList list(items.get());
  if (index == _steps.size()) return results.add(items.get(), context);
  const bool isExpression = _steps[index].isExpression();
  if (isExpression) _internal(context).setLast(static_cast<int64_t>(list.count()));
  for (size_t i = 0; i < list.count(); ++i) {
    if (isExpression) {
      takeItem(index, list[i], static_cast<int64_t>(i) + 1, validate);
    } else if (auto* node = dyn_cast<NSXMLNode>(list[i])) {
      takeNode(index, node);
    } else if (validate) {
      _internal(context).raise(XQueryErrors::contextItemNotANode.error());
    }
    if (isOver()) return;
  }
}

void XQueryPathWalk::takeNodes(size_t index, std::span<NSXMLNode* const> nodes) {
  const bool isExpression = index < _steps.size() && _steps[index].isExpression();
  if (isExpression) _internal(context).setLast(static_cast<int64_t>(nodes.size()));
  WorkPacer pacer;
  int64_t position = 0;
  for (NSXMLNode* node : nodes) {
    ++position;
    if (index == _steps.size()) {
      pacer.turn();
      results.addNode(node, context);
    } else if (isExpression) {
      takeItem(index, node, position, false);
    } else {
      takeNode(index, node);
    }
    if (isOver()) return;
  }
}

void XQueryPathWalk::takeNode(size_t index, NSXMLNode* node) {
  if (index == _steps.size()) return results.addNode(node, context);
  const XQueryWalkedStep& step = _steps[index];
  if (step.isExpression()) {
    _internal(context).setLast(1);
    return takeItem(index, node, 1, false);
  }
  XQueryCheckStack(context);
  if (setsEveryFocus || step.testMayRaise) _internal(context).setContextItem(node, 0);
  if (absorbsNext(step, node)) {
    const bool isChild = _steps[index + 1].axis == XQueryAxisChild;
    const int axis = isChild ? XQueryAxisDescendant : XQueryAxisAttributesBelow;
    if (_steps[index + 1].arrivesByParents) return takeByParents(index + 1, axis, node);
    if (_steps[index + 1].countsBelow) return takeCountedBelow(index + 1, node);
    take(index + 1, axis, node);
  } else {
    take(index, step.axis, node);
  }
}

void XQueryPathWalk::takeItem(size_t index, NSObject* item, int64_t position, bool validate) {
  const auto* step = cast<XQueryFilterStep>(_steps[index].step);
  const Value value = step->valueFor(item, position, context);
  if (XQueryHasFailed(value, context)) {
    hasFailed = true;
  } else {
    takeValue(index + 1, value, validate);
  }
}

bool XQueryPathWalk::absorbsNext(const XQueryWalkedStep& step, const NSXMLNode* node) const {
  const bool isOpen =
      step.absorbsNext && orderIsFree && !setsEveryFocus && descendantsAreSubtree(node);
  const XQueryWalkedStep& next = *(&step + 1);
  if (!isOpen || (!next.countsBelow && !next.arrivesByParents)) return isOpen;
  // Parents are told apart by their order.
  return (!next.countsBelow || !listingStep) &&
         (!node->firstChild() || NSXMLNodeOrder::areComparable(node, node->firstChild()));
}

void XQueryPathWalk::take(size_t index, int axis, NSXMLNode* node) {
  const XQueryWalkedStep& step = _steps[index];
  if (step.lookup && takeLookedUp(index, axis, node)) return;
  if (!step.hasPredicates() || filtersEach(step)) {
    stream(index, axis, node);
  } else {
    filter(index, axis, node);
  }
}

// Lists what the step is to ask of; false where it has to walk.
bool XQueryPathWalk::lookUp(const XQueryWalkedStep& step, int axis, NSXMLNode* node,
                            std::vector<NSXMLNode*>& nodes) {
  const bool isOpen =
      axis == XQueryAxisChild || axis == XQueryAxisDescendant || axis == XQueryAxisAttributesBelow;
  if (!step.lookup || !isOpen || listingStep || setsEveryFocus) return false;
  // Diagnostics would show an error of the value twice.
  if (_internal(context).showsErrors()) return false;
  XQueryStepTest test(step, *this);
  return step.lookup->find(node, axis, test, context, nodes);
}

// False where the step has to walk.
bool XQueryPathWalk::takeLookedUp(size_t index, int axis, NSXMLNode* node) {
  const XQueryWalkedStep& step = _steps[index];
  std::vector<NSXMLNode*>& nodes = openNodeList();
  const bool areFound = lookUp(step, axis, node, nodes);
  if (areFound && filtersEach(step)) {
    takeEachKept(index, nodes);
  } else if (areFound && filterNodes(step, firstAsked(step), nodes)) {
    takeNodes(index + 1, nodes);
  } else {
    hasFailed = hasFailed || areFound;
  }
  closeNodeList();
  return areFound;
}

void XQueryPathWalk::takeEachKept(size_t index, std::span<NSXMLNode* const> nodes) {
  const XQueryWalkedStep& step = _steps[index];
  WorkPacer pacer;
  for (NSXMLNode* node : nodes) {
    pacer.turn();
    if (keepsAlone(step, firstAsked(step), node)) takeNode(index + 1, node);
    if (isOver()) return;
  }
}

// Whether nothing is asked of what this walk finds but its number, and no other walk of the step
// finds the same: from one node, children of children lie beside each other. A walk from the last
// child of a last child goes on to the end of the document, where others that walks start from may
// lie if the two are not the last of all: further down than children of children, or than their
// children where what the path starts from has a single child.
bool XQueryPathWalk::onlyCounts(size_t index, int axis, const NSXMLNode* node) const {
  const bool goesDown = axis == XQueryAxisDescendant || axis == XQueryAxisAttributesBelow;
  const XQueryWalkedStep& step = _steps[index];
  if (!goesDown || index + 1 != _steps.size() || step.hasPredicates()) return false;
  if (!startsFromOne || !results.countsOnly() || setsEveryFocus || listingStep) return false;
  const bool isJoined = step.axis != axis;  // with the "//" before it
  const auto before = _steps.first(isJoined ? index - 1 : index);
  const bool areChildren =
      std::all_of(before.begin(), before.end(),
                  [](const XQueryWalkedStep& each) { return each.axis == XQueryAxisChild; });
  constexpr size_t mostApart = 2;
  if (!areChildren || before.size() <= mostApart) return areChildren;
  return before.size() == mostApart + 1 && isOnlyChild(node->parent()->parent());
}

// Whether it is of use to ask the predicates before all nodes are found, and nobody can tell.
bool XQueryPathWalk::filtersEach(const XQueryWalkedStep& step) const {
  return step.filtersEach && results.mayEndEarly() && !listingStep && !setsEveryFocus;
}

// The same as filtering a list of nodes where no predicate can tell which place a node has in it.
bool XQueryPathWalk::keepsAlone(const XQueryWalkedStep& step, size_t firstPredicate,
                                NSXMLNode* node) {
  const auto& predicates = step.step->predicates();
  for (auto each = predicates.begin() + static_cast<std::ptrdiff_t>(firstPredicate);
       each != predicates.end(); ++each) {
    const XQueryNodeQuestion* question = XQueryNodeQuestionIn(each->get());
    const auto answer = question ? question->holdsFor(node, context) : std::nullopt;
    if (answer.value_or(false)) continue;
    if (answer) return false;
    if (XQueryStep::keeps(**each, node, 1, context)) continue;
    hasFailed = _internal(context).isFailing();
    return false;
  }
  return true;
}

// The same as the step does, which asks predicate after predicate of all nodes that are left.
bool XQueryPathWalk::filterNodes(const XQueryWalkedStep& step, size_t fromIndex,
                                 std::vector<NSXMLNode*>& nodes) {
  const auto& predicates = step.step->predicates();
  for (size_t index = fromIndex; index < predicates.size(); ++index) {
    if (index == step.positions.conditions.first) {
      index = keepUpToPosition(step, nodes) - 1;
      if (hasFailed) return false;
      continue;
    }
    if (index == step.positions.fromBack.predicate) {
      const uint64_t behind = step.positions.fromBack.behind;
      const bool isThere = behind < nodes.size();
      if (isThere) nodes[0] = nodes[nodes.size() - 1 - behind];
      nodes.resize(isThere ? 1 : 0);
      continue;
    }
    if (index == step.positions.sameForAll) {
      if (!keepAtOnce(*predicates[index], nodes)) return false;
      continue;
    }
    if (index == step.positions.range.predicate && keepRange(step.positions.range, nodes)) continue;
    const XQueryNodeQuestion* question =
        step.step->asksForPosition(index) ? nullptr : XQueryNodeQuestionIn(predicates[index].get());
    if (!question) return step.step->filterNodes(nodes, index, context);
    if (!keepNodes(*predicates[index], *question, nodes)) return false;
  }
  return true;
}

// Asks conditions no further than the position goes that is asked for behind them. Answers how many
// predicates are dealt with.
size_t XQueryPathWalk::keepUpToPosition(const XQueryWalkedStep& step,
                                        std::vector<NSXMLNode*>& nodes) {
  XQueryConditionFilter filter(*step.step, step.positions, context);
  WorkPacer pacer;
  size_t kept = 0;
  for (size_t i = 0; i < nodes.size() && !filter.isOver(); ++i) {
    pacer.turn();
    const size_t at = filter.goesBackwards() ? nodes.size() - 1 - i : i;
    NSXMLNode* node = nodes[at];
    if (filter.keeps(node, static_cast<int64_t>(at) + 1)) nodes[kept++] = node;
  }
  hasFailed = filter.hasFailed();
  nodes.resize(kept);
  return filter.predicatesDone();
}

// Of a predicate that answers the same for all nodes; false when a limit was reached.
bool XQueryPathWalk::keepAtOnce(const XQueryExpr& predicate, std::vector<NSXMLNode*>& nodes) {
  if (nodes.empty()) return true;
  const auto position = XQueryStep::positionIn(predicate, context);
  if (_internal(context).isFailing()) return false;
  if (!position) return true;
  const bool isThere = *position >= 1 && *position <= nodes.size();
  if (isThere) nodes[0] = nodes[*position - 1];
  nodes.resize(isThere ? 1 : 0);
  return true;
}

// False where the predicate has to be asked of each node.
bool XQueryPathWalk::keepRange(const XQueryPositionRange& range, std::vector<NSXMLNode*>& nodes) {
  if (nodes.empty()) return true;
  const auto positions = range.positionsOf(nodes.size(), context);
  if (!positions) return false;
  nodes.resize(static_cast<size_t>(std::min<uint64_t>(positions->last, nodes.size())));
  const auto before = std::min<uint64_t>(positions->first - 1, nodes.size());
  if (positions->hole > before && positions->hole <= nodes.size()) {
    nodes.erase(nodes.begin() + static_cast<std::ptrdiff_t>(positions->hole - 1));
  }
  nodes.erase(nodes.begin(), nodes.begin() + static_cast<std::ptrdiff_t>(before));
  return true;
}

// The focus that asking leaves is that of the last node.
bool XQueryPathWalk::keepNodes(const XQueryExpr& predicate, const XQueryNodeQuestion& question,
                               std::vector<NSXMLNode*>& nodes) {
  auto& dynamic = _internal(context);
  dynamic.setLast(static_cast<int64_t>(nodes.size()));
  NSXMLNode* const last = nodes.empty() ? nullptr : nodes.back();
  WorkPacer pacer;
  size_t kept = 0;
  for (size_t i = 0; i < nodes.size(); ++i) {
    pacer.turn();
    NSXMLNode* node = nodes[i];
    const auto answer = question.holdsFor(node, context);
    if (answer ? *answer
               : XQueryStep::keeps(predicate, node, static_cast<int64_t>(i) + 1, context)) {
      nodes[kept++] = node;
    } else if (!answer && dynamic.isFailing()) {
      return false;
    }
  }
  if (last) dynamic.setContextItem(last, static_cast<int64_t>(nodes.size()));
  nodes.resize(kept);
  return true;
}

// Hands each node on as it is found. What the test asks of a node is copied into the walk, where it
// stays in registers; names are what is walked for most.
void XQueryPathWalk::stream(size_t index, int axis, NSXMLNode* node) {
  XQueryStepTest test(_steps[index], *this);
  const NSXMLExpandedName* const name = test.onlyName();
  const bool isNamed = name || test.onlyNames();
  if ((isNamed || !_steps[index].testMayRaise) && onlyCounts(index, axis, node)) {
    count(_steps[index], axis, node);
  } else if (name) {
    streamMatching(index, axis, node,
                   [name, axis](auto act) { return XQueryNamedVisit(name, axis, act); });
  } else if (test.onlyNames()) {
    streamMatching(index, axis, node, [&test](auto act) { return XQueryChoiceVisit(test, act); });
  } else {
    streamMatching(index, axis, node, [&test](auto act) {
      return [&test, act](NSXMLNode* found) { return !test.matches(found) || act(found); };
    });
  }
}

void XQueryPathWalk::count(const XQueryWalkedStep& step, int axis, NSXMLNode* node) {
  XQueryStepTest test(step, *this);
  if (test.onlyName()) {
    XQueryWalkAnyAxis(node, axis, false, CountNamedVisit(test, results));
  } else if (test.onlyNames()) {
    XQueryWalkAnyAxis(node, axis, false, CountChoiceVisit(test, results));
  } else if (test.kindsAlone()) {
    XQueryWalkAnyAxis(node, axis, false, CountKindsVisit(test, results));
  } else {
    XQueryWalkAnyAxis(node, axis, false, CountVisit(test, results));
  }
}

// `visitOf` makes of what is to be done with a matching node a visitor of all nodes.
template <class VisitOf>
void XQueryPathWalk::streamMatching(size_t index, int axis, NSXMLNode* node, VisitOf visitOf) {
  const XQueryWalkedStep& step = _steps[index];
  const bool isLast = index + 1 == _steps.size();
  // Without a trail the walk ends as soon as the answer is certain.
  const bool isWalkedOnce = index == 0 && startsFromOne;
  size_t asked = 0;
  const auto handOn = [this, &step, isLast, index, &asked](NSXMLNode* found) {
    // A trail may go on after the end.
    if (isOver()) return false;
    ++asked;
    if (step.hasPredicates() && !keepsAlone(step, step.predicatesInTest, found)) return !hasFailed;
    if (isLast) {
      results.addNode(found, context);
    } else {
      takeNode(index + 1, found);
    }
    return !isOver();
  };
  if (step.gathersFirst) {
    std::vector<NSXMLNode*>& nodes = openNodeList();
    XQueryWalkAnyAxis(node, axis, false, visitOf([&nodes](NSXMLNode* found) {
                        nodes.push_back(found);
                        return true;
                      }));
    for (NSXMLNode* found : nodes) {
      if (isOver()) break;
      takeNode(index + 1, found);
    }
    closeNodeList();
  } else if (step.trail != XQueryWalkedStep::noTrail && !setsEveryFocus && !isWalkedOnce) {
    trail(step.trail).walk(node, axis, visitOf(handOn));
  } else {
    XQueryWalkAnyAxis(node, axis, false, visitOf(handOn));
  }
  _met += asked;
  if (step.lookup) step.lookup->noteAsked(node, asked);
  if (isLast) results.setIsReversed(step.isReverse());
}

// Gathers the nodes found from one context item, filters them and hands on what is left.
void XQueryPathWalk::filter(size_t index, int axis, NSXMLNode* node) {
  const XQueryWalkedStep& step = _steps[index];
  std::vector<NSXMLNode*>& nodes = openNodeList();
  const size_t predicatesDone = collect(step, axis, node, nodes);
  _met += nodes.size();
  if (step.lookup) step.lookup->noteAsked(node, nodes.size());
  if (listingStep == &step) {
    listed->insert(listed->end(), nodes.begin(), nodes.end());
  } else if (filterNodes(step, predicatesDone, nodes)) {
    takeNodes(index + 1, nodes);
  } else {
    hasFailed = true;
  }
  closeNodeList();
}

// Gathers the step's nodes along the axis, nearest first for a reverse axis. Answers how many
// predicates are dealt with: the walk stops at the node that a literal position asks for, and among
// children begins at the end where the position is counted from there.
size_t XQueryPathWalk::collect(const XQueryWalkedStep& step, int axis, NSXMLNode* node,
                               std::vector<NSXMLNode*>& nodes) {
  XQueryStepTest test(step, *this);
  const size_t first = step.predicatesInTest;
  const auto position = step.hasPredicates() ? step.step->literalPosition(first) : std::nullopt;
  if (position && !step.testMayRaise) {
    uint64_t left = *position;
    if (left == 0) return first + 1;
    XQueryWalkAnyAxis(node, axis, true, [&](NSXMLNode* found) {
      if (!test.matches(found) || --left > 0) return true;
      nodes.push_back(found);
      return false;
    });
    return first + 1;
  }
  const bool hasConditions =
      step.positions.conditions.first == first && !listingStep && !step.testMayRaise &&
      step.positions.fromBack.predicate != step.positions.conditions.position;
  if (hasConditions) return collectKept(step, axis, node, nodes);
  const bool isComputed = step.isPositionComputed && step.positions.sameForAll == first;
  if (isComputed && !listingStep && !step.testMayRaise) {
    collectComputed(step, axis, node, nodes);
    return first + 1;
  }
  const bool hasRange = step.positions.range.predicate == first &&
                        !step.positions.range.readsSize() && !listingStep && !step.testMayRaise;
  if (hasRange && collectRange(step, axis, node, nodes)) return first + 1;
  const bool isFromBack = step.positions.fromBack.predicate == first && axis == XQueryAxisChild;
  if (isFromBack && !listingStep && !step.testMayRaise) {
    collectFromBack(step, node, nodes);
    return first + 1;
  }
  walkFor(step, axis, node, [&nodes](NSXMLNode* found) {
    nodes.push_back(found);
    return true;
  });
  return first;
}

// Does something with each node that the test accepts, as long as that wants more of them.
template <class Act>
void XQueryPathWalk::walkFor(const XQueryWalkedStep& step, int axis, NSXMLNode* node, Act act) {
  XQueryStepTest test(step, *this);
  const auto walk = [&](auto visit) {
    if (step.trail != XQueryWalkedStep::noTrail && !setsEveryFocus) {
      trail(step.trail).walk(node, axis, visit);
    } else {
      XQueryWalkAnyAxis(node, axis, true, visit);
    }
  };
  if (const NSXMLExpandedName* name = test.onlyName()) {
    walk(XQueryNamedVisit(name, axis, act));
  } else if (test.onlyNames()) {
    walk(XQueryChoiceVisit(test, act));
  } else {
    walk([&test, act](NSXMLNode* found) { return !test.matches(found) || act(found); });
  }
}

// The same for conditions with a position behind them: the walk ends where no condition is asked
// any more.
size_t XQueryPathWalk::collectKept(const XQueryWalkedStep& step, int axis, NSXMLNode* node,
                                   std::vector<NSXMLNode*>& nodes) {
  XQueryConditionFilter filter(*step.step, step.positions, context);
  int64_t position = 0;
  walkFor(step, axis, node, [&](NSXMLNode* found) {
    if (filter.keeps(found, ++position)) nodes.push_back(found);
    return !filter.isOver();
  });
  hasFailed = hasFailed || filter.hasFailed();
  return filter.predicatesDone();
}

// The number is worked out when there is a node to ask it for: without any, it is not evaluated.
void XQueryPathWalk::collectComputed(const XQueryWalkedStep& step, int axis, NSXMLNode* node,
                                     std::vector<NSXMLNode*>& nodes) {
  XQueryStepTest test(step, *this);
  std::optional<uint64_t> left;
  XQueryWalkAnyAxis(node, axis, true, [&](NSXMLNode* found) {
    if (!test.matches(found)) return true;
    if (!left) left = XQueryStep::positionIn(*step.firstPredicate()->get(), context).value_or(0);
    if (*left == 0 || --*left > 0) return *left > 0;
    nodes.push_back(found);
    return false;
  });
  hasFailed = hasFailed || _internal(context).isFailing();
}

// The same for a range of positions; false where the predicate has to be asked of each node.
bool XQueryPathWalk::collectRange(const XQueryWalkedStep& step, int axis, NSXMLNode* node,
                                  std::vector<NSXMLNode*>& nodes) {
  XQueryStepTest test(step, *this);
  std::optional<XQueryPositionRange::Positions> positions;
  bool isOpen = true;
  uint64_t position = 0;
  XQueryWalkAnyAxis(node, axis, true, [&](NSXMLNode* found) {
    if (!test.matches(found)) return true;
    if (!positions) positions = step.positions.range.positions(context);
    isOpen = positions.has_value();
    if (!isOpen || ++position > positions->last) return false;
    if (position >= positions->first && position != positions->hole) nodes.push_back(found);
    return position < positions->last;
  });
  return isOpen;
}

void XQueryPathWalk::collectFromBack(const XQueryWalkedStep& step, const NSXMLNode* node,
                                     std::vector<NSXMLNode*>& nodes) {
  XQueryStepTest test(step, *this);
  uint64_t left = step.positions.fromBack.behind + 1;
  const auto visit = [&](NSXMLNode* found) {
    if (!test.matches(found) || --left > 0) return true;
    nodes.push_back(found);
    return false;
  };
  NSXMLNode* last = node->lastChild();
  if (last && visit(last)) XQueryWalkPrecedingSiblings(last, visit);
}

}  // namespace xquery
