#include "Signals.h"

#include "Streams.h"

#include <csignal>
#include <cstring>
#include <limits.h>
#include <unistd.h>

namespace cli {
namespace {

std::atomic<bool>* raised = nullptr;
std::atomic<int> underWay = 0;
char temporary[PATH_MAX];
std::atomic<bool> hasTemporary = false;

static_assert(std::atomic<bool>::is_always_lock_free && std::atomic<int>::is_always_lock_free);

[[noreturn]] void end(int signal) {
  if (hasTemporary) unlink(temporary);
  endBySignal(signal);
}

void handle(int signal) {
  const int error = errno;
  if (signal != SIGINT || underWay == 0 || raised->exchange(true)) end(signal);
  errno = error;
}

}  // namespace

void handleSignals() {
  raised = interruption().get();
  for (const int signal : {SIGINT, SIGTERM, SIGHUP}) {
    struct sigaction action {};
    if (sigaction(signal, nullptr, &action) != 0 || action.sa_handler == SIG_IGN) continue;
    action = {};
    action.sa_handler = handle;
    action.sa_flags = SA_RESTART;
    sigaction(signal, &action, nullptr);
  }
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

void removeAtInterrupt(const std::string& path) {
  hasTemporary = false;
  if (path.empty() || path.size() >= sizeof temporary) return;
  std::memcpy(temporary, path.c_str(), path.size() + 1);
  hasTemporary = true;
}

void endIfInterrupted() {
  if (interruption()->load()) end(SIGINT);
}

}  // namespace cli
