// Equality of whole sequences and trees.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_deep_equal(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
