// The bound on nesting: the stack space that is really left on the calling thread.
#pragma once

namespace xquery {

// Whether enough stack is left to go one level deeper: one comparison of an address.
bool XQueryStackHasRoom();

}  // namespace xquery
