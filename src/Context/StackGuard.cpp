#include "Context/StackGuard.h"

#include "Context/XQueryContextInternal.h"
#include "Platform/Base/Sanitizers.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"

#include <algorithm>
#include <pthread.h>
#include <sys/resource.h>

namespace xquery {
namespace {

// What must stay free below the deepest checked frame: room for the unchecked work between two
// checks, for third-party code, and for unwinding an exception. Sanitizer frames are larger.
#if XQUERY_ADDRESS_SANITIZER || XQUERY_THREAD_SANITIZER
constexpr size_t reserve = 1024 * 1024;
#else
constexpr size_t reserve = 256 * 1024;
#endif

// What is used of a large stack at most: a plain call takes about 450 bytes of it and one within
// several clauses and constructors a kilobyte and a half, so that a hundred thousand find room, and
// an endless recursion ends, and leaves what it has used, in a fraction of a second. Code that was
// not optimized takes several times as much.
#if defined(__OPTIMIZE__) && !XQUERY_ADDRESS_SANITIZER && !XQUERY_THREAD_SANITIZER
constexpr size_t mostUse = size_t{192} << 20;
#else
constexpr size_t mostUse = size_t{1} << 30;
#endif

struct Stack {
  uintptr_t base;  // its lowest address
  size_t size;
};

// Where the main thread's stack is the system library reads from a file of the kernel, which may
// not be there or not be opened for want of a descriptor. Half of what the limit allows is then
// taken to be left below this frame.
Stack guessedStack() {
  constexpr rlim_t usualSize = rlim_t{8} << 20;
  rlimit limit = {};
  const bool isKnown = getrlimit(RLIMIT_STACK, &limit) == 0 && limit.rlim_cur != RLIM_INFINITY;
  const uintptr_t address = XQueryStackAddress();
  const uintptr_t room = (isKnown ? limit.rlim_cur : usualSize) / 2;
  const uintptr_t left = std::min(address, room);
  return {address - left, left};
}

Stack stackOfThread() {
  pthread_attr_t attributes;
  if (pthread_getattr_np(pthread_self(), &attributes) != 0) return guessedStack();
  void* base = nullptr;
  size_t size = 0;
  pthread_attr_getstack(&attributes, &base, &size);
  pthread_attr_destroy(&attributes);
  return {reinterpret_cast<uintptr_t>(base), size};
}

uintptr_t lowestUsableAddress() {
  const Stack stack = stackOfThread();
  return XQueryLowestStackAddress(stack.base, stack.size);
}

// Below the usable part as well.
bool stackHas(size_t bytes) {
  const uintptr_t address = XQueryStackAddress();
  if (XQueryStackHasRoom() && address - workMeter.stackLimit >= bytes) return true;
  const Stack stack = stackOfThread();
  return address > stack.base && address - stack.base >= bytes;
}

}  // namespace

uintptr_t XQueryLowestStackAddress(uintptr_t base, size_t size) {
  // A very small stack keeps half of itself usable.
  const size_t use = std::min(size - std::min(size / 2, reserve), mostUse);
  return base + size - use;
}

bool XQueryStackHasRoom() {
  WorkMeter& meter = workMeter;
  if (meter.stackLimit == UINTPTR_MAX) meter.stackLimit = lowestUsableAddress();
  return XQueryStackAddress() > meter.stackLimit;
}

void XQueryCheckStackFor(XQueryContextInternal& context, size_t bytes) {
  static_assert(XQueryMostLibraryStack <= reserve, "a stack that is not small has enough");
  if (!stackHas(bytes)) context.raise(XQueryErrors::nestedTooDeeply.error());
}

void XQueryCheckStackClosely(XQueryContext& context) {
  if (!XQueryStackHasRoom()) _internal(context).raise(XQueryErrors::nestedTooDeeply.error());
  if (workMeter.stepsLeft <= 0) lookAtWork();
}

bool XQueryCheckStack(XQueryProlog& prolog) {
  checkWork();
  if (XQueryStackHasRoom()) return true;
  const auto& errors = prolog.errors();
  if (errors.empty() || !(errors.back()->msg()->view() == XQueryErrors::nestedTooDeeply.text)) {
    prolog.addError(XQueryErrors::nestedTooDeeply.error());
  }
  return false;
}

}  // namespace xquery
