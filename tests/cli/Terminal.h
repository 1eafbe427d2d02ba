// The built command on a terminal of its own.
#pragma once

#include <chrono>
#include <map>
#include <string>
#include <sys/types.h>
#include <vector>

namespace command {

class Terminal {
 public:
  // Starts the xquery command with variables of the environment changed.
  explicit Terminal(const std::vector<std::string>& arguments,
                    const std::map<std::string, std::string>& environment = {},
                    unsigned short columns = 80);
  // What still runs is killed.
  ~Terminal();
  Terminal(const Terminal&) = delete;
  Terminal& operator=(const Terminal&) = delete;

  void type(const std::string& keys);
  // Waits until the text appears behind all that was waited for before; what stood before it, and
  // it, are answered. Fails the test, and answers all there is, when it does not appear.
  std::string waitFor(const std::string& text);
  // Types a line and waits for the next prompt; what stands between is answered.
  std::string ask(const std::string& line, const std::string& prompt = "xquery> ");
  // All that was written until now, for what must not appear.
  const std::string& everything() const { return _output; }
  // The other side of the terminal goes away.
  void hangUp();
  void signal(int number) const;
  // Whether the terminal makes lines of what is typed.
  bool isCooked() const;
  // Waits until no line is being edited any more: what was entered is being evaluated, and an
  // interrupt is a signal.
  void waitUntilItWorks();
  // Waits until it does that and sleeps, as what opens a pipe does that nobody writes to.
  void waitUntilItSleeps();
  // The exit status, or minus the number of the signal; waits for the end.
  int end();

 private:
  // False when nothing more comes within the time.
  bool readMore(std::chrono::milliseconds time);
  bool isAsleep() const;
  void waitUntil(bool (Terminal::*holds)() const, const char* what);

  int _side = -1;
  pid_t _process = -1;
  std::string _output;
  size_t _seen = 0;
};

// The text as a terminal without any extras would show it: without escape sequences and carriage
// returns.
std::string plain(const std::string& output);

}  // namespace command
