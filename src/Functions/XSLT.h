// Extension functions that apply stylesheets.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value ext_xslt(const Value* arguments, size_t count, XQueryContext& context);
Value ext_xslt_uri(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
