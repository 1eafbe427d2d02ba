// The string functions that take regular expressions.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

// Arguments are promoted to strings; omitted flags are the empty string. None for a wrong number of
// arguments, for invalid flags, patterns and replacements, and where the regular expression answers
// none.
Value fn_matches(const Value* arguments, size_t count, XQueryContext& context);
Value fn_replace(const Value* arguments, size_t count, XQueryContext& context);
Value fn_tokenize(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
