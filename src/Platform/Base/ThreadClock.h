// What a thread has taken of the processor, for limits that a busy machine is not to change. Asking
// is a system call.
#pragma once

#include <ctime>

namespace xquery {

inline double threadSeconds(clockid_t clock = CLOCK_THREAD_CPUTIME_ID) {
  timespec time = {};
  clock_gettime(clock, &time);
  return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9;
}

}  // namespace xquery
