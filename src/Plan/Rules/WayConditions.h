// Conditions on a node that look at nothing but the names from it up.
#pragma once

#include "Plan/Facts.h"
#include "Plan/Program.h"

namespace xquery {

// Variables that hold nodes on one way, or above them, and those that hold the number of some.
struct XQueryWayVariables {
  XQueryVariableSet nodes;
  XQueryVariableSet numbers;
};

// Whether the expression in the place answers alike for all elements that are reached from the
// document by the same names, held by "." or by such a variable: paths up by names and kinds,
// whether there are nodes, how many, what they are called, joined by "and", "or", not() and
// quantifiers.
bool XQueryIsOfWays(const XQueryProgram& program, XQueryPlaceID place,
                    const XQueryWayVariables& variables = {});
// Whether it is the number of some nodes.
bool XQueryIsNumberOfNodes(const XQueryProgram& program, XQueryPlaceID place);

}  // namespace xquery
