// --stream: the query evaluated for one input record by record, each item written as it is found.
#pragma once

#include "Options.h"
#include "Timing.h"
#include "xquery/xquery.h"

namespace cli {

// The usage is wrong where the options ask for what a stream cannot do; throws WrongUsage.
void checkStream(const Options& options);

// What was found before a failure stays written, since somebody may have read it; but a file is
// replaced by a complete result or not at all. Throws Failure when it cannot be written.
Status runStream(const Options& options, const xquery::XQuery& query,
                 const xquery::XQueryConstants& constants, Phases& phases);

}  // namespace cli
