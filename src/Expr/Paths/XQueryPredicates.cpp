// Predicates of path steps.
//
// A numeric literal selects by position and is never evaluated. Any other predicate is evaluated
// once per item with the item as focus; a number selects by position, anything else by its truth.
// An error in a predicate drops the item it arose for and nothing more: a path over irregular data
// keeps what fits, and the focus is what it was before the predicate was evaluated. Reaching an
// engine limit is no such error and ends the evaluation.
#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryTypeTable.h"

namespace xquery {
namespace {

// The literal that a predicate is, or holds as its only element.
const XQueryLiteral* literalIn(const XQueryExpr* predicate) {
  const auto* list = dyn_cast<XQueryExprList>(predicate);
  if (list && list->count() == 1) predicate = list->objectAtIndex(0);
  return dyn_cast<XQueryLiteral>(predicate);
}

Value itemAtPosition(const Value& items, uint64_t position) {
  if (isNull(items) || position == 0) return NSNull::null();
  if (const auto* array = dyn_cast<NSArray>(items)) {
    return position <= array->count() ? array->objects()[position - 1] : NSNull::null();
  }
  return position == 1 ? items : NSNull::null();
}

// A fraction is cut off, so that 2.5 selects the second item.
bool selects(const Value& result, int64_t position, XQueryContext& context) {
  if (!result) return false;
  if (XQueryIsNumericType(result.get())) {
    const auto* number = cast<NSNumber>(result);
    return number->compare(*XQueryNumber::zero()) > 0 &&
           number->unsignedIntegerValue() == static_cast<uint64_t>(position);
  }
  return XQueryIsTrue(XQueryEffectiveBooleanValue(result, context));
}

// Null when a limit was reached.
Value keptItems(const Value& items, const XQueryExpr& predicate, XQueryContext& context) {
  const XQueryItemList list(items.get());
  _internal(context).setLast(static_cast<int64_t>(list.count()));
  XQueryGatherer kept;
  for (size_t i = 0; i < list.count(); ++i) {
    NSObject* item = list[i];
    const bool isKept = XQueryStep::keeps(predicate, item, static_cast<int64_t>(i) + 1, context);
    if (isKept && item && item->kind() != Kind::Null) kept.add(item);
    if (_internal(context).isFailing()) return {};
  }
  return kept.value();
}

// False when a limit was reached.
bool keepNodes(std::vector<NSXMLNode*>& nodes, const XQueryExpr& predicate,
               XQueryContext& context) {
  _internal(context).setLast(static_cast<int64_t>(nodes.size()));
  size_t kept = 0;
  for (size_t i = 0; i < nodes.size(); ++i) {
    NSXMLNode* node = nodes[i];
    if (XQueryStep::keeps(predicate, node, static_cast<int64_t>(i) + 1, context)) {
      nodes[kept++] = node;
    } else if (_internal(context).isFailing()) {
      return false;
    }
  }
  nodes.resize(kept);
  return true;
}

}  // namespace

bool XQueryStep::keeps(const XQueryExpr& predicate, NSObject* item, int64_t position,
                       XQueryContext& context) {
  checkWork();
  auto& dynamic = _internal(context);
  dynamic.setContextItem(item, position);
  const int64_t last = dynamic.last();
  const Value result = predicate.evaluateWithContext(context);
  if (!XQueryHasFailed(result, context)) return selects(result, position, context);
  if (dynamic.isFailingForGood()) return false;
  dynamic.passOverFailure(nullptr);
  dynamic.setContextItem(item, position);
  dynamic.setLast(last);
  return false;
}

std::optional<uint64_t> XQueryStep::positionIn(const XQueryExpr& predicate,
                                               XQueryContext& context) {
  auto& dynamic = _internal(context);
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  Value item = dynamic.contextItem();
  const Value result = predicate.evaluateWithContext(context);
  if (XQueryHasFailed(result, context)) {
    if (dynamic.isFailingForGood()) return 0;
    dynamic.passOverFailure(nullptr);
    dynamic.setContextItem(std::move(item), position);
    dynamic.setLast(last);
    return 0;
  }
  if (!result) return 0;
  if (XQueryIsNumericType(result.get())) {
    const auto* number = cast<NSNumber>(result);
    return number->compare(*XQueryNumber::zero()) > 0 ? number->unsignedIntegerValue() : 0;
  }
  const bool isTrue = XQueryIsTrue(XQueryEffectiveBooleanValue(result, context));
  return isTrue ? std::nullopt : std::optional<uint64_t>(0);
}

std::optional<uint64_t> XQueryStep::literalPositionOf(const XQueryExpr* predicate) {
  const XQueryLiteral* literal = literalIn(predicate);
  if (!literal || !XQueryIsNumericType(literal->literalValue().get())) return std::nullopt;
  return cast<NSNumber>(literal->literalValue())->unsignedIntegerValue();
}

Value XQueryStep::handlePreicatesFromIndex(size_t index, Value items,
                                           XQueryContext& context) const {
  for (; index < _predicates.size() && items; ++index) {
    const XQueryExpr* predicate = _predicates[index].get();
    if (!predicate) break;
    if (const auto position = literalPosition(index)) {
      items = itemAtPosition(items, *position);
    } else {
      items = keptItems(items, *predicate, context);
    }
  }
  return items;
}

bool XQueryStep::filterNodes(std::vector<NSXMLNode*>& nodes, size_t fromIndex,
                             XQueryContext& context) const {
  for (size_t index = fromIndex; index < _predicates.size(); ++index) {
    const XQueryExpr* predicate = _predicates[index].get();
    if (!predicate) break;
    if (const auto position = literalPosition(index)) {
      const bool isThere = *position >= 1 && *position <= nodes.size();
      if (isThere) nodes[0] = nodes[*position - 1];
      nodes.resize(isThere ? 1 : 0);
    } else if (!keepNodes(nodes, *predicate, context)) {
      return false;
    }
  }
  return true;
}

}  // namespace xquery
