// What a where clause asks of the items of a path that its last "for" walks, beside what the
// predicates of the path ask: of
//
//   for $a in //book, $b in //article[year = $a/year] where $b/publisher = $a/publisher
//
// that the publishers are the same. So both pick articles, and not every one of a year is asked.
#pragma once

#include "Plan/Joins/XQueryJoinCondition.h"
#include "Plan/Planning.h"

namespace xquery {

// Adds equalities to the condition by which the last step of the path at the place, or its start,
// picks items: those of the where clause before which there is nothing that may fail. An item that
// one of them excludes, the where clause drops. None where the path is kept from one time to the
// next, or the clause has a type or a position, or other clauses stand behind it.
void XQueryAddTermsBehind(const XQueryPlanning& planning, XQueryPlaceID path,
                          XQueryJoinCondition& condition);

}  // namespace xquery
