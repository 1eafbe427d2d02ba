// The interactive session: queries from a terminal, evaluated one after the other.
//
// An entry is one line, or as many as it takes until nothing is open any more. What it declares
// stays for the entries that follow; each evaluation has a context of its own, so that it sees
// documents as they are by then.
#pragma once

#include "Options.h"

namespace cli {

// Until the user ends it. Throws Failure where INPUT or a document of the options cannot be read.
[[nodiscard]] Status runSession(const Options& options);

}  // namespace cli
