// Functions that ask for the focus and the static context.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_position(const Value* arguments, size_t count, XQueryContext& context);
Value fn_last(const Value* arguments, size_t count, XQueryContext& context);
Value fn_static_base_uri(const Value* arguments, size_t count, XQueryContext& context);
Value fn_default_collation(const Value* arguments, size_t count, XQueryContext& context);
Value fn_implicit_timezone(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
