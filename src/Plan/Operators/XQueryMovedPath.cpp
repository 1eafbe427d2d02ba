#include "Plan/Operators/XQueryMovedPath.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"

namespace xquery {

Value XQueryMovedPath::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  const Value document = _start->evaluateWithContext(context);
  if (XQueryHasFailed(document, context)) return {};
  return document ? Value(NSNull::null()) : Value();
}

}  // namespace xquery
