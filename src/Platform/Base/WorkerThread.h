// Threads with a stack of known size, for libraries that recurse with what they read.
#pragma once

#include <csignal>
#include <cstddef>
#include <pthread.h>

namespace xquery {

// Whether it runs. The handlers of the host's signals are not run on it.
inline bool startWorkerThread(pthread_t& thread, size_t stackBytes, void* (*function)(void*),
                              void* argument) {
  pthread_attr_t attributes;
  if (pthread_attr_init(&attributes) != 0) return false;
  sigset_t all;
  sigset_t before;
  sigfillset(&all);
  pthread_sigmask(SIG_SETMASK, &all, &before);
  const bool isStarted = pthread_attr_setstacksize(&attributes, stackBytes) == 0 &&
                         pthread_create(&thread, &attributes, function, argument) == 0;
  pthread_sigmask(SIG_SETMASK, &before, nullptr);
  pthread_attr_destroy(&attributes);
  return isStarted;
}

}  // namespace xquery
