// Casting between atomic types.
#pragma once

#include "Types/XQueryTypeTable.h"
#include "xquery/Object.h"

namespace xquery {

class XQueryContext;

// Casts one atomic value. A value that does not fit raises error 6 "value does not match a required
// type".
Value XQueryCastAs(const Value& object, XQueryTypeID type, XQueryContext& forContext);

// Atomizes first: to zero or one item when the empty sequence is allowed (and then answers it
// unchanged), else to exactly one. An item that cannot be cast at all raises error 6 "invalid type
// conversion".
Value XQueryCastObject(const Value& object, XQueryTypeID asType, XQueryContext& forContext,
                       bool allowEmpty);

// The same with the empty sequence refused.
Value XQueryCastAsTypeForContext(const Value& object, XQueryTypeID type, XQueryContext& context);

}  // namespace xquery
