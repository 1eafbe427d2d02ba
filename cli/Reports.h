// What standard error hears about a failure.
#pragma once

#include "Documents.h"
#include "Options.h"

#include <string>

namespace cli {

// Lines of text or, with --as json, of JSON, ready for a terminal. `input` names what of several
// inputs failed; empty where there is no need to say.
std::string report(const Options& options, const Failure& failure, const std::string& input = {});

}  // namespace cli
