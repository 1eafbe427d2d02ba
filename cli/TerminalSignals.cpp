#include "TerminalSignals.h"

#include <cerrno>
#include <fcntl.h>
#include <unistd.h>

namespace cli {
namespace {

int ends[2] = {-1, -1};

// A signal that finds the pipe full is like one that waits already.
void keep(int signal) {
  const int error = errno;
  const auto byte = static_cast<unsigned char>(signal);
  if (write(ends[1], &byte, 1) < 0) errno = error;
  errno = error;
}

void openPipe() {
  if (ends[0] >= 0 || pipe2(ends, O_CLOEXEC | O_NONBLOCK) == 0) return;
  ends[0] = ends[1] = -1;
}

}  // namespace

TerminalSignals::TerminalSignals() {
  openPipe();
  struct sigaction action {};
  action.sa_handler = keep;
  action.sa_flags = SA_RESTART;
  for (size_t n = 0; n < std::size(signals); ++n) sigaction(signals[n], &action, &_former[n]);
}

TerminalSignals::~TerminalSignals() {
  for (size_t n = 0; n < std::size(signals); ++n) sigaction(signals[n], &_former[n], nullptr);
  while (next() != 0) {
  }
}

int TerminalSignals::descriptor() const {
  return ends[0];
}

int TerminalSignals::next() const {
  unsigned char signal = 0;
  return ends[0] >= 0 && read(ends[0], &signal, 1) == 1 ? signal : 0;
}

}  // namespace cli
