// Atomization and the effective boolean value.
#pragma once

#include "Types/XQueryTypeTable.h"
#include "xquery/Number.h"
#include "xquery/Object.h"

namespace xquery {

class XQueryContext;

inline bool XQueryIsNode(const NSObject* object) {
  return object && object->isNode();
}

// How many items an atomization accepts.
enum XQueryOccurrence : int {
  XQueryOccurrenceAny = 0,
  XQueryOccurrenceAnyAlso = 1,  // asked for as "at most one" but accepts any number all the same
  XQueryOccurrenceExactlyOne = 2,
  XQueryOccurrenceAtLeastOne = 3,
};

// An atomic item is its own typed value; a node's is its string value as a plain string. Anything
// else raises error 6 "invalid type".
Value XQueryTypedValue(const Value& item, XQueryContext& context);
Value XQueryAtomization(const Value& value, XQueryContext& context);
// Raises error 6 "invalid type for automization" when the number of items does not fit.
Value XQueryAtomizationCheckingOccurrence(const Value& value, int code, XQueryContext& context);

// One of the two shared truth values, or the XQueryError passed in.
Value XQueryEffectiveBooleanValue(const Value& value, XQueryContext& context);
inline bool XQueryIsTrue(const Value& value) {
  return value.get() == NSNumber::trueValue();
}

}  // namespace xquery
