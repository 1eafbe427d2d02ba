// The signals that matter to who reads from a terminal, one after the other.
#pragma once

#include <csignal>
#include <iterator>

namespace cli {

// While it exists interrupts, stops, continuations and changes of the terminal's size wait in a
// pipe instead of doing what they do otherwise. There is one at a time.
class TerminalSignals {
 public:
  TerminalSignals();
  ~TerminalSignals();
  TerminalSignals(const TerminalSignals&) = delete;
  TerminalSignals& operator=(const TerminalSignals&) = delete;

  // Readable when a signal waits; -1 where there is no pipe.
  int descriptor() const;
  // 0 when none waits.
  int next() const;

 private:
  static constexpr int signals[] = {SIGINT, SIGTSTP, SIGCONT, SIGWINCH};
  struct sigaction _former[std::size(signals)];
};

}  // namespace cli
