#include "Platform/Base/Stack.h"

#include "Platform/Base/WorkerThread.h"
#include "Platform/Base/WorkMeter.h"

#include <cstdint>
#include <exception>
#include <new>
#include <pthread.h>

namespace xquery {

namespace {

uintptr_t frameAddress() {
  return reinterpret_cast<uintptr_t>(__builtin_frame_address(0));
}

// What the thread that lends its work to another hands over, and gets back.
struct Loan {
  const std::function<void()>& function;
  WorkMeter meter;
  std::exception_ptr exception;
};

void* runLoan(void* argument) {
  auto& loan = *static_cast<Loan*>(argument);
  const WorkMeter own = workMeter;
  workMeter = loan.meter;
  workMeter.stackLimit = own.stackLimit;
  try {
    loan.function();
  } catch (...) {
    loan.exception = std::current_exception();
  }
  loan.meter = workMeter;
  workMeter = own;
  return nullptr;
}

// 0 where the system does not tell.
uintptr_t lowestAddress() {
  pthread_attr_t attributes;
  if (pthread_getattr_np(pthread_self(), &attributes) != 0) return 0;
  void* lowest = nullptr;
  size_t size = 0;
  pthread_attr_getstack(&attributes, &lowest, &size);
  pthread_attr_destroy(&attributes);
  return reinterpret_cast<uintptr_t>(lowest);
}

}  // namespace

// What the system answers is not quick on the main thread, and does not change.
size_t stackLeft() {
  static thread_local const uintptr_t lowest = lowestAddress();
  const uintptr_t here = frameAddress();
  return here > lowest ? here - lowest : 0;
}

void withStack(size_t bytes, const std::function<void()>& function) {
  if (stackLeft() >= bytes) return function();
  // What a thread needs for itself comes out of its stack.
  constexpr size_t ownNeeds = size_t{256} << 10;
  Loan loan = {function, workMeter, nullptr};
  pthread_t thread;
  if (!startWorkerThread(thread, bytes + ownNeeds, runLoan, &loan)) throw std::bad_alloc();
  pthread_join(thread, nullptr);
  loan.meter.stackLimit = workMeter.stackLimit;
  workMeter = loan.meter;
  if (loan.exception) std::rethrow_exception(loan.exception);
}

}  // namespace xquery
