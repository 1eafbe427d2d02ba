// The times that --time reports.
#pragma once

#include <chrono>
#include <string>
#include <vector>

namespace cli {

// The measured times of one phase.
class Phase {
 public:
  explicit Phase(const char* name) : _name(name) {}

  // Runs `work`, keeps the time it took and gives back its result.
  template <class Work>
  auto measure(const Work& work) {
    const auto start = std::chrono::steady_clock::now();
    auto result = work();
    const std::chrono::duration<double, std::milli> taken =
        std::chrono::steady_clock::now() - start;
    _milliseconds.push_back(taken.count());
    return result;
  }

  void add(const Phase& other);
  std::chrono::nanoseconds sum() const;

  // One line: the time in sum, or with `statistics` the median and the minimum.
  std::string report(bool statistics) const;

 private:
  const char* _name;
  std::vector<double> _milliseconds;
};

struct Phases {
  Phase parse{"parse"}, compile{"compile"}, evaluate{"evaluate"}, print{"print"};

  void add(const Phases& other);
  void report(bool statistics) const;
};

}  // namespace cli
