// What the calling thread has taken of the processor so far, in seconds.
#pragma once

#include <ctime>

namespace bench {

inline double processorSeconds() {
  timespec time = {};
  clock_gettime(CLOCK_THREAD_CPUTIME_ID, &time);
  return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9;
}

}  // namespace bench
