// The xquery command. The work is done on a thread of its own for the sake of its stack: 1 GiB of
// address space, of which only what is used is ever touched, lets a plainly recursive function go
// deep before the engine reports that it is nested too deeply.
#include "Options.h"
#include "Run.h"

#include <cstddef>
#include <cstdio>
#include <pthread.h>
#include <signal.h>

namespace {

struct Job {
  const cli::Options& options;
  cli::Status status = cli::StatusInput;
};

void* runJob(void* argument) {
  Job& job = *static_cast<Job*>(argument);
  job.status = cli::run(job.options);
  return nullptr;
}

// Where so much address space is not to be had, half of it is tried, and so on.
bool runOnLargeStack(Job& job) {
  constexpr size_t largest = size_t{1} << 30, smallest = size_t{1} << 20;
  for (size_t size = largest; size >= smallest; size /= 2) {
    pthread_attr_t attributes;
    pthread_t thread;
    pthread_attr_init(&attributes);
    pthread_attr_setstacksize(&attributes, size);
    const int failure = pthread_create(&thread, &attributes, runJob, &job);
    pthread_attr_destroy(&attributes);
    if (failure == 0) return pthread_join(thread, nullptr) == 0;
  }
  return false;
}

}  // namespace

int main(int argc, char** argv) {
  // A reader that goes away is a failed write like any other, to be reported and not to die of.
  signal(SIGPIPE, SIG_IGN);
  cli::Options options;
  if (const auto status = cli::parseOptions(argc, argv, options)) return *status;
  Job job{options};
  if (!runOnLargeStack(job)) std::fprintf(stderr, "xquery: cannot start a thread\n");
  return job.status;
}
