// The global variables of one evaluation: what the host supplied, and the prolog's declarations.
#pragma once

#include "xquery/XQuery.h"

namespace xquery {

class XQueryProlog;

// Makes each constant a global of the name that its key stands for in the prolog. A key that is not
// UTF-8 or does not resolve is skipped, and so is one without a value; values are taken as given.
void XQuerySetConstants(const XQueryVariables& constants, const XQueryProlog& prolog,
                        XQueryContext& context);

// Gives every variable that the prolog declares or imported its value, the imported ones first,
// each module's in declaration order. Raises error 16 for an external variable without a value, for
// an initializer without one, and for any external function.
void XQueryEvaluateDeclarations(const XQueryProlog& prolog, XQueryContext& context);

}  // namespace xquery
