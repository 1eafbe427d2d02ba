// Evaluating what the plain way may not have come to yet, and may never.
#pragma once

#include "Expr/XQueryExpr.h"

namespace xquery {

// The value; null for an error, which leaves nothing behind. That goes for limits as well, such as
// a range of too many items; one that ends the whole evaluation is reached again at the next look
// at the work. The expression is repeatable.
Value XQueryValueOrNull(const XQueryExpr& expr, XQueryContext& context);

}  // namespace xquery
