// Functions about nodes and the values of nodes.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_string(const Value* arguments, size_t count, XQueryContext& context);
Value fn_data(const Value* arguments, size_t count, XQueryContext& context);
Value fn_number(const Value* arguments, size_t count, XQueryContext& context);
Value fn_name(const Value* arguments, size_t count, XQueryContext& context);
Value fn_local_name(const Value* arguments, size_t count, XQueryContext& context);
Value fn_namespace_uri(const Value* arguments, size_t count, XQueryContext& context);
Value fn_node_name(const Value* arguments, size_t count, XQueryContext& context);
Value fn_nilled(const Value* arguments, size_t count, XQueryContext& context);
Value fn_lang(const Value* arguments, size_t count, XQueryContext& context);
Value fn_id(const Value* arguments, size_t count, XQueryContext& context);
Value fn_idref(const Value* arguments, size_t count, XQueryContext& context);
Value fn_root(const Value* arguments, size_t count, XQueryContext& context);

// What fn:number of one item is, without a shortcut for texts that are no numbers.
Value XQueryDoubleOrNaN(const Value& item, XQueryContext& context);

}  // namespace xquery
