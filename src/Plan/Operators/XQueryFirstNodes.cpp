#include "Plan/Operators/XQueryFirstNodes.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryAsking.h"

namespace xquery {

Value XQueryFirstNodes::computeValue(XQueryContext& context) const {
  // Diagnostics show every error that a predicate meets.
  if (_internal(context).showsErrors()) return plain().evaluateWithContext(context);
  return XQueryAsk(*_path, context, [&] { return _path->firstItems(_most, context); });
}

Value XQueryFirstTuples::computeValue(XQueryContext& context) const {
  if (_internal(context).showsErrors()) return plain().evaluateWithContext(context);
  return cast<XQueryFLWORExpr>(&plain())->firstItems(_most, context);
}

}  // namespace xquery
