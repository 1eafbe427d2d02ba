// Steps and paths.
//
// A walk sees the tree as it was when it began. A later step may put the very node that the walk
// stands at into an element that it constructs, and a walk upwards would meet that element, the
// one around it, and so on for ever. So a step before one that may give nodes a parent finds all
// its nodes first and hands them on afterwards (findGatheringSteps).
#include "Expr/Paths/XQueryPath.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryAxisWalk.h"
#include "Expr/Paths/XQueryPathResults.h"
#include "Expr/Paths/XQueryPathRun.h"
#include "Expr/XQueryParts.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryErrors.h"

namespace xquery {
namespace {

[[noreturn]] void raiseNoNode(const XQueryErrorText<>& text, XQueryContext& context) {
  _internal(context).raise(text.error());
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
  notePositions();
}

void XQueryStep::notePositions() {
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
      if (run.hasFailed) return;
    } else if (validate) {
      raiseNoNode(XQueryErrors::contextItemNotANode, run.context);
    }
  }
}

void XQueryAxisStep::processNodes(const std::vector<NSXMLNode*>& nodes, XQueryPathRun& run) const {
  for (NSXMLNode* node : nodes) {
    processNode(node, run);
    if (run.hasFailed) return;
  }
}

void XQueryAxisStep::processNode(NSXMLNode* node, XQueryPathRun& run) const {
  XQueryCheckStack(run.context);
  _internal(run.context).setContextItem(node, 0);
  if (_predicates.empty()) {
    stream(node, run);
  } else {
    filter(node, run);
  }
}

// Does something with each node on the axis that the test accepts, nearest first for a reverse axis
// whose nodes are filtered.
template <class Act>
void XQueryAxisStep::walk(NSXMLNode* node, XQueryPathRun& run, Act act) const {
  XQueryNodeTest test(expr(), run);
  const auto visit = [&test, act](NSXMLNode* found) { return !test.matches(found) || act(found); };
  if (_predicates.empty()) {
    XQueryWalkAxis(node, _axis, visit);
  } else {
    XQueryWalkAlongAxis(node, _axis, visit);
  }
}

// Hands each node on as it is found.
void XQueryAxisStep::stream(NSXMLNode* node, XQueryPathRun& run) const {
  const XQueryStep* next = _next.get();
  const auto handOn = [next, &run](NSXMLNode* found) {
    if (next) {
      next->processNode(found, run);
    } else {
      run.results.addNode(found, run.context);
    }
    return !run.hasFailed;
  };
  if (_gathersFirst) {
    std::vector<NSXMLNode*>& nodes = run.openNodeList();
    gather(node, nodes, run);
    for (NSXMLNode* found : nodes) {
      if (!handOn(found)) break;
    }
    run.closeNodeList();
  } else {
    walk(node, run, handOn);
  }
  if (!next) run.results.setIsReversed(isReverse());
}

void XQueryAxisStep::gather(NSXMLNode* node, std::vector<NSXMLNode*>& nodes,
                            XQueryPathRun& run) const {
  walk(node, run, [&nodes](NSXMLNode* found) {
    nodes.push_back(found);
    return true;
  });
}

// Gathers the nodes found from one context item, filters them and hands on what is left.
void XQueryAxisStep::filter(NSXMLNode* node, XQueryPathRun& run) const {
  std::vector<NSXMLNode*>& nodes = run.openNodeList();
  gather(node, nodes, run);
  if (!filterNodes(nodes, 0, run.context)) {
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
  _internal(run.context).setLast(static_cast<int64_t>(list.count()));
  for (size_t i = 0; i < list.count(); ++i) {
    processItem(list[i], static_cast<int64_t>(i) + 1, run, validate);
    if (run.hasFailed) return;
  }
}

void XQueryFilterStep::processNode(NSXMLNode* node, XQueryPathRun& run) const {
  _internal(run.context).setLast(1);
  processItem(node, 1, run, false);
}

void XQueryFilterStep::processNodes(const std::vector<NSXMLNode*>& nodes,
                                    XQueryPathRun& run) const {
  _internal(run.context).setLast(static_cast<int64_t>(nodes.size()));
  for (size_t i = 0; i < nodes.size(); ++i) {
    processItem(nodes[i], static_cast<int64_t>(i) + 1, run, false);
    if (run.hasFailed) return;
  }
}

Value XQueryFilterStep::valueFor(NSObject* item, int64_t position, XQueryContext& context) const {
  XQueryCheckStack(context);
  if (_next && !XQueryIsNode(item)) raiseNoNode(XQueryErrors::itemNotANode, context);
  _internal(context).setContextItem(item, position);
  Value value = _expr ? _expr->evaluateWithContext(context) : Value(NSNull::null());
  if (value) value = handlePreicatesFromIndex(0, std::move(value), context);
  if (XQueryHasFailed(value, context)) return {};
  if (_next && !XQueryAllAreNodes(value)) raiseNoNode(XQueryErrors::itemNotANode, context);
  return value;
}

void XQueryFilterStep::processItem(NSObject* item, int64_t position, XQueryPathRun& run,
                                   bool validate) const {
  const Value value = valueFor(item, position, run.context);
  if (XQueryHasFailed(value, run.context)) {
    run.hasFailed = true;
  } else if (_next) {
    _next->processValue(value, run, validate);
  } else {
    run.results.add(value.get(), run.context);
  }
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
  const auto* node = dyn_cast<NSXMLNode>(_internal(context).contextItem());
  if (!node) return _internal(context).fail(XQueryErrors::contextItemNotANode.error(), exprPlace());
  return XQueryTreatAs(node->rootNode(), *_type, context);
}

// --- paths ---------------------------------------------------------------------------------------

Ref<XQueryPathExpr> XQueryPathExpr::pathExprWithStep(Ref<XQueryStep> step) {
  return make<XQueryPathExpr>(std::move(step));
}

void XQueryPathExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  for (XQueryStep* step = _step.get(); step; step = step->next()) step->bindInfoForProlog(prolog);
  findGatheringSteps();
}

void XQueryPathExpr::notePositions() {
  for (XQueryStep* step = _step.get(); step; step = step->next()) step->notePositions();
}

void XQueryPathExpr::findGatheringSteps() {
  XQueryStep* last = nullptr;  // the last one that may give nodes a parent
  for (XQueryStep* step = _step.get(); step; step = step->next()) {
    if (step->_mayAdopt) last = step;
  }
  for (XQueryStep* step = _step.get(); last && step != last; step = step->next()) {
    if (auto* axisStep = dyn_cast<XQueryAxisStep>(step)) axisStep->_gathersFirst = true;
  }
}

void XQueryPathExpr::visitParts(XQueryPartVisitor& visitor) {
  for (XQueryStep* step = _step.get(); step; step = step->next()) {
    step->visitParts(visitor, step == _step.get());
  }
}

// An error leaves the focus as it was when it was raised.
Value XQueryPathExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  auto& dynamic = _internal(context);
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  Value contextItem = dynamic.contextItem();
  Value value = walkSteps(context);
  if (XQueryHasFailed(value, context)) return {};
  dynamic.setContextItem(std::move(contextItem), position);
  dynamic.setLast(last);
  return value;
}

Value XQueryPathExpr::walkSteps(XQueryContext& context) const {
  const XQueryStep* step = _step.get();
  Value items = step ? _internal(context).contextItem() : NSNull::null();
  if (step && !isa<XQueryAxisStep>(step)) {
    items = step->expr() ? step->expr()->evaluateWithContext(context) : Value(NSNull::null());
    if (XQueryHasFailed(items, context)) return {};
    items = step->handlePreicatesFromIndex(0, std::move(items), context);
    if (XQueryHasFailed(items, context)) return {};
    step = step->next();
  }
  if (!step || isNull(items)) return items;
  XQueryPathResults results;
  XQueryPathRun run(results, context);
  step->processValue(items, run, true);
  return run.hasFailed ? Value() : results.value(_internal(context).ordered());
}

}  // namespace xquery
