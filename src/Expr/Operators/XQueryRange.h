// The range operator.
#pragma once

#include "Platform/Base/XQueryPlaces.h"
#include "xquery/Object.h"

#include <cstdint>

namespace xquery {

class XQueryContext;

// What the operands of a range come to.
struct XQueryRangeBounds {
  bool areIntegers = false;
  int64_t first = 0;  // not above `last`
  int64_t last = 0;
  // Without integers, the answer: null for invalid operands, the empty sequence in either form.
  Value answer;
};

XQueryRangeBounds XQueryRangeBoundsFrom(const Value& left, const Value& right,
                                        XQueryContext& context);
// How many integers bounds that have them enclose. Raises error 0 when they are too many: at the
// place, or where the expression stands that lets the error out.
uint64_t XQueryRangeCount(const XQueryRangeBounds& bounds, XQueryContext& context,
                          XQueryPlaceNumber at = 0);
// The integers from bounds that have them. Raises error 0 when they are too many.
Value XQueryRangeIntegers(const XQueryRangeBounds& bounds, XQueryContext& context);

// A general comparison with all the integers from `first` to `last`, which are not made for it, so
// that there may be any number of them: an integer, a double or an untyped number is compared with
// the bounds. Null where that does not tell the answer, which includes each that is an error.
Value XQueryGeneralComparisonWithRange(int type, const Value& left, int64_t first, int64_t last);

}  // namespace xquery
