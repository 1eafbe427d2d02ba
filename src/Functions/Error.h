// Errors a query raises itself, and tracing.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_error(const Value* arguments, size_t count, XQueryContext& context);
Value fn_trace(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
