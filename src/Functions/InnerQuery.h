// Queries that an evaluation compiles and evaluates itself.
//
// Such a query has a context of its own and shares nothing with the evaluation around it: neither
// variables nor namespaces, caches or client. What binds the outer evaluation binds it as well: how
// things are loaded, and what is left of the limits. Queries within queries nest to a fixed depth,
// so that one that evaluates itself ends soon.
#pragma once

#include "xquery/Collection.h"
#include "xquery/Error.h"
#include "xquery/XQuery.h"

namespace xquery {

constexpr int XQueryMostInnerQueries = 100;

struct XQueryInnerResult {
  Ref<NSArray> items;      // null on failure and where there is no value
  Ref<XQueryError> error;  // null where there is none
};

// A limit that the inner query reaches ends the outer evaluation as well: its error is raised
// there.
XQueryInnerResult XQueryEvaluateInnerQuery(const Ref<NSString>& source, const Value& contextItem,
                                           XQueryContext& outer);

// The same for a result that must consist of nodes: an item that is none is error 19.
XQueryInnerResult XQueryEvaluateInnerPath(const Ref<NSString>& path, const Value& contextItem,
                                          XQueryContext& outer);

}  // namespace xquery
