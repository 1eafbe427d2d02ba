#include "Streams.h"

#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <fcntl.h>
#include <limits.h>
#include <poll.h>
#include <pthread.h>
#include <sched.h>
#include <termios.h>
#include <unistd.h>

namespace cli {
namespace {

// The result and the profile.
struct Temporary {
  char path[PATH_MAX];
  std::atomic<bool> isThere = false;
};
Temporary temporaries[2];

// Held while a file is made and put among these, and for good by a process that ends, whose other
// threads go on for a while and would make one more.
std::atomic_flag areTemporariesHeld;
std::atomic<bool> isEnding = false;

void holdTemporaries() {
  while (areTemporariesHeld.test_and_set()) sched_yield();
}

void registerTemporary(const std::string& path) {
  for (Temporary& each : temporaries) {
    if (each.isThere || path.size() >= sizeof each.path) continue;
    std::memcpy(each.path, path.c_str(), path.size() + 1);
    each.isThere = true;
    return;
  }
}

termios terminal;
std::atomic<bool> hasTerminal = false;

}  // namespace

void prepareStandardStreams() {
  for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
    if (fcntl(stream, F_GETFD) >= 0) continue;
    // The lowest free number is the stream's own.
    const int file = open("/dev/null", stream == STDIN_FILENO ? O_WRONLY : O_RDONLY);
    if (file > STDERR_FILENO) close(file);
  }
  std::signal(SIGPIPE, SIG_IGN);
  std::signal(SIGXFSZ, SIG_IGN);
}

// No signal interrupts the thread meanwhile, whose handler would wait for it.
int makeUntilEnd(const std::string& path, mode_t mode) {
  sigset_t all, before;
  sigfillset(&all);
  pthread_sigmask(SIG_SETMASK, &all, &before);
  holdTemporaries();
  const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, mode);
  const int error = errno;
  if (file >= 0) registerTemporary(path);
  areTemporariesHeld.clear();
  pthread_sigmask(SIG_SETMASK, &before, nullptr);
  errno = error;
  return file;
}

void keepAtEnd(const std::string& path) {
  for (Temporary& each : temporaries) {
    if (each.isThere && path == each.path) each.isThere = false;
  }
}

void restoreTerminalAtEnd() {
  hasTerminal = tcgetattr(STDIN_FILENO, &terminal) == 0;
}

void endOfClosedPipe() {
  endBySignal(SIGPIPE);
}

void endBySignal(int signal) {
  // A second signal may come while the first one waits.
  if (!isEnding.exchange(true)) holdTemporaries();
  for (const Temporary& each : temporaries) {
    if (each.isThere) unlink(each.path);
  }
  if (hasTerminal) {
    std::signal(SIGTTOU, SIG_IGN);  // which stops who is in the background
    tcsetattr(STDIN_FILENO, TCSANOW, &terminal);
  }
  std::signal(signal, SIG_DFL);
  sigset_t one;
  sigemptyset(&one);
  sigaddset(&one, signal);
  pthread_sigmask(SIG_UNBLOCK, &one, nullptr);
  raise(signal);
  _exit(128 + signal);
}

bool writeAll(int file, std::string_view text) {
  while (!text.empty()) {
    const ssize_t count = write(file, text.data(), text.size());
    if (count >= 0) {
      text.remove_prefix(static_cast<size_t>(count));
    } else if (errno == EPIPE) {
      endOfClosedPipe();
    } else if (errno == EAGAIN) {
      pollfd writable{file, POLLOUT, 0};
      poll(&writable, 1, -1);
    } else if (errno != EINTR) {
      return false;
    }
  }
  return true;
}

void writeMessage(std::string_view text) {
  if (!writeAll(STDERR_FILENO, text)) return;
}

}  // namespace cli
