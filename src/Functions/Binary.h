// Extension functions over bytes. Binaries and texts in hexadecimal are taken alike.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value ext_binary_from_string(const Value* arguments, size_t count, XQueryContext& context);
Value ext_string_from_binary(const Value* arguments, size_t count, XQueryContext& context);
Value ext_binary_hex_to_base64(const Value* arguments, size_t count, XQueryContext& context);
Value ext_binary_base64_to_hex(const Value* arguments, size_t count, XQueryContext& context);
Value ext_binary_length(const Value* arguments, size_t count, XQueryContext& context);
Value ext_binary_insert(const Value* arguments, size_t count, XQueryContext& context);
Value ext_binary_remove(const Value* arguments, size_t count, XQueryContext& context);
Value ext_binary_find(const Value* arguments, size_t count, XQueryContext& context);
Value ext_binary_find_all(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
