// Paths as they are walked.
#pragma once

#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Planning.h"

#include <cstddef>
#include <optional>

namespace xquery {

// What walks the path that was written in the place, whatever rules have put around it; null where
// no path was written, or it is walked no more.
XQueryWalkedPath* XQueryWalkedPathAt(const XQueryPlanning& planning, XQueryPlaceID place);

// Which of the predicates of its step stands in the place.
std::optional<size_t> XQueryPredicateAt(const XQueryPlace& place);

}  // namespace xquery
