// Functions about URIs and the documents that they name.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/URL.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_base_uri(const Value* arguments, size_t count, XQueryContext& context);
Value fn_document_uri(const Value* arguments, size_t count, XQueryContext& context);
Value fn_doc(const Value* arguments, size_t count, XQueryContext& context);
Value fn_collection(const Value* arguments, size_t count, XQueryContext& context);
Value fn_resolve_uri(const Value* arguments, size_t count, XQueryContext& context);

// The reference resolved against what locations of the active module are resolved against; by
// itself where there is nothing. Null for a text that is no URI reference.
Ref<NSURL> XQueryURLInContext(const Ref<NSString>& reference, XQueryContext& context);

}  // namespace xquery
