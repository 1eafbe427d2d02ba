// Functions that compute one value from a sequence.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_sum(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
