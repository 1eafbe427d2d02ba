// Steps and paths.
//
// A shortcut for "//": a step descendant-or-self::node() and a child step after it visit, for a
// node whose descendant axis ends with its subtree, exactly the node's descendants, each once, as
// the child of its parent. The descendant axis visits the same nodes in document order without
// touching every node twice. The order differs (the two steps go parent by parent), so the child
// step takes the descendant axis of the node only when
//   - neither step has predicates, and the child step's test cannot raise an error,
//   - every step after them is an axis step that evaluates nothing and cannot raise an error, so
//     that nothing can tell in which order the nodes arrive, and
//   - the path's results will be sorted, and no error can arise from the path's own items.
// Binding finds the steps (`_absorbsNext`); the node and the results are looked at in processNode.
#include "Expr/XQueryPath.h"

#include "Eval/StackGuard.h"
#include "Eval/XQueryContextInternal.h"
#include "Expr/XQueryAxisWalk.h"
#include "Expr/XQueryPathRun.h"
#include "Expr/XQuerySequence.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryErrors.h"

#include <algorithm>

namespace xquery {
namespace {

bool allAreNodes(const Value& items) {
  const XQueryItemList list(items.get());
  for (size_t i = 0; i < list.count(); ++i) {
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
  return !node->parent() || XQueryDescendantStop(node);
}

}  // namespace

// --- the chain -----------------------------------------------------------------------------------

void XQueryStep::setNext(Ref<XQueryStep> next) {
  _next = std::move(next);
  _tail = nullptr;
}

void XQueryStep::setLast(Ref<XQueryStep> last) {
  XQueryStep* end = _tail ? _tail.get() : this;
  while (end->_next) end = end->_next.get();
  end->_next = last;
  _tail = std::move(last);
}

void XQueryStep::setPredicates(std::vector<Ref<XQueryExpr>> predicates) {
  _predicates = std::move(predicates);
  _literalPositions.clear();
  for (const auto& predicate : _predicates) {
    _literalPositions.push_back(literalPositionOf(predicate.get()));
  }
}

void XQueryStep::bindInfoForProlog(XQueryProlog& prolog) {
  if (_expr) _expr->bindInfoForProlog(prolog);
  for (const auto& predicate : _predicates) {
    if (!predicate) return;
    predicate->bindInfoForProlog(prolog);
  }
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

bool XQueryAxisStep::testMayRaise() const {
  if (const auto* nameTest = dyn_cast<XQueryNameTest>(_expr.get())) return nameTest->mayRaise();
  const auto* wildCard = dyn_cast<XQueryWildCardNameTest>(_expr.get());
  return wildCard && wildCard->mayRaise();
}

// Whether the step evaluates nothing and raises nothing.
bool XQueryAxisStep::isPure() const {
  return !testMayRaise() && hasOnlyLiteralPositions();
}

// Whether this is the step that "//" stands for.
bool XQueryAxisStep::isDescendantShorthand() const {
  const auto* test = dyn_cast<XQueryTypeDeclaration>(_expr.get());
  return _axis == XQueryAxisDescendantOrSelf && _predicates.empty() && test &&
         test->type() == XQueryTypeDeclaration::AnyKindTest && !test->data() &&
         test->acceptsCount(1);
}

bool XQueryAxisStep::takesPlainChildren() const {
  return _axis == XQueryAxisChild && _predicates.empty();
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
    } else if (validate) {
      raiseNoNode(XQueryErrors::contextItemNotANode, run.context);
    }
  }
}

void XQueryAxisStep::processNodes(const std::vector<NSXMLNode*>& nodes, XQueryPathRun& run) const {
  for (NSXMLNode* node : nodes) processNode(node, run);
}

void XQueryAxisStep::processNode(NSXMLNode* node, XQueryPathRun& run) const {
  enter(node, run);
  if (!_predicates.empty()) {
    filter(node, run);
  } else if (_absorbsNext && run.orderIsFree && !run.setsEveryFocus &&
             descendantsAreSubtree(node)) {
    cast<XQueryAxisStep>(_next.get())->stream(XQueryAxisDescendant, node, run);
  } else {
    stream(_axis, node, run);
  }
}

void XQueryAxisStep::enter(NSXMLNode* node, XQueryPathRun& run) const {
  XQueryCheckStack(run.context);
  if (run.setsEveryFocus || testMayRaise()) run.context._internal().setContextItem(node, 0);
}

// Hands each node on as it is found.
void XQueryAxisStep::stream(int axis, NSXMLNode* node, XQueryPathRun& run) const {
  XQueryNodeTest test(_expr.get(), run);
  if (const XQueryStep* next = _next.get()) {
    XQueryWalkAxis(node, axis, [&](NSXMLNode* found) {
      if (test.matches(found)) next->processNode(found, run);
      return true;
    });
    return;
  }
  XQueryWalkAxis(node, axis, [&](NSXMLNode* found) {
    if (test.matches(found)) run.results.addNode(found, run.context);
    return true;
  });
  run.results.setIsReversed(isReverse());
}

// Gathers the nodes found from one context item, filters them and hands on what is left.
void XQueryAxisStep::filter(NSXMLNode* node, XQueryPathRun& run) const {
  std::vector<NSXMLNode*>& nodes = run.openNodeList();
  const size_t predicatesDone = collect(node, nodes, run);
  filterNodes(nodes, predicatesDone, run.context);
  if (_next) {
    _next->processNodes(nodes, run);
  } else {
    for (NSXMLNode* found : nodes) run.results.addNode(found, run.context);
  }
  run.closeNodeList();
}

// Gathers the step's nodes along the axis, nearest first for a reverse axis. Answers how many
// predicates are dealt with: the walk stops at the node that a literal position asks for.
size_t XQueryAxisStep::collect(NSXMLNode* node, std::vector<NSXMLNode*>& nodes,
                               XQueryPathRun& run) const {
  XQueryNodeTest test(_expr.get(), run);
  const bool walksAlongAxis = _axis != XQueryAxisPreceding;
  const auto position = walksAlongAxis ? literalPosition(0) : std::nullopt;
  if (position && !testMayRaise()) {
    uint64_t left = *position;
    if (left == 0) return 1;
    XQueryWalkAxis(node, _axis, [&](NSXMLNode* found) {
      if (!test.matches(found) || --left > 0) return true;
      nodes.push_back(found);
      return false;
    });
    return 1;
  }
  XQueryWalkAxis(node, _axis, [&](NSXMLNode* found) {
    if (test.matches(found)) nodes.push_back(found);
    return true;
  });
  if (!walksAlongAxis) std::reverse(nodes.begin(), nodes.end());
  return 0;
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
  }
}

void XQueryFilterStep::processItem(NSObject* item, int64_t position, XQueryPathRun& run,
                                   bool validate) const {
  XQueryContext& context = run.context;
  XQueryCheckStack(context);
  if (_next && !XQueryIsNode(item)) raiseNoNode(XQueryErrors::itemNotANode, context);
  context._internal().setContextItem(item, position);
  Value value = _expr ? _expr->evaluateWithContext(context) : Value(NSNull::null());
  value = handlePreicatesFromIndex(0, std::move(value), context);
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

Value XQueryRootStepExpr::evaluateWithContext(XQueryContext& context) const {
  const auto* node = dyn_cast<NSXMLNode>(context._internal().contextItem());
  if (!node) raiseNoNode(XQueryErrors::contextItemNotANode, context);
  return XQueryTreatAs(node->rootNode(), *_type, context);
}

// --- paths ---------------------------------------------------------------------------------------

Ref<XQueryPathExpr> XQueryPathExpr::pathExprWithStep(Ref<XQueryStep> step) {
  return make<XQueryPathExpr>(std::move(step));
}

void XQueryPathExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  std::vector<XQueryStep*> steps;
  for (XQueryStep* step = _step.get(); step; step = step->next()) {
    step->bindInfoForProlog(prolog);
    steps.push_back(step);
  }
  // From the end, as long as everything behind a step evaluates and raises nothing.
  for (size_t i = steps.size(); i-- > 0;) {
    auto* step = dyn_cast<XQueryAxisStep>(steps[i]);
    if (!step || !step->isPure()) break;
    const auto* next = dyn_cast<XQueryAxisStep>(step->next());
    step->_absorbsNext = step->isDescendantShorthand() && next && next->takesPlainChildren();
  }
}

Value XQueryPathExpr::evaluateWithContext(XQueryContext& context) const {
  XQueryCheckStack(context);
  auto& dynamic = context._internal();
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  Value contextItem = dynamic.contextItem();
  Value result = evaluateSteps(context);
  // An error leaves the focus as it was when it was raised.
  dynamic.setContextItem(std::move(contextItem), position);
  dynamic.setLast(last);
  return result;
}

Value XQueryPathExpr::evaluateSteps(XQueryContext& context) const {
  const auto& dynamic = context._internal();
  const XQueryStep* step = _step.get();
  Value items = dynamic.contextItem();
  if (!isa<XQueryAxisStep>(step)) {
    const XQueryExpr* first = step ? step->expr() : nullptr;
    items = first ? first->evaluateWithContext(context) : Value(NSNull::null());
    if (step) {
      items = step->handlePreicatesFromIndex(0, std::move(items), context);
      step = step->next();
    }
  }
  if (!step || isNull(items)) return items;

  XQueryPathResults results;
  XQueryPathRun run(results, context);
  run.setsEveryFocus = !allAreNodes(items);
  run.orderIsFree = dynamic.ordered();
  step->processValue(items, run, true);
  return results.value(dynamic.ordered());
}

}  // namespace xquery
