#include "Expr/XQueryExpr.h"

#include "Context/XQueryContextInternal.h"
#include "Types/XQueryErrors.h"

#include <new>
#include <stdexcept>

namespace xquery {

Ref<NSString> XQueryExpr::description() const {
  return NSString::stringWithASCII("<XQueryExpr>");
}

void XQueryCatchRaised(XQueryContext& context, const XQueryExpr& expr) {
  _internal(context).failAsRaised(expr.exprPlace());
}

void XQueryCatchFailure(XQueryContext& context, const XQueryExpr& expr) {
  auto& dynamic = _internal(context);
  try {
    throw;
  } catch (const std::bad_alloc&) {
    dynamic.failForWantOfMemory(expr.exprPlace());
  } catch (const std::length_error&) {
    // Only decimals throw it.
    dynamic.setError(XQueryErrors::tooManyDigits.error(), false);
    dynamic.failAsRaised(expr.exprPlace());
  }
}

}  // namespace xquery
