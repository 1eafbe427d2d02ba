#include "Plan/Operators/XQueryAskedEarly.h"

#include "Context/XQueryContextInternal.h"
#include "xquery/Number.h"

namespace xquery {

Value XQueryAskedEarly::computeValue(XQueryContext& context) const {
  if (_internal(context).showsErrors()) return plain().evaluateWithContext(context);
  return NSNumber::trueValue();
}

}  // namespace xquery
