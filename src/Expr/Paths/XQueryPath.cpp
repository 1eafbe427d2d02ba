// Steps and paths.
//
// Two shortcuts rest on steps that can be repeated: axis steps whose test cannot raise an error and
// whose predicates answer the same for the same focus and do nothing else (an error in a predicate
// only drops its item). What a chain of such steps yields from a node is always the same, nobody
// can tell when or how often it is asked, and a result holds every node once. Binding finds where
// this holds (findShortcuts); both are left out while an error may arise from the path's own items,
// since it would leave the focus of the step it met.
//
// A step at the head of such a chain whose predicates cannot tell keeps a trail: it does not walk
// nodes again that it has walked from an earlier context item (XQueryAxisTrail). Trails hold nodes
// of the path's items only, which live as long as the evaluation: steps behind a filter step keep
// none.
//
// "//": a step descendant-or-self::node() and a child step after it visit, for a node whose
// descendant axis ends with its subtree, exactly the node's descendants, each once, as the child of
// its parent. The descendant axis visits the same nodes in document order without touching every
// node twice. The order differs (the two steps go parent by parent), so the child step takes the
// descendant axis of the node only when no predicate can tell, both are repeatable with all steps
// after them, and the path's results will be sorted.
//
// Where only the number of nodes is wanted, and perhaps not beyond some number, a step filters each
// node as it finds it and hands it on, so that the walk ends as soon as the answer is certain
// (countNodes). This too is for steps that can be repeated alone.
//
// A walk sees the tree as it was when it began. A later step may put the very node that the walk
// stands at into an element that it constructs, and a walk upwards would meet that element, the
// one around it, and so on for ever. So a step before one that may give nodes a parent finds all
// its nodes first and hands them on afterwards (findGatheringSteps).
#include "Expr/Paths/XQueryPath.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryAxisWalk.h"
#include "Expr/Paths/XQueryPathRun.h"
#include "Expr/XQueryParts.h"
#include "Expr/XQueryReads.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryErrors.h"

#include <algorithm>

namespace xquery {
namespace {

bool allAreNodes(const Value& items) {
  const XQueryItemList list(items.get());
  WorkPacer pacer;
  for (size_t i = 0; i < list.count(); ++i) {
    pacer.turn();
    if (!XQueryIsNode(list[i])) return false;
  }
  return true;
}

[[noreturn]] void raiseNoNode(const XQueryErrorText<>& text, XQueryContext& context) {
  context._internal().raise(text.error());
}

// Whether the node's descendant axis ends where its subtree ends.
bool descendantsAreSubtree(const NSXMLNode* node) {
  if (node->kind() != Kind::Element && node->kind() != Kind::Document) return false;
  // Without a node to stop at the walk goes to the end of the document, which is the end of the
  // subtree of the topmost node and of its last child.
  return XQueryDescendantStop(node) || !node->parent() || !node->parent()->parent();
}

}  // namespace

// --- the chain -----------------------------------------------------------------------------------

void XQueryStep::setNext(Ref<XQueryStep> next) {
  for (XQueryStep* step = _next.get(); step; step = step->next()) step->_isCutOff = true;
  _next = std::move(next);
  _tail = nullptr;
}

void XQueryStep::setLast(Ref<XQueryStep> last) {
  // A tail is reached through the links that lay before it then; a replaced link cut it off.
  XQueryStep* end = _tail && !_tail->_isCutOff ? _tail.get() : this;
  while (end->_next) end = end->_next.get();
  end->_next = last;
  _tail = std::move(last);
}

void XQueryStep::setPredicates(std::vector<Ref<XQueryExpr>> predicates) {
  _predicates = std::move(predicates);
  notePredicates();
}

void XQueryStep::notePredicates() {
  _literalPositions.clear();
  for (const auto& predicate : _predicates) {
    _literalPositions.push_back(literalPositionOf(predicate.get()));
  }
}

void XQueryStep::bindInfoForProlog(XQueryProlog& prolog) {
  const size_t adoptersBefore = prolog.adopterCount();
  if (_expr) _expr->bindInfoForProlog(prolog);
  for (const auto& predicate : _predicates) {
    if (!predicate) break;
    predicate->bindInfoForProlog(prolog);
  }
  _mayAdopt = prolog.adopterCount() != adoptersBefore;
}

void XQueryStep::visitParts(XQueryPartVisitor& visitor, bool isFirst) {
  visitor.step(*this);
  if (isa<XQueryAxisStep>(this)) {
    visitor.ownPart(_expr.get(), XQueryRole::NodeTest);
  } else {
    visitor.part(_expr, isFirst ? XQueryRole::FirstStep : XQueryRole::Step);
  }
  for (size_t index = 0; index < _predicates.size() && _predicates[index]; ++index) {
    // A literal position is never evaluated.
    if (literalPosition(index)) {
      visitor.ownPart(_predicates[index].get(), XQueryRole::Predicate);
    } else {
      visitor.part(_predicates[index], XQueryRole::Predicate);
    }
  }
}

bool XQueryStep::hasRepeatablePredicates(bool variablesMayChange) const {
  return std::all_of(firstPredicate(), _predicates.end(), [=](const auto& predicate) {
    return !predicate || XQueryIsRepeatable(*predicate, variablesMayChange);
  });
}

void XQueryStep::processItems(const Value&, XQueryPathResults&, XQueryContext&, bool) const {}

void XQueryStep::processValue(const Value&, XQueryPathRun&, bool) const {}

void XQueryStep::processNode(NSXMLNode*, XQueryPathRun&) const {}

void XQueryStep::processNodes(const std::vector<NSXMLNode*>&, XQueryPathRun&) const {}

// --- axis steps ----------------------------------------------------------------------------------

Ref<XQueryAxisStep> XQueryAxisStep::axisStepWithAxis(int axis, Ref<XQueryExpr> nodeTest) {
  return make<XQueryAxisStep>(axis, std::move(nodeTest));
}

void XQueryAxisStep::bindInfoForProlog(XQueryProlog& prolog) {
  auto* nameTest = dyn_cast<XQueryNameTest>(_expr.get());
  if (_axis == XQueryAxisAttribute && nameTest) nameTest->setAttribute(true);
  XQueryStep::bindInfoForProlog(prolog);
}

bool XQueryAxisStep::isValid(const NSXMLNode* node, const XQueryExpr* expr,
                             XQueryContext& context) {
  if (!node || !expr) return false;
  switch (expr->kind()) {
    case Kind::TypeDeclaration:
      return XQueryInstanceOf(node, *cast<XQueryTypeDeclaration>(expr), nullptr);
    case Kind::NameTest:
      // Elements and attributes alike, so that "self::a" also finds an attribute named a.
      return (node->kind() == Kind::Element || node->kind() == Kind::Attribute) &&
             cast<XQueryNameTest>(expr)->isValidNode(*node, &context);
    case Kind::WildCardNameTest:
      return cast<XQueryWildCardNameTest>(expr)->isValidNode(*node, &context);
    default:
      return false;
  }
}

void XQueryAxisStep::setChoice(std::unique_ptr<const XQueryNameChoice> names,
                               size_t predicatesInTest) {
  _choice = std::move(names);
  _predicatesInTest = predicatesInTest;
}

bool XQueryAxisStep::testMayRaise() const {
  if (const auto* nameTest = dyn_cast<XQueryNameTest>(_expr.get())) return nameTest->mayRaise();
  const auto* wildCard = dyn_cast<XQueryWildCardNameTest>(_expr.get());
  return wildCard && wildCard->mayRaise();
}

bool XQueryAxisStep::isDescendantShorthand() const {
  const auto* test = dyn_cast<XQueryTypeDeclaration>(_expr.get());
  return _axis == XQueryAxisDescendantOrSelf && _predicates.empty() && !_choice && test &&
         test->type() == XQueryTypeDeclaration::AnyKindTest && !test->data() &&
         test->acceptsCount(1);
}

// Whether the step may walk the descendants of a node in place of the children of each of them, or
// the attributes below it.
bool XQueryAxisStep::mayTakeDescendants() const {
  return (_axis == XQueryAxisChild || _axis == XQueryAxisAttribute) && hasPredicatesOfTruth();
}

// Whether walks of a step from different nodes may meet the same node and nothing can tell whether
// it is met again: predicates, apart from those that only ask for truth, see a list for each node
// walked from. Not counted are steps whose nodes go straight to the results, which hold each node
// once anyway.
bool XQueryAxisStep::mayWalkTwice(const XQueryAxisStep* previous) const {
  // One of these walks what is below in place of a "//" before it.
  if (_axis == XQueryAxisChild || _axis == XQueryAxisAttribute) {
    return previous && previous->isDescendantShorthand() && mayTakeDescendants();
  }
  if (hasPredicates()) return false;
  switch (_axis) {
    case XQueryAxisSelf:
      return false;
    case XQueryAxisParent:
      return static_cast<bool>(_next);
    default:
      return true;
  }
}

void XQueryAxisStep::processItems(const Value& items, XQueryPathResults& toResults,
                                  XQueryContext& forContext, bool validate) const {
  XQueryPathRun run(toResults, forContext);
  processValue(items, run, validate);
}

void XQueryAxisStep::processValue(const Value& items, XQueryPathRun& run, bool validate) const {
  const XQueryItemList list(items.get());
  for (size_t i = 0; i < list.count(); ++i) {
    if (auto* node = dyn_cast<NSXMLNode>(list[i])) {
      processNode(node, run);
      if (run.isOver()) return;
    } else if (validate) {
      raiseNoNode(XQueryErrors::contextItemNotANode, run.context);
    }
  }
}

void XQueryAxisStep::processNodes(const std::vector<NSXMLNode*>& nodes, XQueryPathRun& run) const {
  for (NSXMLNode* node : nodes) {
    processNode(node, run);
    if (run.isOver()) return;
  }
}

void XQueryAxisStep::processNode(NSXMLNode* node, XQueryPathRun& run) const {
  enter(node, run);
  if (absorbsNextFor(node, run)) {
    const auto* next = cast<XQueryAxisStep>(_next.get());
    const bool isChild = next->axis() == XQueryAxisChild;
    next->take(isChild ? XQueryAxisDescendant : XQueryAxisAttributesBelow, node, run);
  } else {
    take(_axis, node, run);
  }
}

void XQueryAxisStep::take(int axis, NSXMLNode* node, XQueryPathRun& run) const {
  if (!hasPredicates() || filtersEachFor(run)) {
    stream(axis, node, run);
  } else {
    filter(axis, node, run);
  }
}

// Whether it is of use to ask the predicates before all nodes are found, and nobody can tell.
bool XQueryAxisStep::filtersEachFor(const XQueryPathRun& run) const {
  return _filtersEach && run.results.mayEndEarly() && !run.listingStep && !run.setsEveryFocus;
}

// The same as filtering a list of nodes where no predicate can tell which place a node has in it.
bool XQueryAxisStep::keepsAlone(NSXMLNode* node, XQueryPathRun& run) const {
  for (auto predicate = firstPredicate(); predicate != _predicates.end(); ++predicate) {
    if (keeps(**predicate, node, 1, run.context)) continue;
    run.hasFailed = run.context._internal().isFailing();
    return false;
  }
  return true;
}

bool XQueryAxisStep::absorbsNextFor(const NSXMLNode* node, const XQueryPathRun& run) const {
  return _absorbsNext && run.orderIsFree && !run.setsEveryFocus && descendantsAreSubtree(node);
}

void XQueryAxisStep::enter(NSXMLNode* node, XQueryPathRun& run) const {
  XQueryCheckStack(run.context);
  if (run.setsEveryFocus || testMayRaise()) run.context._internal().setContextItem(node, 0);
}

// Hands each node on as it is found. What the test asks of a node is copied into the walk, where it
// stays in registers; names are what is walked for most.
void XQueryAxisStep::stream(int axis, NSXMLNode* node, XQueryPathRun& run) const {
  XQueryNodeTest test(*this, run);
  if (const NSXMLExpandedName* name = test.onlyName()) {
    streamMatching(axis, node, run, [name](auto act) { return XQueryNamedVisit(name, act); });
  } else if (test.onlyNames()) {
    streamMatching(axis, node, run, [&test](auto act) { return XQueryChoiceVisit(test, act); });
  } else {
    streamMatching(axis, node, run, [&test](auto act) {
      return [&test, act](NSXMLNode* found) { return !test.matches(found) || act(found); };
    });
  }
}

// `visitOf` makes of what is to be done with a matching node a visitor of all nodes.
template <class VisitOf>
void XQueryAxisStep::streamMatching(int axis, NSXMLNode* node, XQueryPathRun& run,
                                    VisitOf visitOf) const {
  const XQueryStep* next = _next.get();
  const auto handOn = [this, next, &run](NSXMLNode* found) {
    // A trail may go on after the end.
    if (run.isOver()) return false;
    if (hasPredicates() && !keepsAlone(found, run)) return !run.hasFailed;
    if (next) {
      next->processNode(found, run);
    } else {
      run.results.addNode(found, run.context);
    }
    return !run.isOver();
  };
  if (_gathersFirst) {
    std::vector<NSXMLNode*>& nodes = run.openNodeList();
    XQueryWalkAxis(node, axis, visitOf([&nodes](NSXMLNode* found) {
                     nodes.push_back(found);
                     return true;
                   }));
    for (NSXMLNode* found : nodes) {
      if (run.isOver()) break;
      next->processNode(found, run);
    }
    run.closeNodeList();
  } else if (_trail != noTrail && !run.setsEveryFocus) {
    run.trail(_trail).walk(node, axis, visitOf(handOn));
  } else {
    XQueryWalkAxis(node, axis, visitOf(handOn));
  }
  // What predicates have filtered is sorted forward, also where they have become part of the test.
  if (!next) run.results.setIsReversed(isReverse() && _predicates.empty());
}

// Gathers the nodes found from one context item, filters them and hands on what is left.
void XQueryAxisStep::filter(int axis, NSXMLNode* node, XQueryPathRun& run) const {
  std::vector<NSXMLNode*>& nodes = run.openNodeList();
  const size_t predicatesDone = collect(axis, node, nodes, run);
  if (run.listingStep == this) {
    run.listed->insert(run.listed->end(), nodes.begin(), nodes.end());
    return run.closeNodeList();
  }
  if (!filterNodes(nodes, predicatesDone, run.context)) {
    run.hasFailed = true;
  } else if (_next) {
    _next->processNodes(nodes, run);
  } else {
    WorkPacer pacer;
    for (NSXMLNode* found : nodes) {
      pacer.turn();
      run.results.addNode(found, run.context);
    }
  }
  run.closeNodeList();
}

// Gathers the step's nodes along the axis, nearest first for a reverse axis. Answers how many
// predicates are dealt with: the walk stops at the node that a literal position asks for.
size_t XQueryAxisStep::collect(int axis, NSXMLNode* node, std::vector<NSXMLNode*>& nodes,
                               XQueryPathRun& run) const {
  XQueryNodeTest test(*this, run);
  const size_t first = _predicatesInTest;
  const auto position = hasPredicates() ? literalPosition(first) : std::nullopt;
  if (position && !testMayRaise()) {
    uint64_t left = *position;
    if (left == 0) return first + 1;
    XQueryWalkAlongAxis(node, axis, [&](NSXMLNode* found) {
      if (!test.matches(found) || --left > 0) return true;
      nodes.push_back(found);
      return false;
    });
    return first + 1;
  }
  const auto walk = [&](auto visit) {
    if (_trail != noTrail && !run.setsEveryFocus) {
      run.trail(_trail).walk(node, axis, visit);
    } else {
      XQueryWalkAlongAxis(node, axis, visit);
    }
  };
  const auto add = [&nodes](NSXMLNode* found) {
    nodes.push_back(found);
    return true;
  };
  if (const NSXMLExpandedName* name = test.onlyName()) {
    walk(XQueryNamedVisit(name, add));
  } else if (test.onlyNames()) {
    walk(XQueryChoiceVisit(test, add));
  } else {
    walk([&test, add](NSXMLNode* found) { return !test.matches(found) || add(found); });
  }
  return first;
}

// --- filter steps --------------------------------------------------------------------------------

Ref<XQueryFilterStep> XQueryFilterStep::filterStepWithExpr(Ref<XQueryExpr> expr) {
  return make<XQueryFilterStep>(std::move(expr));
}

void XQueryFilterStep::processItems(const Value& items, XQueryPathResults& toResults,
                                    XQueryContext& forContext, bool validate) const {
  XQueryPathRun run(toResults, forContext);
  processValue(items, run, validate);
}

void XQueryFilterStep::processValue(const Value& items, XQueryPathRun& run, bool validate) const {
  const XQueryItemList list(items.get());
  run.context._internal().setLast(static_cast<int64_t>(list.count()));
  for (size_t i = 0; i < list.count(); ++i) {
    processItem(list[i], static_cast<int64_t>(i) + 1, run, validate);
    if (run.hasFailed) return;
  }
}

void XQueryFilterStep::processNode(NSXMLNode* node, XQueryPathRun& run) const {
  run.context._internal().setLast(1);
  processItem(node, 1, run, false);
}

void XQueryFilterStep::processNodes(const std::vector<NSXMLNode*>& nodes,
                                    XQueryPathRun& run) const {
  run.context._internal().setLast(static_cast<int64_t>(nodes.size()));
  for (size_t i = 0; i < nodes.size(); ++i) {
    processItem(nodes[i], static_cast<int64_t>(i) + 1, run, false);
    if (run.hasFailed) return;
  }
}

void XQueryFilterStep::processItem(NSObject* item, int64_t position, XQueryPathRun& run,
                                   bool validate) const {
  XQueryContext& context = run.context;
  XQueryCheckStack(context);
  if (_next && !XQueryIsNode(item)) raiseNoNode(XQueryErrors::itemNotANode, context);
  context._internal().setContextItem(item, position);
  Value value = _expr ? _expr->evaluateWithContext(context) : Value(NSNull::null());
  if (value) value = handlePreicatesFromIndex(0, std::move(value), context);
  if (XQueryHasFailed(value, context)) {
    run.hasFailed = true;
    return;
  }
  if (!_next) {
    run.results.add(value.get(), context);
    return;
  }
  if (!allAreNodes(value)) raiseNoNode(XQueryErrors::itemNotANode, context);
  _next->processValue(value, run, validate);
}

// --- the root step -------------------------------------------------------------------------------

XQueryRootStep::XQueryRootStep() : XQueryFilterStep(XQueryRootStepExpr::expr(), Kind::RootStep) {}

Ref<XQueryRootStep> XQueryRootStep::rootStep() {
  return make<XQueryRootStep>();
}

XQueryRootStepExpr::XQueryRootStepExpr()
    : XQueryExpr(Kind::RootStepExpr), _type(XQueryTypeDeclaration::document(nullptr)) {}

Ref<XQueryRootStepExpr> XQueryRootStepExpr::expr() {
  return make<XQueryRootStepExpr>();
}

Value XQueryRootStepExpr::computeValue(XQueryContext& context) const {
  const auto* node = dyn_cast<NSXMLNode>(context._internal().contextItem());
  if (!node) return context._internal().fail(XQueryErrors::contextItemNotANode.error());
  return XQueryTreatAs(node->rootNode(), *_type, context);
}

// --- paths ---------------------------------------------------------------------------------------

Ref<XQueryPathExpr> XQueryPathExpr::pathExprWithStep(Ref<XQueryStep> step) {
  return make<XQueryPathExpr>(std::move(step));
}

void XQueryPathExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  for (XQueryStep* step = _step.get(); step; step = step->next()) step->bindInfoForProlog(prolog);
  noteChange();
}

void XQueryPathExpr::visitParts(XQueryPartVisitor& visitor) {
  for (XQueryStep* step = _step.get(); step; step = step->next()) {
    step->visitParts(visitor, step == _step.get());
  }
}

Value XQueryPathExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  XQueryPathResults results;
  Value items;
  switch (evaluateSteps(context, items, results)) {
    case Answer::Failed:
      return {};
    case Answer::Items:
      return items;
    case Answer::Results:
      break;
  }
  return results.value(context._internal().ordered());
}

std::optional<uint64_t> XQueryPathExpr::countNodes(uint64_t most, XQueryContext& context) const {
  XQueryCheckStack(context);
  XQueryPathResults results;
  results.endAfter(most);
  results.countOnly();
  Value items;
  const Answer answer = evaluateSteps(context, items, results);
  if (answer == Answer::Failed) return std::nullopt;
  // What answers nodes goes through all of the steps, but for no items at all.
  return answer == Answer::Items ? 0 : std::min(results.count(), most);
}

// An item that is no node is an error, wherever it stands among the others. The first nodes of all
// are those that are found first only where these come in order.
bool XQueryPathExpr::mayEndEarly(const XQueryStep& step, const Value& items,
                                 const XQueryPathRun& run) const {
  if (run.setsEveryFocus || run.results.countsOnly()) return !run.setsEveryFocus;
  const auto* start = dyn_cast<NSXMLNode>(items.get());
  const auto* axisStep = dyn_cast<XQueryAxisStep>(&step);
  if (!start || !axisStep || !run.orderIsFree) return false;
  return !axisStep->_absorbsNext || axisStep->absorbsNextFor(start, run);
}

Value XQueryPathExpr::firstItems(uint64_t most, XQueryContext& context) const {
  XQueryCheckStack(context);
  XQueryPathResults results;
  results.endAfter(most);
  Value items;
  const Answer answer = evaluateSteps(context, items, results);
  if (answer == Answer::Results) return results.value(context._internal().ordered());
  return answer == Answer::Items ? items : Value();
}

// An error leaves the focus as it was when it was raised.
XQueryPathExpr::Answer XQueryPathExpr::evaluateSteps(XQueryContext& context, Value& items,
                                                     XQueryPathResults& results) const {
  auto& dynamic = context._internal();
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  Value contextItem = dynamic.contextItem();
  const Answer answer = walkSteps(context, items, results);
  if (answer == Answer::Failed) return answer;
  dynamic.setContextItem(std::move(contextItem), position);
  dynamic.setLast(last);
  return answer;
}

XQueryPathExpr::Answer XQueryPathExpr::walkSteps(XQueryContext& context, Value& items,
                                                 XQueryPathResults& results) const {
  const auto& dynamic = context._internal();
  const XQueryStep* step = _step.get();
  items = dynamic.contextItem();
  if (!isa<XQueryAxisStep>(step)) {
    items = step ? evaluateFirstStep(*step, context) : Value(NSNull::null());
    if (XQueryHasFailed(items, context)) return Answer::Failed;
    if (step) step = step->next();
  }
  if (!step || isNull(items)) return Answer::Items;

  XQueryPathRun run(results, context);
  run.setsEveryFocus = !allAreNodes(items);
  run.orderIsFree = dynamic.ordered();
  if (results.mayEndEarly() && !mayEndEarly(*step, items, run)) results.takeAll();
  run.trailCount = _trailCount;
  if (!_picker || !pickNodes(items, *step, run)) step->processValue(items, run, true);
  return run.hasFailed ? Answer::Failed : Answer::Results;
}

Value XQueryPathExpr::evaluateFirstStep(const XQueryStep& step, XQueryContext& context) const {
  Value items = step.expr() ? step.expr()->evaluateWithContext(context) : Value(NSNull::null());
  if (XQueryHasFailed(items, context)) return {};
  if (_picker && _pickedStep == &step && pickItems(items, context)) return items;
  return step.handlePreicatesFromIndex(0, std::move(items), context);
}

// --- picking -------------------------------------------------------------------------------------

// Filters the items of the first step, of which only some are asked; false when each has to be.
bool XQueryPathExpr::pickItems(Value& items, XQueryContext& context) const {
  const auto listItems = [&items](std::vector<Value>& listed) {
    return XQueryListItems(XQueryItemList(items.get()), listed);
  };
  XQueryPicks picks;
  if (!_picker->pick(items, listItems, context, picks)) return false;
  context._internal().setLast(static_cast<int64_t>(picks.items->size()));
  XQueryGatherer kept;
  for (const XQueryPick& pick : picks.chosen) {
    const Value& item = (*picks.items)[pick.position];
    if (pick.isSure || _pickedStep->keepsByAll(item.get(), int64_t{pick.position} + 1, context)) {
      kept.add(item);
    } else if (context._internal().isFailing()) {
      items = Value();
      return true;
    }
  }
  items = kept.value();
  return true;
}

// The nodes that reach the predicates of a step from `firstStep`.
bool XQueryPathExpr::listNodes(const Value& start, const XQueryStep& firstStep,
                               const XQueryStep& step, XQueryPathRun& run,
                               std::vector<Value>& listed) const {
  XQueryPathRun listing(run.results, run.context);
  listing.setsEveryFocus = false;
  listing.orderIsFree = run.orderIsFree;
  listing.trailCount = _trailCount;
  listing.listingStep = &step;
  listing.listed = &listed;
  firstStep.processValue(start, listing, true);
  run.hasFailed = listing.hasFailed;
  return !listing.hasFailed;
}

bool XQueryPathExpr::listNodesBefore(const XQueryStep& step, XQueryContext& context,
                                     std::vector<Value>& nodes) const {
  const XQueryStep* firstStep = _step.get();
  Value start = context._internal().contextItem();
  if (!isa<XQueryAxisStep>(firstStep)) {
    start = evaluateFirstStep(*firstStep, context);
    if (XQueryHasFailed(start, context)) return false;
    firstStep = firstStep->next();
  }
  if (!start || !allAreNodes(start)) return false;
  XQueryPathResults results;
  XQueryPathRun run(results, context);
  return isNull(start) || listNodes(start, *firstStep, step, run, nodes);
}

// The same for the nodes that reach the picked step from `firstStep`: hands on what is left.
bool XQueryPathExpr::pickNodes(const Value& start, const XQueryStep& firstStep,
                               XQueryPathRun& run) const {
  if (!isa<XQueryAxisStep>(_pickedStep) || run.setsEveryFocus) return false;
  const auto list = [&](std::vector<Value>& listed) {
    return listNodes(start, firstStep, *_pickedStep, run, listed);
  };
  XQueryPicks picks;
  const bool hasPicked = _picker->pick(start, list, run.context, picks);
  if (run.hasFailed) return true;
  if (!hasPicked) return false;
  std::vector<NSXMLNode*>& nodes = run.openNodeList();
  for (const XQueryPick& pick : picks.chosen) {
    auto* node = cast<NSXMLNode>((*picks.items)[pick.position]);
    // The predicates cannot tell at which position the node stands.
    if (pick.isSure || _pickedStep->keepsByAll(node, 1, run.context)) {
      nodes.push_back(node);
    } else if (run.context._internal().isFailing()) {
      run.hasFailed = true;
      return true;
    }
  }
  if (_pickedStep->next()) {
    _pickedStep->next()->processNodes(nodes, run);
  } else {
    for (NSXMLNode* node : nodes) run.results.addNode(node, run.context);
  }
  run.closeNodeList();
  return true;
}

}  // namespace xquery
