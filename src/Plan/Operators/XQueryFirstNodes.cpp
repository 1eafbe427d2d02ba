#include "Plan/Operators/XQueryFirstNodes.h"

#include "Platform/Base/NSLog.h"

namespace xquery {

Value XQueryFirstNodes::computeValue(XQueryContext& context) const {
  // Diagnostics show every error that a predicate meets.
  if (XQueryLogEnabled()) return plain().evaluateWithContext(context);
  return _path->firstItems(_most, context);
}

}  // namespace xquery
