#include "Plan/Operators/XQueryTakenVariable.h"

#include "Context/XQueryContextInternal.h"

namespace xquery {

Value XQueryTakenVariable::computeValue(XQueryContext& context) const {
  Value value = _internal(context).lastValueOfVariable(_varID);
  return value ? value : plain().evaluateWithContext(context);
}

}  // namespace xquery
