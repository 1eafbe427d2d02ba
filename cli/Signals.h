// Interrupts. The first one while a query is compiled or evaluated ends that as a limit would, and
// then the process as an interrupt does; any other ends the process at once. Either way the file
// that a result was being written to goes, and the one that it was to replace stays. So it is with
// the signals that ask a process to end.
#pragma once

#include <atomic>
#include <memory>

namespace cli {

// Called once. A signal that the parent has the command ignore stays ignored.
void handleSignals();

// From now on interrupts end no more than the evaluation that is under way.
void surviveInterrupts();

// Raised by the first interrupt while something is under way.
const std::shared_ptr<std::atomic<bool>>& interruption();

// Exists while a query is compiled or evaluated.
class UnderWay {
 public:
  UnderWay();
  ~UnderWay();
  UnderWay(const UnderWay&) = delete;
  UnderWay& operator=(const UnderWay&) = delete;
};

// Ends the process as the interrupt that there was does, where there was one.
void endIfInterrupted();

}  // namespace cli
