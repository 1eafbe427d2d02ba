// The condition without which the tuples of a FLWOR come to nothing, however it is written.
#pragma once

#include "Plan/Planning.h"

namespace xquery {

// The place of C in "where C" and "return if (C) then T else ()", and of the path in "return
// $x[C]/a"; XQueryNoPlace for none. A tuple for which C does not hold, or the path finds nothing,
// yields nothing, and nothing further is evaluated for it.
XQueryPlaceID XQueryConditionOfTuples(const XQueryPlanning& planning, XQueryPlaceID flwor);

// Of "return $x[C]/a" and "return $x/b[C]" the path; XQueryNoPlace for anything else.
XQueryPlaceID XQueryFilterOfTuples(const XQueryPlanning& planning, XQueryPlaceID flwor);

// Whether the expression answers no item, and does nothing.
bool XQueryIsNothing(const XQueryPlanning& planning, XQueryPlaceID place);

}  // namespace xquery
