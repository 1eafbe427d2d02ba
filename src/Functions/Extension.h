// Extension functions: queries inside queries, the clock, the bytes behind a URL.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value ext_eval(const Value* arguments, size_t count, XQueryContext& context);
Value ext_node_xquery(const Value* arguments, size_t count, XQueryContext& context);
Value ext_node_xpath(const Value* arguments, size_t count, XQueryContext& context);
Value ext_test(const Value* arguments, size_t count, XQueryContext& context);
Value ext_real_date_time(const Value* arguments, size_t count, XQueryContext& context);
Value ext_uri_body(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
