// A line on the terminal that shows how far the reading of a document has come.
#pragma once

#include <chrono>
#include <cstdint>
#include <string>

namespace cli {

// What the line says: "xquery: reading big.xml: 1.2 of 3.4 GB, 35 %, 230 MB/s, 10 s left". Without
// share and time left where `whole` is 0, which is for not known. The name is shortened so that the
// line fits so many columns; where even that is too long, the name goes, and then all but what
// tells most: "35 %, 10 s left". Nothing where there is no room for that.
std::string progressText(const std::string& name, uint64_t bytes, uint64_t whole,
                         std::chrono::duration<double> elapsed, size_t columns);

// Shown once reading has taken a second, and gone with the object. Writes nothing where standard
// error is no terminal.
class ProgressLine {
 public:
  // `name` without control characters.
  explicit ProgressLine(std::string name);
  ~ProgressLine();
  ProgressLine(const ProgressLine&) = delete;
  ProgressLine& operator=(const ProgressLine&) = delete;

  void show(uint64_t bytes, uint64_t whole);

 private:
  using Clock = std::chrono::steady_clock;
  void write(const std::string& text);

  const std::string _name;
  const bool _isOnTerminal;
  const Clock::time_point _start = Clock::now();
  Clock::time_point _next;
  size_t _shown = 0;  // columns
};

}  // namespace cli
