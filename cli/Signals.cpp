#include "Signals.h"

#include "Streams.h"

#include <cerrno>
#include <csignal>

namespace cli {
namespace {

std::atomic<bool>* raised = nullptr;
std::atomic<int> underWay = 0;
std::atomic<bool> survivesInterrupts = false;

static_assert(std::atomic<bool>::is_always_lock_free && std::atomic<int>::is_always_lock_free);

void handle(int signal) {
  const int error = errno;
  if (signal == SIGINT && survivesInterrupts) {
    raised->store(true);
  } else if (signal != SIGINT || underWay == 0 || raised->exchange(true)) {
    endBySignal(signal);
  }
  errno = error;
}

}  // namespace

void handleSignals() {
  raised = interruption().get();
  for (const int signal : {SIGINT, SIGTERM, SIGHUP, SIGQUIT, SIGXCPU}) {
    struct sigaction action {};
    if (sigaction(signal, nullptr, &action) != 0 || action.sa_handler == SIG_IGN) continue;
    action = {};
    action.sa_handler = handle;
    action.sa_flags = SA_RESTART;
    sigaction(signal, &action, nullptr);
  }
}

void surviveInterrupts() {
  survivesInterrupts = true;
  struct sigaction action {};
  if (sigaction(SIGINT, nullptr, &action) != 0 || action.sa_handler != handle) return;
  // What waits for a pipe is to notice.
  action.sa_flags &= ~SA_RESTART;
  sigaction(SIGINT, &action, nullptr);
}

const std::shared_ptr<std::atomic<bool>>& interruption() {
  static const auto flag = std::make_shared<std::atomic<bool>>(false);
  return flag;
}

UnderWay::UnderWay() {
  ++underWay;
}

UnderWay::~UnderWay() {
  --underWay;
}

void endIfInterrupted() {
  if (interruption()->load()) endBySignal(SIGINT);
}

}  // namespace cli
