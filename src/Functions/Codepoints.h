// Strings as sequences of code points.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

// Null, besides for a wrong number of arguments, when an item is no number or no code point: a
// surrogate and what is above U+10FFFF are none.
Value fn_codepoints_to_string(const Value* arguments, size_t count, XQueryContext& context);
// A surrogate that is the whole string is answered as it is; a lone one in a longer string makes
// the answer null.
Value fn_string_to_codepoints(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
