#include "Timing.h"

#include "Streams.h"

#include <algorithm>
#include <cstdio>
#include <numeric>

namespace cli {

void Phase::add(const Phase& other) {
  _milliseconds.insert(_milliseconds.end(), other._milliseconds.begin(), other._milliseconds.end());
}

std::chrono::nanoseconds Phase::sum() const {
  const std::chrono::duration<double, std::milli> all(
      std::accumulate(_milliseconds.begin(), _milliseconds.end(), 0.0));
  return std::chrono::duration_cast<std::chrono::nanoseconds>(all);
}

std::string Phase::report(bool statistics) const {
  std::vector<double> sorted = _milliseconds;
  std::sort(sorted.begin(), sorted.end());
  const size_t middle = sorted.size() / 2;
  double median = sorted.empty() ? 0 : sorted[middle];
  if (!sorted.empty() && sorted.size() % 2 == 0) median = (sorted[middle - 1] + median) / 2;
  const double minimum = sorted.empty() ? 0 : sorted.front();

  char line[120];
  if (statistics) {
    std::snprintf(line, sizeof line, "%-9s median %10.3f ms  minimum %10.3f ms\n", _name, median,
                  minimum);
  } else {
    std::snprintf(line, sizeof line, "%-9s %10.3f ms\n", _name,
                  std::accumulate(sorted.begin(), sorted.end(), 0.0));
  }
  return line;
}

void Phases::add(const Phases& other) {
  parse.add(other.parse);
  compile.add(other.compile);
  evaluate.add(other.evaluate);
  print.add(other.print);
}

void Phases::report(bool statistics) const {
  for (const Phase* phase : {&parse, &compile, &evaluate, &print}) {
    writeMessage(phase->report(statistics));
  }
}

}  // namespace cli
