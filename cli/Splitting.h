// --split: one input cut into documents of so many records each, in one pass and in the memory of
// one record.
#pragma once

#include "Options.h"
#include "Timing.h"
#include "xquery/xquery.h"

namespace cli {

// Gives the positional arguments, INPUT and FOLDER, which are among the inputs, their meaning, and
// makes PATH the query. Throws WrongUsage, also where the options ask for what goes with results
// only.
void interpretSplit(Options& options);

// The pieces are written one after the other. Each is whole when it gets its name, and is named on
// standard output then; what a failure leaves unfinished is removed. Throws Failure.
Status runSplit(const Options& options, const xquery::XQuery& query,
                const xquery::XQueryVariables& constants, Phases& phases);

}  // namespace cli
