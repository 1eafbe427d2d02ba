// What the registry says of each function, compared with what its calls answer.
#pragma once

#include "arguments/Model.h"
#include "xquery/Collection.h"

#include <string>

namespace xquery::arguments {

// What the answer of a call, null for an error, shows to be wrong in the function's row; empty for
// nothing.
std::string contradictionInRow(const std::string& function, const Call& call,
                               const NSArray* answer);
// Whether the row takes the same numbers of arguments as the rule, up to five.
bool rowTakesAsRule(const Function& function);

}  // namespace xquery::arguments
