// How much more two threads do than one.
#pragma once

#include <string_view>

namespace bench {

// For each kind of query with the text in its name, the evaluations per second of a thread alone in
// its process, and how many times as many are made by two threads that share the query and the
// document, by two that have a query and a document each, and by two processes; then how much more
// processor time an evaluation takes of threads that share than of one alone, which tells on a busy
// machine as well whether they are in each other's way. The exit status of the program: 0 when
// threads that share make at least 1.8 times the evaluations of one, or 0.9 of what two processes
// make where the machine does not give these twice as many, and fall behind those that have a query
// and a document each by no more than a twentieth.
[[nodiscard]] int reportThreads(std::string_view kinds);

}  // namespace bench
