// How much memory an evaluation takes at its peak.
#pragma once

#include <string>

namespace bench {

// Evaluates the query once in a process of its own, started from this program, so that nothing
// measured before counts. Bytes beyond what the process held with the query compiled; 0 when it
// cannot be measured.
double peakBytesOf(const std::string& query);

// What that process runs. Answers its exit status.
int reportPeak(const char* query);

}  // namespace bench
