// How much memory is taken: by an evaluation at its peak, and by this process now.
#pragma once

#include <string>

namespace bench {

// Evaluates the query once in a process of its own, started from this program, so that nothing
// measured before counts. Bytes beyond what the process held with the query compiled; 0 when it
// cannot be measured.
double peakBytesOf(const std::string& query);

// What this process holds, without what has been freed.
double residentBytes();

// What that process runs. Answers its exit status.
int reportPeak(const char* query);

}  // namespace bench
