// What planning costs a query that does not gain by it.
#pragma once

#include <string>

namespace bench {

// Prints those queries of bench/queries that take more than a tenth longer planned than as they are
// written, over small documents, and of all of them the median time of compiling them both ways.
// Evaluations are timed as reportPhrasings does it. The exit status of the program: 0 when there is
// no such query and all of them answer the same both ways.
[[nodiscard]] int reportPlanning(double factor, const std::string& ideas);

}  // namespace bench
