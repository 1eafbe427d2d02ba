#include "cli/Terminal.h"

#include <gtest/gtest.h>

#include <cctype>
#include <csignal>
#include <cstdlib>
#include <fstream>
#include <poll.h>
#include <pty.h>
#include <stdexcept>
#include <sys/wait.h>
#include <termios.h>
#include <unistd.h>

namespace command {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

Terminal::Terminal(const std::vector<std::string>& arguments,
                   const std::map<std::string, std::string>& environment, unsigned short columns) {
  winsize size = {24, columns, 0, 0};
  _process = forkpty(&_side, nullptr, nullptr, &size);
  if (_process < 0) throw std::runtime_error("no terminal");
  if (_process > 0) return;
  setenv("TERM", "xterm", 1);
  setenv("NO_COLOR", "1", 1);
  for (const auto& [name, value] : environment) setenv(name.c_str(), value.c_str(), 1);
  const std::string program = XQUERY_BINARY_DIR "/xquery";
  std::vector<char*> argv{const_cast<char*>(program.c_str())};
  for (const std::string& argument : arguments) argv.push_back(const_cast<char*>(argument.c_str()));
  argv.push_back(nullptr);
  execv(program.c_str(), argv.data());
  _exit(127);
}

Terminal::~Terminal() {
  hangUp();
  if (_process < 0) return;
  kill(_process, SIGKILL);
  waitpid(_process, nullptr, 0);
}

void Terminal::type(const std::string& keys) {
  EXPECT_EQ(write(_side, keys.data(), keys.size()), static_cast<ssize_t>(keys.size()));
}

bool Terminal::readMore(milliseconds time) {
  pollfd ready{_side, POLLIN, 0};
  if (_side < 0 || poll(&ready, 1, static_cast<int>(time.count())) <= 0) return false;
  char piece[65536];
  const ssize_t count = read(_side, piece, sizeof piece);
  if (count <= 0) return false;
  _output.append(piece, static_cast<size_t>(count));
  return true;
}

std::string Terminal::waitFor(const std::string& text) {
  const auto end = Clock::now() + std::chrono::seconds(20);
  for (;;) {
    const size_t found = _output.find(text, _seen);
    if (found != std::string::npos) {
      const std::string answer = _output.substr(_seen, found + text.size() - _seen);
      _seen = found + text.size();
      return answer;
    }
    if (!readMore(milliseconds(100)) && Clock::now() > end) break;
  }
  ADD_FAILURE() << "\"" << text << "\" does not appear in\n" << _output.substr(_seen);
  return _output.substr(_seen);
}

std::string Terminal::ask(const std::string& line, const std::string& prompt) {
  type(line + "\n");
  std::string answer = plain(waitFor("\n" + prompt));
  // What was typed is shown first.
  answer.erase(0, answer.find('\n') + 1);
  const size_t start = answer.rfind(prompt);
  return answer.substr(0, start);
}

void Terminal::hangUp() {
  if (_side >= 0) close(_side);
  _side = -1;
}

void Terminal::signal(int number) const {
  kill(_process, number);
}

bool Terminal::isCooked() const {
  termios settings = {};
  return tcgetattr(_side, &settings) == 0 && (settings.c_lflag & ICANON) != 0;
}

void Terminal::waitUntilItWorks() {
  waitUntil(&Terminal::isCooked, "the line is still being edited");
}

void Terminal::waitUntilItSleeps() {
  waitUntil(&Terminal::isCooked, "the line is still being edited");
  waitUntil(&Terminal::isAsleep, "the command is still at work");
}

// The state of a process stands behind its name, which is in parentheses.
bool Terminal::isAsleep() const {
  std::ifstream in("/proc/" + std::to_string(_process) + "/stat");
  std::string status;
  std::getline(in, status);
  const size_t name = status.rfind(')');
  return name != std::string::npos && status.compare(name, 3, ") S") == 0;
}

void Terminal::waitUntil(bool (Terminal::*holds)() const, const char* what) {
  const auto end = Clock::now() + std::chrono::seconds(20);
  while (!(this->*holds)()) {
    if (Clock::now() > end) {
      ADD_FAILURE() << what;
      return;
    }
    readMore(milliseconds(5));
  }
}

int Terminal::end() {
  const auto end = Clock::now() + std::chrono::seconds(20);
  int status = 0;
  pid_t ended = 0;
  while ((ended = waitpid(_process, &status, WNOHANG)) == 0 && Clock::now() < end) {
    if (!readMore(milliseconds(20))) usleep(10'000);
  }
  EXPECT_EQ(ended, _process) << "the command does not end:\n" << _output;
  if (ended != _process) return -1;
  while (readMore(milliseconds(0))) {
  }
  _process = -1;
  return WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
}

std::string plain(const std::string& output) {
  std::string text;
  for (size_t at = 0; at < output.size(); ++at) {
    if (output[at] == '\r') continue;
    if (output[at] != '\033') {
      text += output[at];
      continue;
    }
    // ESC [ parameters letter
    while (at + 1 < output.size() && !std::isalpha(static_cast<unsigned char>(output[at]))) ++at;
  }
  return text;
}

}  // namespace command
