// What a thread has done and what memory its values take, so that an evaluation can be ended.
//
// Work is counted in steps. A step stands for at most about ten microseconds; what may take longer
// charges a step more for each further ten. When enough steps have gathered, whoever watches the
// thread is asked and may throw. So a step costs one subtraction, and clocks and flags are looked
// at often enough to end any evaluation within a fraction of a tenth of a second.
//
//   checkWork(n)        counts, and asks the watcher when it is due; may throw NSException
//   WorkPacer           one step for each so many turns of a tight loop
//   chargeWork(n)       counts; never throws; for code that must not be interrupted
//
// Evaluating an expression and calling a function count a step by themselves, so only what repeats
// inside one call needs more:
//
//   WorkPacer pacer;                        // a local: a turn is one decrement of a register
//   for (const Value& item : items) {
//     pacer.turn();                         // turns of some tens of nanoseconds
//     ...
//   }
//   for (...) { checkWork(); sort(part); }  // turns of about a microsecond and more
//   checkWork(bytes / 4096);                // before or after a pass in C over so many bytes
//
// What throws may be thrown on through any C++ frame but not through frames of C: a callback that a
// C library calls must catch it, end the library's work and throw it on afterwards. Whoever catches
// every exception need not look for it: the watcher throws again at the next look.
//
// The bytes counted are those that the thread took for values less those that it gave back: counted
// objects, texts, lists of values, blocks of trees, digits of large numbers. They may be negative,
// since a thread may free what another one made; only differences mean anything. A new object whose
// memory is large and not made of such parts counts it with countValueBlock and uncountValueBytes.
#pragma once

#include "xquery/Exception.h"

#include <cstddef>
#include <cstdint>

namespace xquery {

class WorkWatcher {
 public:
  // Throws to end the work of the thread that calls it.
  virtual void lookAtWork() = 0;

 protected:
  ~WorkWatcher() = default;
};

struct WorkMeter {
  static constexpr int64_t manySteps = INT64_MAX / 2;

  // The stack must not grow below this address; nothing is above the first value, which stands for
  // a thread that was not asked yet.
  uintptr_t stackLimit = UINTPTR_MAX;
  int64_t stepsLeft = manySteps;  // until the watcher is asked
  int64_t valueBytes = 0;
  int64_t mostValueBytes = INT64_MAX;  // a large block that would exceed it is refused
  bool wasRefused = false;
  WorkWatcher* watcher = nullptr;
};

// Needs no construction, so that reaching it is one instruction.
extern constinit thread_local WorkMeter workMeter __attribute__((tls_model("initial-exec")));

inline void chargeWork(uint64_t steps = 1) {
  workMeter.stepsLeft -= static_cast<int64_t>(steps);
}

// Asks the watcher, if there is one.
void lookAtWork();

inline void checkWork(uint64_t steps = 1) {
  chargeWork(steps);
  if (workMeter.stepsLeft <= 0) [[unlikely]] {
    lookAtWork();
  }
}

class WorkPacer {
 public:
  // A turn takes some tens of nanoseconds.
  static constexpr uint32_t turnsPerStep = 256;

  void turn() {
    if (--_turnsLeft == 0) [[unlikely]] {
      _turnsLeft = turnsPerStep;
      checkWork();
    }
  }

 private:
  uint32_t _turnsLeft = turnsPerStep;
};

inline void countValueBytes(size_t bytes) {
  workMeter.valueBytes += static_cast<int64_t>(bytes);
}
inline void uncountValueBytes(size_t bytes) {
  workMeter.valueBytes -= static_cast<int64_t>(bytes);
}
// For a block that was got elsewhere, or before getting it: counts it and charges the work of
// filling it. Throws std::bad_alloc, counting nothing, for a large one that would exceed the most
// that the thread's values may take.
void countValueBlock(size_t bytes);

}  // namespace xquery
