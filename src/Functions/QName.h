// Functions about QNames and the prefixes in scope at a node.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_QName(const Value* arguments, size_t count, XQueryContext& context);
Value fn_resolve_QName(const Value* arguments, size_t count, XQueryContext& context);
Value fn_local_name_from_QName(const Value* arguments, size_t count, XQueryContext& context);
Value fn_namespace_uri_from_QName(const Value* arguments, size_t count, XQueryContext& context);
Value fn_namespace_uri_for_prefix(const Value* arguments, size_t count, XQueryContext& context);
Value fn_in_scope_prefixes(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
