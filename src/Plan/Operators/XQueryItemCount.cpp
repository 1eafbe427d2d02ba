#include "Plan/Operators/XQueryItemCount.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/XQueryAsking.h"
#include "Expr/XQueryLists.h"
#include "Expr/XQuerySequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "xquery/Number.h"

#include <algorithm>
#include <optional>

namespace xquery {
namespace {

// Whether it counts nodes, or picks items, among which there is no error.
const XQueryWalkedPath* countingPathIn(const XQueryExpr& expr) {
  const auto* planned = dyn_cast<XQueryPlannedExpr>(XQueryWithoutParentheses(&expr));
  const XQueryWalkedPath* path = planned ? planned->walkedPath() : nullptr;
  if (!path) return nullptr;
  return path->countsNodes() || (path->steps().empty() && path->picker()) ? path : nullptr;
}

std::optional<uint64_t> countItemsOfPath(const XQueryWalkedPath& path, uint64_t most,
                                         XQueryContext& context) {
  return XQueryAsk(path, context, [&] { return path.countItems(most, context); });
}

// A body that answers one error by itself makes the call fail.
std::optional<uint64_t> countItemsOfCall(const XQueryFunctionCall& call, uint64_t most,
                                         XQueryContext& context) {
  std::optional<uint64_t> count;
  const auto ask = [&](const XQueryExpr& body) {
    const XQueryWalkedPath* path = countingPathIn(body);
    if (path) count = countItemsOfPath(*path, most, context);
    if (count || _internal(context).isFailing()) return count.has_value();
    const Value items = body.evaluateWithContext(context);
    if (auto* error = dyn_cast<XQueryError>(items)) {
      _internal(context).fail(error, call.exprPlace());
    }
    if (!items || _internal(context).isFailing()) return false;
    count = XQueryItemList(items.get()).count();
    return true;
  };
  return call.askBody(ask, context) ? count : std::nullopt;
}

const XQueryExprList* listWithCommas(const XQueryExpr& expr) {
  const auto* list = dyn_cast<XQueryExprList>(&expr);
  return list && list->kind() == Kind::ExprList ? list : nullptr;
}

const XQueryWalkedPath* pathOfNodesIn(const XQueryExpr& expr) {
  const XQueryWalkedPath* path = countingPathIn(expr);
  return path && path->countsNodes() ? path : nullptr;
}

// One error by itself may be one of what asks for the items.
std::optional<uint64_t> countItemsOfList(const XQueryExprList& list, uint64_t most,
                                         XQueryContext& context) {
  XQueryItemTally tally(most);
  for (size_t index = 0; index < list.count() && !tally.isComplete(); ++index) {
    const XQueryExpr& element = *list.objectAtIndex(index);
    if (const XQueryWalkedPath* path = pathOfNodesIn(element)) {
      const auto count = XQueryAsk(*path, context, [&] { return path->countNodes(most, context); });
      if (!count) return std::nullopt;
      tally.addItems(*count);
      continue;
    }
    const Value value = element.evaluateWithContext(context);
    if (XQueryHasFailed(value, context) || isa<XQueryError>(value)) return std::nullopt;
    tally.add(value);
  }
  return std::min(tally.count(), most);
}

// None after an error, and where there is no value, as "." has none without a focus.
std::optional<uint64_t> countItems(const XQueryExpr& expr, uint64_t most, XQueryContext& context) {
  if (const auto* flwor = dyn_cast<XQueryFLWORExpr>(&expr)) {
    return XQueryAsk(expr, context, [&] { return flwor->countItems(most, context); });
  }
  const auto* call = dyn_cast<XQueryFunctionCall>(&expr);
  if (call && call->hasBody()) return countItemsOfCall(*call, most, context);
  if (const auto* list = listWithCommas(expr)) return countItemsOfList(*list, most, context);
  const auto* planned = dyn_cast<XQueryPlannedExpr>(&expr);
  if (planned && planned->walkedPath())
    return countItemsOfPath(*planned->walkedPath(), most, context);
  const Value items = expr.evaluateWithContext(context);
  if (!items) return std::nullopt;
  return XQueryItemList(items.get()).count();
}

}  // namespace

bool XQueryCountsItems(const XQueryExpr& expr) {
  if (const auto* flwor = dyn_cast<XQueryFLWORExpr>(&expr)) return flwor->orderSpecs().empty();
  if (const auto* call = dyn_cast<XQueryFunctionCall>(&expr)) return call->hasBody();
  if (const auto* list = listWithCommas(expr)) {
    for (size_t index = 0; index < list->count(); ++index) {
      if (pathOfNodesIn(*list->objectAtIndex(index))) return true;
    }
    return false;
  }
  const auto* planned = dyn_cast<XQueryPlannedExpr>(&expr);
  return planned && planned->walkedPath() && planned->walkedPath()->steps().empty();
}

Value XQueryItemCount::computeValue(XQueryContext& context) const {
  // Diagnostics show every error that a condition meets.
  if (_internal(context).showsErrors()) return plain().evaluateWithContext(context);
  XQueryCheckStack(context);
  const bool isAll = !_mayEndEarly || _question.least == 0;
  const auto count = countItems(*_counted, isAll ? UINT64_MAX : _question.least, context);
  if (count) return _question.answer(*count);
  return _internal(context).isFailing() ? Value() : plain().evaluateWithContext(context);
}

Value XQueryKeptCount::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  const auto count = countItems(plain(), UINT64_MAX, context);
  return count ? XQueryPathCount::Question{}.answer(*count) : Value();
}

Value XQueryAskedCount::computeValue(XQueryContext& context) const {
  const auto* count = dyn_cast<NSNumber>(_internal(context).variableForID(_varID));
  if (!count) return plain().evaluateWithContext(context);
  return _question.answer(static_cast<uint64_t>(count->integerValue()));
}

}  // namespace xquery
