#include "Context/StackGuard.h"

#include "Context/XQueryContextInternal.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"

#include <algorithm>
#include <pthread.h>
#include <sys/resource.h>

namespace xquery {
namespace {

// What must stay free below the deepest checked frame: room for the unchecked work between two
// checks, for third-party code, and for unwinding an exception. Sanitizer frames are larger.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr size_t reserve = 1024 * 1024;
#else
constexpr size_t reserve = 256 * 1024;
#endif

// What is used of a stack without a limit, as much as the command gives itself.
constexpr size_t unlimitedUse = size_t{1} << 30;
// No host reserves a stack of this size for a thread.
constexpr size_t unlimitedSize = size_t{1} << 36;

// Where the main thread's stack is the system library reads from a file of the kernel, which may
// not be there or not be opened for want of a descriptor. Half of what the limit allows is then
// taken to be left below this frame.
uintptr_t guessedLowestAddress() {
  constexpr rlim_t usualSize = rlim_t{8} << 20;
  rlimit limit = {};
  const bool isKnown = getrlimit(RLIMIT_STACK, &limit) == 0 && limit.rlim_cur != RLIM_INFINITY;
  const uintptr_t address = XQueryStackAddress();
  const uintptr_t room = (isKnown ? limit.rlim_cur : usualSize) / 2;
  return room < address ? address - room : address;
}

uintptr_t lowestUsableAddress() {
  pthread_attr_t attributes;
  if (pthread_getattr_np(pthread_self(), &attributes) != 0) return guessedLowestAddress();
  void* base = nullptr;
  size_t size = 0;
  pthread_attr_getstack(&attributes, &base, &size);
  pthread_attr_destroy(&attributes);
  return XQueryLowestStackAddress(reinterpret_cast<uintptr_t>(base), size);
}

}  // namespace

uintptr_t XQueryLowestStackAddress(uintptr_t base, size_t size) {
  if (size >= unlimitedSize) return base + size - unlimitedUse;
  // A very small stack keeps half of itself usable.
  return base + std::min(size / 2, reserve);
}

bool XQueryStackHasRoom() {
  WorkMeter& meter = workMeter;
  if (meter.stackLimit == UINTPTR_MAX) meter.stackLimit = lowestUsableAddress();
  return XQueryStackAddress() > meter.stackLimit;
}

void XQueryCheckStackClosely(XQueryContext& context) {
  if (!XQueryStackHasRoom()) context._internal().raise(XQueryErrors::nestedTooDeeply.error());
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
