// Work on a stack of a known size.
#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <functional>
#include <pthread.h>

namespace xquery {

// How much more stack a function takes under sanitizers.
#ifdef XQUERY_SANITIZED
constexpr size_t sanitizedStackFactor = 4;
#else
constexpr size_t sanitizedStackFactor = 1;
#endif

// On a thread with a stack of that many bytes.
inline void onStack(size_t bytes, std::function<void()> work) {
  pthread_attr_t attributes;
  pthread_attr_init(&attributes);
  pthread_attr_setstacksize(&attributes, bytes);
  pthread_t thread;
  const auto run = [](void* argument) -> void* {
    (*static_cast<std::function<void()>*>(argument))();
    return nullptr;
  };
  const int failure = pthread_create(&thread, &attributes, run, &work);
  pthread_attr_destroy(&attributes);
  ASSERT_EQ(failure, 0);
  pthread_join(thread, nullptr);
}

}  // namespace xquery
