// The xquery command. A query may recurse as deep as the stack is, so the work wants a large one: a
// hundred thousand calls within clauses and constructors find room. Only what is used of it is ever
// touched.
//
// The stack of the main thread grows up to a limit that takes effect when a program starts, so the
// limit is raised and the program started anew. A thread with a large stack would do without that,
// but a process with two threads counts references and allocates with atomic steps: arithmetic over
// a range took 1.7 times as long. It remains for where the limit cannot be raised, and for where
// the address space is bounded: the room for a thread's stack is taken beforehand, whereas a main
// thread that finds none when its stack grows is killed.
#include "Options.h"
#include "Run.h"
#include "Streams.h"

#include <algorithm>
#include <cstddef>
#include <filesystem>
#include <pthread.h>
#include <sys/auxv.h>
#include <sys/resource.h>
#include <system_error>
#include <unistd.h>

namespace {

// Code that was not optimized takes several times as much.
#if defined(__OPTIMIZE__) && !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
constexpr size_t stackSize = size_t{256} << 20;
#else
constexpr size_t stackSize = size_t{1} << 30;
#endif

// How much address space the process may take; RLIM_INFINITY where it is not bounded.
rlim_t addressSpace() {
  rlimit space;
  return getrlimit(RLIMIT_AS, &space) == 0 ? space.rlim_cur : RLIM_INFINITY;
}

bool hasLargeStack() {
  rlimit limit;
  return getrlimit(RLIMIT_STACK, &limit) == 0 && limit.rlim_cur != RLIM_INFINITY &&
         limit.rlim_cur >= stackSize;
}

// Comes back only when the program cannot be started with a large stack. It is never tried twice,
// since a program that was started so finds the limit raised; emulators that only pretend to raise
// it are not believed.
void restartWithLargeStack(char** argv) {
  // What was started as an argument of the dynamic loader finds the loader in /proc.
  const bool isStartedByLoader = getauxval(AT_BASE) == 0;
  rlimit limit;
  if (isStartedByLoader || getrlimit(RLIMIT_STACK, &limit) != 0 || limit.rlim_max < stackSize) {
    return;
  }
  std::error_code error;
  const std::filesystem::path program = std::filesystem::read_symlink("/proc/self/exe", error);
  if (error) return;
  const rlim_t previous = limit.rlim_cur;
  limit.rlim_cur = stackSize;
  if (setrlimit(RLIMIT_STACK, &limit) != 0 || !hasLargeStack()) return;
  execv(program.c_str(), argv);
  limit.rlim_cur = previous;
  setrlimit(RLIMIT_STACK, &limit);
}

struct Job {
  const cli::Options& options;
  cli::Status status = cli::StatusInput;
};

void* runJob(void* argument) {
  Job& job = *static_cast<Job*>(argument);
  job.status = cli::run(job.options);
  return nullptr;
}

// Three quarters of a bounded address space are left for the rest. Where so much is not to be had,
// half of it is tried, and so on.
bool runOnThread(Job& job) {
  constexpr size_t smallest = size_t{1} << 20;
  const size_t most = std::min<rlim_t>(stackSize, addressSpace() / 4);
  for (size_t size = most; size >= smallest; size /= 2) {
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
  const bool isBounded = addressSpace() != RLIM_INFINITY;
  const bool usesMainStack = !isBounded && hasLargeStack();
  if (!isBounded && !usesMainStack) restartWithLargeStack(argv);
  cli::prepareStandardStreams();
  cli::Options options;
  if (const auto status = cli::parseOptions(argc, argv, options)) return *status;
  Job job{options};
  if (usesMainStack) {
    runJob(&job);
  } else if (!runOnThread(job)) {
    cli::writeMessage("xquery: cannot start a thread\n");
  }
  return job.status;
}
