#include "Plan/Operators/XQueryPathFilter.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Paths/XQueryPathPattern.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeIndexes.h"

#include <algorithm>

namespace xquery {
namespace {

const NSXMLDocument* documentOf(const XQueryContext& context) {
  const auto* item = dyn_cast<NSXMLNode>(_internal(context).contextItem());
  return item ? dyn_cast<NSXMLDocument>(item->rootNode()) : nullptr;
}

// Whether there is nothing to be had by asking it.
bool isAnsweredAtOnce(const XQueryWalkedPath& path, const NSXMLDocument& document) {
  return path.picker() ||
         std::any_of(path.steps().begin(), path.steps().end(), [&](const XQueryWalkedStep& step) {
           return step.lookup && step.lookup->isReady(&document);
         });
}

// Whether the path finds so much more than there is to be asked for that walking it and merging the
// two takes longer.
bool isWorthAsking(const XQueryPathPattern& pattern, size_t count, const NSXMLDocument& document) {
  constexpr size_t few = 64;
  if (count <= few) return true;
  const NSXMLIndexedWays known = NSXMLIndexedWays::of(&document);
  const auto most = known.elements ? pattern.mostAsked(*known.elements) : std::nullopt;
  constexpr uint64_t times = 3;
  return most && *most / times > count;
}

}  // namespace

Value XQueryPathFilter::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  const NSXMLDocument* document = documentOf(context);
  // Diagnostics show every error that a predicate meets.
  if (document && !_internal(context).showsErrors()) {
    if (_paths.right && !isAnsweredAtOnce(*_paths.right, *document)) {
      return filtered(*_operation->left(), *_paths.right, context);
    }
    if (_paths.left && !isAnsweredAtOnce(*_paths.left, *document)) {
      return filtered(*_operation->right(), *_paths.left, context);
    }
  }
  return plain().evaluateWithContext(context);
}

Value XQueryPathFilter::filtered(const XQueryExpr& operand, const XQueryWalkedPath& path,
                                 XQueryContext& context) const {
  const Value items = operand.evaluateWithContext(context);
  if (XQueryHasFailed(items, context)) return {};
  const NSXMLDocument* document = documentOf(context);
  if (items && document && XQueryAllAreNodes(items)) {
    XQueryPathPattern pattern(path, *document, context);
    const size_t count = XQueryItemList(items.get()).count();
    if (isWorthAsking(pattern, count, *document)) return keptOf(items, pattern, context);
  }
  const Value others = path.evaluateWithContext(context);
  if (XQueryHasFailed(others, context)) return {};
  const bool isLeft = &operand == _operation->left();
  return _operation->answerFor(isLeft ? items : others, isLeft ? others : items, context);
}

Value XQueryPathFilter::keptOf(const Value& items, XQueryPathPattern& pattern,
                               XQueryContext& context) const {
  auto& dynamic = _internal(context);
  Value contextItem = dynamic.contextItem();
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  const bool wantsFound = _operation->operatorType() == XQueryOperatorIntersect;
  const XQueryItemList list(items.get());
  XQueryGatherer kept;
  WorkPacer pacer;
  for (size_t i = 0; i < list.count(); ++i) {
    pacer.turn();
    const bool isFound = pattern.finds(cast<NSXMLNode>(list[i]));
    if (dynamic.isFailing()) return {};
    if (isFound == wantsFound) kept.add(list[i]);
  }
  dynamic.setContextItem(std::move(contextItem), position);
  dynamic.setLast(last);
  // In document order, each once.
  return XQueryOperatorExpr::sequenceOperatorEvaluate(XQueryOperatorUnion, kept.value(),
                                                      NSNull::null(), context);
}

}  // namespace xquery
