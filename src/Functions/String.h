// Functions over whole strings: comparing, joining, measuring.
//
// Unless said otherwise an argument is promoted to a string, the empty sequence being the empty
// string, a collation is promoted and then not used, positions count UTF-16 units, and a result is
// an xs:string. Null answers a wrong number of arguments.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

// By code point; empty when either string is the empty sequence.
Value fn_compare(const Value* arguments, size_t count, XQueryContext& context);
Value fn_concat(const Value* arguments, size_t count, XQueryContext& context);
Value fn_string_join(const Value* arguments, size_t count, XQueryContext& context);
Value fn_string_length(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
