// Asking an expression for something else than its value, such as how many items that has.
#pragma once

#include "Expr/XQueryExpr.h"
#include "xquery/Exception.h"

#include <exception>

namespace xquery {

// What `ask` answers, or nothing after an error, which has arisen in the expression then as it
// would have if its value had been asked for.
template <class Ask>
auto XQueryAsk(const XQueryExpr& expr, XQueryContext& context, const Ask& ask) -> decltype(ask()) {
  try {
    return ask();
  } catch (const NSException&) {
    XQueryCatchRaised(context, expr);
  } catch (const std::exception&) {
    XQueryCatchFailure(context, expr);
  }
  return {};
}

}  // namespace xquery
