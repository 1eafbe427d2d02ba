// An expression evaluated where a test expects errors as exceptions.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryExpr.h"

namespace xquery {

// What the expression answers. The error that it meets instead is thrown, as by code that raises.
inline Value evaluatedOrThrown(const XQueryExpr& expr, XQueryContext& context) {
  Value value = expr.evaluateWithContext(context);
  if (XQueryHasFailed(value, context)) _internal(context).throwFailure();
  return value;
}

}  // namespace xquery
