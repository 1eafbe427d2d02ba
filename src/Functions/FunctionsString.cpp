#include "Functions/FunctionsString.h"

#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "xquery/Collection.h"
#include "xquery/String.h"

namespace xquery {

// The answer is a plain string, which is an untyped value.
Value fn_concat(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2) return Value();
  NSMutableString text;
  for (size_t index = 0; index < count; ++index) {
    Value item =
        XQueryAtomizationCheckingOccurrence(arguments[index], XQueryOccurrenceAnyAlso, context);
    if (isa<NSNull>(item)) continue;
    item = XQueryCastAsTypeForContext(item, XQueryTypeString, context);
    if (!isa<NSString>(item)) return item;
    text.append(cast<NSString>(item)->view());
  }
  return text.string();
}

}  // namespace xquery
