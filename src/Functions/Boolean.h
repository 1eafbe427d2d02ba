// Functions about truth values.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_true(const Value* arguments, size_t count, XQueryContext& context);
Value fn_false(const Value* arguments, size_t count, XQueryContext& context);
Value fn_boolean(const Value* arguments, size_t count, XQueryContext& context);
Value fn_not(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
