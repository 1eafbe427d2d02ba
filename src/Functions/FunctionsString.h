// Functions over strings.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_concat(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
