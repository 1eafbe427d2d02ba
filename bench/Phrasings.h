// How much the time of a query depends on how it is phrased.
#pragma once

#include <string>

namespace bench {

struct PhrasingOptions {
  double factor = 0.1;
  double limit = 5;   // seconds that one evaluation may take
  std::string ideas;  // measures those whose "DATA/IDEA" contains this text
};

// Prints, for each idea of bench/queries, the median time of every phrasing and how many times the
// fastest one takes, then the ideas whose slowest phrasing takes more than twice as long as the
// fastest, the worst first. Times are the processor's, of evaluations over a parsed document after
// a first one that does not count. What does not end within the limit shows the time that it had
// taken by then, with a ">". The exit status of the program: 0 when no idea has more than 2 and
// all phrasings of each answer the same.
[[nodiscard]] int reportPhrasings(const PhrasingOptions& options);

}  // namespace bench
