// Conditions on a node that look at nothing but the names from it up.
#pragma once

#include "Plan/Program.h"

namespace xquery {

// Whether the expression in the place answers alike for all elements that are reached from the
// document by the same names: paths up by name tests, whether there are nodes, how many, joined by
// "and", "or" and not().
bool XQueryIsOfWays(const XQueryProgram& program, XQueryPlaceID place);

}  // namespace xquery
