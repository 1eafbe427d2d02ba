// How the items of a result are written.
#pragma once

#include "Options.h"
#include "Output.h"
#include "xquery/xquery.h"

namespace cli {

// Stops at the first failed write.
void writeItems(const Options& options, const xquery::NSArray& items, Output& output);

}  // namespace cli
