// Whether a place is evaluated once at most in one evaluation of its body.
#pragma once

#include "Plan/Program.h"

namespace xquery {

bool XQueryIsEvaluatedOnce(const XQueryProgram& program, XQueryPlaceID place);

}  // namespace xquery
