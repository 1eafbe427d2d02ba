// What the types ask of the dynamic context, which lives in a room above and answers.
#pragma once

#include "xquery/Error.h"
#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/XQuery.h"

namespace xquery {

// Records the error in the context and ends the operation with it.
[[noreturn]] void XQueryRaise(XQueryContext& context, Ref<XQueryError> error);

// The namespaces in which a cast resolves the name of a QName: those of the active prolog. Null for
// a prefix that it does not declare.
Ref<NSString> XQueryDefaultElementNamespace(const XQueryContext& context);
Ref<NSString> XQueryNamespaceForPrefix(const XQueryContext& context, NSStringView prefix);

}  // namespace xquery
