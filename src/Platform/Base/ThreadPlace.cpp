#include "Platform/Base/ThreadPlace.h"

#include <algorithm>
#include <array>
#include <bit>
#include <mutex>
#include <new>
#include <thread>

namespace xquery {

constinit thread_local uint32_t assignedThreadPlace __attribute__((tls_model("initial-exec"))) =
    noThreadPlace;

namespace {

struct Places {
  std::mutex mutex;
  std::array<uint32_t, mostThreadPlaces> threads = {};  // running at each place
};

Places& places() {
  // Never destroyed: threads may end after the destructors that run at exit.
  alignas(Places) static unsigned char storage[sizeof(Places)];
  static Places* const shared = ::new (storage) Places;
  return *shared;
}

// Leaves the place to others when the thread ends.
struct Leaving {
  ~Leaving() {
    Places& all = places();
    const std::lock_guard<std::mutex> guard(all.mutex);
    --all.threads[assignedThreadPlace];
    assignedThreadPlace = noThreadPlace;
  }
};

}  // namespace

uint32_t threadPlaceCount() {
  constexpr uint32_t eachProcessor = 4;
  constexpr uint32_t fewest = 8;
  static const uint32_t count = std::bit_ceil(
      std::clamp(std::thread::hardware_concurrency() * eachProcessor, fewest, mostThreadPlaces));
  return count;
}

// The first of those with the fewest threads.
uint32_t assignThreadPlace() {
  Places& all = places();
  {
    const std::lock_guard<std::mutex> guard(all.mutex);
    const auto end = all.threads.begin() + threadPlaceCount();
    const auto found = std::min_element(all.threads.begin(), end);
    ++*found;
    assignedThreadPlace = static_cast<uint32_t>(found - all.threads.begin());
  }
  static thread_local Leaving leaving;
  static_cast<void>(&leaving);
  return assignedThreadPlace;
}

}  // namespace xquery
