// Memory that is kept for the next evaluation, and how a host gets it back.
//
// What evaluations free stays with the process: making the next values costs less, and a process
// that evaluates all the time asks the system for nothing. So a process keeps about as much as its
// largest evaluation took. A host that is done with large ones, or that has other work to do, gives
// the rest back:
//
//   context = nullptr;  // with the results and documents that are no longer wanted
//   XQueryReleaseIdleMemory();
#pragma once

#include "xquery/Export.h"

namespace xquery {

// Gives the system back what nobody uses: of the calling thread, of threads that have ended, of
// what other threads handed on, and of what evaluations that were ended left behind. Other threads
// may evaluate meanwhile; what they keep for themselves at the time, some tens of kilobytes each,
// stays. Takes about a second for each gigabyte that is idle. Nothing that is in use is touched;
// may be called at any time on any thread.
XQUERY_EXPORT void XQueryReleaseIdleMemory();

}  // namespace xquery
