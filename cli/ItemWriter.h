// How the items of a result are written.
#pragma once

#include "Options.h"
#include "Results.h"
#include "xquery/xquery.h"

namespace cli {

Framing framing(const Options& options);

// Stops at the first failed write. `inputName` is what --with-name puts before each item.
void writeItems(const Options& options, const std::string& inputName, const xquery::NSArray& items,
                ResultPart& result);

}  // namespace cli
