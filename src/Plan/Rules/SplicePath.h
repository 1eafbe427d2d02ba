// The path that stands in a place takes the steps of another one that it begins with.
#pragma once

#include "Plan/Planning.h"

namespace xquery {

// Where nobody can tell: see SplicePaths.cpp.
void XQuerySplicePath(XQueryPlanning& planning, XQueryPlaceID place);

}  // namespace xquery
