#include "Stack.h"

#include <algorithm>
#include <cinttypes>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>
#include <sys/auxv.h>
#include <sys/resource.h>
#include <system_error>
#include <unistd.h>

namespace cli {
namespace {

// Code that was not optimized, or that checks itself, takes several times as much.
#if defined(__OPTIMIZE__) && defined(NDEBUG)
constexpr size_t stackSize = size_t{256} << 20;
#else
constexpr size_t stackSize = size_t{1} << 30;
#endif

// What stays free between a stack that is full and what lies below it.
constexpr size_t keptFromStack = size_t{2} << 20;

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

// Whether the main thread, which this is, finds so much free below its stack.
bool hasRoomForLargeStack() {
  std::ifstream maps("/proc/self/maps");
  const auto here = reinterpret_cast<uintptr_t>(&maps);
  uintptr_t below = 0;  // the end of what lies below
  std::string line;
  while (std::getline(maps, line)) {
    uintptr_t begin = 0;
    uintptr_t end = 0;
    if (std::sscanf(line.c_str(), "%" SCNxPTR "-%" SCNxPTR, &begin, &end) != 2) return false;
    if (here < end) return here >= begin && end - below >= stackSize + keptFromStack;
    below = end;
  }
  return false;
}

// It is never tried twice, since a program that was started so finds the limit raised; emulators
// that only pretend to raise it are not believed.
void restart(char** argv) {
  // What was started as an argument of the dynamic loader finds the loader in /proc.
  const bool isStartedByLoader = getauxval(AT_BASE) == 0;
  std::error_code error;
  const std::filesystem::path program = std::filesystem::read_symlink("/proc/self/exe", error);
  if (!error && !isStartedByLoader) execv(program.c_str(), argv);
}

bool usesMainStack() {
  return addressSpace() == RLIM_INFINITY && hasLargeStack();
}

void* runWork(void* work) {
  (*static_cast<const std::function<void()>*>(work))();
  return nullptr;
}

}  // namespace

void takeLargeStack(char** argv) {
  rlimit limit;
  if (addressSpace() != RLIM_INFINITY || hasLargeStack()) return;
  if (getrlimit(RLIMIT_STACK, &limit) != 0 || limit.rlim_max < stackSize) return;
  const rlim_t previous = limit.rlim_cur;
  limit.rlim_cur = stackSize;
  if (setrlimit(RLIMIT_STACK, &limit) != 0 || !hasLargeStack()) return;
  if (hasRoomForLargeStack()) return;
  restart(argv);
  limit.rlim_cur = previous;
  setrlimit(RLIMIT_STACK, &limit);
}

bool runOnLargeStack(const std::function<void()>& work) {
  if (usesMainStack()) {
    work();
    return true;
  }
  const auto thread = startWithLargeStack(work, 1);
  return thread && pthread_join(*thread, nullptr) == 0;
}

// Three quarters of a bounded address space are left for the rest. Where so much is not to be had,
// half of it is tried, and so on.
std::optional<pthread_t> startWithLargeStack(const std::function<void()>& work, unsigned threads) {
  constexpr size_t smallest = size_t{1} << 20;
  const size_t most = std::min<rlim_t>(stackSize, addressSpace() / 4 / threads);
  for (size_t size = most; size >= smallest; size /= 2) {
    pthread_attr_t attributes;
    pthread_t thread;
    pthread_attr_init(&attributes);
    pthread_attr_setstacksize(&attributes, size);
    const int failure =
        pthread_create(&thread, &attributes, runWork, const_cast<std::function<void()>*>(&work));
    pthread_attr_destroy(&attributes);
    if (failure == 0) return thread;
  }
  return std::nullopt;
}

}  // namespace cli
