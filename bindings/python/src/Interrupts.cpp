#include "Interrupts.h"

#include <algorithm>
#include <array>
#include <csignal>
#include <pthread.h>
#include <unistd.h>

namespace xquery::python {
namespace {

// The evaluations of the main thread that are under way at a time: of a query in the function that
// hears what another one traces, and so on. Deeper ones are ended by the outer ones alone.
constexpr size_t mostNested = 16;

// A signal may be handled on any thread while the main one goes on, so the flags are never freed.
std::array<Cancellation::Flag, mostNested>& flagsOfMain() {
  static auto* flags = [] {
    auto* all = new std::array<Cancellation::Flag, mostNested>;
    for (auto& flag : *all) flag = std::make_shared<std::atomic<bool>>(false);
    return all;
  }();
  return *flags;
}

size_t nesting = 0;  // of the main thread alone
std::atomic<std::atomic<bool>*> interruptedFlag = nullptr;
struct sigaction handlerBefore;

void handleInterrupt(int signal, siginfo_t* information, void* context) {
  if (std::atomic<bool>* flag = interruptedFlag.load()) flag->store(true);
  if (handlerBefore.sa_flags & SA_SIGINFO) {
    handlerBefore.sa_sigaction(signal, information, context);
  } else {
    handlerBefore.sa_handler(signal);
  }
}

bool isOurs(const struct sigaction& action) {
  return (action.sa_flags & SA_SIGINFO) != 0 && action.sa_sigaction == handleInterrupt;
}

bool isSameHandler(const struct sigaction& a, const struct sigaction& b) {
  return a.sa_flags == b.sa_flags && a.sa_sigaction == b.sa_sigaction;
}

// The ours that stands before a handler.
struct sigaction oursBefore(const struct sigaction& handler) {
  struct sigaction ours = handler;
  ours.sa_flags |= SA_SIGINFO;
  ours.sa_sigaction = handleInterrupt;
  return ours;
}

bool isStanding = false;

// A signal that is ignored, or ends the process, is left as it is. An evaluation may take less time
// than asking the system does, so that it is told first, and asked only where the handler is not
// the one of the last time: then for that moment an interrupt went to that of the last time.
void standBefore() {
  struct sigaction now = {};
  if (handlerBefore.sa_sigaction) {
    const struct sigaction ours = oursBefore(handlerBefore);
    isStanding = sigaction(SIGINT, &ours, &now) == 0;
    if (isStanding && isSameHandler(now, handlerBefore)) return;
    sigaction(SIGINT, &now, nullptr);
  } else if (sigaction(SIGINT, nullptr, &now) != 0) {
    return;
  }
  isStanding = false;
  const bool isPlain = (now.sa_flags & SA_SIGINFO) == 0;
  if (isOurs(now) || (isPlain && (now.sa_handler == SIG_DFL || now.sa_handler == SIG_IGN))) return;
  handlerBefore = now;
  const struct sigaction ours = oursBefore(now);
  isStanding = sigaction(SIGINT, &ours, nullptr) == 0;
}

// A handler that was set meanwhile stays.
void stepBack() {
  if (!isStanding) return;
  isStanding = false;
  struct sigaction now = {};
  if (sigaction(SIGINT, &handlerBefore, &now) == 0 && !isOurs(now)) {
    sigaction(SIGINT, &now, nullptr);
  }
}

// Counts the forks that this process is the child of: the main thread of a child is the one that
// forked.
std::atomic<unsigned> forks = 0;

bool isMainThread() {
  static const int registered = pthread_atfork(nullptr, nullptr, [] { ++forks; });
  thread_local unsigned askedAt = ~0U;
  thread_local bool isMain = false;
  if (const unsigned now = forks; askedAt != now || registered != 0) {
    askedAt = now;
    isMain = getpid() == gettid();
  }
  return isMain;
}

}  // namespace

void Cancellation::raise() {
  const std::lock_guard lock(_mutex);
  _isRaised = true;
  for (const Flag& flag : _flags) flag->store(true);
}

bool Cancellation::isRaised() const {
  const std::lock_guard lock(_mutex);
  return _isRaised;
}

void Cancellation::add(Flag flag) {
  const std::lock_guard lock(_mutex);
  if (_isRaised) flag->store(true);
  _flags.push_back(std::move(flag));
}

void Cancellation::remove(const Flag& flag) {
  const std::lock_guard lock(_mutex);
  const auto found = std::find(_flags.begin(), _flags.end(), flag);
  if (found != _flags.end()) _flags.erase(found);
}

UnderWay::UnderWay(std::shared_ptr<Cancellation> cancellation)
    : _cancellation(std::move(cancellation)), _isMain(isMainThread()) {
  if (_isMain && nesting < mostNested) {
    _flag = flagsOfMain().at(nesting);
    _flag->store(false);
    interruptedFlag = _flag.get();
    if (nesting == 0) standBefore();
  } else if (_cancellation) {
    _flag = std::make_shared<std::atomic<bool>>(false);
  }
  if (_isMain) ++nesting;
  if (_cancellation) _cancellation->add(_flag);
}

UnderWay::~UnderWay() {
  if (_cancellation) _cancellation->remove(_flag);
  if (!_isMain) return;
  --nesting;
  if (nesting >= mostNested) return;
  interruptedFlag = nesting > 0 ? flagsOfMain().at(nesting - 1).get() : nullptr;
  if (nesting == 0) stepBack();
}

void UnderWay::raiseWhatHandlersRaise() const {
  if (_isMain && PyErr_CheckSignals() != 0) throw py::error_already_set();
}

}  // namespace xquery::python
