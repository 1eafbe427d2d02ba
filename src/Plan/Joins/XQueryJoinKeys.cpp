#include "Plan/Joins/XQueryJoinKeys.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"

namespace xquery {

Value XQueryJoinKeys::computeValue(XQueryContext& context) const {
  XQueryGatherer keys;
  if (!add(0, keys, context)) return {};
  return keys.value();
}

// The keys for the values of the clauses from one on; false for a failure.
bool XQueryJoinKeys::add(size_t clause, XQueryGatherer& keys, XQueryContext& context) const {
  if (clause == _clauses.size()) {
    Value key = plain().evaluateWithContext(context);
    if (!key || XQueryHasFailed(key, context)) return false;
    if (_areSingle && XQueryItemList(key.get()).count() > 1) return false;
    keys.add(std::move(key));
    return true;
  }
  const XQueryJoinClause& each = _clauses[clause];
  Value value = each.expr->evaluateWithContext(context);
  if (!value || XQueryHasFailed(value, context)) return false;
  if (!each.isLoop) {
    _internal(context).setVariable(std::move(value), each.varID);
    return add(clause + 1, keys, context);
  }
  std::vector<Value> items;
  if (!XQueryListItems(XQueryItemList(value.get()), items)) return false;
  for (Value& item : items) {
    checkWork();
    _internal(context).setVariable(std::move(item), each.varID);
    if (!add(clause + 1, keys, context)) return false;
  }
  return true;
}

}  // namespace xquery
