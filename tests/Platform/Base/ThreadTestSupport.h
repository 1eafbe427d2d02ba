// The threads of the process, of which libraries that cannot be stopped leave some behind.
#pragma once

#include <chrono>
#include <cstddef>
#include <filesystem>
#include <iterator>
#include <thread>

namespace xquery {

inline ptrdiff_t threadCount() {
  return std::distance(std::filesystem::directory_iterator("/proc/self/task"), {});
}

// Until what other tests left behind is done as well.
inline void waitForTheLastThread() {
  for (int turn = 0; turn < 6000 && threadCount() > 1; ++turn) {
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
  }
}

}  // namespace xquery
