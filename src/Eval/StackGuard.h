// The bound on nesting: the stack space that is really left on the calling thread. Evaluation and
// binding recurse with the nesting of the query, which has no other limit.
#pragma once

#include <cstdint>

namespace xquery {

class XQueryContext;
class XQueryProlog;

// Whether enough stack is left to go one level deeper: one comparison of an address.
bool XQueryStackHasRoom();

// Raises error 0 "limit: expression nested too deeply" when there is none.
void XQueryCheckStack(XQueryContext& context);
// The same while binding: adds the error to the prolog (once) and answers false.
bool XQueryCheckStack(XQueryProlog& prolog);

}  // namespace xquery
