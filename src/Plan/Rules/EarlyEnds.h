// Whether the rest of a list may be left unevaluated.
#pragma once

#include "Plan/Planning.h"

namespace xquery {

// Whether nobody can tell whether what comes behind some item of a value was evaluated: it does
// nothing, leaves nothing and cannot fail. What the first clause of a FLWOR walks may fail, since
// it is evaluated once, before any item.
bool XQueryMayEndEarly(const XQueryPlanning& planning, XQueryPlaceID place);

}  // namespace xquery
