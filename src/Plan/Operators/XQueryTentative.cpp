#include "Plan/Operators/XQueryTentative.h"

#include "Context/XQueryContextInternal.h"

namespace xquery {

Value XQueryValueOrNull(const XQueryExpr& expr, XQueryContext& context) {
  auto& dynamic = _internal(context);
  const Value item = dynamic.contextItem();
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  const Ref<XQueryError> error = dynamic.error();
  Value value = expr.evaluateWithContext(context);
  if (!XQueryHasFailed(value, context)) return value;
  dynamic.passOverFailure(error);
  dynamic.setContextItem(item, position);
  dynamic.setLast(last);
  return {};
}

}  // namespace xquery
