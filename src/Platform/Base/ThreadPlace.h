// Places for what threads would get in each other's way at, were there only one of it.
//
// An object that several threads count goes from processor to processor with every count. Where one
// such object may as well be several, each thread uses the one at its own place. There are some
// places for each processor; more threads than that share places, which costs time and nothing
// else.
#pragma once

#include <cstdint>

namespace xquery {

constexpr uint32_t mostThreadPlaces = 64;

// A power of two.
uint32_t threadPlaceCount();

// The place of the calling thread while it runs, below the number of places.
uint32_t assignThreadPlace();
constexpr uint32_t noThreadPlace = UINT32_MAX;
extern constinit thread_local uint32_t assignedThreadPlace
    __attribute__((tls_model("initial-exec")));
inline uint32_t threadPlace() {
  const uint32_t place = assignedThreadPlace;
  return place == noThreadPlace ? assignThreadPlace() : place;
}

}  // namespace xquery
