// Extension functions between nodes and texts.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value ext_string_from_node(const Value* arguments, size_t count, XQueryContext& context);
Value ext_node_from_string(const Value* arguments, size_t count, XQueryContext& context);
Value ext_xpath_for_node(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
