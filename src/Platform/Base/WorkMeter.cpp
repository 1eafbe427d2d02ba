#include "Platform/Base/WorkMeter.h"

#include "xquery/Object.h"

#include <new>

namespace xquery {

constinit thread_local WorkMeter workMeter __attribute__((tls_model("initial-exec")));

void lookAtWork() {
  if (workMeter.watcher) {
    workMeter.watcher->lookAtWork();
  } else {
    workMeter.stepsLeft = WorkMeter::manySteps;
  }
}

void countValueBlock(size_t bytes) {
  // A step's worth of memory to fill; smaller blocks are left to the step of whoever asks for them.
  constexpr size_t bytesPerStep = 4096;
  // Looking at every block would cost more than what the smaller ones can exceed the bound by.
  constexpr size_t largeBlock = size_t{64} * 1024;
  WorkMeter& meter = workMeter;
  if (bytes >= largeBlock &&
      meter.valueBytes + static_cast<int64_t>(bytes) > meter.mostValueBytes) {
    meter.wasRefused = true;
    meter.stepsLeft = 0;  // whoever catches the exception does not go on for long
    throw std::bad_alloc();
  }
  countValueBytes(bytes);
  chargeWork(bytes / bytesPerStep);
}

void* allocateValueMemory(size_t bytes) {
  countValueBlock(bytes);
  void* block = ::operator new(bytes, std::nothrow);
  if (!block) {
    uncountValueBytes(bytes);
    throw std::bad_alloc();
  }
  return block;
}

void freeValueMemory(void* block, size_t bytes) noexcept {
  uncountValueBytes(bytes);
  ::operator delete(block, bytes);
}

}  // namespace xquery
