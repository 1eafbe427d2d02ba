#include "Plan/Operators/XQueryLateElement.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"

namespace xquery {

Value XQueryLateElement::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  Value before;
  Value behind;
  if (!gather(0, _element, before, context)) return {};
  if (!gather(_element + 1, _list.count(), behind, context)) return {};
  Value late = _list.objectAtIndex(_element)->evaluateWithContext(context);
  if (XQueryHasFailed(late, context)) return {};
  XQueryGatherer all;
  all.add(std::move(before));
  all.add(std::move(late));
  all.add(std::move(behind));
  return all.value();
}

// What stands there, as it is gathered from one after the other.
bool XQueryLateElement::gather(size_t from, size_t to, Value& value, XQueryContext& context) const {
  XQueryGatherer parts;
  for (size_t index = from; index < to; ++index) {
    Value part = _list.objectAtIndex(index)->evaluateWithContext(context);
    if (XQueryHasFailed(part, context)) return false;
    parts.add(std::move(part));
  }
  value = parts.value();
  return true;
}

}  // namespace xquery
