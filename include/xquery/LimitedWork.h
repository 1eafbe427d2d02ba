// Work of a host that ends at limits as an evaluation does: reading, changing and writing
// documents.
//
//   XQueryLimits limits;
//   limits.cancelled = std::make_shared<std::atomic<bool>>(false);
//   Ref<NSXMLDocument> document;
//   const auto error = XQueryWithinLimits(limits, [&] {
//     document = NSXMLDocument::documentWithFile("large.xml", NSXMLNodeOptionsNone);
//   });
//   ... on another thread: limits.cancelled->store(true);
#pragma once

#include "xquery/Error.h"
#include "xquery/Export.h"
#include "xquery/Limits.h"

#include <functional>

namespace xquery {

// Does the work on the calling thread. Answers null when it came to its end, and otherwise the
// error of the limit that ended it: error 0 with a message that begins with "limit: ". What was
// begun then is given up: a document that was being read is not made, one that was being changed
// may be changed in part. All limits hold as for an evaluation; memory that the work frees may be
// that of values from before. Where the work waits for bytes of a pipe or a terminal, the limits
// are looked at when a signal interrupts the waiting, whose handler was installed without
// SA_RESTART. Passes on what the work throws of its own.
[[nodiscard]] XQUERY_EXPORT Ref<XQueryError> XQueryWithinLimits(const XQueryLimits& limits,
                                                                const std::function<void()>& work);

}  // namespace xquery
