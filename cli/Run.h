// One run of the command: read, compile, evaluate, print.
#pragma once

#include "Options.h"

namespace cli {

// Runs on the calling thread, which should have a large stack: the depth of recursion that a query
// may reach is bounded by it.
[[nodiscard]] Status run(const Options& options);

}  // namespace cli
