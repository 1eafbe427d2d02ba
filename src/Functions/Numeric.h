// Rounding and absolute values. The result has the type of the argument.
#pragma once

#include "xquery/Object.h"

#include <cstddef>
#include <cstdint>

namespace xquery {

class XQueryContext;

Value fn_abs(const Value* arguments, size_t count, XQueryContext& context);
Value fn_floor(const Value* arguments, size_t count, XQueryContext& context);
Value fn_ceiling(const Value* arguments, size_t count, XQueryContext& context);
Value fn_round(const Value* arguments, size_t count, XQueryContext& context);
Value fn_round_half_to_even(const Value* arguments, size_t count, XQueryContext& context);

// Rounds a number to `precision` digits after the point (negative: before it). Halves go toward
// positive infinity, or to the even neighbour. The empty sequence stays empty. A result that the
// number's type cannot hold fails as a cast to it does.
Value xqround(const Value& value, int64_t precision, bool halfToEven, XQueryContext& context);

}  // namespace xquery
