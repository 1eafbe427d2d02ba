// Paths as they are walked.
#pragma once

#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Planning.h"

namespace xquery {

// What walks the path that was written in the place, whatever rules have put around it; null where
// no path was written, or it is walked no more.
XQueryWalkedPath* XQueryWalkedPathAt(const XQueryPlanning& planning, XQueryPlaceID place);

}  // namespace xquery
