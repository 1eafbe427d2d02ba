// How long work keeps its thread's processor busy: what else the machine does at the time does not
// count, unlike by the clock on the wall.
#pragma once

#include <algorithm>
#include <ctime>

namespace xquery {

inline double processorSeconds() {
  timespec now = {};
  ::clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
  return static_cast<double>(now.tv_sec) + 1e-9 * static_cast<double>(now.tv_nsec);
}

template <class Work>
double processorSecondsOf(Work work) {
  const double start = processorSeconds();
  work();
  return processorSeconds() - start;
}

// Whether eight times the size takes about eight times as long; what grows with the square takes 64
// times as long. `measure` gives the seconds for a size. A try that something disturbed (other work
// on the same caches, a host that takes the processor away) is one of several.
template <class Measure>
bool growsInProportion(Measure measure, size_t size) {
  double small = 1e9;
  double large = 1e9;
  for (int turn = 0; turn < 5; ++turn) {
    small = std::min(small, measure(size / 8));
    large = std::min(large, measure(size));
    if (large < 24 * small) return true;
  }
  return false;
}

}  // namespace xquery
