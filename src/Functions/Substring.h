// Functions that look for a part of a string or take one. The rules of FunctionsString.h hold.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

// The empty string is part, start and end of every string, of the empty one as well.
Value fn_contains(const Value* arguments, size_t count, XQueryContext& context);
Value fn_starts_with(const Value* arguments, size_t count, XQueryContext& context);
Value fn_ends_with(const Value* arguments, size_t count, XQueryContext& context);

// Positions count from 1 and are rounded, halves up.
Value fn_substring(const Value* arguments, size_t count, XQueryContext& context);
// The empty string where the other one is empty or not found.
Value fn_substring_before(const Value* arguments, size_t count, XQueryContext& context);
// The string itself where the other one is empty; the empty string where it is not found.
Value fn_substring_after(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
