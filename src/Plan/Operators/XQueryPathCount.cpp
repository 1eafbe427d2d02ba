#include "Plan/Operators/XQueryPathCount.h"

#include "Platform/Base/NSLog.h"
#include "Types/XQueryNumber.h"
#include "xquery/Number.h"

namespace xquery {

Value XQueryPathCount::computeValue(XQueryContext& context) const {
  // Diagnostics show every error that a predicate meets.
  if (XQueryLogEnabled()) return plain().evaluateWithContext(context);
  const uint64_t least = _question.least;
  const auto count = _path->countNodes(least == 0 ? UINT64_MAX : least, context);
  if (!count) return {};
  if (least == 0) return XQueryNumber::integerWithInt64(static_cast<int64_t>(*count));
  return NSNumber::numberWithBool((*count >= least) != _question.isNegated);
}

}  // namespace xquery
